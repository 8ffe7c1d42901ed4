/// A CIM server's broker for tests of the bridge: strict about objects, scripted in what it answers.
///
/// Content is plain data (Value, Path, Instance); CMPI objects are made of it and keep a copy of what they are given,
/// as servers do. Objects stay in memory until the broker ends, so that a use or a second release of a released one is
/// seen and told in `faults`. Tables are members, so that a test can take slots out. Any thread.
#pragma once

#include <cmpift.h>

#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

namespace fake {

struct Path;
struct Instance;

struct Value {
    CMPIType type = CMPI_null;
    CMPIValueState state = CMPI_nullValue;
    CMPIValue number{}; // of simple types
    std::string text;   // of strings and date-times
    bool null_text = false;
    std::shared_ptr<Path> path;
    std::shared_ptr<Instance> instance;
    std::vector<Value> elements;

    bool null() const { return (state & CMPI_nullValue) != 0; }
};

Value null_value(CMPIType type);
Value boolean(bool value);
Value uint8(unsigned value);
Value uint16(unsigned value);
Value uint32(unsigned value);
Value uint64(unsigned long long value);
Value sint32(int value);
Value sint64(long long value);
Value string(const std::string& text);
Value string_without_chars();
Value datetime(const std::string& text);
Value reference(const Path& path);
Value embedded(const Instance& instance);
Value array(CMPIType element, std::vector<Value> elements);

using Values = std::vector<std::pair<std::string, Value>>;

struct Path {
    std::string name_space;
    std::string class_name;
    Values keys;
};

struct Instance {
    Path path;
    Values properties;
};

/// The characters behind a string of the broker's, past its table.
const std::string& text_of(const CMPIString* string);

/// The value of that name, or a null one of type CMPI_null.
Value find(const Values& values, const std::string& name);

enum Kind { strings, datetimes, arrays, paths, instances, arguments, enumerations, contexts, results, kinds };

struct Object_Head;

class Broker {
public:
    Broker();
    ~Broker();
    Broker(const Broker&) = delete;
    Broker& operator=(const Broker&) = delete;

    CMPIBroker cmpi{};
    CMPIBrokerFT bft{};
    CMPIBrokerEncFT eft{};
    CMPIStringFT string_ft{};
    CMPIDateTimeFT datetime_ft{};
    CMPIArrayFT array_ft{};
    CMPIObjectPathFT path_ft{};
    CMPIInstanceFT instance_ft{};
    CMPIArgsFT args_ft{};
    CMPIEnumerationFT enumeration_ft{};
    CMPIContextFT context_ft{};
    CMPIResultFT result_ft{};

    // Objects lent to the module.
    CMPIObjectPath* path(const Path& content);
    CMPIInstance* instance(const Instance& content);
    CMPIArgs* args(const Values& content = {});
    CMPIContext* context(const Values& entries = {});
    CMPIResult* result();

    // What came out.
    struct Returned {
        std::vector<Instance> instances;
        std::vector<Path> paths;
        std::vector<Value> values;
        int done = 0;
    };
    Returned& returned(const CMPIResult* result);
    const Values& content(const CMPIArgs* args);

    /// Made by the module and not released yet.
    int alive(Kind kind);
    int alive();
    std::vector<std::string> faults;

    // Up-calls: status and answer; what was asked is kept.
    CMPIrc answer = CMPI_RC_OK;
    std::vector<Instance> found;
    /// getInstance gives none for the object whose key "Id" this is, with that status, which may be OK.
    struct {
        std::string id;
        CMPIrc code = CMPI_RC_ERR_NOT_FOUND;
    } gone;
    Value method_answer;
    Values method_out;
    struct Up_Call {
        std::string name;
        Path path;
        Instance instance;
        std::string method;
        Values in;
    };
    std::vector<Up_Call> up_calls;
    std::function<void(const std::string& name)> on_up_call;
    std::vector<std::pair<std::string, Instance>> deliveries;

    // Threads.
    bool refuse_prepare = false;
    bool refuse_attach = false;
    int prepared = 0, attached = 0, detached = 0, contexts_released = 0;

    // The key names of the last property filter.
    std::vector<std::string> filter_keys;

    // For the tables.
    template <class Object>
    Object* keep(Object* object);
    void fault(const std::string& text);
    std::recursive_mutex mutex;
    std::vector<std::unique_ptr<Object_Head>> objects;
};

} // namespace fake
