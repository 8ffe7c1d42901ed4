/// The texts of scalar values that key texts and dumps share.
///
/// Internal to the runtime. Pure functions; the same text in every locale.
#pragma once

#include "runtime/String.h"

namespace cimple {

/// Appends the value of that type at `value`: booleans as words, numbers in decimal (reals with six places),
/// date-times in their 25-character form. Strings and char16 have texts of their own.
void append_scalar(uint16 type, const void* value, String& text);

} // namespace cimple
