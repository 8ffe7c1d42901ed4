// World Wide Names of ports: what the service takes and refuses, and how it reads.
#include <gmock/gmock.h>

#include "tests/module/support/Wwn.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Value;
using testing::Contains;
using testing::IsEmpty;

namespace {

constexpr char no_port_words[] = "NVRHBA_FCHBAWWNService_Provider invald port ...return";

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
    Service service(rig, wwn_service_class);
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
    Service service(rig, wwn_service_class);
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
    Service service(rig, wwn_service_class);
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
    Service service(rig, wwn_service_class);
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

// The server is told of the exception; nothing stays locked behind it.
TEST(WwnServiceReading, FailsWhereTheLibraryThrowsOrLacksTheCall)
{
    Rig rig({host::Manner::strict(), "small"});
    Wwn wwn(rig);
    add_fault(fault("RM_ReadWWN", "throws = true"));
    add_fault(fault("RM_GetWWNCapability", "throws = true"));
    EXPECT_THAT(wwn.read(2).answer, failed_with(CMPI_RC_ERR_FAILED));
    EXPECT_THAT(wwn.capability().answer, failed_with(CMPI_RC_ERR_FAILED));
    clear_faults();
    add_fault(fault("RM_ReadWWN", "absent = true"));
    add_fault(fault("RM_GetWWNCapability", "absent = true"));
    EXPECT_THAT(wwn.read(2), returned(40001));
    EXPECT_THAT(wwn.capability(), returned(40001));
    clear_faults();
    EXPECT_THAT(wwn.read(2), returned(0));
    EXPECT_THAT(wwn.capability(), returned(0));
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
    path.class_name = wwn_service_class;
    const host::Answer answer = rig.server().call(path, "GetWWNCapability");
    ASSERT_TRUE(answer.ok());
    EXPECT_EQ(answer.value, Value::uint32(32968));
    EXPECT_THAT(rig.words(), Contains(no_port_words));
}
