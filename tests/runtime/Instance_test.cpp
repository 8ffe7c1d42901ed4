#include "runtime/Instance.h"

#include <gtest/gtest.h>
#include <thread>
#include <vector>

#include "tests/runtime/Test_Classes.h"

using namespace cimple;

namespace {

template <class T>
void expect_value(const Property<T>& property, const T& expected)
{
    EXPECT_EQ(property.null, 0);
    EXPECT_TRUE(property.value == expected);
}

uint32 nulls_of(const Instance* instance, bool keys)
{
    uint32 count = 0;
    for (const Meta_Feature* feature : features_of(record_of(instance)))
        if (is_property(feature) && is_key(feature) == keys) count += null_of(instance, as_property(feature));
    return count;
}

uint32 properties_of(const Instance* instance, bool keys)
{
    uint32 count = 0;
    for (const Meta_Feature* feature : features_of(record_of(instance)))
        count += is_property(feature) && is_key(feature) == keys;
    return count;
}

using Thing = Ref<Test_Thing>;
using Base = Ref<Test_Base>;

} // namespace

TEST(InstanceCreation, WithDefaultsPropertiesWithoutOneAreNull)
{
    const Thing thing(create_as<Test_Thing>(true));
    EXPECT_EQ(thing->magic, 0xF00DFACEu);
    EXPECT_EQ(thing->refs, 1u);
    EXPECT_EQ(thing->meta_class, &Test_Thing::meta);
    EXPECT_TRUE(thing->__name_space.empty());
    EXPECT_EQ(nulls_of(thing.get(), true), 2u);
    EXPECT_EQ(nulls_of(thing.get(), false), properties_of(thing.get(), false));
    EXPECT_EQ(thing->Peers.null, 1) << "a reference array is null as a property is";
    EXPECT_EQ(thing->Peer, nullptr);
    EXPECT_EQ(thing->Inside, nullptr);
    EXPECT_TRUE(thing->Text.value.empty());
    EXPECT_EQ(thing->Texts.value.size(), 0u);
    EXPECT_TRUE(thing->When.value == Datetime());
}

TEST(InstanceCreation, WithoutDefaultsNullBytesAreZeroAndValuesEmpty)
{
    const Thing thing(create_as<Test_Thing>(false));
    EXPECT_EQ(nulls_of(thing.get(), true) + nulls_of(thing.get(), false), 0u);
    EXPECT_EQ(thing->Peers.null, 0);
    EXPECT_EQ(thing->Uint64.value, 0u);
    EXPECT_EQ(thing->Real64.value, 0.0);
    EXPECT_TRUE(thing->Name.value.empty());
    EXPECT_EQ(thing->Uint32s.value.capacity(), 8u);
    const Ref<Test_Defaults> defaults(create_as<Test_Defaults>(false));
    EXPECT_EQ(defaults->Uint16.value, 0u);
    EXPECT_TRUE(defaults->Text.value.empty());
}

TEST(InstanceCreation, DefaultsOfEveryTypeAreStored)
{
    const Ref<Test_Defaults> made(create_as<Test_Defaults>(true));
    expect_value(made->Boolean, true);
    expect_value(made->Uint8, uint8(200));
    expect_value(made->Sint8, sint8(-100));
    expect_value(made->Uint16, uint16(60000));
    expect_value(made->Sint16, sint16(-30000));
    expect_value(made->Uint32, 4000000000u);
    expect_value(made->Sint32, -2000000000);
    expect_value(made->Uint64, uint64(18000000000000000000u));
    expect_value(made->Sint64, sint64(-9000000000000000000));
    expect_value(made->Real32, 0.5f);
    expect_value(made->Real64, -0.25);
    expect_value(made->Char16, u'\u20ac');
    expect_value(made->Text, String("a default"));
    expect_value(made->When, Datetime(300000000));
    expect_value(made->Numbers, Array<uint16>{5, 12, 2});
    expect_value(made->Texts, Array<String>{"first", ""});
    expect_value(made->Times, Array<Datetime>{Datetime(86400000000)});
}

