/// From a port's WWPN text to the name by which the management library knows it.
#pragma once

#include "foundation/management_api.h"

namespace cimple {

/// Turns `wwpn` (16 digits) into the library's form. False for a text that is none, after the first or second words
/// have been logged, by the conversion's step that refused it.
bool library_name(HBA_WWN& wwn, const char* wwpn, const char* first_words, const char* second_words);

} // namespace cimple
