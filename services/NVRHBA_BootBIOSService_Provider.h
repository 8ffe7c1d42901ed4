/// Serves the boot BIOS service of the host. Its instance comes from the agent's map; its methods, but for
/// StartService, are answered as not supported.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_BootBIOSService.h"
#include "classes/NVRHBA_BootBIOSService_Methods.h"

namespace cimple {

class NVRHBA_BootBIOSService_Provider : public Read_Only_Provider<NVRHBA_BootBIOSService>,
                                        public NVRHBA_BootBIOSService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_BootBIOSService* model, const Enum_Handler& handler);

    /// Does nothing and says so: return value 0.
    Invoke_Method_Status StartService(const NVRHBA_BootBIOSService* self, Property<uint32>& return_value);

    template <class... Arguments>
    Invoke_Method_Status EnableBootBIOS(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status DisableBootBIOS(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status GetBootBIOSStatus(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
};

} // namespace cimple
