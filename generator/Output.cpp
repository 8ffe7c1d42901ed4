#include "generator/Output.h"

#include "generator/Catalogue.h"

#include <filesystem>
#include <fstream>
#include <iterator>

namespace generator {
namespace {

bool holds(const std::string& path, const std::string& text)
{
    std::error_code error;
    if (!std::filesystem::is_regular_file(path, error)) return false;
    std::ifstream stream(path, std::ios::binary);
    return std::string((std::istreambuf_iterator<char>(stream)), std::istreambuf_iterator<char>()) == text;
}

} // namespace

void write_file(const std::string& path, const std::string& text)
{
    if (holds(path, text)) return;
    std::error_code error;
    std::filesystem::create_directories(std::filesystem::path(path).parent_path(), error);
    std::ofstream stream(path, std::ios::binary | std::ios::trunc);
    stream << text;
    stream.close();
    if (!stream) throw Error(path + ": cannot write the file");
}

} // namespace generator
