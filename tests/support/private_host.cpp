#include "tests/support/private_host.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <sys/mount.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include "tests/support/private_host_setup.h"

namespace nvrtest {

namespace {

[[noreturn]] void fail(const std::string& what)
{
    throw std::runtime_error(what + ": " + std::strerror(errno));
}

std::string cover_path()
{
    static int number = 0;
    return private_root() + "/cover" + std::to_string(number++);
}

} // namespace

std::string library_folder()
{
    return private_root() + "/lib";
}

void write_file(const std::string& path, const std::string& content)
{
    remove(path);
    std::ofstream file(path, std::ios::binary);
    file << content;
    if (!file.flush()) fail("write " + path);
}

std::string read_file(const std::string& path)
{
    std::ifstream file(path, std::ios::binary);
    if (!file) return "(none)";
    std::ostringstream content;
    content << file.rdbuf();
    return content.str();
}

bool exists(const std::string& path)
{
    struct stat status;
    return ::lstat(path.c_str(), &status) == 0;
}

void remove(const std::string& path)
{
    int failed = std::remove(path.c_str());
    while (failed && errno == EBUSY && ::umount2(path.c_str(), MNT_DETACH | UMOUNT_NOFOLLOW) == 0)
        failed = std::remove(path.c_str());
    if (failed && errno != ENOENT) fail("remove " + path);
}

void make_folder(const std::string& path)
{
    if (::mkdir(path.c_str(), 0755) != 0) fail("mkdir " + path);
}

void make_link(const std::string& target, const std::string& path)
{
    remove(path);
    if (::symlink(target.c_str(), path.c_str()) != 0) fail("link " + path);
}

void cover_file(const std::string& path, const std::string& content)
{
    const std::string cover = cover_path();
    write_file(cover, content);
    bind_over(cover, path);
}

void make_unopenable(const std::string& path)
{
    // A socket's file can be looked up and mounted, but not opened.
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    const std::string cover = cover_path();
    cover.copy(address.sun_path, sizeof address.sun_path - 1);
    const int socket = ::socket(AF_UNIX, SOCK_STREAM, 0);
    if (socket < 0 || ::bind(socket, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0) fail("bind a socket");
    ::close(socket);
    bind_over(cover, path);
}

No_Descriptors::No_Descriptors()
{
    if (::getrlimit(RLIMIT_NOFILE, &m_limit) != 0) fail("read the limit of descriptors");
    rlimit none = m_limit;
    none.rlim_cur = 0;
    if (::setrlimit(RLIMIT_NOFILE, &none) != 0) fail("take the descriptors away");
}

No_Descriptors::~No_Descriptors()
{
    ::setrlimit(RLIMIT_NOFILE, &m_limit);
}

Small_Disk::Small_Disk(std::string folder) : m_folder(std::move(folder))
{
    if (::mount("tmpfs", m_folder.c_str(), "tmpfs", 0, "size=64k,mode=0755") != 0) fail("a disk on " + m_folder);
}

Small_Disk::~Small_Disk()
{
    ::umount2(m_folder.c_str(), MNT_DETACH);
}

void Small_Disk::fill() const
{
    std::ofstream file(m_folder + "/filler", std::ios::binary);
    file << std::string(1024 * 1024, 'x') << std::flush;
    if (file) throw std::runtime_error("the disk on " + m_folder + " has no end");
}

} // namespace nvrtest
