// SCSI answers of a simulated logical unit. Pure functions.
#ifndef _simulator_Scsi_h
#define _simulator_Scsi_h

#include "simulator/Model.h"

namespace nvrsim {

enum class Scsi_Command { inquiry, capacity };

struct Scsi_Reply {
    uint32_t status = 0; // of the Common HBA API
    Bytes data;
    Bytes sense; // with a check condition only
};

/// `unit` null: there is no such logical unit.
Scsi_Reply scsi_inquiry(const Lun* unit, bool vitalProductData, uint32_t page);
Scsi_Reply scsi_capacity(const Lun* unit);

} // namespace nvrsim

#endif // _simulator_Scsi_h
