#include "logs/Alert_Queue.h"

#include "foundation/CLogger.h"
#include "runtime/Immortal.h"
#include "runtime/guarded.h"

namespace cimple {

Alert_Queue& Alert_Queue::instance()
{
    static Immortal<Alert_Queue> queue;
    return *queue;
}

void Alert_Queue::open()
{
    Auto_Mutex signal(m_IndicationSignalMutex);
    Auto_Mutex queue(m_IndicationQueueMutex);
    m_IndicationQueue.clear();
    m_takes = true;
    m_bIndicationCleanUp = false;
}

void Alert_Queue::close()
{
    Auto_Mutex signal(m_IndicationSignalMutex);
    {
        Auto_Mutex queue(m_IndicationQueueMutex);
        m_takes = false;
    }
    m_bIndicationCleanUp = true;
    m_IndicationSignalCond.signal();
}

bool Alert_Queue::push(const indication_data& record)
{
    {
        Auto_Mutex queue(m_IndicationQueueMutex);
        if (!m_takes) return false;
        const bool is_full = m_IndicationQueue.size() >= most_records;
        if (is_full || !guarded([&] { m_IndicationQueue.push_back(record); })) {
            NVR_LOG("Failed to allocate memory to queue the event");
            return false;
        }
    }
    Auto_Mutex signal(m_IndicationSignalMutex);
    NVR_LOG("sending the signal for thread to indicate");
    m_IndicationSignalCond.signal();
    return true;
}

bool Alert_Queue::take(indication_data& record)
{
    Auto_Mutex queue(m_IndicationQueueMutex);
    if (m_IndicationQueue.empty()) return false;
    record = m_IndicationQueue.front();
    m_IndicationQueue.pop_front();
    return true;
}

bool Alert_Queue::pop(indication_data& record)
{
    NVR_LOG("waiting for signal to occur");
    Auto_Mutex signal(m_IndicationSignalMutex);
    while (!take(record)) {
        if (m_bIndicationCleanUp) return false;
        m_IndicationSignalCond.wait(m_IndicationSignalMutex);
    }
    return true;
}

} // namespace cimple
