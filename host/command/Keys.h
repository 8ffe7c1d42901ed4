/// What a path says of the object it leads to, and the names of ports in it.
#pragma once

#include "host/Value.h"

#include <string>

namespace host {

/// A key's value as text; empty if the path has no such key.
std::string key_text(const Path& path, const char* key);

/// A World Wide Name that a user typed, as the module writes it: upper case, without separators.
std::string plain_name(const std::string& text);

} // namespace host
