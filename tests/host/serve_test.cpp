// The host over HTTP: CIM-XML messages as clients send them, good and bad, and what the connection itself must stand.
#include "host/serve/Cim_Server.h"
#include "host/serve/Http_Server.h"
#include "host/serve/Message.h"
#include "host/serve/Xml_Writer.h"
#include "tests/host/Things.h"

#include <atomic>
#include <curl/curl.h>
#include <netinet/in.h>
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

class Serve : public testing::Test {
protected:
    struct Result {
        unsigned status;
        std::string cim_error, body;
    };

    void SetUp() override { things::reset(); }
    Result ask(const std::string& body, const std::string& method = "", const std::string& object = "")
    {
        Reply reply = m_cim.answer(body, method, object);
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
    const auto code_of = [&](const std::string& request) {
        const std::string body = body_of(request);
        const std::size_t at = body.find("<ERROR CODE=\"");
        return at == std::string::npos ? 0 : std::stoi(body.substr(at + 13));
    };
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
    expect_refused("<CIM CIMVERSION=\"3.0\" DTDVERSION=\"2.0\"/>", 400, "unsupported-cim-version");
    expect_refused("<CIM CIMVERSION=\"2.0\" DTDVERSION=\"1.0\"/>", 400, "unsupported-dtd-version");
    expect_refused("<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"/>", 400, "request-not-valid");
    expect_refused("<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" PROTOCOLVERSION=\"2.0\"/></CIM>", 400,
                   "unsupported-protocol-version");
    expect_refused("<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" "
                   "PROTOCOLVERSION=\"1.0\"><MULTIREQ/></MESSAGE></CIM>",
                   501, "multiple-requests-unsupported");
    EXPECT_EQ("header-mismatch", ask(good, "GetInstance").cim_error);
    EXPECT_EQ("header-mismatch", ask(good, "EnumerateInstanceNames", "root%2Felse").cim_error);
    EXPECT_EQ(200u, ask(good, "EnumerateInstanceNames", "root%2Ftest").status);
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
    for (const char* broken : {"\xc0\x80", "\xed\xa0\x80", "\xf5\x80\x80\x80", "\xe2\x82", "\x80", "\x02"})
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
        http.most_bytes = 1024 * 1024;
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
        curl_slist* headers = curl_slist_append(nullptr, "Expect:");
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
    int silent_connection() const
    {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_port = htons(m_http.port());
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
    const long status = send(&huge).status;
    EXPECT_TRUE(status == 413 || status == 0) << status << ": told, or the connection closed under the sender";
    EXPECT_EQ(200, send(&m_names).status);
}

TEST_F(Served, AnswersBesideAHundredConnectionsThatSendNothing)
{
    std::vector<int> silent;
    for (int i = 0; i < 100; ++i)
        silent.push_back(silent_connection());
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
