// Frame tagging: the switch of an adapter, and its tag table carried to and from a file.
#include <fcntl.h>
#include <filesystem>
#include <optional>
#include <regex>
#include <sys/stat.h>
#include <unistd.h>

#include <gmock/gmock.h>

#include "simulator/Calls.h"
#include "simulator/nvrsim.h"
#include "tests/module/support/Service.h"
#include "tests/support/curl_libraries.h"
#include "tests/support/file_server.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Value;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

namespace {

constexpr char adapter_name[] = "Norvane-FC2162-0";
constexpr char directory[] = "/var/log/dumps";
constexpr char here[] = "/var/log/here"; // where the server stands

const std::string provider = "NVRHBA_FCTagService_Provider";

/// One tagged adapter, and one without a table.
std::string tagged_host()
{
    return std::string("[[adapter]]\n[[adapter.port]]\ndump_directory = \"") + directory +
           "\"\n[[adapter.tag]]\nsource = \"10000000C9A00001\"\ntarget = \"50060E8005A10000\"\ntag = 5\n"
           "[[adapter.tag]]\nsource = \"10000000C9A00001\"\ntarget = \"50060E8005A1000F\"\ntag = 255\n[[adapter]]\n";
}

void make_place(const std::string& path)
{
    std::filesystem::remove_all(path);
    make_folder(path);
}

std::vector<std::string> files(const std::string& path)
{
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(path))
        names.push_back(entry.path().filename());
    std::sort(names.begin(), names.end());
    return names;
}

/// "source target tag" of each entry that the simulated adapter has.
std::vector<std::string> table(const char* adapter = adapter_name)
{
    const uint32_t handle = nvrsim_CPQFC_OpenAdapter(adapter);
    std::vector<uint32_t> words(9 * 70000 + 1);
    words[0] = 70000;
    auto* config = reinterpret_cast<CPQFC_QOSCONFIG*>(words.data());
    EXPECT_EQ(nvrsim_CPQFC_QoSGetConfig(handle, config), 0u);
    nvrsim_CPQFC_CloseAdapter(handle);
    std::vector<std::string> rows;
    for (uint32_t i = 0; i < config->count; i++) {
        const CPQFC_QOSENTRY& entry = config->entry[i];
        char text[48];
        char* at = text;
        for (const HBA_WWN& wwn : {entry.source, entry.target}) {
            for (const HBA_UINT8 byte : wwn.wwn)
                at += std::snprintf(at, 3, "%02X", byte);
            *at++ = ' ';
        }
        std::snprintf(at, 8, "%d", entry.tag);
        rows.push_back(text);
    }
    return rows;
}

const std::vector<std::string> two_rows = {"10000000C9A00001 50060E8005A10000 5",
                                           "10000000C9A00001 50060E8005A1000F 255"};

std::string row(const std::string& tag)
{
    return "<Row><src_wwpn>10000000C9A00002</src_wwpn><tgt_wwpn>50060e8005a10000</tgt_wwpn><tag>" + tag +
           "</tag></Row>";
}

std::string document(const std::string& configuration)
{
    return "<ApexConfig><theSystem><ApexVersion/><CreationDate/><HostName/><Adapter/></theSystem><Configuration>" +
           configuration + "</Configuration></ApexConfig>";
}

/// The words of one entry of a table in the log, from its texts.
Words entry_words(const std::string& source, const std::string& target, const std::string& tag)
{
    Words words;
    const auto bytes = [&](const std::string& start, const std::string& digits) {
        for (std::size_t i = 0; i + 1 < digits.size(); i += 2) {
            char byte[4];
            std::snprintf(byte, sizeof byte, "%X", static_cast<unsigned>(std::stoul(digits.substr(i, 2), nullptr, 16)));
            words.push_back(start + byte);
        }
    };
    bytes("src_wwpn:", source);
    bytes("tgt_wwpn:", target);
    words.push_back("tag:" + tag);
    return words;
}

Words two_rows_words()
{
    return joined({{"PrintQoSEntry", "Number Of Entries: 2"},
                   entry_words("10000000C9A00001", "50060E8005A10000", "5"),
                   entry_words("10000000C9A00001", "50060E8005A1000F", "255")});
}

struct Method {
    const char* name;
    Words entry;
    std::string not_opened;
};

const Method methods[] = {
    {"GetGlobalFlag",
     {provider + ": Inside GetGlobalFlag"},
     provider + "::Failed to Open Adapter, Skipping GetGlobalFlag Adapter Name:"},
    {"SetGlobalFlag",
     {provider + ": Inside SetGlobalFlag"},
     "ERROR:" + provider + "::Failed to Open Adapter, Skipping SetGlobalFlag Adapter Name:"},
    {"GetConfigTable", {}, provider + "::Failed to Open Adapter, Skipping GetConfigTable Adaptor Name:"},
    {"SetConfigTable", {}, provider + "::Failed to Open Adapter, Skipping SetConfigTable Adapter Name:"},
};

