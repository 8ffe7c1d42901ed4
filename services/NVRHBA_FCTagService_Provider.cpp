#include "services/NVRHBA_FCTagService_Provider.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <stdexcept>
#include <strings.h>
#include <sys/stat.h>
#include <utility>

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "classes/NVRHBA_DumpData.h"
#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "foundation/open_file.h"
#include "runtime/Forced_Unwind.h"
#include "runtime/guarded.h"
#include "services/NVR_MethodWrapper.h"
#include "services/service_method.h"
#include "services/tag_tables.h"

namespace cimple {

namespace {

constexpr uint32 answer_refused = 1;
constexpr uint32 answer_not_reached = 5;
constexpr uint32 answer_empty_table = 32767;
constexpr uint32 answer_no_adapters = 32768;

constexpr std::size_t name_size = 32;  // of a port or adapter, with its terminator
constexpr std::size_t path_size = 256; // the same of a file

/// The directory that the last table was written to, kept from call to call; under the agent's data mutex.
char dump_directory[path_size];

template <std::size_t size>
void copyCut(char (&target)[size], const String& source)
{
    std::snprintf(target, size, "%s", source.c_str());
}

/// Why a method goes no further than its service and its Target; 0 if it does.
uint32 refusal(ProviderAgent& agent, const Instance* self, const Instance* target)
{
    if (!isAnyService(agent.m_NVRHBA_FCTagService_map, self)) {
        NVR_LOG("Invalid instance of FC Tagging Service");
        return ANSWER_FOREIGN_INSTANCE;
    }
    if (!target) {
        NVR_LOG("Target has a null pointer");
        return ANSWER_NULL_ARGUMENT;
    }
    if (!isKnownFCPort(agent, target)) {
        NVR_LOG("NVRHBA_FCTagService_Provider::Wrong DeviceID passed");
        return ANSWER_BAD_ARGUMENT;
    }
    return ANSWER_DONE;
}

/// The adapter of a port, opened for tagging; closed at the end of its life at the latest.
class Tag_Adapter {
public:
    Tag_Adapter() = default;
    Tag_Adapter(const Tag_Adapter&) = delete;
    Tag_Adapter& operator=(const Tag_Adapter&) = delete;
    ~Tag_Adapter() noexcept(false) { close(); }

    /// Result 0 or the method's return value; `failure` are its words for an adapter that cannot be opened.
    uint32 open(const ProviderAgent& agent, const Instance* port, const char* failure)
    {
        copyCut(m_name, adapterOf(agent, deviceID(port)));
        NVR_LOG("NVRHBA_FCTagService_Provider::Successfully got AdapterName,%s", m_name);
        const uint32 adapters = CPQFC_GetNumberOfAdapters();
        if (adapters == 0) {
            NVR_LOG("NVRHBA_FCTagService_Provider::CPQFC_GetNumberOfAdapters()- No Adapters found");
            return answer_no_adapters;
        }
        NVR_LOG("NVRHBA_FCTagService_Provider::CPQFC_GetNumberOfAdapters Successful:%d", static_cast<int>(adapters));
        m_handle = CPQFC_OpenAdapter(m_name);
        if (m_handle != 0) return ANSWER_DONE;
        NVR_LOG("%s%s", failure, m_name);
        return ANSWER_BAD_ARGUMENT;
    }
    void close()
    {
        const uint32 handle = std::exchange(m_handle, 0);
        if (handle != 0) guarded([&] { CPQFC_CloseAdapter(handle); });
    }

    const char* name() const { return m_name; }
    uint32 handle() const { return m_handle; }

private:
    static String adapterOf(const ProviderAgent& agent, const char* id)
    {
        const auto& ports = agent.m_NVRHBA_FCPort_map;
        for (std::size_t i = 0; i < ports.size(); i++)
            if (::strcasecmp(ports[i]->DeviceID.value.c_str(), id) == 0) return ports[i]->AdapterName.value;
        return String();
    }

    char m_name[name_size] = {};
    uint32 m_handle = 0;
};

/// A file that was fetched for this call, which nobody else needs.
class Fetched_File {
public:
    explicit Fetched_File(const String& uri) : m_path(NVR_MethodWrapper::downloadFileUsingCurl(uri, m_hint, m_fetched))
    {
    }
    Fetched_File(const Fetched_File&) = delete;
    Fetched_File& operator=(const Fetched_File&) = delete;
    ~Fetched_File() { remove(); }

