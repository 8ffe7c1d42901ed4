/// Instances as text, one property a line, so that a difference from what is expected shows as lines.
///
///     NVRHBA_FCPort[0] uint64 Speed = 16000000000
///
/// The number is the place in the enumeration; properties stand in the order of their names. Null ones are left out.
#pragma once

#include <string>
#include <vector>

#include "host/Host.h"

namespace nvrtest {

/// Line breaks and control characters in texts are escaped. Times of the present day are written as "<now>".
std::string to_lines(const std::string& class_name, const std::vector<host::Instance>& instances);

/// The lines of `text` that begin with "<class_name>[", and how many there are in all.
std::string lines_of_class(const std::string& text, const std::string& class_name);

/// Empty if both are the same; else the lines that only one of them has, with "-" (expected) or "+" before them.
std::string difference(const std::string& expected, const std::string& actual);

} // namespace nvrtest
