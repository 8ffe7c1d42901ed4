// What a client may write over the settings of a test and of the jobs, and what it is told.

#include "classes/CIM_DiagnosticSettingData.h"
#include "tests/diagnostics/Diagnostics_Test.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::IsEmpty;

namespace {

using Setting = NVRHBA_FCHBADiagnosticSettingData;

const std::string using_given = "Using the overrided values if valid, else default settings values are used";
const std::string bad_control = "Invalid LoopControl, Valid value is '3'. Using the default value";
const std::string bad_count = "Invalid LoopControlParam, Valid value range[1-4000]. Using the default value";
const std::string bad_size = "Invalid BufferSizes, Valid value is '<8'. Using the default value";
const std::string bad_pattern = "Invalid BufferPattern, Use hex values. Using the default value";
const std::string good_pattern = "Valid Pattern entered";

class Overrides : public Diagnostics {
protected:
    /// A client's own settings of a test: nothing but its name.
    Ref<Setting> input(const char* name)
    {
        Ref<Setting> made(create_as<Setting>(false));
        nullify_properties(made.get(), true, true, 1);
        made->InstanceID.set(name);
        return made;
    }
    /// Hands it in and gives the words.
    Words give(const Setting* given, const char* name)
    {
        words();
        result = NVR_Diagnostics::getNVRHBA_FCHBADiagnosticSettingDataInstance(agent(), given, name);
        return words();
    }
    std::string now(const char* property, const char* name = internal_name) { return value(&setting(name), property); }

    Setting* result = nullptr;
};

Array<uint8> bytes(const std::string& text)
{
    Array<uint8> made;
    for (const char c : text)
        made.append(static_cast<uint8>(c));
    return made;
}

/// The doubled lines of one override.
Words twice(const Words& words)
{
    return repeated(2, words);
}

} // namespace

TEST_F(Overrides, DefaultsAreFoundByTheNameOfTheTest)
{
    words();
    for (const Diagnostic_Test& test : diagnostic_tests)
        EXPECT_EQ(value(NVR_Diagnostics::getDefaultNVRHBA_FCHBADiagnosticSettingDataInstance(agent(), test.name),
                        "InstanceID"),
                  test.name);
    EXPECT_THAT(words(), IsEmpty());
    for (const char* name : {"", "NVR:FCHBA echo Test", "NVR:FCHBA Echo Test ", "NVR:FCHBA Echo Tes"}) {
        EXPECT_EQ(NVR_Diagnostics::getDefaultNVRHBA_FCHBADiagnosticSettingDataInstance(agent(), name), nullptr);
        EXPECT_THAT(words(), ElementsAre("Could not find the default setting data"));
    }
}

TEST_F(Overrides, OfAnotherClassOrTestAreRefused)
{
    const std::string refused = "Invalid overrided Diagsetting param, default settings values are used";
    EXPECT_THAT(give(nullptr, internal_name), ElementsAre(refused));
    EXPECT_EQ(result, nullptr);
    words();
    const Ref<Instance> foreign(create(&CIM_DiagnosticSettingData::meta, true));
    EXPECT_EQ(NVR_Diagnostics::getNVRHBA_FCHBADiagnosticSettingDataInstance(agent(), foreign.get(), internal_name),
              nullptr);
    EXPECT_THAT(words(), ElementsAre(refused));
    EXPECT_THAT(give(input(echo_name).get(), internal_name), IsEmpty());
    EXPECT_EQ(result, nullptr);
    const Ref<Setting> unnamed = input("");
    unnamed->InstanceID.null = 1;
    EXPECT_THAT(give(unnamed.get(), internal_name), IsEmpty());
    EXPECT_EQ(result, nullptr);
}

TEST_F(Overrides, WithoutADefaultThereIsNothingToWriteTo)
{
    map("FCHBADiagnosticSettingData").clear();
    EXPECT_THAT(give(input(internal_name).get(), internal_name),
                ElementsAre("Could not find the default setting data", using_given));
    EXPECT_EQ(result, nullptr);
    EXPECT_THAT(give(input(self_name).get(), self_name),
                ElementsAre("Could not find the default setting data", using_given,
                            std::string("No Override Setting Supported for test : ") + self_name));
    EXPECT_EQ(result, nullptr);
}

TEST_F(Overrides, ThreeTestsTakeNone)
{
    for (const char* name : {status_name, reset_name, self_name}) {
        const Ref<Setting> given = input(name);
        given->HaltOnError.set(true);
        EXPECT_THAT(give(given.get(), name),
                    ElementsAre(using_given, std::string("No Override Setting Supported for test : ") + name));
        EXPECT_EQ(result, &setting(name));
        EXPECT_EQ(now("OverridedSettingData", name), "0");
        EXPECT_EQ(now("HaltOnError", name), "false");
    }
}

