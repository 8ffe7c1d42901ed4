/// How a CIM server treats a provider module, as a table of rules: the broker has no behaviour of a server's own, it
/// only looks here.
///
/// Four manners are known. `strict` takes the hardest choice of all in each row and is the default; `sfcb` and
/// `sfcb-1.3.7` behave like that server's versions 1.3.18 and 1.3.7, `pegasus` like OpenPegasus 2.14.4.
/// Constant data; any thread.
#pragma once

#include <string>
#include <vector>

namespace host {

struct Manner {
    enum class Mft { absent, mark_and_release };
    enum class Cleanup { every_mi, newest_of_each_kind };
    enum class Disable { before_deactivate_with_empty_type, never, after_last_deactivate };

    const char* name;

    // Life of a module.
    bool resolve_now;         ///< dlopen binds every symbol at once, else lazily
    bool factories_by_class;  ///< all factories of a class at its first request; else one by one, per provider name
    Cleanup cleanup;          ///< which MIs a clean-up is asked of
    bool idle_heeds_filters;  ///< a provider with subscriptions is not unloaded as idle
    bool disable_before_stop; ///< disableIndications comes before a terminating clean-up
    bool pooled_threads;      ///< requests share threads, else each has a new one
    bool parallel_subclasses; ///< a request that several providers answer asks them at once, else in turn

    // Function tables.
    unsigned broker_version;
    const char* broker_name;
    unsigned capabilities;
    int encapsulation_version;
    bool messages_absent;    ///< eft: newCMPIError, openMessageFile, closeMessageFile, getMessage2 are null
    bool thread_ends_absent; ///< xft: joinThread, exitThread, cancelThread, threadSleep, signalCondition are null
    Mft memory;
    int object_version;
    bool origin_and_error_absent; ///< setPropertyWithOrigin and returnError are null
    bool property_qualifier_absent;
    bool result_life_absent; ///< release and clone of results, clone of contexts are null
    int wait_timed_out;      ///< what a timed wait of xft that ran out answers

    // Contexts.
    bool principal_has_null_chars; ///< a request's principal is a string whose characters are null, else ""
    bool factory_context_filled;   ///< flags 0 and principal "$$" at the factory, else no entry
    bool language_entries;         ///< CMPIInitNameSpace, CMPIRole, CMPIAcceptLanguage
    bool session_entry;            ///< CMPISessionId

    // Values.
    bool types_must_match;      ///< 61 for a property's value of another type than its class says
    bool unknown_property_kept; ///< an unknown property appears in the instance, else it is dropped; 0 both times
    bool filter_at_set;         ///< what the property filter leaves out is dropped when set, else when returned
    bool array_takes_chars;     ///< a string array's element may be given as chars, else 13
    bool string_of_null;        ///< newString(null) gives an object, else null and 4
    unsigned short not_found_state;
    unsigned short key_state;      ///< state of a key that was got by its name
    bool association_class_filled; ///< associators without an association class see the registered one
    bool host_name_in_paths;
    int nobody_subscribed; ///< deliverIndication without a subscription

    // Indications.
    bool asks_before_activation;  ///< authorizeFilter and mustPoll are called, and enabling runs on another thread
    bool enables_each_time;       ///< enableIndications comes with every subscription, else with a provider's first
    bool activation_flags_always; ///< first and last activation are always 1
    Disable disable;

    /// The manner of that name (no case), or null.
    static const Manner* find(const std::string& name);
    static const Manner& strict();
    static const Manner& sfcb();
    static const Manner& sfcb_1_3_7();
    static const Manner& pegasus();
    /// All of them, in the order above.
    static const std::vector<const Manner*>& all();
};

} // namespace host
