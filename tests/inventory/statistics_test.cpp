// A port's counters, and that old ones stay when new ones cannot be had.

#include "inventory/PortStatistics.h"

#include <cstring>
#include <exception>

#include <gmock/gmock.h>

#include "inventory/Adapter.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"
#include "inventory/PortAttributes.h"
#include "inventory/Target.h"
#include "tests/foundation/fakes/fake_libraries.h"
#include "tests/inventory/fake_host.h"
#include "tests/support/log_capture.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;

namespace {

constexpr uint64 FCPortStatistics::*const fields[] = {
    &FCPortStatistics::SecondsSinceLastReset,
    &FCPortStatistics::PacketsTransmitted,
    &FCPortStatistics::WordsTransmitted,
    &FCPortStatistics::PacketsReceived,
    &FCPortStatistics::WordsReceived,
    &FCPortStatistics::LIPCount,
    &FCPortStatistics::NOSCount,
    &FCPortStatistics::ErrorFrames,
    &FCPortStatistics::DumpedFrames,
    &FCPortStatistics::LinkFailures,
    &FCPortStatistics::LossOfSyncCounter,
    &FCPortStatistics::LossOfSignalCounter,
    &FCPortStatistics::PrimitiveSeqProtocolErrCount,
    &FCPortStatistics::InvalidTransmissionWords,
    &FCPortStatistics::CRCErrors,
    &FCPortStatistics::TxSequences,
    &FCPortStatistics::RxSequences,
    &FCPortStatistics::ExCountOrig,
    &FCPortStatistics::ExCountResp,
    &FCPortStatistics::ActiveXRIs,
    &FCPortStatistics::ActiveRPIs,
    &FCPortStatistics::ElasticBufOverruns,
    &FCPortStatistics::LinkTransitions,
    &FCPortStatistics::PrimitiveSeqTimesouts,
    &FCPortStatistics::ArbitrationTimeouts,
};

// The attribute of each field, in the fields' order.
constexpr uint16 numbers[] = {1025, 1030, 1032, 1031, 1033, 1036, 1037, 1038, 1039, 1040, 1041, 1042, 1043,
                              1044, 1045, 1028, 1029, 1026, 1027, 1048, 1047, 1058, 1046, 1057, 1059};

struct Statistics : testing::Test {
    Statistics()
    {
        data.buildAdapterData();
        port = dynamic_cast<FCPort*>(data.getPorts().at(0));
    }
    FCPortStatistics& read() { return dynamic_cast<FCPortStatistics&>(*port->getStatistics()); }
    Values& counters() { return host.adapters[0].ports[0].statistics; }

    Fake_Host host;
    NVR_Data data;
    FCPort* port = nullptr;
};

} // namespace

TEST_F(Statistics, AreReadByNumber)
{
    ASSERT_EQ(std::size(fields), std::size(numbers));
    FCPortStatistics& statistics = read();
    for (std::size_t i = 0; i < std::size(fields); i++)
        EXPECT_EQ(statistics.*fields[i], numbers[i] * 0x100000000u) << numbers[i];
}

TEST_F(Statistics, AreAskedForInOrder)
{
    std::vector<uint16> order;
    host.faults["RM_GetAttributeValue"] = [&](int, uint32 number) {
        order.push_back(static_cast<uint16>(number));
        return 0u;
    };
    read();
    EXPECT_THAT(order, ElementsAre(1025, 1030, 1031, 1032, 1033, 1036, 1037, 1038, 1039, 1040, 1041, 1042, 1043, 1044,
                                   1045, 1026, 1027, 1028, 1029, 1046, 1047, 1048, 1057, 1058, 1059));
}

