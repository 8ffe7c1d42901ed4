/// Serves the driver parameter service of the host: its instance from the agent's map, and the setting of one
/// parameter.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCHBADriverParamService.h"
#include "classes/NVRHBA_FCHBADriverParamService_Methods.h"
#include "classes/NVRHBA_FCPort.h"

namespace cimple {

class NVRHBA_FCHBADriverParamService_Provider : public Read_Only_Provider<NVRHBA_FCHBADriverParamService>,
                                                public NVRHBA_FCHBADriverParamService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCHBADriverParamService* model, const Enum_Handler& handler);

    /// Does nothing and says so: return value 0.
    Invoke_Method_Status StartService(const NVRHBA_FCHBADriverParamService* self, Property<uint32>& return_value);

    /// Sets `strParam` to `strValue` for the port, or for all ports; until the driver's next start, or for good. The
    /// library checks name and limits. What is published of it stays as it is until the next refresh.
    ///
    /// Return values: 0; 33068 for another service; 32968 for a port that is none; 40001 for one that is not local, for
    /// a null text, and for texts of more than 254 characters; 40000 plus the library's status.
    Invoke_Method_Status SetDriverParameter(const NVRHBA_FCHBADriverParamService* self, NVRHBA_FCPort*& Target,
                                            Property<boolean>& bPermanent, Property<boolean>& bGlobal,
                                            Property<String>& strParam, Property<String>& strValue,
                                            Property<uint32>& return_value);
};

} // namespace cimple
