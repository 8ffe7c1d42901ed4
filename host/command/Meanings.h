/// What the return values of the module's services mean, in words.
#pragma once

#include "host/command/Actions.h"

namespace host {

/// The words for a method's return value: the method's own, else those that all services share. Never empty.
std::string return_words(const Meanings& own, std::uint64_t value);

/// The words among these, or empty.
std::string words_among(const Meanings& meanings, std::uint64_t value);
/// The words of all bits that are set, with commas between.
std::string words_of_bits(const Meanings& bits, std::uint64_t value);

} // namespace host
