// Loading, factories, clean-up and unloading, in the order that each manner has.
#include "host/ModuleSymbols.h"
#include "tests/host/Things.h"

#include <algorithm>
#include <fstream>
#include <future>
#include <thread>

using namespace host;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::UnorderedElementsAre;

namespace {

std::vector<std::string> only(const std::string& word, std::vector<std::string> lines)
{
    lines.erase(std::remove_if(lines.begin(), lines.end(),
                               [&](const std::string& line) { return line.find(word) == std::string::npos; }),
                lines.end());
    return lines;
}

class Life : public things::In_Every_Manner {
protected:
    std::unique_ptr<Host> server = things::make_host(manner());
    bool by_class() const { return !is("pegasus"); }
    bool newest_only() const { return is("sfcb") || is("sfcb-1.3.7"); }
    void use(const char* class_name) { EXPECT_TRUE(server->names(things::space, class_name).ok()) << class_name; }
    std::vector<std::string> told(const std::string& word) { return only(word, things::events()); }
};
FOR_EVERY_MANNER(Life);

TEST_P(Life, NothingIsLoadedBeforeTheFirstRequest)
{
    EXPECT_FALSE(server->is_loaded(THINGS_MODULE));
    EXPECT_TRUE(things::events().empty());
    use("TEST_Thing");
    EXPECT_TRUE(server->is_loaded(THINGS_MODULE));
    EXPECT_THAT(server->log().front(), HasSubstr(is("pegasus") ? "dlopen (lazy, global)" : "dlopen (now, global)"));
}

TEST_P(Life, FactoriesComeAllAtOnceOrOneByOne)
{
    use("TEST_Link");
    use("TEST_Link");
    if (by_class())
        EXPECT_THAT(told("factory"),
                    ElementsAre("TEST_Link Instance factory, principal", "TEST_Link Association factory, principal",
                                "TEST_Link Method factory, principal"));
    else
        EXPECT_THAT(told("factory"), ElementsAre("TEST_Link Instance factory, principal"));
}

TEST_P(Life, AFactorysContextIsTheManners)
{
    use("TEST_Other");
    const char* seen = newest_only() ? "principal $$" : "principal none";
    EXPECT_THAT(things::events(), Contains(seen));
}

TEST_P(Life, OneMissingFactoryFailsTheClassOrOnlyItsKind)
{
    Host own(things::schema(), things::options(manner()));
    own.add(things::registration("TEST_Other", instance_kind | method_kind));
    Answer names = own.names(things::space, "TEST_Other");
    Answer call = own.call(things::thing(1, "TEST_Other"), "Hello");
    EXPECT_EQ(by_class() ? 1 : 0, names.status.code);
    EXPECT_EQ(1, call.status.code);
    EXPECT_THAT(call.status.message, HasSubstr("has no factory TEST_Other_Provider_Create_MethodMI"));
}

TEST_P(Life, AProviderNameThatRepeatsHasOneSetOfMisOrOneAClass)
{
    Host own(things::schema(), things::options(manner()));
    for (const char* class_name : {"TEST_Thing", "TEST_Other"}) {
        Registration registration = things::registration(class_name, instance_kind);
        registration.provider = "TEST_Other_Provider";
        own.add(registration);
    }
    EXPECT_TRUE(own.names(things::space, "TEST_Thing").ok());
    EXPECT_TRUE(own.names(things::space, "TEST_Other").ok());
    EXPECT_EQ(by_class() ? 2u : 1u, told("factory").size());
}

TEST_P(Life, IdleModulesAreCleanedAndClosed)
{
    use("TEST_Thing");
    use("TEST_Other");
    things::events();
    Unload_Result result = server->unload_idle();
    EXPECT_EQ(0, result.refused);
    EXPECT_EQ(1, result.closed);
    EXPECT_FALSE(server->is_loaded(THINGS_MODULE));
    if (newest_only())
        EXPECT_THAT(told("cleanup"), ElementsAre("TEST_Other Instance cleanup 0", "TEST_Thing Method cleanup 0"));
    else if (is("strict"))
        EXPECT_THAT(told("cleanup"), ElementsAre("TEST_Thing Instance cleanup 0", "TEST_Thing Method cleanup 0",
                                                 "TEST_Other Instance cleanup 0"));
    else
        EXPECT_THAT(told("cleanup"), ElementsAre("TEST_Thing Instance cleanup 0", "TEST_Other Instance cleanup 0"));
}

TEST_P(Life, AClosedModuleIsLoadedAgainByTheNextRequest)
{
    for (int round = 0; round < 10; ++round) {
        use("TEST_Link");
        EXPECT_EQ(by_class() ? 3u : 1u, told("factory").size());
        EXPECT_EQ(1, server->unload_idle().closed);
    }
    EXPECT_EQ(0, server->unload_idle().cleanups) << "nothing is left to clean";
    EXPECT_EQ("", server->report().to_text());
}

TEST_P(Life, ARefusalKeepsTheModuleAndItsMis)
{
    use("TEST_Thing");
    things::set("refuse_unload", 1);
    Unload_Result result = server->unload_idle();
    EXPECT_EQ(result.cleanups, result.refused);
    EXPECT_EQ(50, result.statuses.at(0).code);
    EXPECT_EQ(0, result.closed);
    things::events();
    use("TEST_Thing");
    EXPECT_THAT(told("factory"), ElementsAre()) << "the same MI is used again";
    things::set("refuse_unload", 0);
    EXPECT_EQ(1, server->unload_idle().closed) << "asked again at the next sample";
}

TEST_P(Life, StoppingAsksWithTerminatingAndTakesNoRefusal)
{
    use("TEST_Link");
    use("TEST_Other");
    things::events();
    things::set("refuse_unload", 1);
    Unload_Result result = server->stop();
    EXPECT_EQ(1, result.closed);
    if (newest_only())
        EXPECT_THAT(told("cleanup"), ElementsAre("TEST_Other Instance cleanup 1", "TEST_Link Association cleanup 1",
                                                 "TEST_Link Method cleanup 1"));
    else if (is("strict"))
        EXPECT_THAT(told("cleanup"), ElementsAre("TEST_Other Instance cleanup 1", "TEST_Link Instance cleanup 1",
                                                 "TEST_Link Association cleanup 1", "TEST_Link Method cleanup 1"));
    else
        EXPECT_THAT(told("cleanup"), ElementsAre("TEST_Other Instance cleanup 1", "TEST_Link Instance cleanup 1"));
    Answer late = server->names(things::space, "TEST_Other");
    EXPECT_EQ(1, late.status.code);
    EXPECT_EQ("the server has stopped", late.status.message);
    EXPECT_EQ(0, server->stop().cleanups);
}

TEST_P(Life, TheEndCleansWhatTheServerLeftOver)
{
    use("TEST_Link");
    use("TEST_Other");
    server->unload_idle();
    use("TEST_Link");
    server->stop();
    things::events();
    server.reset();
    if (newest_only())
        EXPECT_THAT(told("cleanup"), UnorderedElementsAre("TEST_Link Instance cleanup 1"));
    else
        EXPECT_THAT(told("cleanup"), ElementsAre());
}

TEST_P(Life, AThreadThatOutlivesTheServerKeepsWhatItWasLent)
{
    use("TEST_Thing");
    const CMPIBroker* broker = nullptr;
    CMPIContext* prepared = nullptr;
    server->on_request_thread([&](const CMPIBroker* mb, const CMPIContext* context) {
        broker = mb;
        prepared = mb->bft->prepareAttachThread(mb, context);
    });
    std::promise<void> attached, ended;
    std::thread thread([&] {
        EXPECT_EQ(CMPI_RC_OK, broker->bft->attachThread(broker, prepared).rc);
        CMPIObjectPath* path = broker->eft->newObjectPath(broker, things::space, "TEST_Thing", nullptr);
        attached.set_value();
        ended.get_future().wait();
        CMPIStatus status{};
        EXPECT_EQ(nullptr, broker->bft->enumerateInstances(broker, prepared, path, nullptr, &status));
        EXPECT_EQ(CMPI_RC_ERR_FAILED, status.rc);
        ASSERT_NE(nullptr, status.msg);
        EXPECT_STREQ("the server has stopped", status.msg->ft->getCharPtr(status.msg, nullptr));
        path->ft->release(path);
        EXPECT_EQ(CMPI_RC_OK, broker->bft->detachThread(broker, prepared).rc);
    });
    attached.get_future().wait();
    server.reset();
    ended.set_value();
    thread.join();
}

TEST_P(Life, AContextThatComesBackUnusedLetsTheBrokerGo)
{
    server->on_request_thread([&](const CMPIBroker* mb, const CMPIContext* context) {
        CMPIContext* prepared = mb->bft->prepareAttachThread(mb, context);
        EXPECT_EQ(1u, server->report().contexts_not_detached);
        prepared->ft->release(prepared);
    });
    EXPECT_EQ("", server->report().to_text());
}

TEST_P(Life, NeverUnloadIsHeeded)
{
    Host own(things::schema(), things::options(manner()));
    Registration registration = things::registration("TEST_Other", instance_kind);
    registration.never_unload = true;
    own.add(registration);
    EXPECT_TRUE(own.names(things::space, "TEST_Other").ok());
    EXPECT_EQ(0, own.unload_idle().cleanups);
    EXPECT_EQ(1, own.stop().cleanups);
}

TEST_P(Life, ABusyModuleIsNotIdle)
{
    things::set("count", 1);
    things::set("sleep_ms", 300);
    std::thread client([&] { EXPECT_TRUE(server->enumerate(things::space, "TEST_Other").ok()); });
    while (only("enumerate on another", things::events()).empty())
        std::this_thread::yield();
    EXPECT_EQ(0, server->unload_idle().cleanups);
    client.join();
    EXPECT_EQ(1, server->unload_idle().closed);
}

TEST_P(Life, AModuleThatCannotBeLoadedSaysWhy)
{
    Host own(things::schema(), things::options(manner()));
    Registration registration = things::registration("TEST_Other", instance_kind);
    registration.module = "/nowhere/libnothing.so";
    own.add(registration);
    Answer answer = own.names(things::space, "TEST_Other");
    EXPECT_EQ(1, answer.status.code);
    EXPECT_THAT(answer.status.message, HasSubstr("the module cannot be loaded: /nowhere/libnothing.so"));
}

TEST_P(Life, FactoriesThatFailAreToldAndTriedAgain)
{
    things::set("factory_null", 1);
    Answer answer = server->names(things::space, "TEST_Other");
    EXPECT_EQ(1, answer.status.code);
    EXPECT_THAT(answer.status.message, HasSubstr("TEST_Other_Provider_Create_InstanceMI of the module failed (no MI)"));
    things::set("factory_null", 0);
    things::set("factory_status", 2);
    answer = server->names(things::space, "TEST_Other");
    EXPECT_EQ(1, answer.status.code);
    EXPECT_THAT(answer.status.message, HasSubstr("CMPI_RC_ERR_ACCESS_DENIED not today"));
    things::set("factory_status", 0);
    EXPECT_TRUE(server->names(things::space, "TEST_Other").ok());
}

TEST(ModuleFiles, FactoriesAreFoundWithoutRunningCode)
{
    Host server(things::schema());
    ASSERT_EQ(4u, server.add_module(THINGS_MODULE, things::space));
    std::vector<std::string> classes;
    for (const Registration& each : server.registrations())
        classes.push_back(each.class_name);
    EXPECT_THAT(classes, ElementsAre("TEST_Thing", "TEST_Other", "TEST_Link", "TEST_Alert"));
    EXPECT_EQ(unsigned(instance_kind | method_kind | association_kind), server.registrations()[2].kinds);
    EXPECT_EQ("TEST_Link_Provider", server.registrations()[2].provider);
    EXPECT_FALSE(server.is_loaded(THINGS_MODULE));
}

TEST(ModuleFiles, WhatIsNoModuleIsRefusedWithAReason)
{
    std::string error;
    Host server(things::schema());
    EXPECT_EQ(0u, server.add_module("/nowhere", things::space, &error));
    EXPECT_THAT(error, HasSubstr("/nowhere: No such file"));
    EXPECT_EQ(0u, server.add_module(THINGS_MOF, things::space, &error));
    EXPECT_THAT(error, HasSubstr("not a 64-bit shared object"));
}

TEST(ModuleFiles, TruncatedAndBrokenFilesAreReadWithinTheirBounds)
{
    std::ifstream file(THINGS_MODULE, std::ios::binary);
    std::string whole(std::istreambuf_iterator<char>(file), {});
    ASSERT_GT(whole.size(), 1000u);
    const std::string copy = testing::TempDir() + "broken_module.so";
    for (std::size_t i = 0; i < 200; ++i) {
        std::string broken = whole;
        if (i % 2)
            broken.resize(whole.size() * i / 200);
        else
            for (std::size_t at = 40 + i; at < broken.size(); at += 61 + i)
                broken[at] = static_cast<char>(0xFF);
        std::ofstream(copy, std::ios::binary) << broken;
        std::string error;
        std::vector<std::string> names = exported_functions(copy, error);
        EXPECT_EQ(names.empty(), !error.empty());
    }
    std::remove(copy.c_str());
}

} // namespace
