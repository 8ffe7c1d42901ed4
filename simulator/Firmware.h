// Firmware images of the simulated adapters: a header with version, size and checksum, then the payload.
#ifndef _simulator_Firmware_h
#define _simulator_Firmware_h

#include <cstdint>
#include <string>

namespace nvrsim {

struct Firmware_Image {
    std::string version;
    uint32_t size = 0;
};

enum class Firmware_Check { good, unreadable, damaged };

/// Reads and checks a file; only a regular one of 64 MiB at most.
Firmware_Check read_firmware(const char* path, Firmware_Image& image);

/// An image with a payload of `size` bytes, for tests and demonstrations.
std::string make_firmware(const std::string& version, uint32_t size);

} // namespace nvrsim

#endif // _simulator_Firmware_h
