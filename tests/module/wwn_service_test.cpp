// World Wide Names of ports, changed, restored and read through the service.
#include <cstdio>

#include <gmock/gmock.h>

#include "tests/module/support/Service.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Value;
using testing::Contains;
using testing::IsEmpty;
using testing::Not;
using namespace std::chrono_literals;

namespace {

constexpr char service_class[] = "NVRHBA_FCHBAWWNService";
constexpr char new_wwpn[] = "10000000C9A0F001";
constexpr char new_wwnn[] = "20000000C9A0F001";
constexpr unsigned untold = 65535;
constexpr char no_port_words[] = "NVRHBA_FCHBAWWNService_Provider invald port ...return";

/// What a method logs until its Target is accepted.
Words opened(const std::string& method, const std::string& device_id = first_port)
{
    return joined({{"Entering " + method, gate}, known_port(), converted(device_id)});
}

/// The same for a change whose names are accepted too.
Words names_accepted(const std::string& wwpn = new_wwpn, const std::string& wwnn = new_wwnn)
{
    return joined({opened("ChangeWWN"), converted(wwpn), converted(wwnn)});
}

class Wwn {
public:
    explicit Wwn(Rig& rig) : m_service(rig, service_class), m_port(port(rig)) {}

    Called change(unsigned type, const std::string& wwpn = new_wwpn, const std::string& wwnn = new_wwnn)
    {
        return m_service.call(
            "ChangeWWN",
            {{"Target", m_port}, {"NewWWPN", Value::string(wwpn)}, {"NewWWNN", Value::string(wwnn)}, type_of(type)});
    }
    Called restore(unsigned type) { return m_service.call("RestoreWWN", {{"Target", m_port}, type_of(type)}); }
    Called read(unsigned type) { return m_service.call("ReadWWN", {{"Target", m_port}, type_of(type)}); }
    Called capability() { return m_service.call("GetWWNCapability", {{"Target", m_port}}); }
    Service& service() { return m_service; }

private:
    static host::Named_Value type_of(unsigned type) { return {"Type", Value::uint16(static_cast<uint16_t>(type))}; }

    Service m_service;
    const Value m_port;
};

void expect_status(const Called& called, unsigned status)
{
    EXPECT_EQ(called.out("WWNOperationStatus"), Value::uint16(static_cast<uint16_t>(status)));
}

std::string fault(const std::string& call, const std::string& what)
{
    return "call = \"" + call + "\", " + what;
}

} // namespace

class WwnService : public Every_Manner {};
NVR_IN_EVERY_MANNER(WwnService);

