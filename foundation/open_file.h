/// Opens files so that no caller is ever blocked, whatever stands at the path: a FIFO, a full pipe, a terminal.
#pragma once

#include <cstddef>
#include <cstdio>
#include <memory>
#include <string_view>

namespace cimple {

struct Close_File {
    void operator()(std::FILE* file) const { std::fclose(file); }
};
using File = std::unique_ptr<std::FILE, Close_File>;

/// As fopen with mode "r", "w" or "a+"; empty on failure, with errno set. A read that would wait ends the file, a write
/// that would wait fails. The file is closed in programs that the process starts.
File open_file(const char* path, const char* mode);

/// Reads a file by lines and asks for no memory: settings that were not read would be lost when they are written back.
class Line_Reader {
public:
    /// Opens the file as open_file does.
    explicit Line_Reader(const char* path);
    ~Line_Reader();
    Line_Reader(const Line_Reader&) = delete;
    Line_Reader& operator=(const Line_Reader&) = delete;

    bool is_open() const { return m_fd >= 0; }
    /// As fgets: a line with its end, or as much of it as there is room for; false at the end of the file, or of what
    /// could be read of it.
    template <std::size_t Size>
    bool read(char (&line)[Size])
    {
        return read(line, Size);
    }

    /// Something of the file was not read: it could not be opened, or a read was refused. That it is not there is none.
    bool has_failed() const { return m_failed; }

private:
    bool read(char* line, std::size_t size);
    int next();

    const int m_fd;
    bool m_failed;
    char m_bytes[512];
    std::size_t m_at = 0, m_end = 0;
};

/// Makes the file, or writes over what it holds: the text and what comes behind it, and nothing else. False, with errno
/// set, if that cannot be done. All in one write, so that no reader finds the one without the other, and that on a full
/// disk a text of less than a block goes into the room of the old one. Asks for no memory and takes no lock, also none
/// of the C library's: to be called by a process that ends, too.
bool write_text(const char* path, std::string_view text, std::string_view rest = {});

/// As open_file, for paths that clients name, which may lead anywhere: as fopen with mode "rb" or "wb", but for regular
/// files alone (errno EINVAL for others). Writing empties a file that is there, also behind a link, and else makes it;
/// a link that leads nowhere is refused (EEXIST).
File open_regular_file(const char* path, const char* mode);

/// Writes the bytes, and nothing else, to such a file; false if that cannot be done. No part of them then stays: the
/// file is removed, or left empty behind a link.
bool write_regular_file(const char* path, std::string_view bytes);

/// 0 if such a path leads to a regular file, else why it does not: the errno of the look, EINVAL for what is no file.
int fault_of_file(const char* path);

} // namespace cimple