/// From the adapter's name to its number.
Words adapters(const std::string& name = adapter_name, int count = 2)
{
    return {provider + "::Successfully got AdapterName," + name,
            provider + "::CPQFC_GetNumberOfAdapters Successful:" + std::to_string(count)};
}

/// The way of a table method to the adapter.
Words table_path(const std::string& dumps = directory)
{
    return {provider + "::Successfully got DeviceID," + first_port, provider + "::Successfully got DumpPath," + dumps};
}

} // namespace

class TagService : public Every_Manner {
protected:
    TagService()
    {
        make_place(directory);
        make_place(here);
        EXPECT_EQ(::chdir(here), 0);
        rig.emplace(Rig_Options{*GetParam(), tagged_host()});
        service.emplace(*rig, "NVRHBA_FCTagService");
    }
    Arguments with(const std::string& uri = {}, std::size_t place = 0)
    {
        Arguments arguments{{"Target", port(*rig, place)}};
        if (!uri.empty()) arguments.push_back({"URI", Value::string(uri)});
        return arguments;
    }
    /// Of a file of that content.
    Called load(const std::string& content)
    {
        write_file(std::string(here) + "/table", content);
        return service->call("SetConfigTable", with("table"));
    }
    /// The words of a file that was opened and read, up to what is in it.
    Words reading(const std::string& name = "table")
    {
        return joined({{gate},
                       known_port(),
                       {"Inside NVR_MethodWrapper::downloadFileUsingCurl", provider + "::filename is : " + name},
                       adapters(),
                       {provider + "::Entering SetConfigTable"}});
    }

    std::optional<Rig> rig;
    std::optional<Service> service;
};
NVR_IN_EVERY_MANNER(TagService);

// ---- The switch

TEST_P(TagService, TheSwitchIsReadAndSet)
{
    const auto way = [&](std::size_t method, const Called& called) {
        // The number of the handle is the library's.
        Words words = joined({{gate}, methods[method].entry, known_port(), adapters()});
        EXPECT_EQ(Words(called.words.begin(), called.words.begin() + static_cast<std::ptrdiff_t>(words.size())), words);
        const Words rest(called.words.begin() + static_cast<std::ptrdiff_t>(words.size()), called.words.end());
        EXPECT_THAT(rest, ElementsAre(StartsWith(provider + "::Successfully Opened Adaptor, Adapter Handle:"),
                                      provider + "::" + methods[method].name + " Successful"));
    };
    Called called = service->call("GetGlobalFlag", with());
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.out("State").as_uint(), 0u);
    way(0, called);
    for (const std::uint32_t state : {1u, 4294967295u, 0u}) {
        called = service->call("SetGlobalFlag", {{"Target", port(*rig)}, {"State", Value::uint32(state)}});
        EXPECT_THAT(called, returned(0));
        way(1, called);
        called = service->call("gETgLOBALfLAG", with());
        EXPECT_THAT(called, returned(0));
        EXPECT_EQ(called.out("State").as_uint(), state);
        EXPECT_EQ(service->call("GetGlobalFlag", with("", 1)).out("State").as_uint(), 0u) << "of the other adapter";
    }
    // None given is 0.
    ASSERT_THAT(service->call("SetGlobalFlag", {{"Target", port(*rig)}, {"State", Value::uint32(7)}}), returned(0));
    EXPECT_THAT(service->call("SetGlobalFlag", with()), returned(0));
    EXPECT_EQ(service->call("GetGlobalFlag", with()).out("State").as_uint(), 0u);
}

// ---- What all four methods refuse

TEST_P(TagService, ATargetThatIsNoPortIsRefused)
{
    for (const Method& method : methods) {
        const Words null_target = joined({{gate}, method.entry, {"Target has a null pointer"}});
        Called called = service->call(method.name);
        EXPECT_THAT(called, returned(4097)) << method.name;
        EXPECT_EQ(called.words, null_target);
        // One of another class never gets past the conversion of arguments.
        called = service->call(method.name, {{"Target", no_port(*rig)}, {"URI", Value::string("x")}});
        EXPECT_THAT(called, returned(4097)) << method.name;
        EXPECT_EQ(called.words, null_target);
        called = service->call(method.name, {{"Target", unknown_port(*rig)}, {"URI", Value::string("x")}});
        EXPECT_THAT(called, returned(32968)) << method.name;
        EXPECT_EQ(called.words,
                  joined({{gate}, method.entry, no_known_port(), {provider + "::Wrong DeviceID passed"}}));
    }
    EXPECT_EQ(calls("CPQFC_GetNumberOfAdapters"), 0u);
}

TEST_P(TagService, AnotherServiceIsRefused)
{
    for (const Method& method : methods) {
        const Called called = service->call_on(service->stranger(), method.name, with("x"));
        EXPECT_THAT(called, returned(33068)) << method.name;
        EXPECT_EQ(called.words, joined({{gate}, method.entry, {"Invalid instance of FC Tagging Service"}}));
    }
}

