/// Finds the providers that a request is for, calls them on threads of the manner's, and puts their answers together.
///
/// Thread-safe; as many requests at once as threads come.
#pragma once

#include "host/Modules.h"
#include "host/Request.h"
#include "host/StaticInstances.h"

#include <vector>

namespace host {

class Dispatcher final : public Request_Runner {
public:
    Dispatcher(Broker& broker, Modules& modules, Workers& workers);

    Answer run(const Request& request) override;
    Static_Instances& statics() { return m_statics; }

private:
    /// A provider to be asked, and with what class.
    struct Target {
        Served_Class served;
        std::string class_name;
    };

    Answer enumerate(const Request& request);
    Answer one_instance(const Request& request, Mi kind);
    Answer traverse(const Request& request);
    Answer set_property(const Request& request);
    Answer get_property(const Request& request);
    Answer ask(const Request& request, const std::vector<Target>& targets, Mi kind);
    void ask_one(const Request& request, const Target& target, Mi kind, Answer& answer);

    bool knows(const std::string& name_space) const;
    const Served_Class* find(const std::vector<Served_Class>& all, const std::string& class_name) const;

    Broker& m_broker;
    Modules& m_modules;
    Workers& m_workers;
    Static_Instances m_statics;
};

/// Calls the function of the MI that stands for the request's operation; on the thread of the call, inside its scope.
/// `mi` is of the kind that the operation belongs to. `class_name` is the class that the provider is asked for.
Status call_mi(Broker& broker, const Request& request, Mi kind, void* mi, const std::string& class_name,
               Answer& answer);

} // namespace host
