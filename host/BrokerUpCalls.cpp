// The bft of the broker: threads, indications, and requests of a module to the server.
#include "host/Broker.h"
#include "host/Convert.h"
#include "host/objects/ArgsObject.h"
#include "host/objects/EnumerationObject.h"
#include "host/objects/InstanceObject.h"
#include "host/objects/PathObject.h"

namespace host {
namespace {

CMPIContext* prepare_attach_thread(const CMPIBroker* mb, const CMPIContext* ctx)
{
    Broker& broker = *Broker::of(mb);
    auto* context = unwrap<Context_Object>(ctx);
    if (!context) broker.violation("prepareAttachThread without a context");
    return context ? broker.prepare_context(*context) : nullptr;
}

CMPIStatus attach_thread(const CMPIBroker* mb, const CMPIContext* ctx)
{
    return status_of(Broker::of(mb)->attach(ctx));
}
CMPIStatus detach_thread(const CMPIBroker* mb, const CMPIContext* ctx)
{
    return status_of(Broker::of(mb)->detach(ctx));
}

CMPIStatus deliver_indication(const CMPIBroker* mb, const CMPIContext* ctx, const char* ns, const CMPIInstance* ind)
{
    Broker& broker = *Broker::of(mb);
    broker.expect_known_thread("deliverIndication");
    if (!unwrap<Context_Object>(ctx)) broker.violation("deliverIndication without a context");
    auto* instance = unwrap<Instance_Object>(ind);
    if (!instance || !ns) return status_of(CMPI_RC_ERR_INVALID_PARAMETER);
    bool wanted = broker.indications() && broker.indications()->deliver(ns, instance->filtered());
    return status_of(wanted ? CMPI_RC_OK : broker.manner().nobody_subscribed);
}

Property_List list_of(const char** properties)
{
    if (!properties) return std::nullopt;
    std::vector<std::string> names;
    for (; *properties; ++properties)
        names.push_back(*properties);
    return names;
}

std::string text_of(const char* text)
{
    return text ? text : "";
}

/// A request of the module, begun: the path is taken over, and the user is that of the context.
struct Up_Call {
    Up_Call(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op, Request::Operation operation)
        : broker(*Broker::of(mb))
    {
        broker.expect_known_thread(operation_name(operation));
        auto* context = unwrap<Context_Object>(ctx);
        if (!context) broker.violation(std::string(operation_name(operation)) + " without a context");
        auto* path = unwrap<Path_Object>(op);
        good = context && path;
        request.operation = operation;
        request.up_call = true;
        if (path) request.path = path->data;
        if (!context) return;
        const Context_Object::Entry* principal = context->find(CMPIPrincipal);
        if (principal && !principal->null_characters) request.principal = principal->value.as_text();
    }

    Answer run(CMPIStatus* status)
    {
        Answer answer;
        if (!good)
            answer.status = {CMPI_RC_ERR_INVALID_PARAMETER, ""};
        else if (!broker.requests())
            answer.status = {CMPI_RC_ERR_FAILED, ""};
        else
            answer = broker.requests()->run(request);
        put_status(status, answer.status.code);
        if (status && !answer.status.message.empty())
            status->msg = broker.make_string(Origin::got, answer.status.message);
        return answer;
    }

    CMPIEnumeration* enumerate(CMPIType type, CMPIStatus* status)
    {
        CMPIStatus own = status_of(CMPI_RC_OK);
        Answer answer = run(status ? status : &own);
        if (!answer.ok()) return nullptr;
        std::vector<Value> elements;
        for (Instance& instance : answer.instances)
            elements.push_back(Value::instance(std::move(instance)));
        for (Path& path : answer.paths)
            elements.push_back(Value::reference(std::move(path)));
        return &broker.make<Enumeration_Object>(Origin::made, type, std::move(elements))->face;
    }

