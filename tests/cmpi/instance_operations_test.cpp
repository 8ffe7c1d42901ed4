// Instance and method operations: what reaches the provider, what reaches the client, and every status between.
#include "tests/cmpi/Bridge_Test.h"

namespace cimple {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

class Instances : public Bridge_Test {
protected:
    CMPIInstanceMI* mi = instance_mi();

    CMPIrc names(const fake::Path& path)
    {
        return mi->ft->enumerateInstanceNames(mi, context, result, broker.path(path)).rc;
    }
    CMPIrc enumerate(const fake::Path& path, const char** properties = nullptr)
    {
        return mi->ft->enumerateInstances(mi, context, result, broker.path(path), properties).rc;
    }
    CMPIrc get(const fake::Path& path, const char** properties = nullptr)
    {
        return mi->ft->getInstance(mi, context, result, broker.path(path), properties).rc;
    }
    CMPIrc create_one(const fake::Path& path, const fake::Values& properties)
    {
        return mi->ft->createInstance(mi, context, result, broker.path(path), broker.instance({path, properties})).rc;
    }
    CMPIrc modify(const fake::Path& path, const fake::Values& properties, const char** list = nullptr)
    {
        return mi->ft->modifyInstance(mi, context, result, broker.path(path), broker.instance({path, properties}), list)
            .rc;
    }
    CMPIrc remove(const fake::Path& path) { return mi->ft->deleteInstance(mi, context, result, broker.path(path)).rc; }

