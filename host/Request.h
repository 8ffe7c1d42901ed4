/// One operation on the server, from a client or from a provider's up-call: plain data.
#pragma once

#include "host/Host.h"
#include "host/Value.h"

#include <string>
#include <vector>

namespace host {

struct Request {
    enum class Operation {
        enumerate,
        names,
        get,
        create,
        modify,
        remove,
        exec_query,
        set_property,
        get_property,
        call,
        associators,
        associator_names,
        references,
        reference_names
    };

    Operation operation = Operation::enumerate;
    Path path; ///< class path or instance path; of the instance for create and modify
    Instance instance;
    Property_List properties;
    std::string name; ///< of a property or a method
    Value value;
    std::vector<Named_Value> arguments;
    std::string query, language;
    std::string association_class, result_class, role, result_role;
    std::string principal;
    const Result_Sink* sink = nullptr; ///< null: results stay in the answer
    bool up_call = false;              ///< from a module, which may be in the middle of its own clean-up
};

/// "enumerateInstances" and so on, as the function tables have it.
const char* operation_name(Request::Operation operation);

/// Whoever answers requests; the broker's up-calls go there.
class Request_Runner {
public:
    virtual ~Request_Runner() = default;
    /// Runs on threads of the manner's choice; the caller waits.
    virtual Answer run(const Request& request) = 0;
};

} // namespace host
