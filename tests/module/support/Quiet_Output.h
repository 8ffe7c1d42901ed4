/// Standard output leads nowhere while this lives: a traversal tells of each of its steps there.
#pragma once

#include <cstdio>
#include <fcntl.h>
#include <unistd.h>

namespace nvrtest {

class Quiet_Output {
public:
    Quiet_Output() : m_own(::dup(STDOUT_FILENO))
    {
        std::fflush(stdout);
        const int nowhere = ::open("/dev/null", O_WRONLY | O_CLOEXEC);
        ::dup2(nowhere, STDOUT_FILENO);
        ::close(nowhere);
    }
    ~Quiet_Output()
    {
        std::fflush(stdout);
        ::dup2(m_own, STDOUT_FILENO);
        ::close(m_own);
    }
    Quiet_Output(const Quiet_Output&) = delete;
    Quiet_Output& operator=(const Quiet_Output&) = delete;

private:
    const int m_own;
};

} // namespace nvrtest
