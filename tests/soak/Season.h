/// What happens between two looks at the process.
#pragma once

namespace soak {

struct Season {
    const char* name;
    /// Libraries fail, and adapters go and come.
    bool has_faults;
    /// A client has switched on that a cache that grew old has the adapters read anew. Without it, what such a reading
    /// fails to get would stay lost: the settings' own instances too.
    bool reads_adapters;
    /// Clients call the services that have the adapters read anew, and those that leave what stays until then.
    bool has_changes;
    /// The module is unloaded and loaded, and clients set each setting to what they like.
    bool has_unloads;
};

/// What a short run sees most of.
constexpr Season all_at_once = {"", true, true, true, true};

/// One life of the module has these. First the adapters are now and then read anew, as the settings say or because a
/// service asks for it ...
constexpr Season failing_changes = {"changes, faults", true, true, true, false};
constexpr Season changes = {"changes", false, false, true, false};
/// ... then they never are, as on most hosts for weeks: what only a reading would take away has to show.
constexpr Season undisturbed = {"undisturbed", true, false, false, false};

} // namespace soak
