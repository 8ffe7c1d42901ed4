// Failures within an update of the adapter side that no hardware shows: what they cost, and what is said of them.

#include <stdexcept>

#include "agent/Agent_Wait.h"
#include "agent/port_data_instances.h"
#include "inventory/Adapter.h"
#include "inventory/AdapterAttributes.h"
#include "inventory/NVR_Data.h"
#include "tests/agent/Simulated_Host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::Not;
using testing::SizeIs;

namespace {

class UpdateFailures : public SimulatedHost {
protected:
    UpdateFailures()
    {
        EXPECT_EQ(load(), 0);
        refresh();
        words();
    }
    ~UpdateFailures() override
    {
        higher_floors = {};
        settle();
        unload();
    }

    const FCAdapterAttributes& attributes()
    {
        return dynamic_cast<const FCAdapterAttributes&>(*agent().m_pData->getAdapters().at(0)->getAttributes());
    }
};

} // namespace

TEST_F(UpdateFailures, OfHigherFloorsAreToldAndTheUpdateGoesOn)
{
    higher_floors = {32769, 40008, 5, [] { return uint32{40002}; }};
    refresh();
    EXPECT_THAT(words(), contains_in_order({"Done with the Driver Parameter fetching", "Calling FC_CreateDumpClasses",
                                            "Issue with FC Driver Log classes", "FC_CreateDumpClasses failed",
                                            "nvrstatus = 40008", "FC_CreateDumpClasses succesful",
                                            "CreatePortVirtualizationClasses failed: 5",
                                            "FCHBA Diagnositcss either Not Supported/Failed to Create the feature",
                                            "Create the Diagnostic classes", "PERF: updateAdapterMaps: cleanExit"}));
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
}

TEST_F(UpdateFailures, OfTheDiagnosticsMayBeExceptions)
{
    higher_floors.diagnostics = []() -> uint32 { throw std::runtime_error("diagnostics"); };
    refresh();
    EXPECT_THAT(words(), contains_in_order({"FC Port Virtualization classes are successfully created",
                                            "Exception in FCHBA Diagnostics feature class creation",
                                            "Create the Diagnostic classes", "PERF: updateAdapterMaps: cleanExit"}));
}

TEST_F(UpdateFailures, AHostWithoutAnInventoryPublishesItsProfilesAndEnds)
{
    ProviderAgent& held = agent();
    Agent_Wait wait(held);
    std::unique_ptr<NVR_Data> inventory = std::move(held.m_pData);
    words();
    EXPECT_EQ(held.updateAdapterMaps(), 32769u);
    held.m_pData = std::move(inventory);
    const std::vector<std::string> told = words();
    EXPECT_EQ(told.back(), "Could not locate the data pointer - Serious issue");
    EXPECT_THAT(told, Not(Contains("Starting the SoftwareInstallationService")));
    EXPECT_EQ(held.m_NVRHBA_RegisteredProfile_map.size(), 11u);
    EXPECT_EQ(held.m_NVRHBA_SoftwareIdentity_map.size(), 0u);
}

TEST_F(UpdateFailures, WhatIsKnownOfAPortIsRefusedASecondTime)
{
    EXPECT_EQ(createTransceiver(agent(), first_wwpn), nullptr);
    EXPECT_EQ(words().back(), "Insert Failed : m_CIM_PhysicalComponent_map ");
    Instance* made = nullptr;
    EXPECT_EQ(CreateVPD(agent(), first_wwpn, made), 1u);
    EXPECT_EQ(made, nullptr);
    EXPECT_EQ(words().back(), "Insert Failed : m_NVRHBA_VitalProductData_map");
    EXPECT_EQ(agent().m_NVRHBA_Transceiver_map.size(), 1u);
    EXPECT_EQ(agent().m_NVRHBA_VitalProductData_map.size(), 1u);
}

TEST_F(UpdateFailures, APortWhoseNameIsNoneHasNoData)
{
    EXPECT_EQ(createTransceiver(agent(), "10000000C9A0000"), nullptr);
    EXPECT_EQ(words().back(), "str2HBAName failed");
    Instance* made = nullptr;
    EXPECT_EQ(CreateVPD(agent(), "none", made), 1u);
    EXPECT_EQ(words().back(), "str2HBAName failed");
    EXPECT_EQ(createFlashImages(agent(), "", attributes(), nullptr), 1u);
    EXPECT_EQ(words().back(), "str2HBAName failed");
}

TEST_F(UpdateFailures, AnImageWithoutItsControllerEndsTheList)
{
    agent().m_NVRHBA_FlashImageSoftwareIdentity_map.clear();
    EXPECT_EQ(createFlashImages(agent(), first_wwpn, attributes(), nullptr), 1u);
    EXPECT_EQ(words().back(), "Failed to create ElementFlashImageSoftwareIdentityInst");
    EXPECT_EQ(agent().m_NVRHBA_FlashImageSoftwareIdentity_map.size(), 1u);
}
