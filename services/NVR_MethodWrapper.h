/// The management operations of the services: what they do to an adapter through the management libraries, with the
/// words that they log.
///
/// They take a port by its eight-byte name. Results are statuses: 0 for success, the library's status, or 1 where a
/// library entry is missing or a check of their own fails. They need the management session (foundation/
/// Management_Session.h), and callers serialise, by the agent's data mutex. One source file a service.
#pragma once

#include <string>
#include <vector>

#include "foundation/management_api.h"
#include "runtime/Property.h"
#include "runtime/String.h"

namespace cimple {

/// The virtual ports of a port.
struct VPort_List {
    uint32 count = 0;                   ///< as the library reported it
    std::vector<RM_VPORTENTRY> entries; ///< what it gave room and records for
};

class NVR_MethodWrapper {
public:
    NVR_MethodWrapper() = delete;

    // --- World Wide Names (wwn_operations.cpp). Results are return values of the service. `operationStatus` is written
    // only where the operation has a code to tell; `type` and the codes are told in wwn_operations.cpp.

    /// Refuses names that the library refuses and names that a virtual port of any local port has (91); then asks the
    /// library, for five minutes if it is busy.
    static uint32 ChangeWWN(const HBA_WWN& port, const HBA_WWN& newWWPN, const HBA_WWN& newWWNN, uint16 type,
                            Property<uint16>& operationStatus);
    /// 0, also where the library refuses.
    static uint32 RestoreWWN(const HBA_WWN& port, uint16 type, Property<uint16>& operationStatus);
    /// `WWPN` and `WWNN` become texts with colons.
    static uint32 ReadWWN(const HBA_WWN& port, uint16 type, Property<String>& WWPN, Property<String>& WWNN,
                          Property<uint16>& operationStatus);
    /// `capability` is the library's word.
    static uint32 GetWWNCapability(const HBA_WWN& port, Property<uint32>& capability);

    // --- Firmware and port state (firmware_operations.cpp; the reset is in foundation/shared_operations.h).

    /// Imports, verifies and writes the image; blocks until that is done. 1 also for a file that is not there.
    static uint32 nvrcimDownloadFW(const HBA_WWN& port, const char* path);
    /// 1 for a text that is no port's name.
    static uint32 SetPortEnabled(const char* deviceID, boolean enabled);

    // --- Transfer of files (transfer_operations.cpp), by libcurl, which is loaded for each.

    /// Result the path of the local file, which may not be there; `returnValue` gets 4 after some failures, `fetched`
    /// true once a file was written for the caller to remove.
    static std::string downloadFileUsingCurl(const String& uri, uint32& returnValue, bool& fetched);
    /// 0; -1; or 1 if the file cannot be opened.
    static int uploadFileUsingCurl(const String& uri, const char* path);

    // --- Driver parameters (driver_param_operations.cpp; agent/driver_param_instances.h reads them).

    /// `CW1` 1: for all ports; `CW2` 1: for good. Null texts are refused.
    static uint32 nvrcimSetDriverParam(const char* deviceID, const HBA_WWN& port, uint32 CW1, uint32 CW2,
                                       const char* name, const char* value);

    // --- Boot code (boot_bios_operations.cpp).

    /// 0 or 1.
    static uint32 nvrcimGetBootBiosState(const HBA_WWN& port, uint32* state);
    /// `control` points to "E" or "D", in either case.
    static uint32 nvrcimSetBootBiosState(const HBA_WWN& port, const char* control);

    // --- Dumps (dump_operations.cpp).

    /// `directory`: RM_DUMP_DIRECTORY_SIZE bytes, zeroed first; the text may fill them all.
    static uint32 nvrcimGetDumpDirectory(const HBA_WWN& port, char (&directory)[RM_DUMP_DIRECTORY_SIZE]);
    /// `count` is 0 after a failure.
    static uint32 nvrcimGetRetentionCount(const HBA_WWN& port, uint32& count);
    static uint32 nvrcimSetRetentionCount(const HBA_WWN& port, uint32 count);
    static uint32 nvrcimDeleteDumpFiles(const HBA_WWN& port);
    /// `kind` -1: the whole adapter's dump.
    static uint32 nvrcimDumpDiagnostic(const HBA_WWN& port, sint32 kind);
    static uint32 GetDumpFileNames(const HBA_WWN& port, RM_DUMPLIST* list);
    static uint32 nvrcimSetDumpDirectory(const HBA_WWN& port, const char* path);

    // --- Virtual ports (virtual_port_operations.cpp).

    /// 0; 1 for a port that is not local or a failed call; 4 for a null pointer. `list` is written on success alone.
    static int ListVPorts(const HBA_WWN& port, VPort_List* list);
    /// The same for one virtual port's record.
    static int ListVPortAttributes(const HBA_WWN& port, const HBA_WWN& vport, RM_VPORTATTRIBUTES* attributes);
    /// Asks for the targets that a virtual port sees, for the log alone: 0 or 1.
    static int ListVPortTargets(const HBA_WWN& port, const HBA_WWN& vport);
    /// The virtual machines behind a virtual port: 0, 1 or 4 as above. An adapter that maps none has none: 0.
    static int ListVMfromVPort(const HBA_WWN& port, const RM_VPORTENTRY& vport, std::vector<RM_VMINFO>* machines);
};

} // namespace cimple
