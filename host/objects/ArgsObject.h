/// CMPIArgs of the broker: named values, in the order they were added.
#pragma once

#include "host/objects/Object.h"

#include <vector>

namespace host {

struct Manner;

class Args_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::args;
    static CMPIArgsFT table(const Manner& manner);

    Args_Object(Broker& owner, Origin from, std::vector<Named_Value> content);
    std::string to_text() const override;

    CMPIArgs face;
    std::vector<Named_Value> values;
};

} // namespace host
