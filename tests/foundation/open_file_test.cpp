#include "foundation/open_file.h"

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <string>

#include <dlfcn.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;

namespace {

const std::string opened = "/var/log/file";
const std::string other = "/var/log/other";

/// Bytes that the system takes of what is written at a time.
constexpr std::size_t all = SIZE_MAX;
std::size_t most_taken = all;

/// Writes "new" to the file at `opened`; false, with errno, if it cannot be opened.
bool rewrite()
{
    File file = open_regular_file(opened.c_str(), "wb");
    if (!file) return false;
    EXPECT_EQ(std::fputs("new", file.get()), 1);
    return true;
}

void expect_refused(const char* mode, int error)
{
    EXPECT_FALSE(open_regular_file(opened.c_str(), mode)) << mode;
    EXPECT_EQ(errno, error) << mode;
    if (*mode == 'r') {
        EXPECT_EQ(fault_of_file(opened.c_str()), error);
    }
}

} // namespace

extern "C" __attribute__((visibility("default"))) ssize_t writev(int file, const iovec* parts, int count)
{
    static auto* const next = reinterpret_cast<ssize_t (*)(int, const iovec*, int)>(dlsym(RTLD_NEXT, "writev"));
    if (most_taken == all) return next(file, parts, count);
    for (; count > 0 && parts->iov_len == 0; count--)
        parts++;
    return count > 0 && most_taken > 0 ? write(file, parts->iov_base, std::min(parts->iov_len, most_taken)) : 0;
}

TEST(LineReader, ReadsAsFgetsDoes)
{
    const std::string longest(1000, 'x');
    write_file(opened, "one\n\n" + longest + "\nlast");
    Line_Reader file(opened.c_str());
    ASSERT_TRUE(file.is_open());
    char line[600], small[5];
    for (const std::string& expected :
         {std::string("one\n"), std::string("\n"), longest.substr(0, 599), longest.substr(599) + '\n'}) {
        ASSERT_TRUE(file.read(line));
        EXPECT_EQ(line, expected);
    }
    ASSERT_TRUE(file.read(small));
    EXPECT_STREQ(small, "last");
    EXPECT_FALSE(file.read(small));
    EXPECT_STREQ(small, "");
}

TEST(LineReader, OfWhatIsNotThereOrNoFile)
{
    Line_Reader missing("/var/log/missing");
    EXPECT_FALSE(missing.is_open());
    EXPECT_EQ(errno, ENOENT);
    EXPECT_FALSE(missing.has_failed());
    char line[20];
    Line_Reader folder("/var/log");
    EXPECT_FALSE(folder.has_failed());
    EXPECT_FALSE(folder.read(line));
    EXPECT_TRUE(folder.has_failed());
    ASSERT_EQ(::mkfifo(opened.c_str(), 0600), 0);
    Line_Reader fifo(opened.c_str());
    EXPECT_FALSE(fifo.read(line)) << "it waited for a writer";
}

TEST(LineReader, TellsWhatCannotBeOpenedFromWhatIsNotThere)
{
    write_file(opened, "one\n");
    const No_Descriptors none;
    Line_Reader file(opened.c_str());
    EXPECT_FALSE(file.is_open());
    EXPECT_TRUE(file.has_failed());
}

TEST(OpenRegularFile, ReadsWritesAndMakesFiles)
{
    expect_refused("rb", ENOENT);
    ASSERT_TRUE(rewrite());
    EXPECT_EQ(read_file(opened), "new");
    char text[8] = {};
    EXPECT_EQ(std::fread(text, 1, sizeof text, open_regular_file(opened.c_str(), "rb").get()), 3u);
    EXPECT_STREQ(text, "new");
    EXPECT_EQ(fault_of_file(opened.c_str()), 0);
    write_file(opened, "something longer");
    ASSERT_TRUE(rewrite());
    EXPECT_EQ(read_file(opened), "new");
}

