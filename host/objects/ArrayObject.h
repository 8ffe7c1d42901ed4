/// CMPIArray of the broker: a fixed number of elements of one type, null until they are set.
#pragma once

#include "host/objects/Object.h"

#include <vector>

namespace host {

struct Manner;

class Array_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::array;
    static CMPIArrayFT table(const Manner& manner);

    Array_Object(Broker& owner, Origin from, CMPIType element, std::vector<Value> values);
    std::string to_text() const override { return Value::array(element_type, elements).to_text(); }

    CMPIArray face;
    CMPIType element_type;
    std::vector<Value> elements;
};

} // namespace host
