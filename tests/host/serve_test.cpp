// The host over HTTP: CIM-XML messages as clients send them, good and bad, and what the connection itself must stand.
#include "host/serve/Cim_Server.h"
#include "host/serve/Deadlines.h"
#include "host/serve/Http_Server.h"
#include "host/serve/Message.h"
#include "host/serve/Xml_Reader.h"
#include "host/serve/Xml_Writer.h"
#include "tests/host/Things.h"

#include <atomic>
#include <curl/curl.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <thread>
#include <unistd.h>

using namespace host;
using testing::HasSubstr;
using testing::Not;

namespace {

constexpr const char* opening = "<?xml version=\"1.0\" encoding=\"utf-8\"?><CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\">"
                                "<MESSAGE ID=\"4711\" PROTOCOLVERSION=\"1.0\"><SIMPLEREQ>";
constexpr const char* closing = "</SIMPLEREQ></MESSAGE></CIM>";
constexpr const char* in_test =
    "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"test\"/></LOCALNAMESPACEPATH>";

std::string intrinsic(const std::string& operation, const std::string& parameters,
                      const std::string& name_space = in_test)
{
    return opening + ("<IMETHODCALL NAME=\"" + operation + "\">") + name_space + parameters + "</IMETHODCALL>" +
           closing;
}
std::string class_parameter(const std::string& name, const std::string& class_name)
{
    return "<IPARAMVALUE NAME=\"" + name + "\"><CLASSNAME NAME=\"" + class_name + "\"/></IPARAMVALUE>";
}
std::string value_parameter(const std::string& name, const std::string& value)
{
    return "<IPARAMVALUE NAME=\"" + name + "\"><VALUE>" + value + "</VALUE></IPARAMVALUE>";
}
std::string name_of(const std::string& id, const std::string& class_name = "TEST_Thing")
{
    return "<INSTANCENAME CLASSNAME=\"" + class_name + "\"><KEYBINDING NAME=\"Id\"><KEYVALUE VALUETYPE=\"numeric\">" +
           id +
           "</KEYVALUE></KEYBINDING><KEYBINDING NAME=\"Realm\"><KEYVALUE "
           "VALUETYPE=\"string\">here</KEYVALUE></KEYBINDING>"
           "</INSTANCENAME>";
}
std::string instance_parameter(const std::string& id, const char* name = "InstanceName")
{
    return "<IPARAMVALUE NAME=\"" + std::string(name) + "\">" + name_of(id) + "</IPARAMVALUE>";
}
std::string call(const std::string& method, const std::string& arguments, const std::string& id = "1")
{
    return opening + ("<METHODCALL NAME=\"" + method + "\"><LOCALINSTANCEPATH>") + in_test + name_of(id) +
           "</LOCALINSTANCEPATH>" + arguments + "</METHODCALL>" + closing;
}

std::string created(const std::string& class_name, const std::string& properties)
{
    return intrinsic("CreateInstance", "<IPARAMVALUE NAME=\"NewInstance\"><INSTANCE CLASSNAME=\"" + class_name + "\">" +
                                           properties + "</INSTANCE></IPARAMVALUE>");
}
std::string text_property(const std::string& name, const std::string& text)
{
    return "<PROPERTY NAME=\"" + name + "\" TYPE=\"string\"><VALUE>" + text + "</VALUE></PROPERTY>";
}
std::string end_property(const std::string& name, const std::string& answer)
{
    const std::size_t from = answer.find("<INSTANCENAME"), to = answer.find("</INSTANCENAME>");
    return "<PROPERTY.REFERENCE NAME=\"" + name + "\"><VALUE.REFERENCE>" + answer.substr(from, to + 15 - from) +
           "</VALUE.REFERENCE></PROPERTY.REFERENCE>";
}

class Serve : public testing::Test {
protected:
    struct Result {
        unsigned status;
        std::string cim_error, body;
    };

    void SetUp() override { things::reset(); }
    Result ask(const std::string& body, const Request_Head& head = {})
    {
        Reply reply = m_cim.answer(body, head);
        Result result{reply.status, reply.cim_error, ""};
        while (reply.pieces(result.body)) {
        }
        return result;
    }
    std::string body_of(const std::string& request)
    {
        const Result result = ask(request);
        EXPECT_EQ(200u, result.status) << result.body;
        return result.body;
    }
    /// The status in an answer; 0 for success.
    int code_of(const std::string& request)
    {
        const std::string body = body_of(request);
        const std::size_t at = body.find("<ERROR CODE=\"");
        return at == std::string::npos ? 0 : std::stoi(body.substr(at + 13));
    }

    std::unique_ptr<Host> m_host = things::make_host();
    Cim_Server m_cim{*m_host, "localhost:5988"};
};

} // namespace

TEST_F(Serve, NamesTheInstancesOfAClass)
{
    things::set("count", 2);
    const std::string body = body_of(intrinsic("EnumerateInstanceNames", class_parameter("ClassName", "TEST_Thing")));
    EXPECT_THAT(body, HasSubstr("<MESSAGE ID=\"4711\" PROTOCOLVERSION=\"1.0\"><SIMPLERSP>"
                                "<IMETHODRESPONSE NAME=\"EnumerateInstanceNames\"><IRETURNVALUE>"
                                "<INSTANCENAME CLASSNAME=\"TEST_Thing\"><KEYBINDING NAME=\"Id\">"
                                "<KEYVALUE VALUETYPE=\"numeric\">1</KEYVALUE></KEYBINDING>"));
    EXPECT_THAT(body, HasSubstr("</IRETURNVALUE></IMETHODRESPONSE></SIMPLERSP></MESSAGE></CIM>\n"));
}

