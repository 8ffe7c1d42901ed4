/// A small family of classes for the tests of the runtime, with records as the generator would write them.
///
///   Test_Base           keys Name (string) and Number (uint32); Note
///   Test_Thing          : Test_Base; a property of every type, scalar and array; references of each kind; a method
///   Test_Link           association of Left (Test_Base) and Right (Test_Thing); a word of its own
///   Test_Plain_Keys     a key of every type that a key text can be read from
///   Test_Odd_Keys       keys that a key text can only be written from
///   Test_Array_Key      a string key, then an array key
///   Test_Node, Test_Chain, Test_Leaf   no keys; : Test_Node with the key Next (Test_Node); : Test_Node
///   Test_Defaults       a default of every type, scalar and array
///   Other_Base          unrelated to Test_Base, with the same key names; Number is an array
#pragma once

#include "runtime/Instance.h"

namespace cimple {

#define TEST_BASE_MEMBERS                                                                                              \
    Property<String> Name;                                                                                             \
    Property<uint32> Number;                                                                                           \
    Property<String> Note;

struct Test_Base : Instance {
    TEST_BASE_MEMBERS
    static const Meta_Class meta;
};

struct Test_Thing : Instance {
    TEST_BASE_MEMBERS
    Property<boolean> Boolean;
    Property<uint8> Uint8;
    Property<sint8> Sint8;
    Property<uint16> Uint16;
    Property<sint16> Sint16;
    Property<uint32> Uint32;
    Property<sint32> Sint32;
    Property<uint64> Uint64;
    Property<sint64> Sint64;
    Property<real32> Real32;
    Property<real64> Real64;
    Property<char16> Char16;
    Property<String> Text;
    Property<Datetime> When;
    Property<Array<boolean>> Booleans;
    Property<Array<uint8>> Uint8s;
    Property<Array<sint8>> Sint8s;
    Property<Array<uint16>> Uint16s;
    Property<Array<sint16>> Sint16s;
    Property<Array<uint32>> Uint32s;
    Property<Array<sint32>> Sint32s;
    Property<Array<uint64>> Uint64s;
    Property<Array<sint64>> Sint64s;
    Property<Array<real32>> Real32s;
    Property<Array<real64>> Real64s;
    Property<Array<char16>> Char16s;
    Property<Array<String>> Texts;
    Property<Array<Datetime>> Times;
    Test_Base* Peer;
    Instance* Inside; // an embedded instance
    Property<Array<Instance*>> Peers;
    static const Meta_Class meta;
};

struct Test_Link : Instance {
    Test_Base* Left;
    Test_Thing* Right;
    Property<String> Word;
    static const Meta_Class meta;
};

struct Test_Plain_Keys : Instance {
    Property<boolean> Boolean;
    Property<uint8> Uint8;
    Property<sint8> Sint8;
    Property<uint16> Uint16;
    Property<sint16> Sint16;
    Property<uint32> Uint32;
    Property<sint32> Sint32;
    Property<uint64> Uint64;
    Property<sint64> Sint64;
    Property<String> Text;
    static const Meta_Class meta;
};

struct Test_Odd_Keys : Instance {
    Property<real32> Real32;
    Property<real64> Real64;
    Property<char16> Char16;
    Property<Datetime> When;
    static const Meta_Class meta;
};

struct Test_Array_Key : Instance {
    Property<String> Name;
    Property<Array<uint8>> Bytes;
    static const Meta_Class meta;
};

struct Test_Node : Instance {
    static const Meta_Class meta;
};

struct Test_Chain : Instance {
    Test_Node* Next;
    static const Meta_Class meta;
};

struct Test_Leaf : Instance {
    static const Meta_Class meta;
};

struct Test_Defaults : Instance {
    Property<boolean> Boolean;
    Property<uint8> Uint8;
    Property<sint8> Sint8;
    Property<uint16> Uint16;
    Property<sint16> Sint16;
    Property<uint32> Uint32;
    Property<sint32> Sint32;
    Property<uint64> Uint64;
    Property<sint64> Sint64;
    Property<real32> Real32;
    Property<real64> Real64;
    Property<char16> Char16;
    Property<String> Text;
    Property<Datetime> When;
    Property<Array<uint16>> Numbers;
    Property<Array<String>> Texts;
    Property<Array<Datetime>> Times;
    static const Meta_Class meta;
};

struct Other_Base : Instance {
    Property<String> Name;
    Property<Array<uint32>> Number;
    static const Meta_Class meta;
};

/// The record of a call of Test_Thing.Frob.
struct Test_Thing_Frob : Instance {
    Property<String> Word;
    Test_Base* Target;
    Property<Array<uint32>> Results;
    Property<uint32> return_value;
    static const Meta_Method meta;
};

extern const Meta_Repository test_repository;

/// A Test_Base (or Test_Thing) with those keys; the caller owns it.
template <class T = Test_Base>
T* make_keyed(const char* name, uint32 number)
{
    T* instance = create_as<T>();
    instance->Name.set(name);
    instance->Number.set(number);
    return instance;
}

/// A Test_Thing with a value in every feature.
Test_Thing* make_full_thing();

} // namespace cimple
