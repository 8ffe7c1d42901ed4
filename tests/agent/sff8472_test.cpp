// Modules by their bytes: names, dates, and readings with either calibration.

#include <cstring>
#include <limits>

#include <gmock/gmock.h>

#include "agent/sff8472.h"

using namespace cimple;

namespace {

struct Pages : RM_SFFDATA {
    Pages() : RM_SFFDATA() {}
    Pages& text(unsigned at, const std::string& value)
    {
        std::memcpy(a0 + at, value.data(), value.size());
        return *this;
    }
    Pages& monitoring(uint8 kind)
    {
        a0[92] = kind;
        return *this;
    }
    Pages& word(unsigned at, uint16 value)
    {
        a2[at] = static_cast<uint8>(value >> 8);
        a2[at + 1] = static_cast<uint8>(value);
        return *this;
    }
    Pages& real(unsigned at, float value)
    {
        uint32 bits;
        std::memcpy(&bits, &value, sizeof bits);
        return word(at, static_cast<uint16>(bits >> 16)).word(at + 2, static_cast<uint16>(bits));
    }
    /// Temperature, supply, bias, power sent, power received.
    Pages& readings(uint16 t, uint16 v, uint16 i, uint16 sent, uint16 received)
    {
        return word(96, t).word(98, v).word(100, i).word(102, sent).word(104, received);
    }
    Pages& line(unsigned at, uint16 slope, sint16 offset)
    {
        return word(at, slope).word(at + 2, static_cast<uint16>(offset));
    }
    Sff_Module decoded(uint32 size = RM_SFF_SIZE) const { return decode_sff(*this, size); }
    Sff_Diagnostics diagnostics(uint32 size = RM_SFF_SIZE) const { return decoded(size).diagnostics; }
};

constexpr uint8 internal_calibration = 0x68;
constexpr uint8 external_calibration = 0x58;

/// Every constant neutral: slopes and the first-power term 1, all else 0.
Pages neutral()
{
    Pages pages;
    pages.monitoring(external_calibration).real(68, 1);
    for (unsigned line : {76, 80, 84, 88})
        pages.line(line, 0x0100, 0);
    return pages;
}

void expect_none(const Sff_Diagnostics& made)
{
    EXPECT_FALSE(made.temperature.has_value());
    EXPECT_FALSE(made.vcc.has_value());
    EXPECT_FALSE(made.txBiasCurrent.has_value());
    EXPECT_FALSE(made.txPower.has_value());
    EXPECT_FALSE(made.rxPower.has_value());
}

} // namespace

TEST(Sff8472, NamesStandInTheirFields)
{
    Pages pages;
    pages.text(0, "\x03\x04\x07")
        .text(20, "NORVANE         ")
        .text(36, "x") // between two fields
        .text(37, "\x01\xC9\xab")
        .text(40, "OM-8G-SW        ")
        .text(56, "1A  ")
        .text(60, "\x03\x52")
        .text(68, "S123            ")
        .text(84, "230714AB");
    const Sff_Module made = pages.decoded();
    EXPECT_EQ(made.identifier, 3);
    EXPECT_EQ(made.extIdentifier, 4);
    EXPECT_EQ(made.connector, 7);
    EXPECT_EQ(made.vendorName, "NORVANE         ") << "blanks are kept";
    EXPECT_EQ(made.oui[0], 0x01);
    EXPECT_EQ(made.oui[1], 0xC9);
    EXPECT_EQ(made.oui[2], 0xAB);
    EXPECT_EQ(made.vendorPN, "OM-8G-SW        ");
    EXPECT_EQ(made.vendorRev, "1A  ");
    EXPECT_EQ(made.wavelength, 850);
    EXPECT_EQ(made.vendorSN, "S123            ");
    EXPECT_EQ(made.dateCode, "230714AB");
}

