#include "simulator/Firmware.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

namespace nvrsim {

namespace {

struct Header {
    char magic[8];
    uint32_t format;
    uint32_t size;
    uint32_t checksum; // CRC-32 of the payload
    char version[32];
    uint32_t reserved[3];
};
static_assert(sizeof(Header) == 64, "firmware header");

constexpr char magic[8] = {'N', 'V', 'R', 'F', 'W', 'I', 'M', 'G'};
constexpr off_t largestFile = 64 << 20;

constexpr std::array<uint32_t, 256> make_crc_table()
{
    std::array<uint32_t, 256> table{};
    for (uint32_t byte = 0; byte < table.size(); ++byte) {
        uint32_t crc = byte;
        for (int bit = 0; bit < 8; ++bit)
            crc = crc >> 1 ^ (crc & 1 ? 0xEDB88320u : 0);
        table[byte] = crc;
    }
    return table;
}

uint32_t crc32(const char* data, size_t size)
{
    static constexpr std::array<uint32_t, 256> table = make_crc_table();
    uint32_t crc = ~0u;
    for (size_t i = 0; i < size; ++i)
        crc = crc >> 8 ^ table[(crc ^ static_cast<uint8_t>(data[i])) & 0xFF];
    return ~crc;
}

} // namespace

Firmware_Check read_firmware(const char* path, Firmware_Image& image)
{
    const int file = ::open(path, O_RDONLY | O_CLOEXEC | O_NONBLOCK);
    if (file < 0) return Firmware_Check::unreadable;
    struct stat status;
    std::vector<char> content;
    bool readable = ::fstat(file, &status) == 0 && S_ISREG(status.st_mode);
    if (readable && status.st_size <= largestFile) {
        content.resize(static_cast<size_t>(status.st_size));
        size_t used = 0;
        for (ssize_t got; used < content.size(); used += static_cast<size_t>(got))
            if ((got = ::read(file, content.data() + used, content.size() - used)) <= 0) break;
        content.resize(used);
    }
    ::close(file);
    if (!readable) return Firmware_Check::unreadable;

    Header header;
    if (content.size() < sizeof header) return Firmware_Check::damaged;
    std::memcpy(&header, content.data(), sizeof header);
    if (std::memcmp(header.magic, magic, sizeof magic) != 0 || header.format != 1 ||
        header.size != content.size() - sizeof header ||
        header.checksum != crc32(content.data() + sizeof header, header.size))
        return Firmware_Check::damaged;
    image.version.assign(header.version, ::strnlen(header.version, sizeof header.version));
    image.size = header.size;
    return Firmware_Check::good;
}

std::string make_firmware(const std::string& version, uint32_t size)
{
    std::string payload(size, '\0');
    for (size_t i = 0; i < payload.size(); ++i)
        payload[i] = static_cast<char>(i * 131 + 7);
    Header header{};
    std::memcpy(header.magic, magic, sizeof magic);
    header.format = 1;
    header.size = size;
    header.checksum = crc32(payload.data(), payload.size());
    std::memcpy(header.version, version.data(), std::min(version.size(), sizeof header.version - 1));
    return std::string(reinterpret_cast<const char*>(&header), sizeof header) + payload;
}

} // namespace nvrsim
