#include "tests/module/support/Service_Methods.h"

#include <filesystem>

#include "tests/module/support/Firmware.h"
#include "tests/support/private_host.h"

namespace nvrtest {

namespace {

constexpr char image_path[] = "/var/log/an.image";
constexpr char table_path[] = "/var/log/a.table";

} // namespace

std::vector<Service_Method> service_methods()
{
    const char* const names = "NVRHBA_FCHBAWWNService";
    const char* const firmware = "NVRHBA_SoftwareInstallationService";
    const char* const params = "NVRHBA_FCHBADriverParamService";
    const char* const boot = "NVRHBA_BootBIOSService";
    const char* const tags = "NVRHBA_FCTagService";
    const char* const dumps = "NVRHBA_DumpService";
    const auto type = [](std::uint16_t value) { return host::Named_Value{"Type", host::Value::uint16(value)}; };
    std::vector<host::Value> bytes;
    for (const char byte : image(new_version, 10))
        bytes.push_back(host::Value::uint8(static_cast<std::uint8_t>(byte)));
    const Arguments image_bytes = {{"Image", host::Value::array(CMPI_uint8, bytes)},
                                   {"InstallOptions", options_value({32768})},
                                   {"InstallOptionsValues", texts_value({"a.copy"})}};
    const Arguments new_names = {{"NewWWPN", host::Value::string("10000000C9A0F001")},
                                 {"NewWWNN", host::Value::string("20000000C9A0F001")},
                                 type(1)};
    return {
        {names, "ChangeWWN", new_names, 32968, 32968, 32968, 0, true, "RM_ChangeWWN"},
        {names, "RestoreWWN", {type(0)}, 32968, 32968, 32968, 0, true, "RM_RestoreWWN"},
        {names, "ReadWWN", {type(2)}, 32968, 32968, 32968, 0, false, "RM_ReadWWN"},
        {names, "GetWWNCapability", {}, 32968, 32968, 32968, 0, false, "RM_GetWWNCapability"},
        {firmware,
         "InstallFromURI",
         {{"URI", host::Value::string(image_path)}},
         4097,
         32968,
         32968,
         40001,
         true,
         "RM_DownloadFirmware"},
        {firmware, "InstallFromByteStream", image_bytes, 4097, 32968, 32968, 40001, true, "RM_DownloadFirmware"},
        {firmware, "ResetHBA", {}, 32968, 32968, 32968, 40001, true, "RM_ResetHBA"},
        {firmware,
         "SetPortEnabled",
         {{"PortEnabled", host::Value::boolean(true)}},
         32968,
         32968,
         32968,
         0,
         false,
         "RM_SetPortEnabled"},
        {params,
         "SetDriverParameter",
         {{"strParam", host::Value::string("lun-queue-depth")}, {"strValue", host::Value::string("64")}},
         32968,
         32968,
         32968,
         40001,
         false,
         "RM_SetDriverParam"},
        {boot, "EnableBootBIOS", {}, 32968, 32968, 32968, 40001, false, "RM_SetBootBiosState"},
        {boot, "DisableBootBIOS", {}, 32968, 32968, 32968, 40001, false, "RM_SetBootBiosState"},
        {boot, "GetBootBIOSStatus", {}, 32968, 32968, 32968, 40001, false, "RM_GetAttributeValue"},
        {tags, "GetGlobalFlag", {}, 4097, 4097, 32968, 0, false, "CPQFC_QoSGetGlobalFlag"},
        {tags,
         "SetGlobalFlag",
         {{"State", host::Value::uint32(1)}},
         4097,
         4097,
         32968,
         0,
         false,
         "CPQFC_QoSSetGlobalFlag"},
        {tags,
         "GetConfigTable",
         {{"URI", host::Value::string("a.table")}},
         4097,
         4097,
         32968,
         0,
         false,
         "CPQFC_QoSGetConfig"},
        {tags,
         "SetConfigTable",
         {{"URI", host::Value::string(table_path)}},
         4097,
         4097,
         32968,
         0,
         false,
         "CPQFC_QoSSetConfig"},
        {dumps, "GenerateDump", {}, 32968, 32968, 32968, 40001, false, "RM_GenerateDump"},
        {dumps, "GetDumpFileNames", {}, 32968, 32968, 32968, 40001, false, "RM_GetDumpFileNames"},
        {dumps, "DeleteDump", {}, 32968, 32968, 32968, 40001, false, "RM_DeleteDumpFiles"},
    };
}

void prepare_service_files()
{
    for (const char* folder : {firmware_folder, dump_folder})
        std::filesystem::create_directories(folder);
    std::filesystem::current_path(firmware_folder);
    write_image(image_path);
    write_file(table_path,
               "<ApexConfig><theSystem><ApexVersion/><CreationDate/><HostName/><Adapter/></theSystem>"
               "<Configuration><numberOfEntries>1</numberOfEntries><Row><src_wwpn>10000000C9A00001</src_wwpn>"
               "<tgt_wwpn>50060E8005A10000</tgt_wwpn><tag>1</tag></Row></Configuration></ApexConfig>");
}

} // namespace nvrtest
