// The rebuild of all adapter-side maps: the order of its steps, and how each kind of failure ends it.

#include "agent/Adapter_Update.h"
#include "agent/Agent_Builders.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "inventory/NVR_Data.h"
#include "runtime/Forced_Unwind.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

/// What stands on higher floors and follows the walk. Only its words tell of a failure.
void buildHigherFloors(ProviderAgent& agent)
{
    NVR_LOG("Calling FC_CreateDumpClasses");
    if (agent_builders.CreateFCDriverLogClasses) {
        if (agent_builders.CreateFCDriverLogClasses(agent) == 0)
            NVR_LOG("FC Driver Log classes are successfully created");
        else
            NVR_LOG("Issue with FC Driver Log classes");
    }
    if (agent_builders.FC_CreateDumpClasses) {
        if (const uint32 status = agent_builders.FC_CreateDumpClasses(agent)) {
            NVR_LOG("FC_CreateDumpClasses failed");
            NVR_LOG("nvrstatus = %d", static_cast<int>(status));
        }
        NVR_LOG("FC_CreateDumpClasses succesful");
    }
    if (agent_builders.CreatePortVirtualizationClasses) {
        if (const uint32 status = agent_builders.CreatePortVirtualizationClasses(agent))
            NVR_LOG("CreatePortVirtualizationClasses failed: %d", static_cast<int>(status));
        else
            NVR_LOG("FC Port Virtualization classes are successfully created");
    }
}

void buildDiagnostics(ProviderAgent& agent)
{
    const bool done = guarded([&] {
        if (agent_builders.clearDiagnosticsClasses) agent_builders.clearDiagnosticsClasses(agent, 0);
        if (!agent_builders.CreateFCHBADiagnosticClassFeature) return;
        if (agent_builders.CreateFCHBADiagnosticClassFeature(agent) == 0)
            NVR_LOG("FCHBA Diagnositcs classes created Successfully");
        else
            NVR_LOG("FCHBA Diagnositcss either Not Supported/Failed to Create the feature");
    });
    if (!done) NVR_LOG("Exception in FCHBA Diagnostics feature class creation");
}

} // namespace

uint32 ProviderAgent::updateAdapterMaps()
{
    try {
        NVR_LOG("PERF: updateAdapterMaps: Entry");
        clearAdapterMaps();
        forgetBaseServerProfile();
        Adapter_Update update(*this);
        update.buildHost();
        update.buildProfiles();
        if (!m_pData) {
            NVR_LOG("Could not locate the data pointer - Serious issue");
            return NVR_FAILURE;
        }
        update.testForAdapters();
        update.buildProviderIdentity();
        update.buildConfigSettings();
        update.buildServices();
        update.buildRecordLog();
        update.buildAccessPoint();
        update.buildDriverIdentities();
        update.walkAdapters();
        FetchDriverParams();
        NVR_LOG("Done with the Driver Parameter fetching");
        buildHigherFloors(*this);
    } catch (const Update_Ended&) {
        return NVR_FAILURE;
    } catch (...) {
        if (is_forced_unwind()) throw;
        NVR_LOG("No FC card found");
        if (m_CIM_ComputerSystem_map.empty()) return NVR_FAILURE;
    }
    buildDiagnostics(*this);
    NVR_LOG("Create the Diagnostic classes");
    NVR_LOG("PERF: updateAdapterMaps: cleanExit");
    return 0;
}

} // namespace cimple
