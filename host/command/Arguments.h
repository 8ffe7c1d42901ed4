/// Values as a user types them, read by the type that the class declares.
///
///     Number=5  Number=0x1F  Loud=true  Name=any text  Name="quoted, with \" inside"  When=20240101000000.000000+000
///     State=OK (a word of the class)  Ids=[1,2,3]  Names=[a,"b,c"]  Target=NVRHBA_FCPort.DeviceID="..."  Gone=NULL
///
/// Pure functions; any thread.
#pragma once

#include "host/Schema.h"
#include "host/Value.h"

#include <string>

namespace host {

struct Argument_Parse {
    bool ok = false;
    Named_Value argument;
    std::string error; ///< what is wrong with it, naming the argument
};

/// Splits "name=value"; false if there is no name or no '='.
bool split_argument(const std::string& text, std::string& name, std::string& value);

/// Reads a value for a property or parameter. References without a namespace get `name_space`.
Argument_Parse parse_argument(const Element_Record& element, const std::string& text, const Schema& schema,
                              const std::string& name_space);

} // namespace host
