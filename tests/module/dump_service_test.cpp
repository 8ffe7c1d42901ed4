// The dumps of a port: made, listed, deleted, and how many of them are kept.
#include <cstdlib>
#include <filesystem>

#include <gmock/gmock.h>

#include "tests/module/support/Service.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Value;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;

namespace {

constexpr char directory[] = "/var/log/dumps";

std::string host_with(const std::string& port_keys)
{
    return std::string("[[adapter]]\n[[adapter.port]]\ndump_directory = \"") + directory + "\"\n" + port_keys +
           "\n[[adapter]]\n";
}

std::string host_with_dumps(int count)
{
    std::string names;
    for (int i = 1; i <= count; i++)
        names += (i > 1 ? ", " : "") + ("\"dump" + std::to_string(i) + "\"");
    return host_with("dumps = [" + names + "]\nretention = 20");
}

/// The directory, empty.
void make_directory()
{
    std::filesystem::remove_all(directory);
    make_folder(directory);
}

std::vector<std::string> files()
{
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(directory))
        names.push_back(entry.path().filename());
    std::sort(names.begin(), names.end());
    return names;
}

std::vector<std::string> texts(const Value& array)
{
    std::vector<std::string> all;
    for (const Value& element : array.elements())
        all.push_back(element.as_text());
    return all;
}

Words begun(const std::string& entry)
{
    return joined({{entry, gate}, known_port(), converted(first_port)});
}

/// One question for the list, with what it is answered.
Words asked(std::uint32_t status = 0)
{
    return joined({{"Calling the Get Dump filenames method", "NVR_MethodWrapper::GetDumpFileNames",
                    "Entering the Get Dump filenames method"},
                   local(),
                   status ? Words{status_line(status)} : Words(),
                   {"Exit the Get Dump filenames method"}});
}

Words listed(const std::vector<std::string>& names)
{
    Words words = {"NVRHBA_DumpService::nvrcimGetDumpFileNames Succesful",
                   " NumberOfEntries = " + std::to_string(names.size())};
    for (const std::string& name : names)
        words.push_back("Filenames = " + name);
    words.push_back("NVRHBA GetDumpFileNames Succesful");
    return words;
}

struct Method {
    const char* name;
    const char* entry;
    const char* operation;
    const char* library_call;
    const char* failure; ///< of the operation; null: none of its own
    const char* provider_failed;
};

const Method methods[] = {
    {"GenerateDump", "Entering GenerateDump", "nvrcimDumpDiagnostic", "RM_GenerateDump",
     "Failed to generate the dump file, exited with error code ", "NVRHBA_DumpService::nvrcimDumpDiagnostic failed"},
    {"DeleteDump", "Entering DeleteDump", "nvrcimDeleteDumpFiles", "RM_DeleteDumpFiles",
     "Failed to delete the Dump files, exited with error code ", "NVRHBA_DumpService::nvrcimDeleteDumpFiles failed"},
    {"GetDumpFileNames", "Entering GetDumpFileNames", "GetDumpFileNames", "RM_GetDumpFileNames", nullptr,
     "NVRHBA_DumpService::nvrcimGetDumpFileNames failed"},
};

} // namespace

class DumpService : public Every_Manner {
protected:
    void load(const std::string& scenario = host_with(""))
    {
        make_directory();
        rig.emplace(Rig_Options{*GetParam(), scenario});
        service.emplace(*rig, "NVRHBA_DumpService");
    }
    Arguments target() { return {{"Target", port(*rig)}}; }

    std::optional<Rig> rig;
    std::optional<Service> service;
};
NVR_IN_EVERY_MANNER(DumpService);

