// What is around the module: the server's process, the files and the network of the host, and the adapters are after a
// session as they were before it, but for what a client has asked for.
//
// The program stands in for the functions by which the module can reach files, and notes what the module asks of them.
#include <array>
#include <clocale>
#include <csignal>
#include <cstdarg>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <dlfcn.h>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <link.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <mutex>
#include <netinet/in.h>
#include <semaphore.h>
#include <set>
#include <string>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>
#include <vector>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/faults/Session.h"
#include "tests/module/support/Elf_File.h"
#include "tests/module/support/Entries.h"
#include "tests/module/support/Service_Methods.h"
#include "tests/support/code_range.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::Contains;
using testing::Each;
using testing::IsEmpty;
using testing::UnorderedElementsAre;
using testing::UnorderedElementsAreArray;

// --- What the module asks of files

namespace {

Code_Range module_code;
std::mutex writes_mutex;
bool writes_are_noted = false;
std::set<std::string>& writes()
{
    static std::set<std::string> paths;
    return paths;
}

void note(const void* caller, const std::string& path)
{
    if (!module_code.holds(reinterpret_cast<std::uintptr_t>(caller))) return;
    const std::lock_guard<std::mutex> lock(writes_mutex);
    if (writes_are_noted) writes().insert(path);
}

template <class Function>
Function* real(const char* name)
{
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

} // namespace

#define NVR_STANDS_IN extern "C" __attribute__((visibility("default")))

NVR_STANDS_IN int open(const char* path, int flags, ...)
{
    std::va_list arguments;
    va_start(arguments, flags);
    const mode_t mode = flags & O_CREAT ? va_arg(arguments, mode_t) : 0;
    va_end(arguments);
    if ((flags & O_ACCMODE) != O_RDONLY || flags & (O_CREAT | O_TRUNC)) note(__builtin_return_address(0), path);
    static auto* const next = real<int(const char*, int, ...)>("open");
    return next(path, flags, mode);
}

NVR_STANDS_IN int mkdir(const char* path, mode_t mode) noexcept
{
    note(__builtin_return_address(0), path);
    static auto* const next = real<int(const char*, mode_t)>("mkdir");
    return next(path, mode);
}

NVR_STANDS_IN int unlink(const char* path) noexcept
{
    note(__builtin_return_address(0), path);
    static auto* const next = real<int(const char*)>("unlink");
    return next(path);
}

NVR_STANDS_IN int remove(const char* path) noexcept
{
    note(__builtin_return_address(0), path);
    static auto* const next = real<int(const char*)>("remove");
    return next(path);
}

NVR_STANDS_IN sem_t* sem_open(const char* name, int flags, ...) noexcept
{
    std::va_list arguments;
    va_start(arguments, flags);
    const mode_t mode = flags & O_CREAT ? va_arg(arguments, mode_t) : 0;
    const unsigned value = flags & O_CREAT ? va_arg(arguments, unsigned) : 0;
    va_end(arguments);
    note(__builtin_return_address(0), std::string("semaphore ") + name);
    static auto* const next = real<sem_t*(const char*, int, ...)>("sem_open");
    return next(name, flags, mode, value);
}

NVR_STANDS_IN int sem_unlink(const char* name) noexcept
{
    note(__builtin_return_address(0), std::string("semaphore ") + name);
    static auto* const next = real<int(const char*)>("sem_unlink");
    return next(name);
}

namespace {

/// The paths that the module asked to write to, make or remove while this lives.
class Noted_Writes {
public:
    Noted_Writes()
    {
        EXPECT_TRUE(module_code.find(std::filesystem::path(NVR_MODULE).filename().string()));
        const std::lock_guard<std::mutex> lock(writes_mutex);
        writes().clear();
        writes_are_noted = true;
    }
    ~Noted_Writes()
    {
        const std::lock_guard<std::mutex> lock(writes_mutex);
        writes_are_noted = false;
    }
    std::set<std::string> all() const
    {
        const std::lock_guard<std::mutex> lock(writes_mutex);
        return writes();
    }

private:
    const Entries m_module; // loaded, so that its code can be told
};

constexpr const char* reading_parts[] = {"load", "enumerations", "traversals", "refresh", "unload"};

void read_all(Session& session)
{
    for (const char* part : reading_parts)
        session.run(Session::part(part));
}

void run_all(Session& session)
{
    for (const Session::Part& part : Session::parts())
        session.run(part);
}

/// What the module writes by itself, whatever it is asked.
std::vector<std::string> own_files()
{
    const std::string guard = "semaphore /NVR_RM_INIT_LIB_" + std::to_string(getpid());
    const std::string done = "semaphore /NVR_RM_INIT_LIB_DONE_" + std::to_string(getpid());
    return {conf_path, dmp_path, trace_path, guard, done};
}

// --- The server's process

struct Process {
    std::vector<std::string> handlers, environment;
    std::string locale, folder, masks;

