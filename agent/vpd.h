/// The vital product data of a port, as pairs of tag and text.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

/// A two-letter tag, or vpd_product_name's two bytes, and its value.
using Vpd_Entry = std::pair<std::string, std::string>;

constexpr char vpd_product_name[] = {static_cast<char>(RM_VPD_TAG_PRODUCT_NAME),
                                     static_cast<char>(RM_VPD_TAG_PRODUCT_NAME), '\0'};

/// Reads the entries of a port in their order. Result the library's status; on failure there are none. The library's
/// walk is bounded: it ends when it has run its length or stops to advance.
uint32 readVPD(const HBA_WWN& wwn, std::vector<Vpd_Entry>& entries);

} // namespace cimple