TEST(OpenRegularFile, MakesFilesAsTheUmaskSays)
{
    const mode_t before = ::umask(027);
    ASSERT_TRUE(rewrite());
    ::umask(before);
    struct stat status;
    ASSERT_EQ(::stat(opened.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0640u);
}

TEST(OpenRegularFile, FollowsALinkToAFile)
{
    write_file(other, "old");
    make_link(other, opened);
    ASSERT_TRUE(rewrite());
    EXPECT_EQ(read_file(other), "new");
}

TEST(OpenRegularFile, MakesNothingBehindALinkThatLeadsNowhere)
{
    make_link(other, opened);
    expect_refused("wb", EEXIST);
    expect_refused("rb", ENOENT);
    EXPECT_FALSE(exists(other));
}

TEST(OpenRegularFile, RefusesFolders)
{
    make_folder(opened);
    expect_refused("wb", EINVAL);
    expect_refused("rb", EINVAL);
}

TEST(OpenRegularFile, RefusesFifosWithoutWaitingForTheirOtherEnd)
{
    ASSERT_EQ(::mkfifo(opened.c_str(), 0600), 0);
    expect_refused("wb", EINVAL);
    expect_refused("rb", EINVAL);
    const int end = ::open(opened.c_str(), O_RDWR | O_NONBLOCK);
    ASSERT_GE(end, 0);
    expect_refused("wb", EINVAL);
    expect_refused("rb", EINVAL);
    ::close(end);
}

TEST(OpenRegularFile, RefusesDevices)
{
    make_link("/dev/null", opened);
    expect_refused("wb", EINVAL);
    expect_refused("rb", EINVAL);
}

TEST(OpenRegularFile, TellsWhyAPathIsNone)
{
    for (const char* mode : {"rb", "wb"}) {
        EXPECT_FALSE(open_regular_file("", mode));
        EXPECT_EQ(errno, ENOENT);
        EXPECT_FALSE(open_regular_file("/var/log/none/file", mode));
        EXPECT_EQ(errno, ENOENT);
        EXPECT_FALSE(open_regular_file(std::string(65536, 'x').c_str(), mode));
        EXPECT_EQ(errno, ENAMETOOLONG);
    }
}

TEST(WriteRegularFile, WritesItsBytesAndNothingElse)
{
    for (const std::string& bytes : {std::string("a\0b", 3), std::string(), std::string(100000, 'x')}) {
        ASSERT_TRUE(write_regular_file(opened.c_str(), bytes));
        EXPECT_EQ(read_file(opened), bytes);
    }
    make_folder(other);
    EXPECT_FALSE(write_regular_file(other.c_str(), "new"));
    EXPECT_TRUE(exists(other));
    EXPECT_FALSE(write_regular_file("/var/log/none/file", "new"));
}

TEST(WriteText, LeavesNothingOfALongerText)
{
    for (const char* old : {"", "short", "a text that is longer than the one that is written"}) {
        write_file(opened, old);
        EXPECT_TRUE(write_text(opened.c_str(), "a line\n", "and a rest"));
        EXPECT_EQ(read_file(opened), "a line\nand a rest") << old;
    }
    EXPECT_TRUE(write_text(opened.c_str(), ""));
    EXPECT_EQ(read_file(opened), "");
}

// As where the process is killed in between.
TEST(WriteText, KeepsWhatItCannotCutOffApartFromWhatItWrote)
{
    const int file = ::memfd_create("settings", MFD_ALLOW_SEALING);
    ASSERT_EQ(::write(file, "2,5,1\n/var/log/longer", 21), 21);
    ASSERT_EQ(::fcntl(file, F_ADD_SEALS, F_SEAL_SHRINK), 0);
    const std::string path = "/proc/self/fd/" + std::to_string(file);
    EXPECT_TRUE(write_text(path.c_str(), "4,5,1\n", "/var/log/new"));
    EXPECT_EQ(read_file(path), "4,5,1\n/var/log/new\ner");
    ::close(file);
}

TEST(WriteText, GoesOnWhereTheSystemTookAPart)
{
    most_taken = 4;
    EXPECT_TRUE(write_text(opened.c_str(), "a line\n", "and a rest"));
    most_taken = all;
    EXPECT_EQ(read_file(opened), "a line\nand a rest");
}

TEST(WriteText, DoesNotOfferForEverWhatNobodyTakes)
{
    most_taken = 0;
    EXPECT_FALSE(write_text(opened.c_str(), "a text"));
    EXPECT_EQ(errno, EIO);
    EXPECT_FALSE(write_regular_file(opened.c_str(), "a text"));
    EXPECT_TRUE(write_regular_file(opened.c_str(), ""));
    most_taken = all;
}

TEST(WriteText, OnAFullDiskTakesTheRoomOfTheOldOneOrTells)
{
    make_folder("/var/log/disk");
    const Small_Disk disk("/var/log/disk");
    write_file("/var/log/disk/file", "old");
    disk.fill();
    EXPECT_TRUE(write_text("/var/log/disk/file", "a new text"));
    EXPECT_EQ(read_file("/var/log/disk/file"), "a new text");
    EXPECT_FALSE(write_text("/var/log/disk/file", std::string(100000, 'x')));
    EXPECT_FALSE(write_text("/var/log/disk/another", "a text"));
    EXPECT_EQ(errno, ENOSPC);
    EXPECT_EQ(read_file("/var/log/disk/another"), "");
}

TEST(WriteRegularFile, LeavesNoPartOnAFullDisk)
{
    make_folder("/var/log/disk");
    const Small_Disk disk("/var/log/disk");
    const std::string more(100000, 'x');
    EXPECT_FALSE(write_regular_file("/var/log/disk/file", more));
    EXPECT_FALSE(exists("/var/log/disk/file"));
    // A link stays, and what it leads to is no part either.
    write_file("/var/log/disk/file", "old");
    make_link("/var/log/disk/file", opened);
    EXPECT_FALSE(write_regular_file(opened.c_str(), more));
    EXPECT_TRUE(exists(opened));
    EXPECT_EQ(read_file("/var/log/disk/file"), "");
    EXPECT_TRUE(write_regular_file(opened.c_str(), "new"));
    EXPECT_EQ(read_file("/var/log/disk/file"), "new");
}
