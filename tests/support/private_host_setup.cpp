#include "tests/support/private_host_setup.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <dirent.h>
#include <fcntl.h>
#include <filesystem>
#include <sched.h>
#include <stdexcept>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include "tests/support/private_host.h"

namespace nvrtest {

namespace {

constexpr char root_variable[] = "NVR_PRIVATE_HOST";

void check(bool done, const std::string& what)
{
    if (!done) throw std::runtime_error(what + ": " + std::strerror(errno));
}

void write_line(const char* path, const std::string& line)
{
    const int fd = ::open(path, O_WRONLY | O_CLOEXEC);
    check(fd >= 0, path);
    const bool written = ::write(fd, line.data(), line.size()) == static_cast<ssize_t>(line.size());
    ::close(fd);
    check(written, path);
}

void unshare_mounts()
{
    if (::geteuid() == 0) {
        check(::unshare(CLONE_NEWNS) == 0, "a mount namespace of our own");
    } else {
        const std::string uid = std::to_string(::geteuid());
        const std::string gid = std::to_string(::getegid());
        check(::unshare(CLONE_NEWUSER | CLONE_NEWNS) == 0, "a user namespace of our own");
        write_line("/proc/self/setgroups", "deny");
        write_line("/proc/self/uid_map", "0 " + uid + " 1");
        write_line("/proc/self/gid_map", "0 " + gid + " 1");
    }
    check(::mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0, "private mounts");
}

std::string program_path()
{
    char path[PATH_MAX];
    const ssize_t size = ::readlink("/proc/self/exe", path, sizeof path);
    check(size > 0, "/proc/self/exe");
    return std::string(path, static_cast<std::size_t>(size));
}

// A folder to mount on that exists everywhere and that nothing of ours lies in.
std::string choose_root(const std::string& program)
{
    for (const char* folder : {"/mnt", "/media", "/srv"}) {
        struct stat status;
        const std::string inside = std::string(folder) + "/";
        if (::stat(folder, &status) == 0 && S_ISDIR(status.st_mode) && program.rfind(inside, 0) != 0) return folder;
    }
    throw std::runtime_error("no folder to mount the private host on");
}

// The machine's /etc as links, without the module's own files.
void make_private_etc(const std::string& root)
{
    const std::string etc = root + "/etc";
    const std::string real = root + "/machine_etc";
    make_folder(etc);
    make_folder(real);
    bind_over("/etc", real);
    DIR* entries = ::opendir(real.c_str());
    check(entries != nullptr, "read /etc");
    while (const dirent* entry = ::readdir(entries)) {
        const std::string name = entry->d_name;
        if (name == "." || name == ".." || name.rfind("norvane_", 0) == 0 || name.rfind("nvr_", 0) == 0) continue;
        check(::symlink((real + "/" + name).c_str(), (etc + "/" + name).c_str()) == 0, "link " + name);
    }
    ::closedir(entries);
    bind_over(etc, "/etc");
}

void make_private_folder(const std::string& root, const std::string& name, const std::string& path)
{
    make_folder(root + "/" + name);
    bind_over(root + "/" + name, path);
}

} // namespace

void bind_over(const std::string& source, const std::string& path)
{
    check(::mount(source.c_str(), path.c_str(), nullptr, MS_BIND | MS_REC, nullptr) == 0, "bind over " + path);
}

void enter_private_host(char** argv)
{
    if (::getenv(root_variable)) return;
    const std::string program = program_path();
    unshare_mounts();
    const std::string root = choose_root(program);
    check(::mount("tmpfs", root.c_str(), "tmpfs", 0, "mode=0755") == 0, "mount on " + root);
    make_private_etc(root);
    make_private_folder(root, "log", "/var/log");
    make_private_folder(root, "shm", "/dev/shm");
    make_folder(root + "/lib");

    // The loader reads its search path when a program starts.
    std::string path = root + "/lib";
    if (const char* before = ::getenv("LD_LIBRARY_PATH")) path += std::string(":") + before;
    check(::setenv("LD_LIBRARY_PATH", path.c_str(), 1) == 0, "set LD_LIBRARY_PATH");
    check(::setenv(root_variable, root.c_str(), 1) == 0, "set the environment");
    ::execv(program.c_str(), argv);
    check(false, "start anew");
}

void separate_private_host()
{
    check(::unshare(CLONE_NEWNS) == 0, "a mount namespace of our own");
    const std::string root = private_root() + "/own";
    check(::mkdir(root.c_str(), 0755) == 0 || errno == EEXIST, "mkdir " + root);
    check(::mount("tmpfs", root.c_str(), "tmpfs", 0, "mode=0755") == 0, "mount on " + root);
    make_folder(root + "/etc");
    for (const auto& entry : std::filesystem::directory_iterator("/etc"))
        if (entry.is_symlink() || entry.is_regular_file())
            std::filesystem::copy(entry, root + entry.path().string(), std::filesystem::copy_options::copy_symlinks);
    bind_over(root + "/etc", "/etc");
    make_private_folder(root, "log", "/var/log");
    make_private_folder(root, "shm", "/dev/shm");
    make_private_folder(root, "lib", private_root() + "/lib");
}

std::string private_root()
{
    const char* root = ::getenv(root_variable);
    if (!root) throw std::runtime_error("not in a private host: link norvane_private_main");
    return root;
}

} // namespace nvrtest
