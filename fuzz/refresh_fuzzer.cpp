// Whole refreshes of the agent, and its live values, over a host whose libraries lie.
#include "agent/Clock.h"
#include "agent/ProviderAgent.h"
#include "fuzz/Spoiled_Host.h"
#include "inventory/NVR_Data.h"
#include "runtime/Instance.h"

using namespace cimple;
using fuzzing::expect;

static std::atomic<uint64> now{1700000000000000};

// No interval within which the agent would rest passes by without a call.
static uint64 clock_of_hours()
{
    return now += 3600ull * 1000000;
}

static void sleep_of_none(uint64) {}

static ProviderAgent* agent = nullptr;

extern "C" int LLVMFuzzerInitialize(int*, char*** argv)
{
    fuzzing::make_spoiled_host(*argv, "[[adapter]]\n[[adapter.port]]\n[[adapter.port.vport]]\nname = \"one\"\n"
                                      "[[adapter.port.vport.vm]]\nname = \"machine\"\n[[target]]\nluns = 2\n");
    agent_clock = &clock_of_hours;
    agent_sleep = &sleep_of_none;
    expect(ProviderAgent::load() == 0, "an agent over good libraries loads");
    agent = ProviderAgent::GetInstance();
    static fuzzing::Every_Line lines;
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    fuzzing::Bytes bytes(data, size);
    fuzzing::spoil_by(&bytes);
    {
        Auto_Mutex lock(agent->m_DataMutex);
        agent->m_pData->buildAdapterData();
        agent->updateAdapterMaps();
        agent->m_pData->buildSANData();
        agent->updateSANMaps();
        agent->UpdateFCPortStatus();
        agent->GetFCPortStats();
        agent->UpdateDriverParams();
        agent->UpdateDriverParamGlobal();
        // The next input finds what this one found.
        agent->clearSANMaps();
        agent->clearAdapterMaps();
        agent->m_pData->freeAllData();
    }
    fuzzing::spoil_by(nullptr);
    return 0;
}
