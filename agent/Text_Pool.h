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
    /// The text, held by the pool; for copies that are made before the next call.
    const String& operator()(std::string_view text);

private:
    std::unordered_map<std::string_view, String> m_texts; // a key looks at the bytes of its own String
};

} // namespace cimple
