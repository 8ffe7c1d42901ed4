#include "host/serve/Xml_Values.h"

#include "host/ScalarText.h"
#include "host/serve/Message.h"
#include "host/serve/Xml_Reader.h"

namespace host {
namespace {

constexpr int deepest = 8;
// Of what the schema does not bound: each new name is compared with those before it.
constexpr std::size_t most_keys = 64, most_undeclared = 1024;

[[noreturn]] void refuse(const std::string& text)
{
    throw Cim_Fault{cim_status::invalid_parameter, text};
}

CMPIType type_named(const std::string& name)
{
    constexpr CMPIType types[] = {CMPI_boolean, CMPI_uint8,  CMPI_sint8,  CMPI_uint16,   CMPI_sint16,
                                  CMPI_uint32,  CMPI_sint32, CMPI_uint64, CMPI_sint64,   CMPI_real32,
                                  CMPI_real64,  CMPI_char16, CMPI_string, CMPI_dateTime, CMPI_ref};
    for (const CMPIType type : types)
        if (same_name(type_name(type), name)) return type;
    return same_name(name, "reference") ? CMPI_ref : CMPI_string;
}

/// A char16: one character of the UTF-8 that the whole message has been found to be.
Value character(const std::string& text, const std::string& name)
{
    const auto byte = [&](std::size_t i) { return static_cast<unsigned char>(text[i]); };
    const std::size_t length = text.empty() ? 0 : byte(0) >= 0xF0 ? 4 : byte(0) >= 0xE0 ? 3 : byte(0) >= 0xC0 ? 2 : 1;
    if (length == 0 || length == 4 || text.size() != length) refuse(name + ": '" + text + "' is not one character");
    unsigned unit = length == 1 ? byte(0) : byte(0) & (0x7Fu >> length);
    for (std::size_t i = 1; i < length; ++i)
        unit = unit << 6 | (byte(i) & 0x3F);
    return Value::integer(CMPI_char16, unit);
}

/// What an element of a class that the schema does not know is taken for, by its own words.
Element_Record undeclared(const pugi::xml_node& node)
{
    Element_Record element;
    element.name = node.attribute("NAME").as_string();
    element.type = type_named(node.attribute("TYPE").as_string("string"));
    if (std::string(node.name()) == "PROPERTY.REFERENCE") element.type = CMPI_ref;
    if (std::string(node.name()) == "PROPERTY.ARRAY") element.type = static_cast<CMPIType>(element.type | CMPI_ARRAY);
    element.embedded = bool(node.attribute("EmbeddedObject"));
    return element;
}

} // namespace

std::string read_name_space(const pugi::xml_node& path)
{
    std::string text;
    for (const pugi::xml_node& part : path.children("NAMESPACE"))
        text += (text.empty() ? "" : "/") + std::string(part.attribute("NAME").as_string());
    return text;
}

Xml_Values Xml_Values::deeper() const
{
    if (m_depth >= deepest) refuse("references or instances within each other, too deep");
    return {m_schema, m_name_space, m_depth + 1};
}

Path Xml_Values::reference(const pugi::xml_node& value_reference) const
{
    pugi::xml_node node = first_element(value_reference);
    const std::string form = node.name();
    std::string name_space = m_name_space, host;
    if (form == "INSTANCEPATH" || form == "CLASSPATH") {
        const pugi::xml_node path = node.child("NAMESPACEPATH");
        host = text_of(path.child("HOST"));
        name_space = read_name_space(path.child("LOCALNAMESPACEPATH"));
    } else if (form == "LOCALINSTANCEPATH" || form == "LOCALCLASSPATH") {
        name_space = read_name_space(node.child("LOCALNAMESPACEPATH"));
    }
    if (form != "INSTANCENAME" && form != "CLASSNAME") {
        const pugi::xml_node name = node.child("INSTANCENAME");
        node = name ? name : node.child("CLASSNAME");
    }
    Path path;
    if (std::string(node.name()) == "INSTANCENAME")
        path = deeper().instance_name(node);
    else if (node)
        path.class_name = node.attribute("NAME").as_string();
    else
        refuse("a reference to nothing");
    path.host = host;
    path.name_space = name_space;
    return path;
}

Value Xml_Values::key(const pugi::xml_node& node, const std::string& name, const Class_Record* of_class) const
{
    const Element_Record* element = of_class ? of_class->property(name) : nullptr;
    if (const pugi::xml_node reference_node = node.child("VALUE.REFERENCE")) {
        if (element && element->type != CMPI_ref) refuse("the key " + name + " is no reference");
        return Value::reference(reference(reference_node));
    }
    const pugi::xml_node value = node.child("KEYVALUE");
    if (!value) refuse("the key " + name + " has no value");
    CMPIType type = CMPI_string;
    if (element)
        type = element->type;
    else if (same_name(value.attribute("VALUETYPE").as_string(), "boolean"))
        type = CMPI_boolean;
    else if (same_name(value.attribute("VALUETYPE").as_string(), "numeric"))
        type = CMPI_sint64;
    Value result;
    const std::string wrong = read_scalar(text_of(value), type, result);
    if (!wrong.empty()) refuse("the key " + name + ": " + wrong);
    return result;
}

Path Xml_Values::instance_name(const pugi::xml_node& node) const
{
    Path path;
    path.name_space = m_name_space;
    path.class_name = node.attribute("CLASSNAME").as_string();
    const Class_Record* of_class = m_schema.find(path.class_name);
    for (const pugi::xml_node& binding : node.children("KEYBINDING")) {
        const std::string name = binding.attribute("NAME").as_string();
        const Element_Record* element = of_class ? of_class->property(name) : nullptr;
        if (of_class && !(element && element->key)) refuse(of_class->name + " has no key " + name);
        if (path.find(name)) refuse("the key " + name + " is there twice");
        if (path.keys.size() >= most_keys) refuse("too many keys");
        path.set(name, key(binding, name, of_class));
    }
    // A single key may stand without its name.
    if (path.keys.empty() && of_class && (node.child("KEYVALUE") || node.child("VALUE.REFERENCE")))
        for (const Element_Record& property : of_class->properties)
            if (property.key) {
                path.set(property.name, key(node, property.name, of_class));
                break;
            }
    return path;
}

Value Xml_Values::scalar(const pugi::xml_node& node, const Element_Record& element) const
{
    const std::string text = text_of(node);
    const CMPIType type = static_cast<CMPIType>(element.type & ~CMPI_ARRAY);
    if (element.embedded) {
        pugi::xml_document document;
        if (const std::string wrong = read_xml(text, document); !wrong.empty()) refuse(element.name + ": " + wrong);
        if (!document.child("INSTANCE")) refuse(element.name + " holds no instance");
        return Value::instance(deeper().instance(document.child("INSTANCE")));
    }
    if (type == CMPI_char16) return character(text, element.name);
    Value value;
    const std::string wrong = read_scalar(text, type, value);
    if (!wrong.empty()) refuse(element.name + ": " + wrong);
    return value;
}

Value Xml_Values::value(const pugi::xml_node& parent, const Element_Record& element) const
{
    const CMPIType type = static_cast<CMPIType>(element.type & ~CMPI_ARRAY);
    const bool is_array = (element.type & CMPI_ARRAY) != 0;
    const pugi::xml_node array = parent.child(type == CMPI_ref ? "VALUE.REFARRAY" : "VALUE.ARRAY");
    if (bool(array) != is_array && (array || parent.child("VALUE")))
        refuse(element.name + (is_array ? " is an array" : " is no array"));
    if (is_array) {
        if (!array) return Value::null_of(element.type);
        std::vector<Value> elements;
        for (const pugi::xml_node& node : array.children()) {
            if (node.type() != pugi::node_element) continue;
            const std::string form = node.name();
            if (form == "VALUE.NULL")
                elements.push_back(Value::null_of(type));
            else if (form == "VALUE.REFERENCE" && type == CMPI_ref)
                elements.push_back(Value::reference(reference(node)));
            else if (form == "VALUE" && type != CMPI_ref)
                elements.push_back(scalar(node, element));
            else
                refuse(element.name + " holds " + form);
        }
        return Value::array(element.embedded ? CMPIType(CMPI_instance) : type, std::move(elements));
    }
    if (type == CMPI_ref) {
        const pugi::xml_node node = parent.child("VALUE.REFERENCE");
        return node ? Value::reference(reference(node)) : Value::null_of(CMPI_ref);
    }
    const pugi::xml_node node = parent.child("VALUE");
    return node ? scalar(node, element) : Value::null_of(element.type);
}

Instance Xml_Values::instance(const pugi::xml_node& node) const
{
    Instance result;
    result.path.name_space = m_name_space;
    result.path.class_name = node.attribute("CLASSNAME").as_string();
    const Class_Record* of_class = m_schema.find(result.path.class_name);
    for (const pugi::xml_node& child : node.children()) {
        const std::string form = child.name();
        if (form.rfind("PROPERTY", 0) != 0) continue;
        const std::string name = child.attribute("NAME").as_string();
        const Element_Record* declared = of_class ? of_class->property(name) : nullptr;
        if (of_class && !declared) refuse(of_class->name + " has no property " + name);
        if (result.find(name)) refuse("the property " + name + " is there twice");
        if (result.properties.size() >= most_undeclared) refuse("too many properties");
        const Element_Record element = declared ? *declared : undeclared(child);
        result.set(element.name, value(child, element));
        if (element.key && !result.get(element.name).is_null()) result.path.set(element.name, result.get(element.name));
    }
    return result;
}

Instance Xml_Values::named_instance(const pugi::xml_node& node) const
{
    Instance result = instance(node.child("INSTANCE"));
    const Path named = instance_name(node.child("INSTANCENAME"));
    if (!same_name(named.class_name, result.path.class_name)) refuse("an instance of another class than its name's");
    result.path = named;
    return result;
}

} // namespace host
