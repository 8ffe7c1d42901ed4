/// Serves the dump service of the host. Its instance comes from the agent's map; its methods are answered as not
/// supported.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_DumpService.h"
#include "classes/NVRHBA_DumpService_Methods.h"

namespace cimple {

class NVRHBA_DumpService_Provider : public Read_Only_Provider<NVRHBA_DumpService>, public NVRHBA_DumpService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_DumpService* model, const Enum_Handler& handler);

    template <class... Arguments>
    Invoke_Method_Status GenerateDump(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status GetDumpFileNames(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
    template <class... Arguments>
    Invoke_Method_Status DeleteDump(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
};

} // namespace cimple
