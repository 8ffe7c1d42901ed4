// Subscriptions in each manner's order, and delivery to a sink.
#include "tests/host/Things.h"

#include <mutex>

using namespace host;
using testing::Contains;
using testing::ElementsAre;

namespace {

class Indications_ : public things::In_Every_Manner {
protected:
    std::unique_ptr<Host> server = things::make_host(manner());
    std::mutex mutex;
    std::vector<Indication> seen;
    Indication_Sink sink()
    {
        return [this](const Indication& indication) {
            std::lock_guard lock(mutex);
            seen.push_back(indication);
        };
    }
    bool asks() const { return !is("pegasus"); }
    /// Events since the last look but those of factories.
    std::vector<std::string> told()
    {
        server->settle();
        std::vector<std::string> kept;
        for (const std::string& event : things::events())
            if (event.find("principal") == std::string::npos) kept.push_back(event);
        return kept;
    }
};
FOR_EVERY_MANNER(Indications_);

TEST_P(Indications_, AreActivatedAndEndedInTheMannersOrder)
{
    int first = 0, second = 0;
    ASSERT_TRUE(server->subscribe(things::space, "TEST_Alert", sink(), first).ok());
    if (asks())
        EXPECT_THAT(told(), ElementsAre("authorize TEST_Alert: SELECT * FROM TEST_Alert", "mustPoll TEST_Alert",
                                        "activate TEST_Alert in root/test 1", "enable"));
    else
        EXPECT_THAT(told(), ElementsAre("activate TEST_Alert in root/test 1", "enable"));

    ASSERT_TRUE(server->subscribe(things::space, "CIM_Signal", sink(), second, "SELECT 1").ok());
    if (asks())
        EXPECT_THAT(told(), ElementsAre("authorize TEST_Alert: SELECT 1", "mustPoll TEST_Alert",
                                        "activate TEST_Alert in root/test 0", "enable"));
    else
        EXPECT_THAT(told(), ElementsAre("activate TEST_Alert in root/test 1"))
            << "enabled once, activation always first";

    ASSERT_TRUE(server->unsubscribe(first).ok());
    const char* type = is("sfcb-1.3.7") ? "" : "TEST_Alert";
    const std::string end = std::string("deactivate '") + type + "' in root/test ";
    EXPECT_THAT(told(), ElementsAre(end + (asks() ? "0" : "1")));
    ASSERT_TRUE(server->unsubscribe(second).ok());
    if (is("sfcb"))
        EXPECT_THAT(told(), ElementsAre(end + "1"));
    else if (is("sfcb-1.3.7"))
        EXPECT_THAT(told(), ElementsAre("disable", end + "1"));
    else
        EXPECT_THAT(told(), ElementsAre(end + "1", "disable"));
    EXPECT_EQ(6, server->unsubscribe(second).code);
    EXPECT_EQ("", server->report().to_text());
}

TEST_P(Indications_, ReachTheSinksOfTheirClassAndNamespace)
{
    things::set("alert", 1);
    int id = 0;
    ASSERT_TRUE(server->subscribe(things::space, "CIM_Signal", sink(), id).ok());
    server->settle();
    ASSERT_EQ(1u, seen.size());
    EXPECT_EQ("root/test", seen[0].name_space);
    EXPECT_EQ("TEST_Alert", seen[0].instance.path.class_name);
    EXPECT_EQ(42u, seen[0].instance.get("Number").as_uint());
    std::vector<std::string> events = told();
    EXPECT_THAT(events, Contains("delivered 0"));
    EXPECT_THAT(events, Contains(is("sfcb") || is("sfcb-1.3.7") ? "to nobody 0" : "to nobody 1"));
    EXPECT_EQ("", server->report().to_text());
}

TEST_P(Indications_, AFilterThatTheProviderRefusesIsNotActive)
{
    things::set("authorize_status", 2);
    int id = 0;
    Status status = server->subscribe(things::space, "TEST_Alert", sink(), id);
    EXPECT_EQ(asks() ? 2 : 0, status.code);
    if (asks()) {
        EXPECT_EQ(6, server->unsubscribe(id).code);
    }
}

// Where the server waits for the answer; the others do not learn of it.
TEST_P(Indications_, AFilterWhoseIndicationsAreNotEnabledIsNotActive)
{
    things::set("enable_status", 1);
    int id = 0;
    const Status status = server->subscribe(things::space, "TEST_Alert", sink(), id);
    EXPECT_EQ(asks() ? 0 : 1, status.code);
    if (asks()) return;
    EXPECT_EQ(6, server->unsubscribe(id).code);
    EXPECT_THAT(told(), ElementsAre("activate TEST_Alert in root/test 1", "enable",
                                    "deactivate 'TEST_Alert' in root/test 1", "disable"));
    things::set("enable_status", 0);
    EXPECT_EQ(0, server->subscribe(things::space, "TEST_Alert", sink(), id).code);
    EXPECT_THAT(told(), ElementsAre("activate TEST_Alert in root/test 1", "enable"));
}

TEST_P(Indications_, WithoutAProviderAreNotSupported)
{
    int id = 0;
    EXPECT_EQ(7, server->subscribe(things::space, "TEST_Thing", sink(), id).code);
    EXPECT_EQ(5, server->subscribe(things::space, "No_Such", sink(), id).code);
    EXPECT_EQ(3, server->subscribe("root/nowhere", "TEST_Alert", sink(), id).code);
}

TEST_P(Indications_, KeepAProviderFromBeingIdleWhereTheMannerLooks)
{
    int id = 0;
    ASSERT_TRUE(server->subscribe(things::space, "TEST_Alert", sink(), id).ok());
    server->settle();
    EXPECT_EQ(is("pegasus") ? 0 : 1, server->unload_idle().closed);
    // The subscription is the server's and outlives the module.
    EXPECT_EQ(is("pegasus") ? 0 : 1, server->unsubscribe(id).code);
}

TEST_P(Indications_, AreDisabledBeforeAStopWhereTheMannerDoes)
{
    int id = 0;
    ASSERT_TRUE(server->subscribe(things::space, "TEST_Alert", sink(), id).ok());
    told();
    server->stop();
    std::vector<std::string> events = told();
    if (is("sfcb") || is("sfcb-1.3.7"))
        EXPECT_THAT(events, ElementsAre("disable", "TEST_Alert Method cleanup 1", "TEST_Alert Indication cleanup 1"));
    else
        EXPECT_THAT(events, testing::Not(Contains("disable")));
}

} // namespace
