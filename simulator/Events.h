// Port events on their way to registered callbacks. One thread of the library delivers them in order, started with the
// first event; its state is never destroyed. Has a mutex of its own, taken inside the simulator's and never around it.
#ifndef _simulator_Events_h
#define _simulator_Events_h

#include "simulator/Model.h"

#include <condition_variable>
#include <deque>
#include <mutex>
#include <thread>

namespace nvrsim {

class Events {
public:
    static Events& instance();

    HBA_CALLBACKHANDLE add(NVR_PORT_EVENT_CALLBACK* callback, void* data, Wwn port);
    bool knows(HBA_CALLBACKHANDLE handle);
    /// After this no call of the callback runs or comes, unless it is made by that very callback.
    void remove(HBA_CALLBACKHANDLE handle);
    /// Queues an event for every callback of the port. The number of callbacks that will be called.
    size_t post(Wwn port, uint32_t type, uint32_t fabricPortId);
    /// Waits until all events posted so far are delivered. Not to be called from a callback.
    void drain();
    size_t registered();
    /// That deliver events: one from the first event on.
    size_t threads();

private:
    Events() = default;
    void deliver();

    struct Registration {
        NVR_PORT_EVENT_CALLBACK* callback;
        void* data;
        Wwn port;
    };
    struct Event {
        uintptr_t registration;
        uint32_t type;
        uint32_t fabricPortId;
    };

    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::map<uintptr_t, Registration> m_registrations;
    std::deque<Event> m_queue;
    uintptr_t m_next = 1;
    uintptr_t m_running = 0; // registration whose callback runs now
    bool m_started = false;
    std::thread::id m_thread;
};

} // namespace nvrsim

#endif // _simulator_Events_h
