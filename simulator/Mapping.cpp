#include "simulator/Mapping.h"

#include "simulator/Defaults.h"

namespace nvrsim {

size_t visible_targets(const Port& port)
{
    return port.link_is_up() && !port.loopbackPlug ? port.targets.size() : 0;
}

void fill_entry(Call& call, const Port& port, const Target& target, uint32_t targetNumber, const Lun& lun,
                uint32_t path, HBA_SCSIID& scsi, HBA_FCPID& fcp)
{
    call.field(scsi.OSDeviceName, os_device_name(lun, path));
    scsi.ScsiBusNumber = port.ordinal;
    scsi.ScsiTargetNumber = targetNumber;
    scsi.ScsiOSLun = lun.number;
    fcp.FcId = target.fcId;
    fcp.NodeWWN = to_wire(target.wwnn);
    fcp.PortWWN = to_wire(target.wwpn);
    std::memcpy(&fcp.FcpLun, lun.fcpLun.data(), sizeof fcp.FcpLun);
}

} // namespace nvrsim