TEST_P(DumpService, GeneratesAFileAndKeepsAsManyAsTheRetentionSays)
{
    load(host_with("retention = 2"));
    const Called called = service->call("GenerateDump", target());
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, joined({begun("Entering GenerateDump"),
                                    {"NVR_MethodWrapper::nvrcimDumpDiagnostic"},
                                    local(),
                                    {"NVRHBA_DumpService::nvrcimDumpDiagnostic Succesful",
                                     "returning from NVRHBA_DumpService::GenerateDump"}}));
    EXPECT_THAT(files(), ElementsAre("NVR_10000000C9A00001_dump_0001.dmp"));
    EXPECT_EQ(calls("RM_GenerateEfdDump"), 0u);
    EXPECT_THAT(service->call("generatedump", target()), returned(0));
    EXPECT_THAT(service->call("GENERATEDUMP", target()), returned(0));
    EXPECT_THAT(files(), ElementsAre("NVR_10000000C9A00001_dump_0002.dmp", "NVR_10000000C9A00001_dump_0003.dmp"));
}

TEST_P(DumpService, ListsTheNames)
{
    load();
    Called called = service->call("GetDumpFileNames", target());
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, joined({begun("Entering GetDumpFileNames"), asked(), listed({})}));
    EXPECT_TRUE(called.out("DumpFiles").elements().empty());
    ASSERT_THAT(service->call("GenerateDump", target()), returned(0));
    Arguments given = target();
    given.push_back({"DumpFiles", Value::array(CMPI_string, {Value::string("what"), Value::string("was")})});
    called = service->call("getdumpFILENAMES", given);
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, joined({begun("Entering GetDumpFileNames"), asked(), listed(files())}));
    EXPECT_THAT(texts(called.out("DumpFiles")), ElementsAre("NVR_10000000C9A00001_dump_0001.dmp"));
}

TEST_P(DumpService, AsksAgainForALongerList)
{
    load();
    for (const int count : {4, 5, 300}) {
        load_scenario(host_with_dumps(count));
        std::vector<std::string> names;
        for (int i = 1; i <= count; i++)
            names.push_back("dump" + std::to_string(i));
        const Called called = service->call("GetDumpFileNames", target());
        EXPECT_THAT(called, returned(0)) << count;
        EXPECT_EQ(called.words, joined({begun("Entering GetDumpFileNames"),
                                        count > 4 ? joined({asked(191), asked()}) : asked(), listed(names)}))
            << count;
        EXPECT_EQ(texts(called.out("DumpFiles")), names) << count;
    }
}

TEST_P(DumpService, DeletesTheFiles)
{
    load();
    ASSERT_THAT(service->call("GenerateDump", target()), returned(0));
    const Called called = service->call("DeleteDump", target());
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, joined({begun("Entering DeleteDump"),
                                    {"NVR_MethodWrapper::nvrcimDeleteDumpFiles"},
                                    local(),
                                    {"NVRHBA_DumpService::nvrcimDeleteDumpFiles Succesful",
                                     "returning from NVRHBA_DumpService::DeleteDump"}}));
    EXPECT_THAT(files(), IsEmpty());
    EXPECT_THAT(service->call("dELETEdUMP", target()), returned(0));
}

TEST_P(DumpService, ATargetThatIsNoPortIsRefused)
{
    load();
    for (const Method& method : methods) {
        const Words null_target = {method.entry, gate, "NVRHBA_DumpService invald port ...return"};
        Called called = service->call(method.name);
        EXPECT_THAT(called, returned(32968)) << method.name;
        EXPECT_EQ(called.words, null_target);
        // One of another class never gets past the conversion of arguments.
        called = service->call(method.name, {{"Target", no_port(*rig)}});
        EXPECT_THAT(called, returned(32968)) << method.name;
        EXPECT_EQ(called.words, null_target);
        called = service->call(method.name, {{"Target", unknown_port(*rig)}});
        EXPECT_THAT(called, returned(32968)) << method.name;
        EXPECT_EQ(called.words,
                  joined({{method.entry, gate}, no_known_port(), {"NVRHBA_DumpService::Id2HBAName failed"}}));
        EXPECT_EQ(calls(method.library_call), 0u);
    }
}

