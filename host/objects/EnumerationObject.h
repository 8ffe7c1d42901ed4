/// CMPIEnumeration of the broker: the results of an up-call, made into objects one by one as they are taken.
#pragma once

#include "host/objects/Object.h"

#include <vector>

namespace host {

struct Manner;

class Enumeration_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::enumeration;
    static CMPIEnumerationFT table(const Manner& manner);

    /// `type` is that of every element: CMPI_instance or CMPI_ref.
    Enumeration_Object(Broker& owner, Origin from, CMPIType type, std::vector<Value> content);
    std::string to_text() const override;

    CMPIEnumeration face;
    CMPIType element_type;
    std::vector<Value> elements;
    std::size_t position = 0;
};

} // namespace host
