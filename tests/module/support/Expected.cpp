#include "tests/module/support/Expected.h"

#include <fstream>
#include <sstream>
#include <stdexcept>

namespace nvrtest {

std::string expected_text(const std::string& file)
{
    const std::string path = std::string(NVR_EXPECTED_DIR) + "/" + file;
    std::ifstream stream(path);
    if (!stream) throw std::runtime_error("cannot read " + path);
    std::string text;
    for (std::string line; std::getline(stream, line);)
        if (line.rfind('#', 0) != 0) text += line + '\n';
    return text;
}

std::vector<std::vector<std::string>> expected_rows(const std::string& file)
{
    std::vector<std::vector<std::string>> rows;
    std::istringstream lines(expected_text(file));
    for (std::string line; std::getline(lines, line);) {
        std::istringstream words(line);
        std::vector<std::string> row;
        for (std::string word; words >> word;)
            row.push_back(word);
        if (!row.empty()) rows.push_back(row);
    }
    return rows;
}

} // namespace nvrtest