TEST(Sff8472, ATextEndsAtItsFirstZeroOrItsField)
{
    Pages pages;
    std::memset(pages.a0, 'x', sizeof pages.a0);
    pages.text(20, std::string("AB\0CD", 5));
    EXPECT_EQ(pages.decoded().vendorName, "AB");
    EXPECT_EQ(pages.decoded().vendorPN, std::string(16, 'x'));
    EXPECT_EQ(pages.decoded().vendorRev, "xxxx");
    EXPECT_EQ(pages.decoded().vendorSN, std::string(16, 'x'));
    EXPECT_EQ(pages.decoded().dateCode, "xxxxxxxx");
    EXPECT_EQ(Pages().decoded().vendorName, "");
}

TEST(Sff8472, InternalReadingsAreScaled)
{
    Pages pages;
    pages.monitoring(internal_calibration).readings(0x2380, 33000, 3250, 5800, 4321);
    const Sff_Diagnostics made = pages.diagnostics();
    EXPECT_FLOAT_EQ(made.temperature.value(), 35.5f);
    EXPECT_FLOAT_EQ(made.vcc.value(), 3.3f);
    EXPECT_FLOAT_EQ(made.txBiasCurrent.value(), 6.5f);
    EXPECT_FLOAT_EQ(made.txPower.value(), 0.58f);
    EXPECT_FLOAT_EQ(made.rxPower.value(), 0.4321f);
}

TEST(Sff8472, ReadingsReachTheEndsOfTheirRange)
{
    Pages pages;
    pages.monitoring(internal_calibration).readings(0x8000, 0xFFFF, 0xFFFF, 0xFFFF, 0xFFFF);
    Sff_Diagnostics made = pages.diagnostics();
    EXPECT_FLOAT_EQ(made.temperature.value(), -128);
    EXPECT_FLOAT_EQ(made.vcc.value(), 6.5535f);
    EXPECT_FLOAT_EQ(made.txBiasCurrent.value(), 131.07f);
    EXPECT_FLOAT_EQ(made.txPower.value(), 6.5535f);
    EXPECT_FLOAT_EQ(made.rxPower.value(), 6.5535f);
    made = pages.readings(0x7FFF, 0, 0, 0, 0).diagnostics();
    EXPECT_FLOAT_EQ(made.temperature.value(), 127.99609f);
    EXPECT_EQ(made.vcc.value(), 0);
    EXPECT_EQ(made.rxPower.value(), 0);
    EXPECT_FLOAT_EQ(pages.readings(0xFFFF, 0, 0, 0, 0).diagnostics().temperature.value(), -1.0f / 256);
}

TEST(Sff8472, NeutralConstantsChangeNothing)
{
    const Sff_Diagnostics made = neutral().readings(0xE680, 33000, 3250, 5800, 4321).diagnostics();
    EXPECT_FLOAT_EQ(made.temperature.value(), -25.5f);
    EXPECT_FLOAT_EQ(made.vcc.value(), 3.3f);
    EXPECT_FLOAT_EQ(made.txBiasCurrent.value(), 6.5f);
    EXPECT_FLOAT_EQ(made.txPower.value(), 0.58f);
    EXPECT_FLOAT_EQ(made.rxPower.value(), 0.4321f);
}

TEST(Sff8472, ExternalReadingsHaveALineEach)
{
    Pages pages = neutral();
    pages
        .line(76, 0x0180, 100)     // bias: 1.5 x + 100
        .line(80, 0x0080, -200)    // sent: 0.5 x - 200
        .line(84, 0x0110, -0x0280) // temperature: 1.0625 x - 2.5 degrees
        .line(88, 0x0200, 1000)    // supply: 2 x + 1000
        .readings(0x2000, 16000, 2000, 6000, 0);
    Sff_Diagnostics made = pages.diagnostics();
    EXPECT_FLOAT_EQ(made.txBiasCurrent.value(), 6.2f);
    EXPECT_FLOAT_EQ(made.txPower.value(), 0.28f);
    EXPECT_FLOAT_EQ(made.temperature.value(), 31.5f);
    EXPECT_FLOAT_EQ(made.vcc.value(), 3.3f);
    made = pages.word(96, 0xF000).diagnostics();
    EXPECT_FLOAT_EQ(made.temperature.value(), -19.5f) << "the reading has a sign";
    EXPECT_FLOAT_EQ(pages.line(88, 0xFF00, 0).diagnostics().vcc.value(), 408) << "a slope has none";
}

