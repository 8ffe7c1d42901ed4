/// What the module hands to the system log: openlog, syslog and closelog are replaced in test programs.
#pragma once

#include <string>
#include <vector>

namespace nvrtest {

struct Syslog_Spy {
    struct Entry {
        int priority;
        std::string format; ///< as given
        std::string text;   ///< as it would be written
    };
    std::vector<Entry> entries;
    const char* ident = nullptr;
    int option = 0;
    int facility = 0;
    int opened = 0;
    int closed = 0;
};

/// The process's one.
Syslog_Spy& syslog_spy();

} // namespace nvrtest
