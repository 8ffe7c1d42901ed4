/// CIM values in CIM-XML (DMTF DSP0201), read by the types that the schema declares. Throws Cim_Fault with status 4 for
/// what does not fit; nesting is bounded.
#pragma once

#include "host/Schema.h"
#include "host/Value.h"

#include <pugixml.hpp>

#include <string>

namespace host {

/// "root/norvane" of a LOCALNAMESPACEPATH.
std::string read_name_space(const pugi::xml_node& path);

class Xml_Values {
public:
    /// Names without a namespace of their own are in `name_space`.
    Xml_Values(const Schema& schema, std::string name_space, int depth = 0)
        : m_schema(schema), m_name_space(std::move(name_space)), m_depth(depth)
    {
    }

    /// INSTANCENAME.
    Path instance_name(const pugi::xml_node& node) const;
    /// INSTANCE, with a path that has the keys among its properties.
    Instance instance(const pugi::xml_node& node) const;
    /// VALUE.NAMEDINSTANCE.
    Instance named_instance(const pugi::xml_node& node) const;
    /// What stands inside PROPERTY, PROPERTY.ARRAY, PROPERTY.REFERENCE, PARAMVALUE or IPARAMVALUE; null where nothing
    /// does.
    Value value(const pugi::xml_node& parent, const Element_Record& element) const;

private:
    Path reference(const pugi::xml_node& value_reference) const;
    Value scalar(const pugi::xml_node& value, const Element_Record& element) const;
    Value key(const pugi::xml_node& binding, const std::string& name, const Class_Record* of_class) const;
    Xml_Values deeper() const;

    const Schema& m_schema;
    std::string m_name_space;
    int m_depth;
};

} // namespace host
