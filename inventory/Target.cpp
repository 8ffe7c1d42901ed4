#include "inventory/Target.h"

#include <algorithm>
#include <cstdio>
#include <cstring>

#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "inventory/Adapter.h"
#include "inventory/AdapterHandle.h"

namespace cimple {

namespace {

constexpr uint32 response_size = 255;
constexpr uint32 sense_size = 128;

// One SCSI command down one path, and what came back. The buffers are zeroed once for all its attempts.
struct Command {
    HBA_STATUS status = HBA_STATUS_ERROR;
    uint8 response[response_size + 1] = {}; // a zero byte behind what the library may write
    uint8 sense[sense_size] = {};

    // Sends until the device answers something else than a check condition, three times at most.
    template <class Send>
    bool run(Send send)
    {
        for (int calls = 0; calls < 3; calls++) {
            status = send(*this);
            if (status != HBA_STATUS_SCSI_CHECK_CONDITION) break;
        }
        if (status == HBA_STATUS_OK) return true;
        NVR_LOG("HBA_SendScsiInquiry_t(0x80) returns %d.", static_cast<int>(status)); // these words for all commands
        return false;
    }

    std::string text(std::size_t from, std::size_t size) const
    {
        const char* start = reinterpret_cast<const char*>(response) + from;
        return std::string(start, ::strnlen(start, size));
    }

    uint32 bigEndian(std::size_t from) const
    {
        const uint8* b = response + from;
        return uint32{b[0]} << 24 | uint32{b[1]} << 16 | uint32{b[2]} << 8 | b[3];
    }
};

// The way to one logical unit.
class Path {
public:
    Path(HBA_HANDLE handle, const HBA_FCPID& id) : m_handle(handle), m_id(id) {}

    bool inquire(Command& command, uint8 evpd, uint32 page) const
    {
        return command.run([&](Command& c) {
            return HBA_SendScsiInquiry(m_handle, m_id.PortWWN, m_id.FcpLun, evpd, page, c.response, response_size,
                                       c.sense, sense_size);
        });
    }

    bool readCapacity(Command& command) const
    {
        return command.run([&](Command& c) {
            return HBA_SendReadCapacity(m_handle, m_id.PortWWN, m_id.FcpLun, c.response, response_size, c.sense,
                                        sense_size);
        });
    }

private:
    const HBA_HANDLE m_handle;
    const HBA_FCPID& m_id;
};

constexpr char unknown[] = "Unknown";

void readStandardInquiry(const Path& path, Target& target)
{
    NVR_LOG("SCSI Inquiry with 0, 0");
    Command command;
    if (!path.inquire(command, 0, 0)) {
        target.Vendor = target.Product = target.Revision = unknown;
        return;
    }
    target.DeviceType = command.response[0] & 0x1F;
    NVR_LOG("DeviceType......%d", static_cast<int>(target.DeviceType));
    target.Vendor = command.text(8, 8);
    target.Product = command.text(16, 16);
    target.Revision = command.text(32, 4);
}

void readSerialNumber(const Path& path, Target& target)
{
    NVR_LOG("SCSI Inquiry with 1, 0x80");
    Command command;
    target.SerialNumber = path.inquire(command, 1, 0x80) ? command.text(4, response_size - 4) : unknown;
}

void readIdentifier(const Path& path, Target& target)
{
    NVR_LOG("SCSI Inquiry with 1, 0x83");
    Command command;
    if (!path.inquire(command, 1, 0x83)) {
        if (command.status != HBA_STATUS_SCSI_CHECK_CONDITION) return;
        char text[24 * 3 + 1];
        for (std::size_t i = 0; i < 24; i++)
            std::snprintf(text + 3 * i, 4, "%02x ", command.sense[i]);
        NVR_LOG("Sense Data: %s", text);
        return;
    }
    DeviceIdentifier& identifier = target.Identifier;
    identifier.deviceType = command.response[0] % 32;
    identifier.pageCode = command.response[1];
    identifier.pageLength = command.response[3];
    identifier.identifierType = command.response[5] & 0x0F;
    identifier.identifierLength = command.response[7];
    std::memcpy(identifier.identifier, command.response + 8,
                std::min(identifier.identifierLength, response_size - 8)); // the page may claim more than fits
}

void readCapacity(const Path& path, Target& target)
{
    NVR_LOG("Send Read Capacity");
    Command command;
    if (!path.readCapacity(command)) return;
    target.LastBlock = command.bigEndian(0);
    target.BlockSize = command.bigEndian(4);
}

} // namespace

Target::Target(const Adapter& adapter, const HBA_FCPSCSIENTRY& entry)
    : FcId(entry.FcpId.FcId), NodeName(wwnText(entry.FcpId.NodeWWN)), PortName(wwnText(entry.FcpId.PortWWN)),
      FcpLun(static_cast<uint64>(entry.FcpId.FcpLun)), OSDeviceName(fieldText(entry.ScsiId.OSDeviceName)),
      BusNumber(entry.ScsiId.ScsiBusNumber), TargetNumber(entry.ScsiId.ScsiTargetNumber), OSLun(entry.ScsiId.ScsiOSLun)
{
    NVR_LOG("Creating Target...");
    NVR_LOG("NodeWWN: %s", NodeName.c_str());
    NVR_LOG("PortWWN: %s", PortName.c_str());
    {
        const AdapterHandle handle(adapter.name());
        const Path path(handle, entry.FcpId);
        readStandardInquiry(path, *this);
        readSerialNumber(path, *this);
        readIdentifier(path, *this);
        cimple::readCapacity(path, *this);
    }
    NVR_LOG("End Creating Target...");
}

} // namespace cimple
