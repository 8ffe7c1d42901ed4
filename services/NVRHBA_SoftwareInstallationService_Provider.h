/// Serves the firmware installation service of the host. Its instance comes from the agent's map.
///
/// Each method runs to its end inside the call, under the locks of the agent wait, transfers included; no job is made.
/// The return values stand in agent/method_answer.h, and beside them 4 and 5, told in the source.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_SoftwareInstallationService.h"
#include "classes/NVRHBA_SoftwareInstallationService_Methods.h"

namespace cimple {

class NVRHBA_SoftwareInstallationService_Provider : public Read_Only_Provider<NVRHBA_SoftwareInstallationService>,
                                                    public NVRHBA_SoftwareInstallationService_Methods {
public:
    using Self = NVRHBA_SoftwareInstallationService;

    Enum_Instances_Status enum_instances(const Self* model, const Enum_Handler& handler);

    /// Does nothing and says so: return value 0.
    Invoke_Method_Status StartService(const Self* self, Property<uint32>& return_value);

    /// Writes the image at a path or URI to the port's adapter. A fetched image is removed once it is written.
    Invoke_Method_Status InstallFromURI(const Self* self, CIM_ConcreteJob*& Job, const Property<String>& URI,
                                        const CIM_ManagedElement* Target, const Property<Array<uint16>>& InstallOptions,
                                        const Property<Array<String>>& InstallOptionsValues,
                                        Property<uint32>& return_value);
    /// The same with the image's bytes, by way of a file that the client names, which is removed in the end.
    Invoke_Method_Status InstallFromByteStream(const Self* self, CIM_ConcreteJob*& Job,
                                               const Property<Array<uint8>>& Image, const CIM_ManagedElement* Target,
                                               const Property<Array<uint16>>& InstallOptions,
                                               const Property<Array<String>>& InstallOptionsValues,
                                               Property<uint32>& return_value);
    Invoke_Method_Status ResetHBA(const Self* self, const NVRHBA_FCPort* Target, Property<uint32>& return_value);
    Invoke_Method_Status SetPortEnabled(const Self* self, const NVRHBA_FCPort* Target,
                                        const Property<boolean>& PortEnabled, Property<uint32>& return_value);
};

} // namespace cimple
