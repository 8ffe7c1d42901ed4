/// One provider of a module: its open library, the MIs that its factories made, and whether they may be called.
///
/// In manners that make factories by class there is one for each registered class, else one for each provider name.
/// Thread-safe. MI pointers that `ready` gave stay valid until the provider is closed, which waits for calls.
#pragma once

#include "host/Host.h"

#include <array>
#include <atomic>
#include <mutex>
#include <string>
#include <vector>

namespace host {

class Broker;

/// Position of a kind in tables, in the order of clean-ups.
enum class Mi { instance, association, method, property, indication };
constexpr std::size_t mi_kinds = 5;
constexpr Mi all_mi_kinds[] = {Mi::instance, Mi::association, Mi::method, Mi::property, Mi::indication};
unsigned kind_bit(Mi kind);
/// "Instance", as factories are named.
const char* mi_name(Mi kind);

class Provider {
public:
    Provider(Broker& broker, const Registration& registration);
    Provider(const Provider&) = delete;
    Provider& operator=(const Provider&) = delete;

    /// Another registration that this provider serves as well (same provider name).
    void join(const Registration& registration);

    /// Loads the library and makes MIs as the manner does, where that has not been done. On a request thread.
    /// `mi` gets the MI of that kind.
    Status ready(Mi kind, void*& mi);
    /// The MI of that kind if it was made, else null.
    void* made(Mi kind) const;

    /// Calls clean-up of one MI; on a request thread.
    Status cleanup(Mi kind, const CMPIContext* context, bool terminating);
    /// Forgets the MIs: the next request calls the factories again. Those that were never cleaned are left over.
    void forget();
    /// Closes the library if no MI is there. True if it was open. It stays mapped as long as MIs are left over.
    bool close();
    /// True if MIs are left over; and their clean-up, on a request thread, in place of the end of the server's process.
    bool has_left_over() const;
    void clean_left_over(const CMPIContext* context);

    bool is_open() const;
    const std::string& module() const { return m_registration.module; }
    const std::string& name() const { return m_registration.provider; }
    bool never_unload() const;
    /// When its MIs were made, counted over all providers; 0 for none.
    unsigned age() const { return m_age; }

    std::atomic<int> filters{0};      ///< active subscriptions
    std::atomic<bool> enabled{false}; ///< enableIndications was called last

private:
    /// A factory's result.
    struct Made {
        Mi kind;
        void* mi;
    };

    Status open();
    Status make(Mi kind);
    Status call_cleanup(const Made& made, const CMPIContext* context, bool terminating);

    Broker& m_broker;
    Registration m_registration;
    mutable std::mutex m_mutex;
    void* m_library = nullptr;
    std::array<void*, mi_kinds> m_made{};
    std::array<bool, mi_kinds> m_cleaned{};
    std::vector<Made> m_left_over;
    std::vector<void*> m_left_open; ///< handles of the library that left-over MIs need
    std::atomic<unsigned> m_age{0};
};

} // namespace host
