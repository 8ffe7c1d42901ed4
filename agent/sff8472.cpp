#include "agent/sff8472.h"

#include <cfloat>
#include <cmath>
#include <cstdio>
#include <cstring>

namespace cimple {

namespace {

// Page A0.
constexpr unsigned at_identifier = 0;
constexpr unsigned at_ext_identifier = 1;
constexpr unsigned at_connector = 2;
constexpr unsigned at_vendor_name = 20; // 16 bytes
constexpr unsigned at_oui = 37;
constexpr unsigned at_vendor_pn = 40;  // 16 bytes
constexpr unsigned at_vendor_rev = 56; // 4 bytes
constexpr unsigned at_wavelength = 60;
constexpr unsigned at_vendor_sn = 68; // 16 bytes
constexpr unsigned at_date_code = 84; // 8 bytes
constexpr unsigned at_monitoring = 92;
constexpr uint8 monitoring_implemented = 0x40;
constexpr uint8 calibrated_internally = 0x20;
constexpr uint8 calibrated_externally = 0x10;

// Page A2: constants of calibration, and the readings.
constexpr unsigned at_rx_power_terms = 56; // five floats, from the fourth power down
constexpr unsigned at_tx_bias_line = 76;   // a line: slope, offset
constexpr unsigned at_tx_power_line = 80;
constexpr unsigned at_temperature_line = 84;
constexpr unsigned at_vcc_line = 88;
constexpr unsigned at_temperature = 96;
constexpr unsigned at_vcc = 98;
constexpr unsigned at_tx_bias = 100;
constexpr unsigned at_tx_power = 102;
constexpr unsigned at_rx_power = 104;

// What one step of a reading is worth.
constexpr double degrees_per_step = 1.0 / 256;
constexpr double volts_per_step = 1.0 / 10000;
constexpr double milliamperes_per_step = 1.0 / 500;
constexpr double milliwatts_per_step = 1.0 / 10000;

/// The numbers of a page: the module's byte order is big-endian.
class Page {
public:
    explicit Page(const uint8 (&bytes)[256]) : m_bytes(bytes) {}

    uint8 byte(unsigned at) const { return m_bytes[at]; }
    uint16 word(unsigned at) const { return static_cast<uint16>(m_bytes[at] << 8 | m_bytes[at + 1]); }
    sint16 signed_word(unsigned at) const { return static_cast<sint16>(word(at)); }
    double real(unsigned at) const
    {
        const uint32 bits = uint32{word(at)} << 16 | word(at + 2);
        float value;
        std::memcpy(&value, &bits, sizeof value);
        return static_cast<double>(value);
    }
    std::string text(unsigned at, std::size_t size) const
    {
        const char* start = reinterpret_cast<const char*>(m_bytes + at);
        return std::string(start, ::strnlen(start, size));
    }

private:
    const uint8 (&m_bytes)[256];
};

/// slope * reading + offset; the slope is fixed point with eight binary digits.
double on_line(const Page& page, unsigned line, double reading)
{
    return page.word(line) / 256.0 * reading + page.signed_word(line + 2);
}

double on_rx_power_curve(const Page& page, double reading)
{
    double value = 0;
    for (unsigned term = 0; term < 5; term++)
        value = value * reading + page.real(at_rx_power_terms + 4 * term);
    return value;
}

/// The module's own constants may make nothing of a reading.
std::optional<real32> number(double value)
{
    if (!(std::fabs(value) <= FLT_MAX)) return std::nullopt;
    return static_cast<real32>(value);
}

Sff_Diagnostics decode_diagnostics(const Page& page, bool external)
{
    double temperature = page.signed_word(at_temperature);
    double vcc = page.word(at_vcc);
    double bias = page.word(at_tx_bias);
    double sent = page.word(at_tx_power);
    double received = page.word(at_rx_power);
    if (external) {
        temperature = on_line(page, at_temperature_line, temperature);
        vcc = on_line(page, at_vcc_line, vcc);
        bias = on_line(page, at_tx_bias_line, bias);
        sent = on_line(page, at_tx_power_line, sent);
        received = on_rx_power_curve(page, received);
    }
    return {number(temperature * degrees_per_step), number(vcc * volts_per_step), number(bias * milliamperes_per_step),
            number(sent * milliwatts_per_step), number(received * milliwatts_per_step)};
}

} // namespace

Sff_Module decode_sff(const RM_SFFDATA& data, uint32 size)
{
    const Page a0(data.a0);
    Sff_Module module;
    module.identifier = a0.byte(at_identifier);
    module.extIdentifier = a0.byte(at_ext_identifier);
    module.connector = a0.byte(at_connector);
    module.vendorName = a0.text(at_vendor_name, 16);
    module.vendorPN = a0.text(at_vendor_pn, 16);
    module.vendorRev = a0.text(at_vendor_rev, 4);
    module.vendorSN = a0.text(at_vendor_sn, 16);
    module.dateCode = a0.text(at_date_code, 8);
    std::memcpy(module.oui, data.a0 + at_oui, sizeof module.oui);
    module.wavelength = a0.word(at_wavelength);

    const uint8 monitoring = a0.byte(at_monitoring);
    if ((monitoring & monitoring_implemented) != 0 && size >= RM_SFF_SIZE)
        module.diagnostics = decode_diagnostics(
            Page(data.a2), (monitoring & (calibrated_externally | calibrated_internally)) == calibrated_externally);
    return module;
}

std::string sff_date(const std::string& dateCode)
{
    if (dateCode.size() < 6) return std::string();
    for (std::size_t i = 0; i < 6; i++)
        if (dateCode[i] < '0' || dateCode[i] > '9') return std::string();
    const auto two = [&](std::size_t at) { return 10 * (dateCode[at] - '0') + (dateCode[at + 1] - '0'); };
    char date[64];
    std::snprintf(date, sizeof date, "%04d%02d%02d000000.000000+000", 2000 + two(0), two(2), two(4));
    return date;
}

} // namespace cimple
