/// The class reference as data: lists beside the tests, written down apart from the MOF files.
#pragma once

#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

namespace cimple::expected {

using Row = std::vector<std::string>;

/// The rows of tests/classes/expected/<name>, each cut into words; comments are left out. Throws for a missing file.
inline std::vector<Row> rows(const std::string& name)
{
    std::ifstream stream(std::string(EXPECTED_FOLDER) + "/" + name);
    if (!stream) throw std::runtime_error("no list " + name);
    std::vector<Row> result;
    for (std::string line; std::getline(stream, line);) {
        if (line.empty() || line[0] == '#') continue;
        std::istringstream words(line);
        result.emplace_back();
        for (std::string word; words >> word;)
            result.back().push_back(word);
    }
    return result;
}

/// An MI kind: its word in a factory's name, and the letter that the bridge is given.
struct Mi_Kind {
    const char* word;
    char letter;
};

/// What the providers of a kind of class ("plain", "association", "indication") export.
inline std::vector<Mi_Kind> mi_kinds(const std::string& kind)
{
    if (kind == "association") return {{"Instance", 'I'}, {"Method", 'M'}, {"Association", 'A'}};
    if (kind == "indication") return {{"Indication", 'N'}, {"Method", 'M'}};
    return {{"Instance", 'I'}, {"Method", 'M'}};
}

} // namespace cimple::expected
