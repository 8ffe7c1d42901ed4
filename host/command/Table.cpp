#include "host/command/Table.h"

#include <algorithm>
#include <numeric>

namespace host {
namespace {

constexpr std::size_t gap = 2;
constexpr std::size_t narrowest = 6;

bool is_continuation(char c)
{
    return (static_cast<unsigned char>(c) & 0xC0) == 0x80;
}

/// Length of the well-formed UTF-8 character at a position, or 0.
std::size_t character_at(const std::string& text, std::size_t at)
{
    auto c = static_cast<unsigned char>(text[at]);
    std::size_t size = c < 0x80                ? 1
                       : c >= 0xC2 && c < 0xE0 ? 2
                       : c >= 0xE0 && c < 0xF0 ? 3
                       : c >= 0xF0 && c < 0xF5 ? 4
                                               : 0;
    if (size == 0 || at + size > text.size()) return 0;
    for (std::size_t i = 1; i < size; ++i)
        if (!is_continuation(text[at + i])) return 0;
    return size;
}

bool is_number(const std::string& text)
{
    return !text.empty() && text.find_first_not_of("0123456789.-") == std::string::npos &&
           text.find_first_of("0123456789") != std::string::npos;
}

} // namespace

std::string printable(const std::string& text)
{
    std::string result;
    for (std::size_t at = 0; at < text.size();) {
        std::size_t size = character_at(text, at);
        bool control = size == 1 && (static_cast<unsigned char>(text[at]) < 0x20 || text[at] == 0x7F);
        bool high_control = size == 2 && text[at] == '\xC2' && static_cast<unsigned char>(text[at + 1]) < 0xA0;
        if (size == 0 || control || high_control)
            result += '?';
        else
            result.append(text, at, size);
        at += size ? size : 1;
    }
    return result;
}

std::size_t text_width(const std::string& text)
{
    return static_cast<std::size_t>(
        std::count_if(text.begin(), text.end(), [](char c) { return !is_continuation(c); }));
}

std::string cut(const std::string& text, std::size_t width)
{
    if (text_width(text) <= width) return text;
    const std::string dots = width >= 3 ? "..." : std::string(width, '.');
    std::size_t left = width - dots.size(), at = 0;
    while (at < text.size() && (left > 0 || is_continuation(text[at])))
        if (!is_continuation(text[at++])) --left;
    return text.substr(0, at) + dots;
}

void Table::add(std::vector<std::string> cells)
{
    for (std::string& cell : cells)
        cell = printable(cell);
    cells.resize(m_headers.size());
    m_rows.push_back(std::move(cells));
}

std::string Table::to_text(std::size_t width) const
{
    std::vector<std::size_t> shown, widths;
    std::vector<bool> right;
    for (std::size_t c = 0; c < m_headers.size(); ++c) {
        std::size_t widest = 0;
        bool numbers = true;
        for (const auto& row : m_rows) {
            widest = std::max(widest, text_width(row[c]));
            numbers = numbers && (row[c].empty() || is_number(row[c]));
        }
        if (widest == 0) continue;
        shown.push_back(c);
        widths.push_back(std::max(widest, text_width(m_headers[c])));
        right.push_back(numbers);
    }
    auto total = [&] {
        return std::accumulate(widths.begin(), widths.end(), gap * (widths.empty() ? 0 : widths.size() - 1));
    };
    while (total() > width) {
        auto widest = std::max_element(widths.begin(), widths.end());
        if (*widest <= narrowest) break;
        --*widest;
    }
    std::string text;
    auto line = [&](const std::vector<std::string>& cells) {
        std::string out;
        for (std::size_t i = 0; i < shown.size(); ++i) {
            std::string cell = cut(cells[shown[i]], widths[i]);
            std::string fill(widths[i] - text_width(cell), ' ');
            out += (i ? std::string(gap, ' ') : "") + (right[i] ? fill + cell : cell + fill);
        }
        out.erase(out.find_last_not_of(' ') + 1);
        text += out + "\n";
    };
    if (shown.empty()) return text;
    line(m_headers);
    for (const auto& row : m_rows)
        line(row);
    return text;
}

} // namespace host
