#include "host/Provider.h"

#include "host/Broker.h"
#include "host/ProviderCall.h"

#include <dlfcn.h>

namespace host {
namespace {

constexpr const char* mi_names[mi_kinds] = {"Instance", "Association", "Method", "Property", "Indication"};

std::atomic<unsigned> factories_called{0};

} // namespace

unsigned kind_bit(Mi kind)
{
    constexpr unsigned bits[mi_kinds] = {instance_kind, association_kind, method_kind, property_kind, indication_kind};
    return bits[static_cast<std::size_t>(kind)];
}

const char* mi_name(Mi kind)
{
    return mi_names[static_cast<std::size_t>(kind)];
}

Provider::Provider(Broker& broker, const Registration& registration) : m_broker(broker), m_registration(registration) {}

void Provider::join(const Registration& registration)
{
    std::lock_guard lock(m_mutex);
    m_registration.kinds |= registration.kinds;
    m_registration.never_unload = m_registration.never_unload || registration.never_unload;
}

bool Provider::never_unload() const
{
    std::lock_guard lock(m_mutex);
    return m_registration.never_unload;
}

Status Provider::open()
{
    if (m_library) return {};
    const bool now = m_broker.manner().resolve_now;
    m_library = dlopen(module().c_str(), (now ? RTLD_NOW : RTLD_LAZY) | RTLD_GLOBAL);
    const char* error = m_library ? nullptr : dlerror();
    m_broker.log().line("dlopen (%s, global) %s for %s: %s", now ? "now" : "lazy", module().c_str(), name().c_str(),
                        m_library ? "OK"
                        : error   ? error
                                  : "failed");
    if (m_library) return {};
    return {CMPI_RC_ERR_FAILED, "the module cannot be loaded: " + std::string(error ? error : module()), Fault::module};
}

Status Provider::make(Mi kind)
{
    void*& slot = m_made[static_cast<std::size_t>(kind)];
    if (slot) return {};
    std::string factory = name() + "_Create_" + mi_name(kind) + "MI";
    using Factory = void* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
    auto call = reinterpret_cast<Factory>(dlsym(m_library, factory.c_str()));
    if (!call) {
        m_broker.log().line("factory %s: missing", factory.c_str());
        return {CMPI_RC_ERR_FAILED, "the module " + module() + " has no factory " + factory, Fault::module};
    }
    CMPIStatus status = status_of(CMPI_RC_OK);
    void* mi = nullptr;
    CMPIContext* context = m_broker.make_factory_context();
    Status guarded = guard(m_broker, factory, [&] { mi = call(m_broker.face(), context, &status); });
    Status told = guarded.ok() ? read_status(status) : guarded;
    m_broker.log().line("factory %s: %s%s", factory.c_str(), mi ? "OK" : "null",
                        told.ok() ? "" : (", " + status_name(told.code)).c_str());
    if (!told.ok() || !mi)
        return {CMPI_RC_ERR_FAILED,
                "the factory " + factory + " of the module failed" +
                    (told.ok() ? " (no MI)" : ": " + status_name(told.code) + " " + told.message),
                Fault::module};
    slot = mi;
    m_cleaned[static_cast<std::size_t>(kind)] = false;
    m_age = ++factories_called;
    return {};
}

Status Provider::ready(Mi kind, void*& mi)
{
    std::lock_guard lock(m_mutex);
    if (!(m_registration.kinds & kind_bit(kind)))
        return {CMPI_RC_ERR_NOT_SUPPORTED, name() + " is not registered as " + mi_name(kind) + " provider",
                Fault::request};
    Status status = open();
    for (Mi each : all_mi_kinds) {
        bool wanted = each == kind || m_broker.manner().factories_by_class;
        if (status.ok() && wanted && (m_registration.kinds & kind_bit(each))) status = make(each);
    }
    mi = status.ok() ? m_made[static_cast<std::size_t>(kind)] : nullptr;
    return status;
}

void* Provider::made(Mi kind) const
{
    std::lock_guard lock(m_mutex);
    return m_made[static_cast<std::size_t>(kind)];
}

Status Provider::cleanup(Mi kind, const CMPIContext* context, bool terminating)
{
    Status told = call_cleanup({kind, made(kind)}, context, terminating);
    m_broker.log().line("cleanup (terminating %s) of %s %s: %s", terminating ? "true" : "false", name().c_str(),
                        mi_name(kind), status_name(told.code).c_str());
    std::lock_guard lock(m_mutex);
    if (terminating || told.ok()) m_cleaned[static_cast<std::size_t>(kind)] = true;
    return told;
}

Status Provider::call_cleanup(const Made& made, const CMPIContext* context, bool terminating)
{
    const auto [kind, mi] = made;
    CMPIStatus status = status_of(CMPI_RC_ERR_NOT_SUPPORTED);
    CMPIBoolean flag = terminating ? CMPI_true : CMPI_false;
    auto call = [&](auto* face) {
        if (face->ft && face->ft->cleanup) status = face->ft->cleanup(face, context, flag);
    };
    Status guarded = guard(m_broker, name() + " cleanup", [&, kind = kind, mi = mi] {
        if (kind == Mi::instance) call(static_cast<CMPIInstanceMI*>(mi));
        if (kind == Mi::association) call(static_cast<CMPIAssociationMI*>(mi));
        if (kind == Mi::method) call(static_cast<CMPIMethodMI*>(mi));
        if (kind == Mi::property) call(static_cast<CMPIPropertyMI*>(mi));
        if (kind == Mi::indication) call(static_cast<CMPIIndicationMI*>(mi));
    });
    return guarded.ok() ? read_status(status) : guarded;
}

void Provider::forget()
{
    std::lock_guard lock(m_mutex);
    for (Mi kind : all_mi_kinds) {
        const auto at = static_cast<std::size_t>(kind);
        if (m_made[at] && !m_cleaned[at]) m_left_over.push_back({kind, m_made[at]});
    }
    m_made.fill(nullptr);
    m_age = 0;
    enabled = false;
}

bool Provider::close()
{
    std::lock_guard lock(m_mutex);
    for (void* mi : m_made)
        if (mi) return false;
    if (!m_library) return false;
    m_broker.log().line("dlclose %s for %s", module().c_str(), name().c_str());
    if (m_left_over.empty())
        dlclose(m_library);
    else
        m_left_open.push_back(m_library);
    m_library = nullptr;
    return true;
}

bool Provider::has_left_over() const
{
    std::lock_guard lock(m_mutex);
    return !m_left_over.empty();
}

void Provider::clean_left_over(const CMPIContext* context)
{
    std::vector<Made> left_over;
    std::vector<void*> left_open;
    {
        std::lock_guard lock(m_mutex);
        left_over.swap(m_left_over);
        left_open.swap(m_left_open);
    }
    for (const Made& made : left_over) {
        Status told = call_cleanup(made, context, true);
        m_broker.log().line("left over at the end: cleanup of %s %s: %s", name().c_str(), mi_name(made.kind),
                            status_name(told.code).c_str());
    }
    for (void* library : left_open)
        dlclose(library);
}

bool Provider::is_open() const
{
    std::lock_guard lock(m_mutex);
    return m_library != nullptr;
}

} // namespace host