TEST_P(TagService, AHostWithoutAdaptersIsRefused)
{
    add_fault("call = \"CPQFC_GetNumberOfAdapters\", status = 0");
    write_file(std::string(here) + "/x", "");
    for (const Method& method : methods) {
        const bool takes_uri = method.entry.empty();
        const Called called = service->call(method.name, with(takes_uri ? "x" : ""));
        EXPECT_THAT(called, returned(32768)) << method.name;
        EXPECT_EQ(called.words.back(), provider + "::CPQFC_GetNumberOfAdapters()- No Adapters found");
        EXPECT_EQ(called.words[called.words.size() - 2], provider + "::Successfully got AdapterName," + adapter_name);
    }
    EXPECT_EQ(calls("CPQFC_OpenAdapter"), 0u);
}

TEST_P(TagService, AnAdapterThatCannotBeOpenedIsRefused)
{
    add_fault("call = \"CPQFC_OpenAdapter\", damage = \"null\"");
    write_file(std::string(here) + "/x", "");
    for (const Method& method : methods) {
        const bool takes_uri = method.entry.empty();
        const Called called = service->call(method.name, with(takes_uri ? "x" : ""));
        EXPECT_THAT(called, returned(32968)) << method.name;
        EXPECT_EQ(called.words.back(), method.not_opened + adapter_name);
    }
    EXPECT_THAT(files(directory), IsEmpty());
}

TEST_P(TagService, ATableNeedsAName)
{
    for (const Value& uri : {Value::string(""), Value::null_of(CMPI_string)}) {
        Called called = service->call("GetConfigTable", {{"Target", port(*rig)}, {"URI", uri}});
        EXPECT_THAT(called, returned(4097));
        EXPECT_EQ(called.words, joined({{gate}, known_port(), {"Null sized URI..returning"}}));
        called = service->call("SetConfigTable", {{"Target", port(*rig)}, {"URI", uri}});
        EXPECT_THAT(called, returned(4097));
        EXPECT_EQ(called.words, joined({{gate}, known_port(), {provider + "::Null sized URI"}}));
    }
    EXPECT_THAT(service->call("GetConfigTable", with()), returned(4097));
    EXPECT_THAT(service->call("SetConfigTable", with()), returned(4097));
}

// ---- From the adapter to a file

TEST_P(TagService, ATableIsWrittenIntoTheDumpDirectory)
{
    const Called called = service->call("GetConfigTable", with("tags.xml"));
    EXPECT_THAT(called, returned(0));
    const Words before = joined({{gate}, known_port(), table_path(), adapters()});
    const Words after = joined({two_rows_words(),
                                {provider + "::GetConfigTable", "GetConfigTable: filename :/var/log/dumps/tags.xml",
                                 provider + "::WriteConfigTablesToFile", provider + "::GetConfigTable Successful"}});
    ASSERT_EQ(called.words.size(), before.size() + 1 + after.size());
    EXPECT_EQ(Words(called.words.begin(), called.words.begin() + static_cast<std::ptrdiff_t>(before.size())), before);
    EXPECT_THAT(called.words[before.size()], StartsWith(provider + "::Successfully Opened Adapter, hbaHandle:"));
    EXPECT_EQ(Words(called.words.end() - static_cast<std::ptrdiff_t>(after.size()), called.words.end()), after);

    ASSERT_THAT(files(directory), ElementsAre("tags.xml"));
    const std::string text = read_file("/var/log/dumps/tags.xml");
    const std::string empty_bytes = "\t\t\t<reserved1>00000000000000000000000000000000</reserved1>\n";
    const std::regex date("<CreationDate>[0-9]{14}\\.[0-9]{6}[-+][0-9]{3}</CreationDate>");
    EXPECT_TRUE(std::regex_search(text, date)) << text;
    EXPECT_EQ(std::regex_replace(text, date, "<CreationDate>now</CreationDate>"),
              "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
              "<ApexConfig>\n"
              "\t<theSystem>\n"
              "\t\t<ApexVersion>1.0</ApexVersion>\n"
              "\t\t<CreationDate>now</CreationDate>\n"
              "\t\t<HostName>storage1</HostName>\n"
              "\t\t<Adapter>Norvane-FC2162-0</Adapter>\n"
              "\t</theSystem>\n"
              "\t<Configuration>\n"
              "\t\t<numberOfEntries>2</numberOfEntries>\n"
              "\t\t<Row>\n"
              "\t\t\t<src_wwpn>10000000C9A00001</src_wwpn>\n"
              "\t\t\t<tgt_wwpn>50060E8005A10000</tgt_wwpn>\n" +
                  empty_bytes +
                  "\t\t\t<tag>5</tag>\n"
                  "\t\t\t<reserved2>000000</reserved2>\n"
                  "\t\t</Row>\n"
                  "\t\t<Row>\n"
                  "\t\t\t<src_wwpn>10000000C9A00001</src_wwpn>\n"
                  "\t\t\t<tgt_wwpn>50060E8005A1000F</tgt_wwpn>\n" +
                  empty_bytes +
                  "\t\t\t<tag>255</tag>\n"
                  "\t\t\t<reserved2>000000</reserved2>\n"
                  "\t\t</Row>\n"
                  "\t</Configuration>\n"
                  "</ApexConfig>\n\n");
}

