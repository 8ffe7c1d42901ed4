// The tagging service at its own interface: what no server hands over, and what it keeps from call to call.
#include <cstdio>
#include <fstream>
#include <unistd.h>

#include "classes/NVRHBA_DumpData.h"
#include "classes/NVRHBA_FCTagService.h"
#include "classes/NVRHBA_PortController.h"
#include "services/ApexConfig.h"
#include "services/NVRHBA_FCTagService_Provider.h"
#include "services/tag_tables.h"
#include "simulator/nvrsim.h"
#include "tests/services/Service_Host.h"
#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

namespace {

class TagMethods : public ServiceHost {
protected:
    explicit TagMethods(const std::string& adapter_keys = "",
                        const std::string& port_keys = "dump_directory = \"/var/log\"\n")
        : ServiceHost("[[adapter]]\n" + adapter_keys + "[[adapter.port]]\n" + port_keys +
                      "[[adapter.tag]]\nsource = \"10000000C9A00001\"\ntarget = \"50060E8005A10000\"\ntag = 5\n")
    {
    }

    enum Way { get_flag, set_flag, get_table, set_table };
    uint32 call(Way way, const Instance* self, Instance* target)
    {
        words();
        const auto* service = static_cast<const NVRHBA_FCTagService*>(self);
        auto* port = static_cast<NVRHBA_FCPort*>(target);
        Property<uint32> result{};
        switch (way) {
        case get_flag:
            EXPECT_EQ(provider.GetGlobalFlag(service, port, state, result), INVOKE_METHOD_OK);
            break;
        case set_flag:
            EXPECT_EQ(provider.SetGlobalFlag(service, port, state, result), INVOKE_METHOD_OK);
            break;
        case get_table:
            EXPECT_EQ(provider.GetConfigTable(service, port, uri, result), INVOKE_METHOD_OK);
            break;
        case set_table:
            EXPECT_EQ(provider.SetConfigTable(service, port, uri, result), INVOKE_METHOD_OK);
            break;
        }
        EXPECT_FALSE(result.null);
        told = words();
        return result.value;
    }
    uint32 call(Way way) { return call(way, service(), port()); }
    Instance* service() { return agent().m_NVRHBA_FCTagService_map[0]; }

    NVRHBA_FCTagService_Provider provider;
    Property<uint32> state{};
    Property<String> uri;
};

constexpr auto ways = {0, 1, 2, 3};

} // namespace

TEST_F(TagMethods, AreForTheirServiceAlone)
{
    uri.set("x");
    const Ref<NVRHBA_FCTagService> nobody(create_as<NVRHBA_FCTagService>(true));
    nobody->Name.set("nobody");
    for (const int way : ways) {
        EXPECT_EQ(call(Way(way), port(), port()), 33068u);
        EXPECT_EQ(told.back(), "Invalid instance of FC Tagging Service");
        EXPECT_EQ(call(Way(way), nullptr, port()), 33068u);
        EXPECT_EQ(call(Way(way), nobody.get(), port()), 33068u);
    }
    agent().m_NVRHBA_FCTagService_map.clear();
    EXPECT_EQ(call(get_flag, nobody.get(), port()), 0u);
}

TEST_F(TagMethods, TakeNoTargetOfAnotherClass)
{
    uri.set("x");
    const Ref<NVRHBA_FCPort> unnamed(create_as<NVRHBA_FCPort>(true));
    for (const int way : ways) {
        for (Instance* target : {static_cast<Instance*>(agent().m_NVRHBA_PortController_map[0]), service(),
                                 static_cast<Instance*>(unnamed.get())}) {
            EXPECT_EQ(call(Way(way), service(), target), 32968u);
            EXPECT_EQ(told.back(), "NVRHBA_FCTagService_Provider::Wrong DeviceID passed");
        }
        EXPECT_EQ(call(Way(way), service(), nullptr), 4097u);
    }
}