TEST_P(DumpService, APortThatIsNotLocalIsRefused)
{
    load();
    add_fault("call = \"RM_IsLocalHBA\", value = 0");
    for (const Method& method : methods) {
        const bool lists = !method.failure;
        const Called called = service->call(method.name, target());
        EXPECT_THAT(called, returned(40001)) << method.name;
        EXPECT_EQ(called.words, joined({begun(method.entry),
                                        lists ? Words{"Calling the Get Dump filenames method"} : Words(),
                                        {std::string("NVR_MethodWrapper::") + method.operation},
                                        lists ? Words{"Entering the Get Dump filenames method"} : Words(),
                                        not_local(),
                                        {method.provider_failed}}));
        EXPECT_EQ(calls(method.library_call), 0u);
    }
}

TEST_P(DumpService, AnotherServiceIsRefused)
{
    load();
    for (const Method& method : methods) {
        const Called called = service->call_on(service->stranger(), method.name, target());
        EXPECT_THAT(called, returned(33068)) << method.name;
        EXPECT_EQ(called.words, Words({method.entry, gate, "Invalid instance of NVRHBA_DumpService"}));
        EXPECT_EQ(calls(method.library_call), 0u);
    }
}

namespace {

/// The host, once, for what needs no other manner.
struct Dumps {
    explicit Dumps(const std::string& scenario) : rig({host::Manner::strict(), scenario}) {}
    Rig rig;
    Service service{rig, "NVRHBA_DumpService"};
    Arguments target{{"Target", port(rig)}};
};

} // namespace

TEST(DumpServiceStatuses, EachComesBackAbove40000)
{
    make_directory();
    Dumps dumps(host_with_dumps(3));
    for (const Method& method : methods)
        for (std::uint32_t status = 1; status <= 260; status++) {
            clear_faults();
            add_fault("call = \"" + std::string(method.library_call) + "\", status = " + std::to_string(status));
            const Called called = dumps.service.call(method.name, dumps.target);
            EXPECT_THAT(called, returned(40000 + status)) << method.name;
            const std::string operation = std::string("NVR_MethodWrapper::") + method.operation;
            Words own = joined({{operation}, local()});
            if (method.failure) {
                own.push_back(method.failure + std::to_string(status));
                own.push_back(status_line(status));
            } else {
                own = status == 191 ? joined({asked(191), asked(191)}) : asked(status);
            }
            EXPECT_EQ(called.words, joined({begun(method.entry), own, {method.provider_failed}}))
                << method.name << ' ' << status;
            EXPECT_TRUE(called.out("DumpFiles").elements().empty());
        }
}

TEST(DumpServiceStatuses, AMissingFunctionIsStatusOne)
{
    make_directory();
    Dumps dumps(host_with(""));
    for (const Method& method : methods) {
        add_fault("call = \"" + std::string(method.library_call) + "\", absent = true");
        EXPECT_THAT(dumps.service.call(method.name, dumps.target), returned(40001)) << method.name;
    }
}

TEST(DumpServiceLists, CountsThatLieReadNoFurtherThanTheList)
{
    make_directory();
    Dumps dumps(host_with_dumps(3));
    for (const char* count : {"5", "100", "4294967295"}) {
        clear_faults();
        add_fault("call = \"RM_GetDumpFileNames\", value = " + std::string(count));
        const Called called = dumps.service.call("GetDumpFileNames", dumps.target);
        EXPECT_THAT(called, returned(0)) << count;
        EXPECT_THAT(texts(called.out("DumpFiles")), ElementsAre("dump1", "dump2", "dump3", "")) << count;
        EXPECT_THAT(called.words,
                    Contains(" NumberOfEntries = " + std::to_string(static_cast<int>(std::stoul(count)))));
    }
    clear_faults();
    add_fault("call = \"RM_GetDumpFileNames\", value = 2");
    EXPECT_THAT(texts(dumps.service.call("GetDumpFileNames", dumps.target).out("DumpFiles")),
                ElementsAre("dump1", "dump2"));
    // More than there is memory for.
    clear_faults();
    for (const char* count : {"65536", "4294967295"}) {
        add_fault("call = \"RM_GetDumpFileNames\", status = 191, value = " + std::string(count));
        const Called called = dumps.service.call("GetDumpFileNames", dumps.target);
        EXPECT_THAT(called, returned(40191)) << count;
        EXPECT_EQ(called.words, joined({begun("Entering GetDumpFileNames"),
                                        asked(191),
                                        {"NVRHBA_DumpService::nvrcimGetDumpFileNames failed"}}));
        clear_faults();
    }
    // The need of the first answer is not that of the second.
    add_fault("call = \"RM_GetDumpFileNames\", status = 191, value = 0");
    EXPECT_THAT(dumps.service.call("GetDumpFileNames", dumps.target), returned(40191));
}

