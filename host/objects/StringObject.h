/// CMPIString of the broker: UTF-8 text, or, as one server has it for an unknown user, null characters.
#pragma once

#include "host/objects/Object.h"

#include <optional>
#include <string>

namespace host {

struct Manner;

class String_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::string;
    static CMPIStringFT table(const Manner& manner);

    String_Object(Broker& owner, Origin from, std::optional<std::string> characters);
    std::string to_text() const override { return text.value_or(""); }

    CMPIString face;
    std::optional<std::string> text;
};

} // namespace host
