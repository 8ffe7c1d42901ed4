#include "host/Host.h"

#include "host/Broker.h"
#include "host/Dispatcher.h"
#include "host/Indications.h"
#include "host/Modules.h"
#include "host/ProviderCall.h"
#include "host/Workers.h"

#include <mutex>

namespace host {

using Operation = Request::Operation;

/// Everything behind the face, in the order of its building; torn down in reverse.
struct Host::Parts {
    Parts(std::shared_ptr<const Schema> known, Host_Options given)
        : schema(std::move(known)), options(std::move(given)), log(options.log_file),
          broker(*schema, options.manner, log), workers(options.manner.pooled_threads), modules(broker, workers),
          indications(broker, modules, workers), dispatcher(broker, modules, workers)
    {
        broker.connect(&dispatcher, &indications);
    }

    Answer run(Operation operation, const Path& path, Request request = {})
    {
        request.operation = operation;
        request.path = path;
        request.principal = options.principal;
        return dispatcher.run(request);
    }

    /// For the rest of the process: a thread that the server never saw detach may call its broker still.
    static void keep(std::unique_ptr<Parts> parts)
    {
        static auto& mutex = *new std::mutex;
        static auto& kept = *new std::vector<std::unique_ptr<Parts>>;
        std::lock_guard lock(mutex);
        kept.push_back(std::move(parts));
    }

    std::shared_ptr<const Schema> schema;
    Host_Options options;
    Server_Log log;
    Broker broker;
    Workers workers;
    Modules modules;
    Indications indications;
    Dispatcher dispatcher;
};

namespace {

Path class_path(const std::string& name_space, const std::string& class_name)
{
    Path path;
    path.name_space = name_space;
    path.class_name = class_name;
    return path;
}

Request with(Property_List properties, const Result_Sink* sink = nullptr)
{
    Request request;
    request.sink = sink;
    request.properties = std::move(properties);
    return request;
}

Request along(const std::string& association_class, const std::string& result_class, const std::string& role,
              const std::string& result_role, Property_List properties = {}, const Result_Sink* sink = nullptr)
{
    Request request = with(std::move(properties), sink);
    request.association_class = association_class;
    request.result_class = result_class;
    request.role = role;
    request.result_role = result_role;
    return request;
}

} // namespace

Host::Host(std::shared_ptr<const Schema> schema, Host_Options options)
    : m_parts(std::make_unique<Parts>(std::move(schema), std::move(options)))
{
}

Host::~Host()
{
    m_parts->indications.settle();
    stop();
    m_parts->modules.end();
    if (!m_parts->broker.is_lent()) return;
    m_parts->workers.end();
    Parts::keep(std::move(m_parts));
}

void Host::add(const Registration& registration)
{
    m_parts->modules.add(registration);
}

std::size_t Host::add_module(const std::string& file, const std::string& name_space, std::string* error)
{
    return m_parts->modules.add_module(file, name_space, error);
}

void Host::add_instance(Instance instance)
{
    m_parts->dispatcher.statics().add(std::move(instance));
}
void Host::clear_instances()
{
    m_parts->dispatcher.statics().clear();
}
std::vector<Registration> Host::registrations() const
{
    return m_parts->modules.registrations();
}

Answer Host::enumerate(const std::string& name_space, const std::string& class_name, Property_List properties,
                       const Result_Sink* sink)
{
    return m_parts->run(Operation::enumerate, class_path(name_space, class_name), with(std::move(properties), sink));
}

Answer Host::names(const std::string& name_space, const std::string& class_name, const Result_Sink* sink)
{
    return m_parts->run(Operation::names, class_path(name_space, class_name), with({}, sink));
}

Answer Host::get(const Path& path, Property_List properties)
{
    return m_parts->run(Operation::get, path, with(std::move(properties)));
}

Answer Host::create(const Instance& instance)
{
    Request request;
    request.instance = instance;
    return m_parts->run(Operation::create, instance.path, std::move(request));
}

Answer Host::modify(const Instance& instance, Property_List properties)
{
    Request request = with(std::move(properties));
    request.instance = instance;
    return m_parts->run(Operation::modify, instance.path, std::move(request));
}

Answer Host::remove(const Path& path)
{
    return m_parts->run(Operation::remove, path);
}

Answer Host::exec_query(const std::string& name_space, const std::string& class_name, const std::string& query,
                        const std::string& language)
{
    Request request;
    request.query = query;
    request.language = language;
    return m_parts->run(Operation::exec_query, class_path(name_space, class_name), std::move(request));
}

Answer Host::set_property(const Path& path, const std::string& name, const Value& value)
{
    Request request;
    request.name = name;
    request.value = value;
    return m_parts->run(Operation::set_property, path, std::move(request));
}

Answer Host::get_property(const Path& path, const std::string& name)
{
    Request request;
    request.name = name;
    return m_parts->run(Operation::get_property, path, std::move(request));
}

Answer Host::call(const Path& path, const std::string& method, const std::vector<Named_Value>& in)
{
    Request request;
    request.name = method;
    request.arguments = in;
    return m_parts->run(Operation::call, path, std::move(request));
}

Answer Host::associators(const Path& path, const std::string& association_class, const std::string& result_class,
                         const std::string& role, const std::string& result_role, Property_List properties,
                         const Result_Sink* sink)
{
    return m_parts->run(Operation::associators, path,
                        along(association_class, result_class, role, result_role, std::move(properties), sink));
}

Answer Host::associator_names(const Path& path, const std::string& association_class, const std::string& result_class,
                              const std::string& role, const std::string& result_role, const Result_Sink* sink)
{
    return m_parts->run(Operation::associator_names, path,
                        along(association_class, result_class, role, result_role, {}, sink));
}

Answer Host::references(const Path& path, const std::string& result_class, const std::string& role,
                        Property_List properties, const Result_Sink* sink)
{
    return m_parts->run(Operation::references, path, along("", result_class, role, "", std::move(properties), sink));
}

Answer Host::reference_names(const Path& path, const std::string& result_class, const std::string& role,
                             const Result_Sink* sink)
{
    return m_parts->run(Operation::reference_names, path, along("", result_class, role, "", {}, sink));
}

Status Host::subscribe(const std::string& name_space, const std::string& class_name, Indication_Sink sink, int& id,
                       const std::string& query)
{
    return m_parts->indications.subscribe(name_space, class_name, std::move(sink), query, id);
}

Status Host::unsubscribe(int id)
{
    return m_parts->indications.unsubscribe(id);
}
void Host::settle()
{
    m_parts->indications.settle();
}
Unload_Result Host::unload_idle()
{
    return m_parts->modules.unload_idle();
}

Unload_Result Host::stop()
{
    return m_parts->modules.stop([this] { m_parts->indications.disable_all(); });
}

bool Host::is_loaded(const std::string& module) const
{
    return m_parts->modules.is_loaded(module);
}
Report Host::report() const
{
    return m_parts->broker.ledger().report();
}
void Host::reset_report()
{
    m_parts->broker.ledger().reset();
}
std::vector<std::string> Host::log() const
{
    return m_parts->log.lines();
}
const Schema& Host::schema() const
{
    return *m_parts->schema;
}
const Manner& Host::manner() const
{
    return m_parts->options.manner;
}
const CMPIBroker* Host::broker() const
{
    return m_parts->broker.face();
}

void Host::on_request_thread(const std::function<void(const CMPIBroker*, const CMPIContext*)>& body)
{
    m_parts->workers.run([&] {
        Call_Scope scope(m_parts->broker, "a request");
        body(broker(), m_parts->broker.make_request_context(m_parts->options.principal, ""));
    });
}

} // namespace host
