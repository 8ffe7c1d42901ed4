#include "host/command/Keys.h"

#include <cctype>

namespace host {

std::string key_text(const Path& path, const char* key)
{
    const Value* value = path.find(key);
    return value ? value->as_text() : "";
}

std::string plain_name(const std::string& text)
{
    std::string digits;
    for (char c : text)
        if (c != ':' && c != '-') digits += static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
    return digits;
}

} // namespace host
