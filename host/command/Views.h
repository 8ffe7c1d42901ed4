/// What people see of instances, paths and results: tables with the columns that matter for a class, lists of
/// properties with the words of their numbers, and JSON.
///
/// Pure functions; any thread.
#pragma once

#include "host/Host.h"
#include "host/Schema.h"
#include "host/command/Listing.h"

#include <nlohmann/json_fwd.hpp>

#include <string>
#include <vector>

namespace host {

/// Width that tables and lists keep to.
constexpr std::size_t page_width = 120;

/// A property's value for people: the word where the class has one, units where they are known.
std::string value_text(const Element_Record* property, const Value& value);
/// The same with the number beside its word: "2 (OK)".
std::string value_text_with_number(const Element_Record* property, const Value& value);

/// A row an instance: known classes by their own columns, others by their keys and names. `columns` overrides; without
/// them, `all` takes every property.
Listing instance_listing(const std::vector<Instance>& instances, const Schema& schema,
                         const std::vector<std::string>& columns, bool all);
/// The same as a table that fits the page.
std::string instance_table(const std::vector<Instance>& instances, const Schema& schema,
                           const std::vector<std::string>& columns);
/// Every property, one a line, the values aligned and wrapped; null ones only if `nulls`.
std::string property_list(const Instance& instance, const Schema& schema, bool nulls);

nlohmann::ordered_json to_json(const Value& value);
nlohmann::ordered_json to_json(const Instance& instance);
/// JSON as text, with bytes that are no UTF-8 replaced.
std::string json_text(const nlohmann::ordered_json& json);

} // namespace host
