#include "agent/Text_Pool.h"

namespace cimple {

const String& Text_Pool::operator()(std::string_view text)
{
    const auto known = m_texts.find(text);
    if (known != m_texts.end()) return known->second;
    const String made(text.data(), text.size());
    return m_texts.emplace(std::string_view(made.c_str(), made.size()), made).first->second;
}

} // namespace cimple
