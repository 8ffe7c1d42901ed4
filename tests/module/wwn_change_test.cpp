// World Wide Names of ports, changed and restored: what the library answers, how long it is waited for, and which names
// are taken.
#include <cstdio>

#include <gmock/gmock.h>

#include "tests/module/support/Test_Clock.h"
#include "tests/module/support/Wwn.h"
#include "tests/support/Cases.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using namespace std::chrono_literals;

namespace {

const std::string reboot = "Reboot required to activate the new setting";
const std::string reset = "Reset required to activate the new setting";
const std::string until_power_down = "Volatile names will be active until system power-down or HBA power-cycle";
const std::string restored = "WWNs restored successfully";

/// What an activation code of the library comes to.
struct Code_Row {
    unsigned code;
    Words words;
    unsigned status;
};

/// The words of a change up to the library's answer, and behind one that was done.
Words changing(unsigned type)
{
    return joined({names_accepted(),
                   {type == 0 ? "Writing Volatile World Wide Name." : "Writing Non-Volatile World Wide Name.",
                    "ChangeWWN operation initiated"}});
}
Words changed(const Words& activation)
{
    return joined(
        {{"New WWNs written successfully"},
         activation,
         {"ChangeWWN operation completed. Please restart the CIMOM to use Norvane CIM provider", gate_refreshing}});
}
Words not_changed(unsigned status)
{
    return {"ChanngeWWN: RM_ChangeWWN call failed with error: " + std::to_string(status)};
}

/// The words of a restore up to the library's answer.
Words restoring(unsigned type)
{
    return joined(
        {opened("RestoreWWN"),
         {type == 0 ? "Restoring Factory Default World Wide Name..." : "Restoring Non-volatile World Wide Name...",
          "RestoreWWN operation initiated."}});
}

/// Has the library give each code; `told` makes the words of a call out of those of its activation.
void expect_codes(const std::string& call, const std::vector<Code_Row>& rows, Called (*ask)(Wwn& wwn),
                  Words (*told)(const Words& activation))
{
    Rig rig;
    Wwn wwn(rig);
    for (const Code_Row& row : rows) {
        clear_faults();
        add_fault(fault(call, "value = " + std::to_string(row.code)));
        const Called called = ask(wwn);
        EXPECT_THAT(called, returned(0)) << row.code;
        expect_status(called, row.status);
        EXPECT_EQ(called.words, told(row.words)) << row.code;
    }
}

} // namespace

TEST(WwnServiceChange, TellsEachActivationCode)
{
    expect_codes(
        "RM_ChangeWWN",
        {{5, {reboot, until_power_down}, 5},
         {6, {reboot}, 6},
         {7, {reset, until_power_down}, 7},
         {8, {reset}, 8},
         {0, {}, untold},
         {1, {}, untold},
         {4, {}, untold},
         {9, {}, untold},
         {97, {}, untold},
         {65541, {}, untold}},
        [](Wwn& wwn) { return wwn.change(0); },
        [](const Words& activation) {
            return joined({changing(0), changed(activation)});
        });
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
        Words reason;
        if (status == 92) reason = {"WWN Management is not available on this HBA"};
        if (status == 89) reason = {"WWN NOT SUPPORTED"};
        EXPECT_EQ(called.words, joined({changing(1), reason, not_changed(status)}));
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
    EXPECT_EQ(called.words, joined({changing(1), {"Validating new WWNs..."}, changed({reset})}));
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
    EXPECT_EQ(called.words, joined({changing(0), {"Validating new WWNs..."}, not_changed(97)}));
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

    // Any other answer is no refusal, nor is none.
    clear_faults();
    add_fault(fault("RM_ValidateWwn", "status = 4"));
    EXPECT_THAT(wwn.change(1), returned(0));
    for (unsigned status = 1; status <= 260; status++) {
        clear_faults();
        add_fault(fault("RM_ValidateWwn", "status = " + std::to_string(status)));
        add_fault(fault("RM_ChangeWWN", "status = 255"));
        EXPECT_THAT(wwn.change(1), returned(status == 5 ? 40005 : 40255)) << status;
    }
    clear_faults();
    add_fault(fault("RM_ValidateWwn", "absent = true"));
    EXPECT_THAT(wwn.change(1), returned(0));
}

TEST(WwnServiceChange, IsNotDoneByALibraryWithoutTheCall)
{
    Rig rig({host::Manner::strict(), "small"});
    Wwn wwn(rig);
    add_fault(fault("RM_ChangeWWN", "absent = true"));
    const Called called = wwn.change(1);
    EXPECT_THAT(called, returned(40001));
    expect_status(called, untold);
    EXPECT_EQ(called.words, joined({changing(1), not_changed(1)}));
}

