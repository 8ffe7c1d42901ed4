#include "services/tag_tables.h"

#include <cerrno>
#include <stdexcept>
#include <unistd.h>

#include "agent/Clock.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "foundation/management_binding.h"
#include "foundation/open_file.h"
#include "runtime/Forced_Unwind.h"
#include "services/ApexConfig.h"
#include "services/service_method.h"

namespace cimple {

namespace {

constexpr uint32 answer_refused = 1;
constexpr uint32 answer_unknown_failure = 32768;
constexpr uint32 answer_no_memory = 32774;

/// A file of the most entries has half of it.
constexpr long most_file_bytes = 32 * 1024 * 1024;

std::string hostName()
{
    char name[256] = {};
    if (::gethostname(name, sizeof name - 1) == 0) return name;
    NVR_LOG("NVRHBA_FCTagService_Provider::gethostname() failed err : %d , using 'unknown' for hostname and IP address",
            errno);
    return "unknown";
}

std::string now()
{
    char text[Datetime::text_size];
    agent_now().ascii(text);
    return text;
}

/// Throws std::runtime_error for what cannot be opened as a regular file, std::bad_alloc for one that is too large.
std::string contentOf(const std::string& path)
{
    const File file = open_regular_file(path.c_str(), "rb");
    if (!file) throw std::runtime_error("cannot open file " + path);
    std::fseek(file.get(), 0, SEEK_END);
    const long size = std::ftell(file.get());
    std::rewind(file.get());
    if (size < 0 || size > most_file_bytes) throw std::bad_alloc();
    std::string content(static_cast<std::size_t>(size), '\0');
    content.resize(std::fread(content.data(), 1, content.size(), file.get()));
    return content;
}

uint32 loadTable(const std::string& path, uint32 handle)
{
    const Tag_Table table = readApexConfig(contentOf(path));
    PrintQoSEntry(table);
    const uint32 status = CPQFC_QoSSetConfig(handle, table.get());
    if (status != RM_STATUS_OK) {
        NVR_LOG("NVRHBA_FCTagService_Provider::CPQFC_QoSSetConfig failed with an error :%d", static_cast<int>(status));
        return answer_refused;
    }
    NVR_LOG("NVRHBA_FCTagService_Provider::CPQFC_QoSSetConfig is success");
    return ANSWER_DONE;
}

} // namespace

void PrintQoSEntry(const Tag_Table& table)
{
    NVR_LOG("PrintQoSEntry");
    NVR_LOG("Number Of Entries: %d", static_cast<int>(table.size()));
    for (uint32 i = 0; i < table.size(); i++) {
        for (const HBA_UINT8 byte : table[i].source.wwn)
            NVR_LOG("src_wwpn:%X", byte);
        for (const HBA_UINT8 byte : table[i].target.wwn)
            NVR_LOG("tgt_wwpn:%X", byte);
        NVR_LOG("tag:%d", table[i].tag);
    }
}

void WriteConfigTablesToFile(const std::string& path, const Tag_Table& table, const std::string& adapter)
{
    NVR_LOG("NVRHBA_FCTagService_Provider::WriteConfigTablesToFile");
    const std::string text = apexConfigText(table, {now(), hostName(), adapter});
    if (!write_regular_file(path.c_str(), text)) NVR_LOG("NVRHBA_FCTagService_Provider::file.fail()");
}

uint32 loadConfigTable(const std::string& path, uint32 handle)
{
    NVR_LOG("NVRHBA_FCTagService_Provider::Entering SetConfigTable");
    try {
        return loadTable(path, handle);
    } catch (const std::bad_alloc&) {
        NVR_LOG("SetConfigTable: Memory allocation failed");
        return answer_no_memory;
    } catch (const std::runtime_error& error) {
        NVR_LOG("%s", error.what());
        return ANSWER_BAD_ARGUMENT;
    } catch (...) {
        if (is_forced_unwind()) throw;
        NVR_LOG("unknown exectiion is caught");
        return answer_unknown_failure;
    }
}

} // namespace cimple
