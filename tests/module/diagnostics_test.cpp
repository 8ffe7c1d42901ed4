// The diagnostics as a management client meets them: runs, jobs, records, help and logs through the module's factories.
#include <algorithm>
#include <atomic>
#include <chrono>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/module/support/Service.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

namespace {

constexpr char beacon[] = "NVR:FCHBA Beacon Test";
constexpr char echo[] = "NVR:FCHBA Echo Test";
constexpr char external[] = "NVR:FCHBA External Loopback Test";
constexpr char host_loopback[] = "NVR:FCHBA Host Loopback Test";
constexpr char internal[] = "NVR:FCHBA Internal Loopback Test";
constexpr char ping[] = "NVR:FCHBA Ping Test";
constexpr char status[] = "NVR:FCHBA Status Test";
constexpr char reset[] = "NVR:FCHBA Reset Test";
constexpr char self[] = "NVR:FCHBA Self Test";
constexpr char target[] = "50060E8005A10000";

// One port on a fabric with a target, one with a loopback plug.
constexpr char two_ports[] = R"(
[[adapter]]
[[adapter]]
[[adapter.port]]
loopback_plug = true
[[target]]
)";

const std::string entry = "NVRHBA_FCHBADiagnosticTest_Provider::RunDiagnosticService";
const std::string using_given = "Using the overrided values if valid, else default settings values are used";

host::Value controller(Rig& rig, std::size_t place = 0)
{
    return host::Value::reference(rig.names("NVRHBA_PortController").paths.at(place));
}

using Properties = std::vector<host::Named_Value>;

/// A client's settings of a test, as an instance within the request.
host::Value settings_of(const char* test, const Properties& properties,
                        const char* class_name = "NVRHBA_FCHBADiagnosticSettingData")
{
    host::Instance instance;
    instance.path.name_space = "root/norvane";
    instance.path.class_name = class_name;
    instance.set("InstanceID", host::Value::string(test));
    for (const host::Named_Value& property : properties)
        instance.set(property.name, property.value);
    return host::Value::instance(instance);
}

host::Value job_settings(bool deletes, const char* id = "NVR:FCHBA JobSettingData")
{
    return settings_of(id, {{"DeleteOnCompletion", host::Value::boolean(deletes)}}, "NVRHBA_JobSettingData");
}

host::Value strings(const std::vector<std::string>& texts)
{
    std::vector<host::Value> elements;
    for (const std::string& text : texts)
        elements.push_back(host::Value::string(text));
    return host::Value::array(CMPI_string, elements);
}

host::Value numbers(CMPIType type, const std::vector<std::uint64_t>& values)
{
    std::vector<host::Value> elements;
    for (const std::uint64_t value : values)
        elements.push_back(host::Value::integer(type, value));
    return host::Value::array(type, elements);
}

host::Value pattern(const std::string& text)
{
    std::vector<std::uint64_t> bytes;
    for (const char c : text)
        bytes.push_back(static_cast<unsigned char>(c));
    return numbers(CMPI_uint8, bytes);
}

host::Value target_device(const char* wwpn)
{
    return host::Value::string(wwpn);
}

/// Runs a test on the first port, or on another.
Called run(Rig& rig, const char* test, const Arguments& more = {}, std::size_t place = 0)
{
    Arguments arguments = {{"ManagedElement", controller(rig, place)}};
    arguments.insert(arguments.end(), more.begin(), more.end());
    return Service(rig, "NVRHBA_FCHBADiagnosticTest", test).call("RunDiagnosticService", arguments);
}

std::string job_id(const Called& called)
{
    const host::Path* path = called.out("Job").as_path();
    if (!path) return "no job";
    const host::Value* key = path->find("InstanceID");
    return path->class_name + ' ' + (key ? key->as_text() : "without a key");
}

std::string job_of(const char* test, int number, int id)
{
    return "NVRHBA_ConcreteJob " + std::string(test) + ':' + std::to_string(number) + ':' + std::to_string(id);
}

std::vector<std::string> texts(const host::Answer& answer, const char* property)
{
    std::vector<std::string> all;
    for (const host::Instance& instance : answer.instances)
        all.push_back(instance.get(property).to_text());
    return all;
}

host::Instance setting(Rig& rig, const char* test)
{
    for (const host::Instance& one : rig.enumerate("NVRHBA_FCHBADiagnosticSettingData").instances)
        if (one.get("InstanceID").as_text() == test) return one;
    throw std::runtime_error("no such setting");
}

std::string newest_test(const char* port)
{
    char text[256] = {};
    nvrsim_get(port, "test", text, sizeof text);
    return text;
}

/// The words of the opening with the default settings, up to the start of the test.
Words opening(const char* test)
{
    return joined(
        {{entry, gate, std::string("Device ID ") + first_port + " and the status 0"},
         converted(first_port),
         {"Using the default NVRHBA_JobSettingData Instance",
          "Using default NVRHBA_FCHBADiagnosticSettingData Instance", std::string("Started Diagnostic : ") + test}});
}

