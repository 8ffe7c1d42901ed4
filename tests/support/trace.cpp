#include "tests/support/trace.h"

#include <fstream>

namespace nvrtest {

std::vector<Trace_Line> trace_file_lines(const std::string& path, std::streamoff from)
{
    std::vector<Trace_Line> lines;
    std::ifstream file(path);
    file.seekg(from);
    for (std::string line; std::getline(file, line);) {
        if (line.rfind("[threadid =", 0) != 0) {
            if (!lines.empty()) lines.back().words += "\n" + line;
            continue;
        }
        // Three groups, "[thread] [time] [file:line]", then the level's, directly behind the third.
        std::size_t end = 0;
        for (int group = 0; group < 4 && end != std::string::npos; group++)
            end = line.find(']', end + 1);
        lines.push_back({line.substr(0, line.find(']') + 1),
                         end == std::string::npos || end + 2 > line.size() ? line : line.substr(end + 2)});
    }
    return lines;
}

std::vector<std::string> trace_file_words(const std::string& path)
{
    std::vector<std::string> words;
    for (Trace_Line& line : trace_file_lines(path))
        words.push_back(std::move(line.words));
    return words;
}

bool Contains_In_Order::MatchAndExplain(const std::vector<std::string>& words, std::ostream* explanation) const
{
    auto wanted = m_wanted.begin();
    for (const std::string& word : words)
        if (wanted != m_wanted.end() && word == *wanted) ++wanted;
    if (wanted == m_wanted.end()) return true;
    if (explanation) *explanation << "which lacks, from there on: " << testing::PrintToString(*wanted);
    return false;
}

void Contains_In_Order::DescribeTo(std::ostream* os) const
{
    *os << "has in order: " << testing::PrintToString(m_wanted);
}

void Contains_In_Order::DescribeNegationTo(std::ostream* os) const
{
    *os << "lacks, or has in another order: " << testing::PrintToString(m_wanted);
}

} // namespace nvrtest