TEST(Sff8472, ReceivedPowerHasACurve)
{
    Pages pages = neutral();
    pages.real(56, 1e-12f).real(60, -2e-9f).real(64, 3e-5f).real(68, 0.5f).real(72, 12.25f).word(104, 1000);
    // 1 - 2 + 30 + 500 + 12.25, in tenths of a microwatt
    EXPECT_NEAR(pages.diagnostics().rxPower.value(), 0.054125f, 1e-7);
    EXPECT_FLOAT_EQ(pages.word(104, 0).diagnostics().rxPower.value(), 0.001225f);
}

TEST(Sff8472, ConstantsThatMakeNoNumberLeaveTheReadingOut)
{
    for (float constant : {std::numeric_limits<float>::infinity(), -std::numeric_limits<float>::infinity(),
                           std::numeric_limits<float>::quiet_NaN(), std::numeric_limits<float>::max()}) {
        Pages pages = neutral();
        pages.real(56, constant).readings(0x2380, 33000, 3250, 5800, 4321);
        const Sff_Diagnostics made = pages.diagnostics();
        EXPECT_FALSE(made.rxPower.has_value()) << constant;
        EXPECT_TRUE(made.txPower.has_value()) << "the others stand";
    }
}

TEST(Sff8472, InternalCalibrationLeavesTheConstantsAlone)
{
    Pages pages = neutral();
    pages.line(84, 0x0200, 0).readings(0x1000, 0, 0, 0, 0);
    EXPECT_FLOAT_EQ(pages.monitoring(internal_calibration).diagnostics().temperature.value(), 16);
    EXPECT_FLOAT_EQ(pages.monitoring(external_calibration).diagnostics().temperature.value(), 32);
    EXPECT_FLOAT_EQ(pages.monitoring(0x40).diagnostics().temperature.value(), 16) << "neither is told";
    EXPECT_FLOAT_EQ(pages.monitoring(0x70).diagnostics().temperature.value(), 16) << "both are told";
}

TEST(Sff8472, AModuleWithoutDiagnosticsHasNoReadings)
{
    Pages pages;
    pages.readings(0x2380, 33000, 3250, 5800, 4321);
    expect_none(pages.monitoring(0x00).diagnostics());
    expect_none(pages.monitoring(0xBF).diagnostics());
}

TEST(Sff8472, APageThatDidNotComeIsNotLookedAt)
{
    Pages pages;
    pages.monitoring(internal_calibration).readings(0x2380, 33000, 3250, 5800, 4321).text(20, "NORVANE");
    for (uint32 size : {0u, 256u, 511u}) {
        expect_none(pages.diagnostics(size));
        EXPECT_EQ(pages.decoded(size).vendorName, "NORVANE");
    }
    EXPECT_TRUE(pages.diagnostics(0xFFFFFFFF).vcc.has_value());
}

TEST(Sff8472, AnyBytesAreSafe)
{
    Pages pages;
    std::memset(pages.a0, 0xFF, sizeof pages.a0);
    std::memset(pages.a2, 0xFF, sizeof pages.a2);
    pages.monitoring(external_calibration);
    const Sff_Module made = pages.decoded();
    EXPECT_EQ(made.vendorName.size(), 16u);
    EXPECT_EQ(made.wavelength, 0xFFFF);
    EXPECT_FALSE(made.diagnostics.rxPower.has_value()) << "all ones are no number";
    EXPECT_TRUE(made.diagnostics.temperature.has_value());
}

TEST(Sff8472, ADateCodeIsADayOfThisCentury)
{
    EXPECT_EQ(sff_date("230714  "), "20230714000000.000000+000");
    EXPECT_EQ(sff_date("991231A7"), "20991231000000.000000+000");
    EXPECT_EQ(sff_date("000101"), "20000101000000.000000+000");
    for (const char* none : {"", "23071", "23 714  ", "23071A", "2307-4  ", "        "})
        EXPECT_EQ(sff_date(none), "") << none;
}