TEST_F(Statistics, ThatAreNotReportedHaveAllOnesInTheLowWord)
{
    counters()[1040] = wide_value(0xFFFFFFFFFFFFFFFFu);
    counters().erase(1041);
    counters()[1042] = wide_value(0xFFFFFFFFFFFFFFFEu);
    counters()[1043] = wide_value(0);
    FCPortStatistics& statistics = read();
    EXPECT_EQ(statistics.LinkFailures, 0xFFFFFFFFu);
    EXPECT_EQ(statistics.LossOfSyncCounter, 0xFFFFFFFFu);
    EXPECT_EQ(statistics.LossOfSignalCounter, 0xFFFFFFFFFFFFFFFEu);
    EXPECT_EQ(statistics.PrimitiveSeqProtocolErrCount, 0u);
}

TEST_F(Statistics, AreReadFromTheLibraryEachTime)
{
    EXPECT_EQ(port->statistics(), nullptr);
    const PortStatistics* first = &read();
    EXPECT_EQ(first, port->statistics());
    counters()[1040] = wide_value(5);
    EXPECT_EQ(read().LinkFailures, 5u);
    EXPECT_EQ(host.calls["RM_GetPortStatistics"], 2);
}

TEST_F(Statistics, StayWhenNewOnesCannotBeRead)
{
    host.fail("RM_GetPortStatistics", 5);
    EXPECT_THROW(port->getStatistics(), std::exception);
    EXPECT_EQ(port->statistics(), nullptr);
    host.faults.clear();
    FCPortStatistics* before = &read();
    host.fail("RM_GetPortStatistics", 5);
    Log_Capture log;
    EXPECT_THROW(port->getStatistics(), std::exception);
    EXPECT_EQ(port->statistics(), before);
    EXPECT_EQ(before->LinkFailures, 1040 * 0x100000000u);
    EXPECT_THAT(log.words(), ElementsAre("ERROR: RM_GetPortStatistics call failed (5)",
                                         "FC Port statistics error occurred,retain the old statistics !!!"));
}

TEST_F(Statistics, OfAPortWithoutANameCannotBeRead)
{
    EXPECT_THROW(FCPortStatistics(""), std::exception);
    EXPECT_THROW(FCPortStatistics("10000000C9A0000G"), std::exception);
}

TEST_F(Statistics, AreCountersOnlyWhenTheyLieInsideTheBlock)
{
    fake::operations().RM_GetAttributeValue = [](void* block, uint16_t, uint16_t* length, uint32_t* status) {
        *length = 8;
        *status = 0;
        return static_cast<void*>(static_cast<char*>(block) + 512 - 7);
    };
    FCPortStatistics& statistics = read();
    for (const auto field : fields)
        EXPECT_EQ(statistics.*field, 0xFFFFFFFFu);
}

namespace {

struct Failing_Attributes : FCPortAttributes {
    using FCPortAttributes::FCPortAttributes;
    ~Failing_Attributes() noexcept(false) override { throw std::exception(); }
};
struct Failing_Statistics : PortStatistics {
    ~Failing_Statistics() noexcept(false) override { throw std::exception(); }
};
struct Failing_Target : Target {
    using Target::Target;
    ~Failing_Target() noexcept(false) override { throw std::exception(); }
};

struct Port_Of_Failing_Parts : FCPort {
    Port_Of_Failing_Parts(Adapter* adapter) : FCPort(adapter, 0)
    {
        delete m_attributes;
        m_attributes = new Failing_Attributes(*adapter, 0);
        m_statistics = new Failing_Statistics;
        m_targets.push_back(new Failing_Target(*adapter, make_entry(0)));
    }
};

} // namespace

TEST_F(Statistics, AndOtherPartsThatFailToEndAreLogged)
{
    Log_Capture log;
    delete new Port_Of_Failing_Parts(data.getAdapters()[0]);
    EXPECT_THAT(log.words(), contains_in_order({"~FCPort", "FC Port attribute deletion failed!!!",
                                                "FC Port statistics deletion failed!!!", "~Port",
                                                "Freeing Target: 50000000C9A00000", "Target deletion failed !!!"}));
}
