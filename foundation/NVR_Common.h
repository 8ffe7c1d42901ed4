/// Helpers that run through the whole module: the text forms of World Wide Names, firmware versions, the operating
/// system's name, and the log's way of printing a field.
///
/// Pure functions; any thread. A WWN in memory is 8 bytes, byte 0 first (HBA_WWN). Its texts: plain, 16 upper-case
/// digits, as in CIM keys; with colons, 23 characters, as `Id2HBAName` makes and `str2HBAName` takes.
#pragma once

#include <cstddef>
#include <string>

#include "foundation/management_api.h"
#include "runtime/String.h"
#include "runtime/Type.h"

namespace cimple {

/// The module's general failure number.
constexpr uint32 NVR_FAILURE = 32769;

constexpr std::size_t wwn_text_size = 17;        ///< plain form with its terminator
constexpr std::size_t hba_name_size = 256;       ///< what Id2HBAName fills
constexpr std::size_t mac_name_text_size = 24;   ///< what mac2HBAName fills
constexpr std::size_t descriptor_text_size = 33; ///< the longest text of printDescriptor

/// Writes the plain form of `wwn` to `text` (`wwn_text_size` bytes; null: nothing is written). Result 0, always.
int wwn2String(char* text, const HBA_WWN& wwn);
/// The plain form of `wwn`.
std::string wwnText(const HBA_WWN& wwn);
/// "%02X:%02X:..." and "%02x:%02x:...".
std::string wwnColonText(const HBA_WWN& wwn);
std::string wwnLowerText(const HBA_WWN& wwn);
/// A MAC address with `separator` ("-" or ":") between lower-case pairs.
std::string macText(const uint8 (&mac)[6], char separator);

/// Reads the plain form (exactly 16 hexadecimal digits). Result 1; 0 for anything else, which is logged.
int string2HBAName(HBA_WWN* wwn, const char* text);

/// Puts colons between the digits of an identifier, skipping a double quote in front: `name` (`hba_name_size` bytes)
/// becomes 23 characters and a terminator. `id` is not checked; behind its end come zero bytes, which `str2HBAName`
/// refuses. Result 0, or 1 for a null argument.
int Id2HBAName(char* name, const char* id);

/// Reads the form with colons, digits in either case. Result 0, or 1 for anything else, which is logged; some bytes of
/// `wwn` may be written then.
int str2HBAName(HBA_WWN* wwn, const char* text);

/// Turns "00-00-c9-12-34-56" into "00:00:c9:12:34:56:00:00", the shape of a WWN with two zero bytes at its end
/// (`mac_name_text_size` bytes). Result 0, or NVR_FAILURE for anything else; nothing is written then.
uint32 mac2HBAName(char* name, const char* mac);

/// The first identification descriptor of a device's page 0x83. The lengths are as the device reports them; bytes of
/// `identifier` that it did not send are zero.
struct DeviceIdentifier {
    uint8 deviceType = 0;
    uint8 pageCode = 0;
    uint32 pageLength = 0;
    uint32 identifierType = 0;
    uint32 identifierLength = 0;
    uint8 identifier[256] = {};
};

/// Prints an identifier of 16, 12 or 8 bytes as upper-case digits (`text`: `descriptor_text_size` bytes). Other lengths
/// give an empty text and are logged.
void printDescriptor(char* text, const DeviceIdentifier& descriptor);

/// A firmware version such as "1.23a4", taken apart.
struct NVR_Version {
    uint16 major = 0;
    uint16 minor = 0;
    uint16 revision = 0;
    uint16 build = 0;
    String releaseType;
    String testRelease;
};

/// Reads a version of the shape digit, ".", digit, digit, letter, digit; more may follow. The two texts are appended
/// to. Result 0, or NVR_FAILURE for another shape; throws nothing.
uint32 parseVersion(const char* text, NVR_Version& version);

/// The first line of "/proc/version" and the whole of "/etc/issue". Result 0, or NVR_FAILURE; what could not be read is
/// "Unknown". Throws nothing.
uint32 getOSInformation(String& name, String& distribution);

/// Log "name: value" or "name: ".
void printField(const char* name, int value);
void printField(const char* name, const char* value);
void printField(const char* name);

/// The text in a fixed field of a library's record, which may fill it without a terminator.
template <std::size_t N>
std::string fieldText(const char (&field)[N])
{
    std::size_t size = 0;
    while (size < N && field[size])
        size++;
    return std::string(field, size);
}

} // namespace cimple
