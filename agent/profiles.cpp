#include "agent/profiles.h"

#include "agent/instance_table.h"
#include "classes/NVRHBA_RegisteredProfile.h"

namespace cimple {

Ref<NVRHBA_RegisteredProfile> makeRegisteredProfile(const Profile_Row& row)
{
    auto profile = make<NVRHBA_RegisteredProfile>(interop_name_space);
    set(profile->InstanceID, text("NVR:%s", row.name));
    set(profile->Description, text("Norvane %s", row.name));
    set(profile->ElementName, text("Norvane Registered %s", row.name));
    set(profile->RegisteredOrganization, row.organization);
    set(profile->RegisteredName, row.name);
    set(profile->RegisteredVersion, row.version);
    set(profile->AdvertiseTypes, {3});
    set(profile->AdvertiseTypeDescriptions, {"SLP"});
    return profile;
}

} // namespace cimple
