#include "tests/module/support/Firmware.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <sys/mount.h>
#include <unistd.h>

#include "simulator/nvrsim.h"
#include "tests/support/private_host.h"

namespace nvrtest {

namespace {

Rig_Options rig_options(const host::Manner& manner, const std::string& scenario)
{
    std::filesystem::create_directories(firmware_folder);
    std::filesystem::create_directories(served_folder);
    if (::chdir(firmware_folder) != 0) throw std::runtime_error("cannot stand in the folder");
    Rig_Options options;
    options.manner = manner;
    options.scenario = scenario;
    return options;
}

std::string number(std::uint32_t value)
{
    return std::to_string(static_cast<std::int32_t>(value));
}

} // namespace

Firmware_Host::Firmware_Host(const host::Manner& manner, const std::string& scenario)
    : rig(rig_options(manner, scenario)), service(rig, "NVRHBA_SoftwareInstallationService")
{
}

Called Firmware_Host::install(const std::string& uri, const std::vector<std::uint16_t>& options)
{
    return service.call(
        "InstallFromURI",
        {{"URI", host::Value::string(uri)}, {"Target", target()}, {"InstallOptions", options_value(options)}});
}

Called Firmware_Host::install_bytes(const std::string& image, const std::vector<std::uint16_t>& options,
                                    const std::vector<std::string>& values)
{
    std::vector<host::Value> bytes;
    for (const char byte : image)
        bytes.push_back(host::Value::uint8(static_cast<std::uint8_t>(byte)));
    return service.call("InstallFromByteStream", {{"Image", host::Value::array(CMPI_uint8, bytes)},
                                                  {"Target", target()},
                                                  {"InstallOptions", options_value(options)},
                                                  {"InstallOptionsValues", texts_value(values)}});
}

std::string image(const std::string& version, std::uint32_t payload)
{
    const std::string path = "/var/log/made.image";
    if (nvrsim_make_firmware(path.c_str(), version.c_str(), payload) != 0) throw std::runtime_error("no image");
    std::string bytes = read_file(path);
    remove(path);
    return bytes;
}

void write_image(const std::string& path, const std::string& version)
{
    write_file(path, image(version));
}

std::vector<std::string> names_in(const std::string& folder)
{
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(folder))
        names.push_back(entry.path().filename());
    std::sort(names.begin(), names.end());
    return names;
}

void mount_small_disk(const std::string& folder, unsigned kilobytes)
{
    const std::string size = "size=" + std::to_string(kilobytes) + "k";
    if (::mount("tmpfs", folder.c_str(), "tmpfs", 0, size.c_str()) != 0) throw std::runtime_error("no small disk");
}

host::Value options_value(const std::vector<std::uint16_t>& options)
{
    std::vector<host::Value> values;
    for (const std::uint16_t option : options)
        values.push_back(host::Value::uint16(option));
    return host::Value::array(CMPI_uint16, values);
}

host::Value texts_value(const std::vector<std::string>& texts)
{
    std::vector<host::Value> values;
    for (const std::string& text : texts)
        values.push_back(host::Value::string(text));
    return host::Value::array(CMPI_string, values);
}

Words options_words(std::size_t count, unsigned first)
{
    return {"size of InstallOptions array = " + std::to_string(count) + ", first member " + std::to_string(first)};
}

Words local_file(const std::string& path)
{
    return {"Inside NVR_MethodWrapper::downloadFileUsingCurl", "filename is : " + path};
}

Words importing(const std::string& path, std::uint32_t status)
{
    return joined({{"entering the nvrcimDownloadFW function"},
                   local(),
                   {"\n firmware file name \"" + path + "\"\n", "\n: RM_ImportHBAFile: status = " + number(status)}});
}

Words verifying(std::uint32_t status)
{
    return {"wwpn 10  0  0  0 c9 a0  0  1", "\n: RM_VerifyFirmware: status = " + number(status)};
}

Words downloading(std::uint32_t status)
{
    std::string told = "\nERROR: RM_DownloadFirmware: status = " + number(status);
    if (status == 148) told = "\nERROR: RM_DownloadFirmware: Mailbox failed; Internal Driver Error.\n";
    if (status == 149) told = "\nERROR: RM_DownloadFirmware: Mailbox timed out.\n";
    if (status == 150) told = "\nERROR: RM_DownloadFirmware: Mailbox busy; retry.\n";
    return {"Starting Firmware download", "Checking Firmware download status", told};
}

Words downloaded(const std::string& path)
{
    return joined({importing(path), verifying(), downloading(), {status_line(0)}});
}

Words reset_by_option()
{
    return joined(
        {{"HBA RESET OPTION SELECTED", "NVR_MethodWrapper::nvrcimReset"},
         local(),
         {"WWN 10:00:00:00:C9:A0:00:01 is reset", "Fiwmware download functionality complete with Reset on the HBA"}});
}

} // namespace nvrtest
