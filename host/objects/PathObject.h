/// CMPIObjectPath of the broker: a Path, with null for a host name that was never set.
#pragma once

#include "host/objects/Object.h"

namespace host {

struct Manner;

class Path_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::path;
    static CMPIObjectPathFT table(const Manner& manner);

    Path_Object(Broker& owner, Origin from, Path path);
    std::string to_text() const override { return data.to_text(); }

    CMPIObjectPath face;
    Path data;
};

} // namespace host
