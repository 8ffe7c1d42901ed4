/// Serves the frame tagging service of the host: its instance from the agent's map, the switch of the feature, and the
/// adapter's tag table as a file (services/ApexConfig.h).
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_FCTagService.h"
#include "classes/NVRHBA_FCTagService_Methods.h"

namespace cimple {

/// `Target` names the adapter by one of its ports. Return values that all four methods share: 0; 1 where the library
/// refuses; 4097 without a Target; 32768 for a host without adapters; 32968 for a Target that is no port of the host,
/// and for an adapter that cannot be opened; 33068 for another service.
class NVRHBA_FCTagService_Provider : public Read_Only_Provider<NVRHBA_FCTagService>,
                                     public NVRHBA_FCTagService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCTagService* model, const Enum_Handler& handler);

    /// `State` is set on success alone.
    Invoke_Method_Status GetGlobalFlag(const NVRHBA_FCTagService* self, NVRHBA_FCPort*& Target, Property<uint32>& State,
                                       Property<uint32>& return_value);
    Invoke_Method_Status SetGlobalFlag(const NVRHBA_FCTagService* self, NVRHBA_FCPort*& Target, Property<uint32>& State,
                                       Property<uint32>& return_value);

    /// Writes the table to a file of the name `URI` in the port's dump directory, or in the last one that was known, or
    /// else in /tmp. 4097 without a name; 32767 for an empty table; 32968 for a path of more than 255 characters. A
    /// table or file that fails otherwise shows in the log alone: 0.
    Invoke_Method_Status GetConfigTable(const NVRHBA_FCTagService* self, NVRHBA_FCPort*& Target, Property<String>& URI,
                                        Property<uint32>& return_value);
    /// Loads the table from a file, which is fetched first if it is not one of this host. 4097 without a name; 4107 for
    /// a file that is not there, 5 for one that cannot be reached; otherwise as loadConfigTable.
    Invoke_Method_Status SetConfigTable(const NVRHBA_FCTagService* self, NVRHBA_FCPort*& Target, Property<String>& URI,
                                        Property<uint32>& return_value);
};

} // namespace cimple