TEST_F(Serve, WritesEveryTypeOfValue)
{
    things::set("count", 1);
    const std::string body = body_of(intrinsic("EnumerateInstances", class_parameter("ClassName", "TEST_Thing")));
    for (const char* part :
         {"<PROPERTY NAME=\"Flag\" TYPE=\"boolean\"><VALUE>TRUE</VALUE></PROPERTY>",
          "<PROPERTY NAME=\"U64\" TYPE=\"uint64\"><VALUE>18000000000000000000</VALUE></PROPERTY>",
          "<PROPERTY NAME=\"S64\" TYPE=\"sint64\"><VALUE>-9000000000000000000</VALUE></PROPERTY>",
          "<PROPERTY NAME=\"R64\" TYPE=\"real64\"><VALUE>-2.25</VALUE></PROPERTY>",
          "<PROPERTY NAME=\"When\" TYPE=\"datetime\"><VALUE>20240229120000.000000+060</VALUE></PROPERTY>",
          "<PROPERTY.ARRAY NAME=\"Texts\" "
          "TYPE=\"string\"><VALUE.ARRAY><VALUE>one</VALUE><VALUE>two</VALUE></VALUE.ARRAY>",
          "<PROPERTY NAME=\"Inner\" TYPE=\"string\" EmbeddedObject=\"instance\"><VALUE>&lt;INSTANCE CLASSNAME=&quot;",
          "<PROPERTY.REFERENCE NAME=\"Friend\" REFERENCECLASS=\"TEST_Other\"><VALUE.REFERENCE>"})
        EXPECT_THAT(body, HasSubstr(part));
}

TEST_F(Serve, ReadsBackWhatItWrites)
{
    things::set("count", 1);
    const Answer before = m_host->get(things::thing(1));
    ASSERT_TRUE(before.ok());
    std::string body = body_of(intrinsic("GetInstance", instance_parameter("1")));
    const std::size_t from = body.find("<INSTANCE "), to = body.find("</INSTANCE></IRETURNVALUE>");
    ASSERT_NE(std::string::npos, from);
    const std::string written = body.substr(from, to + 11 - from);
    const Message message(
        intrinsic("CreateInstance", "<IPARAMVALUE NAME=\"NewInstance\">" + written + "</IPARAMVALUE>"),
        m_host->schema());
    const Instance read = message.instance("NewInstance");
    EXPECT_EQ(before.instances[0].properties.size(), read.properties.size());
    for (const Named_Value& property : before.instances[0].properties)
        EXPECT_EQ(property.value.to_text(), read.get(property.name).to_text()) << property.name;
}

TEST_F(Serve, LeavesOutWhatAClientDoesNotAskFor)
{
    things::set("count", 1);
    const std::string list =
        "<IPARAMVALUE NAME=\"PropertyList\"><VALUE.ARRAY><VALUE>text</VALUE></VALUE.ARRAY></IPARAMVALUE>";
    const std::string body = body_of(intrinsic("GetInstance", instance_parameter("1") + list));
    EXPECT_THAT(body, HasSubstr("NAME=\"Text\""));
    EXPECT_THAT(body, Not(HasSubstr("NAME=\"U8\"")));
}

TEST_F(Serve, ShowsClasses)
{
    std::string body = body_of(intrinsic("GetClass", class_parameter("ClassName", "test_thing")));
    EXPECT_THAT(body, HasSubstr("<CLASS NAME=\"TEST_Thing\" SUPERCLASS=\"TEST_Base\"><QUALIFIER NAME=\"Description\""));
    EXPECT_THAT(body, HasSubstr("<METHOD NAME=\"Double\" TYPE=\"uint32\">"));
    EXPECT_THAT(body, HasSubstr("<PARAMETER.REFERENCE NAME=\"Target\" REFERENCECLASS=\"TEST_Other\">"));
    EXPECT_THAT(body, Not(HasSubstr("NAME=\"Realm\""))) << "only what the class itself declares";
    body = body_of(intrinsic("GetClass", class_parameter("ClassName", "TEST_Thing") +
                                             value_parameter("LocalOnly", "false") +
                                             value_parameter("IncludeClassOrigin", "TRUE")));
    EXPECT_THAT(body, HasSubstr("<PROPERTY NAME=\"Realm\" TYPE=\"string\" CLASSORIGIN=\"TEST_Base\">"));

    body = body_of(intrinsic("EnumerateClassNames", class_parameter("ClassName", "CIM_Root")));
    EXPECT_THAT(body, HasSubstr("<CLASSNAME NAME=\"TEST_Base\"/>"));
    EXPECT_THAT(body, Not(HasSubstr("TEST_Thing")));
    body = body_of(intrinsic("EnumerateClassNames", value_parameter("DeepInheritance", "true")));
    EXPECT_THAT(body, HasSubstr("<CLASSNAME NAME=\"TEST_Thing\"/>"));
    EXPECT_THAT(body_of(intrinsic("EnumerateClasses", "")), HasSubstr("<CLASS NAME=\"CIM_Root\">"));
}

