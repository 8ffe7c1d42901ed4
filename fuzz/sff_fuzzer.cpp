// The memory pages of an optical module.
#include <cmath>

#include "agent/sff8472.h"
#include "fuzz/fuzzing.h"
#include "runtime/Datetime.h"

using namespace cimple;
using fuzzing::expect;

static void expect_finite(const std::optional<real32>& value)
{
    expect(!value || std::isfinite(*value), "a reading is a number or missing");
}

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    fuzzing::Bytes bytes(data, size);
    const uint32 written = bytes.word();
    RM_SFFDATA pages = {};
    bytes.fill(&pages, sizeof pages);
    const Sff_Module module = decode_sff(pages, written);
    expect(module.vendorName.size() <= 16 && module.vendorSN.size() <= 16, "texts keep to their fields");
    expect_finite(module.diagnostics.temperature);
    expect_finite(module.diagnostics.vcc);
    expect_finite(module.diagnostics.txBiasCurrent);
    expect_finite(module.diagnostics.txPower);
    expect_finite(module.diagnostics.rxPower);
    const std::string date = sff_date(module.dateCode);
    Datetime made;
    made.set(date.c_str());
    return 0;
}
