/// The functions that a shared object exports, read from its file: no code of it runs.
#pragma once

#include <string>
#include <vector>

namespace host {

/// Names of the defined dynamic function symbols of a 64-bit ELF file, in the order of its table. Empty with `error`
/// filled when the file cannot be read or is none; offsets outside of the file are refused, never followed.
std::vector<std::string> exported_functions(const std::string& file, std::string& error);

} // namespace host
