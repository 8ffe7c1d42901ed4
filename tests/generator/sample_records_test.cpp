// Records and structures of the sample classes, as compiled code.
#include "classes/Sample_Alert.h"
#include "classes/Sample_Base.h"
#include "classes/Sample_Derived.h"
#include "classes/Sample_Link.h"
#include "classes/Sample_Narrow_Link.h"
#include "classes/Sample_Nothing.h"
#include "classes/repository.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <string>
#include <type_traits>

#pragma GCC diagnostic ignored "-Winvalid-offsetof"

using namespace cimple;

namespace {

const Meta_Property& property(const Meta_Record& record, const char* name)
{
    return *as_property(find_feature(&record, name, META_FLAG_PROPERTY));
}

template <class T>
const T& default_of(const char* name)
{
    return *static_cast<const T*>(property(Sample_Derived::meta, name).value);
}

} // namespace

TEST(SampleRecords, EveryKindOfDefaultIsHeld)
{
    EXPECT_EQ(default_of<uint64>("Many"), UINT64_MAX);
    EXPECT_EQ(default_of<uint16>("State"), 5);
    EXPECT_EQ(default_of<sint64>("Least"), INT64_MIN);
    EXPECT_EQ(default_of<sint8>("Small"), -128);
    EXPECT_EQ(default_of<boolean>("Flag"), true);
    EXPECT_EQ(default_of<real32>("Fraction"), 0.5f);
    EXPECT_EQ(default_of<char16>("Letter"), u'x');
    EXPECT_STREQ(default_of<const char*>("When"), "00000000000500.000000:000");
    EXPECT_STREQ(default_of<const char*>("Note"), "a \"quoted\" back\\slash \xC3\xA9");
    EXPECT_EQ(property(Sample_Derived::meta, "Name").value, nullptr);
    EXPECT_EQ(property(Sample_Derived::meta, "Fixed").value, nullptr);
}

TEST(SampleRecords, ArrayDefaultsAreElementsAndCount)
{
    const auto& numbers = default_of<Meta_Array_Value>("Numbers");
    ASSERT_EQ(numbers.size, 3u);
    EXPECT_EQ(static_cast<const uint16*>(numbers.elements)[2], 3);
    const auto& words = default_of<Meta_Array_Value>("Words");
    ASSERT_EQ(words.size, 2u);
    EXPECT_STREQ(static_cast<const char* const*>(words.elements)[1], "two");
}

TEST(SampleRecords, AnInstanceIsMadeWithItsDefaults)
{
    Ref<Sample_Derived> instance(create_as<Sample_Derived>());
    EXPECT_EQ(instance->State.value, 5);
    EXPECT_EQ(instance->State.null, 0);
    EXPECT_EQ(instance->Name.null, 1);
    EXPECT_EQ(instance->When.value.usec(), 300u * 1000000);
    ASSERT_EQ(instance->Numbers.value.size(), 3u);
    EXPECT_EQ(instance->Numbers.value[1], 2);
    EXPECT_EQ(instance->Numbers.null, 0);
    EXPECT_EQ(instance->Words.value[0], "one");
    EXPECT_EQ(instance->Fixed.null, 1);
    EXPECT_EQ(instance->Several.null, 1);
    EXPECT_EQ(instance->Something, nullptr);
}

TEST(SampleRecords, StringsThatCarryInstancesAreReferences)
{
    static_assert(std::is_same_v<decltype(Sample_Derived::Anything), Instance*>);
    static_assert(std::is_same_v<decltype(Sample_Derived::Something), Sample_Base*>);
    static_assert(std::is_same_v<decltype(Sample_Derived::Several), Property<Array<Instance*>>>);
    const auto* anything = as_reference(find_feature(&Sample_Derived::meta, "Anything", META_FLAG_REFERENCE));
    EXPECT_EQ(anything->flags, META_FLAG_REFERENCE | META_FLAG_EMBEDDED_OBJECT);
    EXPECT_EQ(anything->meta_class, &Instance::meta);
    const auto* several = as_reference(find_feature(&Sample_Derived::meta, "Several", META_FLAG_REFERENCE));
    EXPECT_EQ(several->flags, META_FLAG_REFERENCE | META_FLAG_EMBEDDED_INSTANCE);
    EXPECT_EQ(several->meta_class, &Sample_Base::meta);
    EXPECT_EQ(several->subscript, -1);
}

