/// What clients ask of the module: one request after the other, each of a random kind.
///
/// Any thread, with its own numbers. Nobody stops or restarts the host's server meanwhile.
#pragma once

#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "host/Host.h"
#include "tests/module/support/Rig.h"
#include "tests/soak/Counts.h"
#include "tests/soak/Random.h"
#include "tests/soak/Season.h"
#include "tests/support/Watch.h"

namespace soak {

class Load {
public:
    /// Where clients put the files that they name; the program stands in it.
    static constexpr char folder[] = "/var/log/soak";

    /// Asks each method once, without arguments, whether it is served. Who changes the season sees to it that no
    /// thread acts meanwhile.
    Load(nvrtest::Rig& rig, nvrtest::Watch& watch, Counts& counts, const Season& season);

    /// One act of a client: one request, or as many as it takes to come by the path of another.
    void act(Random& random);
    /// Ends all subscriptions, when no other thread acts.
    void unsubscribe_all();
    /// Subscribes, has an event come, and unsubscribes.
    void meet_alert();
    /// Brings all settings back to their defaults, but that each refresh reads the adapters if the season's does.
    /// False where one is not published.
    bool restore_settings();
    /// Calls a service that has the adapters read anew, whatever the settings say; true if it did.
    bool have_adapters_read();
    /// Writes the files that clients name, and removes all others.
    void restore_files();
    /// The paths of all instances, in order.
    std::string all_names();

private:
    struct Class {
        std::string name;
        unsigned kinds;
    };
    struct Method {
        std::string class_name;
        const host::Method_Record* record;
        bool is_change; ///< has the adapters read anew, or leaves what stays until then
    };
    using Arguments = std::vector<host::Named_Value>;

    /// Counts, and watches that an answer comes.
    template <class Request>
    host::Answer ask(const std::string& what, Request request);

    void read(Random& random);
    void get(Random& random);
    void traverse(Random& random);
    void modify(Random& random);
    void call(Random& random);
    bool set(const char* name, std::uint32_t value);
    void subscribe(Random& random);
    void unsubscribe();
    void reach_too_far(Random& random);

    /// A path of the class, or one of nobody.
    host::Path path_of(const std::string& class_name, Random& random);
    host::Value argument(const host::Element_Record& parameter, const host::Path& target, Random& random);
    host::Value plain_value(CMPIType type, Random& random);

    nvrtest::Rig& m_rig;
    nvrtest::Watch& m_watch;
    Counts& m_counts;
    const Season& m_season;
    std::vector<Class> m_classes, m_associations;
    std::vector<Method> m_methods;
    std::mutex m_mutex;
    std::vector<int> m_subscriptions;
};

} // namespace soak
