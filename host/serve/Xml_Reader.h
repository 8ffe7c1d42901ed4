/// XML as the standard has it, read strictly: what the parser would let pass is refused before it, so that two readers
/// of one request cannot differ. Pure functions; any bytes may be given.
#pragma once

#include <pugixml.hpp>

#include <string>
#include <string_view>

namespace host {

/// True if `text` is UTF-8 without the characters that no XML can carry.
bool is_xml_text(std::string_view text);

/// Reads a whole document of UTF-8. Result: what is wrong with it, or "". Document type declarations are passed over,
/// so that no entities can be had but those of XML's own.
std::string read_xml(std::string_view text, pugi::xml_document& document);

/// All that an element says, however many sections and comments it is made of.
std::string text_of(const pugi::xml_node& element);

/// The first element within another, or none.
pugi::xml_node first_element(const pugi::xml_node& parent);

} // namespace host