TEST_F(TagMethods, ANullValueIsNoneWhateverItHolds)
{
    uri.set("x");
    uri.null = 1;
    EXPECT_EQ(call(get_table), 4097u);
    EXPECT_EQ(call(set_table), 4097u);
    state.set(1);
    EXPECT_EQ(call(set_flag), 0u);
    state.null = 1;
    EXPECT_EQ(call(set_flag), 0u);
    EXPECT_EQ(call(get_flag), 0u);
    EXPECT_EQ(state.value, 0u);
    EXPECT_FALSE(state.null);
}

TEST_F(TagMethods, ANameEndsAtItsFirstZeroByte)
{
    uri.set(String("tags\0xml", 8));
    EXPECT_EQ(call(get_table), 0u);
    EXPECT_TRUE(exists("/var/log/tags"));
    uri.set(String("\0xml", 4));
    EXPECT_EQ(call(get_table), 4097u);
    EXPECT_EQ(call(set_table), 4097u);
    uri.set(String("/var/log/tags\0xml", 17));
    EXPECT_EQ(call(set_table), 0u);
}

TEST_F(TagMethods, TheDirectoryIsKeptFromCallToCall)
{
    uri.set("tags");
    EXPECT_EQ(call(get_table), 0u);
    EXPECT_THAT(told, Contains("NVRHBA_FCTagService_Provider::Successfully got DumpPath,/var/log"));
    agent().m_NVRHBA_DumpData_map.clear();
    uri.set("more");
    EXPECT_EQ(call(get_table), 0u);
    EXPECT_THAT(told, Not(Contains(StartsWith("NVRHBA_FCTagService_Provider::Successfully got DumpPath"))));
    EXPECT_THAT(told, Contains("GetConfigTable: filename :/var/log/more"));
    EXPECT_TRUE(exists("/var/log/more"));
}

TEST_F(TagMethods, WithoutADirectoryATableGoesToTmp)
{
    const std::string name = "nvr-tag-service-test-" + std::to_string(::getpid());
    agent().m_NVRHBA_DumpData_map.clear();
    uri.set(name.c_str());
    EXPECT_EQ(call(get_table), 0u);
    EXPECT_THAT(told, Contains("GetConfigTable: filename :/tmp/" + name));
    EXPECT_THAT(read_file("/tmp/" + name), HasSubstr("<ApexConfig>"));
    EXPECT_EQ(std::remove(("/tmp/" + name).c_str()), 0);
}

TEST_F(TagMethods, AnEmptyDirectoryIsNone)
{
    const std::string name = "nvr-tag-service-test-" + std::to_string(::getpid());
    uri.set(name.c_str());
    EXPECT_EQ(call(get_table), 0u);
    agent().m_NVRHBA_DumpData_map[0]->DumpDirectory.set("");
    EXPECT_EQ(call(get_table), 0u);
    EXPECT_THAT(told, Contains("NVRHBA_FCTagService_Provider::Successfully got DumpPath,"));
    EXPECT_THAT(told, Contains("GetConfigTable: filename :/tmp/" + name));
    EXPECT_EQ(std::remove(("/tmp/" + name).c_str()), 0);
}

TEST_F(TagMethods, ADirectoryIsCut)
{
    agent().m_NVRHBA_DumpData_map[0]->DumpDirectory.set(std::string(300, 'd').c_str());
    uri.set("tags");
    EXPECT_EQ(call(get_table), 32968u);
    EXPECT_THAT(told, Contains("NVRHBA_FCTagService_Provider::Successfully got DumpPath," + std::string(255, 'd')));
}

TEST_F(TagMethods, AHostThatDoesNotTellItsNameIsUnknown)
{
    no_host_name = true;
    uri.set("tags");
    EXPECT_EQ(call(get_table), 0u);
    EXPECT_THAT(told, Contains(StartsWith("NVRHBA_FCTagService_Provider::gethostname() failed err : ")));
    EXPECT_THAT(read_file("/var/log/tags"), HasSubstr("<HostName>unknown</HostName>"));
}

TEST_F(TagMethods, APortIsKnownInAnyCaseOfItsName)
{
    Ref<NVRHBA_FCPort> same(static_cast<NVRHBA_FCPort*>(clone(port())));
    same->DeviceID.set("10000000c9a00001");
    EXPECT_EQ(call(get_flag, service(), same.get()), 0u);
    uri.set("tags");
    EXPECT_EQ(call(get_table, service(), same.get()), 0u);
    EXPECT_TRUE(exists("/var/log/tags"));
}

