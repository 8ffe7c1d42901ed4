#include "agent/vpd.h"

#include "foundation/management_binding.h"

namespace cimple {

uint32 readVPD(const HBA_WWN& wwn, std::vector<Vpd_Entry>& entries)
{
    entries.clear();
    alignas(RM_VPDBLOCK) unsigned char block[RM_VPD_SIZE] = {};
    uint32 size = sizeof block;
    const uint32 status = RM_GetVPD(wwn, block, &size);
    if (status != RM_STATUS_OK) return status;

    RM_VPDCURSOR cursor = {};
    char value[RM_VPD_VALUE_SIZE + 1];
    for (unsigned i = 0; i < RM_VPD_MAX_ENTRIES; i++) {
        const uint8 before = cursor.index;
        value[0] = '\0';
        if (RM_GetNextVpdEntry(block, &cursor, RM_VPD_CURSOR_SIZE, value, RM_VPD_VALUE_SIZE) == 0) break;
        if (cursor.index <= before) break;
        value[RM_VPD_VALUE_SIZE] = '\0';
        std::string tag(cursor.tag, sizeof cursor.tag);
        entries.emplace_back(tag.c_str(), value);
    }
    return status;
}

} // namespace cimple
