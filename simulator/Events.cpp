#include "simulator/Events.h"

#include <pthread.h>

namespace nvrsim {

Events& Events::instance()
{
    static Events* const events = new Events;
    return *events;
}

HBA_CALLBACKHANDLE Events::add(NVR_PORT_EVENT_CALLBACK* callback, void* data, Wwn port)
{
    std::lock_guard<std::mutex> lock(m_mutex);
    const uintptr_t handle = m_next++;
    m_registrations.emplace(handle, Registration{callback, data, port});
    return reinterpret_cast<HBA_CALLBACKHANDLE>(handle);
}

bool Events::knows(HBA_CALLBACKHANDLE handle)
{
    std::lock_guard<std::mutex> lock(m_mutex);
    return m_registrations.count(reinterpret_cast<uintptr_t>(handle)) != 0;
}

void Events::remove(HBA_CALLBACKHANDLE handle)
{
    const auto id = reinterpret_cast<uintptr_t>(handle);
    std::unique_lock<std::mutex> lock(m_mutex);
    m_registrations.erase(id);
    if (std::this_thread::get_id() == m_thread) return;
    m_changed.wait(lock, [&] { return m_running != id; });
}

size_t Events::post(Wwn port, uint32_t type, uint32_t fabricPortId)
{
    std::lock_guard<std::mutex> lock(m_mutex);
    size_t count = 0;
    for (const auto& [handle, registration] : m_registrations) {
        if (registration.port != port) continue;
        m_queue.push_back({handle, type, fabricPortId});
        ++count;
    }
    if (count && !m_started) {
        std::thread thread([this] { deliver(); });
        m_thread = thread.get_id();
        thread.detach();
        m_started = true;
    }
    m_changed.notify_all();
    return count;
}

void Events::drain()
{
    std::unique_lock<std::mutex> lock(m_mutex);
    m_changed.wait(lock, [&] { return m_queue.empty() && !m_running; });
}

size_t Events::registered()
{
    std::lock_guard<std::mutex> lock(m_mutex);
    return m_registrations.size();
}

size_t Events::threads()
{
    std::lock_guard<std::mutex> lock(m_mutex);
    return m_started;
}

void Events::deliver()
{
    pthread_setname_np(pthread_self(), "nvrsim-events"); // it stays until the process ends
    std::unique_lock<std::mutex> lock(m_mutex);
    for (;;) {
        m_changed.wait(lock, [&] { return !m_queue.empty(); });
        const Event event = m_queue.front();
        m_queue.pop_front();
        const auto found = m_registrations.find(event.registration);
        if (found != m_registrations.end()) {
            const Registration registration = found->second;
            m_running = event.registration;
            lock.unlock();
            registration.callback(registration.data, to_wire(registration.port), event.type, event.fabricPortId);
            lock.lock();
            m_running = 0;
        }
        m_changed.notify_all();
    }
}

} // namespace nvrsim
