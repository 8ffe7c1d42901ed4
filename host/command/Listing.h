/// Rows of named fields, printed as people or programs want them: an aligned table, blocks of one field a line, CSV as
/// RFC 4180 has it, or JSON.
///
/// Plain data; one thread at a time.
#pragma once

#include "host/Value.h"

#include <nlohmann/json_fwd.hpp>

#include <string>
#include <vector>

namespace host {

class Listing {
public:
    struct Field {
        std::string key;   ///< its name in CSV and JSON
        std::string label; ///< its name for people
    };
    /// What people see, and the value as it is. Null: nothing in CSV, null in JSON.
    struct Cell {
        Cell(std::string text, Value plain) : shown(std::move(text)), value(std::move(plain)) {}
        /// A text, or null if it is empty.
        Cell(const std::string& text) : shown(text), value(text.empty() ? Value() : Value::string(text)) {}
        std::string shown;
        Value value;
    };

    explicit Listing(std::vector<Field> fields) : m_fields(std::move(fields)) {}
    /// As many cells as there are fields.
    void add(std::vector<Cell> cells);
    bool empty() const { return m_rows.empty(); }

    /// A line a row that fits the width; fields that no row fills are left out.
    std::string table(std::size_t width) const;
    /// A line a field, with an empty line between rows.
    std::string blocks() const;
    /// A line with the keys and a line a row, each ended by CR and LF, with control characters as '?'.
    std::string csv() const;
    /// An array with an object for each row.
    nlohmann::ordered_json json() const;

private:
    const std::vector<Field> m_fields;
    std::vector<std::vector<Cell>> m_rows;
};

/// A line of CSV, ended by CR and LF: cells quoted where they ask for it, control characters as '?'.
std::string csv_line(const std::vector<std::string>& cells);
/// One row with a line of names before it, as `Listing::csv` writes it.
std::string csv_record(const std::vector<Named_Value>& fields);

} // namespace host
