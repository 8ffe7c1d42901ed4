/// Serves the dump service of the host: its instance from the agent's map, and the dumps of a port.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_DumpService.h"
#include "classes/NVRHBA_DumpService_Methods.h"
#include "classes/NVRHBA_FCPort.h"

namespace cimple {

/// Return values of all three methods: 0; 33068 for another service; 32968 for a Target that is no port of the host;
/// 40001 for one that is not local; 40000 plus the library's status.
class NVRHBA_DumpService_Provider : public Read_Only_Provider<NVRHBA_DumpService>, public NVRHBA_DumpService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_DumpService* model, const Enum_Handler& handler);

    Invoke_Method_Status GenerateDump(const NVRHBA_DumpService* self, NVRHBA_FCPort*& Target,
                                      Property<uint32>& return_value);
    /// The names come back in `DumpFiles`, which is left alone on failure. 32968 also without memory.
    Invoke_Method_Status GetDumpFileNames(const NVRHBA_DumpService* self, NVRHBA_FCPort*& Target,
                                          Property<Array<String>>& DumpFiles, Property<uint32>& return_value);
    Invoke_Method_Status DeleteDump(const NVRHBA_DumpService* self, NVRHBA_FCPort*& Target,
                                    Property<uint32>& return_value);
};

} // namespace cimple
