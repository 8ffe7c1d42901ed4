#include "runtime/Mutex.h"

#include <cassert>
#include <cerrno>
#include <ctime>

namespace cimple {

void Mutex::lock()
{
    m_order.check();
    const int status = pthread_mutex_lock(&_rep.mutex);
    if (status != 0)
        __assert_fail("pthread_mutex_lock(&((MutexRep*)_rep)->mutex) == 0", __FILE__, __LINE__, __PRETTY_FUNCTION__);
    m_order.taken();
}

void Mutex::unlock()
{
    m_order.given();
    pthread_mutex_unlock(&_rep.mutex);
}

int Mutex::try_lock()
{
    const int status = pthread_mutex_trylock(&_rep.mutex);
    if (status == 0) m_order.taken();
    return status == 0 || status == EBUSY ? status : -1;
}

bool Mutex::lock_soon()
{
    constexpr timespec pause = {0, 1000000};
    for (int tries = 0; tries < 100; tries++) {
        if (try_lock() == 0) return true;
        ::nanosleep(&pause, nullptr);
    }
    return false;
}

void Cond::wait(Mutex& mutex)
{
    // Also a thread that is cancelled here leaves with the mutex in its hands.
    class Let_Go {
    public:
        explicit Let_Go(const Ordered_Lock& lock) : m_lock(lock)
        {
            m_lock.given();
            m_lock.check();
        }
        ~Let_Go() { m_lock.taken(); }

    private:
        const Ordered_Lock& m_lock;
    };
    const Let_Go let_go(mutex.m_order);
    pthread_cond_wait(&m_cond, &mutex._rep.mutex);
}

void Cond::signal()
{
    pthread_cond_signal(&m_cond);
}

void Cond::broadcast()
{
    pthread_cond_broadcast(&m_cond);
}

} // namespace cimple
