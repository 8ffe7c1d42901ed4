/// Serves the boot BIOS service of the host: its instance comes from the agent's map, and its methods switch the boot
/// code of a port's adapter on and off and read whether it is on.
///
/// Return values: 0 done, 32968 a port that is none, 33068 the wrong instance, else 40000 and the operation's status.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_BootBIOSService.h"
#include "classes/NVRHBA_BootBIOSService_Methods.h"
#include "classes/NVRHBA_FCPort.h"

namespace cimple {

class NVRHBA_BootBIOSService_Provider : public Read_Only_Provider<NVRHBA_BootBIOSService>,
                                        public NVRHBA_BootBIOSService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_BootBIOSService* model, const Enum_Handler& handler);

    /// Does nothing and says so: return value 0.
    Invoke_Method_Status StartService(const Instance* self, Property<uint32>& return_value);

    // `Target` may be of any class that has a DeviceID.
    Invoke_Method_Status EnableBootBIOS(const Instance* self, const Instance* Target, Property<uint32>& return_value);
    Invoke_Method_Status DisableBootBIOS(const Instance* self, const Instance* Target, Property<uint32>& return_value);
    Invoke_Method_Status GetBootBIOSStatus(const Instance* self, const Instance* Target,
                                           Property<uint32>& nBootBIOSStatus, Property<uint32>& return_value);
};

} // namespace cimple