TEST_P(WwnService, ReadsTheNamesOfEachType)
{
    Rig rig({*GetParam()});
    Wwn wwn(rig);
    const Words told = {"WWPN: 10:00:00:00:c9:a0:00:01", "WWNN: 20:00:00:00:c9:a0:00:01"};
    const Called lasting = wwn.read(1);
    EXPECT_THAT(lasting, returned(0));
    expect_status(lasting, 0);
    EXPECT_EQ(lasting.out("WWPN").as_text(), "10:00:00:00:c9:a0:00:01");
    EXPECT_EQ(lasting.out("WWNN").as_text(), "20:00:00:00:c9:a0:00:01");
    EXPECT_EQ(lasting.words,
              joined({opened("ReadWWN"), {"Reading Non-Volatile WWNs.", "Non-Volatile WWNs read successfully"}, told}));
    const Called factory = wwn.read(2);
    EXPECT_THAT(factory, returned(0));
    expect_status(factory, 0);
    EXPECT_EQ(
        factory.words,
        joined({opened("ReadWWN"), {"Reading Factory Default WWNs.", "Factory Default WWNs read successfully"}, told}));
    const Called current = wwn.read(3);
    expect_status(current, 4);
    EXPECT_EQ(current.words,
              joined({opened("ReadWWN"), {"Reading current WWNs.", "Current WWNs: Non-Volatile"}, told}));
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(WwnService, TellsOfNamesThatDoNotExist)
{
    Rig rig({*GetParam()});
    Wwn wwn(rig);
    // Volatile names that are not there come back as the library left them, configured ones not at all.
    const Called gone = wwn.read(0);
    EXPECT_THAT(gone, returned(0));
    expect_status(gone, 9);
    EXPECT_EQ(gone.out("WWPN").as_text(), "00:00:00:00:00:00:00:00");
    EXPECT_EQ(gone.out("WWNN").as_text(), "00:00:00:00:00:00:00:00");
    EXPECT_EQ(gone.words, joined({opened("ReadWWN"),
                                  {"Reading Volatile WWNs.", "Volatile WWNs DO NOT EXIST on this adapter",
                                   "WWPN: 00:00:00:00:00:00:00:00", "WWNN: 00:00:00:00:00:00:00:00"}}));
    const Called configured = wwn.read(4);
    EXPECT_THAT(configured, returned(0));
    expect_status(configured, 9);
    EXPECT_TRUE(configured.out("WWPN").is_null());
    EXPECT_TRUE(configured.out("WWNN").is_null());
    EXPECT_EQ(configured.words,
              joined({opened("ReadWWN"), {"Reading configured WWNs.", "Configured WWNs DO NOT EXIST"}}));
}

TEST_P(WwnService, ChangesNamesThatWaitForAReset)
{
    Rig rig({*GetParam()});
    Wwn wwn(rig);
    const Called changed = wwn.change(1);
    EXPECT_THAT(changed, returned(0));
    expect_status(changed, 8);
    EXPECT_EQ(changed.words,
              joined({names_accepted(),
                      {"Writing Non-Volatile World Wide Name.", "ChangeWWN operation initiated",
                       "New WWNs written successfully", "Reset required to activate the new setting",
                       "ChangeWWN operation completed. Please restart the CIMOM to use Norvane CIM provider",
                       gate_refreshing}}));
    const Called configured = wwn.read(4);
    expect_status(configured, 8);
    EXPECT_EQ(configured.out("WWPN").as_text(), "10:00:00:00:c9:a0:f0:01");
    EXPECT_THAT(configured.words, Contains("Configured WWNs: Non-Volatile (Activation required: adapter restart)"));

    const Called volatile_names = wwn.change(0);
    expect_status(volatile_names, 7);
    EXPECT_EQ(volatile_names.words,
              joined({names_accepted(),
                      {"Writing Volatile World Wide Name.", "ChangeWWN operation initiated",
                       "New WWNs written successfully", "Reset required to activate the new setting",
                       "Volatile names will be active until system power-down or HBA power-cycle",
                       "ChangeWWN operation completed. Please restart the CIMOM to use Norvane CIM provider",
                       gate_refreshing}}));
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(WwnService, RestoresNames)
{
    Rig rig({*GetParam()});
    Wwn wwn(rig);
    const Called active = wwn.restore(0);
    EXPECT_THAT(active, returned(0));
    expect_status(active, 1);
    EXPECT_EQ(active.words, joined({opened("RestoreWWN"),
                                    {"Restoring Factory Default World Wide Name...", "RestoreWWN operation initiated.",
                                     "WWNs already active. No Restore needed", gate_refreshing}}));
    EXPECT_THAT(wwn.change(0), returned(0));
    const Called restored = wwn.restore(1);
    EXPECT_THAT(restored, returned(0));
    expect_status(restored, 8);
    EXPECT_EQ(restored.words, joined({opened("RestoreWWN"),
                                      {"Restoring Non-volatile World Wide Name...", "RestoreWWN operation initiated.",
                                       "WWNs restored successfully", "Please reset the HBA to activate the new setting",
                                       gate_refreshing}}));
}

TEST_P(WwnService, TellsWhatCanBeChanged)
{
    Rig rig({*GetParam()});
    Wwn wwn(rig);
    const Called told = wwn.capability();
    EXPECT_THAT(told, returned(0));
    EXPECT_EQ(told.out("WWNCapability"), Value::uint32(0x200C));
    EXPECT_EQ(told.words, joined({opened("GetWWNCapability"),
                                  {"Can change Non-Volatile WWNs", "Can change Volatile WWNs",
                                   "Activation requirement: Reset HBA"}}));
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(WwnService, TakesMethodsAndArgumentsInAnyCase)
{
    Rig rig({*GetParam()});
    Service service(rig, service_class);
    for (const char* method : {"READWWN", "readwwn", "rEADwwn"}) {
        const Called read = service.call(method, {{"TARGET", port(rig)}, {"type", Value::uint16(2)}});
        EXPECT_THAT(read, returned(0)) << method;
        EXPECT_EQ(read.out("WWPN").as_text(), "10:00:00:00:c9:a0:00:01");
    }
    EXPECT_THAT(service.call("getwwncapability", {{"target", port(rig, 1)}}), returned(0));
    EXPECT_THAT(service.call("restorewwn", {{"target", port(rig, 1)}}), returned(0));
    EXPECT_THAT(service.call("changewwn", {{"target", port(rig)},
                                           {"newwwpn", Value::string(new_wwpn)},
                                           {"NEWWWNN", Value::string(new_wwnn)}}),
                returned(0));
}

// The instance is looked at before the target, and the target before all else.
TEST_P(WwnService, RefusesWhatItIsNotMeantFor)
{
    Rig rig({*GetParam()});
    Service service(rig, service_class);
    const struct {
        const char* what;
        Arguments target;
        Words looked_up;
    } targets[] = {
        {"missing", {}, {}},
        {"null", {{"Target", Value::null_of(CMPI_ref)}}, {}},
        {"of another class", {{"Target", no_port(rig)}}, {}},
        {"unknown", {{"Target", unknown_port(rig)}}, no_known_port()},
        {"without a key", {{"Target", port_with_id(rig, Value::string(""))}}, no_known_port()},
    };
    for (const std::string method : {"ChangeWWN", "RestoreWWN", "ReadWWN", "GetWWNCapability"}) {
        const bool tells_status = method != "GetWWNCapability";
        for (const auto& target : targets) {
            // Bad names and a bad type would be refused too, but later.
            Arguments arguments = target.target;
            arguments.push_back({"Type", Value::uint16(9)});
            const Called called = service.call(method, arguments);
            EXPECT_THAT(called, returned(32968)) << method << ' ' << target.what;
            EXPECT_EQ(called.words, joined({{"Entering " + method, gate}, target.looked_up, {no_port_words}}))
                << method << ' ' << target.what;
            if (tells_status) expect_status(called, untold);
            EXPECT_TRUE(called.out("WWPN").is_null());
            EXPECT_TRUE(called.out("WWNCapability").is_null());
        }
        const Called called = service.call_on(service.stranger(), method, {{"Target", unknown_port(rig)}});
        EXPECT_THAT(called, returned(33068)) << method;
        EXPECT_EQ(called.words, (Words{"Entering " + method, gate, "Invalid instance of HBA WWN Management Service"}));
        if (tells_status) expect_status(called, untold);
    }
    EXPECT_EQ(calls("RM_ChangeWWN") + calls("RM_RestoreWWN") + calls("RM_ReadWWN") + calls("RM_GetWWNCapability"), 0u);
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST(WwnServiceNames, AreConvertedBeforeTheTypeIsLookedAt)
{
    Rig rig;
    Wwn wwn(rig);
    const struct {
        const char* wwpn;
        const char* wwnn;
        unsigned type;
        unsigned value;
        Words words;
    } rows[] = {
        {"", "", 2, 32969, {"New WWPN has a null pointer"}},
        {"", new_wwnn, 0, 32969, {"New WWPN has a null pointer"}},
        {new_wwpn, "", 2, 32969, joined({converted(new_wwpn), {"New WWNN has a null pointer"}})},
        {"1", "", 2, 32968, joined({not_converted("1"), {"NVRHBA_FCHBAWWNService_Provider::str2HBAName failed"}})},
        {"10000000C9A0F00X", "", 2, 32968,
         joined({not_converted("10000000C9A0F00X"), {"NVRHBA_FCHBAWWNService_Provider::str2HBAName failed"}})},
        {new_wwpn, "20000000", 0, 32968,
         joined({converted(new_wwpn),
                 not_converted("20000000"),
                 {"NVRHBA_FCHBAWWNService_Provider::str2HBAName failed"}})},
        {new_wwpn, new_wwnn, 2, 32968,
         joined({converted(new_wwpn), converted(new_wwnn), {"ChangeWWN: Type 2 not recognized..."}})},
        {new_wwpn, new_wwnn, 65535, 32968,
         joined({converted(new_wwpn), converted(new_wwnn), {"ChangeWWN: Type 65535 not recognized..."}})},
    };
    for (const auto& row : rows) {
        const Called called = wwn.change(row.type, row.wwpn, row.wwnn);
        EXPECT_THAT(called, returned(row.value)) << row.wwpn << ' ' << row.wwnn;
        EXPECT_EQ(called.words, joined({opened("ChangeWWN"), row.words}));
        expect_status(called, untold);
    }
    EXPECT_EQ(calls("RM_ValidateWwn"), 0u);
    EXPECT_EQ(calls("RM_ChangeWWN"), 0u);
}

// The first sixteen characters count, behind a quote in front; what follows is not looked at.
TEST(WwnServiceNames, MayComeInOddClothes)
{
    Rig rig;
    Wwn wwn(rig);
    EXPECT_THAT(wwn.change(1, '"' + std::string(new_wwpn) + '"', new_wwnn), returned(0));
    EXPECT_THAT(wwn.change(1, std::string(new_wwpn) + std::string(65536, 'x'), new_wwnn), returned(0));
    EXPECT_THAT(wwn.change(1, "10000000c9a0f001", "20000000c9a0f001"), returned(0));
    EXPECT_THAT(wwn.change(1, std::string(new_wwpn) + std::string(1, '\0') + "more", new_wwnn), returned(0));
    EXPECT_THAT(wwn.change(1, std::string(65536, 'x'), new_wwnn), returned(32968));
    EXPECT_THAT(wwn.change(1, "10:00:00:00:c9:a0:f0:01", new_wwnn), returned(32968));
    EXPECT_THAT(wwn.change(1, "1000\n0000%s%n\xC3\xBC", new_wwnn), returned(32968));
    EXPECT_THAT(wwn.service().call("ChangeWWN", {{"Target", port(rig)}, {"Type", Value::uint16(1)}}), returned(32969));
}

TEST(WwnServiceNames, OfATargetAreTakenInAnyCase)
{
    Rig rig;
    Service service(rig, service_class);
    const Called read = service.call(
        "ReadWWN", {{"Target", port_with_id(rig, Value::string("10000000c9a00002"))}, {"Type", Value::uint16(2)}});
    EXPECT_THAT(read, returned(0));
    EXPECT_EQ(read.out("WWPN").as_text(), "10:00:00:00:c9:a0:00:02");
}

TEST(WwnServiceTypes, BeyondThoseOfTheMethodAreRefused)
{
    Rig rig;
    Wwn wwn(rig);
    for (unsigned type : {2u, 3u, 65535u}) {
        const Called called = wwn.restore(type);
        EXPECT_THAT(called, returned(32968));
        EXPECT_EQ(called.words,
                  joined({opened("RestoreWWN"), {"RestoreWWN: Type " + std::to_string(type) + " not recognized..."}}));
        expect_status(called, untold);
    }
    for (unsigned type : {5u, 6u, 65535u}) {
        const Called called = wwn.read(type);
        EXPECT_THAT(called, returned(32968));
        EXPECT_EQ(called.words,
                  joined({opened("ReadWWN"), {"ReadWWN: Type " + std::to_string(type) + " not recognized..."}}));
        expect_status(called, untold);
    }
    EXPECT_EQ(calls("RM_RestoreWWN"), 0u);
    EXPECT_EQ(calls("RM_ReadWWN"), 0u);
}

TEST(WwnServiceTypes, ThatAreMissingCountAsZero)
{
    Rig rig;
    Service service(rig, service_class);
    EXPECT_THAT(service.call("ReadWWN", {{"Target", port(rig)}}).words, Contains("Reading Volatile WWNs."));
    EXPECT_THAT(service.call("RestoreWWN", {{"Target", port(rig)}, {"Type", Value::null_of(CMPI_uint16)}}).words,
                Contains("Restoring Factory Default World Wide Name..."));
}

TEST(WwnServiceReading, TellsEachStatusWord)
{
    Rig rig;
    Wwn wwn(rig);
    const struct {
        unsigned type, word;
        const char* words;
        unsigned status;
        bool names;
    } rows[] = {
        {0, 1, "Volatile WWNs are active", 1, true},
        {0, 9, "Volatile WWNs DO NOT EXIST on this adapter", 9, true},
        {0, 3, nullptr, 0, true},
        {1, 0, "Non-Volatile WWNs read successfully", 0, true},
        {1, 9, "Non-Volatile WWNs read successfully", 0, true},
        {2, 1, "Factory Default WWNs read successfully", 0, true},
        {2, 4294967295, "Factory Default WWNs read successfully", 0, true},
        {3, 3, "Current WWNs: Volatile", 3, true},
        {3, 4, "Current WWNs: Non-Volatile", 4, true},
        {3, 9, nullptr, 0, true},
        {3, 65539, nullptr, 0, true},
        {4, 9, "Configured WWNs DO NOT EXIST", 9, false},
        {4, 5, "Configured WWNs: Volatile (Activation required: warm reboot)", 5, true},
        {4, 7, "Configured WWNs: Volatile (Activation required: adapter restart)", 7, true},
        {4, 6, "Configured WWNs: Non-Volatile (Activation required: warm reboot)", 6, true},
        {4, 8, "Configured WWNs: Non-Volatile (Activation required: adapter restart)", 8, true},
        {4, 1, nullptr, 0, true},
    };
    const char* const types[] = {"Reading Volatile WWNs.", "Reading Non-Volatile WWNs.",
                                 "Reading Factory Default WWNs.", "Reading current WWNs.", "Reading configured WWNs."};
    for (const auto& row : rows) {
        clear_faults();
        add_fault(fault("RM_ReadWWN", "value = " + std::to_string(row.word)));
        const Called called = wwn.read(row.type);
        EXPECT_THAT(called, returned(0)) << row.type << ' ' << row.word;
        expect_status(called, row.status);
        EXPECT_EQ(called.out("WWPN").is_null(), !row.names) << row.type << ' ' << row.word;
        EXPECT_EQ(called.out("WWNN").is_null(), !row.names) << row.type << ' ' << row.word;
        Words words = joined({opened("ReadWWN"), {types[row.type]}});
        if (row.words) words.push_back(row.words);
        if (row.names) {
            words.push_back("WWPN: " + called.out("WWPN").as_text());
            words.push_back("WWNN: " + called.out("WWNN").as_text());
        }
        EXPECT_EQ(called.words, words) << row.type << ' ' << row.word;
    }
}

TEST(WwnServiceReading, PassesEachStatusOfTheLibraryOn)
{
    Rig rig({host::Manner::strict(), "small"});
    Wwn wwn(rig);
    for (unsigned status = 1; status <= 260; status++)
        for (unsigned type : {0u, 1u, 2u, 3u, 4u}) {
            if (type > 1 && status != 7 && status != 8 && status != 89 && status != 92 && status != 97) continue;
            clear_faults();
            add_fault(fault("RM_ReadWWN", "status = " + std::to_string(status)));
            const std::uint64_t before = calls("RM_ReadWWN");
            const Called called = wwn.read(type);
            EXPECT_THAT(called, returned(40000 + status));
            expect_status(called, 0);
            EXPECT_TRUE(called.out("WWPN").is_null());
            std::string words = "ReadWWN: RM_ReadWWN call failed with error: " + std::to_string(status);
            if (status == 92) words = "WWN Management is NOT AVAILABLE on this adapter";
            if (status == 89 && type == 0) words = "Volatile WWNs are NOT SUPPORTED on this adapter";
            EXPECT_EQ(called.words.back(), words) << status;
            EXPECT_THAT(called.words[called.words.size() - 2], testing::StartsWith("Reading ")) << status;
            EXPECT_EQ(calls("RM_ReadWWN"), before + 1) << status; // nothing is asked twice
        }
}

TEST(WwnServiceCapability, IsToldBitByBit)
{
    Rig rig;
    Wwn wwn(rig);
    for (unsigned combination = 0; combination < 32; combination++) {
        const unsigned word = (combination & 1 ? 0x8000u : 0) | (combination & 2 ? 4u : 0) |
                              (combination & 4 ? 8u : 0) | (combination & 8 ? 0x1000u : 0) |
                              (combination & 16 ? 0x2000u : 0) | 0x80000001u;
        clear_faults();
        add_fault(fault("RM_GetWWNCapability", "value = " + std::to_string(word)));
        const Called called = wwn.capability();
        EXPECT_THAT(called, returned(0));
        EXPECT_EQ(called.out("WWNCapability"), Value::uint32(word));
        Words words = opened("GetWWNCapability");
        if (word & 0x8000) words.push_back("Read Only mode: World Wide Name Management is not supported in this mode");
        words.push_back(word & 4 ? "Can change Non-Volatile WWNs" : "Cannot change Non-Volatile WWNs");
        words.push_back(word & 8 ? "Can change Volatile WWNs" : "Cannot change Volatile WWNs");
        if (word & 0x1000) words.push_back("Activation requirement: Reboot");
        if (word & 0x2000) words.push_back("Activation requirement: Reset HBA");
        EXPECT_EQ(called.words, words) << word;
    }
    // A library that says yes and writes nothing leaves the word as it was preset.
    clear_faults();
    add_fault(fault("RM_GetWWNCapability", "damage = \"null\""));
    EXPECT_EQ(wwn.capability().out("WWNCapability"), Value::uint32(1));
}

TEST(WwnServiceCapability, IsNotToldWhenTheLibraryFails)
{
    Rig rig({host::Manner::strict(), "small"});
    Wwn wwn(rig);
    for (unsigned status = 1; status <= 260; status++) {
        clear_faults();
        add_fault(fault("RM_GetWWNCapability", "status = " + std::to_string(status)));
        const Called called = wwn.capability();
        EXPECT_THAT(called, returned(40000 + status));
        EXPECT_TRUE(called.out("WWNCapability").is_null());
        Words words = opened("GetWWNCapability");
        if (status == 92) words.push_back("WWN Management is not available on this HBA");
        words.push_back("GetWWNCapability: RM_ReadWWNCapability call failed with error: " + std::to_string(status));
        EXPECT_EQ(called.words, words);
    }
}

TEST(WwnServiceChange, TellsEachActivationCode)
{
    Rig rig;
    Wwn wwn(rig);
    const std::string reboot = "Reboot required to activate the new setting";
    const std::string reset = "Reset required to activate the new setting";
    const std::string until = "Volatile names will be active until system power-down or HBA power-cycle";
    const struct {
        unsigned code;
        Words words;
        unsigned status;
    } rows[] = {
        {5, {reboot, until}, 5}, {6, {reboot}, 6}, {7, {reset, until}, 7}, {8, {reset}, 8},  {0, {}, untold},
        {1, {}, untold},         {4, {}, untold},  {9, {}, untold},        {97, {}, untold}, {65541, {}, untold},
    };
    for (const auto& row : rows) {
        clear_faults();
        add_fault(fault("RM_ChangeWWN", "value = " + std::to_string(row.code)));
        const Called called = wwn.change(0);
        EXPECT_THAT(called, returned(0)) << row.code;
        expect_status(called, row.status);
        EXPECT_EQ(called.words,
                  joined({names_accepted(),
                          {"Writing Volatile World Wide Name.", "ChangeWWN operation initiated",
                           "New WWNs written successfully"},
                          row.words,
                          {"ChangeWWN operation completed. Please restart the CIMOM to use Norvane CIM provider",
                           gate_refreshing}}))
            << row.code;
    }
}

TEST(WwnServiceChange, PassesEachStatusOfTheLibraryOn)
{
    Rig rig({host::Manner::strict(), "small"});
    Wwn wwn(rig);
    const auto before = slept();
    rig.settle();
    const std::size_t refreshes = rig.refreshes();
    for (unsigned status = 1; status <= 260; status++) {
        if (status == 97) continue; // busy: a test of its own
        clear_faults();
        add_fault(fault("RM_ChangeWWN", "status = " + std::to_string(status)));
        const Called called = wwn.change(1);
        EXPECT_THAT(called, returned(40000 + status));
        expect_status(called, untold);
        Words words =
            joined({names_accepted(), {"Writing Non-Volatile World Wide Name.", "ChangeWWN operation initiated"}});
        if (status == 92) words.push_back("WWN Management is not available on this HBA");
        if (status == 89) words.push_back("WWN NOT SUPPORTED");
        words.push_back("ChanngeWWN: RM_ChangeWWN call failed with error: " + std::to_string(status));
        EXPECT_EQ(called.words, words);
    }
    EXPECT_EQ(rig.refreshes(), refreshes); // what failed changed nothing
    EXPECT_EQ(slept() - before, 0us);
}

TEST(WwnServiceChange, WaitsForABusyLibrary)
{
    Rig rig;
    Wwn wwn(rig);
    const auto before = slept();
    add_fault(fault("RM_ChangeWWN", "status = 97, times = 3"));
    const Called called = wwn.change(1);
    EXPECT_THAT(called, returned(0));
    expect_status(called, 8);
    EXPECT_EQ(
        called.words,
        joined({names_accepted(),
                {"Writing Non-Volatile World Wide Name.", "ChangeWWN operation initiated", "Validating new WWNs...",
                 "New WWNs written successfully", "Reset required to activate the new setting",
                 "ChangeWWN operation completed. Please restart the CIMOM to use Norvane CIM provider",
                 gate_refreshing}}));
    EXPECT_EQ(calls("RM_ChangeWWN"), 4u);
    EXPECT_EQ(slept() - before, 3s); // one behind each further call, also the last
}

TEST(WwnServiceChange, GivesABusyLibraryUpAfterFiveMinutes)
{
    Rig rig;
    Wwn wwn(rig);
    const auto before = slept();
    add_fault(fault("RM_ChangeWWN", "status = 97"));
    const Called called = wwn.change(0);
    EXPECT_THAT(called, returned(40097));
    expect_status(called, untold);
    EXPECT_EQ(called.words,
              joined({names_accepted(),
                      {"Writing Volatile World Wide Name.", "ChangeWWN operation initiated", "Validating new WWNs...",
                       "ChanngeWWN: RM_ChangeWWN call failed with error: 97"}}));
    EXPECT_EQ(calls("RM_ChangeWWN"), 301u);
    EXPECT_EQ(slept() - before, 5min);
}

TEST(WwnServiceChange, TakesTheLastAnswerOfALibraryThatWasBusy)
{
    Rig rig;
    Wwn wwn(rig);
    const auto before = slept();
    add_fault(fault("RM_ChangeWWN", "status = 97, times = 2"));
    add_fault(fault("RM_ChangeWWN", "status = 92"));
    const Called called = wwn.change(0);
    EXPECT_THAT(called, returned(40092));
    EXPECT_EQ(calls("RM_ChangeWWN"), 3u);
    EXPECT_EQ(slept() - before, 2s);
}

TEST(WwnServiceChange, AsksTheLibraryWhetherTheNamesAreNames)
{
    Rig rig;
    Wwn wwn(rig);
    add_fault(fault("RM_ValidateWwn", "status = 5, times = 1"));
    const Called port_name = wwn.change(1);
    EXPECT_THAT(port_name, returned(40005));
    EXPECT_EQ(
        port_name.words,
        joined({names_accepted(), {"Writing Non-Volatile World Wide Name.", "The supplied 'New WWPN' is not valid"}}));
    expect_status(port_name, untold);
    EXPECT_EQ(calls("RM_ValidateWwn"), 1u);

    const Called node_name = wwn.change(1, new_wwpn, "0000000000000000");
    EXPECT_THAT(node_name, returned(40005));
    EXPECT_EQ(node_name.words,
              joined({names_accepted(new_wwpn, "0000000000000000"),
                      {"Writing Non-Volatile World Wide Name.", "The supplied 'New WWNN' is not valid"}}));
    EXPECT_EQ(calls("RM_GetNumberOfLocalAdapters"), 0u);
    EXPECT_EQ(calls("RM_ChangeWWN"), 0u);

    // Any other answer is no refusal.
    clear_faults();
    add_fault(fault("RM_ValidateWwn", "status = 4"));
    EXPECT_THAT(wwn.change(1, new_wwpn, "20000000C9A0F001"), returned(0));
}

namespace {

/// A host of two adapters with a port each; the second has these virtual ports.
std::string host_with_vports(unsigned count)
{
    std::string text = "# a host\n[[adapter]]\n[[adapter.port]]\n[[adapter]]\n[[adapter.port]]\n";
    char name[32];
    for (unsigned i = 0; i < count; i++) {
        std::snprintf(name, sizeof name, "%016llX", 0x2B010000C9A00000ull + i);
        text += "[[adapter.port.vport]]\nwwpn = \"" + std::string(name) + "\"\nwwnn = \"2C010000C9A0FFFF\"\n";
    }
    return text;
}

constexpr char first_vport[] = "2B010000C9A00000";

void expect_duplicate(const Called& called)
{
    EXPECT_THAT(called, returned(91));
    expect_status(called, 1);
    EXPECT_EQ(called.words.back(), "ChangeWWN: Duplication of vport WWPN detected.");
    EXPECT_EQ(calls("RM_ChangeWWN"), 0u);
}

} // namespace

TEST(WwnServiceDuplicates, AreNamesThatAVirtualPortOfAnyLocalPortHas)
{
    Rig rig({host::Manner::strict(), host_with_vports(3)});
    Wwn wwn(rig);
    const std::uint64_t listed = calls("RM_VPList");
    const Called port_name = wwn.change(1, first_vport, new_wwnn);
    expect_duplicate(port_name);
    EXPECT_EQ(port_name.words,
              joined({names_accepted(first_vport),
                      {"Writing Non-Volatile World Wide Name.", "ChangeWWN: Duplication of vport WWPN detected."}}));
    // One port without any, and one that is asked again with more room.
    EXPECT_EQ(calls("RM_VPList"), listed + 3);
    expect_duplicate(wwn.change(1, new_wwpn, "2B010000C9A00002"));
    expect_duplicate(wwn.change(0, "2B010000C9A00001", "2B010000C9A00001"));
    // A virtual port's node name is not looked at.
    EXPECT_THAT(wwn.change(1, "2C010000C9A0FFFF", "2C010000C9A0FFFF"), returned(0));
    EXPECT_EQ(calls("RM_ChangeWWN"), 1u);
}

TEST(WwnServiceDuplicates, AreSearchedToTheEndOfTheLocalPorts)
{
    Rig rig; // the first port has the virtual ones
    Wwn wwn(rig);
    const std::string name = rig.enumerate("NVRHBA_VirtualFCPort").instances.at(0).get("DeviceID").as_text();
    ASSERT_EQ(name.size(), 16u);
    const std::uint64_t listed = calls("RM_VPList"), records = calls("RM_GetLocalHBAInfo");
    expect_duplicate(wwn.change(1, name, new_wwnn));
    EXPECT_EQ(calls("RM_GetLocalHBAInfo"), records + 4);
    EXPECT_EQ(calls("RM_VPList"), listed + 5);
}

TEST(WwnServiceDuplicates, AreSearchedOnceForRecordsOfOneName)
{
    Rig rig;
    Wwn wwn(rig);
    add_fault(fault("RM_GetLocalHBAInfo", "damage = \"zeros\""));
    const std::uint64_t listed = calls("RM_VPList"), records = calls("RM_GetLocalHBAInfo");
    EXPECT_THAT(wwn.change(1), returned(0));
    EXPECT_EQ(calls("RM_GetLocalHBAInfo"), records + 4);
    rig.settle();
    clear_faults();
    // The refresh that followed lists them too; without it there is one call for the four records.
    add_fault(fault("RM_GetLocalHBAInfo", "damage = \"zeros\""));
    add_fault(fault("RM_ChangeWWN", "status = 1"));
    const std::uint64_t before = calls("RM_VPList");
    EXPECT_THAT(wwn.change(1), returned(40001));
    EXPECT_EQ(calls("RM_VPList"), before + 1);
    EXPECT_GE(before, listed + 1);
}

TEST(WwnServiceDuplicates, AreNotSearchedInRecordsThatFail)
{
    Rig rig({host::Manner::strict(), host_with_vports(3)});
    Wwn wwn(rig);
    add_fault(fault("RM_GetLocalHBAInfo", "status = 1, from = 2, times = 1"));
    EXPECT_THAT(wwn.change(1, first_vport, new_wwnn), returned(0));
    clear_faults();
    add_fault(fault("RM_GetLocalHBAInfo", "status = 1, times = 1"));
    EXPECT_THAT(wwn.change(1, first_vport, new_wwnn), returned(91));
}

TEST(WwnServiceDuplicates, AreNotSearchedWithoutRecordsOrLists)
{
    Rig rig({host::Manner::strict(), host_with_vports(3)});
    Wwn wwn(rig);
    for (const char* how :
         {"call = \"RM_GetNumberOfLocalAdapters\", absent = true", "call = \"RM_GetNumberOfLocalAdapters\", value = 0",
          "call = \"RM_GetLocalHBAInfo\", absent = true", "call = \"RM_VPList\", absent = true",
          "call = \"RM_VPList\", status = 2", "call = \"RM_VPList\", value = 0",
          "call = \"RM_VPList\", status = 7, value = 4294967295",
          "call = \"RM_VPList\", status = 7, value = 3000000"}) {
        clear_faults();
        add_fault(how);
        EXPECT_THAT(wwn.change(1, first_vport, new_wwnn), returned(0)) << how;
    }
}

TEST(WwnServiceDuplicates, AreLookedForInAsManyRecordsAsAHostCanHave)
{
    Rig rig({host::Manner::strict(), "small"});
    Wwn wwn(rig);
    add_fault(fault("RM_GetNumberOfLocalAdapters", "value = 4294967295"));
    const std::uint64_t records = calls("RM_GetLocalHBAInfo");
    EXPECT_THAT(wwn.change(1), returned(0));
    EXPECT_EQ(calls("RM_GetLocalHBAInfo"), records + 1024);
}

TEST(WwnServiceDuplicates, AreSearchedInUpTo1023VirtualPorts)
{
    {
        Rig rig({host::Manner::strict(), host_with_vports(1023)});
        expect_duplicate(Wwn(rig).change(1, "2B010000C9A003FE", new_wwnn));
    }
    Rig rig({host::Manner::strict(), host_with_vports(1024)});
    Wwn wwn(rig);
    EXPECT_THAT(wwn.change(1, first_vport, new_wwnn), returned(0));
}

// More than there was room for is counted, but no walk goes beyond the buffer.
TEST(WwnServiceDuplicates, AreNotReadBehindTheList)
{
    Rig rig({host::Manner::strict(), host_with_vports(1)});
    Wwn wwn(rig);
    add_fault(fault("RM_VPList", "value = 1023"));
    EXPECT_THAT(wwn.change(1), returned(0));
    expect_duplicate([&] {
        clear_faults();
        add_fault(fault("RM_VPList", "value = 1023"));
        add_fault(fault("RM_ChangeWWN", "status = 1"));
        Called called = wwn.change(1, first_vport, new_wwnn);
        EXPECT_EQ(calls("RM_ChangeWWN"), 1u); // of the first change
        load_scenario(host_with_vports(1));
        return called;
    }());
}

TEST(WwnServiceRestore, TellsEachActivationCode)
{
    Rig rig;
    Wwn wwn(rig);
    const std::string done = "WWNs restored successfully";
    const std::string reboot = "Reboot required to activate the new setting";
    const std::string until = "Volatile names will be active until system power-down or HBA power-cycle";
    const struct {
        unsigned code;
        Words words;
        unsigned status;
    } rows[] = {
        {1, {"WWNs already active. No Restore needed"}, 1},
        {5, {done, reboot, until}, 5},
        {6, {done, reboot}, 6},
        {7, {done, "Reset the HBA to activate the new setting", until}, 7},
        {8, {done, "Please reset the HBA to activate the new setting"}, 8},
        {0, {}, untold},
        {2, {}, untold},
        {9, {}, untold},
        {65537, {}, untold},
    };
    for (const auto& row : rows) {
        clear_faults();
        add_fault(fault("RM_RestoreWWN", "value = " + std::to_string(row.code)));
        const Called called = wwn.restore(1);
        EXPECT_THAT(called, returned(0)) << row.code;
        expect_status(called, row.status);
        EXPECT_EQ(called.words,
                  joined({opened("RestoreWWN"),
                          {"Restoring Non-volatile World Wide Name...", "RestoreWWN operation initiated."},
                          row.words,
                          {gate_refreshing}}))
            << row.code;
    }
}

TEST(WwnServiceRestore, TakesEveryRefusalOfTheLibraryForDone)
{
    Rig rig({host::Manner::strict(), "small"});
    Wwn wwn(rig);
    const auto before = slept();
    for (unsigned status = 1; status <= 260; status++) {
        if (status == 97) continue;
        clear_faults();
        add_fault(fault("RM_RestoreWWN", "status = " + std::to_string(status)));
        const Called called = wwn.restore(0);
        EXPECT_THAT(called, returned(0));
        expect_status(called, untold);
        EXPECT_EQ(called.words, joined({opened("RestoreWWN"),
                                        {"Restoring Factory Default World Wide Name...",
                                         "RestoreWWN operation initiated.", gate_refreshing}}))
            << status;
    }
    EXPECT_EQ(slept() - before, 0us);
}

TEST(WwnServiceRestore, WaitsForABusyLibraryAndGivesItUp)
{
    Rig rig;
    Wwn wwn(rig);
    const auto before = slept();
    add_fault(fault("RM_RestoreWWN", "status = 97, times = 1"));
    const Called patient = wwn.restore(0);
    EXPECT_THAT(patient, returned(0));
    expect_status(patient, 1);
    EXPECT_EQ(patient.words,
              joined({opened("RestoreWWN"),
                      {"Restoring Factory Default World Wide Name...", "RestoreWWN operation initiated.",
                       "Restoring WWNs...", "WWNs already active. No Restore needed", gate_refreshing}}));
    EXPECT_EQ(slept() - before, 1s);
    add_fault(fault("RM_RestoreWWN", "status = 97"));
    const Called given_up = wwn.restore(0);
    EXPECT_THAT(given_up, returned(0));
    expect_status(given_up, untold);
    EXPECT_EQ(given_up.words.back(), gate_refreshing);
    EXPECT_EQ(calls("RM_RestoreWWN"), 2u + 301u);
    EXPECT_EQ(slept() - before, 301s);
}

// An adapter that goes away is what a refresh shows; changed names themselves wait for their activation.
TEST(WwnServiceRefresh, IsSeenAtTheNextEnumeration)
{
    for (const bool restore : {false, true}) {
        Rig rig;
        Wwn wwn(rig);
        set_port(3, "present", 0);
        ASSERT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
        EXPECT_THAT(restore ? wwn.restore(0) : wwn.change(1), returned(0));
        rig.settle();
        EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 3u);
    }
}

TEST(WwnServiceRefresh, IsNotAskedForByReading)
{
    Rig rig;
    Wwn wwn(rig);
    rig.settle();
    const std::size_t before = rig.refreshes();
    EXPECT_THAT(wwn.read(3), returned(0));
    EXPECT_THAT(wwn.capability(), returned(0));
    EXPECT_THAT(wwn.change(2), returned(32968));
    EXPECT_THAT(wwn.restore(2), returned(32968));
    rig.settle();
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    EXPECT_EQ(rig.refreshes(), before);
}

// What the library does not treat as local is for the library to say.
TEST(WwnServiceTargets, NeedNotBeLocal)
{
    Rig rig;
    Wwn wwn(rig);
    set_port(0, "local", 0);
    const std::uint64_t before = calls("RM_IsLocalHBA");
    EXPECT_THAT(wwn.read(2), returned(0));
    add_fault(fault("RM_ReadWWN", "port = 0, status = 5"));
    EXPECT_THAT(wwn.read(2), returned(40005));
    EXPECT_EQ(calls("RM_IsLocalHBA"), before);
}

TEST(WwnServiceTargets, OfAHostWithoutLibrariesAreUnknown)
{
    Rig rig({host::Manner::strict(), "typical", {}, {"HBAAPI", "tssdm"}});
    host::Path path;
    path.name_space = "root/norvane";
    path.class_name = service_class;
    const host::Answer answer = rig.server().call(path, "GetWWNCapability");
    ASSERT_TRUE(answer.ok());
    EXPECT_EQ(answer.value, Value::uint32(32968));
    EXPECT_THAT(rig.words(), Contains(no_port_words));
}