TEST_P(TagService, AWrittenTableComesBack)
{
    ASSERT_THAT(service->call("GetConfigTable", with("tags.xml")), returned(0));
    ASSERT_THAT(load(document("<numberOfEntries>1</numberOfEntries>" + row("9"))), returned(0));
    ASSERT_THAT(table(), ElementsAre("10000000C9A00002 50060E8005A10000 9"));
    const Called called = service->call("setconfigtable", with("/var/log/dumps/tags.xml"));
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(
        called.words,
        joined({reading("/var/log/dumps/tags.xml"), two_rows_words(), {provider + "::CPQFC_QoSSetConfig is success"}}));
    EXPECT_EQ(table(), two_rows);
    EXPECT_THAT(files(directory), ElementsAre("tags.xml")) << "a file of this host is kept";
}

TEST_P(TagService, AnEmptyTableIsNotWritten)
{
    const Called called = service->call("GetConfigTable", with("tags.xml", 1));
    EXPECT_THAT(called, returned(32767));
    EXPECT_EQ(called.words.back(), provider + ":: CPQFC_QoSGetConfig - No Config Entries set ");
    EXPECT_THAT(files(directory), IsEmpty());
}

TEST_P(TagService, ATableThatCannotBeReadIsNotWritten)
{
    add_fault("call = \"CPQFC_QoSGetConfig\", status = 77, from = 2");
    Called called = service->call("GetConfigTable", with("tags.xml"));
    EXPECT_THAT(called, returned(1));
    EXPECT_EQ(called.words.back(), provider + ":: CPQFC_QoSGetConfig failed with an error :77 ");
    // A first question that fails with a count of 0 is no empty table.
    clear_faults();
    add_fault("call = \"CPQFC_QoSGetConfig\", status = 78");
    called = service->call("GetConfigTable", with("tags.xml"));
    EXPECT_THAT(called, returned(1));
    EXPECT_EQ(called.words.back(), provider + ":: CPQFC_QoSGetConfig failed with an error :78 ");
    EXPECT_THAT(files(directory), IsEmpty());
}

TEST_P(TagService, CountsThatLieReadNoFurtherThanTheTable)
{
    // More than an adapter has, which no file is read with: the log tells, the client is not told.
    for (const char* count : {"65537", "466033", "4294967295"}) {
        clear_faults();
        add_fault("call = \"CPQFC_QoSGetConfig\", status = 7, value = " + std::string(count));
        const Called called = service->call("GetConfigTable", with("tags.xml"));
        EXPECT_THAT(called, returned(0)) << count;
        const std::size_t size = called.words.size();
        EXPECT_EQ(
            Words(called.words.begin() + static_cast<std::ptrdiff_t>(size - 3), called.words.end()),
            Words({provider + ":: Memory Allocation failed for pQosConfig",
                   provider + ": GetConfigTable Memory allocation failed", provider + "::GetConfigTable Successful"}));
        EXPECT_THAT(files(directory), IsEmpty());
    }
    // Another count with the entries.
    for (const auto& [count, told] : {std::pair("1", "1"), std::pair("100", "2"), std::pair("4294967295", "2")}) {
        clear_faults();
        add_fault("call = \"CPQFC_QoSGetConfig\", from = 2, value = " + std::string(count));
        const Called called = service->call("GetConfigTable", with("tags.xml"));
        EXPECT_THAT(called, returned(0)) << count;
        EXPECT_THAT(called.words, Contains(std::string("Number Of Entries: ") + told)) << count;
        EXPECT_THAT(read_file("/var/log/dumps/tags.xml"),
                    testing::HasSubstr(std::string("<numberOfEntries>") + told + "<"));
    }
    // A table that grew in between.
    clear_faults();
    add_fault("call = \"CPQFC_QoSGetConfig\", times = 1, status = 7, value = 1");
    EXPECT_THAT(service->call("GetConfigTable", with("tags.xml")), returned(1));
}

TEST_P(TagService, AFileThatCannotBeWrittenShowsInTheLogAlone)
{
    make_folder(std::string(directory) + "/folder");
    ASSERT_EQ(::mkfifo("/var/log/dumps/fifo", 0600), 0);
    ASSERT_EQ(::symlink("/var/log/dumps/nowhere", "/var/log/dumps/link"), 0);
    for (const char* name :
         {"nobody/tags.xml", "folder/tags.xml", "../tags.xml", "folder", "fifo", "link", "folder/", "/", "..", "."}) {
        const Called called = service->call("GetConfigTable", with(name));
        EXPECT_THAT(called, returned(0)) << name;
        const std::size_t size = called.words.size();
        EXPECT_EQ(Words(called.words.begin() + static_cast<std::ptrdiff_t>(size - 4), called.words.end()),
                  Words({"GetConfigTable: filename :/var/log/dumps/" + std::string(name),
                         provider + "::WriteConfigTablesToFile", provider + "::file.fail()",
                         provider + "::GetConfigTable Successful"}));
    }
    EXPECT_THAT(files(directory), ElementsAre("fifo", "folder", "link"));
    EXPECT_THAT(files(std::string(directory) + "/folder"), IsEmpty());
    EXPECT_FALSE(exists("/var/log/tags.xml"));
}

