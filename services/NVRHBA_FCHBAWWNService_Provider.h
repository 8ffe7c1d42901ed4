/// Serves the WWN management service of the host: its instance comes from the agent's map, and its methods change,
/// restore and read the World Wide Names of a port.
///
/// Return values: 0 done (also a restore that the library refused), 91 a virtual port has the new name, 32968 a port or
/// type that is none or a text that is no name, 32969 a name that is missing, 33068 the wrong instance, else 40000 and
/// the library's status.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCHBAWWNService.h"
#include "classes/NVRHBA_FCHBAWWNService_Methods.h"
#include "classes/NVRHBA_FCPort.h"

namespace cimple {

class NVRHBA_FCHBAWWNService_Provider : public Read_Only_Provider<NVRHBA_FCHBAWWNService>,
                                        public NVRHBA_FCHBAWWNService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCHBAWWNService* model, const Enum_Handler& handler);

    Invoke_Method_Status ChangeWWN(const Instance* self, const Instance* Target, const Property<String>& NewWWPN,
                                   const Property<String>& NewWWNN, const Property<uint16>& Type,
                                   Property<uint16>& WWNOperationStatus, Property<uint32>& return_value);
    Invoke_Method_Status RestoreWWN(const Instance* self, const Instance* Target, const Property<uint16>& Type,
                                    Property<uint16>& WWNOperationStatus, Property<uint32>& return_value);
    Invoke_Method_Status ReadWWN(const Instance* self, const Instance* Target, const Property<uint16>& Type,
                                 Property<String>& WWPN, Property<String>& WWNN, Property<uint16>& WWNOperationStatus,
                                 Property<uint32>& return_value);
    Invoke_Method_Status GetWWNCapability(const Instance* self, const Instance* Target, Property<uint32>& WWNCapability,
                                          Property<uint32>& return_value);
};

} // namespace cimple
