/// Port events on their way from the libraries' threads to the one worker that delivers them.
///
/// Process-wide and never destroyed: a library may call back whenever it likes, long after the provider has gone. Takes
/// records only between open() and close(), and drops all others. Two mutexes: that of the queue, and around it that of
/// the signal; a library's thread takes one after the other, never both. Any thread may push; one worker pops.
#pragma once

#include <atomic>
#include <cstddef>
#include <deque>

#include "foundation/management_api.h"
#include "runtime/Mutex.h"
#include "runtime/Type.h"

namespace cimple {

struct indication_data {
    HBA_WWN portWWN;
    uint32 eventType; ///< as the Common HBA API numbers events
    uint32 fabricPortID;
};

class Alert_Queue {
public:
    static Alert_Queue& instance();

    /// So many records wait at most, 16 MiB of them, however long a subscriber takes.
    static constexpr std::size_t most_records = 1048576;

    /// From now on records are taken. The queue is empty and no worker runs.
    void open();
    /// From now on records are dropped, and the worker ends once it has popped what is there.
    void close();

    /// False if the record was dropped, since the queue is closed or (then logged) full, or memory is out.
    bool push(const indication_data& record);
    /// Waits for a record and takes it; false: the queue is closed and empty.
    bool pop(indication_data& record);

    /// True from close() to open(): what is popped now is not to be delivered.
    bool isCleanUp() const { return m_bIndicationCleanUp; }

private:
    template <class>
    friend class Immortal;
    Alert_Queue() = default;
    /// Takes the oldest record; false: there is none.
    bool take(indication_data& record);

    Mutex m_IndicationQueueMutex{false, "m_IndicationQueueMutex", Lock_Place::innermost};
    std::deque<indication_data> m_IndicationQueue;
    bool m_takes = false; // under the queue's mutex
    Mutex m_IndicationSignalMutex{false, "m_IndicationSignalMutex", Lock_Place::alert_signal};
    Cond m_IndicationSignalCond;
    std::atomic<bool> m_bIndicationCleanUp{true}; // written under the signal's mutex
};

} // namespace cimple