TEST(InstanceCreation, AMethodRecordIsAnInstanceOfItsMethod)
{
    const Ref<Instance> call(create(&Test_Thing_Frob::meta, true));
    EXPECT_STREQ(call->meta_class->name, "Frob") << "the name is where a class has it";
    EXPECT_EQ(record_of(call.get())->num_meta_features, 4u);
    auto* frob = static_cast<Test_Thing_Frob*>(call.get());
    EXPECT_EQ(frob->return_value.null, 1);
    frob->Word.set("word");
    frob->Target = make_keyed("target", 1);
    frob->Results.set(Array<uint32>{1, 2});
    const Ref<Instance> copy(clone(frob));
    EXPECT_TRUE(identical(copy.get(), frob));
    EXPECT_NE(static_cast<Test_Thing_Frob*>(copy.get())->Target, frob->Target);
    EXPECT_EQ(record_of(copy.get()), &Test_Thing_Frob::meta);
}

TEST(InstanceClone, EveryFeatureIsEqualAndNoInstanceIsShared)
{
    const Thing thing(make_full_thing());
    const Thing copy(clone_as(thing.get()));
    EXPECT_TRUE(identical(thing.get(), copy.get()));
    EXPECT_EQ(copy->refs, 1u);
    EXPECT_EQ(copy->magic, instance_magic);
    EXPECT_NE(copy->Peer, thing->Peer);
    EXPECT_NE(copy->Inside, thing->Inside);
    EXPECT_EQ(copy->Peer->refs, 1u);
    EXPECT_NE(copy->Peers.value[0], thing->Peers.value[0]);
    EXPECT_EQ(copy->Name.value.c_str(), thing->Name.value.c_str()) << "texts are shared";
    EXPECT_NE(copy->Texts.value.begin(), thing->Texts.value.begin()) << "arrays are not";
}

TEST(InstanceClone, OfTheKeysAloneHasNothingElse)
{
    const Thing thing(make_full_thing());
    const Thing copy(static_cast<Test_Thing*>(clone_keys(thing.get())));
    EXPECT_TRUE(key_eq(thing.get(), copy.get()));
    EXPECT_EQ(copy->__name_space, thing->__name_space);
    EXPECT_EQ(copy->refs, 1u);
    EXPECT_EQ(copy->Text.null, 1);
    EXPECT_TRUE(copy->Text.value.empty());
    EXPECT_EQ(copy->Texts.null, 1);
    EXPECT_EQ(copy->Texts.value.size(), 0u);
    EXPECT_EQ(copy->Uint64.null, 1);
    EXPECT_EQ(copy->Peers.null, 1);
    EXPECT_EQ(copy->Peers.value.size(), 0u);
    EXPECT_EQ(copy->Peer, nullptr);
    EXPECT_EQ(copy->Inside, nullptr);
    EXPECT_EQ(clone_keys(nullptr), nullptr);
}

TEST(InstanceClone, OfTheKeysOfAnAssociationReachesTheKeysOfItsEnds)
{
    const Ref<Test_Link> link(create_as<Test_Link>());
    link->Left = make_keyed("a", 1);
    link->Right = make_full_thing();
    link->Word.set("word");
    const Ref<Instance> keys(clone_keys(link.get()));
    const Ref<Instance> whole(clone_with_keys_of_ends(link.get()));
    for (const auto* copy : {static_cast<Test_Link*>(keys.get()), static_cast<Test_Link*>(whole.get())}) {
        EXPECT_TRUE(key_eq(link.get(), copy));
        EXPECT_NE(copy->Left, link->Left);
        EXPECT_EQ(copy->Right->Text.null, 1);
    }
    EXPECT_EQ(static_cast<Test_Link*>(keys.get())->Word.null, 1);
    EXPECT_EQ(static_cast<Test_Link*>(whole.get())->Word.value, "word");
    EXPECT_EQ(clone_with_keys_of_ends(nullptr), nullptr);
}

TEST(InstanceClone, WithKeysOfEndsKeepsWhatIsEmbeddedWhole)
{
    const Thing thing(make_full_thing());
    const Thing copy(static_cast<Test_Thing*>(clone_with_keys_of_ends(thing.get())));
    EXPECT_TRUE(identical(copy->Inside, thing->Inside));
    EXPECT_NE(copy->Inside, thing->Inside);
    EXPECT_TRUE(key_eq(thing->Peer, copy->Peer));
    EXPECT_EQ(copy->Texts.value, thing->Texts.value);
}

TEST(InstanceClone, ANullElementOfAReferenceArrayStaysNull)
{
    const Thing thing(make_full_thing());
    const Thing copy(clone_as(thing.get()));
    ASSERT_EQ(copy->Peers.value.size(), 3u);
    EXPECT_NE(copy->Peers.value[0], nullptr);
    EXPECT_EQ(copy->Peers.value[1], nullptr);
    EXPECT_NE(copy->Peers.value[2], nullptr);
}