    Process() : folder(std::filesystem::current_path().string())
    {
        for (int number = 1; number <= SIGRTMAX; number++) {
            struct sigaction action = {};
            if (sigaction(number, nullptr, &action) != 0) continue; // the C library's own
            std::string text = std::to_string(number) + ' ' + std::to_string(action.sa_flags) + ' ' +
                               std::to_string(reinterpret_cast<std::uintptr_t>(action.sa_sigaction));
            for (int other = 1; other <= SIGRTMAX; other++)
                if (sigismember(&action.sa_mask, other) == 1) text += " -" + std::to_string(other);
            handlers.push_back(std::move(text));
        }
        for (char** entry = environ; *entry; entry++)
            environment.push_back(*entry);
        locale = std::setlocale(LC_ALL, nullptr);
        locale += uselocale(nullptr) == LC_GLOBAL_LOCALE ? "" : " and one of the thread's own";
        std::ifstream status("/proc/thread-self/status");
        for (std::string line; std::getline(status, line);)
            for (const char* name : {"SigBlk", "Umask"})
                if (line.rfind(name, 0) == 0) masks += line + '\n';
    }
    bool operator==(const Process& other) const
    {
        return handlers == other.handlers && environment == other.environment && locale == other.locale &&
               folder == other.folder && masks == other.masks;
    }
};

void PrintTo(const Process& process, std::ostream* out)
{
    *out << process.locale << '\n' << process.folder << '\n' << process.masks;
    for (const std::string& handler : process.handlers)
        *out << handler << '\n';
}

void on_user_signal(int) {}

// A server's process, with nothing as a program has it at its start.
void settle_in()
{
    ASSERT_TRUE(std::setlocale(LC_ALL, "C.UTF-8"));
    struct sigaction action = {};
    action.sa_handler = on_user_signal;
    sigaddset(&action.sa_mask, SIGTERM);
    ASSERT_EQ(sigaction(SIGUSR1, &action, nullptr), 0);
    action.sa_handler = SIG_IGN;
    ASSERT_EQ(sigaction(SIGPIPE, &action, nullptr), 0);
    sigset_t blocked;
    sigemptyset(&blocked);
    sigaddset(&blocked, SIGUSR2);
    sigaddset(&blocked, SIGCHLD);
    ASSERT_EQ(pthread_sigmask(SIG_BLOCK, &blocked, nullptr), 0);
    umask(027);
    prepare_service_files(); // stands in their folder
}

} // namespace

TEST(Surroundings, OfTheServersProcessStayAsTheyAre)
{
    settle_in();
    const Process before;
    EXPECT_THAT(before.masks, testing::HasSubstr("Umask:\t0027"));
    Session session;
    for (const Session::Part& part : Session::parts()) {
        session.run(part);
        EXPECT_EQ(Process(), before) << part.name;
    }
    EXPECT_THAT(session.failures(), IsEmpty());
}

// A request's thread is the server's too, from the load on it to the last clean-up.
TEST(Surroundings, OfTheServersThreadStayAsTheyAre)
{
    settle_in();
    Rig rig({host::Manner::strict(), "small"});
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        const Process before;
        Entries entries;
        EXPECT_EQ(Process(), before) << "opened";
        CMPIInstanceMI* ports = entries.instances("NVRHBA_FCPort", broker, context);
        CMPIIndicationMI* alerts = entries.indications("NVRHBA_AlertIndication", broker, context);
        ASSERT_TRUE(ports && alerts);
        EXPECT_EQ(Process(), before) << "loaded";
        CMPIStatus status;
        CMPIObjectPath* path = broker->eft->newObjectPath(broker, "root/norvane", "NVRHBA_FCPort", &status);
        ports->ft->enumerateInstanceNames(ports, context, nullptr, path); // a refresh
        EXPECT_EQ(alerts->ft->enableIndications(alerts, context).rc, CMPI_RC_OK);
        EXPECT_EQ(Process(), before) << "asked";
        path->ft->release(path);
        EXPECT_EQ(alerts->ft->cleanup(alerts, context, 1).rc, CMPI_RC_OK);
        EXPECT_EQ(ports->ft->cleanup(ports, context, 1).rc, CMPI_RC_OK);
        EXPECT_EQ(Process(), before) << "unloaded";
    });
}

// --- Libraries

TEST(Surroundings, HaveTheLibrariesOfTheHardwareByTheirNamesAlone)
{
    const auto loaded = [] {
        std::set<std::string> names;
        dl_iterate_phdr(
            [](dl_phdr_info* info, std::size_t, void* data) {
                static_cast<std::set<std::string>*>(data)->insert(info->dlpi_name);
                return 0;
            },
            &names);
        return names;
    };
    const auto brought_in = [&](const std::vector<std::string>& libraries) {
        const std::set<std::string> before = loaded();
        Rig rig({host::Manner::strict(), "small", "", libraries});
        EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.empty(), libraries.empty());
        std::set<std::string> names;
        for (const std::string& name : loaded())
            if (!before.count(name) && name != NVR_MODULE) names.insert(name);
        return names;
    };
    EXPECT_THAT(brought_in({}), IsEmpty());
    const std::string folder = library_folder() + "/lib"; // the first where the loader looks names up
    EXPECT_THAT(brought_in({"HBAAPI", "rmapi", "tssdm"}),
                UnorderedElementsAre(folder + "HBAAPI.so", folder + "rmapi.so", folder + "tssdm.so"));
    EXPECT_THAT(brought_in({"HBAAPI", "lrmapi", "rmapi", "tssdm"}),
                UnorderedElementsAre(folder + "HBAAPI.so", folder + "lrmapi.so", folder + "tssdm.so"));
}