TEST_F(Overrides, TheBeaconTestReadsNothingOfThem)
{
    const Ref<Setting> given = input(beacon_name);
    given->LoopControlParameter.set(Array<String>{"7"});
    given->HaltOnError.set(true);
    EXPECT_THAT(give(given.get(), beacon_name), ElementsAre(using_given));
    EXPECT_EQ(result, &setting(beacon_name));
    EXPECT_EQ(now("OverridedSettingData", beacon_name), "1");
    EXPECT_EQ(now("LoopControlParameter", beacon_name), "{5}");
    EXPECT_EQ(now("HaltOnError", beacon_name), "false");
}

TEST_F(Overrides, NullOnesAreSkippedAndStillCountAsOverride)
{
    for (const char* name : {external_name, host_name, internal_name}) {
        EXPECT_THAT(give(input(name).get(), name), ElementsAre(using_given));
        expect_rows(&setting(name), {{"OverridedSettingData", "1"},
                                     {"LoopControl", "{3}"},
                                     {"LoopControlParameter", "{100}"},
                                     {"HaltOnError", "false"},
                                     {"BufferSizes", "{8}"},
                                     {"BufferPattern", "{49,97,50,98,51,99,52,100}"}});
    }
    // So do empty arrays, but for the pattern's.
    const Ref<Setting> empty = input(internal_name);
    empty->LoopControl.null = empty->LoopControlParameter.null = empty->BufferSizes.null = 0;
    EXPECT_THAT(give(empty.get(), internal_name), ElementsAre(using_given));
}

TEST_F(Overrides, AllOfThemAreToldTwice)
{
    const Ref<Setting> given = input(internal_name);
    given->LoopControl.set(Array<uint16>{3});
    given->LoopControlParameter.set(Array<String>{"12"});
    given->HaltOnError.set(true);
    given->BufferSizes.set(Array<uint32>{4});
    given->BufferPattern.set(bytes("aF9"));
    EXPECT_THAT(give(given.get(), internal_name),
                ElementsAre(using_given, "Input LoopControl : 3", "Input LoopControlParam : 12",
                            "Input Buffer Size : 4", good_pattern, "Input LoopControl : 3",
                            "Input LoopControlParam : 12", "Input Buffer Size : 4"));
    expect_rows(&setting(internal_name), {{"LoopControl", "{3}"},
                                          {"LoopControlParameter", "{12}"},
                                          {"HaltOnError", "true"},
                                          {"BufferSizes", "{4}"},
                                          {"BufferPattern", "{97,70,57,48}"},
                                          {"OverridedSettingData", "1"}});
    // The next client without settings finds them in force.
    EXPECT_EQ(value(NVR_Diagnostics::getDefaultNVRHBA_FCHBADiagnosticSettingDataInstance(agent(), internal_name),
                    "LoopControlParameter"),
              "{12}");
}

TEST_F(Overrides, WrongOnesAreToldTwiceAndLeaveTheDefaults)
{
    const Ref<Setting> given = input(internal_name);
    given->LoopControl.set(Array<uint16>{2});
    given->LoopControlParameter.set(Array<String>{"4001"});
    given->BufferSizes.set(Array<uint32>{9});
    given->BufferPattern.set(bytes("xyz"));
    const Words wrong = {"Input LoopControl : 2",
                         bad_control,
                         "Input LoopControlParam : 4001",
                         bad_count,
                         "Input Buffer Size : 9",
                         bad_size,
                         bad_pattern};
    EXPECT_THAT(give(given.get(), internal_name), ElementsAreArray(joined({{using_given}, twice(wrong)})));
    expect_rows(&setting(internal_name), {{"LoopControl", "{3}"},
                                          {"LoopControlParameter", "{100}"},
                                          {"BufferSizes", "{8}"},
                                          {"BufferPattern", "{49,97,50,98,51,99,52,100}"},
                                          {"OverridedSettingData", "1"}});
}

