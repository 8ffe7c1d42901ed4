// Associations that the bridge computes from the enumeration of an association class.
#include "runtime/Selection.h"
#include "tests/cmpi/Bridge_Test.h"

namespace cimple {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

class Associations : public Bridge_Test {
protected:
    Associations() : Bridge_Test(&TEST_Link::meta)
    {
        provider.instances = [] {
            auto* noted = new_link("one", "p1");
            noted->Note.set(String("note"));
            return std::vector<Instance*>{noted, new_link("one", "p2"), new_link("two", "p2")};
        };
    }

    CMPIAssociationMI* mi = association_mi();
    const fake::Path one{"root/test", "TEST_Base", {{"Name", fake::string("one")}}};
    const fake::Path none{"root/test", "TEST_Base", {{"Name", fake::string("none")}}};
    const fake::Path p2{"root/test", "TEST_Part", {{"Id", fake::string("p2")}}};

    CMPIrc associator_names(const fake::Path& path, const char* result_class = nullptr, const char* role = nullptr,
                            const char* result_role = nullptr)
    {
        return mi->ft->associatorNames(mi, context, result, broker.path(path), nullptr, result_class, role, result_role)
            .rc;
    }
    CMPIrc associators(const fake::Path& path, const char** properties = nullptr)
    {
        return mi->ft
            ->associators(mi, context, result, broker.path(path), nullptr, nullptr, nullptr, nullptr, properties)
            .rc;
    }
    CMPIrc reference_names(const fake::Path& path, const char* role = nullptr)
    {
        return mi->ft->referenceNames(mi, context, result, broker.path(path), nullptr, role).rc;
    }
    CMPIrc references(const fake::Path& path, const char* role = nullptr, const char** properties = nullptr)
    {
        return mi->ft->references(mi, context, result, broker.path(path), nullptr, role, properties).rc;
    }
    std::vector<std::string> ids()
    {
        std::vector<std::string> ids;
        for (const auto& path : returned().paths)
            ids.push_back(fake::find(path.keys, path.class_name == "TEST_Part" ? "Id" : "Name").text);
        returned() = {};
        return ids;
    }
};

TEST_F(Associations, AssociatorNamesAreTheFarEnds)
{
    EXPECT_EQ(associator_names(one), CMPI_RC_OK);
    EXPECT_THAT(ids(), testing::ElementsAre("p1", "p2"));
    EXPECT_EQ(associator_names(p2), CMPI_RC_OK);
    EXPECT_THAT(ids(), testing::ElementsAre("one", "two"));
    EXPECT_EQ(associator_names(none), CMPI_RC_OK);
    EXPECT_THAT(ids(), IsEmpty());
    EXPECT_EQ(returned().done, 0);
}

TEST_F(Associations, RolesAndResultClassesChoose)
{
    associator_names(one, nullptr, "ANTECEDENT");
    EXPECT_THAT(ids(), SizeIs(2));
    associator_names(one, nullptr, "Dependent");
    EXPECT_THAT(ids(), IsEmpty());
    associator_names(one, nullptr, nullptr, "dependent");
    EXPECT_THAT(ids(), SizeIs(2));
    associator_names(one, nullptr, nullptr, "Antecedent");
    EXPECT_THAT(ids(), IsEmpty());
    associator_names(one, "test_part");
    EXPECT_THAT(ids(), SizeIs(2));
    associator_names(one, "TEST_Thing");
    EXPECT_THAT(ids(), IsEmpty());
}

TEST_F(Associations, ASuperclassOfTheFarEndPassesAndASubclassDoesNot)
{
    provider.instances = [] {
        auto* link = new_link("x", "p1");
        unref(link->Antecedent);
        link->Antecedent = reinterpret_cast<TEST_Base*>(new_thing("derived", 1));
        return std::vector<Instance*>{link, new_link("base", "p1")};
    };
    const fake::Path p1{"root/test", "TEST_Part", {{"Id", fake::string("p1")}}};
    associator_names(p1, "TEST_Base");
    EXPECT_THAT(ids(), testing::ElementsAre("derived", "base"));
    associator_names(p1, "TEST_Thing");
    EXPECT_THAT(ids(), testing::ElementsAre("derived"));
}

TEST_F(Associations, ReferenceNamesAreThePathsOfTheAssociations)
{
    EXPECT_EQ(reference_names(one), CMPI_RC_OK);
    ASSERT_THAT(returned().paths, SizeIs(2));
    EXPECT_EQ(returned().paths[0].class_name, "TEST_Link");
    EXPECT_EQ(fake::find(returned().paths[0].keys, "Dependent").path->class_name, "TEST_Part");
    returned() = {};
    reference_names(one, "antecedent");
    EXPECT_THAT(returned().paths, SizeIs(2));
    returned() = {};
    reference_names(one, "Dependent");
    EXPECT_THAT(returned().paths, IsEmpty());
}

TEST_F(Associations, ReferencesAreTheAssociations)
{
    EXPECT_EQ(references(one), CMPI_RC_OK);
    ASSERT_THAT(returned().instances, SizeIs(2));
    EXPECT_EQ(fake::find(returned().instances[0].properties, "Note").text, "note");
    EXPECT_EQ(fake::find(returned().instances[1].properties, "Note").type, CMPI_string);
    EXPECT_FALSE(fake::find(returned().instances[1].properties, "Note").null()) << "without a list all is reported";
    EXPECT_EQ(fake::find(returned().instances[1].properties, "Dependent").path->class_name, "TEST_Part");
    returned() = {};
    EXPECT_EQ(references(none), CMPI_RC_OK);
    EXPECT_THAT(returned().instances, IsEmpty());
}

TEST_F(Associations, ReferencesHeedThePropertyList)
{
    const char* list[] = {"Antecedent", nullptr};
    EXPECT_EQ(references(one, nullptr, list), CMPI_RC_OK);
    ASSERT_THAT(returned().instances, SizeIs(2));
    EXPECT_EQ(fake::find(returned().instances[0].properties, "Note").type, CMPI_null);
}

TEST_F(Associations, AssociatorsAreFetchedFromTheirOwnProvider)
{
    broker.found = {{{"root/test", "TEST_Part", {}}, {{"Label", fake::string("whole")}}}};
    EXPECT_EQ(associators(one), CMPI_RC_OK);
    ASSERT_THAT(returned().instances, SizeIs(2));
    EXPECT_EQ(fake::find(returned().instances[0].properties, "Label").text, "whole");
    ASSERT_THAT(broker.up_calls, SizeIs(2));
    EXPECT_EQ(broker.up_calls[0].name, "getInstance");
    EXPECT_EQ(fake::find(broker.up_calls[0].path.keys, "Id").text, "p1");
}

TEST_F(Associations, AnAssociatorThatIsGoneIsPassedOver)
{
    broker.answer = CMPI_RC_ERR_NOT_FOUND;
    EXPECT_EQ(associators(one), CMPI_RC_OK);
    EXPECT_THAT(returned().instances, IsEmpty());
}

TEST_F(Associations, AnAssociatorThatIsGoneLeavesTheOthers)
{
    broker.found = {{{"root/test", "TEST_Part", {}}, {{"Label", fake::string("whole")}}}};
    for (const CMPIrc gone : {CMPI_RC_ERR_NOT_FOUND, CMPI_RC_OK}) { // with OK: no instance and no reason
        returned() = {};
        broker.gone = {"p1", gone};
        EXPECT_EQ(associators(one), CMPI_RC_OK);
        EXPECT_THAT(returned().instances, SizeIs(1));
    }
}

class AssociationLog : public Runtime_Log, public Associations {};

TEST_F(AssociationLog, AClassThatTheModuleDoesNotHaveHasNoResult)
{
    const fake::Path other = class_path("TEST_Nothing");
    EXPECT_EQ(associator_names(other), CMPI_RC_OK);
    EXPECT_EQ(associators(other), CMPI_RC_OK);
    EXPECT_EQ(reference_names(other), CMPI_RC_OK);
    EXPECT_EQ(references(other), CMPI_RC_OK);
    EXPECT_EQ(provider.calls(OP_ENUM_INSTANCES), 0);
    for (const char* line :
         {"DBG return: associators(): CMPI_RC_OK", "DBG return: associatorNames(): CMPI_RC_ERR_INVALID_CLASS",
          "DBG return: references(): CMPI_RC_ERR_INVALID_CLASS",
          "DBG return: referenceNames(): CMPI_RC_ERR_INVALID_CLASS"})
        EXPECT_TRUE(has(line)) << line;
}

TEST_F(Associations, StatusesOfTheProvidersOwnTraversal)
{
    struct Row {
        Operation operation;
        int status;
        CMPIrc code;
    };
    const Row names_rows[] = {{OP_ENUM_ASSOCIATOR_NAMES, 110, CMPI_RC_ERR_FAILED},
                              {OP_ENUM_ASSOCIATOR_NAMES, 112, CMPI_RC_ERR_FAILED}, // access denied is folded in
                              {OP_ENUM_ASSOCIATOR_NAMES, 0, CMPI_RC_OK}};
    for (const Row& row : names_rows) {
        provider.on[row.operation] = [&](void**) { return row.status; };
        EXPECT_EQ(associator_names(one), row.code) << row.status;
    }
    const Row references_rows[] = {{OP_ENUM_REFERENCES, 120, CMPI_RC_ERR_FAILED},
                                   {OP_ENUM_REFERENCES, 122, CMPI_RC_ERR_ACCESS_DENIED},
                                   {OP_ENUM_REFERENCES, 0, CMPI_RC_OK}};
    for (const Row& row : references_rows) {
        provider.on[row.operation] = [&](void**) { return row.status; };
        EXPECT_EQ(references(one), row.code) << row.status;
        EXPECT_EQ(reference_names(one), row.code) << row.status;
    }
    const Row associators_rows[] = {{OP_ENUM_ASSOCIATORS, 170, CMPI_RC_ERR_FAILED},
                                    {OP_ENUM_ASSOCIATORS, 172, CMPI_RC_ERR_ACCESS_DENIED},
                                    {OP_ENUM_ASSOCIATORS, 0, CMPI_RC_OK}};
    for (const Row& row : associators_rows) {
        provider.on[row.operation] = [&](void**) { return row.status; };
        EXPECT_EQ(associators(one), row.code) << row.status;
    }
    EXPECT_EQ(provider.calls(OP_ENUM_INSTANCES), 0);
    EXPECT_THAT(returned().instances, IsEmpty());
}

TEST_F(Associations, StatusesOfTheEnumerationBehindATraversal)
{
    provider.on[OP_ENUM_INSTANCES] = [](void**) { return 70; };
    EXPECT_EQ(associator_names(one), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(associators(one), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(references(one), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(reference_names(one), CMPI_RC_ERR_FAILED);
    provider.on[OP_ENUM_INSTANCES] = [](void**) { return 71; };
    EXPECT_EQ(associator_names(one), CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(references(one), CMPI_RC_ERR_ACCESS_DENIED);
}

TEST_F(Associations, AProviderMayTraverseItself)
{
    provider.on[OP_ENUM_ASSOCIATOR_NAMES] = [](void** words) {
        EXPECT_STREQ(static_cast<const String*>(words[4])->c_str(), "Dependent");
        reinterpret_cast<Enum_Handler_Proc>(words[5])(new_part("own"), 0, words[6]);
        return 0;
    };
    associator_names(one, "", "", "Dependent");
    EXPECT_THAT(ids(), testing::ElementsAre("own"));
    provider.on[OP_ENUM_ASSOCIATORS] = [](void** words) {
        auto* part = new_part("own");
        part->__name_space = "root/other";
        reinterpret_cast<Enum_Handler_Proc>(words[5])(part, 0, words[6]);
        return 0;
    };
    associators(one);
    ASSERT_THAT(returned().instances, SizeIs(1));
    EXPECT_EQ(returned().instances[0].path.name_space, "root/other");
}

TEST_F(Associations, TheTraversalTalksOnStandardOutput)
{
    testing::internal::CaptureStdout();
    associator_names(one);
    std::string text = testing::internal::GetCapturedStdout();
    EXPECT_THAT(text, HasSubstr("cimple _proc _enum_associator_names\n"));
    EXPECT_THAT(text, HasSubstr("Provider_Handle enum_associator_names call proc name NS = \nTEST_Part\n{\n"));
    testing::internal::CaptureStdout();
    associators(none);
    EXPECT_EQ(testing::internal::GetCapturedStdout().find("TEST_Base\n{\n"), 0u);
}

namespace {

/// Hands out what the caller selected, as a provider that looks does.
int enumerate_selected(const std::vector<Instance*>& all, void** words)
{
    const Enum_Handler handler{reinterpret_cast<Enum_Handler_Proc>(words[2]), words[3]};
    Selection* selection = Selection::of(handler);
    std::vector<Instance*> wanted;
    for (Instance* instance : all) {
        if (selection && !selection->wants(instance))
            unref(instance);
        else
            wanted.push_back(instance);
    }
    if (selection) selection->asked_all();
    for (Instance* instance : wanted)
        handler.handle(instance);
    handler.proc(nullptr, 0, handler.data);
    return 0;
}

} // namespace

TEST_F(Associations, AProviderThatHeedsTheSelectionChangesNothing)
{
    const auto all_answers = [&] {
        std::string all;
        testing::internal::CaptureStdout();
        for (const fake::Path& source : {one, p2, none}) {
            associator_names(source);
            for (const std::string& id : ids())
                all += id + ' ';
            reference_names(source);
            all += std::to_string(returned().paths.size()) + ' ';
            references(source);
            all += std::to_string(returned().instances.size()) + '\n';
            returned() = {};
        }
        return all + testing::internal::GetCapturedStdout();
    };
    const std::string before = all_answers();
    EXPECT_THAT(before, HasSubstr("p1 p2 2 2\none two 2 2\n0 0\ncimple"));
    int enumerations = 0;
    provider.on[OP_ENUM_INSTANCES] = [&](void** words) {
        enumerations++;
        return enumerate_selected(provider.instances(), words);
    };
    EXPECT_EQ(all_answers(), before);
    EXPECT_EQ(enumerations, 9);
}

// Both ends have the same class, so that either may hold the source.
class Pairs : public Bridge_Test {
protected:
    Pairs() : Bridge_Test(&TEST_Pair::meta) {}

    static Instance* pair(const char* left, const char* right)
    {
        auto* pair = create_as<TEST_Pair>();
        pair->Left = create_as<TEST_Base>();
        pair->Left->Name.set(String(left));
        pair->Right = create_as<TEST_Base>();
        pair->Right->Name.set(String(right));
        return pair;
    }
    std::vector<std::string> associated_with(const char* name, const char* role = "")
    {
        auto* mi = association_mi();
        CMPIObjectPath* path = broker.path({"root/test", "TEST_Base", {{"Name", fake::string(name)}}});
        EXPECT_EQ(mi->ft->associatorNames(mi, context, result, path, "", "", role, "").rc, CMPI_RC_OK);
        std::vector<std::string> names;
        for (const auto& found : returned().paths)
            names.push_back(fake::find(found.keys, "Name").text);
        returned() = {};
        return names;
    }
};

TEST_F(Pairs, TheEndThatDoesNotHoldTheSourceIsTheFarOne)
{
    provider.instances = [] { return std::vector<Instance*>{pair("one", "two"), pair("three", "one")}; };
    EXPECT_THAT(associated_with("one"), testing::ElementsAre("two", "three"));
    EXPECT_THAT(associated_with("one", "right"), testing::ElementsAre("three"));
}

TEST_F(Pairs, AnInstanceThatIsPairedWithItselfHasNoFarEnd)
{
    provider.instances = [] { return std::vector<Instance*>{pair("one", "one")}; };
    EXPECT_THAT(associated_with("one"), IsEmpty());
}

TEST_F(Pairs, AnEndThatIsNullIsNeitherNearNorFar)
{
    const auto half = [](const char* left, const char* right) {
        TEST_Pair* made = create_as<TEST_Pair>();
        for (const auto& [end, name] : {std::pair(&made->Left, left), std::pair(&made->Right, right)})
            if (name) {
                *end = create_as<TEST_Base>();
                (*end)->Name.set(String(name));
            }
        return made;
    };
    provider.instances = [&] {
        return std::vector<Instance*>{half("one", nullptr), half(nullptr, "one"), half(nullptr, nullptr),
                                      half("one", "two")};
    };
    EXPECT_THAT(associated_with("one"), testing::ElementsAre("two"));
    EXPECT_THAT(associated_with("two"), testing::ElementsAre("one"));
}

class PlainClass : public Bridge_Test {};

TEST_F(PlainClass, HasNoAssociations)
{
    auto* mi = association_mi();
    CMPIObjectPath* path = broker.path(thing_path("a", 1));
    EXPECT_EQ(mi->ft->referenceNames(mi, context, result, path, "", "").rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(mi->ft->references(mi, context, result, path, "", "", nullptr).rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(mi->ft->associatorNames(mi, context, result, path, "", "", "", "").rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(mi->ft->associators(mi, context, result, path, "", "", "", "", nullptr).rc, CMPI_RC_ERR_FAILED);
}

} // namespace
} // namespace cimple
