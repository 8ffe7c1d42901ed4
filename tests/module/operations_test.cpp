// What a client may ask of the module's classes, and what it is told where it may not.
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "tests/module/support/Entries.h"
#include "tests/module/support/Expected.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Rig.h"

using namespace nvrtest;
using testing::Contains;
using testing::IsEmpty;

class Operations : public Every_Manner {};
NVR_IN_EVERY_MANNER(Operations);

TEST_P(Operations, GetFindsEveryInstanceByItsPath)
{
    Rig rig({*GetParam()});
    for (const std::string& name : rig.classes()) {
        if (name == "NVRHBA_AlertIndication") continue;
        std::size_t place = 0;
        for (const host::Instance& instance : rig.enumerate(name).instances) {
            if (place++ % 3) continue; // each is an enumeration of its own
            const host::Answer found = rig.server().get(instance.path);
            ASSERT_THAT(found, succeeded()) << instance.path.to_text();
            ASSERT_EQ(found.instances.size(), 1u);
            EXPECT_EQ(difference(to_lines(name, {instance}), to_lines(name, {found.instances[0]})), "");
        }
    }
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(Operations, GetOfKeysThatNobodyHasIsNotFoundAndLeaksNothing)
{
    Rig rig({*GetParam()});
    host::Answer ports = rig.enumerate("NVRHBA_FCPort");
    ASSERT_EQ(ports.instances.size(), 4u);
    host::Path path = ports.instances[0].path;
    path.set("DeviceID", host::Value::string("10000000C9FFFFFF"));
    rig.server().reset_report();
    EXPECT_THAT(rig.server().get(path), failed_with(CMPI_RC_ERR_NOT_FOUND));
    EXPECT_EQ(rig.server().report().left(), 0u) << rig.server().report().to_text();
}

TEST_P(Operations, NamesOfClassesAndKeysAreTakenInAnyCase)
{
    Rig rig({*GetParam()});
    EXPECT_EQ(rig.enumerate("nvrhba_fcport").instances.size(), 4u);
    host::Path path = rig.enumerate("NVRHBA_FCPort").instances.at(1).path;
    path.class_name = "NVRHBA_FCPORT";
    for (host::Named_Value& key : path.keys)
        key.name = host::lower_case(key.name);
    const host::Answer found = rig.server().get(path);
    ASSERT_THAT(found, succeeded());
    EXPECT_EQ(found.instances.at(0).get("DeviceID").as_text(), "10000000C9A00002");
}

TEST_P(Operations, APropertyListCutsTheInstanceButItsKeysStay)
{
    Rig rig({*GetParam()});
    const host::Answer ports = rig.enumerate("NVRHBA_FCPort", std::vector<std::string>{"Speed", "fabricname"});
    ASSERT_THAT(ports, succeeded());
    ASSERT_EQ(ports.instances.size(), 4u);
    for (const host::Instance& port : ports.instances) {
        EXPECT_EQ(port.get("Speed").to_text(), "16000000000");
        EXPECT_FALSE(port.get("FabricName").is_null());
        EXPECT_TRUE(port.get("Description").is_null());
        EXPECT_TRUE(port.get("MaxSpeed").is_null());
        EXPECT_EQ(port.path.keys.size(), 4u);
    }
    const host::Answer bare = rig.server().get(ports.instances[2].path, std::vector<std::string>{});
    ASSERT_THAT(bare, succeeded());
    EXPECT_TRUE(bare.instances.at(0).get("Speed").is_null());
    const host::Answer unknown = rig.enumerate("NVRHBA_FCPort", std::vector<std::string>{"NoSuchProperty"});
    ASSERT_THAT(unknown, succeeded());
    EXPECT_EQ(unknown.instances.size(), 4u);
}

// What a server would refuse by itself, asked straight at the module.
TEST(OperationsOnUnknownClasses, FailInsteadOfCallingTheClassInvalid)
{
    Rig rig;
    Entries entries;
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        CMPIInstanceMI* mi = entries.instances("NVRHBA_FCPort", broker, context);
        ASSERT_TRUE(mi);
        for (const char* name : {"CIM_NoSuchClass", ""}) {
            CMPIStatus status = {CMPI_RC_OK, nullptr};
            CMPIObjectPath* path = broker->eft->newObjectPath(broker, "root/norvane", name, &status);
            if (!path) continue; // this broker makes no path without a class
            EXPECT_EQ(mi->ft->enumerateInstanceNames(mi, context, nullptr, path).rc, CMPI_RC_ERR_FAILED);
            EXPECT_EQ(mi->ft->enumerateInstances(mi, context, nullptr, path, nullptr).rc, CMPI_RC_ERR_FAILED);
            EXPECT_EQ(mi->ft->getInstance(mi, context, nullptr, path, nullptr).rc, CMPI_RC_ERR_FAILED);
            EXPECT_EQ(mi->ft->deleteInstance(mi, context, nullptr, path).rc, CMPI_RC_ERR_FAILED);
            path->ft->release(path);
        }
        EXPECT_EQ(mi->ft->cleanup(mi, context, 1).rc, CMPI_RC_OK);
    });
}

