#include "generator/Output.h"

#include "generator/Catalogue.h"

#include <filesystem>
#include <fstream>
#include <iterator>

namespace generator {

void write_file(const std::string& path, const std::string& text)
{
    {
        std::ifstream old(path, std::ios::binary);
        if (old && std::string((std::istreambuf_iterator<char>(old)), std::istreambuf_iterator<char>()) == text) return;
    }
    std::error_code error;
    std::filesystem::create_directories(std::filesystem::path(path).parent_path(), error);
    std::ofstream stream(path, std::ios::binary | std::ios::trunc);
    stream << text;
    stream.close();
    if (!stream) throw Error(path + ": cannot write the file");
}

} // namespace generator
