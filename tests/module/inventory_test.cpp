// The main job: what a client reads of a host's adapters and ports, class by class and value by value.
#include <algorithm>
#include <iomanip>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "mof/Model.h"
#include "tests/module/support/Expected.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

std::vector<std::string> texts(const host::Answer& answer, const std::string& property)
{
    std::vector<std::string> all;
    for (const host::Instance& instance : answer.instances)
        all.push_back(instance.get(property).to_text());
    return all;
}

} // namespace

class Inventory : public Every_Manner {};
NVR_IN_EVERY_MANNER(Inventory);

TEST_P(Inventory, OfTheTypicalHostIsAsItsHardwareSays)
{
    Rig rig({*GetParam()});
    const std::string expected = expected_text("typical.txt");
    const std::vector<std::string> classes = rig.classes();
    for (const auto& row : expected_rows("providers.txt")) {
        const std::string& name = row.front();
        if (name == "NVRHBA_AlertIndication") continue;
        ASSERT_NE(std::find(classes.begin(), classes.end(), name), classes.end()) << name;
        const host::Answer answer = rig.enumerate(name);
        EXPECT_THAT(answer, succeeded()) << name;
        const std::string wrong = difference(lines_of_class(expected, name), to_lines(name, answer.instances));
        EXPECT_TRUE(wrong.empty()) << wrong;
    }
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(Inventory, NamesAreThePathsOfTheInstancesInTheSameOrder)
{
    Rig rig({*GetParam()});
    for (const auto& row : expected_rows("providers.txt")) {
        const std::string& name = row.front();
        if (name == "NVRHBA_AlertIndication") continue;
        const host::Answer instances = rig.enumerate(name);
        const host::Answer names = rig.names(name);
        EXPECT_THAT(names, succeeded()) << name;
        std::vector<std::string> wanted, found;
        for (const host::Instance& instance : instances.instances)
            wanted.push_back(instance.path.to_text());
        for (const host::Path& path : names.paths)
            found.push_back(path.to_text());
        EXPECT_EQ(found, wanted) << name;
        EXPECT_EQ(std::set<std::string>(found.begin(), found.end()).size(), found.size()) << name << " repeats a name";
    }
}

namespace {

/// A row of filled.txt: what instances of one class whose InstanceID begins so have.
struct Filled {
    std::string class_name, id_begins;
    std::set<std::string> always, sometimes;
    bool seen = false;
};

std::vector<Filled> filled_rows()
{
    std::vector<Filled> rows;
    std::istringstream lines(expected_text("filled.txt"));
    for (std::string line; std::getline(lines, line);) {
        if (line.empty()) continue;
        std::istringstream words(line);
        Filled row;
        words >> row.class_name >> std::quoted(row.id_begins);
        for (std::string word; words >> word;)
            if (word.back() == '?')
                row.sometimes.insert(word.substr(0, word.size() - 1));
            else
                row.always.insert(word);
        rows.push_back(row);
    }
    return rows;
}

/// What an instance has, but for references.
std::set<std::string> filled_properties(const host::Instance& instance)
{
    std::set<std::string> names;
    for (const host::Named_Value& property : instance.properties)
        if (!property.value.is_null() && property.value.type() != CMPI_ref) names.insert(property.name);
    return names;
}

/// What a new instance of the class has.
std::set<std::string> defaults(const host::Class_Record& record)
{
    std::set<std::string> names;
    for (const auto& feature : record.declaration->features)
        if (feature->has_default) names.insert(feature->name);
    return names;
}

} // namespace

TEST(InventoryProperties, AreThoseThatTheClassesAreToHaveAndNoOthers)
{
    write_file("/etc/nvr_smis.conf", "https://storage1.norvane.test:8443/launch\n");
    Rig rig;
    std::vector<Filled> rows = filled_rows();
    for (const auto& provider : expected_rows("providers.txt")) {
        const std::string& name = provider.front();
        if (name == "NVRHBA_AlertIndication") continue;
        // The counters alone begin with nothing.
        std::set<std::string> from_schema;
        if (name != "NVRHBA_FCPortStatistics") from_schema = defaults(*rig.server().schema().find(name));
        for (const host::Instance& instance : rig.enumerate(name).instances) {
            Filled none;
            Filled* row = &none;
            for (Filled& one : rows)
                if (one.class_name == name && instance.get("InstanceID").as_text().rfind(one.id_begins, 0) == 0)
                    row = &one;
            row->seen = true;
            std::set<std::string> has = filled_properties(instance);
            for (const std::string& property : row->always)
                EXPECT_EQ(has.erase(property), 1u) << instance.path.to_text() << " lacks " << property;
            for (const std::string& property : row->sometimes)
                has.erase(property);
            for (const std::string& property : from_schema) {
                if (row->always.count(property) || row->sometimes.count(property)) continue;
                EXPECT_EQ(has.erase(property), 1u) << instance.path.to_text() << " lost the default " << property;
            }
            EXPECT_THAT(has, IsEmpty()) << instance.path.to_text();
        }
    }
    for (const Filled& row : rows)
        EXPECT_TRUE(row.seen) << row.class_name << ' ' << row.id_begins;
    nvrtest::remove("/etc/nvr_smis.conf");
}

namespace {

/// The walk goes from port to port, and what it makes for one stands together in each class, behind what belongs to
/// all.
void expect_order_of_the_walk(Rig& rig)
{
    const std::vector<std::string> ports = texts(rig.enumerate("NVRHBA_FCPort"), "DeviceID");
    ASSERT_GT(ports.size(), 1u);
    EXPECT_TRUE(std::is_sorted(ports.begin(), ports.end()));
    std::size_t classes = 0;
    for (const auto& row : expected_rows("providers.txt")) {
        const std::string& name = row.front();
        if (name == "NVRHBA_AlertIndication") continue;
        std::vector<std::size_t> order; // 0: of no port
        for (const host::Path& path : rig.names(name).paths) {
            const std::string text = host::lower_case(path.to_text());
            const auto port = std::find_if(ports.begin(), ports.end(), [&](const std::string& wwpn) {
                return text.find(host::lower_case(wwpn)) != std::string::npos;
            });
            order.push_back(port == ports.end() ? 0 : static_cast<std::size_t>(port - ports.begin()) + 1);
        }
        // These walk the ports once for each of the nine tests.
        const bool per_test = name == "NVRHBA_AvailableDiagnosticService" || name == "NVRHBA_ServiceAffectsElement";
        const auto step = static_cast<std::ptrdiff_t>(per_test ? ports.size() : std::max<std::size_t>(order.size(), 1));
        ASSERT_EQ(static_cast<std::ptrdiff_t>(order.size()) % step, 0) << name;
        for (auto part = order.begin(); part != order.end(); part += step)
            EXPECT_TRUE(std::is_sorted(part, part + step)) << name << ' ' << testing::PrintToString(order);
        classes += !order.empty() && order.back() > 1;
    }
    EXPECT_GT(classes, 30u);
}

} // namespace

TEST_P(Inventory, StandsInTheOrderOfTheWalk)
{
    Rig rig({*GetParam()});
    expect_order_of_the_walk(rig);
}

TEST(InventoryOfADualPortCard, StandsInTheOrderOfTheWalk)
{
    Rig rig({host::Manner::strict(), "dual-port"});
    expect_order_of_the_walk(rig);
}

// Each reference leads to an instance that the module itself gives, but for the host, which other providers publish.
TEST(InventoryEnds, LeadToInstances)
{
    Rig rig;
    std::set<std::string> known;
    std::vector<std::pair<std::string, std::string>> ends;
    for (const std::string& name : rig.classes()) {
        if (name == "NVRHBA_AlertIndication") continue;
        for (const host::Instance& instance : rig.enumerate(name).instances) {
            host::Path path = instance.path;
            path.name_space.clear();
            known.insert(path.to_text());
            for (const host::Named_Value& property : instance.properties)
                if (const host::Path* end = property.value.as_path()) {
                    host::Path bare = *end;
                    bare.name_space.clear();
                    if (bare.class_name != "CIM_ComputerSystem") ends.emplace_back(name, bare.to_text());
                }
        }
    }
    EXPECT_GT(ends.size(), 50u);
    for (const auto& [name, end] : ends)
        EXPECT_TRUE(known.count(end)) << name << " leads to " << end;
}

// This hardware gives each port an adapter name of its own; an adapter of two ports is shown as one.
TEST(InventoryOfADualPortCard, HasOnePackageForBothPorts)
{
    Rig rig({host::Manner::strict(), "dual-port"});
    const host::Answer ports = rig.enumerate("NVRHBA_FCPort");
    EXPECT_THAT(texts(ports, "DeviceID"), ElementsAre("10000000C9A00001", "10000000C9A00002"));
    EXPECT_THAT(texts(ports, "AdapterName"), ElementsAre("Norvane-FC2162-0", "Norvane-FC2162-0"));
    EXPECT_EQ(rig.enumerate("NVRHBA_PhysicalPackage").instances.size(), 1u);
    EXPECT_EQ(rig.enumerate("NVRHBA_Product").instances.size(), 1u);
    EXPECT_EQ(rig.enumerate("NVRHBA_LogicalPortGroup").instances.size(), 1u);
    EXPECT_EQ(rig.enumerate("NVRHBA_ProductPhysicalComponent").instances.size(), 1u);
    EXPECT_EQ(rig.enumerate("NVRHBA_MemberOfCollection").instances.size(), 2u);
    EXPECT_THAT(texts(rig.enumerate("NVRHBA_PortController"), "MaxNumberControlled"), ElementsAre("2", "2"));
    EXPECT_THAT(texts(rig.enumerate("NVRHBA_SCSIProtocolController"), "MaxUnitsControlled"), ElementsAre("2", "2"));
    EXPECT_THAT(texts(rig.enumerate("NVRHBA_PCIDevice"), "ElementName"),
                ElementsAre("Norvane:FCAdapter0", "Norvane:FCAdapter0"));
    // The adapter's one mapping has an entry for each port that sees a unit, and each port takes them all: the second
    // entry of the first unit is the first one's twin, and ends the SAN's side. The adapters' side has no twins.
    for (const std::string& word : rig.words()) {
        if (word == "Insert Failed : m_NVRHBA_SCSIProtocolEndpoint_map") continue;
        EXPECT_EQ(word.find("Insert Failed"), std::string::npos) << word;
    }
}

TEST(InventoryOfAnEmptyHost, HasProfilesAndNothingElse)
{
    Rig rig({host::Manner::strict(), "# no adapters\n"});
    EXPECT_EQ(rig.enumerate("NVRHBA_RegisteredProfile").instances.size(), 13u);
    for (const char* name : {"NVRHBA_FCPort", "NVRHBA_PhysicalPackage", "NVRHBA_PortController",
                             "NVRHBA_FCPortStatistics", "NVRHBA_LogicalDisk", "NVRHBA_SCSIProtocolEndpoint"}) {
        const host::Answer answer = rig.enumerate(name);
        EXPECT_THAT(answer, succeeded()) << name;
        EXPECT_THAT(answer.instances, IsEmpty()) << name;
    }
    EXPECT_EQ(rig.count_words("HBAAPI reports that there are NO HBAs in the system."), 1u);
    EXPECT_EQ(rig.count_words("FC Adapter Not present !!!!, throw error !!!"), 1u);
    EXPECT_EQ(rig.count_words("No FC card found"), 1u);
}

namespace {

// Ports with the values that the tables of a port's properties tell apart.
constexpr char odd_ports[] = R"(
[[adapter]]
name = "odd"
[[adapter.port]]
state = 3
speed = 3
supported_speed = 0
class_of_service = 0x20
supported_fc4 = []
type = 20
[[adapter.port]]
state = 8
speed = 4
supported_speed = 7
class_of_service = 0x5F
supported_fc4 = [88, 4]
type = 21
[[adapter.port]]
state = 7
speed = 1
supported_speed = 3
type = 2
[[adapter.port]]
state = 1
speed = 16
supported_speed = 0x18
type = 99
)";

} // namespace

