#include "tests/diagnostics/Diagnostics_Test.h"

#include "agent/map_classes.h"
#include "foundation/NVR_Common.h"
#include "simulator/nvrsim.h"

namespace nvrtest {

using namespace cimple;

bool no_more_buffers = false;

Diagnostics::Diagnostics()
{
    no_more_buffers = false;
    EXPECT_EQ(load(), 0);
    refresh();
    words();
}

Diagnostics::~Diagnostics()
{
    settle();
    unload();
}

void Diagnostics::port(const std::string& keys)
{
    host("[[adapter]]\n[[adapter.port]]\n" + keys + "\n[[target]]\n");
}

void Diagnostics::host(const std::string& toml)
{
    scenario(toml);
    refresh();
    words();
}

NVRHBA_FCHBADiagnosticSettingData& Diagnostics::setting(const char* test)
{
    auto* found = NVR_Diagnostics::getDefaultNVRHBA_FCHBADiagnosticSettingDataInstance(agent(), test);
    if (!found) throw std::runtime_error(std::string("there are no settings of ") + test);
    return *found;
}

NVRHBA_JobSettingData& Diagnostics::job_setting()
{
    return *NVR_Diagnostics::getDefaultNVRHBA_JobSettingDataInstance(agent());
}

const NVRHBA_PortController* Diagnostics::controller()
{
    return agent().m_NVRHBA_PortController_map[0];
}

Instance_Map& Diagnostics::map(const std::string& class_name)
{
    ProviderAgent& held = agent();
    for (Instance_Map* each : std::initializer_list<Instance_Map*>{
             &held.m_NVRHBA_FCHBADiagnosticTest_map,
             &held.m_NVRHBA_HelpService_map,
             &held.m_NVRHBA_ServiceAvailableToElement_map,
             &held.m_NVRHBA_DiagnosticIdentity_map,
             &held.m_NVRHBA_DiagElementSoftwareIdentity_map,
             &held.m_NVRHBA_FCHBADiagnosticSettingData_map,
             &held.m_NVRHBA_DiagElementSettingData_map,
             &held.m_NVRHBA_FCHBADiagnosticServiceCapabilities_map,
             &held.m_NVRHBA_DiagElementCapabilities_map,
             &held.m_NVRHBA_JobSettingData_map,
             &held.m_NVRHBA_JobElementSettingData_map,
             &held.m_NVRHBA_DiagnosticsLog_map,
             &held.m_NVRHBA_UseOfLog_map,
             &held.m_NVRHBA_AvailableDiagnosticService_map,
             &held.m_NVRHBA_ServiceAffectsElement_map,
             &held.m_NVRHBA_DiagServiceConformsToProfile_map,
             &held.m_NVRHBA_DiagHostedService_map,
             &held.m_NVRHBA_ConcreteJob_map,
             &held.m_NVRHBA_OwningJobElement_map,
             &held.m_NVRHBA_AffectedJobElement_map,
             &held.m_NVRHBA_DiagnosticServiceRecord_map,
             &held.m_NVRHBA_DiagnosticCompletionRecord_map,
             &held.m_NVRHBA_DiagnosticSettingDataRecord_map,
             &held.m_NVRHBA_LogManagesRecord_map,
             &held.m_NVRHBA_CorrespondingSettingDataRecord_map,
             &held.m_NVRHBA_RecordAppliesToElement_map,
         })
        if (each->meta_class()->name == "NVRHBA_" + class_name) return *each;
    throw std::runtime_error("no map of " + class_name);
}

Diagnostics::Ran Diagnostics::run(const char* test)
{
    return run(test, controller());
}

Diagnostics::Ran Diagnostics::run(const char* test, const NVRHBA_PortController* tested)
{
    const Diagnostic_Test* row = find_diagnostic_test(test);
    if (!row) throw std::runtime_error(std::string("no test ") + test);
    Diagnostic_Run work = {agent(), {}, setting(test), job_setting(), tested, {}};
    EXPECT_EQ(string2HBAName(&work.port, first_wwpn), 1);
    words();
    const uint64 before = slept();
    const uint32 status = row->run(work);
    return {status, std::move(work.job), words(), (slept() - before) / second};
}

std::string newest_test()
{
    char text[256] = {};
    nvrsim_get("0", "test", text, sizeof text);
    return text;
}

Words records_left()
{
    const std::string port = std::string("PortController : ") + first_wwpn;
    return {"NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking()",
            "NVR_Diagnostics::CreateDiagnosticServiceRecord", port, "NVR_Diagnostics::CreateDiagnosticCompletionRecord",
            port};
}

Words joined(const std::vector<Words>& parts)
{
    Words all;
    for (const Words& part : parts)
        all.insert(all.end(), part.begin(), part.end());
    return all;
}

Words repeated(int times, const Words& words)
{
    Words all;
    for (int i = 0; i < times; i++)
        all.insert(all.end(), words.begin(), words.end());
    return all;
}

} // namespace nvrtest

// The linker sends every call of calloc in this program here.
extern "C" void* __real_calloc(std::size_t count, std::size_t size);
extern "C" void* __wrap_calloc(std::size_t count, std::size_t size)
{
    return nvrtest::no_more_buffers ? nullptr : __real_calloc(count, size);
}
