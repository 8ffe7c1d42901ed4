/// A few classes with hand-written records, and a provider for them that a test scripts.
///
/// TEST_Base (key Name) < TEST_Thing (key Number, a property of most types, methods); TEST_Part (key Id);
/// TEST_Link, an association of a TEST_Base and a TEST_Part; TEST_Pair, one of two TEST_Base; TEST_Event, an
/// indication; TEST_Counter (keys Value of 32 bits, Balance of 64 signed ones).
#pragma once

#include <atomic>
#include <functional>
#include <map>
#include <mutex>
#include <vector>

#include "runtime/Registration.h"

namespace cimple {

struct TEST_Base : Instance {
    Property<String> Name;
    static const Meta_Class meta;
};

struct TEST_Part : Instance {
    Property<String> Id;
    Property<String> Label;
    static const Meta_Class meta;
};

struct TEST_Thing : Instance {
    Property<String> Name;
    Property<uint8> Number;
    Property<boolean> Flag;
    Property<sint8> Tiny;
    Property<uint16> Speed;
    Property<sint16> Offset;
    Property<uint32> Count;
    Property<sint32> Delta;
    Property<uint64> Total;
    Property<sint64> Balance;
    Property<real32> Ratio;
    Property<real64> Precise;
    Property<char16> Letter;
    Property<String> Text;
    Property<Datetime> When;
    Property<Array<String>> Words;
    Property<Array<uint16>> Codes;
    Property<Array<boolean>> Flags;
    Property<Array<Datetime>> Times;
    TEST_Part* Part;                   // embedded
    TEST_Part* Other;                  // a reference
    Property<Array<Instance*>> Parts;  // embedded
    Property<Array<Instance*>> Others; // references
    static const Meta_Class meta;
};

struct TEST_Thing_Echo : Instance {
    Property<String> Text;
    Property<boolean> Flag;
    Property<uint16> Number;
    Property<uint64> Wide;
    Property<char16> Letter;
    Property<Array<Instance*>> Parts;
    Property<String> Reply;        // Out
    Property<Array<String>> Lines; // Out
    TEST_Part* Target;             // In and Out
    Property<uint32> return_value;
    static const Meta_Method meta;
};

struct TEST_Link : Instance {
    TEST_Base* Antecedent;
    TEST_Part* Dependent;
    Property<String> Note;
    static const Meta_Class meta;
};

struct TEST_Pair : Instance {
    TEST_Base* Left;
    TEST_Base* Right;
    static const Meta_Class meta;
};

struct TEST_Event : Instance {
    Property<String> Text;
    Property<Array<String>> Notes;
    static const Meta_Class meta;
};

struct TEST_Counter : Instance {
    Property<uint32> Value;
    Property<sint64> Balance;
    static const Meta_Class meta;
};

extern const Meta_Repository test_repository;

TEST_Thing* new_thing(const char* name, uint8 number);
TEST_Part* new_part(const char* id);
TEST_Link* new_link(const char* name, const char* id);

/// A provider whose every operation can be scripted; unscripted ones answer as a provider that only enumerates does.
class Test_Provider : public Registration {
public:
    using Operation_Proc = std::function<int(void** words)>;

    explicit Test_Provider(const Meta_Class* meta_class, const char* name = "TEST_Provider");

    /// What answers an operation; `words` are its eight arguments.
    std::map<int, Operation_Proc> on;
    /// What enum_instances hands over.
    std::function<std::vector<Instance*>()> instances = [] { return std::vector<Instance*>(); };

    std::atomic<int> created{0}, destroyed{0}, loaded{0}, unloaded{0};
    int calls(int operation);

private:
    static int dispatch(const Registration* registration, int code, void* arg0, void* arg1, void* arg2, void* arg3,
                        void* arg4, void* arg5, void* arg6, void* arg7);
    int perform(int code, void** words);

    std::mutex m_mutex;
    std::map<int, int> m_calls;
};

} // namespace cimple