TEST(InstanceClone, CountsOfTheSourceAreNotCopied)
{
    const Thing thing(make_full_thing());
    const Thing second(thing);
    EXPECT_EQ(thing->refs, 2u);
    const Thing copy(clone_as(thing.get()));
    EXPECT_EQ(copy->refs, 1u);
    EXPECT_EQ(clone(nullptr), nullptr);
}

TEST(InstanceClone, OneInstanceMayBeClonedByManyThreads)
{
    const Thing thing(make_full_thing());
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t)
        threads.emplace_back([&thing] {
            for (int i = 0; i < 200; ++i) {
                const Thing held(thing);
                const Thing copy(clone_as(held.get()));
                copy->Name.set("mine");
                ASSERT_FALSE(identical(copy.get(), thing.get()));
            }
        });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(thing->refs, 1u);
}

TEST(InstanceCounting, UnrefFreesAtTheLastCountOnly)
{
    Test_Thing* thing = make_full_thing();
    Test_Base* peer = make_keyed("shared", 1);
    ref(peer);
    unref(thing->Peer);
    thing->Peer = peer;
    ref(thing);
    unref(thing);
    EXPECT_EQ(thing->refs, 1u);
    EXPECT_EQ(peer->refs, 2u);
    unref(thing);
    EXPECT_EQ(peer->refs, 1u) << "a freed instance gives up its targets";
    unref(peer);
    unref(nullptr);
    ref(nullptr);
}

TEST(InstanceCounting, DestroyFreesWhateverTheCountSays)
{
    Test_Base* held = make_keyed("held", 1);
    ref(held);
    Test_Thing* thing = create_as<Test_Thing>();
    thing->Peer = held;
    ref(thing);
    EXPECT_EQ(thing->refs, 2u);
    destroy(thing);
    EXPECT_EQ(held->refs, 1u);
    destroy(held);
    destroy(nullptr);
}

TEST(InstanceCounting, RefOwnsOneCount)
{
    Base one(make_keyed("one", 1));
    Base two(one);
    EXPECT_EQ(one->refs, 2u);
    Base three(std::move(two));
    EXPECT_EQ(one->refs, 2u);
    EXPECT_FALSE(two);
    three.reset();
    EXPECT_EQ(one->refs, 1u);
    two = one;
    Base& alias = two;
    two = alias;
    EXPECT_EQ(one->refs, 2u);
    Test_Base* mine = two.release();
    EXPECT_EQ(mine->refs, 2u);
    unref(mine);
}

TEST(InstanceKeys, ASubclassAgreesWithAModelOfItsSuperclass)
{
    const Thing thing(make_keyed<Test_Thing>("key", 1));
    const Base model(make_keyed("key", 1));
    EXPECT_TRUE(key_eq(thing.get(), model.get()));
    EXPECT_TRUE(key_eq(model.get(), thing.get()));
    model->Number.set(2u);
    EXPECT_FALSE(key_eq(thing.get(), model.get()));
    model->Number.set(1u);
    model->Name.set("KEY");
    EXPECT_FALSE(key_eq(thing.get(), model.get())) << "key values compare with case";
    model->Name.set(String("key\0", 4));
    EXPECT_FALSE(key_eq(thing.get(), model.get())) << "key values compare by length";
}

TEST(InstanceKeys, ASwappedSubscriptIsInequality)
{
    const Base base(make_keyed("key", 0));
    const Ref<Other_Base> other(create_as<Other_Base>());
    other->Name.set("key");
    other->Number.null = 0;
    EXPECT_FALSE(key_eq(base.get(), other.get()));
    EXPECT_FALSE(key_eq(other.get(), base.get()));
}

TEST(InstanceKeys, ArrayKeysCompareElementByElement)
{
    const Ref<Other_Base> a(create_as<Other_Base>());
    a->Number.set(Array<uint32>{1, 2});
    const Ref<Other_Base> b(clone_as(a.get()));
    EXPECT_TRUE(key_eq(a.get(), b.get()));
    b->Number.value[1] = 3;
    EXPECT_FALSE(key_eq(a.get(), b.get()));
}

TEST(InstanceKeys, ExtraKeysOfTheSecondAreNotLookedAt)
{
    const Ref<Test_Node> node(create_as<Test_Node>());
    const Base base(make_keyed("key", 1));
    EXPECT_TRUE(key_eq(node.get(), base.get())) << "a class without keys equals anything";
    EXPECT_FALSE(key_eq(base.get(), node.get()));
}

