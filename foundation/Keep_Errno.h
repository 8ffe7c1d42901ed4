/// Leaves errno, at the end of a scope, as it was at its start: one reader of the settings decides by errno alone.
#pragma once

#include <cerrno>

namespace cimple {

class Keep_Errno {
public:
    Keep_Errno() : m_errno(errno) {}
    ~Keep_Errno() { errno = m_errno; }
    Keep_Errno(const Keep_Errno&) = delete;
    Keep_Errno& operator=(const Keep_Errno&) = delete;

private:
    const int m_errno;
};

} // namespace cimple
