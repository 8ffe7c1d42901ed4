/// CMPIError of the broker: the texts and numbers of a CIM_Error, where the manner has them.
#pragma once

#include "host/objects/Object.h"

#include <string>
#include <vector>

namespace host {

struct Manner;

class Error_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::error;
    static CMPIErrorFT table(const Manner& manner);

    Error_Object(Broker& owner, Origin from);
    std::string to_text() const override { return message; }

    CMPIError face;
    int type = 0, severity = 0, probable_cause = 0, source_format = 0, status_code = CMPI_RC_ERR_FAILED;
    std::string other_type, owning_entity, message_id, message, probable_cause_description, source, other_source_format,
        status_description;
    std::vector<Value> recommended_actions, message_arguments;
};

} // namespace host
