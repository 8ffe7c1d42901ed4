#include "tests/cmpi/test_classes.h"

// The structures have a base with members, for which GCC knows the offsets all the same.
#pragma GCC diagnostic ignored "-Winvalid-offsetof"

namespace cimple {

namespace {

constexpr uint32 property = META_FLAG_PROPERTY;
constexpr uint32 reference = META_FLAG_REFERENCE;
constexpr uint32 key = META_FLAG_KEY;
constexpr uint32 embedded = META_FLAG_EMBEDDED_INSTANCE;
constexpr uint32 in = META_FLAG_IN;
constexpr uint32 out = META_FLAG_OUT;

#define HEAD(flags, name)                                                                                              \
    {                                                                                                                  \
        {0}, flags, name, nullptr, 0                                                                                   \
    }
#define SCALAR(Class, name, type, flags)                                                                               \
    {                                                                                                                  \
        HEAD(property | (flags), #name), type, 0, offsetof(Class, name), nullptr                                       \
    }
#define ARRAY(Class, name, type, flags)                                                                                \
    {                                                                                                                  \
        HEAD(property | (flags), #name), type, -1, offsetof(Class, name), nullptr                                      \
    }
#define REFERENCE(Class, name, Target, flags)                                                                          \
    {                                                                                                                  \
        HEAD(reference | (flags), #name), 0, &Target::meta, offsetof(Class, name)                                      \
    }
#define REFERENCES(Class, name, Target, flags)                                                                         \
    {                                                                                                                  \
        HEAD(reference | (flags), #name), -1, &Target::meta, offsetof(Class, name)                                     \
    }
#define RECORD(Class, features, count) features, count, sizeof(Class)

const uint8 locals[64] = {};

const Meta_Property base_name = SCALAR(TEST_Base, Name, STRING, key);
const Meta_Feature* const base_features[] = {&base_name};

const Meta_Property part_id = SCALAR(TEST_Part, Id, STRING, key);
const Meta_Property part_label = SCALAR(TEST_Part, Label, STRING, 0);
const Meta_Feature* const part_features[] = {&part_id, &part_label};

const Meta_Property thing_number = SCALAR(TEST_Thing, Number, UINT8, key);
const Meta_Property thing_flag = SCALAR(TEST_Thing, Flag, BOOLEAN, 0);
const Meta_Property thing_tiny = SCALAR(TEST_Thing, Tiny, SINT8, 0);
const Meta_Property thing_speed = SCALAR(TEST_Thing, Speed, UINT16, 0);
const Meta_Property thing_offset = SCALAR(TEST_Thing, Offset, SINT16, 0);
const Meta_Property thing_count = SCALAR(TEST_Thing, Count, UINT32, 0);
const Meta_Property thing_delta = SCALAR(TEST_Thing, Delta, SINT32, 0);
const Meta_Property thing_total = SCALAR(TEST_Thing, Total, UINT64, 0);
const Meta_Property thing_balance = SCALAR(TEST_Thing, Balance, SINT64, 0);
const Meta_Property thing_ratio = SCALAR(TEST_Thing, Ratio, REAL32, 0);
const Meta_Property thing_precise = SCALAR(TEST_Thing, Precise, REAL64, 0);
const Meta_Property thing_letter = SCALAR(TEST_Thing, Letter, CHAR16, 0);
const Meta_Property thing_text = SCALAR(TEST_Thing, Text, STRING, 0);
const Meta_Property thing_when = SCALAR(TEST_Thing, When, DATETIME, 0);
const Meta_Property thing_words = ARRAY(TEST_Thing, Words, STRING, 0);
const Meta_Property thing_codes = ARRAY(TEST_Thing, Codes, UINT16, 0);
const Meta_Property thing_flags = ARRAY(TEST_Thing, Flags, BOOLEAN, 0);
const Meta_Property thing_times = ARRAY(TEST_Thing, Times, DATETIME, 0);
const Meta_Reference thing_part = REFERENCE(TEST_Thing, Part, TEST_Part, embedded);
const Meta_Reference thing_other = REFERENCE(TEST_Thing, Other, TEST_Part, 0);
const Meta_Reference thing_parts = REFERENCES(TEST_Thing, Parts, TEST_Part, embedded);
const Meta_Reference thing_others = REFERENCES(TEST_Thing, Others, TEST_Part, 0);

const Meta_Property echo_text = SCALAR(TEST_Thing_Echo, Text, STRING, in);
const Meta_Property echo_flag = SCALAR(TEST_Thing_Echo, Flag, BOOLEAN, in);
const Meta_Property echo_number = SCALAR(TEST_Thing_Echo, Number, UINT16, in);
const Meta_Property echo_wide = SCALAR(TEST_Thing_Echo, Wide, UINT64, in);
const Meta_Property echo_letter = SCALAR(TEST_Thing_Echo, Letter, CHAR16, in);
const Meta_Reference echo_parts = REFERENCES(TEST_Thing_Echo, Parts, TEST_Part, in);
const Meta_Property echo_reply = SCALAR(TEST_Thing_Echo, Reply, STRING, out);
const Meta_Property echo_lines = ARRAY(TEST_Thing_Echo, Lines, STRING, out);
const Meta_Reference echo_target = REFERENCE(TEST_Thing_Echo, Target, TEST_Part, in | out);
const Meta_Property echo_return = SCALAR(TEST_Thing_Echo, return_value, UINT32, out);
const Meta_Feature* const echo_features[] = {&echo_text,  &echo_flag,  &echo_number, &echo_wide,   &echo_letter,
                                             &echo_parts, &echo_reply, &echo_lines,  &echo_target, &echo_return};

// A method with the name of its class, which the bridge refuses.
const Meta_Method namesake = {{HEAD(META_FLAG_METHOD, "TEST_Thing"), RECORD(TEST_Thing_Echo, echo_features, 10)},
                              UINT32};

const Meta_Feature* const thing_features[] = {
    &base_name,    &thing_number, &thing_flag,  &thing_tiny,    &thing_speed,  &thing_offset,
    &thing_count,  &thing_delta,  &thing_total, &thing_balance, &thing_ratio,  &thing_precise,
    &thing_letter, &thing_text,   &thing_when,  &thing_words,   &thing_codes,  &thing_flags,
    &thing_times,  &thing_part,   &thing_other, &thing_parts,   &thing_others, &TEST_Thing_Echo::meta,
    &namesake};

const Meta_Reference link_antecedent = REFERENCE(TEST_Link, Antecedent, TEST_Base, key);
const Meta_Reference link_dependent = REFERENCE(TEST_Link, Dependent, TEST_Part, key);
const Meta_Property link_note = SCALAR(TEST_Link, Note, STRING, 0);
const Meta_Feature* const link_features[] = {&link_antecedent, &link_dependent, &link_note};

const Meta_Reference pair_left = REFERENCE(TEST_Pair, Left, TEST_Base, key);
const Meta_Reference pair_right = REFERENCE(TEST_Pair, Right, TEST_Base, key);
const Meta_Feature* const pair_features[] = {&pair_left, &pair_right};

const Meta_Property event_text = SCALAR(TEST_Event, Text, STRING, 0);
const Meta_Property event_notes = ARRAY(TEST_Event, Notes, STRING, 0);
const Meta_Feature* const event_features[] = {&event_text, &event_notes};

const Meta_Property counter_value = SCALAR(TEST_Counter, Value, UINT32, key);
const Meta_Property counter_balance = SCALAR(TEST_Counter, Balance, SINT64, key);
const Meta_Feature* const counter_features[] = {&counter_value, &counter_balance};

const Meta_Class* const classes[] = {&TEST_Base::meta, &TEST_Part::meta,  &TEST_Thing::meta,  &TEST_Link::meta,
                                     &TEST_Pair::meta, &TEST_Event::meta, &TEST_Counter::meta};

template <class T>
void give(Property<T>& place, const T& value)
{
    place.value = value;
    place.null = 0;
}

} // namespace

const Meta_Repository test_repository = {classes, 7};

const Meta_Class TEST_Base::meta = {
    {HEAD(META_FLAG_CLASS, "TEST_Base"), RECORD(TEST_Base, base_features, 1)}, locals, nullptr, 1, &test_repository};
const Meta_Class TEST_Part::meta = {
    {HEAD(META_FLAG_CLASS, "TEST_Part"), RECORD(TEST_Part, part_features, 2)}, locals, nullptr, 1, &test_repository};
const Meta_Class TEST_Thing::meta = {{HEAD(META_FLAG_CLASS, "TEST_Thing"), RECORD(TEST_Thing, thing_features, 25)},
                                     locals,
                                     &TEST_Base::meta,
                                     2,
                                     &test_repository};
const Meta_Class TEST_Link::meta = {{HEAD(META_FLAG_ASSOCIATION, "TEST_Link"), RECORD(TEST_Link, link_features, 3)},
                                    locals,
                                    nullptr,
                                    2,
                                    &test_repository};
const Meta_Class TEST_Pair::meta = {{HEAD(META_FLAG_ASSOCIATION, "TEST_Pair"), RECORD(TEST_Pair, pair_features, 2)},
                                    locals,
                                    nullptr,
                                    2,
                                    &test_repository};
const Meta_Class TEST_Event::meta = {{HEAD(META_FLAG_INDICATION, "TEST_Event"), RECORD(TEST_Event, event_features, 2)},
                                     locals,
                                     nullptr,
                                     0,
                                     &test_repository};
const Meta_Class TEST_Counter::meta = {
    {HEAD(META_FLAG_CLASS, "TEST_Counter"), RECORD(TEST_Counter, counter_features, 2)},
    locals,
    nullptr,
    2,
    &test_repository};
const Meta_Method TEST_Thing_Echo::meta = {{HEAD(META_FLAG_METHOD, "Echo"), RECORD(TEST_Thing_Echo, echo_features, 10)},
                                           UINT32};

TEST_Thing* new_thing(const char* name, uint8 number)
{
    auto* thing = create_as<TEST_Thing>();
    give(thing->Name, String(name));
    give(thing->Number, number);
    return thing;
}

TEST_Part* new_part(const char* id)
{
    auto* part = create_as<TEST_Part>();
    give(part->Id, String(id));
    return part;
}

TEST_Link* new_link(const char* name, const char* id)
{
    auto* link = create_as<TEST_Link>();
    link->Antecedent = create_as<TEST_Base>();
    give(link->Antecedent->Name, String(name));
    link->Dependent = new_part(id);
    return link;
}

// --- Provider
// ----------------------------------------------------------------------------------------------------------

Test_Provider::Test_Provider(const Meta_Class* meta_class, const char* name)
    : Registration{"TEST_Module", name, dispatch, meta_class, nullptr}
{
}

int Test_Provider::calls(int operation)
{
    std::lock_guard<std::mutex> lock(m_mutex);
    return m_calls[operation];
}

int Test_Provider::dispatch(const Registration* registration, int code, void* arg0, void* arg1, void* arg2, void* arg3,
                            void* arg4, void* arg5, void* arg6, void* arg7)
{
    void* words[8] = {arg0, arg1, arg2, arg3, arg4, arg5, arg6, arg7};
    return const_cast<Test_Provider*>(static_cast<const Test_Provider*>(registration))->perform(code, words);
}

int Test_Provider::perform(int code, void** words)
{
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        ++m_calls[code];
    }
    auto scripted = on.find(code);
    if (scripted != on.end()) return scripted->second(words);
    switch (code) {
    case OP_GET_META_CLASS:
        *static_cast<const Meta_Class**>(words[0]) = meta_class;
        return 0;
    case OP_GET_REPOSITORY:
        *static_cast<const Meta_Repository**>(words[0]) = &test_repository;
        return 0;
    case OP_CREATE_PROVIDER:
        *static_cast<void**>(words[0]) = new int(0);
        ++created;
        return 0;
    case OP_DESTROY_PROVIDER:
        delete static_cast<int*>(words[0]);
        ++destroyed;
        return 0;
    case OP_LOAD:
        ++loaded;
        return 0;
    case OP_UNLOAD:
        ++unloaded;
        return 0;
    case OP_GET_INSTANCE:
        return GET_INSTANCE_UNSUPPORTED;
    case OP_ENUM_INSTANCES: {
        auto handler = reinterpret_cast<Enum_Handler_Proc>(words[2]);
        for (Instance* instance : instances())
            handler(instance, 0, words[3]);
        handler(nullptr, 0, words[3]);
        return 0;
    }
    case OP_CREATE_INSTANCE:
        return CREATE_INSTANCE_UNSUPPORTED;
    case OP_DELETE_INSTANCE:
        return DELETE_INSTANCE_UNSUPPORTED;
    case OP_MODIFY_INSTANCE:
        return MODIFY_INSTANCE_UNSUPPORTED;
    case OP_ENUM_ASSOCIATOR_NAMES:
        return ENUM_ASSOCIATOR_NAMES_UNSUPPORTED;
    case OP_ENUM_REFERENCES:
        return ENUM_REFERENCES_UNSUPPORTED;
    case OP_ENUM_ASSOCIATORS:
        return ENUM_ASSOCIATORS_UNSUPPORTED;
    case OP_ENABLE_INDICATIONS:
    case OP_DISABLE_INDICATIONS:
        return 0;
    default:
        return -1;
    }
}

} // namespace cimple