TEST(InventoryOfOddPorts, FollowsTheTablesOfPortValues)
{
    Rig rig({host::Manner::strict(), odd_ports});
    const host::Answer ports = rig.enumerate("NVRHBA_FCPort");
    EXPECT_THAT(texts(ports, "PortType"), ElementsAre("1", "1", "1", "0"));
    EXPECT_THAT(texts(ports, "OtherPortType"), ElementsAre("Private Loop", "Point to Point", "Other", "NULL"));
    EXPECT_THAT(texts(ports, "OtherNetworkPortType"), ElementsAre("Private Loop", "Point to Point", "Other", "NULL"));
    EXPECT_THAT(texts(ports, "MaxSpeed"), ElementsAre("0", "10000000000", "2000000000", "8000000000"));
    EXPECT_THAT(texts(ports, "OperationalStatus"), ElementsAre("{10}", "{32776}", "{6}", "{0}"));
    EXPECT_THAT(texts(ports, "StatusDescriptions"), ElementsAre("{Stopped}", "{InService}", "{Error}", "{Unknown}"));
    EXPECT_EQ(texts(ports, "SupportedCOS")[0], "{0}");
    EXPECT_EQ(texts(ports, "SupportedCOS")[1], "{7, 1, 2, 3, 4, 5}");
    EXPECT_EQ(texts(ports, "ActiveCOS"), texts(ports, "SupportedCOS"));
    EXPECT_EQ(texts(ports, "SupportedFC4Types")[0], "{0}");
    // Type 88 shares its byte with types that have no number of their own.
    EXPECT_EQ(texts(ports, "SupportedFC4Types")[1], "{4, 88, 1}");
    // The controllers' shorter table knows no loopback value of its own.
    EXPECT_THAT(texts(rig.enumerate("NVRHBA_PortController"), "OperationalStatus"),
                ElementsAre("{10}", "{11}", "{6}", "{0}"));
    EXPECT_THAT(texts(rig.enumerate("NVRHBA_ControlledBy"), "AccessState"), ElementsAre("2", "2", "2", "0"));
}

