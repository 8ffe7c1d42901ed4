// The agent's construction and destruction.
#include "agent/ProviderAgent.h"

#include <cerrno>
#include <new>
#include <unistd.h>

#include "agent/fatal_signal.h"
#include "agent/map_classes.h"
#include "agent/settings_at_exit.h"
#include "foundation/CLogger.h"
#include "foundation/Management_Session.h"
#include "foundation/NVR_Common.h"
#include "foundation/management_binding.h"
#include "inventory/NVR_Data.h"
#include "runtime/guarded.h"

namespace cimple {

ProviderAgent::ProviderAgent(int errno_found)
{
    const bool constructed = guarded([&] { construct(errno_found); });
    if (constructed) return;
    NVR_LOG("Norvane CIM Provider load failure");
    m_bLoaded = false;
}

void ProviderAgent::construct(int errno_found)
{
    // A stale ENOENT of the caller's ends the look-up of the file; ours must not be there in its stead.
    errno = errno_found;
    m_config.load(provider_config_path);
    prepareFatalSignalAction();

    CLogger::instance()->loadSettings();
    saveAtExit(m_config);
    m_cacheTimeout = m_config.getCacheTimeout();
    m_bRefreshAdapterData = m_config.getRefreshAdapterData();
    m_bRefreshSANData = m_config.getRefreshSANData();
    if (getOSInformation(m_osName, m_osExtendedInfo) != 0) NVR_LOG("getOSInformation() failed");

    NVR_LOG("Initializing RM API ");
    if (loadLibraries() == 1) NVR_LOG("Error : In Loading Library ");
    const uint32 status = CPQFC_LoadLibrary();
    if (status != 0) NVR_LOG("Provider Agent::CPQFC_LoadLibrary() Failed:%d ", static_cast<int>(status));
    m_pSession.reset(new (std::nothrow) Management_Session);
    if (!m_pSession) NVR_LOG("Error : Could not allocate RMAPI --returning ");

    NVR_LOG("Initializing Data Pointer ");
    m_pData.reset(new NVR_Data);
    NVR_LOG("Norvane Provider v%d.%d.%d-%d Loaded[%d]", agent_major, agent_minor, agent_revision, agent_build,
            static_cast<int>(getpid()));
    m_bLoaded = true;
}

ProviderAgent::~ProviderAgent()
{
    if (guarded([this] { destruct(); })) return;
    guarded([] { saveAtEnd(); });
    NVR_LOG("Error in ProviderAgent unload. Just continue");
    CLogger::instance()->detachAll(); // the loggers go with the members
}

void ProviderAgent::destruct()
{
    NVR_LOG("Entering the function ~ProviderAgent()");
    {
        Auto_Mutex lock(m_DataFetchMutex);
        m_bLoaded = false;
    }
    joinFetchThread();

    NVR_LOG("Deleting Data pointer");
    {
        Auto_Mutex adapterData(m_AdapterDataReadyMutex);
        Auto_Mutex adapterMaps(m_AdapterMapsReadyMutex);
        Auto_Mutex data(m_DataMutex);
        m_pData.reset();
        NVR_LOG("MethodWrapper");
        m_pSession.reset();
    }
    CPQFC_FreeLibrary();
    ClearMaps();
    forgetBaseServerProfile();

    saveAtEnd();
    NVR_LOG("Norvane Provider Unloaded");
    unloadLibraries();
    CLogger::instance()->detachAll();
}

void ProviderAgent::forgetBaseServerProfile()
{
    if (!m_pBaseServerProfile) return;
    NVR_LOG("Destroying the Base Server Profile instance");
    m_pBaseServerProfile.reset();
}

} // namespace cimple