    const std::string& path() const { return m_path; }
    /// There is nothing to remove.
    void isNotThere() { m_fetched = false; }
    void remove()
    {
        if (!m_fetched) return;
        m_fetched = false;
        struct stat status;
        if (::stat(m_path.c_str(), &status) == 0 && std::remove(m_path.c_str()) == 0)
            NVR_LOG("NVRHBA_FCTagService_Provider::: FC TAG Config file %s removed successfully", m_path.c_str());
        else
            NVR_LOG("NVRHBA_FCTagService_Provider:: Can't stat file %s", m_path.c_str());
    }

private:
    uint32 m_hint = 0; // of a failure; whether a file is there is what counts
    bool m_fetched = false;
    const std::string m_path;
};

void findDumpDirectory(const ProviderAgent& agent, const char* id)
{
    const auto& dumps = agent.m_NVRHBA_DumpData_map;
    for (std::size_t i = 0; i < dumps.size(); i++) {
        if (::strcasecmp(dumps[i]->ElementName.value.c_str(), id) != 0) continue;
        copyCut(dump_directory, dumps[i]->DumpDirectory.value);
        NVR_LOG("NVRHBA_FCTagService_Provider::Successfully got DumpPath,%s", dump_directory);
        return;
    }
}

Tag_Table tableFor(uint32 entries)
{
    try {
        return makeTagTable(entries);
    } catch (const std::bad_alloc&) {
        NVR_LOG("NVRHBA_FCTagService_Provider:: Memory Allocation failed for pQosConfig");
        throw;
    }
}

/// Reads so many entries and writes them to a file of that name. Result 0 or a return value.
uint32 writeTable(const Tag_Adapter& adapter, uint32 entries, const char* name)
{
    Tag_Table table = tableFor(entries);
    const uint32 status = CPQFC_QoSGetConfig(adapter.handle(), table.get());
    if (status != RM_STATUS_OK) {
        NVR_LOG("NVRHBA_FCTagService_Provider:: CPQFC_QoSGetConfig failed with an error :%d ",
                static_cast<int>(status));
        return answer_refused;
    }
    PrintQoSEntry(table);
    NVR_LOG("NVRHBA_FCTagService_Provider::GetConfigTable");
    const std::string path = std::string(*dump_directory ? dump_directory : "/tmp") + "/" + name;
    if (path.size() >= path_size) {
        NVR_LOG("NVRHBA_FCTagService_Provider: GETConfigTable execption: %s", "the file name is too long");
        return ANSWER_BAD_ARGUMENT;
    }
    NVR_LOG("GetConfigTable: filename :%s", path.c_str());
    // A client names a file in that folder, and none elsewhere.
    const bool is_name = !std::strchr(name, '/');
    if (is_name) open_regular_file(path.c_str(), "wb"); // so that it exists
    WriteConfigTablesToFile(is_name ? path : std::string(), table, adapter.name());
    return ANSWER_DONE;
}

/// The same, but that an exception shows in the log alone.
uint32 writeTableOrLog(const Tag_Adapter& adapter, uint32 entries, const char* name)
{
    try {
        return writeTable(adapter, entries, name);
    } catch (const std::bad_alloc&) {
        NVR_LOG("NVRHBA_FCTagService_Provider: GetConfigTable Memory allocation failed");
    } catch (const std::runtime_error& error) {
        NVR_LOG("NVRHBA_FCTagService_Provider: GETConfigTable execption: %s", error.what());
    } catch (...) {
        if (is_forced_unwind()) throw;
        NVR_LOG("NVRHBA_FCTagService_Provider: GetConfigTable unknown exectiion is caught");
    }
    return ANSWER_DONE;
}

/// Why a file cannot be loaded: 0 if it is there.
uint32 missing(const std::string& path)
{
    struct stat status;
    if (::stat(path.c_str(), &status) == 0) return ANSWER_DONE;
    if (errno == ENOENT) {
        NVR_LOG("ERROR:NVRHBA_FCTagService_Provider::Configuration file not found");
        return ANSWER_FILE_NOT_FOUND;
    }
    NVR_LOG("ERROR: NVRHBA_FCTagService_Provider:: Can't stat Configuration file ");
    return answer_not_reached;
}

/// The same as `refusal` for the methods that take a name, with their words for one that is missing.
uint32 refusalOfTable(ProviderAgent& agent, const Instance* self, const Instance* target, const Property<String>& name,
                      const char* no_name)
{
    if (const uint32 refused = refusal(agent, self, target)) return refused;
    if (!name.null && *name.value.c_str()) return ANSWER_DONE;
    NVR_LOG("%s", no_name);
    return ANSWER_NULL_ARGUMENT;
}

/// What reading and setting the flag differ in.
struct Flag_Method {
    const char* entry;
    const char* not_opened;
    const char* failure;
    const char* done;
};

constexpr Flag_Method getting = {
    "NVRHBA_FCTagService_Provider: Inside GetGlobalFlag",
    "NVRHBA_FCTagService_Provider::Failed to Open Adapter, Skipping GetGlobalFlag Adapter Name:",
    "NVRHBA_FCTagService_Provider::CPQFC_QoSGetGlobalFlag Failed with Error :%d",
    "NVRHBA_FCTagService_Provider::GetGlobalFlag Successful"};
constexpr Flag_Method setting = {
    "NVRHBA_FCTagService_Provider: Inside SetGlobalFlag",
    "ERROR:NVRHBA_FCTagService_Provider::Failed to Open Adapter, Skipping SetGlobalFlag Adapter Name:",
    "NVRHBA_FCTagService_Provider::CPQFC_QoSSetGlobalFlag Failed with Error :%d",
    "NVRHBA_FCTagService_Provider::SetGlobalFlag Successful"};

/// `call` asks the library, with the handle of the target's adapter. Result the method's return value.
template <class Call>
uint32 useFlag(const Flag_Method& method, const Instance* self, const Instance* target, Call call)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    NVR_LOG("%s", method.entry);
    if (const uint32 refused = refusal(agent, self, target)) return refused;
    Tag_Adapter adapter;
    if (const uint32 failed = adapter.open(agent, target, method.not_opened)) return failed;
    NVR_LOG("NVRHBA_FCTagService_Provider::Successfully Opened Adaptor, Adapter Handle:%d",
            static_cast<int>(adapter.handle()));
    if (const uint32 status = call(adapter.handle())) {
        NVR_LOG(method.failure, static_cast<int>(status));
        return answer_refused;
    }
    adapter.close();
    NVR_LOG("%s", method.done);
    return ANSWER_DONE;
}

} // namespace