TEST_F(Serve, CallsAMethodWithEveryKindOfArgument)
{
    things::set("count", 1);
    const std::string body = body_of(call(
        "Double", "<PARAMVALUE NAME=\"Number\" PARAMTYPE=\"uint32\"><VALUE>21</VALUE></PARAMVALUE>"
                  "<PARAMVALUE NAME=\"Words\" PARAMTYPE=\"string\"><VALUE.ARRAY><VALUE>a</VALUE><VALUE>b</VALUE>"
                  "</VALUE.ARRAY></PARAMVALUE><PARAMVALUE NAME=\"Target\" PARAMTYPE=\"reference\"><VALUE.REFERENCE>" +
                      name_of("3", "TEST_Other") +
                      "</VALUE.REFERENCE></PARAMVALUE><PARAMVALUE NAME=\"Loud\" PARAMTYPE=\"boolean\">"
                      "<VALUE>TRUE</VALUE></PARAMVALUE>"));
    EXPECT_THAT(body, HasSubstr("<RETURNVALUE PARAMTYPE=\"uint32\"><VALUE>0</VALUE></RETURNVALUE>"));
    EXPECT_THAT(body, HasSubstr("<PARAMVALUE NAME=\"Result\" PARAMTYPE=\"uint32\"><VALUE>42</VALUE></PARAMVALUE>"));
    EXPECT_THAT(body, HasSubstr("<PARAMVALUE NAME=\"Back\" PARAMTYPE=\"string\"><VALUE.ARRAY><VALUE>b</VALUE>"));
}

TEST_F(Serve, AnswersFailuresWithTheirStatus)
{
    things::set("count", 1);
    const std::string elsewhere = "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"nowhere\"/></LOCALNAMESPACEPATH>";
    EXPECT_EQ(3, code_of(intrinsic("EnumerateInstances", class_parameter("ClassName", "TEST_Thing"), elsewhere)));
    EXPECT_EQ(5, code_of(intrinsic("EnumerateInstances", class_parameter("ClassName", "TEST_None"))));
    EXPECT_EQ(5, code_of(intrinsic("GetClass", class_parameter("ClassName", "TEST_None"))));
    EXPECT_EQ(4, code_of(intrinsic("EnumerateInstances", "")));
    EXPECT_EQ(4, code_of(intrinsic("GetInstance", "")));
    EXPECT_EQ(4, code_of(intrinsic("GetInstance", instance_parameter("many"))));
    EXPECT_EQ(4, code_of(intrinsic("GetInstance", instance_parameter("99999999999"))));
    EXPECT_EQ(6, code_of(intrinsic("GetInstance", instance_parameter("77"))));
    EXPECT_EQ(7, code_of(intrinsic("Sing", "")));
    EXPECT_EQ(7, code_of(intrinsic("ExecQuery", value_parameter("Query", "SELECT * FROM TEST_Thing"))));
    EXPECT_EQ(12, code_of(intrinsic("GetProperty", instance_parameter("1") + value_parameter("PropertyName", "None"))));
    EXPECT_EQ(17, code_of(call("Sing", "")));
    EXPECT_EQ(4, code_of(call("Double", "<PARAMVALUE NAME=\"None\"><VALUE>1</VALUE></PARAMVALUE>")));
    EXPECT_EQ(4, code_of(call("Double", "<PARAMVALUE NAME=\"Number\"><VALUE>red</VALUE></PARAMVALUE>")));
    EXPECT_EQ(4, code_of(call("Double", "<PARAMVALUE NAME=\"Words\"><VALUE>no array</VALUE></PARAMVALUE>")));
    EXPECT_EQ(4, code_of(intrinsic("EnumerateClassNames", value_parameter("DeepInheritance", "perhaps"))));
}

TEST_F(Serve, RefusesParametersThatItsOperationsDoNotKnow)
{
    things::set("count", 1);
    const std::string of_class = class_parameter("ClassName", "TEST_Thing");
    EXPECT_EQ(0, code_of(intrinsic("EnumerateInstanceNames", of_class)));
    EXPECT_EQ(4, code_of(intrinsic("EnumerateInstanceNames", of_class + value_parameter("Colour", "red"))));
    EXPECT_EQ(4, code_of(intrinsic("EnumerateInstanceNames", of_class + of_class))) << "twice";
    EXPECT_EQ(4, code_of(intrinsic("EnumerateInstanceNames", value_parameter("ClassName", "TEST_Thing"))));
    EXPECT_EQ(4, code_of(intrinsic("AssociatorNames", instance_parameter("1", "ObjectName") +
                                                          value_parameter("ResultClass", "TEST_Other"))));
    EXPECT_EQ(4, code_of(intrinsic("AssociatorNames", instance_parameter("1", "ObjectName") +
                                                          class_parameter("AssocClass", "TEST_None"))));
    EXPECT_EQ(4, code_of(intrinsic("EnumerateInstances", of_class + class_parameter("PropertyList", "TEST_Thing"))));
    EXPECT_EQ(4, code_of(intrinsic("EnumerateInstances", of_class + class_parameter("LocalOnly", "TEST_Thing"))));
    std::string names;
    for (int i = 0; i < 5000; ++i)
        names += "<VALUE>Text</VALUE>";
    EXPECT_EQ(4, code_of(intrinsic("EnumerateInstances", of_class + "<IPARAMVALUE NAME=\"PropertyList\"><VALUE.ARRAY>" +
                                                             names + "</VALUE.ARRAY></IPARAMVALUE>")));
    const std::string number = "<PARAMVALUE NAME=\"Number\"><VALUE>1</VALUE></PARAMVALUE>";
    EXPECT_EQ(0, code_of(call("Double", number)));
    EXPECT_EQ(4, code_of(call("Double", number + number)));
    // What is empty counts as left out.
    EXPECT_EQ(0, code_of(intrinsic("EnumerateInstanceNames", of_class)));
    EXPECT_EQ(0, code_of(intrinsic("EnumerateClassNames", "<IPARAMVALUE NAME=\"ClassName\"> </IPARAMVALUE>")));
}

