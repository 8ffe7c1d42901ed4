// The inventory over the simulated adapters: whole hosts, missing libraries, damaged answers.

#include <gmock/gmock.h>

#include "foundation/Management_Session.h"
#include "foundation/management_binding.h"
#include "inventory/Adapter.h"
#include "inventory/AdapterAttributes.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"
#include "inventory/PortAttributes.h"
#include "inventory/PortStatistics.h"
#include "inventory/Target.h"
#include "simulator/nvrsim.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace cimple;
using namespace nvrtest;

namespace {

// What a scan found: "adapters/ports/targets".
std::string scan(NVR_Data& data)
{
    data.buildAdapterData();
    data.buildSANData();
    std::size_t targets = 0;
    for (Port* port : data.getPorts())
        targets += port->getNumberOfTargets();
    return std::to_string(data.getAdapters().size()) + "/" + std::to_string(data.getPorts().size()) + "/" +
           std::to_string(targets);
}

constexpr char one_port[] = "[[adapter]]\n[[target]]\nluns = 3\n";

/// The libraries over one adapter with one port and a target of three units.
struct Loaded {
    explicit Loaded(const std::string& variant = "", const std::string& scenario = one_port)
    {
        if (variant.empty())
            compose_libraries();
        else
            compose_variant(variant);
        load_scenario(scenario);
        result = loadLibraries();
    }
    ~Loaded() { unloadLibraries(); }
    int result = -1;
};

} // namespace

TEST(SimulatedHost, IsFoundWhole)
{
    Loaded libraries;
    EXPECT_EQ(libraries.result, 0);
    Management_Session session;
    NVR_Data data;
    EXPECT_EQ(scan(data), "1/1/3");
    auto& attributes = dynamic_cast<FCAdapterAttributes&>(*data.getAdapters()[0]->getAttributes());
    EXPECT_NE(attributes._KERNEL_VERSION, "");
    EXPECT_NE(attributes._DeviceID, 0u);
    auto* port = dynamic_cast<FCPort*>(data.getPorts()[0]);
    EXPECT_EQ(port->portName(), port_value(0, "wwpn"));
    EXPECT_EQ(port->nodeName(), port_value(0, "wwnn"));
    EXPECT_NE(port->getTarget(2)->SerialNumber, "Unknown");
    EXPECT_GT(port->getTarget(2)->LastBlock, 0u);
    set_port(0, "statistic:1040", 77);
    EXPECT_EQ(dynamic_cast<FCPortStatistics&>(*port->getStatistics()).LinkFailures, 77u);
    EXPECT_EQ(nvrsim_open_handles(), 0u);
}

TEST(SimulatedHost, OfADataCentreIsFoundWhole)
{
    Loaded libraries("", "typical");
    Management_Session session;
    NVR_Data data;
    EXPECT_EQ(scan(data), "4/4/64");
}

TEST(SimulatedHost, ShowsWhatChanged)
{
    Loaded libraries;
    Management_Session session;
    NVR_Data data;
    EXPECT_EQ(scan(data), "1/1/3");
    set_port(0, "present", 0);
    EXPECT_EQ(scan(data), "0/0/0");
    set_port(0, "present", 1);
    EXPECT_EQ(scan(data), "1/1/3");
}

// The system's own libHBAAPI, which finds an adapter only after it was told to load its vendors' libraries.
TEST(SimulatedHost, IsFoundThroughTheSystemsLibrary)
{
    write_file("/etc/hba.conf", read_file(std::string(NVRSIM_BUILD) + "/hba.conf"));
    for (int round = 0; round < 2; round++) {
        Loaded libraries("real-hba");
        EXPECT_EQ(libraries.result, 0);
        Management_Session session;
        NVR_Data data;
        EXPECT_EQ(scan(data), "1/1/3");
        EXPECT_EQ(data.getPorts()[0]->portName(), port_value(0, "wwpn"));
        EXPECT_EQ(nvrsim_open_handles(), 0u);
    }
}

namespace {

struct Variant {
    const char* libraries;
    int result;
    bool session;
    const char* found;
};

struct SimulatedLibraries : testing::TestWithParam<Variant> {};

} // namespace

TEST_P(SimulatedLibraries, ThatAreMissingCostWhatTheyMust)
{
    const Variant& variant = GetParam();
    Loaded libraries(variant.libraries);
    EXPECT_EQ(libraries.result, variant.result);
    if (variant.session)
        EXPECT_NO_THROW(Management_Session());
    else
        EXPECT_THROW(Management_Session(), std::exception);
    NVR_Data data;
    EXPECT_EQ(scan(data), variant.found);
}

INSTANTIATE_TEST_SUITE_P(
    EachVariant, SimulatedLibraries,
    testing::Values(Variant{"rmapi-only", 1, true, "1/1/3"}, Variant{"rmapi-both-names", 1, true, "1/1/3"},
                    Variant{"nothing", 1, false, "0/0/0"}, Variant{"hba-only", 1, false, "0/0/0"},
                    Variant{"no-management", 0, false, "0/0/0"}, Variant{"no-tssdm", 1, true, "1/1/3"},
                    Variant{"no-hba", 0, true, "0/0/0"}, Variant{"lrm-without-LRM_GetVPD", 0, true, "1/1/3"},
                    Variant{"lrm-without-LRM_InitLib", 0, false, "1/1/3"},
                    Variant{"hba-without-symbols", 0, true, "0/0/0"}, Variant{"hba-without-load", 0, true, "1/1/3"},
                    Variant{"hba-without-mapping", 0, true, "1/1/0"}),
    [](const auto& info) {
        std::string name = info.param.libraries;
        for (char& c : name)
            if (!std::isalnum(static_cast<unsigned char>(c))) c = '_';
        return name;
    });

namespace {

struct SimulatedDamage : testing::TestWithParam<std::tuple<std::string, std::string>> {};

} // namespace

TEST_P(SimulatedDamage, EndsWithTheScan)
{
    const auto [operation, damage] = GetParam();
    Loaded libraries;
    Management_Session session;
    NVR_Data data;
    add_fault("call = \"" + operation + "\", damage = \"" + damage + '"');
    scan(data);
    for (Port* port : data.getPorts()) {
        try {
            port->getStatistics();
        } catch (const std::exception&) {
        }
    }
    EXPECT_GT(calls(operation), 0u);
    clear_faults();
    add_fault("call = \"" + operation + "\", value = 4294967295");
    scan(data);
    clear_faults();
    EXPECT_EQ(scan(data), "1/1/3");
    EXPECT_EQ(nvrsim_open_handles(), 0u);
}

INSTANTIATE_TEST_SUITE_P(
    EachCall, SimulatedDamage,
    testing::Combine(testing::Values("HBA_GetAdapterName", "HBA_OpenAdapter", "HBA_GetAdapterAttributes",
                                     "HBA_GetAdapterPortAttributes", "HBA_GetFcpTargetMapping", "HBA_SendScsiInquiry",
                                     "HBA_SendReadCapacity", "RM_GetHBAAttributes", "RM_GetPortAttributes",
                                     "RM_GetPortStatistics", "RM_GetAttributeValue", "RM_GetDriverType"),
                     testing::Values("garbage", "truncated", "ones", "zeros", "null", "unterminated")));
