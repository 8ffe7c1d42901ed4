#include "host/Modules.h"

#include "host/ModuleSymbols.h"
#include "host/ProviderCall.h"

#include <algorithm>
#include <iterator>

namespace host {
namespace {

/// Clients know the interop namespace by either name.
constexpr const char* interop_name_spaces[] = {"root/pg_interop", "root/interop"};

/// Classes of profile registration are asked for in the interop namespace as well.
bool is_for_interop(const Class_Record& record)
{
    return record.is_a("CIM_RegisteredProfile") || record.is_a("CIM_ReferencedProfile") ||
           record.is_a("CIM_ElementConformsToProfile");
}

bool ends_with(const std::string& text, const std::string& end)
{
    return text.size() > end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

} // namespace

void Modules::add(const Registration& registration)
{
    Provider* known = nullptr;
    {
        std::lock_guard lock(m_mutex);
        const bool by_class = m_broker.manner().factories_by_class;
        for (const Served_Class& served : m_served) {
            bool same = same_name(served.registration.provider, registration.provider) &&
                        served.registration.module == registration.module &&
                        (!by_class || same_name(served.registration.class_name, registration.class_name));
            if (same) known = served.provider;
        }
        if (!known) m_providers.push_back(std::make_unique<Provider>(m_broker, registration));
        Provider* const provider = known ? known : m_providers.back().get();
        m_served.push_back({registration, m_broker.schema().find(registration.class_name), provider});
    }
    // Without the lock: a provider holds its own while its module is called, which may ask for what is registered.
    if (known) known->join(registration);
}

std::size_t Modules::add_module(const std::string& file, const std::string& name_space, std::string* error)
{
    std::string reason;
    std::map<std::string, unsigned> kinds; // by provider name
    for (const std::string& symbol : exported_functions(file, reason))
        for (Mi kind : all_mi_kinds) {
            std::string end = std::string("_Create_") + mi_name(kind) + "MI";
            if (ends_with(symbol, end)) kinds[symbol.substr(0, symbol.size() - end.size())] |= kind_bit(kind);
        }
    std::size_t count = 0;
    for (const Class_Record* record : m_broker.schema().classes()) {
        // Both names may be there; they are the same MIs, and the longer one is what servers are told.
        auto found = kinds.find(record->name + "_Provider");
        if (found == kinds.end()) found = kinds.find(record->name);
        if (found == kinds.end()) continue;
        Registration registration{record->name, found->first, file, found->second, {name_space}, false};
        if (is_for_interop(*record))
            registration.name_spaces.insert(registration.name_spaces.end(), std::begin(interop_name_spaces),
                                            std::end(interop_name_spaces));
        add(registration);
        ++count;
    }
    if (count == 0 && error) *error = reason.empty() ? file + ": no factory of a known class" : reason;
    return count;
}

std::vector<Registration> Modules::registrations() const
{
    std::lock_guard lock(m_mutex);
    std::vector<Registration> all;
    for (const Served_Class& served : m_served)
        all.push_back(served.registration);
    return all;
}

std::vector<Served_Class> Modules::serving(const std::string& name_space, Mi kind) const
{
    std::lock_guard lock(m_mutex);
    std::vector<Served_Class> found;
    for (const Served_Class& served : m_served) {
        const auto& spaces = served.registration.name_spaces;
        bool here = std::any_of(spaces.begin(), spaces.end(),
                                [&](const std::string& space) { return same_name(space, name_space); });
        if (here && (served.registration.kinds & kind_bit(kind))) found.push_back(served);
    }
    return found;
}

bool Modules::has_name_space(const std::string& name_space) const
{
    std::lock_guard lock(m_mutex);
    for (const Served_Class& served : m_served)
        for (const std::string& space : served.registration.name_spaces)
            if (same_name(space, name_space)) return true;
    return false;
}

bool Modules::stopped() const
{
    std::lock_guard lock(m_mutex);
    return m_stopped;
}

bool Modules::is_loaded(const std::string& module) const
{
    for (Provider* provider : providers_of(module))
        if (provider->is_open()) return true;
    return false;
}

std::vector<Provider*> Modules::providers_of(const std::string& module) const
{
    std::lock_guard lock(m_mutex);
    std::vector<Provider*> found;
    for (const auto& provider : m_providers)
        if (provider->module() == module) found.push_back(provider.get());
    return found;
}

std::set<std::string> Modules::modules() const
{
    std::lock_guard lock(m_mutex);
    std::set<std::string> found;
    for (const auto& provider : m_providers)
        found.insert(provider->module());
    return found;
}

Modules::Visit::Visit(Modules& modules, const std::string& module, bool up_call) : m_modules(modules), m_module(module)
{
    std::unique_lock lock(m_modules.m_mutex);
    if (!up_call) m_modules.m_changed.wait(lock, [&] { return m_modules.m_unloading.count(m_module) == 0; });
    // While the server stops its modules may still ask; afterwards nobody may.
    m_granted = !m_modules.m_stopped || (up_call && m_modules.m_unloading.count(m_module) != 0);
    if (m_granted) ++m_modules.m_visits[m_module];
}

Modules::Visit::~Visit()
{
    if (!m_granted) return;
    std::lock_guard lock(m_modules.m_mutex);
    --m_modules.m_visits[m_module];
    m_modules.m_changed.notify_all();
}

bool Modules::clean(Provider& provider, Mi kind, bool terminating, Unload_Result& result)
{
    Status status;
    m_workers.run([&] {
        Call_Scope scope(m_broker, "cleanup");
        status = provider.cleanup(kind, m_broker.make_request_context("", ""), terminating);
    });
    ++result.cleanups;
    if (!status.ok()) ++result.refused;
    result.statuses.push_back(status);
    return status.ok();
}

void Modules::clean_every_mi(const std::vector<Provider*>& providers, bool terminating, Unload_Result& result)
{
    for (Provider* provider : providers) {
        bool heeded = m_broker.manner().idle_heeds_filters && provider->filters > 0;
        if (!terminating && (provider->never_unload() || heeded)) continue;
        bool all = true;
        for (Mi kind : all_mi_kinds)
            if (provider->made(kind)) all = clean(*provider, kind, terminating, result) && all;
        if (all || terminating) provider->forget();
    }
}

void Modules::clean_newest(const std::vector<Provider*>& providers, bool terminating, Unload_Result& result)
{
    bool never = std::any_of(providers.begin(), providers.end(), [](Provider* p) { return p->never_unload(); });
    if (!terminating && never) return;
    bool all = true;
    for (Mi kind : all_mi_kinds) {
        if (kind == Mi::property) continue; // property providers are cleaned by no server of this manner
        Provider* newest = nullptr;
        for (Provider* provider : providers)
            if (provider->made(kind) && (!newest || provider->age() > newest->age())) newest = provider;
        if (newest) all = clean(*newest, kind, terminating, result) && all;
    }
    if (all || terminating)
        for (Provider* provider : providers)
            provider->forget();
}

void Modules::close(const std::string& module, const std::vector<Provider*>& providers, Unload_Result& result)
{
    std::unique_lock lock(m_mutex);
    m_changed.wait(lock, [&] { return m_visits[module] == 0; });
    lock.unlock();
    bool was_open = false, still_open = false;
    for (Provider* provider : providers) {
        was_open = provider->close() || was_open;
        still_open = still_open || provider->is_open();
    }
    if (was_open && !still_open) ++result.closed;
}

void Modules::unload(const std::string& module, bool terminating, Unload_Result& result)
{
    std::vector<Provider*> providers = providers_of(module);
    auto clean_all =
        m_broker.manner().cleanup == Manner::Cleanup::every_mi ? &Modules::clean_every_mi : &Modules::clean_newest;
    (this->*clean_all)(providers, terminating, result);
    close(module, providers, result);
}

Unload_Result Modules::unload_idle()
{
    Unload_Result result;
    for (const std::string& module : modules()) {
        {
            std::lock_guard lock(m_mutex);
            if (m_stopped || m_visits[module] > 0 || !m_unloading.insert(module).second) continue;
        }
        unload(module, false, result);
        std::lock_guard lock(m_mutex);
        m_unloading.erase(module);
        m_changed.notify_all();
    }
    return result;
}

Unload_Result Modules::stop(const std::function<void()>& before)
{
    Unload_Result result;
    {
        std::lock_guard lock(m_mutex);
        if (m_stopped) return result;
    }
    if (m_broker.manner().disable_before_stop) before();
    for (const std::string& module : modules()) {
        {
            // Requests in flight end first; those that come now wait, and are told that the server has stopped.
            std::unique_lock lock(m_mutex);
            m_changed.wait(lock, [&] { return m_unloading.count(module) == 0; });
            m_unloading.insert(module);
            m_changed.wait(lock, [&] { return m_visits[module] == 0; });
            m_stopped = true;
        }
        // An up-call during a clean-up may have called a factory again.
        for (int round = 0; round < 3; ++round) {
            unload(module, true, result);
            if (!is_loaded(module)) break;
        }
        std::lock_guard lock(m_mutex);
        m_unloading.erase(module);
        m_changed.notify_all();
    }
    std::lock_guard lock(m_mutex);
    m_stopped = true;
    return result;
}

void Modules::end()
{
    for (const std::string& module : modules())
        for (Provider* provider : providers_of(module)) {
            if (!provider->has_left_over()) continue;
            m_workers.run([&] {
                Call_Scope scope(m_broker, "cleanup");
                provider->clean_left_over(m_broker.make_request_context("", ""));
            });
        }
    m_ended = true;
}

} // namespace host