TEST(DumpServiceLists, AFailureOfTheSecondQuestionIsTheAnswer)
{
    make_directory();
    Dumps dumps(host_with_dumps(6));
    for (const std::uint32_t status : {1u, 7u, 64u, 260u}) {
        clear_faults();
        add_fault("call = \"RM_GetDumpFileNames\", from = 2, status = " + std::to_string(status));
        const Called called = dumps.service.call("GetDumpFileNames", dumps.target);
        EXPECT_THAT(called, returned(40000 + status));
        EXPECT_EQ(called.words, joined({begun("Entering GetDumpFileNames"),
                                        asked(191),
                                        asked(status),
                                        {"NVRHBA_DumpService::nvrcimGetDumpFileNames failed"}}));
        EXPECT_TRUE(called.out("DumpFiles").elements().empty());
    }
}

TEST(DumpServiceLists, DamagedNamesEndWithTheirField)
{
    make_directory();
    Dumps dumps(host_with_dumps(6));
    for (const char* damage : {"unterminated", "garbage", "ones", "zeros", "null", "truncated"}) {
        clear_faults();
        add_fault("call = \"RM_GetDumpFileNames\", damage = \"" + std::string(damage) + "\"");
        const Called called = dumps.service.call("GetDumpFileNames", dumps.target);
        ASSERT_TRUE(called.answer.ok()) << damage;
        for (const std::string& name : texts(called.out("DumpFiles")))
            EXPECT_LE(name.size(), 256u) << damage;
    }
}

TEST(DumpServiceDisk, AFullDiskFailsAndLeavesNoFile)
{
    make_directory();
    Dumps dumps(host_with(""));
    const Small_Disk disk(directory);
    disk.fill();
    EXPECT_THAT(dumps.service.call("GenerateDump", dumps.target), returned(40001));
    EXPECT_THAT(files(), ElementsAre("filler"));
}

// --- The settings of the dumps

namespace {

constexpr char found_key[] = "found the key match for instance.";

host::Instance data(Rig& rig, std::size_t place = 0)
{
    return rig.enumerate("NVRHBA_DumpData").instances.at(place);
}

host::Instance change(host::Instance instance, const std::string& name, const Value& value)
{
    instance.set(name, value);
    return instance;
}

struct Modified {
    host::Answer answer;
    Words words;
};

Modified modify(Rig& rig, const host::Instance& instance, const std::vector<std::string>& properties)
{
    rig.settle();
    const std::streamoff before = rig.log_size();
    Modified modified;
    modified.answer = rig.server().modify(instance, properties);
    modified.words = words_of_thread(rig.lines_from(before));
    return modified;
}

Words matched()
{
    return joined({{gate}, converted(first_port), {found_key}});
}

std::uint64_t retention(Rig& rig, std::size_t place = 0)
{
    return data(rig, place).get("RetentionCount").as_uint();
}

} // namespace

