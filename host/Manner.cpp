#include "host/Manner.h"

#include <strings.h>

namespace host {
namespace {

constexpr Manner make_sfcb()
{
    Manner m{};
    m.name = "sfcb";
    m.resolve_now = true;
    m.factories_by_class = true;
    m.cleanup = Manner::Cleanup::newest_of_each_kind;
    m.idle_heeds_filters = false;
    m.disable_before_stop = true;
    m.pooled_threads = false;
    m.parallel_subclasses = false;
    m.broker_version = 0;
    m.broker_name = "RequestHandler";
    m.capabilities = 0x1bf;
    m.encapsulation_version = 1;
    m.messages_absent = true;
    m.thread_ends_absent = true;
    m.memory = Manner::Mft::mark_and_release;
    m.object_version = 1;
    m.origin_and_error_absent = true;
    m.property_qualifier_absent = false;
    m.result_life_absent = false;
    m.wait_timed_out = 110;
    m.principal_has_null_chars = true;
    m.factory_context_filled = true;
    m.language_entries = false;
    m.session_entry = true;
    m.types_must_match = false;
    m.unknown_property_kept = true;
    m.filter_at_set = true;
    m.array_takes_chars = true;
    m.string_of_null = true;
    m.not_found_state = 0x400;
    m.key_state = 0;
    m.association_class_filled = false;
    m.host_name_in_paths = false;
    m.nobody_subscribed = 0;
    m.asks_before_activation = true;
    m.enables_each_time = true;
    m.activation_flags_always = false;
    m.disable = Manner::Disable::never;
    return m;
}

constexpr Manner make_sfcb_1_3_7()
{
    Manner m = make_sfcb();
    m.name = "sfcb-1.3.7";
    m.memory = Manner::Mft::absent;
    m.property_qualifier_absent = true;
    m.disable = Manner::Disable::before_deactivate_with_empty_type;
    return m;
}

constexpr Manner make_pegasus()
{
    Manner m{};
    m.name = "pegasus";
    m.resolve_now = false;
    m.factories_by_class = false;
    m.cleanup = Manner::Cleanup::every_mi;
    m.idle_heeds_filters = true;
    m.disable_before_stop = false;
    m.pooled_threads = true;
    m.parallel_subclasses = true;
    m.broker_version = 200;
    m.broker_name = "Pegasus";
    m.capabilities = 0x81ff;
    m.encapsulation_version = 200;
    m.messages_absent = false;
    m.thread_ends_absent = false;
    m.memory = Manner::Mft::absent;
    m.object_version = 200;
    m.origin_and_error_absent = false;
    m.property_qualifier_absent = true;
    m.result_life_absent = true;
    m.wait_timed_out = 0;
    m.principal_has_null_chars = false;
    m.factory_context_filled = false;
    m.language_entries = true;
    m.session_entry = false;
    m.types_must_match = true;
    m.unknown_property_kept = false;
    m.filter_at_set = false;
    m.array_takes_chars = false;
    m.string_of_null = false;
    m.not_found_state = 0x500;
    m.key_state = 0x200;
    m.association_class_filled = true;
    m.host_name_in_paths = true;
    m.nobody_subscribed = 1;
    m.asks_before_activation = false;
    m.enables_each_time = false;
    m.activation_flags_always = true;
    m.disable = Manner::Disable::after_last_deactivate;
    return m;
}

/// Every row that the servers disagree on is decided against the module: what one of them leaves out is left out,
/// what one of them refuses is refused, what can run at once does.
constexpr Manner make_strict()
{
    Manner m = make_pegasus();
    m.name = "strict";
    m.resolve_now = true;
    m.factories_by_class = true;
    m.idle_heeds_filters = false;
    m.pooled_threads = false;
    m.broker_version = 0;
    m.broker_name = "Norvane strict broker";
    m.capabilities = 0x1bf & 0x81ff;
    m.encapsulation_version = 1;
    m.messages_absent = true;
    m.thread_ends_absent = true;
    m.object_version = 1;
    m.origin_and_error_absent = true;
    m.wait_timed_out = 110;
    m.principal_has_null_chars = true;
    m.language_entries = false;
    m.filter_at_set = true;
    m.association_class_filled = false;
    m.host_name_in_paths = false;
    m.asks_before_activation = true;
    m.enables_each_time = true;
    m.activation_flags_always = false;
    return m;
}

constexpr Manner strict_manner = make_strict();
constexpr Manner sfcb_manner = make_sfcb();
constexpr Manner sfcb_1_3_7_manner = make_sfcb_1_3_7();
constexpr Manner pegasus_manner = make_pegasus();

} // namespace

const Manner& Manner::strict()
{
    return strict_manner;
}
const Manner& Manner::sfcb()
{
    return sfcb_manner;
}
const Manner& Manner::sfcb_1_3_7()
{
    return sfcb_1_3_7_manner;
}
const Manner& Manner::pegasus()
{
    return pegasus_manner;
}

const std::vector<const Manner*>& Manner::all()
{
    static const auto& manners =
        *new std::vector<const Manner*>{&strict_manner, &sfcb_manner, &sfcb_1_3_7_manner, &pegasus_manner};
    return manners;
}

const Manner* Manner::find(const std::string& name)
{
    for (const Manner* manner : all())
        if (strcasecmp(manner->name, name.c_str()) == 0) return manner;
    return nullptr;
}

} // namespace host