TEST_F(Overrides, OnlyThreeIsALoopControl)
{
    for (const uint16 control : {0, 1, 2, 4, 5, 32768, 65535}) {
        const Ref<Setting> given = input(internal_name);
        given->LoopControl.set(Array<uint16>{control, 3});
        const Words line = {"Input LoopControl : " + std::to_string(control), bad_control};
        EXPECT_THAT(give(given.get(), internal_name), ElementsAreArray(joined({{using_given}, twice(line)})));
        EXPECT_EQ(now("LoopControl"), "{3}");
    }
    const Ref<Setting> given = input(internal_name);
    given->LoopControl.set(Array<uint16>{3, 2, 1});
    EXPECT_THAT(give(given.get(), internal_name),
                ElementsAre(using_given, "Input LoopControl : 3", "Input LoopControl : 3"));
    EXPECT_EQ(now("LoopControl"), "{3}") << "the first element alone";
}

TEST_F(Overrides, CountsAreShortNumbersFrom1To4000)
{
    const Ref<Setting> given = input(internal_name);
    for (const char* text : {"1", "4000", "0042", " 12", "+7", "7abc", "9 x"}) {
        given->LoopControlParameter.set(Array<String>{text, "5"});
        const std::string line = std::string("Input LoopControlParam : ") + text;
        EXPECT_THAT(give(given.get(), internal_name), ElementsAre(using_given, line, line));
        EXPECT_EQ(now("LoopControlParameter"), std::string("{") + text + "}");
    }
    given->LoopControlParameter.set(Array<String>{"77"});
    give(given.get(), internal_name);
    const std::string long_text(10000, '1');
    for (const char* text :
         {"", "0", "4001", "9999", "12345", "-1", "0x10", "abc", "99999999999999999999", long_text.c_str()}) {
        given->LoopControlParameter.set(Array<String>{text});
        const Words said = give(given.get(), internal_name);
        ASSERT_EQ(said.size(), 5u) << text;
        EXPECT_EQ(said[2], bad_count) << text;
        EXPECT_EQ(said[4], bad_count) << text;
        EXPECT_EQ(now("LoopControlParameter"), "{77}") << text;
    }
}

TEST_F(Overrides, HaltOnErrorIsTakenAsItIs)
{
    const Ref<Setting> given = input(internal_name);
    for (const bool halt : {true, false, true}) {
        given->HaltOnError.set(halt);
        EXPECT_THAT(give(given.get(), internal_name), ElementsAre(using_given));
        EXPECT_EQ(now("HaltOnError"), halt ? "true" : "false");
    }
}

TEST_F(Overrides, SizesGoUpToEight)
{
    const Ref<Setting> given = input(internal_name);
    for (const uint32 size : {0u, 1u, 7u, 8u}) {
        given->BufferSizes.set(Array<uint32>{size, 9});
        const std::string line = "Input Buffer Size : " + std::to_string(size);
        EXPECT_THAT(give(given.get(), internal_name), ElementsAre(using_given, line, line));
        EXPECT_EQ(now("BufferSizes"), "{" + std::to_string(size) + "}");
    }
    for (const uint32 size : {9u, 4096u, 0x7FFFFFFFu, 0x80000000u, 0xFFFFFFFFu}) {
        given->BufferSizes.set(Array<uint32>{size});
        const Words line = {"Input Buffer Size : " + std::to_string(static_cast<int>(size)), bad_size};
        EXPECT_THAT(give(given.get(), internal_name), ElementsAreArray(joined({{using_given}, twice(line)})));
        EXPECT_EQ(now("BufferSizes"), "{8}");
    }
}

TEST_F(Overrides, PatternsAreFilledUpAndCut)
{
    const struct {
        uint32 size;
        std::string given;
        std::string stored;
    } rows[] = {{8, "ab", "ab000000"}, {8, "", "00000000"}, {8, "0123456789", "01234567"},
                {3, "AbCdEf", "AbC"},  {1, "", "0"},        {8, std::string(10000, 'f'), "ffffffff"}};
    for (const auto& row : rows) {
        const Ref<Setting> given = input(internal_name);
        given->BufferSizes.set(Array<uint32>{row.size});
        given->BufferPattern.set(bytes(row.given));
        EXPECT_THAT(give(given.get(), internal_name), Contains(good_pattern));
        const Array<uint8>& stored = setting(internal_name).BufferPattern.value;
        EXPECT_EQ(std::string(stored.begin(), stored.end()), row.stored);
    }
    const Ref<Setting> before = input(internal_name);
    before->BufferSizes.set(Array<uint32>{8});
    before->BufferPattern.set(bytes("12345678"));
    give(before.get(), internal_name);
    for (const std::string& wrong :
         {std::string("g"), std::string("12 4"), std::string("\0", 1), std::string("1234567/"), std::string("@"),
          std::string("`"), std::string(":"), std::string("\xFF"), std::string(10000, 'f') + "G"}) {
        const Ref<Setting> given = input(internal_name);
        given->BufferPattern.set(bytes(wrong));
        EXPECT_THAT(give(given.get(), internal_name), ElementsAre(using_given, bad_pattern, bad_pattern));
        EXPECT_EQ(now("BufferPattern"), "{49,50,51,52,53,54,55,56}");
    }
    // No size, no pattern.
    const Ref<Setting> given = input(internal_name);
    given->BufferSizes.set(Array<uint32>{0});
    given->BufferPattern.set(bytes("ab"));
    EXPECT_THAT(give(given.get(), internal_name),
                ElementsAre(using_given, "Input Buffer Size : 0", bad_pattern, "Input Buffer Size : 0", bad_pattern));
    EXPECT_EQ(now("BufferPattern"), "{49,50,51,52,53,54,55,56}");
}

