/// Indication subscriptions of clients: filters, listener destinations and the subscriptions that tie them, as a CIM
/// server keeps them for its clients (DMTF DSP1054); and the delivery to the listeners' HTTP addresses (DSP0200).
///
/// Kept in memory, for as long as the server runs; their number is bounded. Any thread. Deliveries have a thread of
/// their own, so that a slow listener holds up neither the module nor a client; when too many wait, the oldest is
/// dropped. Operations that fail throw Cim_Fault.
#pragma once

#include "host/Host.h"

#include <condition_variable>
#include <deque>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <vector>

namespace host {

class Subscriptions {
public:
    explicit Subscriptions(Host& host);
    /// Ends all subscriptions and waits for the delivery under way.
    ~Subscriptions();
    Subscriptions(const Subscriptions&) = delete;
    Subscriptions& operator=(const Subscriptions&) = delete;

    /// Is the class one of those kept here?
    bool serves(const std::string& class_name) const;
    /// Their declarations, which clients ask for before they create one.
    static const Schema& schema();

    std::vector<Instance> instances(const std::string& class_name) const;
    std::optional<Instance> find(const Path& path) const;
    /// Keeps the instance; a subscription is activated at the providers first. Returns its path.
    Path create(Instance instance);
    /// A filter or destination goes only when no subscription uses it.
    void remove(const Path& path);

private:
    struct Entry {
        Instance instance;
        std::vector<int> ids = {}; ///< of an active subscription at the host, one a namespace
    };
    struct Delivery {
        std::string url, body;
    };

    std::vector<int> activate(const Instance& subscription);
    void end(const std::vector<int>& ids);
    void queue(const std::string& url, const Indication& indication);
    void deliver_all();

    Host& m_host;
    mutable std::mutex m_mutex;
    std::vector<Entry> m_entries;

    std::mutex m_queue_mutex;
    std::condition_variable m_changed;
    std::deque<Delivery> m_queue;
    bool m_stopped = false;
    std::size_t m_sent = 0;
    std::thread m_thread;
};

} // namespace host
