#pragma once

#include <string>

namespace generator {

/// Writes `text` to `path`, making folders on the way. A file that holds the text already is left alone, so that its
/// time does not change and nothing is compiled again. Throws Error.
void write_file(const std::string& path, const std::string& text);

} // namespace generator