TEST(InstanceKeys, NullBytesMustAgree)
{
    const Base a(make_keyed("key", 1));
    const Base b(make_keyed("key", 1));
    b->Number.null = 1;
    EXPECT_FALSE(key_eq(a.get(), b.get()));
    a->Number.null = 1;
    EXPECT_TRUE(key_eq(a.get(), b.get()));
    EXPECT_TRUE(key_eq(nullptr, nullptr));
    EXPECT_FALSE(key_eq(a.get(), nullptr));
    EXPECT_FALSE(key_eq(nullptr, a.get()));
}

TEST(InstanceKeys, RealKeysCompareAsNumbers)
{
    const Ref<Test_Odd_Keys> a(create_as<Test_Odd_Keys>());
    a->Real32.set(0.0f);
    a->Real64.set(0.0);
    const Ref<Test_Odd_Keys> b(clone_as(a.get()));
    b->Real32.set(-0.0f);
    b->Real64.set(-0.0);
    EXPECT_TRUE(key_eq(a.get(), b.get()));
    b->Real64.set(0.5);
    EXPECT_FALSE(key_eq(a.get(), b.get()));
    b->Real64.set(0.0);
    b->When.value.set_interval(5);
    EXPECT_FALSE(key_eq(a.get(), b.get()));
}

TEST(InstanceKeys, ReferenceKeysAreFollowed)
{
    const Ref<Test_Link> a(create_as<Test_Link>());
    const Ref<Test_Link> b(create_as<Test_Link>());
    EXPECT_TRUE(key_eq(a.get(), b.get())) << "two null references agree";
    a->Left = make_keyed("left", 1);
    EXPECT_FALSE(key_eq(a.get(), b.get()));
    EXPECT_FALSE(key_eq(b.get(), a.get()));
    Test_Thing* left = make_keyed<Test_Thing>("left", 1);
    left->Text.set("not a key");
    b->Left = reinterpret_cast<Test_Base*>(left);
    EXPECT_TRUE(key_eq(a.get(), b.get()));
    left->Number.set(9u);
    EXPECT_FALSE(key_eq(a.get(), b.get()));
}

TEST(InstanceKeys, KeysNonNullLooksAtPropertiesAndReferences)
{
    const Base base(make_keyed("key", 1));
    EXPECT_TRUE(keys_non_null(base.get()));
    base->Number.null = 1;
    EXPECT_FALSE(keys_non_null(base.get()));
    const Ref<Test_Link> link(create_as<Test_Link>());
    link->Left = make_keyed("left", 1);
    EXPECT_FALSE(keys_non_null(link.get()));
    link->Right = make_keyed<Test_Thing>("right", 1);
    EXPECT_TRUE(keys_non_null(link.get()));
    const Ref<Test_Node> node(create_as<Test_Node>());
    EXPECT_TRUE(keys_non_null(node.get()));
}

TEST(InstanceIdentity, EachFeatureMatters)
{
    const Thing thing(make_full_thing());
    const Thing fresh(make_full_thing());
    EXPECT_TRUE(identical(thing.get(), fresh.get()));
    for (const Meta_Feature* feature : features_of(record_of(thing.get()))) {
        if (!is_property(feature)) continue;
        const Thing other(clone_as(thing.get()));
        null_of(other.get(), as_property(feature)) = 1;
        EXPECT_FALSE(identical(thing.get(), other.get())) << feature->name;
        EXPECT_FALSE(identical(other.get(), thing.get())) << feature->name;
    }
    const Thing other(clone_as(thing.get()));
    other->__name_space = "root/other";
    EXPECT_FALSE(identical(thing.get(), other.get()));
    other->__name_space = "root/test";
    EXPECT_TRUE(identical(thing.get(), other.get()));
    other->Peer->Note.set("changed");
    EXPECT_FALSE(identical(thing.get(), other.get())) << "all of a target is compared";
    other->Peer->Note = thing->Peer->Note;
    EXPECT_TRUE(identical(thing.get(), other.get()));
    other->Peers.value[2]->__name_space = "elsewhere";
    EXPECT_FALSE(identical(thing.get(), other.get()));
    other->Peers.value[2]->__name_space.clear();
    other->Peers.null = 1;
    EXPECT_FALSE(identical(thing.get(), other.get()));
    other->Peers.null = 0;
    unref(other->Peers.value[2]);
    other->Peers.value.remove(2);
    EXPECT_FALSE(identical(thing.get(), other.get()));
}