TEST(InventoryOfPorts, TranslatesTheCodesOfTheirSpeed)
{
    std::string host = "# speeds\n";
    for (const char* code : {"0", "1", "2", "3", "4", "8", "16", "32", "64"})
        host += std::string("[[adapter]]\n[[adapter.port]]\nspeed = ") + code + "\n";
    Rig rig({host::Manner::strict(), host});
    EXPECT_THAT(texts(rig.enumerate("NVRHBA_FCPort"), "Speed"),
                ElementsAre("0", "1000000000", "2000000000", "0", "10000000000", "4000000000", "8000000000",
                            "16000000000", "0"));
}

TEST(InventoryOfBrokenSensors, LeavesTemperaturesNull)
{
    Rig rig({host::Manner::strict(), "[[adapter]]\n[[adapter.port]]\nattributes = { 551 = 0 }\n"});
    const host::Answer packages = rig.enumerate("NVRHBA_PhysicalPackage");
    ASSERT_EQ(packages.instances.size(), 1u);
    for (const char* name : {"BoardTemperature", "ThresholdCriticalTemp", "ThresholdWarningTemp"})
        EXPECT_TRUE(packages.instances[0].get(name).is_null()) << name;
    EXPECT_EQ(packages.instances[0].get("TemperatureUnit").as_text(), "Celsius");
}