TEST_F(Serve, RefusesKeysThatAreNoneOfTheClass)
{
    things::set("count", 1);
    const auto keyed = [](const std::string& class_name, const std::string& bindings) {
        return "<IPARAMVALUE NAME=\"InstanceName\"><INSTANCENAME CLASSNAME=\"" + class_name + "\">" + bindings +
               "</INSTANCENAME></IPARAMVALUE>";
    };
    const auto key = [](const std::string& name, const std::string& value) {
        return "<KEYBINDING NAME=\"" + name + "\">" + value + "</KEYBINDING>";
    };
    const std::string realm = key("Realm", "<KEYVALUE>here</KEYVALUE>");
    const std::string id = key("Id", "<KEYVALUE VALUETYPE=\"numeric\">1</KEYVALUE>");
    const std::string reference = "<VALUE.REFERENCE>" + name_of("1") + "</VALUE.REFERENCE>";
    const auto code = [&](const std::string& class_name, const std::string& bindings) {
        return code_of(intrinsic("GetInstance", keyed(class_name, bindings)));
    };
    EXPECT_EQ(0, code("TEST_Thing", id + realm));
    EXPECT_EQ(4, code("TEST_Thing", id + realm + key("None", "<KEYVALUE>1</KEYVALUE>")));
    EXPECT_EQ(4, code("TEST_Thing", id + realm + key("Text", "<KEYVALUE>no key</KEYVALUE>")));
    EXPECT_EQ(4, code("TEST_Thing", id + id + realm));
    EXPECT_EQ(4, code("TEST_Thing", key("Id", reference) + realm));
    EXPECT_EQ(4, code("TEST_Thing", key("Id", "<KEYVALUE VALUETYPE=\"boolean\">TRUE</KEYVALUE>") + realm));
    EXPECT_EQ(4, code("TEST_Thing", key("Id", "<KEYVALUE>-1</KEYVALUE>") + realm));
    EXPECT_EQ(4, code("TEST_Thing", key("Id", "") + realm));
    EXPECT_EQ(4, code("TEST_Link", key("First", "<KEYVALUE>1</KEYVALUE>")));
    EXPECT_EQ(4, code("TEST_Link", key("First", "<VALUE.REFERENCE></VALUE.REFERENCE>")));
    EXPECT_EQ(6, code("TEST_Thing", realm)) << "a key is missing";
    std::string many;
    for (int i = 0; i < 100; ++i)
        many += key("K" + std::to_string(i), "<KEYVALUE>1</KEYVALUE>");
    EXPECT_EQ(4, code("TEST_None", many));
    EXPECT_EQ(5, code("TEST_None", id));
}

TEST_F(Serve, LeavesOutWhatSubclassesBringWhereAClientSaysSo)
{
    things::set("count", 1);
    const std::string of_class = class_parameter("ClassName", "TEST_Base");
    EXPECT_THAT(body_of(intrinsic("EnumerateInstances", of_class)), HasSubstr("NAME=\"U64\""));
    const std::string body =
        body_of(intrinsic("EnumerateInstances", of_class + value_parameter("DeepInheritance", "FALSE")));
    EXPECT_THAT(body, HasSubstr("<INSTANCE CLASSNAME=\"TEST_Thing\"><PROPERTY "));
    EXPECT_THAT(body, HasSubstr("<PROPERTY NAME=\"Id\""));
    EXPECT_THAT(body, Not(HasSubstr("NAME=\"U64\"")));
}

TEST_F(Serve, NamesItselfAsItsClientDoes)
{
    things::set("count", 1);
    const std::string request = intrinsic("ReferenceNames", instance_parameter("1", "ObjectName"));
    Request_Head head;
    EXPECT_THAT(ask(request, head).body, HasSubstr("<HOST>localhost:5988</HOST>"));
    head.host = "<console>:7777";
    EXPECT_THAT(ask(request, head).body, HasSubstr("<HOST>&lt;console&gt;:7777</HOST>"));
}

TEST_F(Serve, ReadsTextsHoweverTheyAreWritten)
{
    const auto text_in = [&](const std::string& value) {
        const Message message(
            intrinsic("CreateInstance",
                      "<IPARAMVALUE NAME=\"NewInstance\"><INSTANCE CLASSNAME=\"TEST_Thing\"><PROPERTY "
                      "NAME=\"Text\" TYPE=\"string\"><VALUE>" +
                          value + "</VALUE></PROPERTY></INSTANCE></IPARAMVALUE>"),
            m_host->schema());
        return message.instance("NewInstance").get("Text").as_text();
    };
    EXPECT_EQ("a<b>c", text_in("a<![CDATA[<b>]]>c"));
    EXPECT_EQ("ab", text_in("a<!-- & -->b"));
    EXPECT_EQ("  ", text_in("  "));
    EXPECT_EQ("", text_in(""));
    EXPECT_EQ("\xe2\x82\xac&\"", text_in("&#x20AC;&amp;&#34;"));
    EXPECT_EQ("&none;", text_in("<![CDATA[&none;]]>"));
}

