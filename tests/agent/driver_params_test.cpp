// The driver's parameters as a refresh reads them: their instances, their ties, and what each failure costs.

#include "agent/driver_param_instances.h"
#include "classes/NVRHBA_DriverParamGlobal.h"
#include "classes/NVRHBA_DriverParams.h"
#include "classes/NVRHBA_FCHBADriverParamService.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_SoftwareIdentity.h"
#include "simulator/nvrsim.h"
#include "tests/agent/expect_rows.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::Not;
using testing::SizeIs;

namespace {

class DriverParams : public LoadedHost {
protected:
    Instances globals() { return plain(agent().m_NVRHBA_DriverParamGlobal_map); }
    Instances locals() { return plain(agent().m_NVRHBA_DriverParams_map); }

    enum List { local, global };
    /// Reads a list of the first port once more; the instances that it makes are forgotten before, their ties stay.
    /// Answers what was logged.
    std::vector<std::string> read_again(List list, uint32 status)
    {
        agent().m_NVRHBA_DriverParamGlobal_map.clear();
        agent().m_NVRHBA_DriverParams_map.clear();
        words();
        EXPECT_EQ(nvrcimGetDriverParam(agent(), first_wwpn, list == global), status);
        return words();
    }
};

// Two parameters of one name and a third.
std::string twins(const char* list)
{
    std::string text;
    for (const char* name : {"twin", "twin", "behind"})
        text += std::string("[[") + list + "]]\nname = \"" + name + "\"\n";
    return text;
}

} // namespace

TEST_F(DriverParams, AreReadOnceForAllAndOnceAPort)
{
    scenario("[host]\n[[host.global_params]]\nname = \"g\"\nhelp = \"Help\"\nlow = 1\nhigh = 9\ndefault = 3\n"
             "current = 4\nexport = 1\ndynamic = 0\n"
             "[[adapter]]\n[[adapter.port]]\n[[adapter.port.params]]\nname = \"a\"\nlow = 2\nhigh = 8\ndefault = 5\n"
             "current = 6\nexport = 0\ndynamic = 1\nhelp = \"A\"\n[[adapter]]\n");
    const Instances whole = globals();
    ASSERT_THAT(whole, SizeIs(1));
    expect_rows(whole[0].get(), {
                                    {"InstanceID", "g"},
                                    {"paramno", "0"},
                                    {"paramname", "g"},
                                    {"lowRange", "1"},
                                    {"highRange", "9"},
                                    {"glbl", "3"},
                                    {"current", "4"},
                                    {"exportFlag", "1"},
                                    {"dynamic", "0"},
                                    {"help", "Help"},
                                });
    const Instances all = locals();
    ASSERT_THAT(all, SizeIs(1 + 12));
    expect_rows(all[0].get(), {
                                  {"InstanceID", "10000000C9A00001:a"},
                                  {"paramno", "0"},
                                  {"deviceID", "10000000c9a00001"},
                                  {"paramname", "a"},
                                  {"lowRange", "2"},
                                  {"highRange", "8"},
                                  {"def", "5"},
                                  {"current", "6"},
                                  {"exportFlag", "0"},
                                  {"dynamic", "1"},
                                  {"help", "A"},
                              });
    EXPECT_EQ(agent().m_NVRHBA_GlobalDriverServiceElementSettingData_map.size(), 1u);
    EXPECT_EQ(agent().m_NVRHBA_DriverServiceElementSettingData_map.size(), 13u);
    const Instances affects = plain(agent().m_NVRHBA_DriverParameterAffectsFCPort_map);
    ASSERT_THAT(affects, SizeIs(13));
    EXPECT_EQ(end(affects[0].get(), "Antecedent", "DeviceID"), first_wwpn);
    EXPECT_EQ(end(affects[0].get(), "Dependent", "InstanceID"), "10000000C9A00001:a");
    EXPECT_EQ(end(affects[1].get(), "Antecedent", "DeviceID"), "10000000C9A00002");
    EXPECT_EQ(nvrsim_calls("RM_GetDriverParamsGlobal"), 1u);
    EXPECT_EQ(nvrsim_calls("RM_GetDriverParams"), 2u);
}