// What the first port measures as 0, the second one does not tell; and each sees a unit that does not tell its size.
TEST(InventoryOfZeros, TellsThemFromWhatIsMissing)
{
    Rig rig({host::Manner::strict(), R"(
[[adapter]]
[[adapter.port]]
transceiver = { temperature = 0.0, tx_bias = 0.0, tx_power = 0.0, rx_power = 0.0 }
statistics = { 1030 = 0, 1041 = 0 }
[[adapter]]
[[adapter.port]]
transceiver = { diagnostics = false }
statistics = { 1030 = false, 1041 = -1 }
[[target]]
[[target.lun]]
[[target.lun]]
number = 1
capacity_status = 1
)"});
    const auto values = [&](const char* class_name, const char* property) {
        std::vector<std::string> texts;
        for (const host::Instance& instance : rig.enumerate(class_name).instances)
            texts.push_back(instance.get(property).is_null() ? "none" : instance.get(property).to_text());
        return texts;
    };
    for (const char* reading : {"Temperature", "TxBiasCurrent", "TxPower", "RxPower"})
        EXPECT_THAT(values("NVRHBA_Transceiver", reading), testing::ElementsAre("0", "none")) << reading;
    for (const char* counter : {"PacketsTransmitted", "LossOfSyncCounter"})
        EXPECT_THAT(values("NVRHBA_FCPortStatistics", counter), testing::ElementsAre("0", "4294967295")) << counter;
    EXPECT_THAT(values("NVRHBA_StorageVolume", "NumberOfBlocks"),
                testing::ElementsAre("16777215", "none", "16777215", "none"));
}

TEST(InventoryWithoutPCIRegisters, PublishesADeviceOfZeros)
{
    Rig rig;
    rig.stop();
    add_fault("call = \"RM_DiagReadPCIRegistersV2\", status = 1");
    rig.restart();
    const host::Answer devices = rig.enumerate("NVRHBA_PCIDevice");
    ASSERT_EQ(devices.instances.size(), 4u);
    EXPECT_EQ(devices.instances[0].get("DeviceID").as_text(), "10000000C9A00001:0x0000");
    EXPECT_EQ(devices.instances[0].get("VendorID").to_text(), "0");
    EXPECT_EQ(devices.instances[0].get("BusNumber").to_text(), "4");
    EXPECT_EQ(rig.count_words("RM_DiagReadPCIRegistersV2 call failed"), 4u);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
}

TEST(InventoryOfConvergedCards, LeavesThemOut)
{
    Rig rig({host::Manner::strict(), R"(
[[adapter]]
name = "Norvane-O1"
[[adapter]]
name = "Norvane-FC-plain"
[[adapter]]
name = "Norvane-N2"
[[adapter]]
name = "converged function"
[[adapter.port]]
attributes = { 556 = 2 }
)"});
    EXPECT_THAT(texts(rig.enumerate("NVRHBA_FCPort"), "AdapterName"), ElementsAre("Norvane-FC-plain"));
    EXPECT_EQ(rig.count_words("Found VCNA Card, AdapterName = Norvane-O1. skipping this card"), 1u);
    EXPECT_EQ(rig.count_words("Found VCNA Card, AdapterName = Norvane-N2. skipping this card"), 1u);
    EXPECT_EQ(rig.count_words("Found VCNA Card, AdapterName = converged function. skipping this card"), 1u);
}

TEST(InventoryOfTwoPortsOfOneName, ShowsOneAndEndsTheUpdate)
{
    Rig rig({host::Manner::strict(), R"(
allow_twins = true
[[adapter]]
name = "first"
[[adapter]]
name = "second"
[[adapter.port]]
wwpn = "10000000C9A00001"
)"});
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
    // The twin's device is the first thing of it that is refused.
    EXPECT_EQ(rig.count_words("Insert Failed : m_NVRHBA_PCIDevice_map"), 1u);
    EXPECT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
}
