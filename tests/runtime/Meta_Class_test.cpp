#include "runtime/Meta_Class.h"

#include <gtest/gtest.h>
#include <set>
#include <string>

#include "runtime/Registration.h"
#include "tests/runtime/Test_Classes.h"

using namespace cimple;

TEST(MetaClass, EverythingIsASubclassOfTheRootAlsoNothing)
{
    EXPECT_TRUE(is_subclass(&Instance::meta, &Test_Thing::meta));
    EXPECT_TRUE(is_subclass(&Instance::meta, &Instance::meta));
    EXPECT_TRUE(is_subclass(&Instance::meta, nullptr));
    Meta_Class same_name = {
        {{{0}, META_FLAG_CLASS, "INSTANCE", nullptr, 0}, nullptr, 0, sizeof(Instance)}, nullptr, nullptr, 0, nullptr};
    EXPECT_TRUE(is_subclass(&same_name, &Test_Thing::meta));
    EXPECT_TRUE(is_subclass(&same_name, nullptr));
}

TEST(MetaClass, SubclassesGoUpByPointerOrName)
{
    EXPECT_TRUE(is_subclass(&Test_Base::meta, &Test_Thing::meta));
    EXPECT_TRUE(is_subclass(&Test_Base::meta, &Test_Base::meta));
    EXPECT_FALSE(is_subclass(&Test_Thing::meta, &Test_Base::meta));
    EXPECT_FALSE(is_subclass(&Other_Base::meta, &Test_Thing::meta));
    EXPECT_FALSE(is_subclass(&Test_Base::meta, nullptr));
    EXPECT_FALSE(is_subclass(nullptr, &Test_Base::meta));
    EXPECT_FALSE(is_subclass(&Test_Base::meta, &Instance::meta));
    const Meta_Class twin = {
        {{{0}, META_FLAG_CLASS, "test_BASE", nullptr, 0}, nullptr, 0, sizeof(Instance)}, nullptr, nullptr, 0, nullptr};
    EXPECT_TRUE(is_subclass(&twin, &Test_Thing::meta));
}

TEST(MetaClass, FeaturesAreFoundByNameAndMask)
{
    EXPECT_STREQ(find_feature(&Test_Thing::meta, "uint64", META_FLAG_PROPERTY)->name, "Uint64");
    EXPECT_EQ(find_feature(&Test_Thing::meta, "Peer", META_FLAG_PROPERTY), nullptr);
    EXPECT_NE(find_feature(&Test_Thing::meta, "Peer", META_FLAG_REFERENCE), nullptr);
    EXPECT_NE(find_feature(&Test_Thing::meta, "PEER", META_FLAG_PROPERTY | META_FLAG_REFERENCE), nullptr);
    EXPECT_EQ(find_feature(&Test_Thing::meta, "frob", META_FLAG_METHOD), &Test_Thing_Frob::meta);
    EXPECT_EQ(find_feature(&Test_Thing::meta, "frob", META_FLAG_PROPERTY | META_FLAG_REFERENCE), nullptr);
    EXPECT_EQ(find_feature(&Test_Thing::meta, "Peerless", 7), nullptr);
    EXPECT_EQ(find_feature(&Test_Thing::meta, "", 7), nullptr);
    EXPECT_EQ(find_feature(&Test_Thing::meta, nullptr, 7), nullptr);
    EXPECT_EQ(find_feature(nullptr, "Peer", 7), nullptr);
    EXPECT_EQ(find_feature(&Instance::meta, "Peer", 7), nullptr);
    EXPECT_STREQ(find_feature(&Test_Thing_Frob::meta, "RETURN_VALUE", META_FLAG_PROPERTY)->name, "return_value");
    EXPECT_EQ(find_feature(&Test_Thing::meta, "Name", 1), find_feature(&Test_Base::meta, "Name", 1))
        << "an inherited feature is shared";
}

TEST(MetaClass, ClassesAreFoundByNameInARepository)
{
    EXPECT_EQ(find_meta_class(&test_repository, "TEST_thing"), &Test_Thing::meta);
    EXPECT_EQ(find_meta_class(&test_repository, "Test"), nullptr);
    EXPECT_EQ(find_meta_class(&test_repository, nullptr), nullptr);
    EXPECT_EQ(find_meta_class(&test_repository, "Instance"), nullptr) << "the root is in no repository";
    EXPECT_EQ(find_meta_class(nullptr, "Test_Thing"), nullptr);
}

TEST(MetaClass, TheRootHasNothingButItsHead)
{
    EXPECT_STREQ(Instance::meta.name, "Instance");
    EXPECT_EQ(Instance::meta.flags, uint32(META_FLAG_CLASS));
    EXPECT_EQ(Instance::meta.num_meta_features, 0u);
    EXPECT_EQ(Instance::meta.size, sizeof(Instance));
    EXPECT_EQ(Instance::meta.super_meta_class, nullptr);
}

