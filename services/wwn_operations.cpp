// The World Wide Names of a port: changed, restored, read.
//
// Types of names: 0 volatile and 1 non-volatile to change; 0 factory and 1 non-volatile to restore; 0 volatile, 1
// non-volatile, 2 factory, 3 current and 4 configured to read. What comes of a change or a restore is told by the
// activation codes of management_api.h, what was read by its status words.
#include "services/NVR_MethodWrapper.h"

#include <algorithm>
#include <cstring>

#include "agent/Clock.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "foundation/management_binding.h"
#include "runtime/guarded.h"
#include "services/Counted_List.h"
#include "services/WWPN_List.h"
#include "services/service_method.h"

namespace cimple {

namespace {

constexpr uint32 answer_duplicate = 91;
constexpr int busy_retries = 300;
constexpr uint64 busy_interval = 1000 * 1000; // microseconds

/// Why a new name is refused: the numbers are the service's, of which the search finds the first alone.
enum Duplicate : uint16 {
    NO_DUPLICATE = 0,
    VPORT_WWPN = 1,
    VPORT_WWNN = 2,
    VPORT_TARGET_WWPN = 3,
    VPORT_TARGET_WWNN = 4
};

const char* wordsOf(Duplicate duplicate)
{
    switch (duplicate) {
    case NO_DUPLICATE:
        break;
    case VPORT_WWPN:
        return "ChangeWWN: Duplication of vport WWPN detected.";
    case VPORT_WWNN:
        return "ChangeWWN: Duplication of vport WWNN detected.";
    case VPORT_TARGET_WWPN:
        return "ChangeWWN: Duplication of vport target WWPN detected.";
    case VPORT_TARGET_WWNN:
        return "ChangeWWN: Duplication of vport target WWNN detected.";
    }
    return "";
}

bool same(const HBA_WWN& a, const HBA_WWN& b)
{
    return std::memcmp(a.wwn, b.wwn, sizeof a.wwn) == 0;
}

/// Does a virtual port of `port` bear one of the names as its WWPN? A new WWNN too is held against their WWPNs.
bool hasVPortNamed(const HBA_WWN& port, const HBA_WWN& newWWPN, const HBA_WWN& newWWNN)
{
    Counted_List<RM_VPORTLIST> list;
    if (!list.fill([&](void* room) { return RM_VPList(port, room); })) return false;
    if (list.status != RM_STATUS_OK || list.count() == 0 || list.count() > RM_VPORT_MAX_ENTRIES) return false;
    for (uint32 i = 0; i < list.size(); i++) {
        const HBA_WWN& vport = list[i].wwpn;
        if (same(vport, newWWPN) || same(vport, newWWNN)) return true;
    }
    return false;
}

Duplicate findDuplicate(const HBA_WWN& newWWPN, const HBA_WWN& newWWNN)
{
    Duplicate duplicate = NO_DUPLICATE;
    const uint32 records = std::min(RM_GetNumberOfLocalAdapters(), RM_LOCAL_MAX_RECORDS);
    WWPN_List searched;
    for (uint32 i = 0; i < records; i++) {
        const RM_LOCALINDEX index = {0, i};
        RM_LOCALHBAINFO record = {};
        if (RM_GetLocalHBAInfo(&index, &record) != RM_STATUS_OK) continue;
        if (searched.isDuplicateEntryInWWPNList(record.wwpn)) continue;
        if (hasVPortNamed(record.wwpn, newWWPN, newWWNN)) duplicate = VPORT_WWPN;
    }
    return duplicate;
}

/// The answer for names that cannot be given to a port, or ANSWER_DONE.
uint32 refuseNames(const HBA_WWN& newWWPN, const HBA_WWN& newWWNN, Property<uint16>& operationStatus)
{
    if (RM_ValidateWwn(&newWWPN) == RM_STATUS_ILLEGAL_WWN) {
        NVR_LOG("The supplied 'New WWPN' is not valid");
        return libraryAnswer(RM_STATUS_ILLEGAL_WWN);
    }
    if (RM_ValidateWwn(&newWWNN) == RM_STATUS_ILLEGAL_WWN) {
        NVR_LOG("The supplied 'New WWNN' is not valid");
        return libraryAnswer(RM_STATUS_ILLEGAL_WWN);
    }
    if (const Duplicate duplicate = findDuplicate(newWWPN, newWWNN)) {
        NVR_LOG("%s", wordsOf(duplicate));
        operationStatus.set(static_cast<uint16>(duplicate));
        return answer_duplicate;
    }
    return ANSWER_DONE;
}

/// Calls, and calls again every second while the library is busy, for five minutes; the first time with a word.
/// `status` is that of the last call that came back, also if one throws.
template <class Call>
void callWhileBusy(const char* busy, uint32& status, Call call)
{
    status = call();
    for (int pass = 0; pass < busy_retries && status == RM_STATUS_WWN_BUSY; pass++) {
        if (pass == 0) NVR_LOG("%s", busy);
        status = call();
        agent_sleep.load()(busy_interval);
    }
}

/// What an activation code means to the operator: lines of the log, up to the first null.
struct Activation_Row {
    uint32 code;
    const char* words[3];
};

constexpr char reboot_required[] = "Reboot required to activate the new setting";
constexpr char reset_required[] = "Reset required to activate the new setting";
constexpr char until_power_down[] = "Volatile names will be active until system power-down or HBA power-cycle";
constexpr char restored[] = "WWNs restored successfully";

constexpr Activation_Row changes[] = {
    {RM_ACTIVATION_VOLATILE_REBOOT, {reboot_required, until_power_down}},
    {RM_ACTIVATION_NONVOLATILE_REBOOT, {reboot_required}},
    {RM_ACTIVATION_VOLATILE_RESET, {reset_required, until_power_down}},
    {RM_ACTIVATION_NONVOLATILE_RESET, {reset_required}},
};

constexpr Activation_Row restores[] = {
    {RM_ACTIVATION_ALREADY_ACTIVE, {"WWNs already active. No Restore needed"}},
    {RM_ACTIVATION_VOLATILE_REBOOT, {restored, reboot_required, until_power_down}},
    {RM_ACTIVATION_NONVOLATILE_REBOOT, {restored, reboot_required}},
    {RM_ACTIVATION_VOLATILE_RESET, {restored, "Reset the HBA to activate the new setting", until_power_down}},
    {RM_ACTIVATION_NONVOLATILE_RESET, {restored, "Please reset the HBA to activate the new setting"}},
};

/// Tells of a code and stores it; an unknown one leaves `operationStatus` as it is.
template <std::size_t N>
void tellActivation(const Activation_Row (&rows)[N], uint32 code, Property<uint16>& operationStatus)
{
    for (const Activation_Row& row : rows) {
        if (row.code != code) continue;
        for (const char* words : row.words)
            if (words) NVR_LOG("%s", words);
        operationStatus.set(static_cast<uint16>(code));
    }
}

/// What a status word of a reading means, by the type of names that were asked for.
struct Reading_Row {
    uint16 type;
    uint32 word;
    const char* words;
};

constexpr Reading_Row readings[] = {
    {RM_WWN_VOLATILE, RM_WWN_STATUS_VOLATILE_ACTIVE, "Volatile WWNs are active"},
    {RM_WWN_VOLATILE, RM_WWN_STATUS_NONE, "Volatile WWNs DO NOT EXIST on this adapter"},
    {RM_WWN_CURRENT, RM_WWN_STATUS_CURRENT_VOLATILE, "Current WWNs: Volatile"},
    {RM_WWN_CURRENT, RM_WWN_STATUS_CURRENT_NONVOLATILE, "Current WWNs: Non-Volatile"},
    {RM_WWN_CONFIGURED, RM_WWN_STATUS_NONE, "Configured WWNs DO NOT EXIST"},
    {RM_WWN_CONFIGURED, RM_ACTIVATION_VOLATILE_REBOOT, "Configured WWNs: Volatile (Activation required: warm reboot)"},
    {RM_WWN_CONFIGURED, RM_ACTIVATION_VOLATILE_RESET,
     "Configured WWNs: Volatile (Activation required: adapter restart)"},
    {RM_WWN_CONFIGURED, RM_ACTIVATION_NONVOLATILE_REBOOT,
     "Configured WWNs: Non-Volatile (Activation required: warm reboot)"},
    {RM_WWN_CONFIGURED, RM_ACTIVATION_NONVOLATILE_RESET,
     "Configured WWNs: Non-Volatile (Activation required: adapter restart)"},
};

void tellReading(uint16 type, uint32 word, Property<uint16>& operationStatus)
{
    if (type == RM_WWN_NONVOLATILE) NVR_LOG("Non-Volatile WWNs read successfully");
    if (type == RM_WWN_FACTORY) NVR_LOG("Factory Default WWNs read successfully");
    for (const Reading_Row& row : readings) {
        if (row.type != type || row.word != word) continue;
        NVR_LOG("%s", row.words);
        operationStatus.set(static_cast<uint16>(word));
    }
}

void logReadFailure(uint16 type, uint32 status)
{
    if (status == RM_STATUS_WWN_NOT_AVAILABLE)
        NVR_LOG("WWN Management is NOT AVAILABLE on this adapter");
    else if (status == RM_STATUS_WWN_NOT_SUPPORTED && type == RM_WWN_VOLATILE)
        NVR_LOG("Volatile WWNs are NOT SUPPORTED on this adapter");
    else
        NVR_LOG("ReadWWN: RM_ReadWWN call failed with error: %d", static_cast<int>(status));
}

} // namespace

uint32 NVR_MethodWrapper::ChangeWWN(const HBA_WWN& port, const HBA_WWN& newWWPN, const HBA_WWN& newWWNN, uint16 type,
                                    Property<uint16>& operationStatus)
{
    uint32 refusal = ANSWER_DONE;
    uint32 status = RM_STATUS_ERROR; // until the library has answered
    uint32 code = 0;
    const bool done = guarded([&] {
        refusal = refuseNames(newWWPN, newWWNN, operationStatus);
        if (refusal != ANSWER_DONE) return;
        NVR_LOG("ChangeWWN operation initiated");
        callWhileBusy("Validating new WWNs...", status,
                      [&] { return RM_ChangeWWN(port, newWWPN, newWWNN, type, &code); });
    });
    if (refusal != ANSWER_DONE) return refusal;
    if (!done) NVR_LOG("Error in RM_ChangeWWN");
    if (status == RM_STATUS_OK) {
        NVR_LOG("New WWNs written successfully");
        tellActivation(changes, code, operationStatus);
        return ANSWER_DONE;
    }
    if (status == RM_STATUS_WWN_NOT_AVAILABLE) NVR_LOG("WWN Management is not available on this HBA");
    if (status == RM_STATUS_WWN_NOT_SUPPORTED) NVR_LOG("WWN NOT SUPPORTED");
    NVR_LOG("ChanngeWWN: RM_ChangeWWN call failed with error: %d", static_cast<int>(status));
    return libraryAnswer(status);
}

// A refused restore is not passed on, and the service goes on as after one that was done.
uint32 NVR_MethodWrapper::RestoreWWN(const HBA_WWN& port, uint16 type, Property<uint16>& operationStatus)
{
    NVR_LOG("RestoreWWN operation initiated.");
    uint32 status = RM_STATUS_ERROR;
    uint32 code = 0;
    const bool done =
        guarded([&] { callWhileBusy("Restoring WWNs...", status, [&] { return RM_RestoreWWN(port, type, &code); }); });
    if (!done) NVR_LOG("Error in RestoreWWN");
    if (status == RM_STATUS_OK) tellActivation(restores, code, operationStatus);
    return ANSWER_DONE;
}

uint32 NVR_MethodWrapper::ReadWWN(const HBA_WWN& port, uint16 type, Property<String>& WWPN, Property<String>& WWNN,
                                  Property<uint16>& operationStatus)
{
    operationStatus.set(0);
    HBA_WWN portName = {};
    HBA_WWN nodeName = {};
    uint32 word = 0;
    if (const uint32 status = RM_ReadWWN(port, type, &portName, &nodeName, &word)) {
        logReadFailure(type, status);
        return libraryAnswer(status);
    }
    tellReading(type, word, operationStatus);
    if (type == RM_WWN_CONFIGURED && word == RM_WWN_STATUS_NONE) return ANSWER_DONE;
    const std::string portText = wwnLowerText(portName);
    const std::string nodeText = wwnLowerText(nodeName);
    NVR_LOG("WWPN: %s", portText.c_str());
    NVR_LOG("WWNN: %s", nodeText.c_str());
    WWPN.set(portText.c_str());
    WWNN.set(nodeText.c_str());
    return ANSWER_DONE;
}

uint32 NVR_MethodWrapper::GetWWNCapability(const HBA_WWN& port, Property<uint32>& capability)
{
    uint32 word = 1;
    if (const uint32 status = RM_GetWWNCapability(port, &word)) {
        if (status == RM_STATUS_WWN_NOT_AVAILABLE) NVR_LOG("WWN Management is not available on this HBA");
        NVR_LOG("GetWWNCapability: RM_ReadWWNCapability call failed with error: %d", static_cast<int>(status));
        return libraryAnswer(status);
    }
    capability.set(word);
    if (word & RM_WWN_READ_ONLY) NVR_LOG("Read Only mode: World Wide Name Management is not supported in this mode");
    NVR_LOG(word & RM_WWN_CAN_NONVOLATILE ? "Can change Non-Volatile WWNs" : "Cannot change Non-Volatile WWNs");
    NVR_LOG(word & RM_WWN_CAN_VOLATILE ? "Can change Volatile WWNs" : "Cannot change Volatile WWNs");
    if (word & RM_WWN_NEEDS_REBOOT) NVR_LOG("Activation requirement: Reboot");
    if (word & RM_WWN_NEEDS_RESET) NVR_LOG("Activation requirement: Reset HBA");
    return ANSWER_DONE;
}

} // namespace cimple
