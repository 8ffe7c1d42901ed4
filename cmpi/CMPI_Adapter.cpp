#include "cmpi/CMPI_Adapter.h"

#include <cerrno>
#include <cstddef>
#include <cstdio>
#include <cstring>
#include <new>

#include "cmpi/CMPI_Thread_Context.h"
#include "cmpi/operation.h"
#include "cmpi/operations.h"
#include "runtime/Forced_Unwind.h"
#include "runtime/Undisturbed.h"

namespace cimple {

// A table set is static data of the module: its places are told by the tables' sizes alone.
static_assert(offsetof(MI_Table_Set, magic) == 0);
static_assert(offsetof(MI_Table_Set, adapter) == sizeof(void*));
static_assert(offsetof(MI_Table_Set, instance_table) == 2 * sizeof(void*));
static_assert(offsetof(MI_Table_Set, method_table) ==
              offsetof(MI_Table_Set, instance_table) + sizeof(CMPIInstanceMIFT));
static_assert(offsetof(MI_Table_Set, indication_table) ==
              offsetof(MI_Table_Set, method_table) + sizeof(CMPIMethodMIFT));
static_assert(offsetof(MI_Table_Set, association_table) ==
              offsetof(MI_Table_Set, indication_table) + sizeof(CMPIIndicationMIFT));
static_assert(offsetof(MI_Table_Set, instance_mi) ==
              offsetof(MI_Table_Set, association_table) + sizeof(CMPIAssociationMIFT));
static_assert(offsetof(MI_Table_Set, method_mi) == offsetof(MI_Table_Set, instance_mi) + 2 * sizeof(void*));
static_assert(offsetof(MI_Table_Set, association_mi) == offsetof(MI_Table_Set, method_mi) + 2 * sizeof(void*));
static_assert(offsetof(MI_Table_Set, indication_mi) == offsetof(MI_Table_Set, association_mi) + 2 * sizeof(void*));
static_assert(offsetof(MI_Table_Set, instance_name) == offsetof(MI_Table_Set, indication_mi) + 2 * sizeof(void*));
static_assert(offsetof(MI_Table_Set, method_name) == offsetof(MI_Table_Set, instance_name) + 256);
static_assert(offsetof(MI_Table_Set, indication_name) == offsetof(MI_Table_Set, method_name) + 256);
static_assert(offsetof(MI_Table_Set, association_name) == offsetof(MI_Table_Set, indication_name) + 256);

namespace {

constexpr int table_version = 100;

// `buffer` takes kind and provider name. A text that is there already stays untouched: a server may be reading it.
void fill_name(char (&buffer)[MI_Table_Set::name_size], const char* kind, const char* provider_name)
{
    char text[MI_Table_Set::name_size] = {};
    if (std::snprintf(text, sizeof text, "%s%s", kind, provider_name ? provider_name : "") < 0) return;
    if (std::strcmp(text, buffer) != 0) std::memcpy(buffer, text, sizeof text);
}

// Tables have constant fields in some servers' declarations, hence made in place; once, since servers keep them.
template <class Table, class... Slots>
void fill_table(Table& table, Slots... slots)
{
    if (table.ftVersion == 0) new (&table) Table{slots...};
}

void fill_tables(MI_Table_Set& set, const char* provider_name)
{
    fill_name(set.instance_name, "instance", provider_name);
    fill_name(set.method_name, "method", provider_name);
    fill_name(set.indication_name, "indication", provider_name);
    fill_name(set.association_name, "association", provider_name);

    fill_table(set.instance_table, table_version, table_version, set.instance_name, instanceCleanup,
               enumerateInstanceNames, enumerateInstances, getInstance, createInstance, modifyInstance, deleteInstance,
               execQuery);
    fill_table(set.method_table, table_version, table_version, set.method_name, methodCleanup, invokeMethod);
    fill_table(set.indication_table, table_version, table_version, set.indication_name, indicationCleanup,
               authorizeFilter, mustPoll, activateFilter, deActivateFilter, enableIndications, disableIndications);
    fill_table(set.association_table, table_version, table_version, set.association_name, associationCleanup,
               associators, associatorNames, references, referenceNames);
}

template <class MI, class Table>
void* fill_mi(MI& mi, MI_Table_Set* set, Table& table)
{
    if (!mi.hdl) {
        mi.hdl = set;
        mi.ft = std::launder(&table);
    }
    return &mi;
}

void* mi_of(MI_Table_Set* set, char kind)
{
    switch (kind) {
    case 'I':
        return fill_mi(set->instance_mi, set, set->instance_table);
    case 'M':
        return fill_mi(set->method_mi, set, set->method_table);
    case 'A':
        return fill_mi(set->association_mi, set, set->association_table);
    case 'N':
        return fill_mi(set->indication_mi, set, set->indication_table);
    default:
        return nullptr;
    }
}

// Takes the adapter out of its table: the next factory call builds a new one.
void make_absent(MI_Table_Set* set)
{
    set->magic = MI_Table_Set::magic_dead;
    set->adapter = nullptr;
}

thread_local Running_Call* innermost_call = nullptr;

} // namespace

// --- Life
// --------------------------------------------------------------------------------------------------------------

CMPI_Adapter::CMPI_Adapter(MI_Table_Set* tables, const Registration* registration, const CMPIBroker* broker)
    : registration(registration), proc(registration->proc), provider(nullptr), broker(broker), static_data(tables),
      load_count(0), allow_unload(true), meta_class(nullptr), indications_enabled(false),
      lock(true, registration->provider_name, Lock_Place::observed),
      filters_lock(false, "filters_lock", Lock_Place::innermost), m_users(1)
{
    call(OP_CREATE_PROVIDER, &provider);
}

void CMPI_Adapter::start(const CMPIContext* context, const char* provider_name, int found_errno)
{
    log_enter("CMPI_Adapter");
    CMPI_Thread_Context thread_context(broker, context, this);
    Pushed_Context pushed(thread_context);
    static_data->magic = MI_Table_Set::magic_live;
    static_data->adapter = this;
    fill_tables(*static_data, provider_name);
    load_count = 1;
    errno = found_errno; // a provider's load must find what the server left
    call(OP_LOAD, provider);
    call(OP_GET_META_CLASS, &meta_class);
    log_return("CMPI_Adapter");
    m_started = true;
}

CMPI_Adapter::~CMPI_Adapter()
{
    if (!m_started) return;
    log_enter("~CMPI_Adapter");
    log_return("~CMPI_Adapter");
}

bool CMPI_Adapter::hold()
{
    uint32 users = m_users.load(std::memory_order_relaxed);
    while (users != 0)
        if (m_users.compare_exchange_weak(users, users + 1, std::memory_order_relaxed)) return true;
    return false;
}

void CMPI_Adapter::unload()
{
    const Undisturbed undisturbed; // nobody else would unload it
    {
        Auto_Mutex locked(m_calls_mutex);
        while (m_calls > Running_Call::own(*this))
            m_call_ended.wait(m_calls_mutex);
        m_unloaded = true;
    }
    call(OP_UNLOAD, provider);
}

void CMPI_Adapter::give_back()
{
    if (m_users.fetch_sub(1, std::memory_order_acq_rel) != 1) return;
    const Registration* its_registration = registration;
    Provider_Proc its_proc = proc;
    void* its_provider = provider;
    delete this;
    its_proc(its_registration, OP_DESTROY_PROVIDER, its_provider, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr,
             nullptr);
}

const Meta_Class* CMPI_Adapter::find_class(const char* name) const
{
    const Meta_Repository* repository = nullptr;
    call(OP_GET_REPOSITORY, &repository);
    return find_meta_class(repository, name);
}

Adapter_Use::Adapter_Use(MI_Table_Set* tables)
{
    if (!tables) return;
    Auto_Mutex locked(tables->mutex);
    if (tables->adapter && tables->adapter->hold()) m_adapter = tables->adapter;
}

void Adapter_Use::give_back()
{
    if (CMPI_Adapter* adapter = release()) adapter->give_back();
}

Running_Call::Running_Call(CMPI_Adapter& adapter) : m_outer(innermost_call)
{
    Auto_Mutex locked(adapter.m_calls_mutex);
    if (adapter.m_unloaded) return;
    adapter.m_calls++;
    m_adapter = &adapter;
    innermost_call = this;
}

Running_Call::~Running_Call()
{
    if (!m_adapter) return;
    innermost_call = m_outer;
    Auto_Mutex locked(m_adapter->m_calls_mutex);
    m_adapter->m_calls--;
    m_adapter->m_call_ended.broadcast();
}

uint32 Running_Call::own(const CMPI_Adapter& adapter)
{
    uint32 count = 0;
    for (const Running_Call* call = innermost_call; call; call = call->m_outer)
        count += call->m_adapter == &adapter;
    return count;
}

// --- Factory
// -----------------------------------------------------------------------------------------------------------

namespace {

// Takes a half-built adapter out of its table, however the building ends early.
class Absent_On_Throw {
public:
    explicit Absent_On_Throw(MI_Table_Set* set) : m_set(set) {}
    ~Absent_On_Throw()
    {
        if (m_set) make_absent(m_set);
    }
    Absent_On_Throw(const Absent_On_Throw&) = delete;
    Absent_On_Throw& operator=(const Absent_On_Throw&) = delete;
    void finished() { m_set = nullptr; }

private:
    MI_Table_Set* m_set;
};

} // namespace

extern "C" int cimple_cmpi_adapter(char, MI_Table_Set* tables, Registration* registration, const CMPIBroker* broker,
                                   const CMPIContext* context, const char* provider_name, char kind, void** result)
{
    const int found_errno = errno;
    try {
        Adapter_Use unfinished; // goes after the lock: no provider is destroyed under it
        Auto_Mutex locked(tables->mutex);
        if (tables->adapter) {
            ++tables->adapter->load_count;
        } else {
            unfinished.adopt(new CMPI_Adapter(tables, registration, broker));
            Absent_On_Throw absent(tables);
            unfinished->start(context, provider_name, found_errno);
            absent.finished();
            unfinished.release(); // the table's now
        }
        log_enter("cimple_cmpi_adapter");
        if (void* mi = mi_of(tables, kind)) *result = mi;
        log_return("cimple_cmpi_adapter");
    } catch (...) {
        if (is_forced_unwind()) throw;
        *result = nullptr;
    }
    return 0;
}

// --- Clean-up
// ----------------------------------------------------------------------------------------------------------

namespace {

// One load less. True for the last: the adapter has left its table then, and lives on the counts of its users.
bool count_down(MI_Table_Set* set, CMPI_Adapter* adapter)
{
    Auto_Mutex locked(set->mutex);
    if (set->adapter != adapter) return false; // another clean-up was the last one meanwhile
    if (adapter->load_count != 1) {
        --adapter->load_count;
        return false;
    }
    make_absent(set);
    adapter->give_back(); // the table's count; the caller holds one of its own
    return true;
}

template <class MI>
CMPIStatus cleanup(const MI* mi, const CMPIContext* context, CMPIBoolean terminating, const char* also_enters = nullptr)
{
    return guarded([&]() -> CMPIrc {
        MI_Table_Set* set = tables_of(mi);
        Adapter_Use adapter(set);
        if (!adapter) return CMPI_RC_OK;
        CMPI_Thread_Context thread_context(adapter->broker, context, adapter.get());
        Pushed_Context pushed(thread_context);
        if (also_enters) log_enter(also_enters);
        log_enter("cleanup");
        if (!terminating && !adapter->allow_unload) {
            log_return("cleanup do not unload", CMPI_RC_DO_NOT_UNLOAD);
            return CMPI_RC_DO_NOT_UNLOAD;
        }
        if (!count_down(set, adapter.get())) {
            log_return("cleanup decrement", CMPI_RC_OK);
            return CMPI_RC_OK;
        }
        adapter->unload();
        log_return("cleanup unload", CMPI_RC_OK);
        adapter.give_back();
        return CMPI_RC_OK;
    });
}

} // namespace

CMPIStatus instanceCleanup(CMPIInstanceMI* mi, const CMPIContext* ctx, CMPIBoolean terminating)
{
    return cleanup(mi, ctx, terminating);
}

CMPIStatus methodCleanup(CMPIMethodMI* mi, const CMPIContext* ctx, CMPIBoolean terminating)
{
    return cleanup(mi, ctx, terminating);
}

CMPIStatus associationCleanup(CMPIAssociationMI* mi, const CMPIContext* ctx, CMPIBoolean terminating)
{
    return cleanup(mi, ctx, terminating);
}

CMPIStatus indicationCleanup(CMPIIndicationMI* mi, const CMPIContext* ctx, CMPIBoolean terminating)
{
    return cleanup(mi, ctx, terminating, "indicationCleanup");
}

} // namespace cimple
