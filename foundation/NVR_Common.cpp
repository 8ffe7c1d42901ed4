#include "foundation/NVR_Common.h"

#include <cctype>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <exception>

#include "foundation/CLogger.h"
#include "foundation/open_file.h"

namespace cimple {

namespace {

bool is_hex_digit(char c)
{
    return (c >= '0' && c <= '9') || (c >= 'A' && c <= 'F') || (c >= 'a' && c <= 'f');
}

bool is_digit(char c)
{
    return c >= '0' && c <= '9';
}

uint8 hex_digit(char c)
{
    if (is_digit(c)) return static_cast<uint8>(c - '0');
    return static_cast<uint8>((c | 0x20) - 'a' + 10);
}

// What sscanf's "%02x" reads from text of hexadecimal digits and blanks: blanks are passed over, then one or two
// digits.
bool read_byte(const char* text, uint8& byte)
{
    while (*text == ' ')
        text++;
    if (!is_hex_digit(*text)) return false;
    byte = hex_digit(*text++);
    if (is_hex_digit(*text)) byte = static_cast<uint8>(byte << 4 | hex_digit(*text));
    return true;
}

// Prints bytes as pairs of digits; `separator` 0: none. `text` has room for them and a terminator.
void print_bytes(char* text, const uint8* bytes, std::size_t size, const char (&digits)[17], char separator)
{
    for (std::size_t i = 0; i < size; i++) {
        if (i > 0 && separator) *text++ = separator;
        *text++ = digits[bytes[i] >> 4];
        *text++ = digits[bytes[i] & 15];
    }
    *text = '\0';
}

constexpr char upper_case_digits[] = "0123456789ABCDEF";
constexpr char lower_case_digits[] = "0123456789abcdef";

constexpr std::size_t colon_text_length = 23;

bool is_separator_place(std::size_t place)
{
    return place % 3 == 2;
}

} // namespace

int wwn2String(char* text, const HBA_WWN& wwn)
{
    if (text) print_bytes(text, wwn.wwn, sizeof wwn.wwn, upper_case_digits, 0);
    return 0;
}

std::string wwnText(const HBA_WWN& wwn)
{
    char text[wwn_text_size];
    wwn2String(text, wwn);
    return text;
}

std::string wwnColonText(const HBA_WWN& wwn)
{
    char text[colon_text_length + 1];
    print_bytes(text, wwn.wwn, sizeof wwn.wwn, upper_case_digits, ':');
    return text;
}

std::string wwnLowerText(const HBA_WWN& wwn)
{
    char text[colon_text_length + 1];
    print_bytes(text, wwn.wwn, sizeof wwn.wwn, lower_case_digits, ':');
    return text;
}

std::string macText(const uint8 (&mac)[6], char separator)
{
    char text[18];
    print_bytes(text, mac, sizeof mac, lower_case_digits, separator);
    return text;
}

int string2HBAName(HBA_WWN* wwn, const char* text)
{
    bool valid = wwn && text && std::strlen(text) == 16;
    for (std::size_t i = 0; valid && i < 16; i++)
        valid = is_hex_digit(text[i]);
    if (!valid) {
        NVR_LOG("INVALID WWN");
        return 0;
    }
    for (std::size_t i = 0; i < sizeof wwn->wwn; i++)
        wwn->wwn[i] = static_cast<uint8>(hex_digit(text[2 * i]) << 4 | hex_digit(text[2 * i + 1]));
    return 1;
}

int Id2HBAName(char* name, const char* id)
{
    if (!name || !id) {
        NVR_LOG("Null pointer argument in one of the arguments");
        return 1;
    }
    NVR_LOG("Entering NVR_MethodWrapper::Id2HBAName");
    NVR_LOG("DeviceID is:: %s", id);
    if (*id == '"') id++;
    for (std::size_t place = 0; place < colon_text_length; place++) {
        if (is_separator_place(place))
            name[place] = ':';
        else
            name[place] = *id ? *id++ : '\0';
    }
    name[colon_text_length] = '\0';
    NVR_LOG("HBA Name is:: %s", name);
    return 0;
}

int str2HBAName(HBA_WWN* wwn, const char* text)
{
    NVR_LOG("Entering NVR_MethodWrapper::str2HBAName");
    if (!wwn) {
        NVR_LOG("Null pointer assignment in argument pHBAName");
        return 1;
    }
    if (!text || std::strlen(text) != colon_text_length) {
        NVR_LOG("INVALID HBA Name");
        return 1;
    }
    NVR_LOG("wwpn:( %s ) ", text);
    for (std::size_t place = 0; place < colon_text_length; place++) {
        const char c = text[place];
        // A blank passes here, and fails below, where the text is split at colons.
        if (is_separator_place(place) ? c == ':' || c == ' ' : is_hex_digit(c)) continue;
        NVR_LOG("INVALID HBA Name");
        return 1;
    }
    char copy[colon_text_length + 1];
    std::memcpy(copy, text, sizeof copy);
    char* rest = nullptr;
    char* token = ::strtok_r(copy, ":", &rest);
    for (uint8& byte : wwn->wwn) {
        if (!token || !read_byte(token, byte)) {
            NVR_LOG("INVALID HBA Name");
            return 1;
        }
        token = ::strtok_r(nullptr, ":", &rest);
    }
    const uint8* b = wwn->wwn;
    NVR_LOG("After tokenizing wwpn:( %2x %2x %2x %2x %2x %2x %2x %2x )", b[0], b[1], b[2], b[3], b[4], b[5], b[6],
            b[7]);
    return 0;
}

uint32 mac2HBAName(char* name, const char* mac)
{
    constexpr std::size_t mac_length = 17;
    if (!name || !mac || std::strlen(mac) != mac_length) return NVR_FAILURE;
    for (std::size_t place = 2; place < mac_length; place += 3)
        if (mac[place] != '-') return NVR_FAILURE;
    for (std::size_t place = 0; place < mac_length; place++)
        name[place] = is_separator_place(place) ? ':' : mac[place];
    std::strcpy(name + mac_length, ":00:00");
    return 0;
}

void printDescriptor(char* text, const DeviceIdentifier& descriptor)
{
    NVR_LOG("Entered");
    const uint32 length = descriptor.identifierLength;
    if (length == 16 || length == 12 || length == 8) {
        print_bytes(text, descriptor.identifier, length, upper_case_digits, 0);
        return;
    }
    *text = '\0';
    NVR_LOG("INVALID Descriptor");
}

static uint32 parse_version(const char* text, NVR_Version& version)
{
    const std::size_t size = std::strlen(text);
    const bool valid = size >= 6 && is_digit(text[0]) && text[1] == '.' && is_digit(text[2]) && is_digit(text[3]) &&
                       std::isalpha(static_cast<unsigned char>(text[4])) && is_digit(text[5]);
    if (!valid) {
        NVR_LOG("parseVersion Error: Invalid Firmware String");
        return NVR_FAILURE;
    }
    NVR_LOG("Parsed the major, minor, revision & build numbers");
    // islower answers a flag, not the letter, so a test release is hardly ever recognised. Clients compare versions
    // that were parsed like this.
    if (size > 7 && text[6] != ' ' && std::islower(static_cast<unsigned char>(text[6])) == 'r') {
        if (!is_digit(text[7])) {
            NVR_LOG("parseVersion Error: Invalid Firmware String");
            return NVR_FAILURE;
        }
        NVR_LOG("parseVersion: This seems to be a Test Release Firmware...");
        version.testRelease.append("r");
        version.testRelease.append(text[7]);
        NVR_LOG("Parsed the revision for Test Firmwares");
    }
    version.major = static_cast<uint16>(text[0] - '0');
    version.minor = static_cast<uint16>(text[2] - '0');
    version.revision = static_cast<uint16>(text[3] - '0');
    version.build = static_cast<uint16>(text[5] - '0');
    NVR_LOG("Filled Major, Minor, Revision & Build Numbers");
    version.releaseType.append(text[4]);
    NVR_LOG("Filled ReleaseType");
    NVR_LOG("parseVersion: Version parsing success");
    return 0;
}

uint32 parseVersion(const char* text, NVR_Version& version)
{
    NVR_LOG("Input Version String: [%s]", text ? text : "");
    if (!text) {
        NVR_LOG("parseVersion Error: Input FirmwareVersion is Null");
        return NVR_FAILURE;
    }
    try {
        return parse_version(text, version);
    } catch (const std::exception&) {
        NVR_LOG("parseVersion: error occurred while parsing...");
        return NVR_FAILURE;
    }
}

// Reads a whole file, up to 1 MiB: no banner is longer, and what is not a plain file may claim any size.
static uint32 read_distribution(std::FILE* file, String& distribution)
{
    std::fseek(file, 0, SEEK_END);
    const long end = std::ftell(file);
    const std::size_t size = end > 0 ? static_cast<std::size_t>(end) : 0;
    std::unique_ptr<char, decltype(&std::free)> text(
        static_cast<char*>(size <= 1024 * 1024 ? std::malloc(size + 1) : nullptr), &std::free);
    if (!text) {
        NVR_LOG("Unable to allocate the memory to store OSDistributionName");
        return NVR_FAILURE;
    }
    std::fseek(file, 0, SEEK_SET);
    const std::size_t got = std::fread(text.get(), 1, size, file);
    text.get()[got] = '\0';
    distribution = text.get();
    return 0;
}

uint32 getOSInformation(String& name, String& distribution)
{
    try {
        name = "Unknown";
        distribution = "Unknown";
        NVR_LOG("Under _LINUX -- getting the os name and version");
        File version = open_file("/proc/version", "r");
        if (!version) {
            const int error = errno;
            NVR_LOG("ifstream error no %d", error);
            return NVR_FAILURE;
        }
        char line[256] = "";
        if (!std::fgets(line, sizeof line, version.get())) line[0] = '\0';
        line[std::strcspn(line, "\n")] = '\0';
        name = line;
        NVR_LOG("Under _LINUX -- Getting the OS Distribution Name");
        File issue = open_file("/etc/issue", "r");
        if (!issue) {
            NVR_LOG("Unable to open the /etc/issue file to get OSDistribution Name");
            return NVR_FAILURE;
        }
        return read_distribution(issue.get(), distribution);
    } catch (const std::exception&) {
        return NVR_FAILURE;
    }
}

void printField(const char* name, int value)
{
    NVR_LOG("%s: %d", name, value);
}

void printField(const char* name, const char* value)
{
    NVR_LOG("%s: %s", name, value ? value : "");
}

void printField(const char* name)
{
    NVR_LOG("%s: ", name);
}

} // namespace cimple
