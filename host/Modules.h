/// All registrations, the providers behind them, and the loading and unloading of their modules.
///
/// Thread-safe. A request holds a `Visit` for as long as it may use MIs of a module; unloading waits for visits, and
/// visits wait for unloading, except those of up-calls: a module's own thread may ask the server while its clean-up
/// waits for that very thread.
#pragma once

#include "host/Broker.h"
#include "host/Provider.h"
#include "host/Workers.h"

#include <atomic>
#include <condition_variable>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <vector>

namespace host {

/// A registration and its provider.
struct Served_Class {
    Registration registration;
    const Class_Record* record = nullptr; ///< null if the schema does not know the class
    Provider* provider = nullptr;
};

class Modules {
public:
    Modules(Broker& broker, Workers& workers) : m_broker(broker), m_workers(workers) {}
    Modules(const Modules&) = delete;
    Modules& operator=(const Modules&) = delete;

    void add(const Registration& registration);
    std::size_t add_module(const std::string& file, const std::string& name_space, std::string* error);
    std::vector<Registration> registrations() const;
    /// Registrations of a kind in a namespace, in order.
    std::vector<Served_Class> serving(const std::string& name_space, Mi kind) const;
    bool has_name_space(const std::string& name_space) const;

    Unload_Result unload_idle();
    /// `before` runs first, where the manner wants indications disabled.
    Unload_Result stop(const std::function<void()>& before);
    /// After `stop`, in place of the end of the process that such a server gives a module: cleans up what the server
    /// left over, so that nothing of the module holds on to the broker. Up-calls fail from then on, too.
    void end();
    bool stopped() const;
    bool ended() const { return m_ended; }
    bool is_loaded(const std::string& module) const;

    /// Permission to use the MIs of a module.
    class Visit {
    public:
        Visit(Modules& modules, const std::string& module, bool up_call);
        ~Visit();
        Visit(const Visit&) = delete;
        Visit& operator=(const Visit&) = delete;
        /// False after the server has stopped.
        explicit operator bool() const { return m_granted; }

    private:
        Modules& m_modules;
        const std::string m_module;
        bool m_granted = false;
    };

private:
    std::vector<Provider*> providers_of(const std::string& module) const;
    std::set<std::string> modules() const;
    void unload(const std::string& module, bool terminating, Unload_Result& result);
    void clean_every_mi(const std::vector<Provider*>& providers, bool terminating, Unload_Result& result);
    void clean_newest(const std::vector<Provider*>& providers, bool terminating, Unload_Result& result);
    bool clean(Provider& provider, Mi kind, bool terminating, Unload_Result& result);
    void close(const std::string& module, const std::vector<Provider*>& providers, Unload_Result& result);

    Broker& m_broker;
    Workers& m_workers;
    mutable std::mutex m_mutex;
    std::condition_variable m_changed;
    std::vector<std::unique_ptr<Provider>> m_providers;
    std::vector<Served_Class> m_served;
    std::map<std::string, int> m_visits; ///< requests in flight, by module
    std::set<std::string> m_unloading;
    bool m_stopped = false;
    std::atomic<bool> m_ended{false};
};

} // namespace host
