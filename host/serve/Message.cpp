#include "host/serve/Message.h"

#include "host/serve/Xml_Reader.h"
#include "host/serve/Xml_Values.h"

#include <algorithm>

namespace host {

using namespace cim_status;

namespace {

constexpr std::size_t most_listed = 4096; ///< properties that a client asks for

[[noreturn]] void refuse(const char* cim_error, const std::string& text)
{
    throw Http_Fault{400, cim_error, text};
}

/// A parameter of another form than its operation declares.
[[noreturn]] void refuse_form(const char* name, const char* wanted)
{
    throw Cim_Fault{invalid_parameter, std::string(name) + " holds no " + wanted};
}

pugi::xml_node child_or_refuse(const pugi::xml_node& node, const char* name)
{
    const pugi::xml_node child = node.child(name);
    if (!child) refuse("request-not-valid", std::string(node.name()) + " without " + name);
    return child;
}

void check_version(const char* what, const char* version, const char* cim_error)
{
    if (version[0] != what[0] || version[1] != '.') throw Http_Fault{501, cim_error, std::string("version ") + version};
}

} // namespace

Message::Message(std::string_view body, const Schema& schema, std::string server)
    : m_schema(schema), m_document(std::make_unique<pugi::xml_document>()), m_server(std::move(server))
{
    const std::string wrong = read_xml(body, *m_document);
    if (!wrong.empty()) refuse("request-not-well-formed", wrong);
    const pugi::xml_node cim = m_document->child("CIM");
    if (!cim) refuse("request-not-valid", "no CIM element");
    check_version("2", cim.attribute("CIMVERSION").as_string(), "unsupported-cim-version");
    check_version("2", cim.attribute("DTDVERSION").as_string(), "unsupported-dtd-version");
    const pugi::xml_node message = child_or_refuse(cim, "MESSAGE");
    check_version("1", message.attribute("PROTOCOLVERSION").as_string(), "unsupported-protocol-version");
    m_id = message.attribute("ID").as_string();
    if (message.child("MULTIREQ"))
        throw Http_Fault{501, "multiple-requests-unsupported", "one request a message, please"};
    const pugi::xml_node request = child_or_refuse(message, "SIMPLEREQ");
    m_call = request.child("IMETHODCALL");
    m_intrinsic = bool(m_call);
    if (!m_intrinsic) m_call = child_or_refuse(request, "METHODCALL");
    m_method = m_call.attribute("NAME").as_string();
    if (m_intrinsic) m_name_space = read_name_space(child_or_refuse(m_call, "LOCALNAMESPACEPATH"));
    for (const char* path : {"LOCALINSTANCEPATH", "LOCALCLASSPATH"})
        if (const pugi::xml_node object = m_call.child(path))
            m_name_space = read_name_space(child_or_refuse(object, "LOCALNAMESPACEPATH"));
    if (m_method.empty() || m_name_space.empty()) refuse("request-not-valid", "a call without a name or a namespace");
}

pugi::xml_node Message::parameter(const char* name) const
{
    for (const pugi::xml_node& each : m_call.children("IPARAMVALUE"))
        if (same_name(each.attribute("NAME").as_string(), name)) return each;
    return {};
}

bool Message::has(const char* name) const
{
    const pugi::xml_node found = parameter(name);
    return bool(first_element(found));
}

void Message::check_parameters(const std::vector<std::string>& known) const
{
    std::vector<std::string> seen;
    for (const pugi::xml_node& each : m_call.children("IPARAMVALUE")) {
        const std::string name = lower_case(each.attribute("NAME").as_string());
        const auto is_it = [&](const std::string& other) { return same_name(name, other); };
        if (std::none_of(known.begin(), known.end(), is_it))
            throw Cim_Fault{invalid_parameter, m_method + " has no parameter " + name};
        if (std::any_of(seen.begin(), seen.end(), is_it)) throw Cim_Fault{invalid_parameter, name + " is there twice"};
        seen.push_back(name);
    }
}

std::string Message::text(const char* name) const
{
    const pugi::xml_node value = parameter(name).child("VALUE");
    if (!value && has(name)) refuse_form(name, "VALUE");
    return text_of(value);
}

bool Message::flag(const char* name, bool otherwise) const
{
    if (!has(name)) return otherwise;
    const std::string value = text(name);
    if (same_name(value, "true")) return true;
    if (same_name(value, "false")) return false;
    throw Cim_Fault{invalid_parameter, std::string(name) + " is neither TRUE nor FALSE"};
}

std::string Message::class_name(const char* name) const
{
    const pugi::xml_node value = parameter(name).child("CLASSNAME");
    if (!value && has(name)) refuse_form(name, "CLASSNAME");
    return value.attribute("NAME").as_string();
}

Path Message::instance_name(const char* name) const
{
    const pugi::xml_node node = parameter(name).child("INSTANCENAME");
    if (!node) throw Cim_Fault{invalid_parameter, std::string(name) + " is missing"};
    return Xml_Values(m_schema, m_name_space).instance_name(node);
}

Path Message::object_name(const char* name) const
{
    const pugi::xml_node class_only = parameter(name).child("CLASSNAME");
    if (!class_only) return instance_name(name);
    Path path;
    path.name_space = m_name_space;
    path.class_name = class_only.attribute("NAME").as_string();
    return path;
}

Property_List Message::property_list() const
{
    if (!has("PropertyList")) return std::nullopt;
    const pugi::xml_node array = parameter("PropertyList").child("VALUE.ARRAY");
    if (!array) refuse_form("PropertyList", "VALUE.ARRAY");
    std::vector<std::string> names;
    for (const pugi::xml_node& value : array.children("VALUE"))
        names.push_back(text_of(value));
    if (names.size() > most_listed) throw Cim_Fault{invalid_parameter, "PropertyList has too many names"};
    return names;
}

Instance Message::instance(const char* name) const
{
    const pugi::xml_node node = parameter(name);
    const Xml_Values values(m_schema, m_name_space);
    if (const pugi::xml_node named = node.child("VALUE.NAMEDINSTANCE")) return values.named_instance(named);
    if (const pugi::xml_node bare = node.child("INSTANCE")) return values.instance(bare);
    throw Cim_Fault{invalid_parameter, std::string(name) + " is missing"};
}

Value Message::value(const char* name, const Element_Record& element) const
{
    return Xml_Values(m_schema, m_name_space).value(parameter(name), element);
}

Path Message::target() const
{
    if (const pugi::xml_node path = m_call.child("LOCALINSTANCEPATH")) {
        const pugi::xml_node name = path.child("INSTANCENAME");
        if (!name) throw Cim_Fault{invalid_parameter, "LOCALINSTANCEPATH without INSTANCENAME"};
        return Xml_Values(m_schema, m_name_space).instance_name(name);
    }
    Path target;
    target.name_space = m_name_space;
    target.class_name = m_call.child("LOCALCLASSPATH").child("CLASSNAME").attribute("NAME").as_string();
    return target;
}

std::vector<Named_Value> Message::arguments(const Method_Record& method) const
{
    const Xml_Values values(m_schema, m_name_space);
    std::vector<Named_Value> arguments;
    for (const pugi::xml_node& node : m_call.children("PARAMVALUE")) {
        const std::string name = node.attribute("NAME").as_string();
        const Element_Record* parameter = method.find_parameter(name);
        if (!parameter) throw Cim_Fault{invalid_parameter, method.name + " has no parameter " + name};
        for (const Named_Value& earlier : arguments)
            if (same_name(earlier.name, name)) throw Cim_Fault{invalid_parameter, name + " is there twice"};
        arguments.push_back({parameter->name, values.value(node, *parameter)});
    }
    return arguments;
}

} // namespace host
