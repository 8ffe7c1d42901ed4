/// What the tests of the firmware service share: a host with a folder of the test's own to stand in, images, the
/// simulated ports, and the words of a download.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "tests/module/support/Service.h"

namespace nvrtest {

/// Where the program stands: what a server fetches lands here.
constexpr char firmware_folder[] = "/var/log/firmware";
/// What file servers of a test serve.
constexpr char served_folder[] = "/var/log/served";

constexpr char new_version[] = "2.09b7";

class Firmware_Host {
public:
    explicit Firmware_Host(const host::Manner& manner = host::Manner::strict(),
                           const std::string& scenario = "typical");

    Rig rig;
    Service service;

    /// The first port, or another.
    host::Value target(std::size_t place = 0) { return port(rig, place); }
    Called install(const std::string& uri, const std::vector<std::uint16_t>& options = {});
    Called install_bytes(const std::string& image, const std::vector<std::uint16_t>& options,
                         const std::vector<std::string>& values);
};

/// The bytes of an image that the simulated adapters take; and the same in a file.
std::string image(const std::string& version = new_version, std::uint32_t payload = 5000);
void write_image(const std::string& path, const std::string& version = new_version);
/// The names in a folder, sorted.
std::vector<std::string> names_in(const std::string& folder);

/// Mounts a disk of so many kilobytes over a folder.
void mount_small_disk(const std::string& folder, unsigned kilobytes);

host::Value options_value(const std::vector<std::uint16_t>& options);
host::Value texts_value(const std::vector<std::string>& texts);

// ---- Words.

Words options_words(std::size_t count, unsigned first);
/// Of a file that is not fetched.
Words local_file(const std::string& path);
/// The start of a download to a port, with its image found, up to the library's answer to the import.
Words importing(const std::string& path, std::uint32_t status = 0);
/// The library's answer to the verification by the first port.
Words verifying(std::uint32_t status = 0);
/// The library's answer to the download.
Words downloading(std::uint32_t status = 0);
/// A whole good download to the first port.
Words downloaded(const std::string& path);
/// A reset of the first port, as an install asks for it.
Words reset_by_option();

} // namespace nvrtest