TEST_P(TagService, AFullDiskLeavesNoFile)
{
    const Small_Disk disk(directory);
    disk.fill();
    const Called called = service->call("GetConfigTable", with("tags.xml"));
    EXPECT_THAT(called, returned(0));
    const std::size_t size = called.words.size();
    EXPECT_EQ(Words(called.words.begin() + static_cast<std::ptrdiff_t>(size - 3), called.words.end()),
              Words({provider + "::WriteConfigTablesToFile", provider + "::file.fail()",
                     provider + "::GetConfigTable Successful"}));
    EXPECT_THAT(files(directory), ElementsAre("filler"));
}

TEST_P(TagService, APathThatDoesNotFitIsRefused)
{
    const std::size_t room = 255 - std::string(directory).size() - 1;
    for (const std::size_t size : {room + 1, std::size_t{65536}}) {
        const Called called = service->call("GetConfigTable", with(std::string(size, 'n')));
        EXPECT_THAT(called, returned(32968)) << size;
        EXPECT_EQ(called.words.back(), provider + ": GETConfigTable execption: the file name is too long");
        EXPECT_THAT(files(directory), IsEmpty());
    }
    EXPECT_THAT(service->call("GetConfigTable", with(std::string(room, 'n'))), returned(0));
    EXPECT_THAT(files(directory), ElementsAre(std::string(room, 'n')));
}

TEST_P(TagService, NamesAreTakenAsTheyAre)
{
    for (const char* name : {"a b", "%s%n", "\"'<&>", "a\nb"}) {
        EXPECT_THAT(service->call("GetConfigTable", with(name)), returned(0));
        EXPECT_TRUE(exists(std::string(directory) + "/" + name)) << name;
        EXPECT_THAT(service->call("SetConfigTable", with(std::string(directory) + "/" + name)), returned(0)) << name;
    }
    EXPECT_EQ(table(), two_rows);
}

// ---- From a file to the adapter

TEST_P(TagService, ATableIsLoadedFromAFile)
{
    const Called called = load(document("<numberOfEntries>2</numberOfEntries>" + row("300") + row("1") + row("2")));
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, joined({reading(),
                                    {"PrintQoSEntry", "Number Of Entries: 2"},
                                    entry_words("10000000C9A00002", "50060E8005A10000", "44"),
                                    entry_words("10000000C9A00002", "50060E8005A10000", "1"),
                                    {provider + "::CPQFC_QoSSetConfig is success"}}));
    EXPECT_THAT(table(), ElementsAre("10000000C9A00002 50060E8005A10000 44", "10000000C9A00002 50060E8005A10000 1"));
    EXPECT_THAT(files(here), ElementsAre("table"));
}

TEST_P(TagService, MissingRowsAreZeros)
{
    EXPECT_THAT(load(document("<numberOfEntries>2</numberOfEntries>" + row("1"))), returned(0));
    EXPECT_THAT(table(), ElementsAre("10000000C9A00002 50060E8005A10000 1", "0000000000000000 0000000000000000 0"));
}

TEST_P(TagService, AFileOfAnotherShapeDoesNotTouchTheAdapter)
{
    struct Row {
        std::string content;
        const char* words;
    };
    std::string nested;
    for (int i = 0; i < 100000; i++)
        nested += "<a>";
    const std::string good = "<numberOfEntries>1</numberOfEntries>" + row("1");
    std::string no_host = document(good);
    no_host.erase(no_host.find("<HostName/>"), std::string("<HostName/>").size());
    const Row rows[] = {
        {no_host, "hostNameNode is not found or corrupted in the Apex config table"},
        {"", "apexConfigNode is not found or corrupted in the Apex config table"},
        {document("<numberOfEntries>1</numberOfEntries>"),
         "rowNode is not found or corrupted in the Apex config table"},
        {document(row("1") + "<numberOfEntries>1</numberOfEntries>"),
         "rowNode is not found or corrupted in the Apex config table"},
        {document("<numberOfEntries>1</numberOfEntries><Row/>"), "SetConfigTable::malformed src_wwpn field "},
        {document("<numberOfEntries>1</numberOfEntries><Row><src_wwpn/></Row>"),
         "SetConfigTable::malformed tgt_wwpn field "},
        {document("<numberOfEntries>1</numberOfEntries><Row><src_wwpn>10000000C9A00002</src_wwpn>"
                  "<tgt_wwpn>10000000C9A00002</tgt_wwpn></Row>"),
         "SetConfigTable:: malformed tag field "},
        {document(good).substr(0, 100), "unexpected end of data"},
        {"no XML", "expected <"},
        {nested, "elements are nested too deeply"},
        {std::string(10 * 1024 * 1024, 'x'), "expected <"},
        {"<a>" + std::string(10 * 1024 * 1024, 'x') + "</a>",
         "apexConfigNode is not found or corrupted in the Apex config table"},
    };
    for (const Row& one : rows) {
        const Called called = load(one.content);
        EXPECT_THAT(called, returned(32968)) << one.words;
        // The one that is missing a node has said what it converted before.
        EXPECT_EQ(called.words.back(), one.words);
        EXPECT_EQ(Words(called.words.begin(), called.words.begin() + static_cast<std::ptrdiff_t>(reading().size())),
                  reading());
    }
    EXPECT_EQ(calls("CPQFC_QoSSetConfig"), 0u);
    EXPECT_EQ(table(), two_rows);
}

