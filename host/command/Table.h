/// Text in aligned columns that fits a width: wide columns give way first, cut texts end in "...".
///
/// Plain data; one thread at a time.
#pragma once

#include <string>
#include <vector>

namespace host {

class Table {
public:
    explicit Table(std::vector<std::string> headers) : m_headers(std::move(headers)) {}

    /// As many cells as there are headers. Control characters come out as '?'.
    void add(std::vector<std::string> cells);
    bool empty() const { return m_rows.empty(); }
    /// Lines with a header, each ended; columns that no row fills are left out. Numbers stand right.
    std::string to_text(std::size_t width) const;

private:
    std::vector<std::string> m_headers;
    std::vector<std::vector<std::string>> m_rows;
};

/// Columns that a UTF-8 text takes on a terminal, counted as one for each character.
std::size_t text_width(const std::string& text);
/// Cut to a width, with "..." where something is missing; never inside a character.
std::string cut(const std::string& text, std::size_t width);
/// Control characters and bytes that are no UTF-8 as '?'.
std::string printable(const std::string& text);

} // namespace host