TEST_P(Operations, NothingIsCreatedOrDeleted)
{
    Rig rig({*GetParam()});
    for (const std::string& name : rig.classes()) {
        if (name == "NVRHBA_AlertIndication") continue;
        const host::Answer all = rig.enumerate(name);
        if (all.instances.empty()) continue;
        host::Instance instance = all.instances.front();
        EXPECT_THAT(rig.server().create(instance), failed_with(CMPI_RC_ERR_NOT_SUPPORTED)) << name;
        EXPECT_THAT(rig.server().remove(instance.path), failed_with(CMPI_RC_ERR_NOT_SUPPORTED)) << name;
        EXPECT_EQ(rig.enumerate(name).instances.size(), all.instances.size()) << name;
    }
}

TEST_P(Operations, OnlyThreeClassesCanBeModified)
{
    Rig rig({*GetParam()});
    for (const std::string& name : rig.classes()) {
        if (name == "NVRHBA_AlertIndication" || name == "NVRHBA_ProviderConfigSetting" || name == "NVRHBA_FCPort" ||
            name == "NVRHBA_DumpData")
            continue;
        const host::Answer all = rig.enumerate(name);
        if (!all.instances.empty()) {
            EXPECT_THAT(rig.server().modify(all.instances.front()), failed_with(CMPI_RC_ERR_NOT_SUPPORTED)) << name;
        }
    }
}

TEST_P(Operations, QueriesAreNotSupported)
{
    Rig rig({*GetParam()});
    EXPECT_THAT(rig.server().exec_query("root/norvane", "NVRHBA_FCPort", "select * from NVRHBA_FCPort", "WQL"),
                failed_with(CMPI_RC_ERR_NOT_SUPPORTED));
}

