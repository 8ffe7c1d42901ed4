// The registered profiles, their ties to the host and to each other.
#include "agent/Adapter_Update.h"
#include "agent/profiles.h"
#include "classes/NVRHBA_RegisteredProfile.h"
#include "foundation/CLogger.h"

namespace cimple {

namespace {

const Profile_Row& row_of(const char* name)
{
    for (const Profile_Row& row : profile_rows)
        if (equali(row.name, name)) return row;
    throw std::exception();
}

} // namespace

Instance* Adapter_Update::createRegisteredProfile(const char* name)
{
    NVR_LOG("Generating NVRHBA_RegisteredProfile (%s)", name);
    auto& map = m_agent.m_NVRHBA_RegisteredProfile_map;
    const String id = text("NVR:%s", name);
    for (std::size_t i = 0; i < map.size(); i++) {
        if (!equali(map[i]->InstanceID.value, id)) continue;
        NVR_LOG("Got NVRHBA_RegisteredProfile in the map (%s)", name);
        return map[i];
    }
    Ref<NVRHBA_RegisteredProfile> profile = makeRegisteredProfile(row_of(name));
    if (map.insert(profile.get()) < 0) {
        logInsertFailed(map, nullptr);
        return nullptr;
    }
    NVR_LOG("Created NVRHBA_RegisteredProfile in the map (%s)", name);
    return profile.release();
}

Instance* Adapter_Update::createProfile(const char* name)
{
    Instance* profile = createRegisteredProfile(name);
    createComputerSystemConformsToProfile(m_agent, profile);
    return profile;
}

void Adapter_Update::buildProfiles()
{
    const Instance* registration = createProfile("Profile Registration");
    const auto build = [&](const char* name) {
        Instance* profile = createProfile(name);
        createReferencedProfile(m_agent, text("%s / Profile Registration", name).c_str(), profile, registration);
        return profile;
    };
    m_softwareInventory = build("Software Inventory");
    m_physicalPackage = build("Physical Package");
    m_hostDiscoveredResources = build("Host Discovered Resources");
    m_fcHBA = build("FC HBA");
    m_storageHBA = build("Storage HBA");
    m_fcInitiatorPorts = build("FC Initiator Ports");
    createReferencedProfile(m_agent, "FC HBA / FC Initiator Port", m_fcHBA, m_fcInitiatorPorts);
    m_software = build("Software");
    m_accessPoints = build("Access Points");
    m_pciDevice = build("PCI Device");
    build("FCHBA Diagnostics");
}

} // namespace cimple
