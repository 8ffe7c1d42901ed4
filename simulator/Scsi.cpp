#include "simulator/Scsi.h"

#include <algorithm>

namespace nvrsim {

namespace {

constexpr uint8_t invalidField = 0x24;
constexpr uint8_t noSuchUnit = 0x25;
constexpr uint8_t invalidCommand = 0x20;

Bytes fixed_sense(uint8_t reason)
{
    Bytes sense(18, '\0');
    sense[0] = 0x70;
    sense[2] = 5; // illegal request
    sense[7] = 10;
    sense[12] = static_cast<char>(reason);
    return sense;
}

Scsi_Reply check_condition(uint8_t reason)
{
    return {HBA_STATUS_SCSI_CHECK_CONDITION, Bytes(), fixed_sense(reason)};
}

void append_padded(Bytes& data, const std::string& text, size_t width)
{
    data.append(text, 0, width);
    data.append(width - std::min(width, text.size()), ' ');
}

void append_big(Bytes& data, uint64_t value, size_t width)
{
    for (size_t i = width; i-- > 0;)
        data += static_cast<char>(value >> (8 * i));
}

/// The scenario's own bytes or status for one command, before anything built.
bool overridden(const Lun& unit, const Scsi_Answer Scsi_Answers::*which, Scsi_Reply& reply)
{
    if (!unit.answers) return false;
    const Scsi_Answer& answer = (*unit.answers).*which;
    if (!answer.status && !answer.bytes) return false;
    reply.status = answer.status;
    if (answer.bytes) reply.data = *answer.bytes;
    if (answer.status == HBA_STATUS_SCSI_CHECK_CONDITION)
        reply.sense = unit.answers->sense.empty() ? fixed_sense(invalidField) : unit.answers->sense;
    return true;
}

Bytes standard_inquiry(const Lun& unit)
{
    Bytes data;
    data += static_cast<char>(unit.deviceType);
    data += static_cast<char>(unit.deviceType == 1 || unit.deviceType == 8 ? 0x80 : 0); // removable media
    data += 5;                                                                          // SPC-3
    data += 0x12; // hierarchical, response format 2
    data += 91;   // 96 bytes in all
    data += Bytes("\0\0\2", 3);
    append_padded(data, unit.vendor, 8);
    append_padded(data, unit.product, 16);
    append_padded(data, unit.revision, 4);
    data.resize(96, '\0');
    return data;
}

Bytes page(const Lun& unit, uint8_t code, const Bytes& content)
{
    Bytes data;
    data += static_cast<char>(unit.deviceType);
    data += static_cast<char>(code);
    append_big(data, content.size(), 2);
    return data + content;
}

Bytes identification(const Lun& unit)
{
    if (unit.identifier.empty()) return Bytes();
    Bytes descriptor;
    descriptor += static_cast<char>(unit.identifierCodeSet);
    descriptor += static_cast<char>(unit.identifierType);
    descriptor += '\0';
    descriptor += static_cast<char>(unit.identifier.size());
    return descriptor + unit.identifier;
}

} // namespace

Scsi_Reply scsi_inquiry(const Lun* unit, bool vitalProductData, uint32_t code)
{
    if (!unit) return check_condition(noSuchUnit);
    Scsi_Reply reply;
    if (!vitalProductData) {
        if (code != 0) return check_condition(invalidField);
        if (!overridden(*unit, &Scsi_Answers::inquiry, reply)) reply.data = standard_inquiry(*unit);
        return reply;
    }
    switch (code) {
    case 0x00:
        reply.data = page(*unit, 0x00, Bytes("\x00\x80\x83", 3));
        return reply;
    case 0x80:
        if (!overridden(*unit, &Scsi_Answers::page80, reply)) reply.data = page(*unit, 0x80, unit->serial);
        return reply;
    case 0x83:
        if (!overridden(*unit, &Scsi_Answers::page83, reply)) reply.data = page(*unit, 0x83, identification(*unit));
        return reply;
    default:
        return check_condition(invalidField);
    }
}

Scsi_Reply scsi_capacity(const Lun* unit)
{
    if (!unit) return check_condition(noSuchUnit);
    Scsi_Reply reply;
    if (overridden(*unit, &Scsi_Answers::capacity, reply)) return reply;
    if (!unit->blocks) return check_condition(invalidCommand);
    append_big(reply.data, std::min<uint64_t>(unit->blocks - 1, 0xFFFFFFFF), 4);
    append_big(reply.data, unit->blockSize, 4);
    return reply;
}

} // namespace nvrsim
