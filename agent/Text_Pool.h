/// Equal texts of one rebuild, held once: many instances of a SAN say the same words and name the same targets.
///
/// The texts stay with the instances when the pool ends. For texts of which there are few. No locks.
#pragma once

#include <string_view>
#include <unordered_map>

#include "runtime/String.h"

namespace cimple {

class Text_Pool {
public:
    const String& operator()(std::string_view text)
    {
        const auto known = m_texts.find(text);
        if (known != m_texts.end()) return known->second;
        const String made(text.data(), text.size());
        return m_texts.emplace(std::string_view(made.c_str(), made.size()), made).first->second;
    }

private:
    std::unordered_map<std::string_view, String> m_texts; // a key looks at the bytes of its own String
};

} // namespace cimple
