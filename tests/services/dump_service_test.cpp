// The dump service and its settings at their own interface: what no server hands over.
#include "classes/NVRHBA_DumpData.h"
#include "classes/NVRHBA_DumpService.h"
#include "classes/NVRHBA_FCTagService.h"
#include "classes/NVRHBA_PortController.h"
#include "services/NVRHBA_DumpData_Provider.h"
#include "services/NVRHBA_DumpService_Provider.h"
#include "services/NVR_MethodWrapper.h"
#include "simulator/nvrsim.h"
#include "tests/agent/expect_rows.h"
#include "tests/services/Service_Host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;

namespace {

class DumpMethods : public ServiceHost {
protected:
    DumpMethods() : ServiceHost("[[adapter]]\n[[adapter.port]]\ndump_directory = \"/var/log\"\n") {}

    /// The return values of the three methods, if they are the same.
    uint32 answer_of_all(const Instance* self, Instance* target)
    {
        words();
        const auto* service = static_cast<const NVRHBA_DumpService*>(self);
        auto* port = static_cast<NVRHBA_FCPort*>(target);
        Property<uint32> first{}, second{}, third{};
        Property<Array<String>> names;
        EXPECT_EQ(provider.GenerateDump(service, port, first), INVOKE_METHOD_OK);
        EXPECT_EQ(provider.GetDumpFileNames(service, port, names, second), INVOKE_METHOD_OK);
        EXPECT_EQ(provider.DeleteDump(service, port, third), INVOKE_METHOD_OK);
        EXPECT_EQ(first.value, second.value);
        EXPECT_EQ(first.value, third.value);
        told = words();
        return first.value;
    }
    Modify_Instance_Status modify(const Instance* model, const Instance* instance)
    {
        words();
        const auto status = data_provider.modify_instance(static_cast<const NVRHBA_DumpData*>(model),
                                                          static_cast<const NVRHBA_DumpData*>(instance));
        told = words();
        return status;
    }
    Instance* service() { return agent().m_NVRHBA_DumpService_map[0]; }
    /// A copy of the settings with another count.
    Ref<NVRHBA_DumpData> with_count(uint32 count)
    {
        Ref<NVRHBA_DumpData> data(static_cast<NVRHBA_DumpData*>(clone(agent().m_NVRHBA_DumpData_map[0])));
        data->RetentionCount.set(count);
        return data;
    }

    NVRHBA_DumpService_Provider provider;
    NVRHBA_DumpData_Provider data_provider;
};

} // namespace

TEST_F(DumpMethods, AreForTheirServiceAlone)
{
    EXPECT_EQ(answer_of_all(service(), port()), 0u);
    EXPECT_EQ(answer_of_all(agent().m_NVRHBA_FCTagService_map[0], port()), 33068u);
    EXPECT_EQ(told.back(), "Invalid instance of NVRHBA_DumpService");
    EXPECT_EQ(answer_of_all(nullptr, port()), 33068u);
    const Ref<NVRHBA_DumpService> nobody(create_as<NVRHBA_DumpService>(true));
    nobody->Name.set("nobody");
    EXPECT_EQ(answer_of_all(nobody.get(), port()), 33068u);
    agent().m_NVRHBA_DumpService_map.clear();
    EXPECT_EQ(answer_of_all(nobody.get(), port()), 0u);
}

TEST_F(DumpMethods, TakeNoTargetOfAnotherClass)
{
    EXPECT_EQ(answer_of_all(service(), agent().m_NVRHBA_PortController_map[0]), 32968u);
    EXPECT_EQ(told.back(), "NVRHBA_DumpService::Id2HBAName failed");
    EXPECT_EQ(answer_of_all(service(), service()), 32968u);
    EXPECT_EQ(answer_of_all(service(), nullptr), 32968u);
    EXPECT_EQ(told.back(), "NVRHBA_DumpService invald port ...return");
    Ref<NVRHBA_FCPort> wrong(create_as<NVRHBA_FCPort>(true));
    EXPECT_EQ(answer_of_all(service(), wrong.get()), 32968u);
    EXPECT_EQ(answer_of_all(service(), known_port("no name").get()), 32968u);
    EXPECT_EQ(told.back(), "NVRHBA_DumpService::str2HBAName failed");
}

TEST_F(DumpMethods, AnyKindButTheWholeAdaptersIsAnotherCall)
{
    EXPECT_EQ(NVR_MethodWrapper::nvrcimDumpDiagnostic(first_name, -1), 0u);
    EXPECT_EQ(nvrsim_calls("RM_GenerateDump"), 1u);
    EXPECT_EQ(nvrsim_calls("RM_GenerateEfdDump"), 0u);
    EXPECT_EQ(NVR_MethodWrapper::nvrcimDumpDiagnostic(first_name, 0), 0u);
    EXPECT_EQ(NVR_MethodWrapper::nvrcimDumpDiagnostic(first_name, 7), 0u);
    EXPECT_EQ(nvrsim_calls("RM_GenerateDump"), 1u);
    EXPECT_EQ(nvrsim_calls("RM_GenerateEfdDump"), 2u);
    fault("call = \"RM_GenerateEfdDump\", status = 64");
    words();
    EXPECT_EQ(NVR_MethodWrapper::nvrcimDumpDiagnostic(first_name, 7), 64u);
    EXPECT_THAT(words(), Contains("Failed to generate the dump file, exited with error code 64"));
    EXPECT_EQ(NVR_MethodWrapper::nvrcimDeleteDumpFiles(first_name), 0u);
}

