#include "host/command/Listing.h"

#include "host/command/Table.h"
#include "host/command/Views.h"

#include <nlohmann/json.hpp>

#include <algorithm>

namespace host {
namespace {

/// Quoted where a comma, a quote or a blank at an end asks for it.
std::string csv_cell(const std::string& raw)
{
    const std::string text = printable(raw);
    if (text.find_first_of(",\"") == std::string::npos && (text.empty() || (text.front() != ' ' && text.back() != ' ')))
        return text;
    std::string quoted = "\"";
    for (char c : text)
        quoted += c == '"' ? std::string("\"\"") : std::string(1, c);
    return quoted + '"';
}

std::string csv_text(const Value& value)
{
    return value.is_null() ? "" : value.to_text();
}

} // namespace

void Listing::add(std::vector<Cell> cells)
{
    cells.resize(m_fields.size(), Cell(""));
    m_rows.push_back(std::move(cells));
}

std::string Listing::table(std::size_t width) const
{
    std::vector<std::string> headers;
    for (const Field& field : m_fields)
        headers.push_back(field.label);
    Table table(std::move(headers));
    for (const std::vector<Cell>& row : m_rows) {
        std::vector<std::string> cells;
        for (const Cell& cell : row)
            cells.push_back(cell.shown);
        table.add(std::move(cells));
    }
    return table.to_text(width);
}

std::string Listing::blocks() const
{
    std::size_t widest = 0;
    for (const Field& field : m_fields)
        widest = std::max(widest, text_width(field.label));
    std::string text;
    for (const std::vector<Cell>& row : m_rows) {
        if (!text.empty()) text += "\n";
        for (std::size_t i = 0; i < row.size(); ++i) {
            if (row[i].shown.empty()) continue;
            const std::string& label = m_fields[i].label;
            text += label + std::string(widest - text_width(label) + 2, ' ') + printable(row[i].shown) + "\n";
        }
    }
    return text;
}

std::string Listing::csv() const
{
    std::vector<std::string> cells;
    for (const Field& field : m_fields)
        cells.push_back(field.key);
    std::string text = csv_line(cells);
    for (const std::vector<Cell>& row : m_rows) {
        cells.clear();
        for (const Cell& cell : row)
            cells.push_back(csv_text(cell.value));
        text += csv_line(cells);
    }
    return text;
}

std::string csv_line(const std::vector<std::string>& cells)
{
    std::string line;
    for (std::size_t i = 0; i < cells.size(); ++i)
        line += (i ? "," : "") + csv_cell(cells[i]);
    return line + "\r\n";
}

std::string csv_record(const std::vector<Named_Value>& fields)
{
    std::vector<std::string> names, values;
    for (const Named_Value& field : fields) {
        names.push_back(field.name);
        values.push_back(csv_text(field.value));
    }
    return csv_line(names) + csv_line(values);
}

nlohmann::ordered_json Listing::json() const
{
    nlohmann::ordered_json rows = nlohmann::ordered_json::array();
    for (const std::vector<Cell>& row : m_rows) {
        nlohmann::ordered_json object = nlohmann::ordered_json::object();
        for (std::size_t i = 0; i < row.size(); ++i)
            object[m_fields[i].key] = to_json(row[i].value);
        rows.push_back(std::move(object));
    }
    return rows;
}

} // namespace host