    Broker& broker;
    Request request;
    bool good = false;
};

CMPIEnumeration* enumerate_instance_names(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                                          CMPIStatus* rc)
{
    return Up_Call(mb, ctx, op, Request::Operation::names).enumerate(CMPI_ref, rc);
}

CMPIEnumeration* enumerate_instances(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                                     const char** properties, CMPIStatus* rc)
{
    Up_Call call(mb, ctx, op, Request::Operation::enumerate);
    call.request.properties = list_of(properties);
    return call.enumerate(CMPI_instance, rc);
}

CMPIInstance* get_instance(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                           const char** properties, CMPIStatus* rc)
{
    Up_Call call(mb, ctx, op, Request::Operation::get);
    call.request.properties = list_of(properties);
    Answer answer = call.run(rc);
    if (!answer.ok() || answer.instances.empty()) return nullptr;
    return &call.broker.make<Instance_Object>(Origin::made, std::move(answer.instances.front()))->face;
}

CMPIObjectPath* create_instance(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                                const CMPIInstance* inst, CMPIStatus* rc)
{
    Up_Call call(mb, ctx, op, Request::Operation::create);
    auto* instance = unwrap<Instance_Object>(inst);
    if (instance) call.request.instance = instance->data();
    call.good = call.good && instance;
    Answer answer = call.run(rc);
    if (!answer.ok() || answer.paths.empty()) return nullptr;
    return &call.broker.make<Path_Object>(Origin::made, std::move(answer.paths.front()))->face;
}

CMPIStatus modify_instance(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                           const CMPIInstance* inst, const char** properties)
{
    Up_Call call(mb, ctx, op, Request::Operation::modify);
    auto* instance = unwrap<Instance_Object>(inst);
    if (instance) call.request.instance = instance->data();
    call.good = call.good && instance;
    call.request.properties = list_of(properties);
    CMPIStatus status;
    call.run(&status);
    return status;
}

CMPIStatus delete_instance(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op)
{
    CMPIStatus status;
    Up_Call(mb, ctx, op, Request::Operation::remove).run(&status);
    return status;
}

CMPIEnumeration* exec_query(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op, const char* query,
                            const char* lang, CMPIStatus* rc)
{
    Up_Call call(mb, ctx, op, Request::Operation::exec_query);
    call.request.query = text_of(query);
    call.request.language = text_of(lang);
    return call.enumerate(CMPI_instance, rc);
}

CMPIEnumeration* traverse(Up_Call call, const char* association_class, const char* result_class, const char* role,
                          const char* result_role, const char** properties, CMPIType type, CMPIStatus* rc)
{
    call.request.association_class = text_of(association_class);
    call.request.result_class = text_of(result_class);
    call.request.role = text_of(role);
    call.request.result_role = text_of(result_role);
    call.request.properties = list_of(properties);
    return call.enumerate(type, rc);
}

CMPIEnumeration* associators(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                             const char* association_class, const char* result_class, const char* role,
                             const char* result_role, const char** properties, CMPIStatus* rc)
{
    return traverse({mb, ctx, op, Request::Operation::associators}, association_class, result_class, role, result_role,
                    properties, CMPI_instance, rc);
}

CMPIEnumeration* associator_names(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                                  const char* association_class, const char* result_class, const char* role,
                                  const char* result_role, CMPIStatus* rc)
{
    return traverse({mb, ctx, op, Request::Operation::associator_names}, association_class, result_class, role,
                    result_role, nullptr, CMPI_ref, rc);
}

CMPIEnumeration* references(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                            const char* result_class, const char* role, const char** properties, CMPIStatus* rc)
{
    return traverse({mb, ctx, op, Request::Operation::references}, nullptr, result_class, role, nullptr, properties,
                    CMPI_instance, rc);
}

CMPIEnumeration* reference_names(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                                 const char* result_class, const char* role, CMPIStatus* rc)
{
    return traverse({mb, ctx, op, Request::Operation::reference_names}, nullptr, result_class, role, nullptr, nullptr,
                    CMPI_ref, rc);
}

CMPIData invoke_method(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op, const char* method,
                       const CMPIArgs* in, CMPIArgs* out, CMPIStatus* rc)
{
    Up_Call call(mb, ctx, op, Request::Operation::call);
    auto* arguments = unwrap<Args_Object>(in);
    if (arguments) call.request.arguments = arguments->values;
    call.request.name = text_of(method);
    call.good = call.good && method;
    Answer answer = call.run(rc);
    if (auto* results = unwrap<Args_Object>(out)) results->values = std::move(answer.out);
    return answer.ok() ? data_of(call.broker, answer.value, Origin::got) : null_data(CMPI_null);
}

CMPIStatus set_property(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op, const char* name,
                        const CMPIValue* value, CMPIType type)
{
    Up_Call call(mb, ctx, op, Request::Operation::set_property);
    int code = CMPI_RC_OK;
    call.request.name = text_of(name);
    call.request.value = value_of(value, type, code);
    call.good = call.good && name && code == CMPI_RC_OK;
    CMPIStatus status;
    call.run(&status);
    return status;
}

CMPIData get_property(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op, const char* name,
                      CMPIStatus* rc)
{
    Up_Call call(mb, ctx, op, Request::Operation::get_property);
    call.request.name = text_of(name);
    call.good = call.good && name;
    Answer answer = call.run(rc);
    return answer.ok() ? data_of(call.broker, answer.value, Origin::got) : null_data(CMPI_null);
}

} // namespace

const char* operation_name(Request::Operation operation)
{
    constexpr const char* names[] = {"enumerateInstances", "enumerateInstanceNames", "getInstance", "createInstance",
                                     "modifyInstance",     "deleteInstance",         "execQuery",   "setProperty",
                                     "getProperty",        "invokeMethod",           "associators", "associatorNames",
                                     "references",         "referenceNames"};
    return names[static_cast<std::size_t>(operation)];
}

void fill_up_calls(CMPIBrokerFT& table, const Manner& manner)
{
    table.brokerCapabilities = manner.capabilities;
    table.brokerVersion = manner.broker_version;
    table.brokerName = manner.broker_name;
    table.prepareAttachThread = prepare_attach_thread;
    table.attachThread = attach_thread;
    table.detachThread = detach_thread;
    table.deliverIndication = deliver_indication;
    table.enumerateInstanceNames = enumerate_instance_names;
    table.getInstance = get_instance;
    table.createInstance = create_instance;
    table.modifyInstance = modify_instance;
    table.deleteInstance = delete_instance;
    table.execQuery = exec_query;
    table.enumerateInstances = enumerate_instances;
    table.associators = associators;
    table.associatorNames = associator_names;
    table.references = references;
    table.referenceNames = reference_names;
    table.invokeMethod = invoke_method;
    table.setProperty = set_property;
    table.getProperty = get_property;
}

} // namespace host
