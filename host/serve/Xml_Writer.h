/// CIM objects as CIM-XML (DMTF DSP0201). Everything appends to a text; nothing is read back. Pure functions.
#pragma once

#include "host/Host.h"
#include "host/Schema.h"
#include "host/Value.h"

#include <string>

namespace host {

/// `text` with the five characters escaped that XML reserves; what no XML can carry becomes "?".
void write_text(std::string& out, const std::string& text);
/// ` NAME="value"`
void write_attribute(std::string& out, const char* name, const std::string& value);

/// "string", "uint32", "reference": a type as attributes have it, also of an array's elements.
std::string xml_type(CMPIType type);

/// INSTANCENAME
void write_instance_name(std::string& out, const Path& path);
/// INSTANCEPATH; `host` stands for a path that names none.
void write_instance_path(std::string& out, const Path& path, const std::string& host);
/// LOCALNAMESPACEPATH
void write_name_space(std::string& out, const std::string& name_space);

/// How instances and classes are written, as a client asks.
struct Write_Options {
    bool qualifiers = false;
    bool class_origin = false;
    bool local_only = false; ///< of classes: what the class itself declares
    Property_List properties;
};

/// INSTANCE
void write_instance(std::string& out, const Instance& instance, const Schema& schema, const Write_Options& options);
/// CLASS
void write_class(std::string& out, const Class_Record& record, const Schema& schema, const Write_Options& options);

/// VALUE, VALUE.ARRAY, VALUE.REFERENCE or VALUE.REFARRAY; nothing for null.
void write_value(std::string& out, const Value& value, const Schema& schema);
/// PARAMVALUE of an out parameter.
void write_out_parameter(std::string& out, const Named_Value& parameter, const Schema& schema);

} // namespace host
