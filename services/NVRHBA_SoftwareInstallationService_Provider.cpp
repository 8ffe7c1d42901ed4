#include "services/NVRHBA_SoftwareInstallationService_Provider.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "classes/CIM_ManagedElement.h"
#include "foundation/CLogger.h"
#include "foundation/open_file.h"
#include "foundation/shared_operations.h"
#include "services/NVR_MethodWrapper.h"
#include "services/service_method.h"

namespace cimple {

namespace {

constexpr uint32 reset_not_supported = 2;

constexpr char provider_name[] = "NVRHBA_SoftwareInstallationService_Provider";
constexpr char firmware_service[] = "NVRHBA_FCSoftwareInstallationService";
constexpr char converged_service[] = "NVRVCNA_SoftwareInstallationService";

// Options of the install methods; 4, 5, 6, 7 and 11 are accepted and have no effect.
constexpr uint16 option_reset = 2;
constexpr uint16 option_file = 32768; // its value is the path of the file that takes the image

bool isOption(uint16 option)
{
    switch (option) {
    case option_reset:
    case 4:
    case 5:
    case 6:
    case 7:
    case 11:
        return true;
    }
    return false;
}

using Options = Array<uint16>;

void logOptions(const Options& options)
{
    NVR_LOG("size of InstallOptions array = %d, first member %u", static_cast<int>(options.size()),
            options.size() ? options[0] : 0u);
}

bool isService(ProviderAgent& agent, const Instance* self)
{
    if (isAnyService(agent.m_NVRHBA_SoftwareInstallationService_map, self)) return true;
    NVR_LOG("Invalid instance of Software Installation Service");
    return false;
}

bool isNamed(const NVRHBA_SoftwareInstallationService* self, const char* name)
{
    return !self->Name.null && std::strcmp(self->Name.value.c_str(), name) == 0;
}

/// Removes a file at the scope's end, unless it was removed, or is to stay.
class Passing_File {
public:
    Passing_File(const char* path, bool passes) : m_path(passes ? path : nullptr) {}
    ~Passing_File()
    {
        if (m_path) ::unlink(m_path);
    }
    Passing_File(const Passing_File&) = delete;
    Passing_File& operator=(const Passing_File&) = delete;

