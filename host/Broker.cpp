#include "host/Broker.h"

#include "host/objects/ArgsObject.h"
#include "host/objects/ArrayObject.h"
#include "host/objects/DateTimeObject.h"
#include "host/objects/EnumerationObject.h"
#include "host/objects/ErrorObject.h"
#include "host/objects/InstanceObject.h"
#include "host/objects/PathObject.h"
#include "host/objects/ResultObject.h"
#include "host/objects/SelectExpObject.h"

#include <algorithm>
#include <unistd.h>

namespace host {
namespace {

std::string own_host_name()
{
    char name[256] = "";
    if (gethostname(name, sizeof name - 1) != 0 || !*name) return "localhost";
    return name;
}

} // namespace

Broker::Broker(const Schema& schema, const Manner& manner, Server_Log& log)
    : m_schema(schema), m_manner(manner), m_log(log), m_host_name(own_host_name()),
      m_orphans(*this, Scope::Sort::orphans, "unknown threads"), m_explicit(*this, Scope::Sort::explicit_life, "clones")
{
    fill_object_tables();
    fill_up_calls(m_bft, manner);
    fill_encapsulation(m_eft, manner);
    fill_threads(m_xft, manner);
    m_face = {this, &m_bft, &m_eft, &m_xft, memory_table(manner)};
}

void Broker::connect(Request_Runner* requests, Indication_Taker* indications)
{
    m_requests = requests;
    m_indications = indications;
}

void Broker::fill_object_tables()
{
    m_tables.instance = Instance_Object::table(m_manner);
    m_tables.path = Path_Object::table(m_manner);
    m_tables.args = Args_Object::table(m_manner);
    m_tables.string = String_Object::table(m_manner);
    m_tables.array = Array_Object::table(m_manner);
    m_tables.datetime = Date_Time_Object::table(m_manner);
    m_tables.enumeration = Enumeration_Object::table(m_manner);
    m_tables.result = Result_Object::table(m_manner);
    m_tables.context = Context_Object::table(m_manner);
    m_tables.select_exp = Select_Exp_Object::table(m_manner);
    m_tables.error = Error_Object::table(m_manner);
}

void Broker::adopt(Object& object)
{
    m_ledger.created(object.kind, object.origin);
    if (object.origin == Origin::cloned) {
        m_explicit.add(object);
        return;
    }
    Scope* scope = Scope::current(*this);
    if (!scope) {
        violation(std::string(kind_name(object.kind)) + " made on a thread that has no request and is not attached");
        scope = &m_orphans;
    }
    scope->add(object);
}

CMPIString* Broker::make_string(Origin origin, const std::string& text)
{
    return &make<String_Object>(origin, text)->face;
}

CMPIContext* Broker::make_request_context(const std::string& principal, const std::string& name_space)
{
    std::vector<Context_Object::Entry> entries;
    entries.push_back({CMPIInvocationFlags, Value::uint32(0), false});
    entries.push_back(
        {CMPIPrincipal, Value::string(principal), principal.empty() && m_manner.principal_has_null_chars});
    if (m_manner.language_entries) {
        entries.push_back({CMPIInitNameSpace, Value::string(name_space), false});
        entries.push_back({CMPIRole, Value::string(""), false});
        entries.push_back({CMPIAcceptLanguage, Value::string("en"), false});
    }
    if (m_manner.session_entry) entries.push_back({"CMPISessionId", Value::uint32(1), false});
    return &make<Context_Object>(Origin::lent, std::move(entries))->face;
}

CMPIContext* Broker::make_factory_context()
{
    std::vector<Context_Object::Entry> entries;
    if (m_manner.factory_context_filled) {
        entries.push_back({CMPIInvocationFlags, Value::uint32(0), false});
        entries.push_back({CMPIPrincipal, Value::string("$$"), false});
    }
    return &make<Context_Object>(Origin::lent, std::move(entries))->face;
}

CMPIContext* Broker::prepare_context(const Context_Object& source)
{
    auto* context = new Context_Object(*this, Origin::made, source.entries);
    context->prepared = true;
    m_ledger.created(Object_Kind::context, Origin::made);
    m_ledger.context_out(1);
    m_explicit.add(*context);
    return &context->face;
}

int Broker::attach(const CMPIContext* context)
{
    auto* object = unwrap<Context_Object>(context);
    if (!object) return CMPI_RC_ERR_INVALID_HANDLE;
    if (!object->prepared) {
        violation("attachThread with a context that prepareAttachThread did not make");
        m_ledger.context_out(1);
    }
    if (Scope::current(*this)) violation("attachThread on a thread that has a request or is attached");
    auto scope = std::make_unique<Scope>(*this, Scope::Sort::attached, "attached thread");
    scope->context = context;
    scope->enter();
    std::lock_guard lock(m_mutex);
    m_attached.push_back(std::move(scope));
    return CMPI_RC_OK;
}

int Broker::detach(const CMPIContext* context)
{
    auto* object = unwrap<Context_Object>(context);
    if (!object) return CMPI_RC_ERR_INVALID_HANDLE;
    Scope* scope = Scope::current(*this);
    if (!scope || scope->sort() != Scope::Sort::attached || scope->context != context) {
        violation("detachThread on a thread that is not attached with this context");
        return CMPI_RC_ERR_INVALID_PARAMETER;
    }
    scope->leave();
    std::unique_ptr<Scope> ended;
    {
        std::lock_guard lock(m_mutex);
        auto found =
            std::find_if(m_attached.begin(), m_attached.end(), [&](auto& each) { return each.get() == scope; });
        ended = std::move(*found);
        m_attached.erase(found);
    }
    ended.reset();
    if (object->prepared) release_object(context->hdl, Object_Kind::context);
    m_ledger.context_out(-1); // the last touch: with the last context back, the broker may go
    return CMPI_RC_OK;
}

void Broker::retire(Object& object)
{
    m_ledger.released(object.kind, object.origin);
    object.scope->retire(object);
}

void Broker::keep(Retired_Objects& retired)
{
    Retired_Objects oldest; // freed without the mutex
    std::lock_guard lock(m_mutex);
    oldest = m_retired.add_last(retired);
}

void Broker::violation(const std::string& text)
{
    m_ledger.violation(text);
    m_log.line("broken rule: %s", text.c_str());
}

void Broker::expect_known_thread(const char* call)
{
    if (!Scope::current(*this)) violation(std::string(call) + " on a thread that has no request and is not attached");
}

} // namespace host
