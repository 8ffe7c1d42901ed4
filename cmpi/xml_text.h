/// Text that an XML document can carry. CIM servers put our strings into XML, and one wrong byte from a library spoils
/// the whole answer for the client.
#pragma once

#include "runtime/String.h"

namespace cimple {

/// How many bytes at the start of `text` are well-formed UTF-8 of characters that XML 1.0 allows.
std::size_t carried_by_xml(const char* text, std::size_t size);

/// The text with each byte that XML cannot carry replaced by '?'.
String as_xml_text(const String& text);

} // namespace cimple
