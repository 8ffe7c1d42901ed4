#include "fuzz/fuzzing.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "foundation/CLogger.h"

namespace fuzzing {

std::string Bytes::text(std::size_t most)
{
    const std::size_t size = std::min(most, static_cast<std::size_t>(m_end - m_at));
    std::string text(reinterpret_cast<const char*>(m_at), size);
    m_at += size;
    return text;
}

void Bytes::fill(void* place, std::size_t size)
{
    size = std::min(size, static_cast<std::size_t>(m_end - m_at));
    if (size > 0) std::memcpy(place, m_at, size);
    m_at += size;
}

void expect(bool kept, const char* promise)
{
    if (kept) return;
    std::fprintf(stderr, "broken promise: %s\n", promise);
    std::abort();
}

Every_Line::Every_Line()
{
    cimple::CLogger::instance()->attach(this);
    cimple::CLogger::instance()->enable();
}

Every_Line::~Every_Line()
{
    cimple::CLogger::instance()->detach(this);
}

} // namespace fuzzing
