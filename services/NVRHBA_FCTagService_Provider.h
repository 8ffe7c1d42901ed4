/// Serves the frame tagging service of the host. Its instance comes from the agent's map; its methods are answered as
/// not supported.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCTagService.h"
#include "classes/NVRHBA_FCTagService_Methods.h"

namespace cimple {

class NVRHBA_FCTagService_Provider : public Read_Only_Provider<NVRHBA_FCTagService>,
                                     public NVRHBA_FCTagService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCTagService* model, const Enum_Handler& handler);

    template <class... Arguments>
    Invoke_Method_Status SetConfigTable(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status GetConfigTable(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status SetGlobalFlag(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status GetGlobalFlag(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
};

} // namespace cimple
