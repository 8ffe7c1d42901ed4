// Dumps: real files, small ones, in the port's dump directory.
#include "simulator/Call.h"

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <sys/stat.h>
#include <unistd.h>

using namespace nvrsim;

namespace {

/// The directory that this process has under the system's temporary one, once there is one.
struct Own_Directory {
    std::string path;
    pid_t process;
};

std::atomic<const Own_Directory*> ownDirectory{nullptr};

/// The scenario's directory, or the process's own; made when it is first needed.
std::string directory_of(const Port& port)
{
    if (!port.dumpDirectory.empty()) return port.dumpDirectory;
    const char* base = std::getenv("TMPDIR");
    return std::string(base && *base ? base : "/tmp") + "/nvrsim-dumps-" + std::to_string(::getpid());
}

/// Makes the directory if it is not there. False for the process's own if it is somebody else's, or a link.
bool make_directory(const Port& port)
{
    const std::string directory = directory_of(port);
    ::mkdir(directory.c_str(), 0700);
    if (!port.dumpDirectory.empty()) return true; // what it lacks shows when a file is written
    struct stat status;
    if (::lstat(directory.c_str(), &status) != 0 || !S_ISDIR(status.st_mode) || status.st_uid != ::geteuid())
        return false;
    const Own_Directory* own = ownDirectory;
    if (!own || own->path != directory) ownDirectory = new Own_Directory{directory, ::getpid()};
    return true;
}

/// When the process ends in good order nobody can ask for the dumps in its own directory any more. A child of a fork
/// leaves those of its parent.
__attribute__((destructor)) void drop_own_directory()
{
    const Own_Directory* own = ownDirectory;
    if (!own || own->process != ::getpid()) return;
    std::error_code ignored;
    std::filesystem::remove_all(own->path, ignored);
}

void remove_dump(const Port& port, const std::string& name)
{
    std::remove((directory_of(port) + "/" + name).c_str());
}

uint32_t generate(Port& port, const char* kind)
{
    if (!make_directory(port)) return RM_STATUS_DIRECTORY_NOT_OPENED;
    char name[sizeof(RM_DUMPNAME::name)];
    std::snprintf(name, sizeof name, "NVR_%s_%s_%04u.dmp", to_text(port.current.wwpn).c_str(), kind, ++port.dumpsMade);
    const std::string path = directory_of(port) + "/" + name;
    std::FILE* file = std::fopen(path.c_str(), "wb");
    if (!file) return RM_STATUS_DIRECTORY_NOT_OPENED;
    const bool printed = std::fprintf(file, "dump %s of port %s\n", kind, to_text(port.current.wwpn).c_str()) > 0;
    if (std::fclose(file) != 0 || !printed) {
        std::remove(path.c_str());
        return RM_STATUS_ERROR;
    }
    port.dumps.push_back(name);
    while (port.dumps.size() > port.retention) {
        remove_dump(port, port.dumps.front());
        port.dumps.erase(port.dumps.begin());
    }
    return RM_STATUS_OK;
}

} // namespace

uint32_t nvrsim_RM_GenerateDump(HBA_WWN, HBA_WWN wwn)
{
    return run_on_port(Call_Id::RM_GenerateDump, wwn, [](Call&, Port& port) { return generate(port, "dump"); });
}

uint32_t nvrsim_RM_GenerateEfdDump(HBA_WWN wwn, uint32_t, uint32_t)
{
    return run_on_port(Call_Id::RM_GenerateEfdDump, wwn, [](Call&, Port& port) { return generate(port, "efd"); });
}

uint32_t nvrsim_RM_GetDumpDirectoryA(HBA_WWN wwn, char* buffer, uint32_t size)
{
    return run_on_port(Call_Id::RM_GetDumpDirectoryA, wwn, [&](Call& call, Port& port) {
        if (!buffer || !size) return RM_STATUS_ARGUMENT;
        call.text(buffer, size, directory_of(port));
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_SetDumpDirectory(HBA_WWN wwn, const char* path)
{
    return run_on_port(Call_Id::RM_SetDumpDirectory, wwn, [&](Call&, Port& port) {
        struct stat status;
        if (!path || std::strlen(path) >= RM_DUMP_DIRECTORY_SIZE) return RM_STATUS_ARGUMENT;
        if (::stat(path, &status) != 0 || !S_ISDIR(status.st_mode)) return RM_STATUS_DIRECTORY_NOT_OPENED;
        port.dumpDirectory = path;
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_GetDumpFileNames(HBA_WWN wwn, void* list)
{
    return run_on_port(Call_Id::RM_GetDumpFileNames, wwn, [&](Call& call, Port& port) {
        if (!list) return RM_STATUS_ARGUMENT;
        auto* names = static_cast<RM_DUMPLIST*>(list);
        const uint32_t capacity = names->count ? names->count : port.dumpNeed;
        call.number(&names->count, port.dumps.size());
        if (capacity < port.dumps.size()) {
            port.dumpNeed = static_cast<uint32_t>(port.dumps.size());
            return RM_STATUS_LIST_TOO_LONG;
        }
        for (size_t i = 0; i < port.dumps.size(); ++i) {
            RM_DUMPNAME entry;
            call.field(entry.name, port.dumps[i]);
            call.bytes(names->entry + i, &entry, sizeof entry);
        }
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_DeleteDumpFiles(HBA_WWN wwn)
{
    return run_on_port(Call_Id::RM_DeleteDumpFiles, wwn, [](Call&, Port& port) {
        for (const std::string& name : port.dumps)
            remove_dump(port, name);
        port.dumps.clear();
        if (port.dumpDirectory.empty()) ::rmdir(directory_of(port).c_str()); // goes when nobody's dumps are left
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_GetDumpRetentionCount(HBA_WWN wwn, uint32_t* count)
{
    return run_on_port(Call_Id::RM_GetDumpRetentionCount, wwn, [&](Call& call, Port& port) {
        call.answer(count, port.retention);
        return count ? RM_STATUS_OK : RM_STATUS_ARGUMENT;
    });
}

uint32_t nvrsim_RM_SetDumpRetentionCount(HBA_WWN wwn, uint32_t count)
{
    return run_on_port(Call_Id::RM_SetDumpRetentionCount, wwn, [&](Call&, Port& port) {
        if (count < RM_DUMP_RETENTION_MIN || count > RM_DUMP_RETENTION_MAX) return RM_STATUS_ARGUMENT;
        port.retention = count;
        return RM_STATUS_OK;
    });
}