TEST_P(Operations, InheritedMethodsAreNotSupportedWhateverTheirCase)
{
    Rig rig({*GetParam()});
    for (const auto& row : expected_rows("unsupported_methods.txt")) {
        host::Path path;
        path.name_space = "root/norvane";
        path.class_name = row.at(0);
        std::string method = row.at(1);
        EXPECT_THAT(rig.server().call(path, method), failed_with(CMPI_RC_ERR_NOT_SUPPORTED))
            << path.class_name << '.' << method;
        EXPECT_THAT(rig.server().call(path, host::lower_case(method)), failed_with(CMPI_RC_ERR_NOT_SUPPORTED))
            << path.class_name << '.' << method;
    }
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

// Straight to the module: a server that checks methods against its schema would not let these pass.
TEST(OperationsWithMethods, AreNotFoundUnderOtherNames)
{
    Rig rig;
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    host::Path path;
    path.name_space = "root/norvane";
    for (const char* name : {"NVRHBA_FCPort", "NVRHBA_ControlledBy", "NVRHBA_Product"}) {
        path.class_name = name;
        EXPECT_THAT(rig.server().call(path, "NoSuchMethod"), failed_with(CMPI_RC_ERR_METHOD_NOT_FOUND)) << name;
        EXPECT_THAT(rig.server().call(path, ""), failed_with(CMPI_RC_ERR_METHOD_NOT_FOUND)) << name;
        EXPECT_THAT(rig.server().call(path, std::string(70000, 'x')), failed_with(CMPI_RC_ERR_METHOD_NOT_FOUND))
            << name;
    }
}

// --- The settings of the cache
// ------------------------------------------------------------------------------------------

namespace {

constexpr char settings_class[] = "NVRHBA_ProviderConfigSetting";

host::Instance setting(const std::string& name, const host::Value& current)
{
    host::Instance instance;
    instance.path.name_space = "root/norvane";
    instance.path.class_name = settings_class;
    instance.path.set("InstanceID", host::Value::string("Norvane HBA Provider:" + name));
    instance.set("InstanceID", host::Value::string("Norvane HBA Provider:" + name));
    instance.set("current", current);
    return instance;
}

std::vector<std::string> currents(Rig& rig)
{
    std::vector<std::string> all;
    for (const host::Instance& instance : rig.enumerate(settings_class).instances)
        all.push_back(instance.get("current").to_text());
    return all;
}

struct Change {
    const char* name;
    std::uint32_t value;
    int status; // CMPI
    const char* word;
};

const Change changes[] = {
    {"cachetimeout", 1, CMPI_RC_OK, "Cache time-out is modified successfully"},
    {"cachetimeout", 3, CMPI_RC_OK, "Cache time-out is modified successfully"},
    {"cachetimeout", 30, CMPI_RC_OK, "Cache time-out is modified successfully"},
    {"cachetimeout", 0, CMPI_RC_ERR_INVALID_PARAMETER, "The value provided for cache time-out is out of range"},
    {"cachetimeout", 31, CMPI_RC_ERR_INVALID_PARAMETER, "The value provided for cache time-out is out of range"},
    {"cachetimeout", 4294967295u, CMPI_RC_ERR_INVALID_PARAMETER,
     "The value provided for cache time-out is out of range"},
    {"adapterrefresh", 1, CMPI_RC_OK, "Adapter refresh is modified successfully"},
    {"adapterrefresh", 2, CMPI_RC_ERR_INVALID_PARAMETER, "The value provided for adapter refresh out is out of range"},
    {"sanrefresh", 0, CMPI_RC_OK, "SAN refresh is modified successfully"},
    {"sanrefresh", 2, CMPI_RC_ERR_INVALID_PARAMETER, "The value provided for SAN refresh out is out of range"},
};

} // namespace

TEST_P(Operations, SettingsOfTheCacheChangeWithinTheirBounds)
{
    Rig rig({*GetParam()});
    for (const Change& change : changes) {
        const std::vector<std::string> before = currents(rig);
        rig.forget_words();
        const host::Answer answer = rig.server().modify(setting(change.name, host::Value::uint32(change.value)),
                                                        std::vector<std::string>{"current"});
        EXPECT_EQ(answer.status.code, change.status) << change.name << ' ' << change.value;
        EXPECT_THAT(rig.words(), Contains(change.word)) << change.name << ' ' << change.value;
        std::vector<std::string> wanted = before;
        const std::size_t place = std::string(change.name) == "cachetimeout" ? 0 : change.name[0] == 'a' ? 1 : 2;
        if (change.status == CMPI_RC_OK) wanted.at(place) = std::to_string(change.value);
        EXPECT_EQ(currents(rig), wanted) << change.name << ' ' << change.value;
    }
}

TEST_P(Operations, ASettingWithoutAValueOrOfAnotherNameIsAFailure)
{
    Rig rig({*GetParam()});
    const std::vector<std::string> before = currents(rig);
    rig.forget_words();
    // Not among the properties that the client names.
    EXPECT_THAT(
        rig.server().modify(setting("cachetimeout", host::Value::uint32(7)), std::vector<std::string>{"Description"}),
        failed_with(CMPI_RC_ERR_FAILED));
    EXPECT_THAT(
        rig.server().modify(setting("no such setting", host::Value::uint32(7)), std::vector<std::string>{"current"}),
        failed_with(CMPI_RC_ERR_FAILED));
    EXPECT_EQ(rig.count_words("Instance does not exist"), 2u);
    EXPECT_EQ(currents(rig), before);
}

TEST(OperationsOnSettings, OutliveAnAdapterRefresh)
{
    Rig rig({host::Manner::strict(), "small", refreshing_settings});
    ASSERT_THAT(
        rig.server().modify(setting("cachetimeout", host::Value::uint32(3)), std::vector<std::string>{"current"}),
        succeeded());
    rig.refresh();
    EXPECT_THAT(currents(rig), testing::ElementsAre("3", "1", "1"));
}