TEST_P(DumpService, ChangesHowManyDumpsAreKept)
{
    load();
    for (const std::uint32_t count : {1u, 20u, 7u}) {
        const Modified modified =
            modify(*rig, change(data(*rig), "RetentionCount", Value::uint32(count)), {"RetentionCount"});
        EXPECT_THAT(modified.answer, testing::Field(&host::Answer::status, testing::Field(&host::Status::code, 0)));
        Words start = joined({matched(),
                              {"NVR_MethodWrapper::nvrcimSetRetentionCount"},
                              local(),
                              {"NVR_MethodWrapper::nvrcimSetRetentionCount succeded", "Entered FC_ClearDumpClasses",
                               "Entered FC_CreateDumpClasses"}});
        ASSERT_GE(modified.words.size(), start.size());
        EXPECT_EQ(Words(modified.words.begin(), modified.words.begin() + static_cast<std::ptrdiff_t>(start.size())),
                  start);
        // Published at once, and no other port's.
        EXPECT_EQ(retention(*rig), count);
        EXPECT_EQ(retention(*rig, 1), 5u);
        EXPECT_EQ(rig->enumerate("NVRHBA_DumpService").instances.size(), 1u);
        EXPECT_EQ(rig->enumerate("NVRHBA_ElementDumpData").instances.size(), 2u);
    }
}

TEST_P(DumpService, ARetentionOutOfRangeIsRefused)
{
    load();
    for (const std::uint32_t count : {0u, 21u, 4294967295u}) {
        const Modified modified =
            modify(*rig, change(data(*rig), "RetentionCount", Value::uint32(count)), {"RetentionCount"});
        EXPECT_EQ(modified.answer.status.code, CMPI_RC_ERR_FAILED) << count;
        EXPECT_EQ(modified.words, joined({matched(),
                                          {"NVR_MethodWrapper::nvrcimSetRetentionCount"},
                                          local(),
                                          {"ERROR: RetentionCount value must be in-between 1 and 20",
                                           "NVR_MethodWrapper::nvrcimSetRetentionCount failed"}}));
    }
    EXPECT_EQ(calls("RM_SetDumpRetentionCount"), 0u);
    EXPECT_EQ(retention(*rig), 5u);
}

TEST_P(DumpService, AnUnchangedRetentionAsksNobody)
{
    load();
    const Modified modified = modify(*rig, data(*rig), {"RetentionCount"});
    EXPECT_EQ(modified.answer.status.code, CMPI_RC_OK);
    EXPECT_EQ(modified.words, matched());
    EXPECT_EQ(calls("RM_SetDumpRetentionCount"), 0u);
}