TEST_P(TagService, AFileOfTooMuchIsNoMemory)
{
    for (const char* count : {"-1", "65537"}) {
        const Called called =
            load(document("<numberOfEntries>" + std::string(count) + "</numberOfEntries>" + row("1")));
        EXPECT_THAT(called, returned(32774)) << count;
        EXPECT_EQ(called.words,
                  joined({reading(),
                          {"SetConfigTable::Memory Allocation Failed ", "SetConfigTable: Memory allocation failed"}}));
    }
    // A file that claims to be huge.
    write_file(std::string(here) + "/huge", "");
    ASSERT_EQ(::truncate("/var/log/here/huge", 1024ll * 1024 * 1024 * 1024), 0);
    const Called called = service->call("SetConfigTable", with("huge"));
    EXPECT_THAT(called, returned(32774));
    EXPECT_EQ(called.words, joined({reading("huge"), {"SetConfigTable: Memory allocation failed"}}));
    EXPECT_EQ(calls("CPQFC_QoSSetConfig"), 0u);
}

TEST_P(TagService, WhatIsNoFileCannotBeOpened)
{
    make_folder(std::string(here) + "/folder");
    ASSERT_EQ(::mkfifo("/var/log/here/fifo", 0600), 0);
    for (const char* name : {"folder", "fifo", "/dev/null", "/dev/zero"}) {
        const Called called = service->call("SetConfigTable", with(name));
        EXPECT_THAT(called, returned(32968)) << name;
        EXPECT_EQ(called.words, joined({reading(name), {std::string("cannot open file ") + name}}));
    }
}

TEST_P(TagService, AFileThatIsNotThereIsNotFound)
{
    const Words start = joined({{gate},
                                known_port(),
                                {"Inside NVR_MethodWrapper::downloadFileUsingCurl",
                                 "File not found on local file system. Trying libcURL..."}});
    write_file(std::string(here) + "/file", "");
    const std::pair<std::string, int> names[] = {
        {"nobody", 4107}, {"nobody/nothing", 4107}, {"/nobody/", 4107},           {"../nobody", 4107},
        {"%n%s", 4107},   {"file/inside", 5},       {std::string(65536, 'n'), 5}, {std::string(40000, '/') + "n", 5},
    };
    for (const auto& [name, value] : names) {
        const Called called = service->call("SetConfigTable", with(name));
        EXPECT_THAT(called, returned(value)) << name.substr(0, 20);
        EXPECT_EQ(Words(called.words.begin(), called.words.begin() + static_cast<std::ptrdiff_t>(start.size())), start);
        EXPECT_EQ(called.words.back(), value == 4107 ? "ERROR:" + provider + "::Configuration file not found"
                                                     : "ERROR: " + provider + ":: Can't stat Configuration file ");
    }
    EXPECT_EQ(calls("CPQFC_GetNumberOfAdapters"), 0u);
    EXPECT_THAT(files(here), ElementsAre("file"));
}

// ---- From elsewhere

class TagServiceTransfer : public testing::Test {
protected:
    TagServiceTransfer()
    {
        make_place(directory);
        make_place(here);
        make_place(served);
        EXPECT_EQ(::chdir(here), 0);
        // What the module has opened by that name once is found by it again while the library is in the process.
        install_no_curl();
        rig.emplace(Rig_Options{host::Manner::strict(), tagged_host()});
        service.emplace(*rig, "NVRHBA_FCTagService");
    }
    Called fetch(const std::string& uri)
    {
        return service->call("SetConfigTable", {{"Target", port(*rig)}, {"URI", Value::string(uri)}});
    }

    static constexpr char served[] = "/var/log/served";
    static constexpr char removed[] =
        "NVRHBA_FCTagService_Provider::: FC TAG Config file tags.xml removed successfully";
    std::optional<Rig> rig;
    std::optional<Service> service;
};

TEST_F(TagServiceTransfer, AFetchedTableIsLoadedAndItsFileRemoved)
{
    install_curl();
    const std::string file = std::string(served) + "/tags.xml";
    for (const char* kind : {"http", "ftp"}) {
        write_file(file, document("<numberOfEntries>1</numberOfEntries>" + row(*kind == 'h' ? "1" : "2")));
        File_Server server(kind, served);
        const Called called = fetch(server.url() + "tags.xml");
        EXPECT_THAT(called, returned(0)) << kind;
        EXPECT_THAT(table(),
                    ElementsAre(std::string("10000000C9A00002 50060E8005A10000 ") + (*kind == 'h' ? "1" : "2")));
        EXPECT_THAT(called.words,
                    contains_in_order({"Inside NVR_MethodWrapper::downloadFileUsingCurl", "Successfully closed curl so",
                                       provider + "::filename is : tags.xml", provider + "::Entering SetConfigTable",
                                       provider + "::CPQFC_QoSSetConfig is success", removed}));
        EXPECT_EQ(called.words.back(), removed);
        EXPECT_THAT(files(here), IsEmpty()) << kind;
    }
}

