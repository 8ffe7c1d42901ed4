/// A scope of our own business on a caller's thread: errno is at its end as it was at its start, and the thread is not
/// cancelled in between.
///
/// Messages and files of ours must not show in what the caller does next; one reader of settings decides by errno
/// alone. Destructors log, and a thread that unwinds out of one ends the process.
#pragma once

#include <cerrno>
#include <pthread.h>

namespace cimple {

class Undisturbed {
public:
    Undisturbed() : m_errno(errno) { ::pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &m_cancel_state); }
    ~Undisturbed()
    {
        ::pthread_setcancelstate(m_cancel_state, nullptr);
        errno = m_errno;
    }
    Undisturbed(const Undisturbed&) = delete;
    Undisturbed& operator=(const Undisturbed&) = delete;

private:
    const int m_errno;
    int m_cancel_state = PTHREAD_CANCEL_ENABLE;
};

} // namespace cimple
