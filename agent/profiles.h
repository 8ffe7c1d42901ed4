/// The profiles that the module implements: the rows behind NVRHBA_RegisteredProfile.
#pragma once

#include <array>

#include "runtime/Instance.h"

namespace cimple {

struct NVRHBA_RegisteredProfile;

struct Profile_Row {
    const char* name;
    uint16 organization; // 2 DMTF, 11 SNIA
    const char* version;
};

/// In the order of their enumeration.
constexpr std::array<Profile_Row, 13> profile_rows = {{
    {"Profile Registration", 2, "1.0.0"},
    {"Software Inventory", 2, "1.0.0"},
    {"Physical Package", 11, "1.3.0"},
    {"Host Discovered Resources", 11, "1.2.0"},
    {"FC HBA", 11, "1.2.0"},
    {"Storage HBA", 11, "1.4.0"},
    {"FC Initiator Ports", 11, "1.3.0"},
    {"Software Update", 2, "1.0.0"},
    {"Record Log", 2, "1.0.1"},
    {"Software", 11, "1.2.0"},
    {"Access Points", 11, "1.3.0"},
    {"PCI Device", 2, "1.0.0"},
    {"FCHBA Diagnostics", 2, "1.0.0"},
}};

/// A new instance of a profile, in the interop namespace.
Ref<NVRHBA_RegisteredProfile> makeRegisteredProfile(const Profile_Row& row);

} // namespace cimple