// No answer is a failure, wherever the exception came from; behind an answer, that one stands.
TEST(WwnServiceChange, SurvivesWhatTheLibraryThrows)
{
    Rig rig({host::Manner::strict(), "small"});
    Wwn wwn(rig);
    const Words error = {"Error in RM_ChangeWWN"};
    for (const char* call : {"RM_ValidateWwn", "RM_GetNumberOfLocalAdapters", "RM_GetLocalHBAInfo", "RM_VPList"}) {
        clear_faults();
        add_fault(fault(call, "throws = true"));
        const Called called = wwn.change(1);
        EXPECT_THAT(called, returned(40001)) << call;
        expect_status(called, untold);
        EXPECT_EQ(called.words,
                  joined({names_accepted(), {"Writing Non-Volatile World Wide Name."}, error, not_changed(1)}))
            << call;
    }
    EXPECT_EQ(calls("RM_ChangeWWN"), 0u);
    clear_faults();
    add_fault(fault("RM_ChangeWWN", "throws = true"));
    const Called thrown = wwn.change(1);
    EXPECT_THAT(thrown, returned(40001));
    EXPECT_EQ(thrown.words, joined({changing(1), error, not_changed(1)}));
    clear_faults();
    add_fault(fault("RM_ChangeWWN", "status = 97, times = 2"));
    add_fault(fault("RM_ChangeWWN", "throws = true"));
    const Called busy = wwn.change(1);
    EXPECT_THAT(busy, returned(40097));
    EXPECT_EQ(busy.words, joined({changing(1), {"Validating new WWNs..."}, error, not_changed(97)}));
    clear_faults();
    EXPECT_THAT(wwn.change(1), returned(0));
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

TEST(WwnServiceDuplicates, AreNotSearchedInAListThatIsNeverLongEnough)
{
    Rig rig({host::Manner::strict(), host_with_vports(3)});
    Wwn wwn(rig);
    add_fault(fault("RM_VPList", "status = 7, value = 2"));
    add_fault(fault("RM_ChangeWWN", "status = 1")); // so that no refresh lists them too
    const std::uint64_t listed = calls("RM_VPList");
    EXPECT_THAT(wwn.change(1, first_vport, new_wwnn), returned(40001));
    EXPECT_EQ(calls("RM_VPList"), listed + 4); // twice for each of two ports
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
    expect_codes(
        "RM_RestoreWWN",
        {{1, {"WWNs already active. No Restore needed"}, 1},
         {5, {restored, reboot, until_power_down}, 5},
         {6, {restored, reboot}, 6},
         {7, {restored, "Reset the HBA to activate the new setting", until_power_down}, 7},
         {8, {restored, "Please reset the HBA to activate the new setting"}, 8},
         {0, {}, untold},
         {2, {}, untold},
         {9, {}, untold},
         {65537, {}, untold}},
        [](Wwn& wwn) { return wwn.restore(1); },
        [](const Words& activation) {
            return joined({restoring(1), activation, {gate_refreshing}});
        });
}

TEST(WwnServiceRestore, TakesEveryRefusalOfTheLibraryForDone)
{
    Rig rig({host::Manner::strict(), "small"});
    Wwn wwn(rig);
    const auto before = slept();
    const unsigned each = each_of_cases(1, 20);
    for (unsigned status = 1; status <= 260; status += each) {
        if (status == 97) continue;
        clear_faults();
        add_fault(fault("RM_RestoreWWN", "status = " + std::to_string(status)));
        const Called called = wwn.restore(0);
        EXPECT_THAT(called, returned(0));
        expect_status(called, untold);
        EXPECT_EQ(called.words, joined({restoring(0), {gate_refreshing}})) << status;
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
              joined({restoring(0), {"Restoring WWNs...", "WWNs already active. No Restore needed", gate_refreshing}}));
    EXPECT_EQ(slept() - before, 1s);
    add_fault(fault("RM_RestoreWWN", "status = 97"));
    const Called given_up = wwn.restore(0);
    EXPECT_THAT(given_up, returned(0));
    expect_status(given_up, untold);
    EXPECT_EQ(given_up.words.back(), gate_refreshing);
    EXPECT_EQ(calls("RM_RestoreWWN"), 2u + 301u);
    EXPECT_EQ(slept() - before, 301s);
}

TEST(WwnServiceRestore, TakesWhatTheLibraryThrowsOrLacksForDone)
{
    Rig rig({host::Manner::strict(), "small"});
    Wwn wwn(rig);
    const struct {
        std::vector<std::string> faults;
        Words words;
    } rows[] = {
        {{"throws = true"}, {"Error in RestoreWWN", gate_refreshing}},
        {{"status = 97, times = 2", "throws = true"}, {"Restoring WWNs...", "Error in RestoreWWN", gate_refreshing}},
        {{"absent = true"}, {gate_refreshing}},
    };
    for (const auto& row : rows) {
        clear_faults();
        for (const std::string& what : row.faults)
            add_fault(fault("RM_RestoreWWN", what));
        const Called called = wwn.restore(0);
        EXPECT_THAT(called, returned(0)) << row.faults.back();
        expect_status(called, untold);
        EXPECT_EQ(called.words, joined({restoring(0), row.words})) << row.faults.back();
    }
}