    void answer(Operation operation, int status)
    {
        provider.on[operation] = [status](void**) { return status; };
    }
};

void two_things(Test_Provider& provider)
{
    provider.instances = [] {
        auto* one = new_thing("one", 1);
        one->Text.set(String("first"));
        one->Speed.set<uint16>(16);
        return std::vector<Instance*>{one, new_thing("two", 2)};
    };
}

// --- Enumerations
// ------------------------------------------------------------------------------------------------------

TEST_F(Instances, NamesAreThePathsOfAllInstances)
{
    two_things(provider);
    EXPECT_EQ(names(class_path()), CMPI_RC_OK);
    ASSERT_THAT(returned().paths, SizeIs(2));
    EXPECT_EQ(returned().done, 1);
    const fake::Path& path = returned().paths[1];
    EXPECT_EQ(path.name_space, "root/test");
    EXPECT_EQ(path.class_name, "TEST_Thing");
    EXPECT_EQ(fake::find(path.keys, "Name").text, "two");
    EXPECT_EQ(fake::find(path.keys, "Number").number.uint8, 2);
    EXPECT_THAT(path.keys, SizeIs(2));
}

TEST_F(Instances, InstancesComeWithAllThatIsNotNull)
{
    two_things(provider);
    EXPECT_EQ(enumerate(class_path()), CMPI_RC_OK);
    ASSERT_THAT(returned().instances, SizeIs(2));
    EXPECT_EQ(returned().done, 1);
    const fake::Values& properties = returned().instances[0].properties;
    EXPECT_THAT(properties, SizeIs(4));
    EXPECT_EQ(fake::find(properties, "Text").text, "first");
    EXPECT_EQ(fake::find(properties, "Speed").number.uint16, 16);
    EXPECT_EQ(fake::find(returned().instances[0].path.keys, "Name").text, "one");
}

TEST_F(Instances, TheServerFiltersByTheListAndTheKeys)
{
    two_things(provider);
    const char* list[] = {"Speed", nullptr};
    EXPECT_EQ(enumerate(class_path(), list), CMPI_RC_OK);
    EXPECT_THAT(returned().instances[0].properties, SizeIs(3));
    EXPECT_THAT(broker.filter_keys, ElementsAre("Name", "Number"));
}

TEST_F(Instances, TheModelOfNamesWantsOnlyKeys)
{
    int text_null = -1, number_null = -1;
    provider.on[OP_ENUM_INSTANCES] = [&](void** words) {
        auto* model = static_cast<TEST_Thing*>(words[1]);
        text_null = model->Text.null;
        number_null = model->Number.null;
        return 0;
    };
    names(thing_path("one", 7));
    EXPECT_EQ(text_null, 1);
    EXPECT_EQ(number_null, 0);
}

TEST_F(Instances, TheModelOfAnEnumerationWantsWhatTheListNames)
{
    int text_null = -1, speed_null = -1;
    provider.on[OP_ENUM_INSTANCES] = [&](void** words) {
        auto* model = static_cast<TEST_Thing*>(words[1]);
        text_null = model->Text.null;
        speed_null = model->Speed.null;
        return 0;
    };
    const char* list[] = {"speed", nullptr};
    enumerate(class_path(), list);
    EXPECT_EQ(text_null, 1);
    EXPECT_EQ(speed_null, 0);
    enumerate(class_path());
    EXPECT_EQ(text_null, 0);
}

TEST_F(Instances, StatusesOfAnEnumeration)
{
    answer(OP_ENUM_INSTANCES, 70);
    EXPECT_EQ(names(class_path()), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(enumerate(class_path()), CMPI_RC_ERR_FAILED);
    answer(OP_ENUM_INSTANCES, 71);
    EXPECT_EQ(names(class_path()), CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(enumerate(class_path()), CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(returned().done, 0);
    answer(OP_ENUM_INSTANCES, 4711);
    EXPECT_EQ(names(class_path()), CMPI_RC_OK);
    EXPECT_EQ(returned().done, 0);
    EXPECT_EQ(enumerate(class_path()), CMPI_RC_OK);
    EXPECT_EQ(returned().done, 1);
}

TEST_F(Instances, AnUnknownClassIsAFailure)
{
    EXPECT_EQ(names(class_path("TEST_Nothing")), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(enumerate(class_path("")), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(get(class_path("TEST_Nothing")), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(create_one(class_path("TEST_Nothing"), {}), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(modify(class_path("TEST_Nothing"), {}), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(remove(class_path("TEST_Nothing")), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(provider.calls(OP_ENUM_INSTANCES), 0);
}

TEST_F(Instances, ClassNamesHaveNoCase)
{
    EXPECT_EQ(names(class_path("test_THING")), CMPI_RC_OK);
}

TEST_F(Instances, AConversionThatFailsStopsTheDeliveryAndNotTheRequest)
{
    two_things(provider);
    broker.eft.newInstance = [](const CMPIBroker*, const CMPIObjectPath*, CMPIStatus* rc) -> CMPIInstance* {
        if (rc) rc->rc = CMPI_RC_ERR_FAILED;
        return nullptr;
    };
    EXPECT_EQ(enumerate(class_path()), CMPI_RC_OK);
    EXPECT_THAT(returned().instances, IsEmpty());
    EXPECT_EQ(returned().done, 1);
}

// --- Get
// ---------------------------------------------------------------------------------------------------------------

TEST_F(Instances, GetAsksTheProviderFirst)
{
    provider.on[OP_GET_INSTANCE] = [](void** words) {
        auto* model = static_cast<TEST_Thing*>(words[1]);
        EXPECT_EQ(model->Text.null, 0);
        auto* thing = new_thing(model->Name.value.c_str(), model->Number.value);
        thing->Text.set(String("got"));
        *static_cast<Instance**>(words[2]) = thing;
        return 0;
    };
    EXPECT_EQ(get(thing_path("one", 1)), CMPI_RC_OK);
    ASSERT_THAT(returned().instances, SizeIs(1));
    EXPECT_EQ(fake::find(returned().instances[0].properties, "Text").text, "got");
    EXPECT_EQ(provider.calls(OP_ENUM_INSTANCES), 0);
    EXPECT_EQ(returned().done, 1);
}

TEST_F(Instances, GetFallsBackToTheEnumeration)
{
    two_things(provider);
    EXPECT_EQ(get(thing_path("one", 1)), CMPI_RC_OK);
    ASSERT_THAT(returned().instances, SizeIs(1));
    EXPECT_EQ(fake::find(returned().instances[0].properties, "Text").text, "first");
}

TEST_F(Instances, GetByEnumerationKeepsTheFirstMatch)
{
    provider.instances = [] {
        auto* first = new_thing("same", 1);
        first->Text.set(String("first"));
        auto* second = new_thing("same", 1);
        second->Text.set(String("second"));
        return std::vector<Instance*>{first, second};
    };
    EXPECT_EQ(get(thing_path("same", 1)), CMPI_RC_OK);
    ASSERT_THAT(returned().instances, SizeIs(1));
    EXPECT_EQ(fake::find(returned().instances[0].properties, "Text").text, "first");
}

TEST_F(Instances, GetOfKeysThatNobodyCarriesIsNotFound)
{
    two_things(provider);
    EXPECT_EQ(get(thing_path("three", 3)), CMPI_RC_ERR_NOT_FOUND);
    EXPECT_EQ(get(class_path()), CMPI_RC_ERR_NOT_FOUND);
    answer(OP_ENUM_INSTANCES, 70);
    EXPECT_EQ(get(thing_path("one", 1)), CMPI_RC_ERR_NOT_FOUND);
    EXPECT_THAT(returned().instances, IsEmpty());
}

TEST_F(Instances, StatusesOfGet)
{
    const std::pair<int, CMPIrc> rows[] = {{60, CMPI_RC_ERR_NOT_FOUND},
                                           {62, CMPI_RC_ERR_INVALID_PARAMETER},
                                           {63, CMPI_RC_ERR_ACCESS_DENIED},
                                           {64, CMPI_RC_ERR_FAILED},
                                           {4711, CMPI_RC_ERR_FAILED}}; // found, but there is no instance
    for (const auto& [status, code] : rows) {
        answer(OP_GET_INSTANCE, status);
        EXPECT_EQ(get(thing_path("one", 1)), code) << status;
    }
    EXPECT_EQ(returned().done, 0);
}

// --- Create, modify, delete
// --------------------------------------------------------------------------------------------

TEST_F(Instances, CreateHandsOverAllPropertiesAndReturnsThePath)
{
    std::string text;
    provider.on[OP_CREATE_INSTANCE] = [&](void** words) {
        auto* thing = static_cast<TEST_Thing*>(words[1]);
        text = thing->Text.value.c_str();
        EXPECT_STREQ(thing->__name_space.c_str(), "root/test");
        thing->Number.set<uint8>(9);
        return 0;
    };
    EXPECT_EQ(create_one(class_path(), {{"Name", fake::string("new")}, {"Text", fake::string("made")}}), CMPI_RC_OK);
    EXPECT_EQ(text, "made");
    ASSERT_THAT(returned().paths, SizeIs(1));
    EXPECT_EQ(fake::find(returned().paths[0].keys, "Number").number.uint8, 9);
    EXPECT_EQ(returned().done, 1);
}

TEST_F(Instances, StatusesOfCreate)
{
    const std::pair<int, CMPIrc> rows[] = {
        {80, CMPI_RC_ERR_ALREADY_EXISTS}, {81, CMPI_RC_ERR_NOT_SUPPORTED}, {82, CMPI_RC_ERR_INVALID_PARAMETER},
        {83, CMPI_RC_ERR_ACCESS_DENIED},  {84, CMPI_RC_ERR_FAILED},        {4711, CMPI_RC_OK}};
    for (const auto& [status, code] : rows) {
        answer(OP_CREATE_INSTANCE, status);
        EXPECT_EQ(create_one(class_path(), {}), code) << status;
    }
    EXPECT_EQ(returned().done, 0);
    EXPECT_THAT(returned().paths, IsEmpty());
}

TEST_F(Instances, ModifyWithoutAListMarksEveryPropertyPresent)
{
    int absent = 0;
    provider.on[OP_MODIFY_INSTANCE] = [&](void** words) {
        auto* model = static_cast<TEST_Thing*>(words[1]);
        auto* thing = static_cast<TEST_Thing*>(words[2]);
        absent = model->Name.null + model->Text.null + model->Speed.null + model->When.null + model->Words.null;
        EXPECT_STREQ(thing->Text.value.c_str(), "changed");
        EXPECT_EQ(thing->Speed.null, 1);
        return 0;
    };
    EXPECT_EQ(modify(thing_path("one", 1), {{"Text", fake::string("changed")}}), CMPI_RC_OK);
    EXPECT_EQ(absent, 0);
    ASSERT_THAT(returned().paths, SizeIs(1));
    EXPECT_EQ(fake::find(returned().paths[0].keys, "Name").text, "one");
    EXPECT_EQ(returned().done, 1);
}

TEST_F(Instances, ModifyWithAListMarksWhatItNames)
{
    provider.on[OP_MODIFY_INSTANCE] = [&](void** words) {
        auto* model = static_cast<TEST_Thing*>(words[1]);
        EXPECT_EQ(model->Text.null, 0);
        EXPECT_EQ(model->Speed.null, 1);
        EXPECT_EQ(model->Name.null, 0);
        return 0;
    };
    const char* list[] = {"text", nullptr};
    EXPECT_EQ(modify(thing_path("one", 1), {{"Text", fake::string("x")}, {"Speed", fake::uint16(1)}}, list),
              CMPI_RC_OK);
}

TEST_F(Instances, ModifyTakesMissingKeysFromThePath)
{
    std::string name;
    int number = 0;
    provider.on[OP_MODIFY_INSTANCE] = [&](void** words) {
        auto* thing = static_cast<TEST_Thing*>(words[2]);
        name = thing->Name.value.c_str();
        number = thing->Number.null ? -1 : thing->Number.value;
        return 0;
    };
    EXPECT_EQ(modify(thing_path("path", 7), {{"Name", fake::string("own")}}), CMPI_RC_OK);
    EXPECT_EQ(name, "own");
    EXPECT_EQ(number, 7);
}

TEST_F(Instances, StatusesOfModify)
{
    const std::pair<int, CMPIrc> rows[] = {
        {100, CMPI_RC_ERR_NOT_FOUND},     {101, CMPI_RC_ERR_NOT_SUPPORTED}, {102, CMPI_RC_ERR_INVALID_PARAMETER},
        {103, CMPI_RC_ERR_ACCESS_DENIED}, {104, CMPI_RC_ERR_FAILED},        {4711, CMPI_RC_OK}};
    for (const auto& [status, code] : rows) {
        answer(OP_MODIFY_INSTANCE, status);
        EXPECT_EQ(modify(thing_path("one", 1), {}), code) << status;
    }
    EXPECT_EQ(returned().done, 0);
}

TEST_F(Instances, DeleteHandsOverTheKeys)
{
    std::string name;
    provider.on[OP_DELETE_INSTANCE] = [&](void** words) {
        name = static_cast<TEST_Thing*>(words[1])->Name.value.c_str();
        return 0;
    };
    EXPECT_EQ(remove(thing_path("one", 1)), CMPI_RC_OK);
    EXPECT_EQ(name, "one");
    EXPECT_EQ(returned().done, 1);
}

TEST_F(Instances, StatusesOfDelete)
{
    const std::pair<int, CMPIrc> rows[] = {{90, CMPI_RC_ERR_NOT_FOUND},
                                           {91, CMPI_RC_ERR_NOT_SUPPORTED},
                                           {92, CMPI_RC_ERR_ACCESS_DENIED},
                                           {93, CMPI_RC_ERR_FAILED}};
    for (const auto& [status, code] : rows) {
        answer(OP_DELETE_INSTANCE, status);
        EXPECT_EQ(remove(thing_path("one", 1)), code) << status;
    }
    EXPECT_EQ(returned().done, 0);
    answer(OP_DELETE_INSTANCE, 4711);
    EXPECT_EQ(remove(thing_path("one", 1)), CMPI_RC_OK);
    EXPECT_EQ(returned().done, 1);
}

TEST_F(Instances, QueriesAreNotSupported)
{
    EXPECT_EQ(mi->ft->execQuery(mi, context, result, broker.path(class_path()), "select", "WQL").rc,
              CMPI_RC_ERR_NOT_SUPPORTED);
}

class InstanceLog : public Runtime_Log, public Instances {};

TEST_F(InstanceLog, NamesOperationAndCode)
{
    names(class_path());
    get(thing_path("none", 1));
    mi->ft->execQuery(mi, context, result, broker.path(class_path()), "", "");
    for (const char* line : {"DBG enter: enumInstanceNames()", "DBG return: enumInstanceNames(): CMPI_RC_OK",
                             "DBG return: getInstance(): CMPI_RC_ERR_NOT_FOUND", "DBG enter: execQuery()",
                             "DBG return: execQuery(): CMPI_RC_ERR_NOT_SUPPORTED"})
        EXPECT_TRUE(has(line)) << line;
}

// --- Methods
// -----------------------------------------------------------------------------------------------------------

class Methods : public Bridge_Test {
protected:
    CMPIMethodMI* mi = method_mi();
    CMPIArgs* out = broker.args();

    CMPIrc call(const char* method, const fake::Values& in = {}, const fake::Path& path = thing_path("one", 1))
    {
        return mi->ft->invokeMethod(mi, context, result, broker.path(path), method, broker.args(in), out).rc;
    }

    void serve(std::function<void(TEST_Thing_Echo&)> body, int status = 0)
    {
        provider.on[OP_INVOKE_METHOD] = [body, status](void** words) {
            auto* call = static_cast<TEST_Thing_Echo*>(words[2]);
            call->return_value.set<uint32>(0);
            body(*call);
            return status;
        };
    }
};

TEST_F(Methods, ParametersGoInAndResultsComeOut)
{
    provider.on[OP_INVOKE_METHOD] = [](void** words) {
        EXPECT_STREQ(static_cast<TEST_Thing*>(words[1])->Name.value.c_str(), "one");
        auto* call = static_cast<TEST_Thing_Echo*>(words[2]);
        EXPECT_EQ(call->Number.value, 7);
        EXPECT_EQ(call->Flag.null, 1);
        call->Reply.set(call->Text.value);
        call->return_value.set<uint32>(33068);
        return 0;
    };
    EXPECT_EQ(call("Echo", {{"Text", fake::string("hello")}, {"number", fake::uint16(7)}}), CMPI_RC_OK);
    ASSERT_THAT(returned().values, SizeIs(1));
    EXPECT_EQ(returned().values[0].type, CMPI_uint32);
    EXPECT_EQ(returned().values[0].number.uint32, 33068u);
    EXPECT_EQ(returned().done, 1);
    EXPECT_THAT(broker.content(out), SizeIs(1));
    EXPECT_EQ(fake::find(broker.content(out), "Reply").text, "hello");
}

TEST_F(Methods, NamesHaveNoCase)
{
    serve([](TEST_Thing_Echo&) {});
    EXPECT_EQ(call("eCHO"), CMPI_RC_OK);
}

TEST_F(Methods, AnUnknownMethodIsNotFound)
{
    EXPECT_EQ(call("Nothing"), CMPI_RC_ERR_METHOD_NOT_FOUND);
    EXPECT_EQ(call("Text"), CMPI_RC_ERR_METHOD_NOT_FOUND); // a property is no method
    EXPECT_EQ(call(nullptr), CMPI_RC_ERR_METHOD_NOT_FOUND);
    EXPECT_EQ(provider.calls(OP_INVOKE_METHOD), 0);
}

TEST_F(Methods, AnUnknownClassIsAFailure)
{
    EXPECT_EQ(call("Echo", {}, class_path("TEST_Nothing")), CMPI_RC_ERR_FAILED);
}

TEST_F(Methods, AMethodNamedLikeItsClassIsRefused)
{
    EXPECT_EQ(call("test_thing"), CMPI_RC_ERR_INVALID_CLASS);
    EXPECT_EQ(provider.calls(OP_INVOKE_METHOD), 0);
}

TEST_F(Methods, StatusesOfAMethod)
{
    const std::pair<int, CMPIrc> rows[] = {
        {130, CMPI_RC_ERR_FAILED}, {131, CMPI_RC_ERR_NOT_SUPPORTED}, {132, CMPI_RC_ERR_ACCESS_DENIED}};
    for (const auto& [status, code] : rows) {
        serve([](TEST_Thing_Echo&) {}, status);
        EXPECT_EQ(call("Echo"), code) << status;
    }
    EXPECT_THAT(returned().values, IsEmpty());
    for (int status : {-1, 4711}) {
        serve([](TEST_Thing_Echo&) {}, status);
        EXPECT_EQ(call("Echo"), CMPI_RC_OK) << status;
    }
    EXPECT_THAT(returned().values, SizeIs(2));
}

TEST_F(Methods, ANullReturnValueIsAFailedConversion)
{
    serve([](TEST_Thing_Echo& call) { call.return_value.null = 1; });
    EXPECT_EQ(call("Echo"), CMPI_RC_ERR_FAILED);
    EXPECT_THAT(returned().values, IsEmpty());
    EXPECT_EQ(returned().done, 0);
}

TEST_F(Methods, TextIsCastToTheParametersType)
{
    serve([](TEST_Thing_Echo& call) {
        EXPECT_EQ(call.Flag.null, 0);
        EXPECT_TRUE(call.Flag.value);
        EXPECT_EQ(call.Number.null, 0);
        EXPECT_EQ(call.Number.value, 70000 % 65536);
        EXPECT_EQ(call.Wide.null, 1);   // 64 bits are not cast
        EXPECT_EQ(call.Letter.null, 1); // nor characters
    });
    EXPECT_EQ(call("Echo", {{"Flag", fake::string("TRUEish")},
                            {"Number", fake::string("70000 and more")},
                            {"Wide", fake::string("1")},
                            {"Letter", fake::string("x")}}),
              CMPI_RC_OK);
}

TEST_F(Methods, FalseIsReadByItsFirstFiveLettersAndAllElseIsRefused)
{
    std::vector<int> seen;
    serve([&](TEST_Thing_Echo& call) { seen.push_back(call.Flag.null ? 2 : call.Flag.value); });
    for (const char* text : {"falsehood", "fals", "1", "tru"})
        call("Echo", {{"Flag", fake::string(text)}});
    EXPECT_THAT(seen, ElementsAre(0, 2, 2, 2));
}

TEST_F(Methods, ABooleanForAnInstanceArrayIsItsNull)
{
    serve([](TEST_Thing_Echo& call) { EXPECT_EQ(call.Parts.null, 1); });
    EXPECT_EQ(call("Echo", {{"Parts", fake::boolean(true)}}), CMPI_RC_OK);
}

TEST_F(Methods, ReferencesGoBothWays)
{
    serve([](TEST_Thing_Echo& call) {
        ASSERT_NE(call.Target, nullptr);
        EXPECT_STREQ(call.Target->Id.value.c_str(), "p1");
        EXPECT_STREQ(call.Target->__name_space.c_str(), "root/test");
        unref(call.Target);
        call.Target = new_part("p2");
    });
    EXPECT_EQ(call("Echo", {{"Target", fake::reference(part_path("p1"))}}), CMPI_RC_OK);
    fake::Value target = fake::find(broker.content(out), "Target");
    ASSERT_EQ(target.type, CMPI_ref);
    EXPECT_EQ(fake::find(target.path->keys, "Id").text, "p2");
    EXPECT_EQ(target.path->name_space, "root/test");
}

class MethodLog : public Runtime_Log, public Methods {};

TEST_F(MethodLog, TellsWhyATextIsNotCast)
{
    const auto lines_of = [this](const char* name, const fake::Value& value) {
        const std::size_t before = lines().size() + 1; // and the line of the call's beginning
        call("Echo", {{name, value}});
        auto all = lines();
        all.erase(all.begin(), all.begin() + static_cast<std::ptrdiff_t>(before));
        all.pop_back(); // of its end
        return all;
    };
    EXPECT_THAT(lines_of("Wide", fake::string("1")),
                ElementsAre("WARN Default case - unsupported type", "WARN type mismatch on Wide: string/uint64",
                            "WARN conversion error: Echo.Wide"));
    EXPECT_THAT(lines_of("Letter", fake::string("x")),
                ElementsAre("INFO cast_cmpi_string_to_scalar(): Not supported",
                            "WARN type mismatch on Letter: string/char16", "WARN conversion error: Echo.Letter"));
    EXPECT_THAT(lines_of("Flag", fake::string("maybe")),
                ElementsAre("WARN type mismatch on Flag: string/boolean", "WARN conversion error: Echo.Flag"));
    EXPECT_THAT(lines_of("Number", fake::string_without_chars()),
                ElementsAre("INFO ignored null CMPI string", "WARN cmpi_to_cimple_value() failed",
                            "WARN conversion error: Echo.Number"));
    broker.string_ft.getCharPtr = [](const CMPIString* string, CMPIStatus* status) -> const char* {
        const auto& text = fake::text_of(string);
        status->rc = text == "broken" ? CMPI_RC_ERR_FAILED : CMPI_RC_OK;
        return text.c_str();
    };
    EXPECT_THAT(lines_of("Number", fake::string("broken")),
                ElementsAre("WARN CMGetCharsPtr() failed", "WARN cmpi_to_cimple_value() failed",
                            "WARN conversion error: Echo.Number"));
}

TEST_F(MethodLog, HasAWordForEachFailure)
{
    call("Nothing");
    call("Echo", {}, class_path("TEST_Nothing"));
    call("Echo", {{"Number", fake::string("7")}, {"Unknown", fake::uint16(1)}, {"Text", fake::uint16(1)}});
    for (const char* line :
         {"DBG return: invokeMethod(): CMPI_RC_ERR_METHOD_NOT_FOUND Nothing",
          "DBG return: invokeMethod(): CMPI_RC_ERR_FAILED MetaClass not found",
          "WARN converting string to registered parameter type", "WARN unknown feature: Echo.Unknown",
          "WARN type mismatch on Text: uint16/string", "WARN conversion error: Echo.Text"})
        EXPECT_TRUE(has(line)) << line;
}

} // namespace
} // namespace cimple
