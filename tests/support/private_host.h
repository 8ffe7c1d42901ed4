/// A host of a test's own: the fixed paths of the module under /etc, /var/log and /dev/shm, without the machine's.
///
/// Programs that link `norvane_private_main` (instead of GTest::gtest_main) run in a mount namespace where /etc is a
/// writable folder of links to the machine's entries, /var/log and /dev/shm are empty, and the loader looks for
/// libraries first in a folder that the test fills. Nothing reaches the machine; it all goes with the process. Needs
/// root, or leave to make a user namespace.
#pragma once

#include <string>
#include <sys/resource.h>

namespace nvrtest {

/// The folder that the loader searches first. Empty at the start.
std::string library_folder();

/// Makes the file (instead of what was there) with this content.
void write_file(const std::string& path, const std::string& content);
/// The content, or "(none)" for what cannot be read.
std::string read_file(const std::string& path);
bool exists(const std::string& path);
/// Removes a file or an empty folder, if it is there, and what covers it.
void remove(const std::string& path);
void make_folder(const std::string& path);
/// `path` becomes a link to `target`.
void make_link(const std::string& target, const std::string& path);

/// Covers an existing file that cannot be written, such as one of /proc, by this content; or so that it cannot be
/// opened.
void cover_file(const std::string& path, const std::string& content);
void make_unopenable(const std::string& path);

/// While it lives, this process can open nothing: it has no descriptors left.
class No_Descriptors {
public:
    No_Descriptors();
    ~No_Descriptors();
    No_Descriptors(const No_Descriptors&) = delete;
    No_Descriptors& operator=(const No_Descriptors&) = delete;

private:
    rlimit m_limit;
};

/// A disk of 64 KiB over an existing folder; gone, with all that is on it, at the object's end.
class Small_Disk {
public:
    explicit Small_Disk(std::string folder);
    ~Small_Disk();
    Small_Disk(const Small_Disk&) = delete;
    Small_Disk& operator=(const Small_Disk&) = delete;

    /// Puts a file "filler" there, as large as it can be: others can then be made, but not written.
    void fill() const;

private:
    const std::string m_folder;
};

} // namespace nvrtest