TEST_F(DriverParams, OfALongListAreAskedForTwice)
{
    scenario("[host]\nglobal_params = 53\n[[adapter]]\n[[adapter.port]]\nparams = 60\n");
    EXPECT_THAT(globals(), SizeIs(53));
    EXPECT_THAT(locals(), SizeIs(60));
    EXPECT_EQ(value(globals()[52].get(), "InstanceID"), "param-52");
    EXPECT_EQ(nvrsim_calls("RM_GetDriverParamsGlobal"), 2u);
    EXPECT_EQ(nvrsim_calls("RM_GetDriverParams"), 2u);
    EXPECT_THAT(words(),
                contains_in_order({"RM_GetDriverParamsGlobal: status=7", "number of driver parameters 53",
                                   "saving the values of driver parameter 52", "RM_GetDriverParams: status=7",
                                   "saving the values of driver parameter 59", "PERF: updateAdapterMaps: cleanExit"}));
}

TEST_F(DriverParams, ThatFillTheFirstRoomAreAskedForOnce)
{
    scenario("[host]\nglobal_params = 52\n[[adapter]]\n[[adapter.port]]\nparams = 52\n");
    EXPECT_THAT(globals(), SizeIs(52));
    EXPECT_THAT(locals(), SizeIs(52));
    EXPECT_EQ(nvrsim_calls("RM_GetDriverParamsGlobal"), 1u);
    EXPECT_EQ(nvrsim_calls("RM_GetDriverParams"), 1u);
}

TEST_F(DriverParams, MayBeNone)
{
    scenario("[host]\nglobal_params = 0\n[[adapter]]\n[[adapter.port]]\nparams = 0\n");
    EXPECT_THAT(globals(), SizeIs(0));
    EXPECT_THAT(locals(), SizeIs(0));
    const std::vector<std::string> told = words();
    EXPECT_THAT(told, contains_in_order({"number of driver parameters 0", "RM_GetDriverParams: status=0",
                                         "PERF: updateAdapterMaps: cleanExit"}));
    EXPECT_THAT(told, Not(Contains(testing::StartsWith("Call to nvrcimGetDriverParam"))));
}

TEST_F(DriverParams, ACountThatLiesHarmsNothing)
{
    for (const char* call : {"RM_GetDriverParams", "RM_GetDriverParamsGlobal"})
        for (const char* table : {"value = 0", "value = 4294967295", "status = 7, value = 4294967295",
                                  "status = 191, value = 0", "damage = \"unterminated\"", "damage = \"garbage\""}) {
            SCOPED_TRACE(std::string(call) + ' ' + table);
            port("");
            fault(std::string("call = \"") + call + "\", " + table);
            refresh();
            EXPECT_LE(globals().size(), 52u);
            EXPECT_LE(locals().size(), 52u);
            EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
            EXPECT_THAT(words(), Contains("PERF: updateAdapterMaps: cleanExit"));
        }
}

TEST_F(DriverParams, ThatTheLibraryRefusesAreNoneAndTheUpdateGoesOn)
{
    fault("call = \"RM_GetDriverParamsGlobal\", status = 2");
    fault("call = \"RM_GetDriverParams\", status = 3");
    EXPECT_THAT(globals(), SizeIs(0));
    EXPECT_THAT(locals(), SizeIs(0));
    EXPECT_THAT(words(),
                contains_in_order({"RM_GetDriverParamsGlobal: status=2",
                                   "ERROR: nvrcimGetDriverParamsGlobal: RM_GetDriverParamsGlobal call failed (b) (2)",
                                   "Call to nvrcimGetDriverParam to retrieve Global Driver Parameters failed",
                                   "rm_status = 2", "RM_GetDriverParams: status=3", "RM_GetDriverParams:failed",
                                   "Call to nvrcimGetDriverParam to retrieve Local Driver Parameters failed",
                                   "rm_status = 3", "PERF: updateAdapterMaps: cleanExit"}));
}

TEST_F(DriverParams, OfAPortThatIsNotLocalAreNone)
{
    port("local = false\n");
    EXPECT_THAT(locals(), SizeIs(0));
    EXPECT_THAT(words(), contains_in_order({"NVR_MethodWrapper::nvrcimGetDriverParam()", "INVALID wwpn"}));
}

TEST_F(DriverParams, OfANameThatIsNoneAreNone)
{
    refresh();
    for (const bool is_global : {false, true})
        for (const char* name : {"", "10000000C9A0000", "10000000C9A0000G", "10:00:00:00:C9:A0:00:01"}) {
            words();
            EXPECT_EQ(nvrcimGetDriverParam(agent(), name, is_global), 1u);
            EXPECT_THAT(words(), ElementsAre("NVR_MethodWrapper::nvrcimGetDriverParam()", "INVALID WWN")) << name;
        }
}

