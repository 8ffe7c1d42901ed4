/// Every method of every service, with arguments with which it is done, and the host on which that is so.
#pragma once

#include <string>
#include <vector>

#include "tests/module/support/Service.h"

namespace nvrtest {

struct Service_Method {
    const char* service;
    const char* name;
    /// All but the Target, so that a call is done.
    Arguments others;
    /// The return values without a Target, for one of another class, for one that is no port of the host, and for a
    /// port that is not local.
    unsigned no_target, no_port, unknown, not_local;
    /// A refresh is asked for when it is done.
    bool refreshes;
    /// What it does in the end.
    const char* library_call;
};

/// In the order of the services; a name that one call changes is restored by the next.
std::vector<Service_Method> service_methods();

/// Where the dumps of the host's first adapter go.
constexpr char dump_folder[] = "/var/log/dumps";

/// The first adapter of a scenario with a port that all methods can be called on: with a tag, and dumps of its own.
constexpr char serving_adapter[] =
    "[[adapter]]\n[[adapter.port]]\ndump_directory = \"/var/log/dumps\"\n[[adapter.tag]]\n"
    "source = \"10000000C9A00001\"\ntarget = \"50060E8005A10000\"\ntag = 5\n";

/// Makes the files that the methods read and the folders that they write to, and stands in the firmware's.
void prepare_service_files();

} // namespace nvrtest
