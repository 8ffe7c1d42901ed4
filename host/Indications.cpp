#include "host/Indications.h"

#include "host/ProviderCall.h"
#include "host/objects/PathObject.h"
#include "host/objects/SelectExpObject.h"

namespace host {

struct Indications::Subscription {
    std::string name_space, class_name, query;
    Indication_Sink sink;
    std::vector<Served_Class> served; ///< providers where the filter is active
    std::mutex mutex;                 ///< held while the sink runs
    bool ended = false;
};

Indications::Indications(Broker& broker, Modules& modules, Workers& workers)
    : m_broker(broker), m_modules(modules), m_workers(workers)
{
}

Indications::~Indications()
{
    settle();
}

const char* Indications::name_of(Call what)
{
    constexpr const char* names[] = {"authorizeFilter",  "mustPoll",          "activateFilter",
                                     "deActivateFilter", "enableIndications", "disableIndications"};
    return names[static_cast<std::size_t>(what)];
}

Status Indications::make_call(CMPIIndicationMI* mi, Call what, const Served_Class& served,
                              const Subscription& subscription, bool edge)
{
    CMPIIndicationMIFT* ft = mi->ft;
    if (!ft) return {CMPI_RC_ERR_FAILED, "the provider has no table", Fault::module};
    const Manner& manner = m_broker.manner();
    const CMPIContext* context = m_broker.make_request_context("", subscription.name_space);
    Path path;
    path.name_space = subscription.name_space;
    path.class_name = served.registration.class_name;
    path.host = manner.host_name_in_paths ? m_broker.host_name() : "";
    const CMPIObjectPath* op = &m_broker.make<Path_Object>(Origin::lent, path)->face;
    const CMPISelectExp* filter =
        &m_broker.make<Select_Exp_Object>(Origin::lent, subscription.query, std::string("WQL"))->face;
    const bool empty_type = manner.disable == Manner::Disable::before_deactivate_with_empty_type;
    const char* type = what == Call::deactivate && empty_type ? "" : served.registration.class_name.c_str();
    CMPIBoolean flag = edge || manner.activation_flags_always ? CMPI_true : CMPI_false;

    CMPIStatus status = status_of(CMPI_RC_OK);
    Status guarded = guard(m_broker, name_of(what), [&] {
        switch (what) {
        case Call::authorize:
            if (ft->authorizeFilter) status = ft->authorizeFilter(mi, context, filter, type, op, "");
            break;
        case Call::must_poll:
            if (ft->mustPoll) status = ft->mustPoll(mi, context, filter, type, op);
            break;
        case Call::activate:
            if (ft->activateFilter) status = ft->activateFilter(mi, context, filter, type, op, flag);
            break;
        case Call::deactivate:
            if (ft->deActivateFilter) status = ft->deActivateFilter(mi, context, filter, type, op, flag);
            break;
        case Call::enable:
            if (ft->enableIndications) status = ft->enableIndications(mi, context);
            break;
        case Call::disable:
            if (ft->disableIndications) status = ft->disableIndications(mi, context);
            break;
        }
    });
    return guarded.ok() ? read_status(status) : guarded;
}

Status Indications::call(const Served_Class& served, Call what, const Subscription& subscription, bool edge, bool load)
{
    Status status{CMPI_RC_ERROR_SYSTEM, "the server has no thread for the request", Fault::server};
    m_workers.run([&] {
        Modules::Visit visit(m_modules, served.provider->module(), false);
        if (!visit) {
            status = {CMPI_RC_ERR_FAILED, "the server has stopped", Fault::server};
            return;
        }
        Call_Scope scope(m_broker, name_of(what));
        void* mi = served.provider->made(Mi::indication);
        status = mi ? Status{} : Status{CMPI_RC_ERR_FAILED, "the provider is not loaded", Fault::server};
        if (!mi && load) status = served.provider->ready(Mi::indication, mi);
        if (mi && status.ok()) status = make_call(static_cast<CMPIIndicationMI*>(mi), what, served, subscription, edge);
        m_broker.log().line("%s %s in %s: %s", name_of(what), served.registration.class_name.c_str(),
                            subscription.name_space.c_str(), status_name(status.code).c_str());
    });
    return status;
}

Status Indications::activate(const Served_Class& served, const std::shared_ptr<Subscription>& subscription)
{
    const Manner& manner = m_broker.manner();
    if (manner.asks_before_activation) {
        Status allowed = call(served, Call::authorize, *subscription, false, true);
        if (!allowed.ok()) return allowed;
        call(served, Call::must_poll, *subscription, false, true); // what it answers is of no effect
    }
    Status active = call(served, Call::activate, *subscription, served.provider->filters == 0, true);
    if (!active.ok()) return active;
    bool first = ++served.provider->filters == 1;
    if (!manner.enables_each_time && !first && served.provider->enabled) return active;
    served.provider->enabled = true;
    if (!manner.asks_before_activation) {
        Status enabled = call(served, Call::enable, *subscription, false, true);
        if (!enabled.ok()) deactivate(served, *subscription);
        return enabled;
    }
    std::lock_guard lock(m_mutex);
    m_threads.emplace_back([this, served, subscription] { call(served, Call::enable, *subscription, false, false); });
    return active;
}

Status Indications::subscribe(const std::string& name_space, const std::string& class_name, Indication_Sink sink,
                              const std::string& query, int& id)
{
    const Class_Record* record = m_broker.schema().find(class_name);
    if (!record) return {CMPI_RC_ERR_INVALID_CLASS, "the server has no class " + class_name, Fault::request};
    if (!m_modules.has_name_space(name_space))
        return {CMPI_RC_ERR_INVALID_NAMESPACE, "the server has no namespace " + name_space, Fault::request};
    auto subscription = std::make_shared<Subscription>();
    subscription->name_space = name_space;
    subscription->class_name = record->name;
    subscription->query = query.empty() ? "SELECT * FROM " + record->name : query;
    subscription->sink = std::move(sink);

    std::lock_guard order(m_order);
    {
        // A provider may deliver as soon as its filter is active.
        std::lock_guard lock(m_mutex);
        id = ++m_last_id;
        m_subscriptions[id] = subscription;
    }
    Status status{CMPI_RC_ERR_NOT_SUPPORTED,
                  "no indication provider is registered for " + class_name + " in " + name_space, Fault::request};
    for (const Served_Class& served : m_modules.serving(name_space, Mi::indication)) {
        if (!served.record || !served.record->is_a(record->name)) continue;
        status = activate(served, subscription);
        if (!status.ok()) break;
        subscription->served.push_back(served);
    }
    if (status.ok()) return status;
    for (const Served_Class& served : subscription->served)
        deactivate(served, *subscription);
    std::lock_guard lock(m_mutex);
    m_subscriptions.erase(id);
    return status;
}

Status Indications::deactivate(const Served_Class& served, const Subscription& subscription)
{
    const Manner::Disable when = m_broker.manner().disable;
    const bool last = --served.provider->filters == 0;
    auto disable = [&] {
        served.provider->enabled = false;
        call(served, Call::disable, subscription, false, false);
    };
    if (last && when == Manner::Disable::before_deactivate_with_empty_type) disable();
    Status status = call(served, Call::deactivate, subscription, last, false);
    if (last && when == Manner::Disable::after_last_deactivate) disable();
    return status;
}

Status Indications::unsubscribe(int id)
{
    std::lock_guard order(m_order);
    std::shared_ptr<Subscription> subscription;
    {
        std::lock_guard lock(m_mutex);
        auto found = m_subscriptions.find(id);
        if (found == m_subscriptions.end())
            return {CMPI_RC_ERR_NOT_FOUND, "there is no subscription of that number", Fault::request};
        subscription = found->second;
    }
    Status status;
    for (const Served_Class& served : subscription->served) {
        Status one = deactivate(served, *subscription);
        if (status.ok()) status = one;
    }
    {
        std::lock_guard lock(m_mutex);
        m_subscriptions.erase(id);
    }
    std::lock_guard running(subscription->mutex);
    subscription->ended = true;
    return status;
}

bool Indications::deliver(const std::string& name_space, const Instance& instance)
{
    std::vector<std::shared_ptr<Subscription>> wanted;
    {
        std::lock_guard lock(m_mutex);
        for (const auto& [id, subscription] : m_subscriptions)
            if (same_name(subscription->name_space, name_space) &&
                m_broker.schema().is_a(instance.path.class_name, subscription->class_name))
                wanted.push_back(subscription);
    }
    m_broker.log().line("deliverIndication %s in %s: %zu subscriptions", instance.path.class_name.c_str(),
                        name_space.c_str(), wanted.size());
    for (const auto& subscription : wanted) {
        std::lock_guard running(subscription->mutex);
        if (!subscription->ended && subscription->sink) subscription->sink({name_space, instance});
    }
    return !wanted.empty();
}

void Indications::settle()
{
    std::vector<std::thread> threads;
    {
        std::lock_guard lock(m_mutex);
        threads.swap(m_threads);
    }
    for (std::thread& thread : threads)
        thread.join();
}

void Indications::disable_all()
{
    settle();
    std::vector<std::shared_ptr<Subscription>> all;
    {
        std::lock_guard lock(m_mutex);
        for (const auto& [id, subscription] : m_subscriptions)
            all.push_back(subscription);
    }
    for (const auto& subscription : all)
        for (const Served_Class& served : subscription->served)
            if (served.provider->enabled.exchange(false)) call(served, Call::disable, *subscription, false, false);
}

} // namespace host