TEST_F(TagServiceTransfer, AFetchedFileIsRemovedWhateverComesOfIt)
{
    install_curl();
    write_file(std::string(served) + "/tags.xml", document("<numberOfEntries>1</numberOfEntries>" + row("1")));
    const std::string uri = std::string("file://") + served + "/tags.xml";

    add_fault("call = \"CPQFC_GetNumberOfAdapters\", status = 0");
    Called called = fetch(uri);
    EXPECT_THAT(called, returned(32768));
    EXPECT_EQ(called.words.back(), removed);
    EXPECT_THAT(files(here), IsEmpty());

    clear_faults();
    add_fault("call = \"CPQFC_OpenAdapter\", damage = \"null\"");
    called = fetch(uri);
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(called.words.back(), removed);
    EXPECT_THAT(files(here), IsEmpty());

    clear_faults();
    add_fault("call = \"CPQFC_QoSSetConfig\", status = 9");
    called = fetch(uri);
    EXPECT_THAT(called, returned(1));
    EXPECT_EQ(called.words[called.words.size() - 2], provider + "::CPQFC_QoSSetConfig failed with an error :9");
    EXPECT_EQ(called.words.back(), removed);
    EXPECT_THAT(files(here), IsEmpty());

    clear_faults();
    write_file(std::string(served) + "/tags.xml", "no XML");
    called = fetch(uri);
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(called.words[called.words.size() - 2], "expected <");
    EXPECT_EQ(called.words.back(), removed);
    EXPECT_THAT(files(here), IsEmpty());

    // What the transfer left of a file that is not there is no table.
    called = fetch(std::string("file://") + served + "/nobody.xml");
    EXPECT_THAT(called, returned(32968));
    EXPECT_THAT(files(here), IsEmpty());
    EXPECT_EQ(table(), two_rows);
}

TEST_F(TagServiceTransfer, AMalformedAddressIsNotFoundAndLeavesItsFile)
{
    install_curl();
    const Called called = fetch("http://[:]:x/tags.xml");
    EXPECT_THAT(called, returned(4107));
    EXPECT_THAT(called.words, Contains("download failed 3"));
    EXPECT_EQ(called.words[called.words.size() - 2], provider + "::filename is : http://[:]:x/tags.xml");
    EXPECT_EQ(called.words.back(), "ERROR:" + provider + "::Configuration file not found");
    EXPECT_THAT(files(here), ElementsAre("tags.xml"));
}

TEST_F(TagServiceTransfer, AFullDiskLeavesNoTable)
{
    install_curl();
    std::string rows;
    for (int i = 0; i < 1000; i++)
        rows += row("1");
    write_file(std::string(served) + "/tags.xml", document("<numberOfEntries>1000</numberOfEntries>" + rows));
    const Small_Disk disk(here);
    ASSERT_EQ(::chdir(here), 0);
    const Called called = fetch(std::string("file://") + served + "/tags.xml");
    EXPECT_THAT(called, returned(32968));
    EXPECT_THAT(called.words, contains_in_order({"download failed 23", "unexpected end of data", removed}));
    EXPECT_EQ(called.words.back(), removed);
    EXPECT_THAT(files(here), IsEmpty());
    EXPECT_EQ(table(), two_rows);
    EXPECT_EQ(::chdir("/"), 0);
}

TEST_F(TagServiceTransfer, WithoutALibraryForItNothingIsFetched)
{
    EXPECT_THAT(fetch("ftp://127.0.0.1/tags.xml"), returned(4107));
    EXPECT_THAT(files(here), IsEmpty());
}

// ---- Each status of the library

TEST(TagServiceStatuses, EachIsOne)
{
    make_place(directory);
    make_place(here);
    ASSERT_EQ(::chdir(here), 0);
    Rig rig({host::Manner::strict(), tagged_host()});
    Service service(rig, "NVRHBA_FCTagService");
    write_file(std::string(here) + "/table", document("<numberOfEntries>1</numberOfEntries>" + row("1")));
    struct Row {
        const char* method;
        const char* call;
        std::string failure;
        const char* end;
    };
    const Row rows[] = {
        {"GetGlobalFlag", "CPQFC_QoSGetGlobalFlag", provider + "::CPQFC_QoSGetGlobalFlag Failed with Error :", ""},
        {"SetGlobalFlag", "CPQFC_QoSSetGlobalFlag", provider + "::CPQFC_QoSSetGlobalFlag Failed with Error :", ""},
        {"GetConfigTable", "CPQFC_QoSGetConfig", provider + ":: CPQFC_QoSGetConfig failed with an error :", " "},
        {"SetConfigTable", "CPQFC_QoSSetConfig", provider + "::CPQFC_QoSSetConfig failed with an error :", ""},
    };
    const Arguments arguments = {{"Target", port(rig)}, {"URI", Value::string("table")}};
    const Arguments flag = {{"Target", port(rig)}};
    for (const Row& one : rows)
        for (std::uint32_t status = 1; status <= 260; status++) {
            clear_faults();
            add_fault("call = \"" + std::string(one.call) + "\", status = " + std::to_string(status));
            const Called called =
                service.call(one.method, std::string(one.method).find("Table") == std::string::npos ? flag : arguments);
            EXPECT_THAT(called, returned(1)) << one.method << ' ' << status;
            EXPECT_EQ(called.words.back(), one.failure + std::to_string(status) + one.end);
            EXPECT_TRUE(called.out("State").is_null());
        }
    EXPECT_THAT(files(directory), IsEmpty());
    clear_faults();
    EXPECT_EQ(table(), two_rows);
}

