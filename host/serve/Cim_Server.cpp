#include "host/serve/Cim_Server.h"

#include "host/serve/Xml_Writer.h"

#include <algorithm>
#include <cctype>
#include <iterator>

namespace host {

using namespace cim_status;

namespace {

constexpr int last_status = 17;
constexpr std::size_t piece_size = 16 * 1024;

/// A provider's status that CIM does not know is a failure, told by its number.
void refuse_unless_ok(const Status& status)
{
    if (status.ok()) return;
    if (status.code > 0 && status.code <= last_status)
        throw Cim_Fault{status.code, status.message.empty() ? status_name(status.code) : status.message};
    throw Cim_Fault{failed, status_name(status.code) + (status.message.empty() ? "" : ": " + status.message)};
}

/// "%2F" and so on, as headers have them.
std::string unescaped(const std::string& text)
{
    std::string result;
    for (std::size_t i = 0; i < text.size(); ++i) {
        const bool is_escape = text[i] == '%' && i + 2 < text.size() &&
                               std::isxdigit(static_cast<unsigned char>(text[i + 1])) &&
                               std::isxdigit(static_cast<unsigned char>(text[i + 2]));
        if (is_escape) {
            result += static_cast<char>(std::stoi(text.substr(i + 1, 2), nullptr, 16));
            i += 2;
        } else {
            result += text[i];
        }
    }
    return result;
}

/// What DSP0200 has answered by HTTP where the head and the body of a request do not agree.
void check_head(const Request_Head& head, const Message& message)
{
    if (!head.method.empty() && !same_name(unescaped(head.method), message.method()))
        throw Http_Fault{400, "header-mismatch", "CIMMethod is not the method of the message"};
    // A method's object may name a class or an instance behind the namespace.
    const std::string named = lower_case(unescaped(head.object)), name_space = lower_case(message.name_space());
    const std::string front = named.substr(0, named.find(':'));
    if (!named.empty() && front != name_space)
        throw Http_Fault{400, "header-mismatch", "CIMObject is not the namespace of the message"};
}

/// What a server that has only this version, and one operation a message, cannot do at all.
void check_abilities(const Request_Head& head)
{
    if (!head.operation.empty() && !same_name(head.operation, "MethodCall"))
        throw Http_Fault{501, "unsupported-operation", "CIMOperation is not MethodCall"};
    if (!head.version.empty() && head.version.compare(0, 2, "1.") != 0)
        throw Http_Fault{501, "unsupported-protocol-version", "CIMProtocolVersion is not 1"};
    if (!head.batch.empty()) throw Http_Fault{501, "multiple-requests-unsupported", "one request a message, please"};
}

std::string head(const Message& message)
{
    std::string text =
        "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE";
    write_attribute(text, "ID", message.id());
    text += " PROTOCOLVERSION=\"1.0\"><SIMPLERSP>";
    text += message.is_intrinsic() ? "<IMETHODRESPONSE" : "<METHODRESPONSE";
    write_attribute(text, "NAME", message.method());
    return text + ">";
}

std::string tail(const Message& message)
{
    return std::string(message.is_intrinsic() ? "</IMETHODRESPONSE>" : "</METHODRESPONSE>") +
           "</SIMPLERSP></MESSAGE></CIM>\n";
}

std::string error_element(const Cim_Fault& fault)
{
    std::string text = "<ERROR";
    write_attribute(text, "CODE", std::to_string(fault.code));
    write_attribute(text, "DESCRIPTION", fault.text);
    return text + "/>";
}

Write_Options options_of(const Message& message)
{
    Write_Options options;
    options.class_origin = message.flag("IncludeClassOrigin", false);
    options.properties = message.property_list();
    return options;
}

std::function<bool(std::string&)> one_piece(std::string text)
{
    return [text = std::move(text), done = false](std::string& out) mutable {
        if (done) return false;
        out += text;
        return done = true;
    };
}

} // namespace

/// What stands inside the response element: either a text, or items that are written as they are sent.
struct Cim_Server::Content {
    std::string open, close; ///< around the items
    std::size_t count = 0;
    std::function<void(std::string&, std::size_t)> item;

