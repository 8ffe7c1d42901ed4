/// What stands behind the CMPI calls of one provider: its MI tables, its provider object, its lock, its life.
///
/// An MI_Table_Set is the static record of a provider, made before any code of ours runs: it finds the adapter for
/// calls that come through `hdl`. The adapter lives from the first factory call to the last clean-up, and on until no
/// call runs in it and no thread context made from it is left. Any thread; `lock` makes one request after the other,
/// `mutex` of the set guards what factories and clean-ups share.
#pragma once

#include <cmpift.h>

#include <atomic>
#include <type_traits>
#include <utility>

#include "cmpi/Filter_Record.h"
#include "runtime/Mutex.h"
#include "runtime/Registration.h"

namespace cimple {

class CMPI_Adapter;

/// One static record a provider: `static MI_Table_Set tables{};`. Never freed; servers keep pointers into it.
struct MI_Table_Set {
    static constexpr uint32 magic_live = 0x5DE2B131;
    static constexpr uint32 magic_dead = 0xDDDDDDDD;
    static constexpr std::size_t name_size = 256;

    uint32 magic;
    CMPI_Adapter* adapter;
    CMPIInstanceMIFT instance_table;
    CMPIMethodMIFT method_table;
    CMPIIndicationMIFT indication_table;
    CMPIAssociationMIFT association_table;
    CMPIInstanceMI instance_mi;
    CMPIMethodMI method_mi;
    CMPIAssociationMI association_mi;
    CMPIIndicationMI indication_mi;
    char instance_name[name_size];
    char method_name[name_size];
    char indication_name[name_size];
    char association_name[name_size];
    /// Covers `adapter` and the adapter's `load_count`; taken to find the adapter and to count a call in. Held through
    /// construction, never through an unload, a destruction or an operation.
    Mutex mutex{false, "MI_Table_Set", Lock_Place::observed};
};

/// One heap object a provider, made by cimple_cmpi_adapter.
class CMPI_Adapter {
public:
    const Registration* registration;
    Provider_Proc proc;
    void* provider;
    const CMPIBroker* broker;
    MI_Table_Set* static_data;
    uint32 load_count;
    std::atomic<bool> allow_unload;
    Array<Filter_Record> filters;
    const Meta_Class* meta_class;
    bool indications_enabled;
    /// Serialises the operations of the provider; recursive, so that an up-call may come back on the same thread.
    Mutex lock;
    /// Guards `filters` alone, and nothing else is taken under it.
    Mutex filters_lock;

    /// Creates the provider.
    CMPI_Adapter(MI_Table_Set* tables, const Registration* registration, const CMPIBroker* broker);
    CMPI_Adapter(const CMPI_Adapter&) = delete;
    CMPI_Adapter& operator=(const CMPI_Adapter&) = delete;

    /// Enters the tables and loads the provider, with a thread context in place and `errno` as `found_errno`. Called
    /// once, with the set's mutex held.
    void start(const CMPIContext* context, const char* provider_name, int found_errno);

    /// The provider's procedure; missing arguments are 0.
    template <class... Args>
    int call(Operation operation, Args... args) const
    {
        static_assert(sizeof...(args) <= 8);
        void* words[8] = {word(args)...};
        return proc(registration, operation, words[0], words[1], words[2], words[3], words[4], words[5], words[6],
                    words[7]);
    }

    /// The class of that name in the provider's repository, or null.
    const Meta_Class* find_class(const char* name) const;

    /// Counts a user in: a call, or a thread context. False if the adapter is already on its way out for good.
    bool hold();
    /// Counts a user out; the last one destroys the adapter.
    void give_back();

    /// Waits until no other thread's call runs in the provider, and unloads it: whoever comes later finds it unloaded.
    /// Once, after the adapter has left its table. No lock may be held that a call needs. Throws what the unload
    /// throws.
    void unload();

private:
    ~CMPI_Adapter();

    template <class T>
    static void* word(T* pointer) // an argument of the procedure
    {
        if constexpr (std::is_function_v<T>)
            return reinterpret_cast<void*>(pointer);
        else
            return const_cast<void*>(static_cast<const void*>(pointer));
    }

    friend class Running_Call;

    std::atomic<uint32> m_users;
    Mutex m_calls_mutex{false, "m_calls_mutex", Lock_Place::innermost}; // guards the next three
    Cond m_call_ended;
    uint32 m_calls = 0; // that run
    bool m_unloaded = false;
    bool m_started = false; // wholly built: only such an adapter has an end to tell of
};

/// One count of an adapter: of a table set's for the length of a call, or none.
class Adapter_Use {
public:
    Adapter_Use() = default;
    explicit Adapter_Use(MI_Table_Set* tables);
    ~Adapter_Use() { give_back(); }
    Adapter_Use(const Adapter_Use&) = delete;
    Adapter_Use& operator=(const Adapter_Use&) = delete;

    explicit operator bool() const { return m_adapter != nullptr; }
    CMPI_Adapter* get() const { return m_adapter; }
    CMPI_Adapter* operator->() const { return m_adapter; }
    CMPI_Adapter& operator*() const { return *m_adapter; }
    /// Takes over a count.
    void adopt(CMPI_Adapter* adapter) { m_adapter = adapter; }
    /// Hands it over.
    CMPI_Adapter* release() { return std::exchange(m_adapter, nullptr); }
    void give_back();

private:
    CMPI_Adapter* m_adapter = nullptr;
};

/// A call of an adapter's provider, for a scope within the thread's context; or none, if the provider is unloaded.
class Running_Call {
public:
    explicit Running_Call(CMPI_Adapter& adapter);
    ~Running_Call();
    Running_Call(const Running_Call&) = delete;
    Running_Call& operator=(const Running_Call&) = delete;

    explicit operator bool() const { return m_adapter != nullptr; }
    /// How many of this thread are calls of that adapter, one inside the other.
    static uint32 own(const CMPI_Adapter& adapter);

private:
    CMPI_Adapter* m_adapter = nullptr;
    Running_Call* m_outer;
};

/// The one factory behind all entry stubs. `tag` is ignored ('C' by custom). `kind` is 'I' instance, 'M' method,
/// 'A' association or 'N' indication; `result` takes the address of the matching MI record in `tables`, null if an
/// adapter was needed and its construction threw; another kind leaves it alone. `provider_name` is copied. Always 0.
extern "C" int cimple_cmpi_adapter(char tag, MI_Table_Set* tables, Registration* registration, const CMPIBroker* broker,
                                   const CMPIContext* context, const char* provider_name, char kind, void** result);

} // namespace cimple
