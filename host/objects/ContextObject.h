/// CMPIContext of the broker: the entries of a request, of a factory call, or of a thread to be attached.
#pragma once

#include "host/objects/Object.h"

#include <vector>

namespace host {

struct Manner;

class Context_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::context;
    static CMPIContextFT table(const Manner& manner);

    struct Entry {
        std::string name;
        Value value;
        bool null_characters = false; ///< a string object without characters, as one server has it
    };

    Context_Object(Broker& owner, Origin from, std::vector<Entry> content);
    std::string to_text() const override;
    const Entry* find(const char* name) const;

    CMPIContext face;
    std::vector<Entry> entries;
    bool prepared = false; ///< made by prepareAttachThread
};

} // namespace host