class TagMethodsOfALongName : public TagMethods {
protected:
    TagMethodsOfALongName() : TagMethods("name = \"" + std::string(40, 'n') + "\"\n") {}
};

TEST_F(TagMethodsOfALongName, CutItAndDoNotFindTheAdapter)
{
    EXPECT_EQ(call(get_flag), 32968u);
    EXPECT_THAT(told, Contains("NVRHBA_FCTagService_Provider::Successfully got AdapterName," + std::string(31, 'n')));
    EXPECT_EQ(told.back(),
              "NVRHBA_FCTagService_Provider::Failed to Open Adapter, Skipping GetGlobalFlag Adapter Name:" +
                  std::string(31, 'n'));
}

// Through a file and back, at the length of the longest.
TEST(TagTables, OfAnyLengthThatIsWrittenAreRead)
{
    for (const sint64 entries : {1, 1000, 65536}) {
        Tag_Table table = makeTagTable(entries);
        table[table.size() - 1].tag = 77;
        WriteConfigTablesToFile("/var/log/tags", table, "Norvane-FC2162-0");
        const Tag_Table read = readApexConfig(read_file("/var/log/tags"));
        ASSERT_EQ(read.size(), table.size());
        EXPECT_EQ(read[read.size() - 1].tag, 77);
    }
}

TEST(TagTables, OfWhichAPartIsWrittenAreNotLeftBehindALink)
{
    make_folder("/var/log/disk");
    const Small_Disk disk("/var/log/disk");
    write_file("/var/log/disk/tags", "");
    nvrtest::make_link("/var/log/disk/tags", "/var/log/link");
    Log_Capture log;
    WriteConfigTablesToFile("/var/log/link", makeTagTable(1000), "Norvane-FC2162-0");
    EXPECT_THAT(log.words(), ElementsAre("NVRHBA_FCTagService_Provider::WriteConfigTablesToFile",
                                         "NVRHBA_FCTagService_Provider::file.fail()"));
    EXPECT_TRUE(exists("/var/log/link"));
    EXPECT_EQ(read_file("/var/log/disk/tags"), "");
}

TEST(TagTables, AreLoggedByteByByte)
{
    Tag_Table table = makeTagTable(1);
    table[0].source = {{0x10, 0, 0, 0, 0xC9, 0xA0, 0, 0x01}};
    table[0].target = {{0x50, 0x06, 0x0E, 0x80, 0x05, 0xA1, 0, 0xFF}};
    table[0].tag = 200;
    Log_Capture log;
    PrintQoSEntry(table);
    EXPECT_THAT(log.words(), ElementsAre("PrintQoSEntry", "Number Of Entries: 1", "src_wwpn:10", "src_wwpn:0",
                                         "src_wwpn:0", "src_wwpn:0", "src_wwpn:C9", "src_wwpn:A0", "src_wwpn:0",
                                         "src_wwpn:1", "tgt_wwpn:50", "tgt_wwpn:6", "tgt_wwpn:E", "tgt_wwpn:80",
                                         "tgt_wwpn:5", "tgt_wwpn:A1", "tgt_wwpn:0", "tgt_wwpn:FF", "tag:200"));
}

TEST(TagTables, AreNoLargerThanThoseOfAnAdapter)
{
    EXPECT_EQ(makeTagTable(0).size(), 0u);
    EXPECT_EQ(makeTagTable(65536).size(), 65536u);
    for (const sint64 entries : {sint64{65537}, sint64{4294967295}, sint64{4294967296}, sint64{-1}, INT64_MIN})
        EXPECT_THROW(makeTagTable(entries), std::bad_alloc) << entries;
    Tag_Table table = makeTagTable(2);
    table.get()->count = 1;
    EXPECT_EQ(table.size(), 1u);
    table.get()->count = 3;
    EXPECT_EQ(table.size(), 2u);
}