TEST(MetaClass, FlagNamesStandAtTheirBits)
{
    std::set<std::string> names(meta_flag_names, meta_flag_names + 32);
    EXPECT_EQ(names.size(), 32u);
    const auto name_of = [](uint32 flag) { return std::string(meta_flag_names[__builtin_ctz(flag)]); };
    EXPECT_EQ(name_of(META_FLAG_PROPERTY), "Property");
    EXPECT_EQ(name_of(META_FLAG_ASSOCIATION), "Association");
    EXPECT_EQ(name_of(META_FLAG_DN), "DN");
    EXPECT_EQ(name_of(META_FLAG_EMBEDDED_OBJECT), "EmbeddedObject");
    EXPECT_EQ(name_of(META_FLAG_EXPERIMENTAL), "Experimental");
    EXPECT_EQ(name_of(META_FLAG_IF_DELETED), "IfDeleted");
    EXPECT_EQ(name_of(META_FLAG_IN), "In");
    EXPECT_EQ(name_of(META_FLAG_KEY), "Key");
    EXPECT_EQ(name_of(META_FLAG_OUT), "Out");
    EXPECT_EQ(name_of(META_FLAG_STATIC), "Static");
    EXPECT_EQ(name_of(META_FLAG_EMBEDDED_INSTANCE), "EmbeddedInstance");
}

TEST(MetaClass, TypesHaveTheirNamesAndSizes)
{
    EXPECT_STREQ(type_names[BOOLEAN], "boolean");
    EXPECT_STREQ(type_names[SINT16], "sint16");
    EXPECT_STREQ(type_names[REAL64], "real64");
    EXPECT_STREQ(type_names[CHAR16], "char16");
    EXPECT_STREQ(type_names[STRING], "string");
    EXPECT_STREQ(type_names[DATETIME], "datetime");
    const int sizes[] = {1, 1, 1, 2, 2, 4, 4, 8, 8, 4, 8, 2};
    for (int type = 0; type < 12; ++type)
        EXPECT_EQ(type_sizes[type], sizes[type]) << type_names[type];
}

TEST(MetaClass, OperationCodesAndStatusesHaveTheirNumbers)
{
    EXPECT_EQ(OP_GET_META_CLASS, 0);
    EXPECT_EQ(OP_INVOKE_METHOD, 10);
    EXPECT_EQ(OP_GET_REPOSITORY, 13);
    EXPECT_EQ(OP_ENUM_ASSOCIATORS, 16);
    EXPECT_EQ(LOAD_FAILED, 30);
    EXPECT_EQ(GET_INSTANCE_UNSUPPORTED, 61);
    EXPECT_EQ(ENUM_INSTANCES_ACCESS_DENIED, 71);
    EXPECT_EQ(CREATE_INSTANCE_FAILED, 84);
    EXPECT_EQ(DELETE_INSTANCE_FAILED, 93);
    EXPECT_EQ(MODIFY_INSTANCE_UNSUPPORTED, 101);
    EXPECT_EQ(MODIFY_INSTANCE_FAILED, 104);
    EXPECT_EQ(ENUM_ASSOCIATOR_NAMES_ACCESS_DENIED, 112);
    EXPECT_EQ(ENUM_REFERENCES_UNSUPPORTED, 121);
    EXPECT_EQ(INVOKE_METHOD_ACCESS_DENIED, 132);
    EXPECT_EQ(ENABLE_INDICATIONS_FAILED, 140);
    EXPECT_EQ(DISABLE_INDICATIONS_FAILED, 150);
    EXPECT_EQ(ENUM_ASSOCIATORS_UNSUPPORTED, 171);
    EXPECT_EQ(sizeof(Registration), 5 * sizeof(void*));
}

TEST(MetaClass, HandlersForwardWithTheirData)
{
    struct Seen {
        Instance* instance;
        int status;
    } seen{nullptr, -1};
    const Enum_Handler handler = {[](Instance* instance, int status, void* data) {
                                      *static_cast<Seen*>(data) = {instance, status};
                                      return true;
                                  },
                                  &seen};
    Ref<Instance> instance(create(&Instance::meta, true));
    handler.handle(instance.get());
    EXPECT_EQ(seen.instance, instance.get());
    EXPECT_EQ(seen.status, 0);
    const Indication_Handler indications = {[](Instance* one, void* data) {
                                                static_cast<Seen*>(data)->instance = one;
                                                return one != nullptr;
                                            },
                                            &seen};
    EXPECT_FALSE(indications.handle(nullptr));
    EXPECT_EQ(seen.instance, nullptr);
    EXPECT_TRUE(indications.handle(instance.get()));
}