Enum_Instances_Status NVRHBA_FCTagService_Provider::enum_instances(const NVRHBA_FCTagService*,
                                                                   const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_FCTagService_map, handler);
    NVR_LOG("NVRHBA_FCTagService_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status NVRHBA_FCTagService_Provider::GetGlobalFlag(const NVRHBA_FCTagService* self,
                                                                 NVRHBA_FCPort*& Target, Property<uint32>& State,
                                                                 Property<uint32>& return_value)
{
    uint32 flag = 0;
    const uint32 value =
        useFlag(getting, self, Target, [&](uint32 handle) { return CPQFC_QoSGetGlobalFlag(handle, &flag); });
    if (value == ANSWER_DONE) State.set(flag);
    return answer(return_value, value);
}

Invoke_Method_Status NVRHBA_FCTagService_Provider::SetGlobalFlag(const NVRHBA_FCTagService* self,
                                                                 NVRHBA_FCPort*& Target, Property<uint32>& State,
                                                                 Property<uint32>& return_value)
{
    return answer(return_value, useFlag(setting, self, Target,
                                        [&](uint32 handle) { return CPQFC_QoSSetGlobalFlag(handle, given(State)); }));
}

Invoke_Method_Status NVRHBA_FCTagService_Provider::GetConfigTable(const NVRHBA_FCTagService* self,
                                                                  NVRHBA_FCPort*& Target, Property<String>& URI,
                                                                  Property<uint32>& return_value)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    if (const uint32 refused = refusalOfTable(agent, self, Target, URI, "Null sized URI..returning"))
        return answer(return_value, refused);
    char id[name_size];
    copyCut(id, deviceID(Target));
    NVR_LOG("NVRHBA_FCTagService_Provider::Successfully got DeviceID,%s", id);
    findDumpDirectory(agent, id);
    Tag_Adapter adapter;
    if (const uint32 failed = adapter.open(agent, Target,
                                           "NVRHBA_FCTagService_Provider::Failed to Open Adapter, "
                                           "Skipping GetConfigTable Adaptor Name:"))
        return answer(return_value, failed);
    NVR_LOG("NVRHBA_FCTagService_Provider::Successfully Opened Adapter, hbaHandle:%d",
            static_cast<int>(adapter.handle()));

    CPQFC_QOSCONFIG counted = {};
    if (CPQFC_QoSGetConfig(adapter.handle(), &counted) == RM_STATUS_OK && counted.count == 0) {
        NVR_LOG("NVRHBA_FCTagService_Provider:: CPQFC_QoSGetConfig - No Config Entries set ");
        return answer(return_value, answer_empty_table);
    }
    if (const uint32 failed = writeTableOrLog(adapter, counted.count, URI.value.c_str()))
        return answer(return_value, failed);
    adapter.close();
    NVR_LOG("NVRHBA_FCTagService_Provider::GetConfigTable Successful");
    return answer(return_value, ANSWER_DONE);
}

Invoke_Method_Status NVRHBA_FCTagService_Provider::SetConfigTable(const NVRHBA_FCTagService* self,
                                                                  NVRHBA_FCPort*& Target, Property<String>& URI,
                                                                  Property<uint32>& return_value)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    if (const uint32 refused = refusalOfTable(agent, self, Target, URI, "NVRHBA_FCTagService_Provider::Null sized URI"))
        return answer(return_value, refused);
    Fetched_File file(URI.value);
    NVR_LOG("NVRHBA_FCTagService_Provider::filename is : %s", file.path().c_str());
    if (const uint32 failed = missing(file.path())) {
        file.isNotThere();
        return answer(return_value, failed);
    }
    Tag_Adapter adapter;
    if (const uint32 failed = adapter.open(agent, Target,
                                           "NVRHBA_FCTagService_Provider::Failed to Open Adapter, "
                                           "Skipping SetConfigTable Adapter Name:"))
        return answer(return_value, failed);
    const uint32 value = loadConfigTable(file.path(), adapter.handle());
    file.remove();
    adapter.close();
    return answer(return_value, value);
}

} // namespace cimple
