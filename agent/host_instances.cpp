// The host: another provider's computer system where one is published, else one of our own making.
#include <cerrno>
#include <netdb.h>
#include <unistd.h>
#include <vector>

#include "agent/Adapter_Update.h"
#include "classes/CIM_ComputerSystem.h"
#include "classes/CIM_RegisteredProfile.h"
#include "classes/IBMSD_ComputerSystem.h"
#include "foundation/CLogger.h"
#include "runtime/cimom.h"

namespace cimple {

namespace {

constexpr const char* host_name_space = "root/ibmse";
constexpr const char* unknown = "unknown";

/// The first instance of an open enumeration that `wanted` accepts, cloned; or none.
template <class Wanted>
Ref<Instance> first_of(Instance_Enumerator& enumerator, Wanted wanted)
{
    for (; enumerator.more(); enumerator.next()) {
        const Ref<Instance> instance = enumerator.get();
        if (instance && wanted(*instance)) return Ref<Instance>(clone(instance.get()));
    }
    return Ref<Instance>();
}

/// The official name and the first address of a host; false if it cannot be resolved.
bool resolve(const char* name, String& official, String& address)
{
    std::vector<char> buffer(4096);
    for (;;) {
        hostent entry;
        hostent* found = nullptr;
        int fault = 0;
        const int status = gethostbyname_r(name, &entry, buffer.data(), buffer.size(), &found, &fault);
        if (status == ERANGE && buffer.size() < 1048576) {
            buffer.resize(2 * buffer.size());
            continue;
        }
        if (status != 0 || !found || !found->h_addr_list[0] || found->h_length < 4) return false;
        const auto* bytes = reinterpret_cast<const unsigned char*>(found->h_addr_list[0]);
        official = found->h_name;
        address = text("%d.%d.%d.%d", bytes[0], bytes[1], bytes[2], bytes[3]);
        return true;
    }
}

} // namespace

void Adapter_Update::buildHost()
{
    Ref<Instance> host = askForHost();
    if (!m_agent.m_pBaseServerProfile) askForBaseServerProfile();
    if (!host) {
        NVR_LOG("up-call method failed");
        host = makeHost();
    }
    NVR_LOG("All clear -created nvrhba computer system instance");
    m_host = insert(static_cast<Instance_Map&>(m_agent.m_CIM_ComputerSystem_map), host,
                    "Insert Failed : m_NVRHBA_ComputerSystem_map");
    m_hostClass = string_property(m_host, "CreationClassName");
    m_hostName = string_property(m_host, "Name");
}

Ref<Instance> Adapter_Update::askForHost()
{
    NVR_LOG("up-call to enumerate CIM_ComputerSystem started");
    const Ref<Instance> model(create(&IBMSD_ComputerSystem::meta, true));
    NVR_LOG("up-call to enumerate CIM_ComputerSystem created--calling now");
    Instance_Enumerator enumerator;
    if (cimom::enum_instances(host_name_space, model.get(), enumerator) != 0) return Ref<Instance>();
    NVR_LOG("up-call to enumerate CIM_ComputerSystem started");
    Ref<Instance> host = first_of(enumerator, [](const Instance& instance) {
        return is_subclass(&CIM_ComputerSystem::meta, instance.meta_class);
    });
    if (!host) return host;
    NVR_LOG("up-call - found the correct CIM_ComputerSystem to link");
    host->__name_space = host_name_space;
    return host;
}

void Adapter_Update::askForBaseServerProfile()
{
    NVR_LOG("up-call to enumerate CIM_RegisteredProfile started");
    const Ref<Instance> model(create(&CIM_RegisteredProfile::meta, true));
    NVR_LOG("up-call to enumerate CIM_ComputerSystem created--calling now");
    Instance_Enumerator enumerator;
    if (cimom::enum_instances(interop_name_space, model.get(), enumerator) != 0) return;
    NVR_LOG("up-call to enumerate CIM_RegisteredProfile Passed");
    Ref<Instance> profile = first_of(enumerator, [](const Instance& instance) {
        return is_subclass(&CIM_RegisteredProfile::meta, instance.meta_class) &&
               equali(string_property(&instance, "RegisteredName"), "Base Server");
    });
    if (!profile) return;
    NVR_LOG("up-call - found the correct CIM_RegisteredProfile to link");
    if (profile->__name_space.empty()) profile->__name_space = interop_name_space;
    m_agent.m_pBaseServerProfile = profile;
}

void Adapter_Update::readHostName()
{
    char name[512] = {};
    if (gethostname(name, sizeof name - 1) != 0) {
        NVR_LOG("Error! gethostname() failed err : %d , using 'unknown' for hostname and IP address", errno);
        m_agent.m_hostName = unknown;
        m_agent.m_ipAddress = unknown;
        return;
    }
    NVR_LOG("Host Name : %s", name);
    String official;
    String address;
    if (resolve(name, official, address)) {
        NVR_LOG("Host ipAddress : %s", address.c_str());
    } else {
        NVR_LOG("Error! gethostbyname() failed, using 'unknown' for IP address.");
        official = name;
        address = unknown;
    }
    m_agent.m_hostName = official;
    m_agent.m_ipAddress = address;
}

Ref<Instance> Adapter_Update::makeHost()
{
    readHostName();
    NVR_LOG("Generating an norvane specific m_CIM_ComputerSystem_map[0]");
    auto host = make<CIM_ComputerSystem>();
    set(host->Description, text("%s with Norvane CMPI HBA Provider v%d.%d.%d-%d", m_agent.m_osName.c_str(), agent_major,
                                agent_minor, agent_revision, agent_build));
    set(host->EnabledState, 0);
    set(host->RequestedState, 12);
    set(host->EnabledDefault, 2);
    set(host->CreationClassName, "CIM_ComputerSystem");
    set(host->Name, m_agent.m_hostName);
    set(host->ElementName, m_agent.m_hostName);
    set(host->TransitioningToState, 12);
    set(host->OtherIdentifyingInfo, {m_agent.m_ipAddress, m_agent.m_osName, m_agent.m_osExtendedInfo});
    set(host->IdentifyingDescriptions, {"NORVANE:IP_ADDRESS", "NORVANE:OS_NAME", "NORVANE:OS_EXTENDED_INFO"});
    set(host->Dedicated, {0});
    set(host->NameFormat, "Other");
    set(host->ResetCapability, 2);
    set(host->PowerManagementCapabilities, {0});
    set(host->OperationalStatus, {2});
    m_agent.m_bOwnComputerSystem = true;
    return Ref<Instance>(host.release());
}

} // namespace cimple
