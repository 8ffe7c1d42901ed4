/// What tests expect, kept as data files beside them.
#pragma once

#include <string>
#include <vector>

namespace nvrtest {

/// The file's text, without lines that begin with "#". Throws std::runtime_error if it cannot be read.
std::string expected_text(const std::string& file);
/// Its lines, cut into words; empty ones left out.
std::vector<std::vector<std::string>> expected_rows(const std::string& file);

} // namespace nvrtest