    static Content of(std::string text)
    {
        Content content;
        content.open = std::move(text);
        return content;
    }
    static Content list(std::size_t count, std::function<void(std::string&, std::size_t)> item)
    {
        return {"<IRETURNVALUE>", "</IRETURNVALUE>", count, std::move(item)};
    }
};

struct Cim_Server::Operation {
    const char* name;
    Content (Cim_Server::*run)(const Message&);
    std::vector<std::string> parameters;
};

const Cim_Server::Operation Cim_Server::operations[] = {
    {"GetClass",
     &Cim_Server::get_class,
     {"ClassName", "LocalOnly", "IncludeQualifiers", "IncludeClassOrigin", "PropertyList"}},
    {"EnumerateClasses",
     &Cim_Server::enumerate_classes,
     {"ClassName", "DeepInheritance", "LocalOnly", "IncludeQualifiers", "IncludeClassOrigin"}},
    {"EnumerateClassNames", &Cim_Server::enumerate_class_names, {"ClassName", "DeepInheritance"}},
    {"EnumerateInstances",
     &Cim_Server::enumerate_instances,
     {"ClassName", "LocalOnly", "DeepInheritance", "IncludeQualifiers", "IncludeClassOrigin", "PropertyList"}},
    {"EnumerateInstanceNames", &Cim_Server::enumerate_instance_names, {"ClassName"}},
    {"GetInstance",
     &Cim_Server::get_instance,
     {"InstanceName", "LocalOnly", "IncludeQualifiers", "IncludeClassOrigin", "PropertyList"}},
    {"CreateInstance", &Cim_Server::create_instance, {"NewInstance"}},
    {"ModifyInstance", &Cim_Server::modify_instance, {"ModifiedInstance", "IncludeQualifiers", "PropertyList"}},
    {"DeleteInstance", &Cim_Server::delete_instance, {"InstanceName"}},
    {"GetProperty", &Cim_Server::get_property, {"InstanceName", "PropertyName"}},
    {"SetProperty", &Cim_Server::set_property, {"InstanceName", "PropertyName", "NewValue"}},
    {"Associators",
     &Cim_Server::associators,
     {"ObjectName", "AssocClass", "ResultClass", "Role", "ResultRole", "IncludeQualifiers", "IncludeClassOrigin",
      "PropertyList"}},
    {"AssociatorNames",
     &Cim_Server::associator_names,
     {"ObjectName", "AssocClass", "ResultClass", "Role", "ResultRole"}},
    {"References",
     &Cim_Server::references,
     {"ObjectName", "ResultClass", "Role", "IncludeQualifiers", "IncludeClassOrigin", "PropertyList"}},
    {"ReferenceNames", &Cim_Server::reference_names, {"ObjectName", "ResultClass", "Role"}},
    {"ExecQuery", &Cim_Server::exec_query, {"QueryLanguage", "Query"}},
};

Cim_Server::Cim_Server(Host& host, std::string address)
    : m_host(host), m_address(std::move(address)), m_subscriptions(host)
{
}

Reply Cim_Server::answer(std::string_view body, const Request_Head& request)
{
    try {
        check_abilities(request);
        const Message message(body, m_host.schema(), request.host.empty() ? m_address : request.host);
        check_head(request, message);
        Content content;
        try {
            content = message.is_intrinsic() ? run(message) : invoke(message);
        } catch (const Cim_Fault& fault) {
            content = Content::of(error_element(fault));
        }
        Reply reply;
        std::string open = head(message) + content.open, close = content.close + tail(message);
        reply.pieces = [content = std::move(content), open = std::move(open), close = std::move(close),
                        next = std::size_t{0}, state = 0](std::string& out) mutable {
            if (state == 2) return false;
            const std::size_t full = out.size() + piece_size;
            if (state == 0) out += open;
            state = 1;
            while (next < content.count && out.size() < full)
                content.item(out, next++);
            if (next < content.count) return true;
            out += close;
            state = 2;
            return true;
        };
        return reply;
    } catch (const Http_Fault& fault) {
        return {fault.status, fault.cim_error, one_piece(fault.text + "\n")};
    } catch (const std::exception& error) {
        return {500, "", one_piece(std::string(error.what()) + "\n")};
    }
}

void Cim_Server::check_name_space(const std::string& name_space) const
{
    for (const Registration& each : m_host.registrations())
        for (const std::string& known : each.name_spaces)
            if (same_name(known, name_space)) return;
    throw Cim_Fault{invalid_name_space, "there is no namespace " + name_space};
}

const Class_Record& Cim_Server::class_of(const std::string& name) const
{
    if (name.empty()) throw Cim_Fault{invalid_parameter, "no class is named"};
    const Class_Record* record = m_host.schema().find(name);
    if (!record) record = Subscriptions::schema().find(name);
    if (!record) throw Cim_Fault{invalid_class, "there is no class " + name};
    return *record;
}

Cim_Server::Content Cim_Server::run(const Message& message)
{
    for (const Operation& operation : operations) {
        if (!same_name(operation.name, message.method())) continue;
        check_name_space(message.name_space());
        message.check_parameters(operation.parameters);
        for (const char* flag : {"LocalOnly", "DeepInheritance", "IncludeQualifiers", "IncludeClassOrigin"})
            message.flag(flag, false); // also where it changes nothing
        return (this->*operation.run)(message);
    }
    throw Cim_Fault{not_supported, "there is no operation " + message.method()};
}

Cim_Server::Content Cim_Server::invoke(const Message& message)
{
    check_name_space(message.name_space());
    const Path target = message.target();
    const Class_Record& record = class_of(target.class_name);
    const Method_Record* method = record.method(message.method());
    if (!method) throw Cim_Fault{method_not_found, record.name + " has no method " + message.method()};
    const Answer answer = m_host.call(target, method->name, message.arguments(*method));
    refuse_unless_ok(answer.status);
    std::string text;
    if (!answer.value.is_null()) {
        text += "<RETURNVALUE";
        write_attribute(text, "PARAMTYPE", xml_type(answer.value.type()));
        text += '>';
        write_value(text, answer.value, m_host.schema());
        text += "</RETURNVALUE>";
    }
    for (const Named_Value& each : answer.out)
        write_out_parameter(text, each, m_host.schema());
    return Content::of(text);
}

Cim_Server::Content Cim_Server::get_class(const Message& message)
{
    Write_Options options = options_of(message);
    options.qualifiers = message.flag("IncludeQualifiers", true);
    options.local_only = message.flag("LocalOnly", true);
    std::string text = "<IRETURNVALUE>";
    write_class(text, class_of(message.class_name("ClassName")), m_host.schema(), options);
    return Content::of(text + "</IRETURNVALUE>");
}

/// The direct subclasses of a class, or all below it; those without a superclass where no class is named.
std::vector<const Class_Record*> Cim_Server::classes_asked(const Message& message) const
{
    const bool deep = message.flag("DeepInheritance", false);
    const std::string name = message.class_name("ClassName");
    const Class_Record* root = name.empty() ? nullptr : &class_of(name);
    std::vector<const Class_Record*> found;
    for (const Class_Record* record : m_host.schema().classes())
        if (deep ? record != root && (!root || record->is_a(root->name)) : record->super == root)
            found.push_back(record);
    return found;
}

Cim_Server::Content Cim_Server::enumerate_classes(const Message& message)
{
    Write_Options options = options_of(message);
    options.qualifiers = message.flag("IncludeQualifiers", true);
    options.local_only = message.flag("LocalOnly", true);
    auto classes = classes_asked(message);
    return Content::list(classes.size(), [this, classes, options](std::string& out, std::size_t i) {
        write_class(out, *classes[i], m_host.schema(), options);
    });
}

Cim_Server::Content Cim_Server::enumerate_class_names(const Message& message)
{
    auto classes = classes_asked(message);
    return Content::list(classes.size(), [classes](std::string& out, std::size_t i) {
        out += "<CLASSNAME";
        write_attribute(out, "NAME", classes[i]->name);
        out += "/>";
    });
}

/// What of a list of properties a class itself has, and no subclass brings.
static Property_List those_of(const Class_Record& record, const Property_List& asked)
{
    std::vector<std::string> names;
    if (!asked)
        for (const Element_Record& property : record.properties)
            names.push_back(property.name);
    else
        std::copy_if(asked->begin(), asked->end(), std::back_inserter(names),
                     [&](const std::string& name) { return record.property(name) != nullptr; });
    return names;
}

Cim_Server::Content Cim_Server::enumerate_instances(const Message& message)
{
    Write_Options options = options_of(message);
    const std::string name = message.class_name("ClassName");
    const bool deep = message.flag("DeepInheritance", true);
    Answer answer;
    if (m_subscriptions.serves(name)) {
        answer.instances = m_subscriptions.instances(name);
    } else {
        const Class_Record& record = class_of(name);
        if (!deep) options.properties = those_of(record, options.properties);
        answer = m_host.enumerate(message.name_space(), record.name, options.properties);
    }
    refuse_unless_ok(answer.status);
    auto instances = std::make_shared<std::vector<Instance>>(std::move(answer.instances));
    return Content::list(instances->size(), [this, instances, options](std::string& out, std::size_t i) {
        out += "<VALUE.NAMEDINSTANCE>";
        write_instance_name(out, (*instances)[i].path);
        write_instance(out, (*instances)[i], m_host.schema(), options);
        out += "</VALUE.NAMEDINSTANCE>";
    });
}

Cim_Server::Content Cim_Server::enumerate_instance_names(const Message& message)
{
    const std::string name = message.class_name("ClassName");
    Answer answer;
    if (m_subscriptions.serves(name)) {
        for (const Instance& each : m_subscriptions.instances(name))
            answer.paths.push_back(each.path);
    } else {
        answer = m_host.names(message.name_space(), class_of(name).name);
    }
    refuse_unless_ok(answer.status);
    auto paths = std::make_shared<std::vector<Path>>(std::move(answer.paths));
    return Content::list(paths->size(),
                         [paths](std::string& out, std::size_t i) { write_instance_name(out, (*paths)[i]); });
}

Cim_Server::Content Cim_Server::get_instance(const Message& message)
{
    const Path path = message.instance_name("InstanceName");
    const Write_Options options = options_of(message);
    Answer answer;
    if (m_subscriptions.serves(path.class_name)) {
        if (const auto found = m_subscriptions.find(path)) answer.instances.push_back(*found);
    } else {
        class_of(path.class_name);
        answer = m_host.get(path, options.properties);
    }
    refuse_unless_ok(answer.status);
    if (answer.instances.empty()) throw Cim_Fault{not_found, "there is no such instance"};
    std::string text = "<IRETURNVALUE>";
    write_instance(text, answer.instances[0], m_host.schema(), options);
    return Content::of(text + "</IRETURNVALUE>");
}

Cim_Server::Content Cim_Server::create_instance(const Message& message)
{
    Instance instance = message.instance("NewInstance");
    Path path;
    if (m_subscriptions.serves(instance.path.class_name)) {
        path = m_subscriptions.create(std::move(instance));
    } else {
        class_of(instance.path.class_name);
        const Answer answer = m_host.create(instance);
        refuse_unless_ok(answer.status);
        if (answer.paths.empty()) throw Cim_Fault{failed, "the provider names no path"};
        path = answer.paths[0];
    }
    std::string text = "<IRETURNVALUE>";
    write_instance_name(text, path);
    return Content::of(text + "</IRETURNVALUE>");
}

Cim_Server::Content Cim_Server::modify_instance(const Message& message)
{
    const Instance instance = message.instance("ModifiedInstance");
    if (m_subscriptions.serves(instance.path.class_name))
        throw Cim_Fault{not_supported, "take the subscription back and make a new one"};
    class_of(instance.path.class_name);
    refuse_unless_ok(m_host.modify(instance, message.property_list()).status);
    return {};
}

Cim_Server::Content Cim_Server::delete_instance(const Message& message)
{
    const Path path = message.instance_name("InstanceName");
    if (m_subscriptions.serves(path.class_name)) {
        m_subscriptions.remove(path);
        return {};
    }
    class_of(path.class_name);
    refuse_unless_ok(m_host.remove(path).status);
    return {};
}

Cim_Server::Content Cim_Server::get_property(const Message& message)
{
    const Path path = message.instance_name("InstanceName");
    const std::string name = message.text("PropertyName");
    if (!class_of(path.class_name).property(name))
        throw Cim_Fault{no_such_property, path.class_name + " has no property " + name};
    const Answer answer = m_host.get_property(path, name);
    refuse_unless_ok(answer.status);
    if (answer.value.is_null()) return {};
    std::string text = "<IRETURNVALUE>";
    write_value(text, answer.value, m_host.schema());
    return Content::of(text + "</IRETURNVALUE>");
}

Cim_Server::Content Cim_Server::set_property(const Message& message)
{
    const Path path = message.instance_name("InstanceName");
    const std::string name = message.text("PropertyName");
    const Element_Record* property = class_of(path.class_name).property(name);
    if (!property) throw Cim_Fault{no_such_property, path.class_name + " has no property " + name};
    refuse_unless_ok(m_host.set_property(path, property->name, message.value("NewValue", *property)).status);
    return {};
}

Cim_Server::Content Cim_Server::with_paths(Answer answer, const Message& message)
{
    refuse_unless_ok(answer.status);
    auto instances = std::make_shared<std::vector<Instance>>(std::move(answer.instances));
    return Content::list(instances->size(), [this, instances, options = options_of(message),
                                             server = message.server()](std::string& out, std::size_t i) {
        out += "<VALUE.OBJECTWITHPATH>";
        write_instance_path(out, (*instances)[i].path, server);
        write_instance(out, (*instances)[i], m_host.schema(), options);
        out += "</VALUE.OBJECTWITHPATH>";
    });
}

Cim_Server::Content Cim_Server::only_paths(Answer answer, const Message& message)
{
    refuse_unless_ok(answer.status);
    auto paths = std::make_shared<std::vector<Path>>(std::move(answer.paths));
    return Content::list(paths->size(), [paths, server = message.server()](std::string& out, std::size_t i) {
        out += "<OBJECTPATH>";
        write_instance_path(out, (*paths)[i], server);
        out += "</OBJECTPATH>";
    });
}

/// The object of a traversal: an instance. Traversals of the schema itself are not served.
static Path instance_of(const Message& message)
{
    const Path path = message.object_name("ObjectName");
    if (path.keys.empty()) throw Cim_Fault{not_supported, "associations of classes are not served"};
    return path;
}

Cim_Server::Content Cim_Server::associators(const Message& message)
{
    const Path path = instance_of(message);
    class_of(path.class_name);
    return with_paths(m_host.associators(path, message.class_name("AssocClass"), message.class_name("ResultClass"),
                                         message.text("Role"), message.text("ResultRole"), message.property_list()),
                      message);
}

Cim_Server::Content Cim_Server::associator_names(const Message& message)
{
    const Path path = instance_of(message);
    class_of(path.class_name);
    return only_paths(m_host.associator_names(path, message.class_name("AssocClass"), message.class_name("ResultClass"),
                                              message.text("Role"), message.text("ResultRole")),
                      message);
}

Cim_Server::Content Cim_Server::references(const Message& message)
{
    const Path path = instance_of(message);
    class_of(path.class_name);
    return with_paths(
        m_host.references(path, message.class_name("ResultClass"), message.text("Role"), message.property_list()),
        message);
}

Cim_Server::Content Cim_Server::reference_names(const Message& message)
{
    const Path path = instance_of(message);
    class_of(path.class_name);
    return only_paths(m_host.reference_names(path, message.class_name("ResultClass"), message.text("Role")), message);
}

Cim_Server::Content Cim_Server::exec_query(const Message& message)
{
    throw Cim_Fault{not_supported, "queries are not served: " + message.text("Query")};
}

} // namespace host
