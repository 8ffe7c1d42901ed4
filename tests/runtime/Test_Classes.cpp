#include "tests/runtime/Test_Classes.h"

#include <cstddef>

// offsetof of structures with a base is what the generated records use as well.
#pragma GCC diagnostic ignored "-Winvalid-offsetof"

namespace cimple {

namespace {

constexpr uint32 property_flag = META_FLAG_PROPERTY;
constexpr uint32 key_flag = META_FLAG_PROPERTY | META_FLAG_KEY;
constexpr uint32 reference_flag = META_FLAG_REFERENCE;
constexpr uint32 reference_key_flag = META_FLAG_REFERENCE | META_FLAG_KEY;

#define FEATURE(FLAGS, NAME) {0}, FLAGS, NAME, nullptr, 0
#define PROPERTY(RECORD, CLASS, MEMBER, FLAGS, TYPE, SUBSCRIPT, VALUE)                                                 \
    const Meta_Property RECORD = {{FEATURE(FLAGS, #MEMBER)}, TYPE, SUBSCRIPT, offsetof(CLASS, MEMBER), VALUE}
#define REFERENCE(RECORD, CLASS, MEMBER, FLAGS, SUBSCRIPT, TARGET)                                                     \
    const Meta_Reference RECORD = {                                                                                    \
        {FEATURE(FLAGS, #MEMBER)}, SUBSCRIPT, &TARGET::meta, static_cast<uint32>(offsetof(CLASS, MEMBER))}
#define META_CLASS(CLASS, FLAGS, FEATURES, LOCALS, SUPER, KEYS)                                                        \
    const Meta_Class CLASS::meta = {                                                                                   \
        {{FEATURE(FLAGS, #CLASS)}, FEATURES, sizeof(FEATURES) / sizeof(FEATURES[0]), sizeof(CLASS)},                   \
        LOCALS,                                                                                                        \
        SUPER,                                                                                                         \
        KEYS,                                                                                                          \
        &test_repository}

const uint8 all_local[64] = {1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1,
                             1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1,
                             1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1};

PROPERTY(base_name, Test_Base, Name, key_flag, STRING, 0, nullptr);
PROPERTY(base_number, Test_Base, Number, key_flag, UINT32, 0, nullptr);
PROPERTY(base_note, Test_Base, Note, property_flag, STRING, 0, nullptr);
const Meta_Feature* const base_features[] = {&base_name, &base_number, &base_note};

#define THING(MEMBER, TYPE) PROPERTY(thing_##MEMBER, Test_Thing, MEMBER, property_flag, TYPE, 0, nullptr)
#define THINGS(MEMBER, TYPE, SUBSCRIPT)                                                                                \
    PROPERTY(thing_##MEMBER, Test_Thing, MEMBER, property_flag, TYPE, SUBSCRIPT, nullptr)
THING(Boolean, BOOLEAN);
THING(Uint8, UINT8);
THING(Sint8, SINT8);
THING(Uint16, UINT16);
THING(Sint16, SINT16);
THING(Uint32, UINT32);
THING(Sint32, SINT32);
THING(Uint64, UINT64);
THING(Sint64, SINT64);
THING(Real32, REAL32);
THING(Real64, REAL64);
THING(Char16, CHAR16);
THING(Text, STRING);
THING(When, DATETIME);
THINGS(Booleans, BOOLEAN, -1);
THINGS(Uint8s, UINT8, -1);
THINGS(Sint8s, SINT8, -1);
THINGS(Uint16s, UINT16, -1);
THINGS(Sint16s, SINT16, -1);
THINGS(Uint32s, UINT32, 4); // a fixed length
THINGS(Sint32s, SINT32, -1);
THINGS(Uint64s, UINT64, -1);
THINGS(Sint64s, SINT64, -1);
THINGS(Real32s, REAL32, -1);
THINGS(Real64s, REAL64, -1);
THINGS(Char16s, CHAR16, -1);
THINGS(Texts, STRING, -1);
THINGS(Times, DATETIME, -1);
REFERENCE(thing_Peer, Test_Thing, Peer, reference_flag, 0, Test_Base);
REFERENCE(thing_Inside, Test_Thing, Inside, reference_flag | META_FLAG_EMBEDDED_INSTANCE, 0, Instance);
REFERENCE(thing_Peers, Test_Thing, Peers, reference_flag, -1, Instance);

PROPERTY(frob_word, Test_Thing_Frob, Word, property_flag | META_FLAG_IN, STRING, 0, nullptr);
REFERENCE(frob_target, Test_Thing_Frob, Target, reference_flag | META_FLAG_IN, 0, Test_Base);
PROPERTY(frob_results, Test_Thing_Frob, Results, property_flag | META_FLAG_OUT, UINT32, -1, nullptr);
PROPERTY(frob_return, Test_Thing_Frob, return_value, property_flag | META_FLAG_OUT, UINT32, 0, nullptr);
const Meta_Feature* const frob_features[] = {&frob_word, &frob_target, &frob_results, &frob_return};

} // namespace

const Meta_Method Test_Thing_Frob::meta = {
    {{FEATURE(META_FLAG_METHOD, "Frob")}, frob_features, 4, sizeof(Test_Thing_Frob)}, UINT32};

namespace {

const Meta_Feature* const thing_features[] = {
    &base_name,     &base_number,   &base_note,      &thing_Boolean, &thing_Uint8,
    &thing_Sint8,   &thing_Uint16,  &thing_Sint16,   &thing_Uint32,  &thing_Sint32,
    &thing_Uint64,  &thing_Sint64,  &thing_Real32,   &thing_Real64,  &thing_Char16,
    &thing_Text,    &thing_When,    &thing_Booleans, &thing_Uint8s,  &thing_Sint8s,
    &thing_Uint16s, &thing_Sint16s, &thing_Uint32s,  &thing_Sint32s, &thing_Uint64s,
    &thing_Sint64s, &thing_Real32s, &thing_Real64s,  &thing_Char16s, &thing_Texts,
    &thing_Times,   &thing_Peer,    &thing_Inside,   &thing_Peers,   &Test_Thing_Frob::meta,
};

REFERENCE(link_Left, Test_Link, Left, reference_key_flag, 0, Test_Base);
REFERENCE(link_Right, Test_Link, Right, reference_key_flag, 0, Test_Thing);
PROPERTY(link_Word, Test_Link, Word, property_flag, STRING, 0, nullptr);
const Meta_Feature* const link_features[] = {&link_Left, &link_Right, &link_Word};

#define PLAIN(MEMBER, TYPE) PROPERTY(plain_##MEMBER, Test_Plain_Keys, MEMBER, key_flag, TYPE, 0, nullptr)
PLAIN(Boolean, BOOLEAN);
PLAIN(Uint8, UINT8);
PLAIN(Sint8, SINT8);
PLAIN(Uint16, UINT16);
PLAIN(Sint16, SINT16);
PLAIN(Uint32, UINT32);
PLAIN(Sint32, SINT32);
PLAIN(Uint64, UINT64);
PLAIN(Sint64, SINT64);
PLAIN(Text, STRING);
const Meta_Feature* const plain_features[] = {&plain_Boolean, &plain_Uint8,  &plain_Sint8,  &plain_Uint16,
                                              &plain_Sint16,  &plain_Uint32, &plain_Sint32, &plain_Uint64,
                                              &plain_Sint64,  &plain_Text};

PROPERTY(odd_Real32, Test_Odd_Keys, Real32, key_flag, REAL32, 0, nullptr);
PROPERTY(odd_Real64, Test_Odd_Keys, Real64, key_flag, REAL64, 0, nullptr);
PROPERTY(odd_Char16, Test_Odd_Keys, Char16, key_flag, CHAR16, 0, nullptr);
PROPERTY(odd_When, Test_Odd_Keys, When, key_flag, DATETIME, 0, nullptr);
const Meta_Feature* const odd_features[] = {&odd_Real32, &odd_Real64, &odd_Char16, &odd_When};

PROPERTY(array_key_name, Test_Array_Key, Name, key_flag, STRING, 0, nullptr);
PROPERTY(array_key_bytes, Test_Array_Key, Bytes, key_flag, UINT8, -1, nullptr);
const Meta_Feature* const array_key_features[] = {&array_key_name, &array_key_bytes};

REFERENCE(chain_Next, Test_Chain, Next, reference_key_flag, 0, Test_Node);
const Meta_Feature* const chain_features[] = {&chain_Next};

const boolean default_boolean = true;
const uint8 default_uint8 = 200;
const sint8 default_sint8 = -100;
const uint16 default_uint16 = 60000;
const sint16 default_sint16 = -30000;
const uint32 default_uint32 = 4000000000u;
const sint32 default_sint32 = -2000000000;
const uint64 default_uint64 = 18000000000000000000u;
const sint64 default_sint64 = -9000000000000000000;
const real32 default_real32 = 0.5f;
const real64 default_real64 = -0.25;
const char16 default_char16 = u'\u20ac';
const char* const default_text = "a default";
const char* const default_when = "00000000000500.000000:000";
const uint16 default_number_elements[] = {5, 12, 2};
const Meta_Array_Value default_numbers = {default_number_elements, 3};
const char* const default_text_elements[] = {"first", ""};
const Meta_Array_Value default_texts = {default_text_elements, 2};
const char* const default_time_elements[] = {"00000001000000.000000:000"};
const Meta_Array_Value default_times = {default_time_elements, 1};

#define DEFAULT(MEMBER, TYPE, VALUE) PROPERTY(defaults_##MEMBER, Test_Defaults, MEMBER, property_flag, TYPE, 0, &VALUE)
DEFAULT(Boolean, BOOLEAN, default_boolean);
DEFAULT(Uint8, UINT8, default_uint8);
DEFAULT(Sint8, SINT8, default_sint8);
DEFAULT(Uint16, UINT16, default_uint16);
DEFAULT(Sint16, SINT16, default_sint16);
DEFAULT(Uint32, UINT32, default_uint32);
DEFAULT(Sint32, SINT32, default_sint32);
DEFAULT(Uint64, UINT64, default_uint64);
DEFAULT(Sint64, SINT64, default_sint64);
DEFAULT(Real32, REAL32, default_real32);
DEFAULT(Real64, REAL64, default_real64);
DEFAULT(Char16, CHAR16, default_char16);
DEFAULT(Text, STRING, default_text);
DEFAULT(When, DATETIME, default_when);
PROPERTY(defaults_Numbers, Test_Defaults, Numbers, property_flag, UINT16, -1, &default_numbers);
PROPERTY(defaults_Texts, Test_Defaults, Texts, property_flag, STRING, -1, &default_texts);
PROPERTY(defaults_Times, Test_Defaults, Times, property_flag, DATETIME, -1, &default_times);
const Meta_Feature* const defaults_features[] = {
    &defaults_Boolean, &defaults_Uint8,  &defaults_Sint8,   &defaults_Uint16, &defaults_Sint16, &defaults_Uint32,
    &defaults_Sint32,  &defaults_Uint64, &defaults_Sint64,  &defaults_Real32, &defaults_Real64, &defaults_Char16,
    &defaults_Text,    &defaults_When,   &defaults_Numbers, &defaults_Texts,  &defaults_Times};

PROPERTY(other_name, Other_Base, Name, key_flag, STRING, 0, nullptr);
PROPERTY(other_number, Other_Base, Number, key_flag, UINT32, -1, nullptr);
const Meta_Feature* const other_features[] = {&other_name, &other_number};

const uint8 thing_locals[35] = {0, 0, 0, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1,
                                1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1};

} // namespace

META_CLASS(Test_Base, META_FLAG_CLASS, base_features, all_local, nullptr, 2);
META_CLASS(Test_Thing, META_FLAG_CLASS, thing_features, thing_locals, &Test_Base::meta, 2);
META_CLASS(Test_Link, META_FLAG_ASSOCIATION, link_features, all_local, nullptr, 2);
META_CLASS(Test_Plain_Keys, META_FLAG_CLASS, plain_features, all_local, nullptr, 10);
META_CLASS(Test_Odd_Keys, META_FLAG_CLASS, odd_features, all_local, nullptr, 4);
META_CLASS(Test_Array_Key, META_FLAG_CLASS, array_key_features, all_local, nullptr, 2);
META_CLASS(Test_Chain, META_FLAG_CLASS, chain_features, all_local, &Test_Node::meta, 1);
META_CLASS(Test_Defaults, META_FLAG_CLASS, defaults_features, all_local, nullptr, 0);
META_CLASS(Other_Base, META_FLAG_CLASS, other_features, all_local, nullptr, 2);
const Meta_Class Test_Node::meta = {
    {{FEATURE(META_FLAG_CLASS, "Test_Node")}, nullptr, 0, sizeof(Test_Node)}, nullptr, nullptr, 0, &test_repository};
const Meta_Class Test_Leaf::meta = {{{FEATURE(META_FLAG_CLASS, "Test_Leaf")}, nullptr, 0, sizeof(Test_Leaf)},
                                    nullptr,
                                    &Test_Node::meta,
                                    0,
                                    &test_repository};

namespace {

const Meta_Class* const test_classes[] = {&Test_Base::meta,       &Test_Thing::meta,    &Test_Link::meta,
                                          &Test_Plain_Keys::meta, &Test_Odd_Keys::meta, &Test_Array_Key::meta,
                                          &Test_Node::meta,       &Test_Chain::meta,    &Test_Leaf::meta,
                                          &Test_Defaults::meta,   &Other_Base::meta};

}

const Meta_Repository test_repository = {test_classes, sizeof(test_classes) / sizeof(test_classes[0])};

Test_Thing* make_full_thing()
{
    Ref<Test_Thing> thing(make_keyed<Test_Thing>("a thing whose name outgrows the smallest rep", 7));
    thing->__name_space = "root/test";
    thing->Note.set("note");
    thing->Boolean.set(true);
    thing->Uint8.set(uint8(250));
    thing->Sint8.set(sint8(-120));
    thing->Uint16.set(uint16(65000));
    thing->Sint16.set(sint16(-32000));
    thing->Uint32.set(4000000000u);
    thing->Sint32.set(-2000000000);
    thing->Uint64.set(uint64(18000000000000000000u));
    thing->Sint64.set(sint64(-9000000000000000000));
    thing->Real32.set(1.5f);
    thing->Real64.set(-2.25);
    thing->Char16.set(u'x');
    thing->Text.set("text");
    thing->When.set(Datetime(90000000));
    thing->Booleans.set(Array<boolean>{true, false});
    thing->Uint8s.set(Array<uint8>{1, 2, 3});
    thing->Sint8s.set(Array<sint8>{-1});
    thing->Uint16s.set(Array<uint16>{1, 65535});
    thing->Sint16s.set(Array<sint16>{-2});
    thing->Uint32s.set(Array<uint32>{1, 2, 3, 4});
    thing->Sint32s.set(Array<sint32>{-3});
    thing->Uint64s.set(Array<uint64>{5});
    thing->Sint64s.set(Array<sint64>{-4});
    thing->Real32s.set(Array<real32>{0.5f});
    thing->Real64s.set(Array<real64>{0.25});
    thing->Char16s.set(Array<char16>{u'a', u'\n'});
    thing->Texts.set(Array<String>{"one", "two\twords", "a text of more than thirty-two characters"});
    thing->Times.set(Array<Datetime>{Datetime(1), Datetime(2)});
    thing->Peer = make_keyed("peer", 1);
    Ref<Test_Base> inside(make_keyed("inside", 2));
    thing->Inside = inside.release();
    thing->Peers.null = 0;
    for (uint32 i = 0; i < 3; ++i) {
        Ref<Test_Base> peer(i == 1 ? nullptr : make_keyed("one of many", i));
        thing->Peers.value.append(peer.get());
        peer.release();
    }
    return thing.release();
}

} // namespace cimple