TEST(InstanceIdentity, AnotherClassIsNeverIdentical)
{
    const Thing thing(create_as<Test_Thing>());
    const Base base(create_as<Test_Base>());
    EXPECT_FALSE(identical(thing.get(), base.get()));
    EXPECT_TRUE(identical(nullptr, nullptr));
    EXPECT_FALSE(identical(thing.get(), nullptr));
}

TEST(InstanceCopy, AllFeaturesAreAssigned)
{
    const Thing source(make_full_thing());
    const Thing dest(create_as<Test_Thing>());
    dest->__name_space = "root/test";
    dest->Peer = make_keyed("old", 1);
    dest->Peers.value.append(make_keyed("old", 2));
    copy(dest.get(), source.get());
    EXPECT_TRUE(identical(dest.get(), source.get()));
    EXPECT_NE(dest->Peer, source->Peer);
    EXPECT_NE(dest->Peers.value[0], source->Peers.value[0]);
    copy(dest.get(), dest.get());
    EXPECT_TRUE(identical(dest.get(), source.get()));
}

TEST(InstanceCopy, WhatIsNullInTheModelIsPassedOver)
{
    const Thing source(make_full_thing());
    const Thing dest(create_as<Test_Thing>());
    const Thing model(create_as<Test_Thing>());
    model->Uint32.null = 0;
    model->Texts.null = 0;
    model->Peer = make_keyed("any", 0);
    copy(dest.get(), source.get(), model.get());
    EXPECT_EQ(dest->Uint32.value, 4000000000u);
    EXPECT_EQ(dest->Texts.value.size(), 3u);
    EXPECT_TRUE(dest->Peer && dest->Peer->Name.value == "peer");
    EXPECT_EQ(dest->Name.null, 1);
    EXPECT_EQ(dest->Inside, nullptr);
    EXPECT_EQ(dest->Peers.value.size(), 0u);
    model->Peers.null = 0;
    copy(dest.get(), source.get(), model.get());
    EXPECT_EQ(dest->Peers.value.size(), 3u);
    EXPECT_EQ(dest->Peers.null, 0);
}

TEST(InstanceCopy, ANullInTheSourceReplacesAValue)
{
    const Thing source(create_as<Test_Thing>());
    const Thing dest(make_full_thing());
    dest->__name_space.clear();
    copy(dest.get(), source.get());
    EXPECT_TRUE(identical(dest.get(), source.get()));
}

TEST(InstanceCopy, DifferentClassesAreLeftAlone)
{
    const Thing thing(make_full_thing());
    const Base base(create_as<Test_Base>());
    const Base untouched(clone_as(base.get()));
    copy(base.get(), thing.get());
    copy_keys(base.get(), thing.get());
    EXPECT_TRUE(identical(base.get(), untouched.get()));
    const Base source(make_keyed("source", 1));
    copy(base.get(), source.get(), thing.get());
    EXPECT_TRUE(identical(base.get(), untouched.get())) << "a model of another class says nothing";
    copy(nullptr, source.get());
    copy_keys(base.get(), nullptr);
}

TEST(InstanceCopy, KeysAlone)
{
    const Thing source(make_full_thing());
    const Thing dest(create_as<Test_Thing>());
    copy_keys(dest.get(), source.get());
    EXPECT_TRUE(key_eq(dest.get(), source.get()));
    EXPECT_EQ(dest->Text.null, 1);
    EXPECT_EQ(dest->Peer, nullptr);
    const Ref<Test_Link> link(create_as<Test_Link>());
    link->Left = make_keyed("left", 1);
    link->Word.set("word");
    const Ref<Test_Link> other(create_as<Test_Link>());
    copy_keys(other.get(), link.get());
    EXPECT_TRUE(key_eq(other.get(), link.get()));
    EXPECT_NE(other->Left, link->Left);
    EXPECT_EQ(other->Word.null, 1);
}

TEST(InstanceNullify, KeysAndOthersApart)
{
    const Thing thing(make_full_thing());
    nullify_properties(thing.get(), true, false, 1);
    EXPECT_EQ(nulls_of(thing.get(), true), 2u);
    EXPECT_EQ(nulls_of(thing.get(), false), 0u);
    EXPECT_EQ(thing->Peers.null, 0);
    nullify_properties(thing.get(), false, true, 1);
    EXPECT_EQ(nulls_of(thing.get(), false), properties_of(thing.get(), false));
    EXPECT_EQ(thing->Peers.null, 1) << "a reference array counts as a property";
    EXPECT_NE(thing->Peer, nullptr) << "a scalar reference is left alone";
    nullify_properties(thing.get(), true, true, 0);
    EXPECT_EQ(nulls_of(thing.get(), true) + nulls_of(thing.get(), false), 0u);
    EXPECT_EQ(thing->Peers.null, 0);
    EXPECT_EQ(thing->Uint8.value, 250) << "values stay";
}

