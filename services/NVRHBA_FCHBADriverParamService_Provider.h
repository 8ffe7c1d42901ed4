/// Serves the driver parameter service of the host. Its instance comes from the agent's map; its methods, but for
/// StartService, are answered as not supported.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCHBADriverParamService.h"
#include "classes/NVRHBA_FCHBADriverParamService_Methods.h"

namespace cimple {

class NVRHBA_FCHBADriverParamService_Provider : public Read_Only_Provider<NVRHBA_FCHBADriverParamService>,
                                                public NVRHBA_FCHBADriverParamService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCHBADriverParamService* model, const Enum_Handler& handler);

    /// Does nothing and says so: return value 0.
    Invoke_Method_Status StartService(const NVRHBA_FCHBADriverParamService* self, Property<uint32>& return_value);

    template <class... Arguments>
    Invoke_Method_Status SetDriverParameter(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
};

} // namespace cimple