TEST_F(Serve, TellsByHttpWhatIsNoRequestAtAll)
{
    const std::string good = intrinsic("EnumerateInstanceNames", class_parameter("ClassName", "TEST_Thing"));
    const auto expect_refused = [&](const std::string& body, unsigned status, const std::string& cim_error) {
        const Result result = ask(body);
        EXPECT_EQ(status, result.status) << body;
        EXPECT_EQ(cim_error, result.cim_error) << body;
    };
    expect_refused("", 400, "request-not-well-formed");
    expect_refused("not XML", 400, "request-not-well-formed");
    expect_refused(good + "\x01", 400, "request-not-well-formed");
    expect_refused("\xff\xfe<CIM/>", 400, "request-not-well-formed");
    expect_refused("<CIM><MESSAGE></CIM>", 400, "request-not-well-formed");
    expect_refused("<OTHER/>", 400, "request-not-valid");
    expect_refused(good + "more", 400, "request-not-well-formed");
    expect_refused(good + good.substr(good.find("<CIM")), 400, "request-not-well-formed");
    expect_refused(
        "<?xml version=\"1.0\"?><!DOCTYPE CIM [<!ENTITY a \"aaaa\"><!ENTITY b \"&a;&a;&a;&a;\">]><CIM>&b;</CIM>", 400,
        "request-not-well-formed");
    for (const char* reference :
         {"&none;", "&", "&#0;", "&#xD800;", "&#x110000;", "&#xFFFE;", "&#;", "&#x;", "&#99999999999;"})
        expect_refused("<CIM CIMVERSION=\"" + std::string(reference) + "\"/>", 400, "request-not-well-formed");
    EXPECT_EQ(200u, ask("\xef\xbb\xbf" + good + "\r\n").status) << "a mark at the start and a blank at the end";
    expect_refused("<CIM CIMVERSION=\"3.0\" DTDVERSION=\"2.0\"/>", 501, "unsupported-cim-version");
    expect_refused("<CIM CIMVERSION=\"2.0\" DTDVERSION=\"1.0\"/>", 501, "unsupported-dtd-version");
    expect_refused("<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"/>", 400, "request-not-valid");
    expect_refused("<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" PROTOCOLVERSION=\"2.0\"/></CIM>", 501,
                   "unsupported-protocol-version");
    expect_refused("<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" "
                   "PROTOCOLVERSION=\"1.0\"><MULTIREQ/></MESSAGE></CIM>",
                   501, "multiple-requests-unsupported");
}

TEST_F(Serve, HoldsTheHeadOfARequestAgainstItsBody)
{
    const std::string good = intrinsic("EnumerateInstanceNames", class_parameter("ClassName", "TEST_Thing"));
    const auto told = [&](void (*change)(Request_Head&)) {
        Request_Head head{"MethodCall", "EnumerateInstanceNames", "root%2Ftest", "1.0", "", "localhost"};
        change(head);
        const Result result = ask(good, head);
        return std::to_string(result.status) + " " + result.cim_error;
    };
    EXPECT_EQ("200 ", told([](Request_Head&) {}));
    EXPECT_EQ("200 ", told([](Request_Head& head) { head.object = "root/TEST"; }));
    EXPECT_EQ("400 header-mismatch", told([](Request_Head& head) { head.method = "GetInstance"; }));
    EXPECT_EQ("400 header-mismatch", told([](Request_Head& head) { head.object = "root%2Felse"; }));
    EXPECT_EQ("400 header-mismatch", told([](Request_Head& head) { head.object = "root%2Ftester"; }));
    EXPECT_EQ("400 header-mismatch", told([](Request_Head& head) { head.object = "root%2"; }));
    EXPECT_EQ("501 unsupported-operation", told([](Request_Head& head) { head.operation = "Sing"; }));
    EXPECT_EQ("501 unsupported-protocol-version", told([](Request_Head& head) { head.version = "2.0"; }));
    EXPECT_EQ("501 multiple-requests-unsupported", told([](Request_Head& head) { head.batch = "2"; }));
}

TEST_F(Serve, TakesNoSubscriptionThatLeadsNowhere)
{
    const auto destination = [](const std::string& name, const std::string& url) {
        return created("CIM_ListenerDestinationCIMXML",
                       text_property("Name", name) + (url.empty() ? "" : text_property("Destination", url)));
    };
    const auto filter = [](const std::string& name, const std::string& query, const std::string& language = "WQL") {
        return created("CIM_IndicationFilter", text_property("Name", name) + text_property("Query", query) +
                                                   text_property("QueryLanguage", language) +
                                                   text_property("SourceNamespace", "root/test"));
    };
    for (const char* url : {"", "nowhere", "file:///etc/passwd", "ftp://host/", "http://host/ HTTP/1.1&#13;&#10;X-Y: 1",
                            "http://host/a b", "HTTPX://host"})
        EXPECT_EQ(4, code_of(destination("bad", url))) << url;
    const std::string here = body_of(destination("here", "http://localhost:1/"));
    EXPECT_EQ(11, code_of(destination("here", "http://localhost:1/")));
    EXPECT_EQ(4, code_of(created("CIM_IndicationFilter", text_property("Query", "SELECT * FROM TEST_Alert"))));
    const auto subscription = [&](const std::string& filter_answer) {
        return created("CIM_IndicationSubscription",
                       end_property("Filter", filter_answer) + end_property("Handler", here));
    };
    EXPECT_EQ(4, code_of(created("CIM_IndicationSubscription", end_property("Handler", here))));
    EXPECT_EQ(5, code_of(subscription(body_of(filter("1", "SELECT * FROM TEST_None")))));
    EXPECT_EQ(14, code_of(subscription(body_of(filter("2", "SELECT * FROM TEST_Alert", "English")))));
    EXPECT_EQ(6, code_of(subscription(here))) << "a destination is no filter";
    const std::string good = body_of(filter("3", "SELECT * FROM TEST_Alert"));
    EXPECT_EQ(0, code_of(subscription(good)));
    EXPECT_EQ(11, code_of(subscription(good)));
    EXPECT_EQ(3, code_of(intrinsic("EnumerateInstances", class_parameter("ClassName", "CIM_IndicationFilter"),
                                   "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"nowhere\"/></LOCALNAMESPACEPATH>")));
    EXPECT_EQ(7, code_of(intrinsic("ModifyInstance", "<IPARAMVALUE NAME=\"ModifiedInstance\"><VALUE.NAMEDINSTANCE>"
                                                     "<INSTANCENAME CLASSNAME=\"CIM_IndicationFilter\"/>"
                                                     "<INSTANCE CLASSNAME=\"CIM_IndicationFilter\"/>"
                                                     "</VALUE.NAMEDINSTANCE></IPARAMVALUE>")));
    EXPECT_EQ(4, code_of(intrinsic("ModifyInstance", "<IPARAMVALUE NAME=\"ModifiedInstance\"><VALUE.NAMEDINSTANCE>" +
                                                         name_of("1") +
                                                         "<INSTANCE CLASSNAME=\"TEST_Other\"/>"
                                                         "</VALUE.NAMEDINSTANCE></IPARAMVALUE>")));
}

TEST_F(Serve, MakesASubscriptionOnceForClientsAtTheSameTime)
{
    const std::string filter = body_of(created(
        "CIM_IndicationFilter", text_property("Name", "f") + text_property("Query", "SELECT * FROM TEST_Alert") +
                                    text_property("SourceNamespace", "root/test")));
    const std::string handler = body_of(created(
        "CIM_ListenerDestination", text_property("Name", "h") + text_property("Destination", "http://localhost:1/")));
    const std::string make =
        created("CIM_IndicationSubscription", end_property("Filter", filter) + end_property("Handler", handler));
    std::string name = body_of(make);
    name = name.substr(name.find("<INSTANCENAME"));
    name.resize(name.rfind("</INSTANCENAME>") + 15);
    const std::string take_back =
        intrinsic("DeleteInstance", "<IPARAMVALUE NAME=\"InstanceName\">" + name + "</IPARAMVALUE>");
    EXPECT_EQ(0, code_of(take_back));
    std::atomic<int> made{0}, taken_back{0};
    std::vector<std::thread> clients;
    for (int i = 0; i < 4; ++i)
        clients.emplace_back([&] {
            for (int k = 0; k < 50; ++k) {
                made += code_of(make) == 0;
                taken_back += code_of(take_back) == 0;
            }
        });
    for (std::thread& client : clients)
        client.join();
    taken_back += code_of(take_back) == 0;
    EXPECT_EQ(made, taken_back);
    EXPECT_GT(made, 0);
    EXPECT_EQ(6, code_of(take_back));
}

TEST_F(Serve, KeepsNoMoreFiltersThanItHasRoomFor)
{
    int kept = 0;
    while (kept < 2000 && code_of(created("CIM_IndicationFilter", text_property("Name", std::to_string(kept)))) == 0)
        ++kept;
    EXPECT_EQ(1000, kept);
    EXPECT_THAT(body_of(created("CIM_IndicationFilter", text_property("Name", "more"))),
                HasSubstr("<ERROR CODE=\"1\""));
}

TEST_F(Serve, OutlivesARequestCutAtEveryByte)
{
    things::set("count", 1);
    const std::string whole =
        call("Double", "<PARAMVALUE NAME=\"Number\" PARAMTYPE=\"uint32\"><VALUE>21</VALUE></PARAMVALUE>");
    for (std::size_t size = 0; size < whole.size(); ++size)
        EXPECT_EQ(400u, ask(whole.substr(0, size)).status) << size;
    EXPECT_EQ(200u, ask(whole).status);
}

TEST_F(Serve, OutlivesARequestWithAnyByteChanged)
{
    things::set("count", 1);
    const std::string wholes[] = {
        call("Double",
             "<PARAMVALUE NAME=\"Words\" PARAMTYPE=\"string\"><VALUE.ARRAY><VALUE>a&amp;b</VALUE></VALUE.ARRAY>"
             "</PARAMVALUE><PARAMVALUE NAME=\"Target\" PARAMTYPE=\"reference\"><VALUE.REFERENCE>" +
                 name_of("3", "TEST_Other") + "</VALUE.REFERENCE></PARAMVALUE>"),
        created("TEST_Thing",
                "<PROPERTY NAME=\"Inner\" TYPE=\"string\" EmbeddedObject=\"instance\"><VALUE>"
                "<![CDATA[<INSTANCE CLASSNAME=\"TEST_Other\"><PROPERTY NAME=\"Id\" TYPE=\"uint32\"><VALUE>1"
                "</VALUE></PROPERTY></INSTANCE>]]></VALUE></PROPERTY><PROPERTY.ARRAY NAME=\"Numbers\" "
                "TYPE=\"uint32\"><VALUE.ARRAY><VALUE>1</VALUE><VALUE.NULL/></VALUE.ARRAY></PROPERTY.ARRAY>")};
    for (const std::string& whole : wholes) {
        EXPECT_EQ(200u, ask(whole).status);
        for (std::size_t at = 0; at < whole.size(); ++at)
            for (const char c : {'<', '>', '&', '"', ']', '/', '\0', '\xff'}) {
                std::string changed = whole;
                changed[at] = c;
                const unsigned status = ask(changed).status;
                EXPECT_TRUE(status == 200 || status == 400 || status == 501) << status << ": " << changed;
            }
    }
}

TEST_F(Serve, BoundsWhatStandsWithinEachOther)
{
    std::string name = name_of("1", "TEST_Other");
    for (int i = 0; i < 100; ++i)
        name = "<INSTANCENAME CLASSNAME=\"TEST_Link\"><KEYBINDING NAME=\"First\"><VALUE.REFERENCE>" + name +
               "</VALUE.REFERENCE></KEYBINDING></INSTANCENAME>";
    const std::string body =
        body_of(intrinsic("GetInstance", "<IPARAMVALUE NAME=\"InstanceName\">" + name + "</IPARAMVALUE>"));
    EXPECT_THAT(body,
                HasSubstr("<ERROR CODE=\"4\" DESCRIPTION=\"references or instances within each other, too deep\"/>"));
    std::string deep;
    for (int i = 0; i < 100000; ++i)
        deep += "<A>";
    EXPECT_EQ(400u, ask(deep).status);
}

TEST(XmlText, EscapesWhatXmlReservesAndReplacesWhatItCannotCarry)
{
    const auto written = [](const std::string& text) {
        std::string out;
        write_text(out, text);
        return out;
    };
    EXPECT_EQ("a&lt;b&gt;&amp;&quot;&apos;&#13;", written("a<b>&\"'\r"));
    EXPECT_EQ("\xc3\xa4", written("\xc3\xa4"));
    EXPECT_EQ("x?y", written("x\x01y"));
    EXPECT_EQ("a?", written("a\xff"));
    EXPECT_TRUE(is_xml_text("\xc3\xa4\xe2\x82\xac\xf0\x9f\x98\x80"));
    for (const char* broken :
         {"\xc0\x80", "\xed\xa0\x80", "\xf5\x80\x80\x80", "\xe2\x82", "\x80", "\x02", "\xef\xbf\xbe"})
        EXPECT_FALSE(is_xml_text(broken));
}

namespace {

/// A host that listens, and clients of it.
class Served : public Serve {
protected:
    Http_Options options()
    {
        Http_Options http;
        http.port = 0;
        return http;
    }
    std::string url() const { return "http://127.0.0.1:" + std::to_string(m_http.port()) + "/cimom"; }

    struct Answered {
        long status = 0;
        std::string body;
    };
    /// Sends a body (none: GET), with a header line of the caller's.
    Answered send(const std::string* body, const std::string& line = "")
    {
        Answered answered;
        CURL* handle = curl_easy_init();
        curl_slist* headers = nullptr;
        if (line.rfind("Expect", 0) != 0) headers = curl_slist_append(headers, "Expect:");
        if (line.rfind("Content-Type", 0) != 0)
            headers = curl_slist_append(headers, "Content-Type: application/xml; charset=\"utf-8\"");
        if (!line.empty()) headers = curl_slist_append(headers, line.c_str());
        curl_easy_setopt(handle, CURLOPT_URL, url().c_str());
        curl_easy_setopt(handle, CURLOPT_HTTPHEADER, headers);
        if (body) {
            curl_easy_setopt(handle, CURLOPT_POSTFIELDSIZE, static_cast<long>(body->size()));
            curl_easy_setopt(handle, CURLOPT_POSTFIELDS, body->data());
        }
        curl_easy_setopt(
            handle, CURLOPT_WRITEFUNCTION, +[](char* data, std::size_t, std::size_t size, void* to) {
                static_cast<std::string*>(to)->append(data, size);
                return size;
            });
        curl_easy_setopt(handle, CURLOPT_WRITEDATA, &answered.body);
        curl_easy_perform(handle);
        curl_easy_getinfo(handle, CURLINFO_RESPONSE_CODE, &answered.status);
        curl_slist_free_all(headers);
        curl_easy_cleanup(handle);
        return answered;
    }
    static int silent_connection(const Http_Server& to)
    {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_port = htons(to.port());
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        const int file = socket(AF_INET, SOCK_STREAM, 0);
        EXPECT_EQ(0, connect(file, reinterpret_cast<const sockaddr*>(&address), sizeof address));
        return file;
    }

    const std::string m_names = intrinsic("EnumerateInstanceNames", class_parameter("ClassName", "TEST_Thing"));
    Http_Server m_http{m_cim, options()};
};

} // namespace

TEST_F(Served, AnswersOverHttp)
{
    things::set("count", 2000);
    const Answered answered = send(&m_names);
    EXPECT_EQ(200, answered.status);
    EXPECT_THAT(answered.body, HasSubstr("<KEYVALUE VALUETYPE=\"numeric\">2000</KEYVALUE>"));
    EXPECT_EQ(body_of(m_names), answered.body) << "chunks lose nothing";
}

TEST_F(Served, RefusesOtherThingsThanAPostOfUtf8)
{
    EXPECT_EQ(405, send(nullptr).status);
    EXPECT_EQ(415, send(&m_names, "Content-Type: application/xml; charset=\"iso-8859-1\"").status);
    EXPECT_EQ(415, send(&m_names, "Content-Type: image/png").status);
    EXPECT_EQ(400, send(&m_names, "CIMMethod: GetInstance").status);
    EXPECT_EQ(200, send(&m_names, "71-CIMMethod: EnumerateInstanceNames").status);
}

TEST_F(Served, RefusesAHugeRequestAndGoesOn)
{
    const std::string huge(64 * 1024 * 1024, ' ');
    EXPECT_EQ(413, send(&huge).status);
    EXPECT_EQ(413, send(&huge, "Transfer-Encoding: chunked").status);
    EXPECT_EQ(413, send(&huge, "Expect: 100-continue").status);
    EXPECT_EQ(413, send(&m_names, "Content-Length: 99999999999999999999").status);
    EXPECT_EQ(200, send(&m_names).status);
}

TEST_F(Served, RefusesAHugeHeadAndGoesOn)
{
    EXPECT_EQ(431, send(&m_names, "CIMMethod: " + std::string(64 * 1024, 'x')).status);
    EXPECT_EQ(200, send(&m_names).status);
}

TEST_F(Served, AnswersBesideAHundredConnectionsThatSendNothing)
{
    std::vector<int> silent;
    for (int i = 0; i < 100; ++i)
        silent.push_back(silent_connection(m_http));
    EXPECT_EQ(200, send(&m_names).status);
    for (const int file : silent)
        close(file);
}

TEST_F(Served, AnswersManyAtOnce)
{
    things::set("count", 50);
    const std::string expected = body_of(m_names);
    std::atomic<int> same{0};
    std::vector<std::thread> clients;
    for (int i = 0; i < 8; ++i)
        clients.emplace_back([&] {
            for (int k = 0; k < 20; ++k)
                same += send(&m_names).body == expected;
        });
    for (std::thread& client : clients)
        client.join();
    EXPECT_EQ(160, same);
}

TEST_F(Served, EndsAConnectionThatIsSilent)
{
    Http_Options quick = options();
    quick.idle_seconds = 1;
    const Http_Server http(m_cim, quick);
    const int file = silent_connection(http);
    char byte = 0;
    EXPECT_EQ(0, recv(file, &byte, 1, 0)) << "which returns when the other side has ended it";
    close(file);
}

TEST_F(Served, EndsAConnectionWhoseRequestTrickles)
{
    Http_Options quick = options();
    quick.request_seconds = 1;
    const Http_Server http(m_cim, quick);
    const int file = silent_connection(http);
    const std::string head = "POST /cimom HTTP/1.1\r\nX: ";
    ASSERT_EQ(static_cast<ssize_t>(head.size()), ::send(file, head.data(), head.size(), MSG_NOSIGNAL));
    // Never idle for long, and never done.
    pollfd ended{file, POLLIN, 0};
    while (poll(&ended, 1, 100) == 0)
        if (::send(file, "x", 1, MSG_NOSIGNAL) != 1) break;
    char byte = 0;
    EXPECT_GE(0, recv(file, &byte, 1, 0));
    close(file);
    EXPECT_EQ(200, send(&m_names).status);
}

TEST_F(Served, OutlivesAConnectionCutAtEveryByte)
{
    const std::string whole =
        "POST /cimom HTTP/1.1\r\nHost: here\r\nContent-Type: application/xml\r\nContent-Length: " +
        std::to_string(m_names.size()) + "\r\n\r\n" + m_names;
    for (std::size_t size = 0; size < whole.size(); ++size) {
        const int file = silent_connection(m_http);
        EXPECT_EQ(static_cast<ssize_t>(size), ::send(file, whole.data(), size, MSG_NOSIGNAL));
        close(file);
    }
    EXPECT_EQ(200, send(&m_names).status);
}

TEST_F(Served, SendsALargeAnswerInChunks)
{
    things::set("count", 2000);
    const int file = silent_connection(m_http);
    const std::string request =
        "POST /cimom HTTP/1.1\r\nHost: here\r\nConnection: close\r\nContent-Length: " + std::to_string(m_names.size()) +
        "\r\n\r\n" + m_names;
    ASSERT_EQ(static_cast<ssize_t>(request.size()), ::send(file, request.data(), request.size(), MSG_NOSIGNAL));
    std::string answer;
    char buffer[4096];
    for (ssize_t size; (size = recv(file, buffer, sizeof buffer, 0)) > 0;)
        answer.append(buffer, static_cast<std::size_t>(size));
    close(file);
    EXPECT_THAT(answer, HasSubstr("Transfer-Encoding: chunked\r\n"));
    EXPECT_THAT(answer, HasSubstr("CIMOperation: MethodResponse\r\n"));
    EXPECT_THAT(answer, testing::EndsWith("\r\n0\r\n\r\n"));
}

TEST(ServedDeadlines, EndConnectionsInTheirOrderAndLeaveThoseThatWereTakenOff)
{
    int first[2], second[2], kept[2];
    for (int* pair : {first, second, kept})
        ASSERT_EQ(0, socketpair(AF_UNIX, SOCK_STREAM, 0, pair));
    {
        Deadlines deadlines;
        deadlines.set(kept[0], std::chrono::milliseconds(500));
        deadlines.take_off(kept[0]);
        deadlines.set(second[0], std::chrono::hours(1));
        deadlines.set(first[0], std::chrono::milliseconds(600));
        char byte = 0;
        EXPECT_EQ(0, recv(first[1], &byte, 1, 0));
        EXPECT_EQ(-1, recv(second[1], &byte, 1, MSG_DONTWAIT));
        deadlines.set(second[0], std::chrono::milliseconds(1));
        EXPECT_EQ(0, recv(second[1], &byte, 1, 0)) << "set anew";
        EXPECT_EQ(1, ::send(kept[0], "x", 1, MSG_NOSIGNAL));
    }
    for (int* pair : {first, second, kept})
        for (int i : {0, 1})
            close(pair[i]);
}
