/// The provider of link alerts without the bridge: a handler that keeps what it is given, on a thread with a context.
#pragma once

#include <atomic>
#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>

#include "classes/NVRHBA_AlertIndication.h"
#include "logs/NVRHBA_AlertIndication_Provider.h"
#include "simulator/nvrsim.h"
#include "tests/agent/Simulated_Host.h"
#include "tests/runtime/Fake_Context.h"

namespace nvrtest {

/// What a server's side of the handler sees. Outlives the provider that calls it.
class Client {
public:
    /// A handler that leads here.
    std::unique_ptr<cimple::Indication_Handler> handler()
    {
        return std::make_unique<cimple::Indication_Handler>(cimple::Indication_Handler{&take, this});
    }

    std::size_t count()
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        return m_alerts.size();
    }
    /// Waits until so many came, and gives them all.
    std::vector<Ref<cimple::NVRHBA_AlertIndication>> wait_for(std::size_t count)
    {
        std::unique_lock<std::mutex> lock(m_mutex);
        m_came.wait(lock, [&] { return m_alerts.size() >= count; });
        return m_alerts;
    }

    std::atomic<int> stops{0};
    /// Runs inside each delivery.
    std::function<void()> during;

private:
    static bool take(Instance* instance, void* data)
    {
        auto& client = *static_cast<Client*>(data);
        if (!instance) return client.stops++, false;
        Ref<cimple::NVRHBA_AlertIndication> alert(static_cast<cimple::NVRHBA_AlertIndication*>(instance));
        if (client.during) client.during();
        std::lock_guard<std::mutex> lock(client.m_mutex);
        client.m_alerts.push_back(std::move(alert));
        client.m_came.notify_all();
        return true;
    }

    std::mutex m_mutex;
    std::condition_variable m_came;
    std::vector<Ref<cimple::NVRHBA_AlertIndication>> m_alerts;
};

class Alerts_Test : public SimulatedHost {
protected:
    Alerts_Test()
    {
        cimple::Thread_Context::push(&context);
        scenario("[[adapter]]\nports = 2\n");
        EXPECT_EQ(provider->load(), 0);
        refresh();
        words();
    }
    ~Alerts_Test() override
    {
        // A kept registration keeps the libraries; it must not meet the next test's.
        nvrsim_clear_faults();
        settle();
        if (provider) {
            EXPECT_EQ(provider->unload(), 0);
        }
        nvrsim_drain_events();
        cimple::Thread_Context::pop();
    }

    int enable() { return provider->enable_indications(client.handler()); }
    int disable() { return provider->disable_indications(); }
    void unload_provider()
    {
        settle();
        m_unloaded = provider->unload();
        provider.reset();
    }

    /// Port 0 or 1 goes up or down.
    static void link(const char* port, bool up) { EXPECT_EQ(nvrsim_link(port, up), 0); }
    static void event(const char* port, cimple::uint32 type) { EXPECT_GE(nvrsim_event(port, type, 0x10203), 0); }

    cimple::Fake_Context context;
    Client client;
    std::unique_ptr<cimple::NVRHBA_AlertIndication_Provider> provider{new cimple::NVRHBA_AlertIndication_Provider};
    int m_unloaded = -1;
};

constexpr cimple::uint32 link_down = HBA_EVENT_PORT_OFFLINE;
constexpr cimple::uint32 link_up = HBA_EVENT_PORT_ONLINE;

} // namespace nvrtest