TEST(TagServiceStatuses, AMissingLibraryIsOne)
{
    make_place(directory);
    Rig_Options options{host::Manner::strict(), tagged_host()};
    options.variant = "no-tssdm";
    Rig rig(options);
    Service service(rig, "NVRHBA_FCTagService");
    const Called called = service.call("GetGlobalFlag", {{"Target", port(rig)}});
    EXPECT_THAT(called, returned(1));
    EXPECT_EQ(called.words.back(), provider + "::CPQFC_QoSGetGlobalFlag Failed with Error :1");
    EXPECT_THAT(service.call("GetConfigTable", {{"Target", port(rig)}, {"URI", Value::string("x")}}), returned(1));
}

// The one library that has the function is rmapi: adapters that were opened through tssdm stay open.
TEST(TagServiceHandles, AreClosedOnEveryWayOut)
{
    make_place(directory);
    make_place(here);
    ASSERT_EQ(::chdir(here), 0);
    Rig_Options options{host::Manner::strict(), tagged_host()};
    options.variant = "rmapi-only";
    Rig rig(options);
    Service service(rig, "NVRHBA_FCTagService");
    write_file(std::string(here) + "/table", document("<numberOfEntries>1</numberOfEntries>" + row("1")));
    write_file(std::string(here) + "/bad", "no XML");
    const auto run = [&](const std::string& fault) {
        clear_faults();
        if (!fault.empty()) add_fault(fault);
        for (const Method& method : methods)
            for (const char* name : {"table", "bad", "nobody", ""}) {
                Arguments arguments = {{"Target", port(rig)}};
                if (!method.entry.empty() && *name) continue;
                if (*name) arguments.push_back({"URI", Value::string(name)});
                const host::Answer answer = service.call(method.name, arguments).answer;
                EXPECT_TRUE(answer.ok() || fault.find("throws") != std::string::npos) << answer.status.message;
                EXPECT_EQ(nvrsim_open_handles(), 0u) << method.name << ' ' << name << ' ' << fault;
            }
    };
    run("");
    EXPECT_GT(calls("CPQFC_CloseAdapter"), 0u);
    for (const char* call : {"CPQFC_GetNumberOfAdapters", "CPQFC_QoSGetGlobalFlag", "CPQFC_QoSSetGlobalFlag",
                             "CPQFC_QoSGetConfig", "CPQFC_QoSSetConfig"})
        for (const char* fault : {"status = 0", "status = 9", "absent = true", "throws = true", "damage = \"garbage\"",
                                  "value = 4294967295", "status = 7, value = 4294967295"})
            run("call = \"" + std::string(call) + "\", " + fault);
    EXPECT_THAT(service.call("GetConfigTable", {{"Target", port(rig)}, {"URI", Value::string(std::string(300, 'n'))}}),
                returned(32968));
    EXPECT_THAT(service.call("GetConfigTable", {{"Target", port(rig, 1)}, {"URI", Value::string("x")}}),
                returned(32767));
    EXPECT_EQ(nvrsim_open_handles(), 0u);
}

// ---- Damaged files

TEST(TagServiceFiles, CutAtEachByteAreRefusedWhole)
{
    make_place(directory);
    make_place(here);
    ASSERT_EQ(::chdir(here), 0);
    Rig rig({host::Manner::strict(), tagged_host()});
    Service service(rig, "NVRHBA_FCTagService");
    const Arguments arguments = {{"Target", port(rig)}, {"URI", Value::string("table")}};
    ASSERT_THAT(service.call("GetConfigTable", {{"Target", port(rig)}, {"URI", Value::string("tags.xml")}}),
                returned(0));
    const std::string whole = read_file("/var/log/dumps/tags.xml");
    const std::size_t end = whole.find("</ApexConfig>") + std::string("</ApexConfig>").size();
    for (std::size_t size = 0; size < end; size++) {
        write_file(std::string(here) + "/table", whole.substr(0, size));
        const host::Answer answer = rig.server().call(service.path(), "SetConfigTable", arguments);
        ASSERT_THAT(answer, succeeded());
        EXPECT_EQ(answer.value.as_uint(), 32968u) << size;
    }
    EXPECT_EQ(calls("CPQFC_QoSSetConfig"), 0u);
}