    void stays() { m_path = nullptr; }
    void removeNow()
    {
        NVR_LOG("nvrcimDownloadFW: Removing the FW file from CIMOM's repository ");
        if (!m_path) return;
        struct stat status;
        if (::stat(m_path, &status) == 0 && ::unlink(m_path) == 0)
            NVR_LOG("nvrcimDownloadFW: FW file %s removed successfully", m_path);
        else
            NVR_LOG("nvrcimDownloadFW: Can't stat file %s", m_path);
        m_path = nullptr;
    }

private:
    const char* m_path;
};

/// 0, or the return value for an image that is no file.
uint32 findImage(const char* path)
{
    switch (fault_of_file(path)) {
    case 0:
        return ANSWER_DONE;
    case ENOENT:
        NVR_LOG("ERROR: nvrcimDownloadFW: FW file not found");
        return ANSWER_FILE_NOT_FOUND;
    default:
        NVR_LOG("ERROR: nvrcimDownloadFW: Can't stat FW file ");
        return ANSWER_INVALID_PARAMETER;
    }
}

/// What both ways of installing ask last before they write: the port's name, and whether this is the service for it.
uint32 prepareDownload(const NVRHBA_SoftwareInstallationService* self, const char* target, HBA_WWN& port)
{
    if (!portName(port, target, provider_name)) return ANSWER_NULL_ARGUMENT;
    if (isNamed(self, firmware_service)) return ANSWER_DONE;
    NVR_LOG("Error - The SoftwareInstallationService instance selected is incorrect ");
    return ANSWER_FAILED;
}

/// Resets the adapter once for each time that the options say so. `refresh`: none of them does.
uint32 resetAsAsked(ProviderAgent& agent, const Options& options, const HBA_WWN& port, bool& refresh)
{
    refresh = true;
    for (std::size_t i = 0; i < options.size(); i++) {
        if (options[i] != option_reset) continue;
        refresh = false;
        NVR_LOG("HBA RESET OPTION SELECTED");
        if (const uint32 status = nvrcimReset(port)) {
            NVR_LOG("NVRHBA_SoftwareInstallationService_Provider::nvrcimResetHBA failed");
            return libraryAnswer(status);
        }
        NVR_LOG("Fiwmware download functionality complete with Reset on the HBA");
    }
    if (refresh) agent.m_bAdapterRefreshPending.ask();
    return ANSWER_DONE;
}

uint32 downloadFailed(uint32 status)
{
    NVR_LOG("Error - in the firmware download functionality");
    return libraryAnswer(status);
}

/// Under the agent's locks. `refresh`: to be asked for once they are released.
uint32 installFromURI(ProviderAgent& agent, const NVRHBA_SoftwareInstallationService* self, const String& uri,
                      const Instance* target, const Options& options, bool& refresh)
{
    if (!isService(agent, self)) return ANSWER_FOREIGN_INSTANCE;
    if (!target) {
        NVR_LOG("Target has a null pointer");
        return ANSWER_NULL_ARGUMENT;
    }
    if (!isKnownFCPort(agent, target)) {
        NVR_LOG("NVRHBA_SoftwareInstallationService_Provider invald port ...return");
        return ANSWER_BAD_ARGUMENT;
    }
    if (uri.empty()) {
        NVR_LOG("Null sized URI..returning");
        return ANSWER_NULL_ARGUMENT;
    }
    logOptions(options);
    if (!std::all_of(options.begin(), options.end(), isOption)) {
        NVR_LOG("invalid value of Install options");
        return ANSWER_INVALID_PARAMETER;
    }

    uint32 transferAnswer = 0; // whether an image is there is what counts
    bool fetched = false;
    const std::string path = NVR_MethodWrapper::downloadFileUsingCurl(uri, transferAnswer, fetched);
    NVR_LOG("filename is : %s", path.c_str());
    if (const uint32 fault = findImage(path.c_str())) return fault;
    Passing_File file(path.c_str(), fetched);

    HBA_WWN port;
    if (const uint32 fault = prepareDownload(self, deviceID(target), port)) return fault;
    const uint32 status = NVR_MethodWrapper::nvrcimDownloadFW(port, path.c_str());
    if (status == RM_STATUS_OK) {
        NVR_LOG("FC download functionality complete for target %s", deviceID(target));
    } else if (status == RM_STATUS_REBOOT_NEEDED) {
        NVR_LOG("FC Firmware download completed for target %s Please reboot system to activate new firmware.",
                deviceID(target));
    } else {
        file.stays();
        return downloadFailed(status);
    }
    file.removeNow();
    return resetAsAsked(agent, options, port, refresh);
}

/// The place of the last option that names a file; the size of the options if none does.
std::size_t findFileOption(const Options& options)
{
    std::size_t place = options.size();
    for (std::size_t i = 0; i < options.size(); i++)
        if (options[i] == option_file) place = i;
    return place;
}

/// 0, or the return value for options without a file to write to. `path` stays the options' own.
uint32 chooseFile(const Options& options, const Array<String>& values, const char*& path)
{
    logOptions(options);
    const auto isKnown = [](uint16 option) { return option == option_file || isOption(option); };
    if (!std::all_of(options.begin(), options.end(), isKnown)) {
        NVR_LOG("invalid value of Install options");
        return ANSWER_INVALID_PARAMETER;
    }
    const std::size_t place = findFileOption(options);
    if (place == options.size()) {
        NVR_LOG("InstallOptions does not have the value 32768");
        return ANSWER_INVALID_PARAMETER;
    }
    if (place >= values.size()) {
        NVR_LOG("InstallOptionsValues is empty. Should have the correct firmware file name. Returning Invalid "
                "Parameter");
        return ANSWER_INVALID_PARAMETER;
    }
    path = values[place].c_str();
    return ANSWER_DONE;
}

bool writeImage(const char* path, const Property<Array<uint8>>& image)
{
    if (image.null) return write_regular_file(path, {});
    return write_regular_file(path, {reinterpret_cast<const char*>(image.value.data()), image.value.size()});
}

/// As installFromURI.
uint32 installFromByteStream(ProviderAgent& agent, const NVRHBA_SoftwareInstallationService* self,
                             const Property<Array<uint8>>& image, const Instance* target, const Options& options,
                             const Array<String>& values, bool& refresh)
{
    if (!isService(agent, self)) return ANSWER_FOREIGN_INSTANCE;
    if (!target) {
        NVR_LOG("Target has a null pointer");
        return ANSWER_NULL_ARGUMENT;
    }
    if (!isKnownFCPort(agent, target)) {
        NVR_LOG("NVRHBA_SoftwareInstallationService_Provider::Wrong DeviceID passed");
        return ANSWER_BAD_ARGUMENT;
    }
    if (values.size() == 0) {
        NVR_LOG("InstallOptionsValues is empty. Should have the correct firmware file name. Returning Invalid "
                "Parameter");
        return ANSWER_INVALID_PARAMETER;
    }
    const char* path = nullptr;
    if (const uint32 fault = chooseFile(options, values, path)) return fault;

    NVR_LOG("filename is : %s", path);
    if (!writeImage(path, image)) {
        NVR_LOG("Could not open file to copy the firmware from ByteStream");
        return ANSWER_FAILED;
    }
    Passing_File file(path, true);
    if (const uint32 fault = findImage(path)) return fault;
    HBA_WWN port;
    if (const uint32 fault = prepareDownload(self, deviceID(target), port)) return fault;
    const uint32 status = NVR_MethodWrapper::nvrcimDownloadFW(port, path);
    file.removeNow();
    if (status != RM_STATUS_OK) return downloadFailed(status);
    NVR_LOG("FC download functionality complete for target %s", deviceID(target));
    return resetAsAsked(agent, options, port, refresh);
}

uint32 resetHBA(ProviderAgent& agent, const NVRHBA_SoftwareInstallationService* self, const Instance* target)
{
    if (!isService(agent, self)) return ANSWER_FOREIGN_INSTANCE;
    if (isNamed(self, converged_service)) {
        NVR_LOG("Reset HBA on CNA is not supported");
        return libraryAnswer(reset_not_supported);
    }
    if (!isKnownFCPort(agent, target)) {
        NVR_LOG("NVRHBA_SoftwareInstallationService_Provider invald port ...return");
        return ANSWER_BAD_ARGUMENT;
    }
    HBA_WWN port;
    if (!portName(port, deviceID(target), provider_name)) return ANSWER_BAD_ARGUMENT;
    if (const uint32 status = nvrcimReset(port)) {
        NVR_LOG("NVRHBA_SoftwareInstallationService_Provider::nvrcimResetHBA failed for target %s", deviceID(target));
        return libraryAnswer(status);
    }
    NVR_LOG("NVRHBA_SoftwareInstallationService_Provider::nvrcimResetHBA for target %s is Successful.. Updating the "
            "Provider Data",
            deviceID(target));
    agent.m_bAdapterRefreshPending.ask();
    agent.BuildCimpleInfo();
    return ANSWER_DONE;
}

uint32 setPortEnabled(ProviderAgent& agent, const NVRHBA_SoftwareInstallationService* self, const Instance* target,
                      const Property<boolean>& enabled)
{
    if (!isService(agent, self)) return ANSWER_FOREIGN_INSTANCE;
    if (!isOfClass(target, NVRHBA_FCPort::meta)) {
        NVR_LOG("Invalid Port is passed");
        return ANSWER_BAD_ARGUMENT;
    }
    const char* const id = deviceID(target);
    if (!agent.checkLogicalPort(id)) {
        NVR_LOG("NVRHBA_SoftwareInstallationService_Provider invalid port passed");
        return ANSWER_BAD_ARGUMENT;
    }
    if (enabled.null) return ANSWER_BAD_ARGUMENT;
    NVR_LOG("Input PortEnable : %d", enabled.value);
    if (const uint32 status = NVR_MethodWrapper::SetPortEnabled(id, enabled.value)) {
        NVR_LOG("NVRHBA_SoftwareInstallationService_Provider::SetPortEnabled failed for target %s", id);
        return libraryAnswer(status);
    }
    NVR_LOG("NVRHBA_SoftwareInstallationService_Provider::SetPortEnabled for target %s is Successful. ", id);
    return ANSWER_DONE;
}

} // namespace

Enum_Instances_Status NVRHBA_SoftwareInstallationService_Provider::enum_instances(const Self*,
                                                                                  const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_SoftwareInstallationService_map, handler);
    NVR_LOG("NVRHBA_SoftwareInstallationService_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status NVRHBA_SoftwareInstallationService_Provider::StartService(const Self*,
                                                                               Property<uint32>& return_value)
{
    return answer(return_value, ANSWER_DONE);
}

Invoke_Method_Status NVRHBA_SoftwareInstallationService_Provider::InstallFromURI(
    const Self* self, CIM_ConcreteJob*&, const Property<String>& URI, const CIM_ManagedElement* Target,
    const Property<Array<uint16>>& InstallOptions, const Property<Array<String>>&, Property<uint32>& return_value)
{
    NVR_LOG("entering InstallFromURI");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    bool refresh = false;
    {
        const Agent_Wait wait(agent);
        return_value.set(installFromURI(agent, self, given(URI), Target, given(InstallOptions), refresh));
    }
    if (refresh) agent.BuildCimpleInfo();
    return INVOKE_METHOD_OK;
}

Invoke_Method_Status NVRHBA_SoftwareInstallationService_Provider::InstallFromByteStream(
    const Self* self, CIM_ConcreteJob*&, const Property<Array<uint8>>& Image, const CIM_ManagedElement* Target,
    const Property<Array<uint16>>& InstallOptions, const Property<Array<String>>& InstallOptionsValues,
    Property<uint32>& return_value)
{
    NVR_LOG("Entering InstallFromByteStream");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    bool refresh = false;
    {
        const Agent_Wait wait(agent);
        return_value.set(installFromByteStream(agent, self, Image, Target, given(InstallOptions),
                                               given(InstallOptionsValues), refresh));
    }
    if (refresh) agent.BuildCimpleInfo();
    return INVOKE_METHOD_OK;
}

Invoke_Method_Status NVRHBA_SoftwareInstallationService_Provider::ResetHBA(const Self* self,
                                                                           const NVRHBA_FCPort* Target,
                                                                           Property<uint32>& return_value)
{
    NVR_LOG("Entering ResetHBA");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    return answer(return_value, resetHBA(agent, self, Target));
}

Invoke_Method_Status NVRHBA_SoftwareInstallationService_Provider::SetPortEnabled(const Self* self,
                                                                                 const NVRHBA_FCPort* Target,
                                                                                 const Property<boolean>& PortEnabled,
                                                                                 Property<uint32>& return_value)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    return answer(return_value, setPortEnabled(agent, self, Target, PortEnabled));
}

} // namespace cimple