// --- Files

#if !defined(NORVANE_COVERAGE) // which writes what it has counted

TEST(Surroundings, OfFilesAreReachedByTheNotedFunctionsAlone)
{
    const std::set<std::string> reaching = {
        "chmod",     "chown",    "creat",  "creat64",  "fopen",      "fopen64",    "freopen",    "freopen64",
        "link",      "linkat",   "mkdir",  "mkdirat",  "mkdtemp",    "mkfifo",     "mknod",      "mkstemp",
        "mkstemp64", "mq_open",  "open",   "open64",   "openat",     "openat64",   "popen",      "remove",
        "rename",    "renameat", "rmdir",  "sem_open", "shm_open",   "sem_unlink", "shm_unlink", "symlink",
        "symlinkat", "syscall",  "system", "tmpfile",  "tmpfile64",  "truncate",   "truncate64", "unlink",
        "unlinkat",  "utime",    "utimes", "__open_2", "__open64_2", "fork",       "vfork",      "posix_spawn",
        "execve",    "execv"};
    const Elf_File module(NVR_MODULE);
    ASSERT_THAT(module.imported(), Contains("pthread_create"));
    std::vector<std::string> found;
    for (const std::string& name : module.imported())
        if (reaching.count(name)) found.push_back(name);
    EXPECT_THAT(found, UnorderedElementsAre("mkdir", "open", "remove", "sem_open", "sem_unlink", "unlink"));
}

#endif

TEST(Surroundings, OfAHostThatIsReadHaveNoFileWrittenButTheModulesOwn)
{
    const Noted_Writes noted;
    Session session;
    read_all(session);
    EXPECT_THAT(session.failures(), IsEmpty());
    EXPECT_THAT(noted.all(), UnorderedElementsAreArray(own_files()));
}

TEST(Surroundings, HaveNoFileWrittenButWhereAClientSays)
{
    const Noted_Writes noted;
    Session session;
    run_all(session);
    EXPECT_THAT(session.failures(), IsEmpty());
    std::vector<std::string> told = own_files();
    told.insert(told.end(), {"a.copy", std::string(dump_folder) + "/a.table"}); // an image, and a table of tags
    EXPECT_THAT(noted.all(), UnorderedElementsAreArray(told));
}

// --- Connections

namespace {

// From here on the process ends where it asks for a socket of any kind but the host's own (a log's, the simulator's).
void forbid_network()
{
    std::array<sock_filter, 6> program = {{
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, __NR_socket, 0, 3),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, args)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, AF_UNIX, 1, 0),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_KILL_PROCESS),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    }};
    const sock_fprog filter = {program.size(), program.data()};
    if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 || prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &filter) != 0) {
        std::perror("a filter of system calls");
        std::_Exit(2);
    }
}

[[noreturn]] void live_without_network()
{
    forbid_network();
    Session session;
    run_all(session);
    for (const std::string& failure : session.failures())
        std::fprintf(stderr, "%s\n", failure.c_str());
    std::_Exit(session.failures().empty() ? 0 : 1);
}

[[noreturn]] void connect_without_network()
{
    forbid_network();
    const int unix_socket = socket(AF_UNIX, SOCK_STREAM, 0);
    if (unix_socket >= 0) (void)socket(AF_INET, SOCK_STREAM, 0);
    std::_Exit(0);
}

} // namespace

TEST(SurroundingsDeathTest, GetNoConnectionInAWholeSession)
{
    EXPECT_EXIT(live_without_network(), testing::ExitedWithCode(0), "");
    EXPECT_EXIT(connect_without_network(), testing::KilledBySignal(SIGSYS), "");
}

// --- The adapters

TEST(Surroundings, OfHardwareThatIsReadStayAsTheyAre)
{
    const auto state = [] {
        std::string text(nvrsim_state(nullptr, 0) + 1, '\0');
        text.resize(nvrsim_state(text.data(), text.size()));
        return text;
    };
    Session session;
    const std::string before = state();
    ASSERT_THAT(before, testing::HasSubstr("\"beacon\""));
    read_all(session);
    EXPECT_THAT(session.failures(), IsEmpty());
    EXPECT_EQ(state(), before);
    EXPECT_THAT(called_operations(), Each(testing::MatchesRegex(
                                         "[A-Z]+_(LoadLibrary|InitLib|FreeLibrary|OpenAdapter|CloseAdapter|"
                                         "SendScsiInquiry|SendReadCapacity|(VP|Diag)?Get.*|DiagRead.*|DiagBeaconState|"
                                         "VPList|IsLocalHBA)")));
}