TEST(InstanceFilter, NoListMeansEverything)
{
    const Thing thing(create_as<Test_Thing>());
    EXPECT_EQ(filter_properties(thing.get(), nullptr, true), 0);
    EXPECT_EQ(nulls_of(thing.get(), true) + nulls_of(thing.get(), false), 0u);
    EXPECT_EQ(thing->Peers.null, 0);
    EXPECT_EQ(thing->Peer, nullptr);
}

TEST(InstanceFilter, AnEmptyListLeavesKeysOnlyIfTheyAreKept)
{
    const char* const none[] = {nullptr};
    const Thing kept(make_full_thing());
    EXPECT_EQ(filter_properties(kept.get(), none, true), 0);
    EXPECT_EQ(nulls_of(kept.get(), true), 0u);
    EXPECT_EQ(nulls_of(kept.get(), false), properties_of(kept.get(), false));
    EXPECT_EQ(kept->Peers.null, 1);
    const Thing not_kept(make_full_thing());
    EXPECT_EQ(filter_properties(not_kept.get(), none, false), 0);
    EXPECT_EQ(nulls_of(not_kept.get(), true), 2u);
    EXPECT_EQ(nulls_of(not_kept.get(), false), properties_of(not_kept.get(), false));
}

TEST(InstanceFilter, NamedFeaturesComeBackAndKeysDoNot)
{
    const char* const names[] = {"TEXT", "Nonsense", "Name", "peers", "Peer", "Inside", "uint32s", nullptr};
    const Thing thing(create_as<Test_Thing>());
    EXPECT_EQ(filter_properties(thing.get(), names, false), 0);
    EXPECT_EQ(thing->Text.null, 0);
    EXPECT_EQ(thing->Uint32s.null, 0);
    EXPECT_EQ(thing->Peers.null, 0);
    EXPECT_EQ(thing->Name.null, 1) << "a key stays null even if requested";
    EXPECT_EQ(thing->Uint8.null, 1);
    ASSERT_NE(thing->Peer, nullptr) << "a requested reference gets a target to fill";
    EXPECT_EQ(thing->Peer->meta_class, &Test_Base::meta);
    EXPECT_EQ(thing->Peer->Name.null, 0);
    ASSERT_NE(thing->Inside, nullptr);
    EXPECT_EQ(thing->Inside->meta_class, &Instance::meta);
    Test_Base* const peer = thing->Peer;
    EXPECT_EQ(filter_properties(thing.get(), names, false), 0);
    EXPECT_EQ(thing->Peer, peer) << "a target that is there stays";
}

TEST(InstanceFilter, AMethodsNameEndsTheWalk)
{
    const char* const names[] = {"Text", "Frob", "Uint8", nullptr};
    const Thing thing(make_full_thing());
    EXPECT_EQ(filter_properties(thing.get(), names, true), -1);
    EXPECT_EQ(thing->Text.null, 0);
    EXPECT_EQ(thing->Uint8.null, 1);
}

TEST(InstanceNameSpace, IsSetThroughAllReferences)
{
    const Thing thing(make_full_thing());
    thing->Peer->__name_space = "root/kept";
    set_name_space_recursive(thing.get(), "root/new", false);
    EXPECT_STREQ(thing->__name_space.c_str(), "root/test");
    EXPECT_STREQ(thing->Peer->__name_space.c_str(), "root/kept");
    EXPECT_STREQ(thing->Inside->__name_space.c_str(), "root/new");
    EXPECT_STREQ(thing->Peers.value[0]->__name_space.c_str(), "root/new");
    EXPECT_STREQ(thing->Peers.value[2]->__name_space.c_str(), "root/new");
    set_name_space_recursive(thing.get(), "root/forced", true);
    EXPECT_STREQ(thing->__name_space.c_str(), "root/forced");
    EXPECT_STREQ(thing->Peer->__name_space.c_str(), "root/forced");
    EXPECT_STREQ(thing->Peers.value[2]->__name_space.c_str(), "root/forced");
}
