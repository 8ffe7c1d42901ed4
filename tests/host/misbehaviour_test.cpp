// Providers that break the rules: the host lives, says what was wrong, and goes on.
#include "tests/host/Things.h"

using namespace host;
using testing::Contains;
using testing::Each;
using testing::ElementsAre;
using testing::HasSubstr;

namespace {

class Misbehaviour : public things::In_Every_Manner {
protected:
    void SetUp() override
    {
        things::In_Every_Manner::SetUp();
        things::set("count", 3);
    }
    std::unique_ptr<Host> server = things::make_host(manner());
    Answer enumerate() { return server->enumerate(things::space, "TEST_Other"); }
    std::vector<std::string> violations() { return server->report().violations; }
};
FOR_EVERY_MANNER(Misbehaviour);

TEST_P(Misbehaviour, AnEnumerationThatStopsEarlyKeepsWhatCame)
{
    things::set("stop_after", 2);
    Answer answer = enumerate();
    EXPECT_EQ(1, answer.status.code);
    EXPECT_EQ("stopped early", answer.status.message);
    EXPECT_EQ(2u, answer.instances.size());
}

TEST_P(Misbehaviour, InstancesThatAreNotReleasedAreCounted)
{
    things::set("keep_instances", 1);
    EXPECT_EQ(3u, enumerate().instances.size());
    Report report = server->report();
    EXPECT_EQ(3u, report.of(Object_Kind::instance).left);
    EXPECT_EQ(3u, report.left());
    EXPECT_THAT(report.to_text(), HasSubstr("CMPIInstance: 3 of 3 left at the end of a call"));
    server->reset_report();
    EXPECT_EQ("", server->report().to_text());
}

TEST_P(Misbehaviour, AReleaseTooManyIsNotedAndHarmless)
{
    things::set("release_twice", 1);
    EXPECT_EQ(3u, enumerate().instances.size());
    EXPECT_THAT(violations(), Each("use of a released CMPIInstance"));
    EXPECT_EQ(3u, violations().size());
}

TEST_P(Misbehaviour, WhatTheBrokerLentIsNotReleased)
{
    things::set("release_lent", 1);
    EXPECT_TRUE(enumerate().ok());
    EXPECT_THAT(violations(), ElementsAre("release of a CMPIObjectPath that the broker lent"));
}

TEST_P(Misbehaviour, ClonesLiveOnAndAreCounted)
{
    things::set("clone_forever", 1);
    enumerate();
    enumerate();
    EXPECT_EQ(2u, server->report().clones_alive());
    server->reset_report();
    EXPECT_EQ(2u, server->report().clones_alive()) << "what is alive is not forgotten";
}

TEST_P(Misbehaviour, ResultsOfTheWrongKindAreDropped)
{
    things::set("return_wrong_kind", 1);
    Answer answer = enumerate();
    EXPECT_EQ(3u, answer.instances.size());
    EXPECT_TRUE(answer.paths.empty());
    EXPECT_THAT(violations(), ElementsAre("returnObjectPath in an operation that returns something else"));
}

TEST_P(Misbehaviour, NullAndDoubleEndsAreNoted)
{
    things::set("return_null", 1);
    things::set("done_twice", 1);
    EXPECT_EQ(3u, enumerate().instances.size());
    EXPECT_THAT(violations(), ElementsAre("returnInstance of no instance", "returnDone twice"));
}

TEST_P(Misbehaviour, AMissingReturnDoneIsNoFault)
{
    things::set("no_done", 1);
    EXPECT_EQ(3u, enumerate().instances.size());
    EXPECT_TRUE(violations().empty());
}

TEST_P(Misbehaviour, PathsWithoutKeysAreNoted)
{
    things::set("no_keys", 1);
    EXPECT_EQ(3u, server->names(things::space, "TEST_Other").paths.size());
    EXPECT_THAT(violations(), Contains("returnObjectPath: a path of TEST_Other lacks the key Id"));
}

TEST_P(Misbehaviour, UnknownPropertiesAreNoted)
{
    things::set("unknown_property", 1);
    Answer answer = enumerate();
    const bool kept = is("sfcb") || is("sfcb-1.3.7");
    EXPECT_EQ(kept, answer.instances.at(0).find("Nonsense") != nullptr);
    EXPECT_THAT(violations(), Each("setProperty: the class TEST_Other has no property Nonsense"));
}

TEST_P(Misbehaviour, AnOkWithoutAnInstanceBecomesAFailure)
{
    things::set("ok_without_instance", 1);
    Answer answer = server->get(things::thing(1));
    EXPECT_EQ(1, answer.status.code);
    EXPECT_EQ("the provider answered OK without an instance", answer.status.message);
}

TEST_P(Misbehaviour, AnExceptionEndsTheRequestAndNotTheServer)
{
    things::set("throw", 1);
    Answer answer = enumerate();
    EXPECT_EQ(1, answer.status.code);
    EXPECT_EQ("an exception came out of enumerateInstances", answer.status.message);
    EXPECT_EQ(Fault::module, answer.status.fault);
    EXPECT_THAT(violations(), ElementsAre("an exception came out of enumerateInstances"));
    things::set("throw", 0);
    EXPECT_EQ(3u, enumerate().instances.size());
}

TEST_P(Misbehaviour, AnyStatusComesThroughAsItIs)
{
    for (int code : {2, 7, 61, 100, 4711}) {
        things::set("status", code);
        EXPECT_EQ(code, enumerate().status.code);
    }
    EXPECT_EQ("status 4711", status_name(4711));
}

TEST_P(Misbehaviour, OneFailingSubclassLeavesTheOthers)
{
    things::set("factory_null", 1);
    EXPECT_EQ(1, server->enumerate(things::space, "TEST_Other").status.code);
    things::set("factory_null", 0);
    ASSERT_TRUE(server->enumerate(things::space, "TEST_Thing").ok());
    things::set("factory_null", 1);
    Answer answer = server->enumerate(things::space, "TEST_Base");
    EXPECT_EQ(1, answer.status.code);
    EXPECT_EQ(3u, answer.instances.size()) << "those of the class whose provider lives";
}

TEST_P(Misbehaviour, TheServersLogTellsWhatWasDone)
{
    things::set("release_lent", 1);
    enumerate();
    server->stop();
    std::vector<std::string> log = server->log();
    EXPECT_THAT(log, Contains(HasSubstr("factory TEST_Other_Provider_Create_InstanceMI: OK")));
    EXPECT_THAT(log, Contains(HasSubstr("enumerateInstances TEST_Other: CMPI_RC_OK, 3 instances")));
    EXPECT_THAT(log, Contains(HasSubstr("broken rule: release of a CMPIObjectPath")));
    EXPECT_THAT(log, Contains(HasSubstr("cleanup (terminating true) of TEST_Other_Provider Instance: CMPI_RC_OK")));
    EXPECT_THAT(log.back(), HasSubstr("dlclose"));
}

} // namespace
