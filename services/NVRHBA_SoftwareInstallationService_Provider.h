/// Serves the firmware installation service of the host. Its instance comes from the agent's map; its methods, but for
/// StartService, are answered as not supported.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_SoftwareInstallationService.h"
#include "classes/NVRHBA_SoftwareInstallationService_Methods.h"

namespace cimple {

class NVRHBA_SoftwareInstallationService_Provider : public Read_Only_Provider<NVRHBA_SoftwareInstallationService>,
                                                    public NVRHBA_SoftwareInstallationService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_SoftwareInstallationService* model, const Enum_Handler& handler);

    /// Does nothing and says so: return value 0.
    Invoke_Method_Status StartService(const NVRHBA_SoftwareInstallationService* self, Property<uint32>& return_value);

    template <class... Arguments>
    Invoke_Method_Status ResetHBA(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status SetPortEnabled(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
};

} // namespace cimple
