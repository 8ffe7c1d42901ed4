/// The management session: its life is the time in which RM_ operations may be called, and its methods are the
/// management operations of the services.
///
/// One instance, owned by the agent. The constructor initialises the management library, guarded by a semaphore named
/// after the process, and throws std::exception if the library refuses; it waits while another thread's instance is
/// initialising. The destructor lets go of the semaphore; the library stays initialised until it is closed.
#pragma once

#include <vector>

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

/// The virtual ports of a port.
struct VPort_List {
    uint32 count = 0;                   ///< as the library reported it
    std::vector<RM_VPORTENTRY> entries; ///< what it gave room and records for
};

class NVR_MethodWrapper {
public:
    NVR_MethodWrapper();
    ~NVR_MethodWrapper();
    NVR_MethodWrapper(const NVR_MethodWrapper&) = delete;
    NVR_MethodWrapper& operator=(const NVR_MethodWrapper&) = delete;

    /// As the function of the same name in NVR_Common.h.
    int string2HBAName(HBA_WWN* wwn, const char* text);

    // The operations. They take a port by its name, log their failures, and need a session that lives, not its object.
    // Callers serialise, by the agent's data mutex.

    /// 0 if the management library calls the port local, else 1.
    static int Validatewwpn(const HBA_WWN& port);
    /// The same as the operations ask it, with their words for a port that is not.
    static bool isLocal(const HBA_WWN& port);
    /// Logs a status with the library's words for it.
    static void logStatus(uint32 status);

    /// 0; 1 for a port that is not local or a failed call; 4 for a null pointer. `list` is written on success alone.
    static int ListVPorts(const HBA_WWN& port, VPort_List* list);
    /// The same for one virtual port's record.
    static int ListVPortAttributes(const HBA_WWN& port, const HBA_WWN& vport, RM_VPORTATTRIBUTES* attributes);
    /// Asks for the targets that a virtual port sees, for the log alone: 0 or 1.
    static int ListVPortTargets(const HBA_WWN& port, const HBA_WWN& vport);
    /// The virtual machines behind a virtual port: 0, 1 or 4 as above. An adapter that maps none has none: 0.
    static int ListVMfromVPort(const HBA_WWN& port, const RM_VPORTENTRY& vport, std::vector<RM_VMINFO>* machines);

    /// `directory`: RM_DUMP_DIRECTORY_SIZE bytes, zeroed first; the text may fill them all. Result the library's
    /// status, 1 for a port that is not local.
    static uint32 nvrcimGetDumpDirectory(const HBA_WWN& port, char (&directory)[RM_DUMP_DIRECTORY_SIZE]);
    /// `count` is 0 after a failure.
    static uint32 nvrcimGetRetentionCount(const HBA_WWN& port, uint32& count);

    /// Resets the adapter behind the port. Result the library's status, 1 for a port that is not local.
    static uint32 nvrcimReset(const HBA_WWN& port);
};

} // namespace cimple