TEST_F(DriverParams, OfOneNameEndTheirListButNotTheUpdate)
{
    scenario("[host]\n" + twins("host.global_params") + "[[adapter]]\n[[adapter.port]]\n" +
             twins("adapter.port.params"));
    EXPECT_THAT(globals(), SizeIs(1));
    EXPECT_THAT(locals(), SizeIs(1));
    const std::vector<std::string> told = words();
    EXPECT_THAT(told, contains_in_order({"number of driver parameters 3", "saving the values of driver parameter 1",
                                         "Insert Failed : m_NVRHBA_DriverParamGlobal_map",
                                         "Call to nvrcimGetDriverParam to retrieve Global Driver Parameters failed",
                                         "rm_status = 1", "saving the values of driver parameter 1",
                                         "Insert Failed : m_NVRHBA_DriverParams_map",
                                         "Call to nvrcimGetDriverParam to retrieve Local Driver Parameters failed",
                                         "rm_status = 1", "PERF: updateAdapterMaps: cleanExit"}));
    EXPECT_THAT(told, Not(Contains("saving the values of driver parameter 2")));
}

TEST_F(DriverParams, WhoseTieIsKnownEndTheirList)
{
    port("[[adapter.port.params]]\nname = \"a\"\n");
    refresh();
    EXPECT_THAT(read_again(global, 1).back(), "Insert Failed : m_NVRHBA_GlobalDriverServiceElementSettingData_map");
    EXPECT_THAT(read_again(local, 1).back(), "Insert Failed : m_NVRHBA_DriverServiceElementSettingData_map");
    agent().m_NVRHBA_DriverServiceElementSettingData_map.clear();
    EXPECT_THAT(read_again(local, 1).back(), "Insert Failed : m_NVRHBA_DriverParameterAffectsFCPort_map");
    agent().m_NVRHBA_DriverServiceElementSettingData_map.clear();
    agent().m_NVRHBA_DriverParameterAffectsFCPort_map.clear();
    EXPECT_THAT(read_again(local, 0).back(), "saving the values of driver parameter 0");
}

TEST_F(DriverParams, WithoutAServiceAreTiedToTheirPortAlone)
{
    refresh();
    agent().m_NVRHBA_FCHBADriverParamService_map.clear();
    for (Instance_Map* map : std::initializer_list<Instance_Map*>{
             &agent().m_NVRHBA_DriverServiceElementSettingData_map, &agent().m_NVRHBA_DriverParameterAffectsFCPort_map,
             &agent().m_NVRHBA_GlobalDriverServiceElementSettingData_map})
        map->clear();
    read_again(global, 0);
    EXPECT_EQ(agent().m_NVRHBA_DriverParamGlobal_map.size(), 12u);
    read_again(local, 0);
    EXPECT_EQ(agent().m_NVRHBA_DriverParameterAffectsFCPort_map.size(), 12u);
    EXPECT_TRUE(agent().m_NVRHBA_DriverServiceElementSettingData_map.empty());
    EXPECT_TRUE(agent().m_NVRHBA_GlobalDriverServiceElementSettingData_map.empty());
}

TEST_F(DriverParams, OfAPortThatNobodyPublishesEndTheirList)
{
    scenario("[[adapter]]\nports = 2\n");
    refresh();
    agent().m_NVRHBA_DriverServiceElementSettingData_map.clear();
    const Ref<Instance> gone(agent().m_NVRHBA_FCPort_map[0]);
    agent().m_NVRHBA_FCPort_map.remove_at(0);
    EXPECT_THAT(read_again(local, 1).back(), "Data Structure is corrupted...");
    EXPECT_EQ(agent().m_NVRHBA_DriverParams_map.size(), 1u) << "the first parameter is there, without its port";
    agent().m_NVRHBA_DriverServiceElementSettingData_map.clear();
    agent().m_NVRHBA_FCPort_map.clear();
    EXPECT_THAT(read_again(local, 1).back(), "Data Structure is corrupted...");
}

TEST_F(DriverParams, WithoutTheDriversIdentityAreNotRead)
{
    refresh();
    agent().m_NVRHBA_SoftwareIdentity_map.clear();
    advance_clock(5 * second);
    words();
    agent().FetchDriverParams();
    EXPECT_EQ(words().back(), "Could not locate the FC DriverServiceAffectsDriver Identity");
}