TEST(SampleRecords, FlagsAreTheQualifiersOfTheirName)
{
    EXPECT_EQ(property(Sample_Derived::meta, "Many").flags, META_FLAG_PROPERTY | META_FLAG_WRITE | META_FLAG_REQUIRED |
                                                                META_FLAG_COUNTER | META_FLAG_GAUGE |
                                                                META_FLAG_EXPERIMENTAL);
    EXPECT_EQ(find_feature(&Sample_Link::meta, "Whole", META_FLAG_REFERENCE)->flags,
              META_FLAG_REFERENCE | META_FLAG_KEY | META_FLAG_AGGREGATE);
    EXPECT_EQ(find_feature(&Sample_Narrow_Link::meta, "Part", META_FLAG_REFERENCE)->flags,
              META_FLAG_REFERENCE | META_FLAG_KEY);
    EXPECT_EQ(Sample_Link::meta.flags, META_FLAG_ASSOCIATION | META_FLAG_AGGREGATION);
    EXPECT_EQ(Sample_Alert::meta.flags, META_FLAG_INDICATION | META_FLAG_ABSTRACT);
    EXPECT_EQ(Sample_Nothing::meta.flags, META_FLAG_CLASS);
}

TEST(SampleRecords, AFixedLengthStandsInTheSubscript)
{
    EXPECT_EQ(property(Sample_Derived::meta, "Fixed").subscript, 3);
    EXPECT_EQ(property(Sample_Derived::meta, "Words").subscript, -1);
}

TEST(SampleRecords, AMethodListsItsParametersAndItsResult)
{
    const Meta_Method& method = Sample_Derived_Do_method::meta;
    EXPECT_STREQ(method.name, "Do");
    EXPECT_EQ(method.flags, META_FLAG_METHOD);
    EXPECT_EQ(method.return_type, UINT32);
    EXPECT_EQ(method.size, sizeof(Sample_Derived_Do_method));
    ASSERT_EQ(method.num_meta_features, 4u);
    EXPECT_EQ(method.meta_features[0]->flags, META_FLAG_PROPERTY | META_FLAG_IN | META_FLAG_OCTETSTRING);
    EXPECT_EQ(method.meta_features[1]->flags, META_FLAG_REFERENCE | META_FLAG_OUT);
    EXPECT_EQ(method.meta_features[2]->flags, META_FLAG_PROPERTY | META_FLAG_IN | META_FLAG_OUT);
    EXPECT_STREQ(method.meta_features[3]->name, "return_value");
    EXPECT_EQ(method.meta_features[3]->flags, META_FLAG_PROPERTY | META_FLAG_OUT);
    EXPECT_EQ(as_property(method.meta_features[3])->offset, offsetof(Sample_Derived_Do_method, return_value));
    EXPECT_EQ(find_feature(&Sample_Derived::meta, "do", META_FLAG_METHOD), &method);
    EXPECT_EQ(Sample_Derived_Check_method::meta.return_type, BOOLEAN);
}

TEST(SampleRecords, AClassWithoutFeaturesIsAHeadAlone)
{
    EXPECT_EQ(Sample_Nothing::meta.num_meta_features, 0u);
    EXPECT_EQ(Sample_Nothing::meta.size, sizeof(Instance));
    EXPECT_EQ(Sample_Nothing::meta.num_keys, 0u);
}

TEST(SampleRecords, TheRepositoryKeepsTheOrderOfTheList)
{
    ASSERT_EQ(the_repository.num_meta_classes, 6u);
    EXPECT_EQ(the_repository.meta_classes[0], &Sample_Derived::meta);
    EXPECT_EQ(the_repository.meta_classes[1], &Sample_Base::meta);
    EXPECT_EQ(Sample_Derived::meta.super_meta_class, &Sample_Base::meta);
    EXPECT_EQ(Sample_Derived::meta.meta_repository, &the_repository);
}
