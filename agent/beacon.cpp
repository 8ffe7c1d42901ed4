#include "agent/beacon.h"

#include "agent/library_name.h"
#include "foundation/CLogger.h"
#include "foundation/management_binding.h"

namespace cimple {

namespace {

constexpr uint32 bad_argument = 32968;

struct State_Row {
    uint32 state;
    const char* text;
    uint16 indicator;
};

constexpr State_Row states[] = {{RM_BEACON_OFF, "Off", BEACON_OFF}, {RM_BEACON_ON, "On", BEACON_ON}};

} // namespace

uint32 GetBeaconState(const char* wwpn, uint16* indicator)
{
    NVR_LOG("NVR_DiagTestFunc::GetBeaconState");
    HBA_WWN port = {};
    if (!library_name(port, wwpn, "Id2HBAName failed", "str2HBAName failed")) return bad_argument;
    if (!indicator) {
        NVR_LOG("INVALID Parameter");
        return bad_argument;
    }
    uint32 state = RM_BEACON_NOT_AVAILABLE;
    const uint32 status = RM_DiagBeaconState(port, &state);
    switch (status) {
    case RM_STATUS_OK:
        break;
    case RM_STATUS_NOT_SUPPORTED:
        NVR_LOG("Beaconing not supported on host or adapter");
        *indicator = BEACON_NOT_SUPPORTED;
        return 0;
    case RM_STATUS_DIAGNOSTICS_NOT_AVAILABLE:
        NVR_LOG("Diagnostics not available");
        *indicator = BEACON_NOT_SUPPORTED;
        return 0;
    default:
        NVR_LOG("Unable to get the beacon state");
        *indicator = BEACON_UNKNOWN;
        return 0;
    }
    for (const State_Row& row : states) {
        if (row.state != state) continue;
        NVR_LOG("Beacon state = '%s'\n", row.text);
        *indicator = row.indicator;
        return 0;
    }
    NVR_LOG("Beacon state = '%s'\n", state == RM_BEACON_NOT_AVAILABLE ? "Not available" : "Unknown");
    return 0;
}

uint32 SetBeaconState(const HBA_WWN& port, uint16 indicator)
{
    NVR_LOG("NVR_DiagTestFunc::SetBeaconState");
    for (const State_Row& row : states) {
        if (row.indicator != indicator) continue;
        if (RM_DiagBeacon(port, row.state) != RM_STATUS_OK)
            NVR_LOG("Failed to set the beacon state to %d ", static_cast<int>(row.state));
        NVR_LOG("Successfully set the beacon state");
        return 0;
    }
    return bad_argument;
}

} // namespace cimple
