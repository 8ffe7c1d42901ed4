// Each text is made anew; the pool holds the newest one for its caller.
#include "agent/Text_Pool.h"

namespace cimple {

const String& Text_Pool::operator()(std::string_view text)
{
    m_texts.clear();
    const String made(text.data(), text.size());
    return m_texts.emplace(std::string_view(made.c_str(), made.size()), made).first->second;
}

} // namespace cimple
