/// CMPISelectExp of the broker: the text of an indication filter. It accepts every instance: a filter is chosen by
/// class and namespace here, and no module of this system looks further.
#pragma once

#include "host/objects/Object.h"

#include <string>

namespace host {

struct Manner;

class Select_Exp_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::select_exp;
    static CMPISelectExpFT table(const Manner& manner);

    Select_Exp_Object(Broker& owner, Origin from, std::string query, std::string language);
    std::string to_text() const override { return query; }

    CMPISelectExp face;
    std::string query;
    std::string language;
};

} // namespace host
