#include "agent/NVRHBA_RegisteredProfile_Provider.h"

#include "agent/profiles.h"
#include "foundation/CLogger.h"

namespace cimple {

Enum_Instances_Status NVRHBA_RegisteredProfile_Provider::enum_instances(const NVRHBA_RegisteredProfile*,
                                                                        const Enum_Handler& handler)
{
    for (const Profile_Row& row : profile_rows)
        handler.handle(makeRegisteredProfile(row).release());
    NVR_LOG("NVRHBA_RegisteredProfile_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

} // namespace cimple
