#include "host/Dispatcher.h"

#include "host/ProviderCall.h"

#include <algorithm>
#include <chrono>

namespace host {
namespace {

using Operation = Request::Operation;

Answer failed(int code, std::string message, Fault fault = Fault::request)
{
    Answer answer;
    answer.status = {code, std::move(message), fault};
    return answer;
}

Answer nobody(const std::string& what, const Path& path)
{
    return failed(CMPI_RC_ERR_NOT_SUPPORTED,
                  "no " + what + " provider is registered for " + path.class_name + " in " + path.name_space);
}

bool is_traversal(Operation operation)
{
    return operation == Operation::associators || operation == Operation::associator_names ||
           operation == Operation::references || operation == Operation::reference_names;
}

/// May an association class hold an instance of the source class, in the wanted role?
bool can_hold(const Schema& schema, const Class_Record& association, const std::string& source, const std::string& role)
{
    return std::any_of(association.properties.begin(), association.properties.end(), [&](const Element_Record& end) {
        if (end.type != CMPI_ref || (!role.empty() && !same_name(end.name, role))) return false;
        return schema.is_a(source, end.reference_class) || schema.is_a(end.reference_class, source);
    });
}

} // namespace

Dispatcher::Dispatcher(Broker& broker, Modules& modules, Workers& workers)
    : m_broker(broker), m_modules(modules), m_workers(workers), m_statics(broker.schema())
{
}

bool Dispatcher::knows(const std::string& name_space) const
{
    return m_modules.has_name_space(name_space) || m_statics.has_name_space(name_space);
}

const Served_Class* Dispatcher::find(const std::vector<Served_Class>& all, const std::string& class_name) const
{
    for (const Served_Class& served : all)
        if (same_name(served.registration.class_name, class_name)) return &served;
    return nullptr;
}

Answer Dispatcher::run(const Request& request)
{
    if (request.up_call)
        m_broker.log().line("up-call %s %s", operation_name(request.operation), request.path.to_text().c_str());
    if (request.up_call ? m_modules.ended() : m_modules.stopped())
        return failed(CMPI_RC_ERR_FAILED, "the server has stopped", Fault::server);
    if (!knows(request.path.name_space))
        return failed(CMPI_RC_ERR_INVALID_NAMESPACE, "the server has no namespace " + request.path.name_space);
    if (!m_broker.schema().find(request.path.class_name))
        return failed(CMPI_RC_ERR_INVALID_CLASS, "the server has no class " + request.path.class_name);
    switch (request.operation) {
    case Operation::enumerate:
    case Operation::names:
    case Operation::exec_query:
        return enumerate(request);
    case Operation::call:
        return one_instance(request, Mi::method);
    case Operation::set_property:
        return set_property(request);
    case Operation::get_property:
        return get_property(request);
    default:
        return is_traversal(request.operation) ? traverse(request) : one_instance(request, Mi::instance);
    }
}

Answer Dispatcher::enumerate(const Request& request)
{
    std::vector<Target> targets;
    std::vector<Served_Class> serving = m_modules.serving(request.path.name_space, Mi::instance);
    const Class_Record* wanted = m_broker.schema().find(request.path.class_name);
    for (const Class_Record* record : m_broker.schema().family(*wanted))
        for (const Served_Class& served : serving)
            if (served.record == record) targets.push_back({served, record->name});

    std::vector<Instance> own = m_statics.of_class(request.path.name_space, wanted->name);
    if (targets.empty() && own.empty()) return nobody("instance", request.path);
    Answer answer = ask(request, targets, Mi::instance);
    if (request.operation == Operation::exec_query) return answer;
    const bool names = request.operation == Operation::names;
    const bool hands_on = request.sink && (names ? bool(request.sink->path) : bool(request.sink->instance));
    if (hands_on) answer.handed_on += own.size();
    for (Instance& instance : own) {
        if (!names) keep_properties(instance, request.properties, m_broker.schema());
        if (hands_on)
            names ? request.sink->path(std::move(instance.path)) : request.sink->instance(std::move(instance));
        else if (names)
            answer.paths.push_back(std::move(instance.path));
        else
            answer.instances.push_back(std::move(instance));
    }
    return answer;
}

Answer Dispatcher::one_instance(const Request& request, Mi kind)
{
    if (request.operation == Operation::get)
        if (std::optional<Instance> own = m_statics.get(request.path)) {
            keep_properties(*own, request.properties, m_broker.schema());
            Answer answer;
            answer.instances.push_back(std::move(*own));
            return answer;
        }
    std::vector<Served_Class> serving = m_modules.serving(request.path.name_space, kind);
    const Served_Class* served = find(serving, request.path.class_name);
    if (!served) {
        bool known = request.operation == Operation::get &&
                     !m_statics.of_class(request.path.name_space, request.path.class_name).empty();
        if (known) return failed(CMPI_RC_ERR_NOT_FOUND, "");
        return nobody(kind == Mi::method ? "method" : "instance", request.path);
    }
    Answer answer = ask(request, {{*served, served->registration.class_name}}, kind);
    bool nothing = answer.ok() && request.operation == Operation::get && answer.instances.empty();
    if (nothing) answer.status = {CMPI_RC_ERR_FAILED, "the provider answered OK without an instance", Fault::provider};
    return answer;
}

Answer Dispatcher::traverse(const Request& request)
{
    const bool references =
        request.operation == Operation::references || request.operation == Operation::reference_names;
    const std::string& filter = references ? request.result_class : request.association_class;
    for (const std::string& name : {request.association_class, request.result_class})
        if (!name.empty() && !m_broker.schema().find(name))
            return failed(CMPI_RC_ERR_INVALID_PARAMETER, "the server has no class " + name);

    std::vector<Target> targets;
    for (const Served_Class& served : m_modules.serving(request.path.name_space, Mi::association)) {
        if (!served.record || (!filter.empty() && !served.record->is_a(filter))) continue;
        if (can_hold(m_broker.schema(), *served.record, request.path.class_name, request.role))
            targets.push_back({served, served.record->name});
    }
    return ask(request, targets, Mi::association);
}

Answer Dispatcher::set_property(const Request& request)
{
    std::vector<Served_Class> serving = m_modules.serving(request.path.name_space, Mi::property);
    if (const Served_Class* served = find(serving, request.path.class_name))
        return ask(request, {{*served, served->registration.class_name}}, Mi::property);
    Request modify = request;
    modify.operation = Operation::modify;
    modify.properties = std::vector<std::string>{request.name};
    modify.instance.path = request.path;
    modify.instance.properties = request.path.keys;
    modify.instance.set(request.name, request.value);
    return one_instance(modify, Mi::instance);
}

Answer Dispatcher::get_property(const Request& request)
{
    std::vector<Served_Class> serving = m_modules.serving(request.path.name_space, Mi::property);
    if (const Served_Class* served = find(serving, request.path.class_name))
        return ask(request, {{*served, served->registration.class_name}}, Mi::property);
    const Class_Record* record = m_broker.schema().find(request.path.class_name);
    if (!record->property(request.name))
        return failed(CMPI_RC_ERR_NO_SUCH_PROPERTY, record->name + " has no property " + request.name);
    Request get = request;
    get.operation = Operation::get;
    get.properties = std::vector<std::string>{request.name};
    Answer answer = one_instance(get, Mi::instance);
    if (answer.ok()) answer.value = answer.instances.front().get(request.name);
    return answer;
}

Answer Dispatcher::ask(const Request& request, const std::vector<Target>& targets, Mi kind)
{
    std::vector<Answer> answers(targets.size());
    std::vector<std::function<void()>> works;
    for (std::size_t i = 0; i < targets.size(); ++i) {
        answers[i].status = {CMPI_RC_ERROR_SYSTEM, "the server has no thread for the request", Fault::server};
        works.push_back([&, i] { ask_one(request, targets[i], kind, answers[i]); });
    }
    if (!works.empty()) m_workers.run_all(works, m_broker.manner().parallel_subclasses);
    if (answers.size() == 1) return std::move(answers.front());

    Answer whole;
    for (Answer& answer : answers) {
        if (whole.ok()) whole.status = answer.status;
        std::move(answer.instances.begin(), answer.instances.end(), std::back_inserter(whole.instances));
        std::move(answer.paths.begin(), answer.paths.end(), std::back_inserter(whole.paths));
        whole.handed_on += answer.handed_on;
    }
    return whole;
}

void Dispatcher::ask_one(const Request& request, const Target& target, Mi kind, Answer& answer)
{
    Provider& provider = *target.served.provider;
    Modules::Visit visit(m_modules, provider.module(), request.up_call);
    if (!visit) {
        answer.status = {CMPI_RC_ERR_FAILED, "the server has stopped", Fault::server};
        return;
    }
    const auto start = std::chrono::steady_clock::now();
    Call_Scope scope(m_broker, std::string(operation_name(request.operation)) + " of " + provider.name());
    void* mi = nullptr;
    answer.status = provider.ready(kind, mi);
    if (!answer.ok()) return;
    Status status = call_mi(m_broker, request, kind, mi, target.class_name, answer);
    // An error that the provider returned as an object says more than its status.
    if (answer.ok() || status.ok()) answer.status = answer.ok() ? status : answer.status;
    std::chrono::duration<double, std::milli> time = std::chrono::steady_clock::now() - start;
    const std::string handed_on = request.sink ? ", " + std::to_string(answer.handed_on) + " handed on" : "";
    m_broker.log().line("%s %s: %s, %zu instances, %zu paths%s, %.3f ms", operation_name(request.operation),
                        target.class_name.c_str(), status_name(answer.status.code).c_str(), answer.instances.size(),
                        answer.paths.size(), handed_on.c_str(), time.count());
}

} // namespace host
