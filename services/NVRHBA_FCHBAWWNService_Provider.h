/// Serves the WWN management service of the host. Its instance comes from the agent's map; its methods are answered as
/// not supported.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCHBAWWNService.h"
#include "classes/NVRHBA_FCHBAWWNService_Methods.h"

namespace cimple {

class NVRHBA_FCHBAWWNService_Provider : public Read_Only_Provider<NVRHBA_FCHBAWWNService>,
                                        public NVRHBA_FCHBAWWNService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCHBAWWNService* model, const Enum_Handler& handler);

    template <class... Arguments>
    Invoke_Method_Status ChangeWWN(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status RestoreWWN(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status ReadWWN(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status GetWWNCapability(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
};

} // namespace cimple
