// CIM-XML requests to a host that holds a few instances of its own, up to the whole answer.
#include "fuzz/fuzzing.h"
#include "host/serve/Cim_Server.h"
#include "host/serve/Xml_Reader.h"

using namespace host;
using fuzzing::expect;

static Host& server()
{
    static Host* const made = [] {
        std::string error;
        const auto schema =
            Schema::from_text("class T_Base { [Key] string Name; };\n"
                              "class T_Thing : T_Base { boolean B; uint8 U8; sint64 S64; real32 R; char16 C; datetime "
                              "When; string Texts[]; "
                              "uint32 Numbers[]; [EmbeddedInstance (\"T_Base\")] string Inner; T_Base REF Friend;\n"
                              "  uint32 Do ([In] uint32 Number, [In] string Words[], [In] T_Base REF Target, [In "
                              "(false), Out] string Back); "
                              "};\n"
                              "[Association] class T_Link { [Key] T_Base REF From; [Key] T_Base REF To; };\n"
                              "[Indication] class T_Alert { string Words; };\n",
                              error);
        expect(bool(schema), "the schema of this program is read");
        Host_Options options;
        options.manner = Manner::sfcb(); // requests share threads
        auto* host = new Host(schema, options);
        Registration registration;
        registration.class_name = "T_Thing";
        registration.provider = "T_Thing_Provider";
        registration.module = "/nowhere/lib_none.so"; // what reaches a provider finds none
        registration.kinds = instance_kind | method_kind;
        registration.name_spaces = {"root/test"};
        host->add(registration);
        Instance base;
        base.path.name_space = "root/test";
        base.path.class_name = "T_Base";
        base.set("Name", Value::string("one \"<&>\""));
        host->add_instance(base);
        return host;
    }();
    return *made;
}

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    server();
    return 0;
}

/// Lines that come before the body's first "<" are the headers.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    std::string body(reinterpret_cast<const char*>(data), size);
    Request_Head head;
    for (std::string* header : {&head.method, &head.object, &head.host, &head.version, &head.batch, &head.operation}) {
        const std::size_t end = body.find('\n');
        if (end == std::string::npos || body[0] == '<') break;
        *header = body.substr(0, end);
        body.erase(0, end + 1);
    }
    Cim_Server cim(server(), "localhost:5988");
    Reply reply = cim.answer(body, head);
    std::string text;
    while (reply.pieces(text)) {
    }
    if (reply.status != 200) return 0;
    expect(is_xml_text(text), "an answer is text that XML can carry");
    expect(text.size() > 20 && text.compare(text.size() - 7, 7, "</CIM>\n") == 0, "an answer ends");
    return 0;
}
