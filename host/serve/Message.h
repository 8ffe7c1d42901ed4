/// A CIM-XML request (DMTF DSP0201) as it came over HTTP: one simple request, its XML checked and kept, its parameters
/// read on demand by the types that the schema declares.
///
/// Any bytes may be given. What cannot be understood ends in one of two exceptions: Http_Fault where HTTP tells it
/// (DSP0200), Cim_Fault where a CIM status does. Depth and size of what is read are bounded.
#pragma once

#include "host/Host.h"

#include <pugixml.hpp>

#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace host {

/// A request that gets no CIM-XML answer.
struct Http_Fault {
    unsigned status = 400;
    std::string cim_error; ///< value of the CIMError header ("request-not-well-formed"); "" for none
    std::string text;
};

/// Status codes of DSP0200.
namespace cim_status {
constexpr int failed = 1, invalid_name_space = 3, invalid_parameter = 4, invalid_class = 5, not_found = 6,
              not_supported = 7, already_exists = 11, no_such_property = 12, unknown_language = 14,
              method_not_found = 17;
}

/// A request that gets an ERROR element.
struct Cim_Fault {
    int code = 1;
    std::string text;
};

class Message {
public:
    /// Reads the body of a request, which came to the server of this name. Throws Http_Fault.
    Message(std::string_view body, const Schema& schema, std::string server = "");

    const std::string& server() const { return m_server; }

    const std::string& id() const { return m_id; }
    /// The operation is one of CIM's own; otherwise it is a method of a class.
    bool is_intrinsic() const { return m_intrinsic; }
    const std::string& method() const { return m_method; }
    const std::string& name_space() const { return m_name_space; }

    // Parameters of an intrinsic operation. A missing one gives the default; one of the wrong form throws Cim_Fault.

    bool has(const char* name) const;
    /// Throws Cim_Fault if there is one that the operation does not know, or one twice.
    void check_parameters(const std::vector<std::string>& known) const;
    std::string text(const char* name) const;
    bool flag(const char* name, bool otherwise) const;
    /// A class's name.
    std::string class_name(const char* name) const;
    /// An instance's name, with the types that its class declares.
    Path instance_name(const char* name) const;
    /// An instance's name or a class's, which has no keys.
    Path object_name(const char* name) const;
    Property_List property_list() const;
    /// An instance, named or not.
    Instance instance(const char* name) const;
    /// A value for a property of a class.
    Value value(const char* name, const Element_Record& element) const;

    // What a method call has.

    /// The object that the method is invoked on.
    Path target() const;
    /// The arguments, with the types that the method declares; unknown ones throw Cim_Fault.
    std::vector<Named_Value> arguments(const Method_Record& method) const;

private:
    pugi::xml_node parameter(const char* name) const;

    const Schema& m_schema;
    std::unique_ptr<pugi::xml_document> m_document;
    pugi::xml_node m_call;
    bool m_intrinsic = false;
    std::string m_server, m_id, m_method, m_name_space;
};

} // namespace host