TEST_P(DumpService, TheDirectoryCannotBeChanged)
{
    load();
    host::Instance other = change(data(*rig), "DumpDirectory", Value::string("/elsewhere"));
    Modified modified =
        modify(*rig, change(other, "RetentionCount", Value::uint32(9)), {"DumpDirectory", "RetentionCount"});
    EXPECT_EQ(modified.answer.status.code, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(modified.words, joined({matched(), {"nvrcimSetDumpDirectory is not supported"}}));
    EXPECT_EQ(calls("RM_SetDumpRetentionCount"), 0u);
    EXPECT_EQ(calls("RM_SetDumpDirectory"), 0u);
    EXPECT_EQ(data(*rig).get("DumpDirectory").as_text(), directory);

    modified =
        modify(*rig, change(data(*rig), "RetentionCount", Value::uint32(9)), {"DumpDirectory", "RetentionCount"});
    EXPECT_EQ(modified.answer.status.code, CMPI_RC_OK);
    const Words start = joined({matched(), {" For Non VMWARE", "NVR_MethodWrapper::nvrcimSetRetentionCount"}});
    EXPECT_EQ(Words(modified.words.begin(), modified.words.begin() + static_cast<std::ptrdiff_t>(start.size())), start);
    EXPECT_EQ(retention(*rig), 9u);

    // An empty one, or none, is no directory.
    for (const Value& none : {Value::string(""), Value::null_of(CMPI_string)}) {
        modified = modify(*rig, change(data(*rig), "DumpDirectory", none), {"DumpDirectory", "RetentionCount"});
        EXPECT_EQ(modified.answer.status.code, CMPI_RC_OK);
        EXPECT_EQ(modified.words, matched());
    }
    // And one that the client does not name is not looked at.
    modified = modify(*rig, change(other, "RetentionCount", Value::uint32(8)), {"RetentionCount"});
    EXPECT_EQ(modified.answer.status.code, CMPI_RC_OK);
    EXPECT_EQ(retention(*rig), 8u);
}

TEST_P(DumpService, AWholeInstanceChangesWhatHasAValue)
{
    load();
    rig->settle();
    EXPECT_THAT(rig->server().modify(data(*rig)), succeeded());
    EXPECT_EQ(calls("RM_SetDumpRetentionCount"), 0u);
    host::Instance bare = data(*rig);
    for (host::Named_Value& property : bare.properties)
        if (property.name != "InstanceID") property.value = Value::null_of(property.value.type());
    EXPECT_THAT(rig->server().modify(bare), succeeded());
    EXPECT_EQ(calls("RM_SetDumpRetentionCount"), 0u);
    bare.set("RetentionCount", Value::uint32(11));
    EXPECT_THAT(rig->server().modify(bare), succeeded());
    EXPECT_EQ(retention(*rig), 11u);
}

TEST_P(DumpService, SettingsThatNobodyHasAreAFailure)
{
    load();
    host::Instance nobody = change(data(*rig), "RetentionCount", Value::uint32(9));
    nobody.set("InstanceID", Value::string("NVRHBA_DumpData::nobody"));
    nobody.path.set("InstanceID", Value::string("NVRHBA_DumpData::nobody"));
    const Modified modified = modify(*rig, nobody, {"RetentionCount"});
    EXPECT_EQ(modified.answer.status.code, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(modified.words, Words({gate, "Invalid instance of NVRHBA_DumpData_Provider Data"}));
}

TEST(DumpDataStatuses, EachIsAFailure)
{
    make_directory();
    Rig rig({host::Manner::strict(), host_with("")});
    const host::Instance changed = change(data(rig), "RetentionCount", Value::uint32(9));
    for (std::uint32_t status = 1; status <= 260; status++) {
        clear_faults();
        add_fault("call = \"RM_SetDumpRetentionCount\", status = " + std::to_string(status));
        const Modified modified = modify(rig, changed, {"RetentionCount"});
        EXPECT_EQ(modified.answer.status.code, CMPI_RC_ERR_FAILED) << status;
        EXPECT_EQ(modified.words,
                  joined({matched(),
                          {"NVR_MethodWrapper::nvrcimSetRetentionCount"},
                          local(),
                          {"Failed to set the retention count, exited with error code " + std::to_string(status),
                           status_line(status), "NVR_MethodWrapper::nvrcimSetRetentionCount failed"}}))
            << status;
    }
    clear_faults();
    add_fault("call = \"RM_IsLocalHBA\", value = 0");
    const Modified modified = modify(rig, changed, {"RetentionCount"});
    EXPECT_EQ(modified.answer.status.code, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(modified.words, joined({matched(),
                                      {"NVR_MethodWrapper::nvrcimSetRetentionCount"},
                                      not_local(),
                                      {"NVR_MethodWrapper::nvrcimSetRetentionCount failed"}}));
    clear_faults();
    EXPECT_EQ(retention(rig), 5u);
}

TEST(DumpDataStatuses, ADirectoryThatCannotBeReadAnewDoesNotFailTheChange)
{
    make_directory();
    Rig rig({host::Manner::strict(), host_with("")});
    const host::Instance changed = change(data(rig), "RetentionCount", Value::uint32(9));
    add_fault("call = \"RM_GetDumpDirectoryA\", status = 160");
    const Modified modified = modify(rig, changed, {"RetentionCount"});
    EXPECT_EQ(modified.answer.status.code, CMPI_RC_OK);
    EXPECT_THAT(modified.words, Contains("NVR_Dump::nvrcimGetDumpDirectory failed"));
    EXPECT_EQ(retention(rig), 9u);
    EXPECT_EQ(data(rig).get("DumpDirectory").as_text(), "");
}