Words records_left()
{
    const std::string port = std::string("PortController : ") + first_port;
    return {"NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking()",
            "NVR_Diagnostics::CreateDiagnosticServiceRecord", port, "NVR_Diagnostics::CreateDiagnosticCompletionRecord",
            port};
}

} // namespace

class DiagnosticRuns : public Every_Manner {
protected:
    Rig rig{{*GetParam(), two_ports}};

    void expect_clean()
    {
        EXPECT_THAT(rig.server().report().violations, IsEmpty());
        EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
    }
};
NVR_IN_EVERY_MANNER(DiagnosticRuns);

TEST_P(DiagnosticRuns, AllNineLeaveAJobAndTwoRecords)
{
    const Arguments to_target = {{"DiagnosticSettings", settings_of(echo, {{"TargetDevice", target_device(target)}})}};
    const Arguments ping_target = {
        {"DiagnosticSettings", settings_of(ping, {{"TargetDevice", target_device(target)}})}};
    const struct {
        const char* test;
        Arguments more;
        std::size_t port;
        int id;
    } rows[] = {{beacon, {}, 0, 65535}, {status, {}, 0, 65535},    {reset, {}, 0, 65535},
                {self, {}, 0, 1},       {external, {}, 1, 1},      {host_loopback, {}, 0, 2},
                {internal, {}, 0, 3},   {ping, ping_target, 0, 4}, {echo, to_target, 0, 5}};
    int number = 0;
    for (const auto& row : rows) {
        const Called called = run(rig, row.test, row.more, row.port);
        EXPECT_THAT(called, returned(0)) << row.test;
        EXPECT_EQ(job_id(called), job_of(row.test, ++number, row.id));
        EXPECT_EQ(called.words.back(), row.more.empty() ? std::string(row.test) + " Launched/Completed Succesful"
                                                        : "Adding the embedded instance for Settingdatarecord : " +
                                                              std::string(row.test) + ':' + std::to_string(number) +
                                                              ':' + std::to_string(row.id) + ":SettingData Record");
    }
    const host::Answer records = rig.enumerate("NVRHBA_DiagnosticCompletionRecord");
    EXPECT_EQ(texts(records, "CompletionState"), std::vector<std::string>(9, "2"));
    EXPECT_EQ(texts(rig.enumerate("NVRHBA_ConcreteJob"), "JobState"), std::vector<std::string>(9, "7"));
    EXPECT_EQ(rig.enumerate("NVRHBA_DiagnosticServiceRecord").instances.size(), 9u);
    EXPECT_EQ(rig.enumerate("NVRHBA_DiagnosticSettingDataRecord").instances.size(), 2u);
    EXPECT_EQ(rig.enumerate("NVRHBA_LogManagesRecord").instances.size(), 20u);
    EXPECT_EQ(rig.enumerate("NVRHBA_CorrespondingSettingDataRecord").instances.size(), 4u);
    EXPECT_EQ(rig.enumerate("NVRHBA_OwningJobElement").instances.size(), 9u);
    EXPECT_EQ(rig.enumerate("NVRHBA_AffectedJobElement").instances.size(), 9u);
    EXPECT_EQ(rig.enumerate("NVRHBA_RecordAppliesToElement").instances.size(), 18u);
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(DiagnosticRuns, SayEachStepInOrder)
{
    Service(rig, "NVRHBA_FCHBADiagnosticTest", internal); // the provider is loaded
    run(rig, status);
    const auto before = slept();
    const Called called = run(rig, internal);
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(slept() - before, std::chrono::seconds(2));
    EXPECT_EQ(called.words,
              joined({opening(internal),
                      {"NVR_Diagnostics::LoopBackTest", internal, "Number of test cycles set to run : 100 ",
                       "HaltOnError value : 0 ", "The Input pattern used for testing 1a2b3c4d",
                       "Polling for the results.. ", "Polling for the results.. "},
                      records_left(),
                      {std::string(internal) + " Launched/Completed Succesful"}}));
    expect_clean();
}

TEST_P(DiagnosticRuns, OverridesAreToldTwiceKeptAndRecorded)
{
    const host::Value given = settings_of(internal, {{"LoopControl", numbers(CMPI_uint16, {3})},
                                                     {"LoopControlParameter", strings({"7"})},
                                                     {"HaltOnError", host::Value::boolean(true)},
                                                     {"BufferSizes", numbers(CMPI_uint32, {6})},
                                                     {"BufferPattern", pattern("aB")}});
    const Called called = run(rig, internal, {{"DiagnosticSettings", given}});
    EXPECT_THAT(called, returned(0));
    const Words line = {"Input LoopControl : 3", "Input LoopControlParam : 7", "Input Buffer Size : 6"};
    const std::string id = std::string(internal) + ":1:1";
    EXPECT_EQ(called.words,
              joined({{entry, gate, std::string("Device ID ") + first_port + " and the status 0"},
                      converted(first_port),
                      {"Using the default NVRHBA_JobSettingData Instance", "Entered embedded instance", using_given},
                      line,
                      {"Valid Pattern entered"},
                      line,
                      {std::string("Started Diagnostic : ") + internal, "NVR_Diagnostics::LoopBackTest", internal,
                       "Number of test cycles set to run : 7 ", "HaltOnError value : 1 ",
                       "The Input pattern used for testing aB0000", "Polling for the results.. ",
                       "Polling for the results.. "},
                      records_left(),
                      {std::string(internal) + " Launched/Completed Succesful",
                       "Adding the embedded instance for Settingdatarecord : " + id + ":SettingData Record"}}));
    EXPECT_EQ(newest_test("0"), "loopback cycles=7 halt=1 pattern=aB0000");

    // What the run was set to stands in its record, whole.
    const host::Answer records = rig.enumerate("NVRHBA_DiagnosticSettingDataRecord");
    ASSERT_THAT(records.instances, SizeIs(1));
    EXPECT_EQ(records.instances[0].get("Caption").as_text(), id);
    const host::Instance* recorded = records.instances[0].get("Settings").as_instance();
    ASSERT_TRUE(recorded) << records.instances[0].to_text();
    EXPECT_EQ(recorded->path.class_name, "NVRHBA_FCHBADiagnosticSettingData");
    EXPECT_EQ(recorded->get("InstanceID").as_text(), internal);
    EXPECT_EQ(recorded->get("LoopControlParameter").to_text(), "{7}");
    EXPECT_EQ(recorded->get("BufferPattern").to_text(), "{97, 66, 48, 48, 48, 48}");
    EXPECT_EQ(recorded->get("HaltOnError").to_text(), "true");
    EXPECT_EQ(recorded->get("OverridedSettingData").to_text(), "1");

    // They stay in force for the next run, which counts as one with overrides, and do not reach the older record.
    run(rig, internal);
    EXPECT_EQ(newest_test("0"), "loopback cycles=7 halt=1 pattern=aB0000");
    EXPECT_THAT(
        run(rig, internal, {{"DiagnosticSettings", settings_of(internal, {{"LoopControlParameter", strings({"8"})}})}}),
        returned(0));
    const host::Answer later = rig.enumerate("NVRHBA_DiagnosticSettingDataRecord");
    ASSERT_THAT(later.instances, SizeIs(3));
    const char* const cycles[] = {"{7}", "{7}", "{8}"};
    for (std::size_t i = 0; i < 3; i++)
        EXPECT_EQ(later.instances[i].get("Settings").as_instance()->get("LoopControlParameter").to_text(), cycles[i]);
    EXPECT_EQ(setting(rig, internal).get("OverridedSettingData").to_text(), "1");
    EXPECT_EQ(setting(rig, host_loopback).get("LoopControlParameter").to_text(), "{100}") << "of this test alone";
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(DiagnosticRuns, EmbeddedInstancesComeWithOrWithoutKeysInTheirPath)
{
    for (const bool has_keys : {false, true}) {
        host::Instance given = *settings_of(internal, {{"HaltOnError", host::Value::boolean(true)}}).as_instance();
        if (has_keys) given.path.set("InstanceID", host::Value::string(internal));
        const Called called = run(rig, internal, {{"DiagnosticSettings", host::Value::instance(given)}});
        EXPECT_THAT(called, returned(0));
        EXPECT_THAT(called.words, Contains("HaltOnError value : 1 "));
    }
}

TEST_P(DiagnosticRuns, BadOverridesAreToldAndTheDefaultsStay)
{
    const Words refusals = {"Invalid LoopControl, Valid value is '3'. Using the default value",
                            "Invalid LoopControlParam, Valid value range[1-4000]. Using the default value",
                            "Invalid BufferSizes, Valid value is '<8'. Using the default value",
                            "Invalid BufferPattern, Use hex values. Using the default value"};
    const struct {
        Properties given;
        std::size_t refused; // lines, of both readings
    } rows[] = {
        {{{"LoopControl", numbers(CMPI_uint16, {65535})}}, 2},
        {{{"LoopControlParameter", strings({std::string(100000, '9')})}}, 2},
        {{{"LoopControlParameter", strings({"-1"})}}, 2},
        {{{"BufferSizes", numbers(CMPI_uint32, {4294967295})}}, 2},
        {{{"BufferPattern", pattern(std::string(10000, 'g'))}}, 2},
        {{{"BufferPattern", pattern(std::string(3, '\0'))}}, 2},
        // Empty arrays are none at all.
        {{{"LoopControl", numbers(CMPI_uint16, {})},
          {"LoopControlParameter", strings({})},
          {"BufferSizes", numbers(CMPI_uint32, {})}},
         0},
        {{{"LoopControl", host::Value::null_of(CMPI_uint16A)}, {"HaltOnError", host::Value::null_of(CMPI_boolean)}}, 0},
    };
    for (const auto& row : rows) {
        const Called called = run(rig, internal, {{"DiagnosticSettings", settings_of(internal, row.given)}});
        EXPECT_THAT(called, returned(0));
        std::size_t refused = 0;
        for (const std::string& word : called.words)
            refused += std::count(refusals.begin(), refusals.end(), word);
        EXPECT_EQ(refused, row.refused);
        EXPECT_EQ(newest_test("0"), "loopback cycles=100 halt=0 pattern=1a2b3c4d");
    }
    run(rig, internal,
        {{"DiagnosticSettings", settings_of(internal, {{"BufferPattern", pattern(std::string(10000, 'f'))}})}});
    EXPECT_EQ(newest_test("0"), "loopback cycles=100 halt=0 pattern=ffffffff");
    run(rig, internal, {{"DiagnosticSettings", settings_of(internal, {{"BufferPattern", pattern("")}})}});
    EXPECT_EQ(newest_test("0"), "loopback cycles=100 halt=0 pattern=00000000");
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(DiagnosticRuns, TargetsAreNamesOfSixteenCharacters)
{
    const std::string refused = "Invalid TargetDevice, Enter Target WWPN";
    for (const char* test : {echo, ping}) {
        Called called = run(rig, test);
        EXPECT_THAT(called, returned(5)) << "none is the default";
        EXPECT_EQ(called.words.back(), refused);
        EXPECT_EQ(job_id(called), "no job");
        for (const char* wwpn : {"50060E8005A1000", "50060E8005A100000", ""}) {
            called =
                run(rig, test, {{"DiagnosticSettings", settings_of(test, {{"TargetDevice", target_device(wwpn)}})}});
            EXPECT_THAT(called, returned(5)) << wwpn;
            EXPECT_EQ(called.words.back(), refused);
        }
        called =
            run(rig, test,
                {{"DiagnosticSettings", settings_of(test, {{"TargetDevice", target_device("no name of 16...")}})}});
        EXPECT_THAT(called, returned(40001));
        EXPECT_THAT(called.words, Contains("NVR_Diagnostics::EchoTest::str2HBAName failed"));
        EXPECT_EQ(called.words.back(), std::string(test) + " Failed to Run");
        called = run(rig, test, {{"DiagnosticSettings", settings_of(test, {{"TargetDevice", target_device(target)}})}});
        EXPECT_THAT(called, returned(0));
        EXPECT_EQ(newest_test("0"), std::string("echo cycles=100 halt=0 pattern=1a2b3c4d target=") + target);
    }
}

TEST_P(DiagnosticRuns, JobsThatAreToGoAreGoneAndTheirRecordsStay)
{
    Called called = run(rig, status, {{"JobSettings", job_settings(true)}});
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(job_id(called), "no job");
    EXPECT_THAT(called.words, contains_in_order({using_given, "NVRHBA_DiagTestFunc::DeleteConcreteJob()",
                                                 std::string(status) + " Launched/Completed Succesful"}));
    EXPECT_THAT(rig.enumerate("NVRHBA_ConcreteJob").instances, IsEmpty());
    EXPECT_THAT(rig.enumerate("NVRHBA_OwningJobElement").instances, IsEmpty());
    EXPECT_THAT(texts(rig.enumerate("NVRHBA_DiagnosticCompletionRecord"), "InstanceID"),
                ElementsAre(std::string(status) + ":1:65535"));
    // The setting is shared by all tests, and changed for good.
    EXPECT_EQ(job_id(run(rig, internal)), "no job");
    EXPECT_EQ(job_id(run(rig, status, {{"JobSettings", job_settings(false)}})), job_of(status, 3, 65535));
    EXPECT_EQ(job_id(run(rig, internal)), job_of(internal, 4, 2));
}

TEST_P(DiagnosticRuns, WhatIsNotTheirsIsRefused)
{
    const std::string no_settings = "Unable to get the Job/Diagnostic SettingData, Not able to continue";
    const std::string no_job_settings = "Invalid input instance: NVRHBA_JobSettingData";
    const std::string no_test_settings = "Invalid input instance: NVRHBA_FCHBADiagnosticSettingData";
    // Settings of other tests and other jobs, and instances of base classes.
    const struct {
        Arguments more;
        Words words;
    } rows[] = {
        {{{"DiagnosticSettings", settings_of(echo, {})}}, {"Entered embedded instance", no_test_settings, no_settings}},
        {{{"DiagnosticSettings", settings_of("nvr:fchba internal loopback test", {})}},
         {"Entered embedded instance", no_test_settings, no_settings}},
        {{{"DiagnosticSettings", settings_of(internal, {}, "CIM_FCHBADiagnosticSettingData")}},
         {"Entered embedded instance", "Invalid overrided Diagsetting param, default settings values are used",
          no_test_settings, no_settings}},
        {{{"JobSettings", job_settings(true, "another")}}, {no_job_settings, no_settings}},
        {{{"JobSettings", settings_of("NVR:FCHBA JobSettingData", {}, "CIM_JobSettingData")}},
         {no_job_settings, no_settings}},
    };
    for (const auto& row : rows) {
        const Called called = run(rig, internal, row.more);
        EXPECT_THAT(called, returned(5));
        EXPECT_THAT(called.words, contains_in_order(row.words));
        EXPECT_EQ(called.words.back(), no_settings);
        EXPECT_EQ(job_id(called), "no job");
    }
    EXPECT_EQ(setting(rig, internal).get("OverridedSettingData").to_text(), "0");
    // An instance that is no setting at all never arrives: the run takes the defaults.
    const Called foreign =
        run(rig, internal, {{"DiagnosticSettings", settings_of(internal, {}, "NVRHBA_JobSettingData")}});
    EXPECT_THAT(foreign, returned(0));
    EXPECT_THAT(foreign.words, Contains("Using default NVRHBA_FCHBADiagnosticSettingData Instance"));
}

TEST_P(DiagnosticRuns, NeedATestAndAPortControllerThatTheModuleKnows)
{
    Service test(rig, "NVRHBA_FCHBADiagnosticTest", status);
    const std::string no_test = "Invalid instance: NVRHBA_FCHBADiagnosticTest";
    const std::string no_port = "Invalid instance: NVRHBA_PortController";
    for (const char* name : {"NVR:FCHBA Status Tes", "NVR:FCHBA Status Test ", "nvr:fchba status test", ""}) {
        host::Path path = test.path();
        path.set("Name", host::Value::string(name));
        const Called called = test.call_on(path, "RunDiagnosticService", {{"ManagedElement", controller(rig)}});
        EXPECT_THAT(called, returned(5)) << name;
        EXPECT_EQ(called.words, (Words{entry, gate, no_test}));
    }
    host::Path unknown = *controller(rig).as_path();
    unknown.set("DeviceID", host::Value::string("10000000C9FFFFFF"));
    for (const host::Value& element : {host::Value::null_of(CMPI_ref), port(rig), host::Value::reference(test.path()),
                                       host::Value::reference(unknown)}) {
        const Called called = test.call("RunDiagnosticService", {{"ManagedElement", element}});
        EXPECT_THAT(called, returned(5));
        EXPECT_EQ(called.words, (Words{entry, gate, no_port}));
    }
    EXPECT_THAT(test.call("RunDiagnosticService"), returned(5)) << "nothing at all";
    EXPECT_THAT(test.call("RUNDIAGNOSTICSERVICE", {{"managedelement", controller(rig)}}), returned(0))
        << "names in any case";
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(DiagnosticRuns, FailuresAtTheAdapterAreRecordsAndFailuresOfTheRunAreNumbers)
{
    // Carried out, and failed.
    add_fault("call = \"RM_DiagBeaconState\", status = 63");
    Called called = run(rig, beacon);
    EXPECT_THAT(called, returned(40063));
    EXPECT_EQ(job_id(called), job_of(beacon, 1, 65535)) << "a job and a failure";
    EXPECT_EQ(called.words.back(), std::string(beacon) + " Failed to Run");
    clear_faults();
    called = run(rig, external);
    EXPECT_THAT(called, returned(40001)) << "there is no plug, and a target";
    EXPECT_EQ(job_id(called), "no job");
    add_fault("call = \"RM_ResetHBA\", status = 64");
    EXPECT_THAT(run(rig, reset), returned(40064));
    clear_faults();
    add_fault("call = \"RM_DiagRunPOST\", status = 62");
    EXPECT_THAT(run(rig, self), returned(40062));
    clear_faults();
    nvrsim_set("0", "enabled", 0);
    called = run(rig, self);
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(job_id(called), "no job");
    nvrsim_set("0", "enabled", 1);
    add_fault("call = \"RM_DiagGetResults\", damage = \"ones\", status = 0");
    called = run(rig, self);
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(job_id(called), "no job");
    add_fault("call = \"RM_DiagGetResults\", damage = \"garbage\"");
    run(rig, self);
    clear_faults();
    EXPECT_THAT(run(rig, self), returned(0));
    expect_clean();
}

// Every way from poll to poll, with what the client gets of it and how long it waited.
TEST(DiagnosticPolls, EndInAJobOrInANumber)
{
    const std::string never = "polls = 100000";
    const struct {
        std::string adapter;   // how it answers polls
        std::string fault;     // of the library
        std::uint64_t value;   // of the method
        bool has_job;          //
        long long seconds;     // slept
        std::uint64_t cancels; // asked
    } rows[] = {
        {"polls = 0", "", 0, true, 1, 0},
        {"polls = 1, running_status = 0", "", 0, true, 2, 0},
        {"polls = 120", "", 0, true, 121, 0}, // the last one in time
        {"polls = 120, running_state = 2", "", 0, true, 121, 0},
        {"polls = 121, running_state = 0", "", 0, true, 122, 0}, // and without a state
        // Cancels that work, at once and after a while.
        {"polls = 121", "", 40060, false, 122, 1},
        {never + ", running_state = 2", "", 40060, false, 122, 1},
        {never + ", running_status = 0", "", 0, false, 122, 1},
        {never + ", running_state = 2, running_status = 0", "", 0, false, 122, 1},
        {never + ", cancel_polls = 5", "", 40060, false, 127, 6},
        // One that fails, with the test going on and with its end, and one that times out.
        {never + ", can_cancel = false", "", 40060, false, 244, 122},
        {"polls = 121, can_cancel = false", "", 0, true, 244, 122},
        {never + ", cancel_polls = 100000", "", 40060, false, 244, 122},
        {never + ", cancel_polls = 100000, running_status = 0", "", 0, false, 243, 122},
        // No state that a running test has.
        {never + ", running_state = 0", "", 40060, false, 122, 0},
        {never + ", running_state = 3", "", 40060, false, 122, 0},
        {never + ", running_state = 0, running_status = 0", "", 0, false, 1, 0},
        {"polls = 0, state = 5", "", 0, false, 1, 0},
        {"polls = 0, state = 7", "", 0, false, 1, 0},
        {"polls = 0, state = 4294967295", "", 0, false, 1, 0},
        // Other statuses, at the first poll and later.
        {"polls = 3", "call = \"RM_DiagGetResults\", status = 1", 40001, false, 1, 0},
        {"polls = 3", "call = \"RM_DiagGetResults\", from = 2, status = 62", 40062, false, 2, 0},
        {"polls = 3", "call = \"RM_DiagGetResults\", from = 3, status = 4294967295", 39999, false, 3, 0},
        {"polls = 0", "call = \"RM_DiagGetResults\", damage = \"ones\"", 0, false, 1, 0},
    };
    const char* const tests[] = {internal, self, ping}; // which share the course of their polls
    std::size_t turn = 0;
    int jobs = 0; // they are counted for as long as the module is there
    for (const auto& row : rows) {
        const char* test = tests[turn++ % 3];
        SCOPED_TRACE(row.adapter + "; " + row.fault + "; " + test);
        Rig rig({host::Manner::strict(),
                 "[[adapter]]\n[[adapter.port]]\ndiagnostics = { " + row.adapter + " }\n[[target]]\n"});
        Arguments more;
        if (test == ping) more = {{"DiagnosticSettings", settings_of(ping, {{"TargetDevice", target_device(target)}})}};
        if (!row.fault.empty()) add_fault(row.fault);
        const auto before = slept();
        const Called called = run(rig, test, more);
        EXPECT_THAT(called, returned(row.value));
        EXPECT_EQ(job_id(called), row.has_job ? job_of(test, ++jobs, 1) : "no job");
        EXPECT_EQ(slept() - before, std::chrono::seconds(row.seconds));
        EXPECT_EQ(calls("RM_DiagCancelDiagnostic"), row.cancels);
        EXPECT_THAT(called.words,
                    Contains(std::string(test) + (row.value ? " Failed to Run" : " Launched/Completed Succesful")));
        EXPECT_EQ(rig.enumerate("NVRHBA_DiagnosticServiceRecord").instances.size(), row.has_job ? 1u : 0u);
        EXPECT_EQ(rig.enumerate("NVRHBA_ConcreteJob").instances.size(), row.has_job ? 1u : 0u);
        clear_faults();
    }
}

// The tests wait for each other, and readers see each job with its records.
TEST(DiagnosticThreads, RunsFromManyThreadsAreOneAfterTheOther)
{
    Rig rig({host::Manner::strict(), "typical"});
    constexpr unsigned threads = 4, runs = 8;
    const std::vector<host::Path> ports = rig.names("NVRHBA_PortController").paths;
    const std::vector<host::Path> tests = rig.names("NVRHBA_FCHBADiagnosticTest").paths;
    const host::Path log = rig.names("NVRHBA_DiagnosticsLog").paths.at(6);
    ASSERT_EQ(log.find("InstanceID")->as_text(), status);
    ASSERT_THAT(ports, SizeIs(threads));
    std::mutex mutex;
    std::vector<std::string> jobs;
    std::atomic<bool> goes_on{true};
    std::vector<std::thread> all;
    for (unsigned thread = 0; thread < threads; thread++)
        all.emplace_back([&, thread] {
            for (unsigned i = 0; i < runs; i++) {
                const host::Path& test = tests.at(i % 2 ? 4 : 8); // internal loopback, self test
                Called called;
                called.answer = rig.server().call(test, "RunDiagnosticService",
                                                  {{"ManagedElement", host::Value::reference(ports.at(thread))}});
                EXPECT_THAT(called, returned(0));
                const std::lock_guard<std::mutex> lock(mutex);
                jobs.push_back(job_id(called));
            }
        });
    std::thread reader([&] {
        while (goes_on) {
            const auto jobs_seen = rig.enumerate("NVRHBA_ConcreteJob").instances.size();
            const auto records_seen = rig.enumerate("NVRHBA_DiagnosticCompletionRecord").instances.size();
            EXPECT_GE(records_seen, jobs_seen);
            EXPECT_THAT(rig.server().call(log, "ClearLog"), succeeded());
        }
    });
    for (std::thread& thread : all)
        thread.join();
    goes_on = false;
    reader.join();
    std::sort(jobs.begin(), jobs.end());
    EXPECT_EQ(std::unique(jobs.begin(), jobs.end()), jobs.end()) << "a job came twice";
    EXPECT_THAT(jobs, SizeIs(threads * runs));
    EXPECT_THAT(rig.enumerate("NVRHBA_ConcreteJob").instances, SizeIs(threads * runs));
    EXPECT_THAT(rig.enumerate("NVRHBA_LogManagesRecord").instances, SizeIs(2 * threads * runs));
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST(DiagnosticThreads, RunsMeetRebuilds)
{
    Rig rig({host::Manner::strict(), "typical", refreshing_settings});
    const host::Path port = rig.names("NVRHBA_PortController").paths.at(0);
    const host::Path test = rig.names("NVRHBA_FCHBADiagnosticTest").paths.at(4);
    std::atomic<bool> goes_on{true};
    std::vector<std::thread> all;
    for (int thread = 0; thread < 2; thread++)
        all.emplace_back([&] {
            const host::Value given = settings_of(internal, {{"LoopControlParameter", strings({"7"})}});
            while (goes_on) {
                // In the middle of a rebuild there may be no such test.
                const host::Answer answer = rig.server().call(
                    test, "RunDiagnosticService",
                    {{"ManagedElement", host::Value::reference(port)}, {"DiagnosticSettings", given}});
                ASSERT_THAT(answer, succeeded());
                EXPECT_THAT(answer.value.as_uint(), testing::AnyOf(0u, 5u));
            }
        });
    for (int round = 0; round < 5; round++)
        rig.refresh();
    goes_on = false;
    for (std::thread& thread : all)
        thread.join();
    rig.refresh();
    EXPECT_THAT(rig.enumerate("NVRHBA_ConcreteJob").instances, IsEmpty());
    EXPECT_EQ(setting(rig, internal).get("LoopControlParameter").to_text(), "{100}");
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(DiagnosticRuns, AreForgottenWhenTheAdaptersAreReadAnew)
{
    Rig reading({*GetParam(), two_ports, refreshing_settings});
    run(reading, internal, {{"DiagnosticSettings", settings_of(internal, {{"LoopControlParameter", strings({"7"})}})}});
    run(reading, status, {{"JobSettings", job_settings(true)}});
    EXPECT_EQ(setting(reading, internal).get("LoopControlParameter").to_text(), "{7}");
    reading.refresh();
    const host::Instance now = setting(reading, internal);
    EXPECT_EQ(now.get("LoopControlParameter").to_text(), "{100}");
    EXPECT_EQ(now.get("OverridedSettingData").to_text(), "0");
    EXPECT_EQ(texts(reading.enumerate("NVRHBA_JobSettingData"), "DeleteOnCompletion"),
              std::vector<std::string>{"false"});
    for (const char* name :
         {"NVRHBA_ConcreteJob", "NVRHBA_DiagnosticServiceRecord", "NVRHBA_DiagnosticCompletionRecord",
          "NVRHBA_DiagnosticSettingDataRecord", "NVRHBA_LogManagesRecord", "NVRHBA_OwningJobElement",
          "NVRHBA_AffectedJobElement", "NVRHBA_RecordAppliesToElement", "NVRHBA_CorrespondingSettingDataRecord"})
        EXPECT_THAT(reading.enumerate(name).instances, IsEmpty()) << name;
}

TEST_P(DiagnosticRuns, AreReachedByTheirAssociations)
{
    const Called called = run(rig, internal);
    const host::Path job = *called.out("Job").as_path();
    const host::Path test = Service(rig, "NVRHBA_FCHBADiagnosticTest", internal).path();
    host::Answer found = rig.server().associator_names(test, "NVRHBA_OwningJobElement");
    ASSERT_THAT(found.paths, SizeIs(1));
    EXPECT_EQ(found.paths[0], job);
    found = rig.server().associator_names(job, "NVRHBA_AffectedJobElement");
    ASSERT_THAT(found.paths, SizeIs(1));
    EXPECT_EQ(found.paths[0].find("DeviceID")->as_text(), first_port);
    host::Path log = rig.names("NVRHBA_DiagnosticsLog").paths.at(4);
    EXPECT_EQ(log.find("InstanceID")->as_text(), internal);
    EXPECT_THAT(rig.server().associators(log, "NVRHBA_LogManagesRecord").instances, SizeIs(2));
    EXPECT_THAT(rig.server().associators(log, "NVRHBA_UseOfLog").instances, SizeIs(1));
}

// --------------------------------------------------------------------------------------------------- help and logs

class DiagnosticServices : public Every_Manner {
protected:
    Rig rig{{*GetParam(), two_ports}};
};
NVR_IN_EVERY_MANNER(DiagnosticServices);

TEST_P(DiagnosticServices, HelpIsTheTextAboutATest)
{
    const auto one = host::Value::uint16(1);
    const auto two = host::Value::uint16(2);
    const std::string method = "NVRHBA_HelpService_Provider::GetHelp";
    Service help(rig, "NVRHBA_HelpService", echo);
    const auto document = host::Value::string(echo);
    Called called =
        help.call("GetHelp", {{"RequestedDocument", document}, {"Format", one}, {"RequestedDelivery", one}});
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.out("DocumentInfo").as_text(), "Test verifies the data path from host to target");
    EXPECT_EQ(called.out("Format").to_text(), "1") << "goes in and comes out";
    EXPECT_EQ(called.words, (Words{method, gate}));

    const std::string null_words = "Invalid Requested Document";
    const std::string delivery_words = "Unsupported Delivery options, Use '1' for proper support";
    const struct {
        Arguments arguments;
        int value;
        std::string words;
    } rows[] = {
        {{}, 5, null_words},
        {{{"Format", one}, {"RequestedDelivery", one}}, 5, null_words},
        {{{"RequestedDocument", document}, {"RequestedDelivery", one}}, 5, null_words},
        {{{"RequestedDocument", document}, {"Format", one}}, 5, null_words},
        {{{"RequestedDocument", host::Value::string(ping)}, {"Format", one}, {"RequestedDelivery", one}}, 4, ""},
        {{{"RequestedDocument", host::Value::string("")}, {"Format", one}, {"RequestedDelivery", one}}, 4, ""},
        {{{"RequestedDocument", host::Value::string("unknown")}, {"Format", two}, {"RequestedDelivery", two}}, 4, ""},
        {{{"RequestedDocument", document}, {"Format", two}, {"RequestedDelivery", one}}, 5, delivery_words},
        {{{"RequestedDocument", document}, {"Format", one}, {"RequestedDelivery", two}}, 5, delivery_words},
        {{{"RequestedDocument", document}, {"Format", host::Value::uint16(0)}, {"RequestedDelivery", one}},
         5,
         delivery_words},
    };
    for (const auto& row : rows) {
        called = help.call("GetHelp", row.arguments);
        EXPECT_THAT(called, returned(row.value));
        EXPECT_EQ(called.words, row.words.empty() ? (Words{method, gate}) : (Words{method, gate, row.words}));
        EXPECT_TRUE(called.out("DocumentInfo").is_null());
    }
    called = help.call_on(help.stranger(), "GetHelp",
                          {{"RequestedDocument", document}, {"Format", one}, {"RequestedDelivery", one}});
    EXPECT_THAT(called, returned(5));
    EXPECT_EQ(called.words, (Words{method, gate, "Invalid instance of Help Service"}));
    for (const host::Path& path : rig.names("NVRHBA_HelpService").paths) {
        called = help.call_on(path, "gethelp",
                              {{"RequestedDocument", *path.find("Name")}, {"Format", one}, {"RequestedDelivery", one}});
        EXPECT_THAT(called, returned(0));
        EXPECT_THAT(called.out("DocumentInfo").as_text(), HasSubstr("Test "));
    }
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(DiagnosticServices, ALogIsClearedAloneAndInOrder)
{
    for (const char* test : {status, internal, status, self, internal})
        run(rig, test);
    run(rig, internal, {{"DiagnosticSettings", settings_of(internal, {})}});
    const host::Path log = rig.names("NVRHBA_DiagnosticsLog").paths.at(4);
    Service logs(rig, "NVRHBA_DiagnosticsLog");
    const std::string method = "NVRHBA_DiagnosticsLog_Provider::ClearLog";
    Called called = logs.call_on(log, "ClearLog");
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, (Words{method, gate, "Exiting NVRHBA_DiagnosticsLog_Provider::ClearLog"}));
    EXPECT_THAT(
        texts(rig.enumerate("NVRHBA_DiagnosticCompletionRecord"), "InstanceID"),
        ElementsAre(std::string(status) + ":1:65535", std::string(status) + ":3:65535", std::string(self) + ":4:2"));
    EXPECT_THAT(texts(rig.enumerate("NVRHBA_DiagnosticServiceRecord"), "ServiceName"),
                ElementsAre(status, status, self));
    EXPECT_THAT(rig.enumerate("NVRHBA_LogManagesRecord").instances, SizeIs(6));
    EXPECT_THAT(rig.enumerate("NVRHBA_RecordAppliesToElement").instances, SizeIs(6));
    // Jobs and records of settings stay, with their ties.
    EXPECT_THAT(rig.enumerate("NVRHBA_ConcreteJob").instances, SizeIs(6));
    EXPECT_THAT(rig.enumerate("NVRHBA_DiagnosticSettingDataRecord").instances, SizeIs(1));
    EXPECT_THAT(rig.enumerate("NVRHBA_CorrespondingSettingDataRecord").instances, SizeIs(2));
    EXPECT_THAT(logs.call_on(log, "clearlog"), returned(0)) << "an empty one too";

    host::Path stranger = log;
    stranger.set("InstanceID", host::Value::string("nobody's log"));
    called = logs.call_on(stranger, "ClearLog");
    EXPECT_THAT(called, returned(5));
    EXPECT_EQ(called.words, (Words{method, gate, "Invalid instance of Diagnostic Log"}));
    // A run after it goes on counting.
    EXPECT_EQ(job_id(run(rig, internal)), job_of(internal, 7, 5));
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}