TEST_F(DumpMethods, ADirectoryThatIsRefusedHasWordsByItsStatus)
{
    words();
    EXPECT_EQ(NVR_MethodWrapper::nvrcimSetDumpDirectory(first_name, "/tmp"), 0u);
    EXPECT_THAT(words(),
                ElementsAre("NVR_MethodWrapper::nvrcimSetDumpDirectory", "Entering NVR_MethodWrapper::Validatewwpn()",
                            "RM_IsLocalHBA: status=0", "nvrcimSetDumpDirectory: Success"));
    const std::string start = "ERROR: nvrcimSetDumpDirectory: RM_SetDumpDirectory call failed";
    for (uint32 status = 1; status <= 260; status++) {
        nvrsim_clear_faults();
        fault("call = \"RM_SetDumpDirectory\", status = " + std::to_string(status));
        words();
        EXPECT_EQ(NVR_MethodWrapper::nvrcimSetDumpDirectory(first_name, "/tmp"), status);
        const auto all = words();
        ASSERT_EQ(all.size(), 5u) << status;
        EXPECT_EQ(all[3],
                  status == 27 ? start + ". The specified directory [' / vmfs / volumes / /tmp'] cannot be opened"
                  : status == 160 || status == 178 ? start + ". The configuration file could not be opened"
                                                   : start + " with error code : " + std::to_string(status) + " \n");
        EXPECT_EQ(all[4].rfind("Status: <" + std::to_string(status) + ">", 0), 0u) << all[4];
    }
    nvrsim_clear_faults();
    fault("call = \"RM_IsLocalHBA\", value = 0");
    EXPECT_EQ(NVR_MethodWrapper::nvrcimSetDumpDirectory(first_name, "/tmp"), 1u);
    EXPECT_THAT(words(), Contains("INVALID wwpn"));
}

TEST_F(DumpMethods, SettingsAreChangedByTheirOwnClassAlone)
{
    const auto seven = with_count(7);
    EXPECT_EQ(modify(nullptr, seven.get()), 102);
    EXPECT_EQ(told.back(), "NVRHBA_DumpData_Provider::modify_instance invalid parameter");
    EXPECT_EQ(modify(seven.get(), nullptr), 102);
    EXPECT_EQ(modify(port(), port()), 104);
    EXPECT_EQ(told.back(), "Invalid instance of NVRHBA_DumpData_Provider Data");
    EXPECT_EQ(modify(port(), seven.get()), 104);
    EXPECT_EQ(modify(seven.get(), port()), 104);
    EXPECT_EQ(modify(service(), service()), 104);
    EXPECT_EQ(nvrsim_calls("RM_SetDumpRetentionCount"), 0u);
    EXPECT_EQ(modify(seven.get(), seven.get()), 0);
    expect_rows(agent().m_NVRHBA_DumpData_map[0], {{"RetentionCount", "7"}});
}

TEST_F(DumpMethods, WhatIsNullInModelOrInstanceIsNotChanged)
{
    const auto seven = with_count(7);
    auto bare = with_count(9);
    bare->RetentionCount.null = 1;
    bare->DumpDirectory.set("/elsewhere");
    bare->DumpDirectory.null = 1;
    EXPECT_EQ(modify(seven.get(), bare.get()), 0);
    EXPECT_EQ(modify(bare.get(), seven.get()), 0);
    EXPECT_EQ(told.back(), "found the key match for instance.");
    EXPECT_EQ(nvrsim_calls("RM_SetDumpRetentionCount"), 0u);
    expect_rows(agent().m_NVRHBA_DumpData_map[0], {{"RetentionCount", "5"}});
}

TEST_F(DumpMethods, ThePortIsThatOfTheSettingsFound)
{
    // The client's own ElementName is not asked.
    auto seven = with_count(7);
    seven->ElementName.set("nobody");
    EXPECT_EQ(modify(seven.get(), seven.get()), 0);
    agent().m_NVRHBA_DumpData_map[0]->ElementName.set("no name");
    EXPECT_EQ(modify(seven.get(), seven.get()), 104);
    EXPECT_EQ(told.back(), "NVRHBA_DumpData_Provider::modify_instance::str2HBAName failed");
}

TEST_F(DumpMethods, ARebuildThatFailsDoesNotFailTheChange)
{
    agent().m_NVRHBA_PortController_map.clear();
    const auto seven = with_count(7);
    EXPECT_EQ(modify(seven.get(), seven.get()), 0);
    EXPECT_THAT(
        told, contains_in_order({"NVR_MethodWrapper::nvrcimSetRetentionCount succeded", "Entered FC_ClearDumpClasses",
                                 "Entered FC_CreateDumpClasses", "FC_CreateDumpClasses failed", "nvrstatus = 40008"}));
    EXPECT_TRUE(agent().m_NVRHBA_DumpData_map.empty());
}
