// A client's requests, through the test provider, in every manner.
#include "tests/host/Things.h"

#include <set>
#include <thread>

using namespace host;
using testing::ElementsAre;

namespace {

class Requests : public things::In_Every_Manner {
protected:
    std::unique_ptr<Host> server = things::make_host(manner());
    void TearDown() override { EXPECT_EQ("", server->report().to_text()); }
};
FOR_EVERY_MANNER(Requests);

TEST_P(Requests, EnumerationBringsEveryTypeOfValue)
{
    things::set("count", 2);
    Answer answer = server->enumerate(things::space, "TEST_Thing");
    ASSERT_TRUE(answer.ok()) << answer.status.message;
    ASSERT_EQ(2u, answer.instances.size());
    const Instance& thing = answer.instances[1];
    EXPECT_EQ(things::thing(2), thing.path);
    EXPECT_EQ(Value::boolean(true), thing.get("Flag"));
    EXPECT_EQ(200u, thing.get("U8").as_uint());
    EXPECT_EQ(-100, thing.get("S8").as_int());
    EXPECT_EQ(60000u, thing.get("U16").as_uint());
    EXPECT_EQ(-30000, thing.get("S16").as_int());
    EXPECT_EQ(4000000000u, thing.get("U32").as_uint());
    EXPECT_EQ(-2000000000, thing.get("S32").as_int());
    EXPECT_EQ(18000000000000000000ull, thing.get("U64").as_uint());
    EXPECT_EQ(-9000000000000000000ll, thing.get("S64").as_int());
    EXPECT_EQ(1.5, thing.get("R32").as_real());
    EXPECT_EQ(-2.25, thing.get("R64").as_real());
    EXPECT_EQ(CMPI_char16, thing.get("C16").type());
    EXPECT_EQ("some text", thing.get("Text").as_text());
    EXPECT_EQ(Value::datetime("20240229120000.000000+060"), thing.get("When"));
    EXPECT_EQ("{2, 3, 4}", thing.get("Numbers").to_text());
    EXPECT_EQ("{one, two}", thing.get("Texts").to_text());
    EXPECT_EQ(things::thing(2, "TEST_Other"), *thing.get("Friend").as_path());
    EXPECT_EQ("inner", thing.get("Inner").as_instance()->get("Name").as_text());
    EXPECT_EQ(nullptr, thing.find("Flags"));
}

TEST_P(Requests, NamesAreThePathsAlone)
{
    things::set("count", 3);
    Answer answer = server->names(things::space, "test_thing");
    ASSERT_TRUE(answer.ok());
    EXPECT_THAT(answer.paths, ElementsAre(things::thing(1), things::thing(2), things::thing(3)));
    EXPECT_TRUE(answer.instances.empty());
}

TEST_P(Requests, ASuperclassBringsTheInstancesOfItsSubclasses)
{
    things::set("count", 2);
    Answer answer = server->enumerate(things::space, "TEST_Base");
    ASSERT_TRUE(answer.ok());
    std::vector<std::string> classes;
    for (const Instance& instance : answer.instances)
        classes.push_back(instance.path.class_name);
    EXPECT_THAT(classes, ElementsAre("TEST_Thing", "TEST_Thing", "TEST_Other", "TEST_Other"));
    EXPECT_EQ(4u, server->names(things::space, "CIM_Root").paths.size());
}

TEST_P(Requests, ASinkGetsEachResultInTheProvidersOrderAndTheAnswerKeepsNone)
{
    things::set("count", 3);
    Instance own;
    own.path = things::thing(7);
    server->add_instance(own);
    std::vector<Path> paths;
    std::vector<std::string> texts;
    Result_Sink sink;
    sink.instance = [&](Instance&& instance) {
        paths.push_back(instance.path);
        texts.push_back(instance.get("Text").as_text());
    };
    Answer answer = server->enumerate(things::space, "TEST_Thing", {}, &sink);
    ASSERT_TRUE(answer.ok()) << answer.status.message;
    EXPECT_TRUE(answer.instances.empty());
    EXPECT_EQ(4u, answer.handed_on);
    const auto all = ElementsAre(things::thing(1), things::thing(2), things::thing(3), things::thing(7));
    EXPECT_THAT(paths, all);
    EXPECT_THAT(texts, ElementsAre("some text", "some text", "some text", ""));
    answer = server->names(things::space, "TEST_Thing", &sink);
    EXPECT_THAT(answer.paths, all) << "a sink takes what it has a function for";
    EXPECT_EQ(0u, answer.handed_on);

    paths.clear();
    sink.path = [&](Path&& path) { paths.push_back(std::move(path)); };
    answer = server->names(things::space, "TEST_Thing", &sink);
    EXPECT_TRUE(answer.paths.empty());
    EXPECT_EQ(4u, answer.handed_on);
    EXPECT_THAT(paths, all);
    server->clear_instances();
}

TEST_P(Requests, GetFindsOneByItsKeys)
{
    things::set("count", 5);
    Answer answer = server->get(things::thing(4), {{"State"}});
    ASSERT_TRUE(answer.ok()) << answer.status.message;
    EXPECT_EQ(4u, answer.instances.at(0).get("State").as_uint());
    answer = server->get(things::thing(6));
    EXPECT_EQ(6, answer.status.code);
    EXPECT_EQ("no such thing", answer.status.message);
}

TEST_P(Requests, CreateModifyAndDeleteReachTheProvider)
{
    Instance instance;
    instance.path.name_space = things::space;
    instance.path.class_name = "TEST_Thing";
    instance.set("Id", Value::sint64(9)); // takes the class's type on its way
    Answer answer = server->create(instance);
    ASSERT_TRUE(answer.ok()) << answer.status.message;
    EXPECT_THAT(answer.paths, ElementsAre(things::thing(9)));

    instance.path = things::thing(9);
    instance.set("State", Value::uint16(5));
    EXPECT_EQ(0, server->modify(instance).status.code);
    EXPECT_EQ(0, server->modify(instance, {{"State"}}).status.code);
    instance.set("State", Value::uint16(99));
    answer = server->modify(instance);
    EXPECT_EQ(4, answer.status.code);
    EXPECT_EQ("a state is 0 to 12", answer.status.message);
    EXPECT_EQ(2, server->remove(things::thing(9)).status.code);
    EXPECT_THAT(things::events(), testing::IsSupersetOf({"TEST_Thing create 9", "TEST_Thing modify everything",
                                                         "TEST_Thing modify State"}));
}

TEST_P(Requests, AFunctionThatTheTableLacksIsNotSupported)
{
    Answer answer = server->exec_query(things::space, "TEST_Thing", "SELECT * FROM TEST_Thing", "WQL");
    EXPECT_EQ(7, answer.status.code);
    EXPECT_EQ("the provider has no execQuery", answer.status.message);
}

TEST_P(Requests, PropertiesGoThroughModifyWhereThereIsNoPropertyProvider)
{
    things::set("count", 3);
    EXPECT_TRUE(server->set_property(things::thing(1), "State", Value::sint64(3)).ok());
    EXPECT_THAT(things::events(), testing::Contains("TEST_Thing modify State"));
    EXPECT_EQ(2u, server->get_property(things::thing(2), "State").value.as_uint());
    EXPECT_EQ(12, server->get_property(things::thing(2), "Nix").status.code);
}

TEST_P(Requests, PropertiesGoToThePropertyProviderWhereThereIsOne)
{
    Registration registration = things::registration("TEST_Silent", property_kind | instance_kind);
    registration.provider = "TEST_State_Provider";
    server->add(registration);
    EXPECT_TRUE(server->set_property(things::thing(1, "TEST_Silent"), "Id", Value::uint32(5)).ok());
    EXPECT_EQ(7u, server->get_property(things::thing(1, "TEST_Silent"), "State").value.as_uint());
    EXPECT_THAT(things::events(), testing::Contains("set property Id 5"));
}

TEST_P(Requests, MethodsBringAReturnValueAndOutParameters)
{
    Answer answer = server->call(things::thing(1), "double", {{"Number", Value::uint32(21)}});
    ASSERT_TRUE(answer.ok()) << answer.status.message;
    EXPECT_EQ(Value::uint32(0), answer.value);
    ASSERT_EQ(2u, answer.out.size());
    EXPECT_EQ("Result", answer.out[0].name);
    EXPECT_EQ(42u, answer.out[0].value.as_uint());
    EXPECT_EQ("{b, a}", answer.out[1].value.to_text());
    EXPECT_EQ(17, server->call(things::thing(1), "NoSuch").status.code);
    EXPECT_EQ("hello", server->call(things::thing(1), "Hello").value.as_text());
}

TEST_P(Requests, AssociationsAreAskedOfWhoeverCanHoldTheSource)
{
    EXPECT_EQ(1u, server->associators(things::thing(1)).instances.size());
    EXPECT_THAT(server->associator_names(things::thing(1)).paths, ElementsAre(things::thing(1, "TEST_Other")));
    EXPECT_EQ(1u, server->reference_names(things::thing(1), "TEST_Link", "First").paths.size());
    EXPECT_EQ(0u, server->reference_names(things::thing(1), "TEST_Link", "Second").paths.size()) << "not in that role";
    EXPECT_EQ(0u, server->associators(things::thing(1), "TEST_Alert").instances.size()) << "not along that class";
    EXPECT_EQ(4, server->associators(things::thing(1), "No_Such").status.code);
}

TEST_P(Requests, ASinkGetsWhatTraversalsFind)
{
    std::size_t instances = 0, paths = 0;
    const Result_Sink sink{[&](Instance&&) { instances++; }, [&](Path&&) { paths++; }};
    const auto thing = things::thing(1);
    EXPECT_EQ(1u, server->associators(thing, "", "", "", "", {}, &sink).handed_on);
    EXPECT_EQ(1u, instances);
    EXPECT_EQ(1u, server->associator_names(thing, "", "", "", "", &sink).handed_on);
    EXPECT_EQ(1u, paths);
    EXPECT_EQ(1u, server->references(thing, "", "", {}, &sink).handed_on);
    EXPECT_EQ(2u, instances);
    EXPECT_EQ(1u, server->reference_names(thing, "", "", &sink).handed_on);
    EXPECT_EQ(2u, paths);
}

TEST_P(Requests, WhatTheServerDoesNotKnowItSaysItself)
{
    Answer answer = server->enumerate("root/nowhere", "TEST_Thing");
    EXPECT_EQ(3, answer.status.code);
    EXPECT_EQ("the server has no namespace root/nowhere", answer.status.message);
    EXPECT_EQ(5, server->enumerate(things::space, "No_Such").status.code);
    answer = server->enumerate(things::space, "TEST_Silent");
    EXPECT_EQ(7, answer.status.code);
    EXPECT_EQ("no instance provider is registered for TEST_Silent in root/test", answer.status.message);
    EXPECT_EQ(7, server->call(things::thing(1, "TEST_Other"), "Hello").status.code);
}

TEST_P(Requests, TheServersOwnInstancesAnswerLikeOthers)
{
    Instance profile;
    profile.path.name_space = "root/pg_interop";
    profile.path.class_name = "TEST_Profile";
    profile.set("InstanceID", Value::string("P:1"));
    profile.set("RegisteredName", Value::string("Base Server"));
    server->add_instance(profile);
    Answer answer = server->enumerate("root/pg_interop", "CIM_RegisteredProfile");
    ASSERT_EQ(1u, answer.instances.size()) << answer.status.message;
    EXPECT_EQ("Base Server", answer.instances[0].get("RegisteredName").as_text());
    EXPECT_EQ("P:1", answer.instances[0].path.find("InstanceID")->as_text());
    EXPECT_TRUE(server->get(answer.instances[0].path).ok());
    EXPECT_EQ(nullptr, server->enumerate("root/pg_interop", "TEST_Profile", {{}}).instances[0].find("RegisteredName"));
    server->clear_instances();
    EXPECT_EQ(3, server->enumerate("root/pg_interop", "CIM_RegisteredProfile").status.code);
}

TEST_P(Requests, ManyAtOnceRunAtOnceAndStayApart)
{
    things::set("count", 20);
    things::set("sleep_ms", 20);
    std::vector<std::thread> clients;
    std::atomic<int> good{0};
    for (int i = 0; i < 16; ++i)
        clients.emplace_back([&] {
            for (int round = 0; round < 5; ++round)
                if (server->enumerate(things::space, "TEST_Base").instances.size() == 40) ++good;
        });
    for (std::thread& client : clients)
        client.join();
    EXPECT_EQ(80, good);
}

TEST_P(Requests, ThousandsOfInstancesAreReleasedOnTheWay)
{
    things::set("count", 5000);
    EXPECT_EQ(5000u, server->enumerate(things::space, "TEST_Thing").instances.size());
    // Texts and arrays that the provider looked at go with the call; the instances do not pile up.
    EXPECT_LT(server->report().peak_objects, 5000u * 10);
    EXPECT_EQ(5000u, server->report().of(Object_Kind::instance).released / 2);
}

} // namespace
