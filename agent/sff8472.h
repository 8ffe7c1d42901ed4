/// What the memory of an optical module tells: its makers' names, and where it can measure, what it measures now.
///
/// Decoded from pages A0 and A2 by SFF-8472. Pure functions of those bytes: any content is safe.
#pragma once

#include <optional>
#include <string>

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

/// The analogue values, calibrated. One that is no finite number is missing.
struct Sff_Diagnostics {
    std::optional<real32> temperature;   ///< degrees Celsius
    std::optional<real32> vcc;           ///< volts
    std::optional<real32> txBiasCurrent; ///< milliamperes
    std::optional<real32> txPower;       ///< milliwatts
    std::optional<real32> rxPower;       ///< milliwatts
};

struct Sff_Module {
    uint8 identifier = 0;
    uint8 extIdentifier = 0;
    uint8 connector = 0;
    // Texts: the field up to its first zero byte; the blanks that fill it are kept.
    std::string vendorName;
    std::string vendorPN;
    std::string vendorRev;
    std::string vendorSN;
    std::string dateCode;
    uint8 oui[3] = {};
    uint16 wavelength = 0;       ///< nanometres
    Sff_Diagnostics diagnostics; ///< all missing for a module without digital diagnostics
};

/// `size`: how many bytes of `data` the library says it wrote; page A2 is looked at only if it was written whole.
Sff_Module decode_sff(const RM_SFFDATA& data, uint32 size);

/// The CIM form of a date code, "yymmdd" with a lot's code behind it, in this century; empty for one whose first six
/// characters are not digits.
std::string sff_date(const std::string& dateCode);

} // namespace cimple
