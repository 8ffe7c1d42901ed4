/// The usual WBEM text form of object paths, both ways:
///
///     [//host/][namespace:]Class[.Key=value,Key=value]
///
/// A string value is quoted, with `\"` and `\\` inside; an integer is decimal, a boolean TRUE or FALSE; a reference is
/// the quoted text of its path. Pure functions; any thread.
#pragma once

#include "host/Value.h"

#include <string>

namespace host {

class Schema;

struct Path_Parse {
    bool ok = false;
    Path path;
    /// What is wrong and at which character (from 1), when not ok.
    std::string error;
};

/// Reads a path. With a schema, keys get the type that their class declares, and quoted texts of reference keys become
/// references (at most 8 within each other); a key that the class does not have, or a value that its type cannot hold,
/// is an error. Without a schema, or for a class that it does not know, quoted texts are strings, numbers are sint64
/// (uint64 when too large), and nothing is refused but bad form. `name_space` stands where the text has none. Any
/// bytes may be given; texts above 64 KiB are refused.
Path_Parse parse_path(const std::string& text, const Schema* schema, const std::string& name_space);

/// Writes a path; what is written reads back as the same path.
std::string path_to_text(const Path& path);

/// `text` in double quotes, with quotes and backslashes escaped.
std::string quote(const std::string& text);

} // namespace host
