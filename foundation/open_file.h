/// Opens files so that no caller is ever blocked, whatever stands at the path: a FIFO, a full pipe, a terminal.
#pragma once

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

/// Empties the file or makes it, and writes the text; false if it cannot be opened, with errno set. What does not fit
/// is lost. Takes no lock, also none of the C library's: to be called by a process that ends, too.
bool write_text(const char* path, std::string_view text);

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