TEST_F(Overrides, OfATargetAreReadBehindThePattern)
{
    for (const char* name : {echo_name, ping_name}) {
        Ref<Setting> given = input(name);
        given->HaltOnError.set(true);
        given->LUN.set(uint64{5});
        given->TargetDevice.set(target_wwpn);
        EXPECT_THAT(give(given.get(), name),
                    ElementsAre(using_given, "Checking the Echo test targetdevice",
                                std::string("Input TargetDevice : ") + target_wwpn,
                                "Entering NVR_MethodWrapper::Id2HBAName", std::string("DeviceID is:: ") + target_wwpn,
                                "HBA Name is:: 50:06:0E:80:05:A1:00:00"));
        expect_rows(&setting(name), {{"LUN", "5"}, {"TargetDevice", target_wwpn}});
        given->LUN.null = 1;
        EXPECT_THAT(give(given.get(), name), Contains("Invalid LUN, Using the default value '0' "));
        EXPECT_EQ(now("LUN", name), "5") << "whatever was last set";
        // Only texts of sixteen characters are stored, whatever characters.
        for (const char* target : {"", "50060E8005A1000", "50060E8005A10000F"}) {
            given->TargetDevice.set(target);
            EXPECT_EQ(give(given.get(), name).back(), std::string("Input TargetDevice : ") + target);
            EXPECT_EQ(now("TargetDevice", name), target_wwpn);
        }
        given->TargetDevice.set("sixteen letters!");
        give(given.get(), name);
        EXPECT_EQ(now("TargetDevice", name), "sixteen letters!");
    }
    EXPECT_EQ(now("TargetDevice", internal_name), "null");
}

TEST_F(Overrides, OfJobsAreTheDeletionAlone)
{
    const auto give_job = [this](const Instance* given) {
        words();
        return NVR_Diagnostics::getNVRHBA_JobSettingDataInstance(agent(), given);
    };
    const auto job_input = [](const char* id) {
        Ref<NVRHBA_JobSettingData> made(create_as<NVRHBA_JobSettingData>(false));
        nullify_properties(made.get(), true, true, 1);
        made->InstanceID.set(id);
        return made;
    };
    const char* const id = "NVR:FCHBA JobSettingData";
    EXPECT_EQ(NVR_Diagnostics::getDefaultNVRHBA_JobSettingDataInstance(agent()), first("JobSettingData"));

    EXPECT_EQ(give_job(nullptr), nullptr);
    const Ref<Instance> foreign(create(&Setting::meta, true));
    EXPECT_EQ(give_job(foreign.get()), nullptr);
    EXPECT_EQ(give_job(job_input("another").get()), nullptr);
    EXPECT_THAT(words(), IsEmpty());

    const Ref<NVRHBA_JobSettingData> given = job_input(id);
    EXPECT_EQ(give_job(given.get()), first("JobSettingData"));
    EXPECT_THAT(words(),
                ElementsAre(using_given,
                            "Missing DeleteOnCompletion parameter, Valid values are 1 or 0. Using the default value"));
    expect_rows(first("JobSettingData"), {{"DeleteOnCompletion", "false"}});
    given->DeleteOnCompletion.set(true);
    EXPECT_EQ(give_job(given.get()), first("JobSettingData"));
    EXPECT_THAT(words(), ElementsAre(using_given));
    expect_rows(first("JobSettingData"), {{"DeleteOnCompletion", "true"}});

    map("JobSettingData").clear();
    EXPECT_EQ(NVR_Diagnostics::getDefaultNVRHBA_JobSettingDataInstance(agent()), nullptr);
    EXPECT_EQ(give_job(given.get()), nullptr);
}
