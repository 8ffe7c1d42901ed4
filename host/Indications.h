/// Subscriptions: filters activated at providers in the manner's order, and indications handed to their sinks.
///
/// Thread-safe. After `unsubscribe` has returned the sink is not called any more.
#pragma once

#include "host/Modules.h"

#include <map>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

namespace host {

class Indications final : public Indication_Taker {
public:
    Indications(Broker& broker, Modules& modules, Workers& workers);
    /// Waits for calls on other threads.
    ~Indications() override;

    Status subscribe(const std::string& name_space, const std::string& class_name, Indication_Sink sink,
                     const std::string& query, int& id);
    Status unsubscribe(int id);
    bool deliver(const std::string& name_space, const Instance& instance) override;
    void settle();
    /// disableIndications at every provider that has them enabled.
    void disable_all();

private:
    struct Subscription;
    enum class Call { authorize, must_poll, activate, deactivate, enable, disable };

    /// One call of a provider's indication MI on a request thread.
    Status call(const Served_Class& served, Call what, const Subscription& subscription, bool edge, bool load);
    Status activate(const Served_Class& served, const std::shared_ptr<Subscription>& subscription);
    Status deactivate(const Served_Class& served, const Subscription& subscription);
    Status make_call(CMPIIndicationMI* mi, Call what, const Served_Class& served, const Subscription& subscription,
                     bool edge);
    static const char* name_of(Call what);

    Broker& m_broker;
    Modules& m_modules;
    Workers& m_workers;
    std::mutex m_mutex;
    std::mutex m_order; ///< one subscription is made or ended at a time
    std::map<int, std::shared_ptr<Subscription>> m_subscriptions;
    std::vector<std::thread> m_threads;
    int m_last_id = 0;
};

} // namespace host
