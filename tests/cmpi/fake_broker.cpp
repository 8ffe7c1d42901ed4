#include "tests/cmpi/fake_broker.h"

#include <strings.h>

namespace fake {

struct Object_Head {
    Broker* broker = nullptr;
    Kind kind = strings;
    bool made = false; // by the module: it should release it
    bool released = false;
    virtual ~Object_Head() = default;
};

namespace {

template <class Cmpi, Kind which, class Content>
struct Object : Cmpi, Object_Head {
    Content content{};
    Object() : Cmpi{} { kind = which; }
};

struct Text {
    std::string text;
    bool null = false;
};
struct Items {
    CMPIType type = 0;
    std::vector<Value> values;
};
struct Filtered {
    Instance instance;
    bool filtered = false;
    std::vector<std::string> wanted;
};
struct Walk {
    std::vector<Instance> instances;
    std::size_t at = 0;
};

using String_Object = Object<CMPIString, strings, Text>;
using Datetime_Object = Object<CMPIDateTime, datetimes, std::string>;
using Array_Object = Object<CMPIArray, arrays, Items>;
using Path_Object = Object<CMPIObjectPath, paths, Path>;
using Instance_Object = Object<CMPIInstance, instances, Filtered>;
using Args_Object = Object<CMPIArgs, arguments, Values>;
using Enumeration_Object = Object<CMPIEnumeration, enumerations, Walk>;
using Context_Object = Object<CMPIContext, contexts, Values>;
using Result_Object = Object<CMPIResult, results, Broker::Returned>;

constexpr CMPIStatus ok = {CMPI_RC_OK, nullptr};

void report(CMPIStatus* rc, CMPIrc code)
{
    if (rc) *rc = {code, nullptr};
}

// The object behind a CMPI pointer; a released one is a fault.
template <class Whole, class Cmpi>
Whole& whole(const Cmpi* cmpi)
{
    auto* object = static_cast<Whole*>(const_cast<Cmpi*>(cmpi));
    if (object->released) object->broker->fault("a released object was used");
    return *object;
}

template <class Whole, class Cmpi>
CMPIStatus release(Cmpi* cmpi)
{
    Whole& object = whole<Whole>(cmpi);
    std::lock_guard<std::recursive_mutex> lock(object.broker->mutex);
    object.released = true;
    if constexpr (std::is_same_v<Whole, Context_Object>) ++object.broker->contexts_released;
    return ok;
}

Broker& of(const CMPIBroker* broker)
{
    return *static_cast<Broker*>(broker->hdl);
}

template <class Whole, class Table>
Whole* make(Broker& broker, Table& table, bool made)
{
    auto* object = new Whole;
    object->ft = &table;
    object->hdl = object;
    object->broker = &broker;
    object->made = made;
    return broker.keep(object);
}

CMPIString* make_string(Broker& broker, const std::string& text, bool made = false, bool null = false)
{
    auto* object = make<String_Object>(broker, broker.string_ft, made);
    object->content = {text, null};
    return object;
}

CMPIObjectPath* make_path(Broker& broker, const Path& content, bool made = false)
{
    auto* object = make<Path_Object>(broker, broker.path_ft, made);
    object->content = content;
    return object;
}

CMPIInstance* make_instance(Broker& broker, const Instance& content, bool made = false)
{
    auto* object = make<Instance_Object>(broker, broker.instance_ft, made);
    object->content.instance = content;
    return object;
}

Instance filtered(const Filtered& content)
{
    if (!content.filtered) return content.instance;
    Instance result{content.instance.path, {}};
    for (const auto& property : content.instance.properties)
        for (const auto& name : content.wanted)
            if (strcasecmp(name.c_str(), property.first.c_str()) == 0) result.properties.push_back(property);
    return result;
}

// A copy of what the module handed in.
Value value_of(const CMPIValue* value, CMPIType type)
{
    Value result = null_value(type);
    if (!value) return result;
    result.state = CMPI_goodValue;
    if (type & CMPI_ARRAY) {
        result.elements = whole<Array_Object>(value->array).content.values;
    } else if (type == CMPI_string) {
        const Text& text = whole<String_Object>(value->string).content;
        result.text = text.text;
        result.null_text = text.null;
    } else if (type == CMPI_dateTime) {
        result.text = whole<Datetime_Object>(value->dateTime).content;
    } else if (type == CMPI_ref) {
        result.path = std::make_shared<Path>(whole<Path_Object>(value->ref).content);
    } else if (type == CMPI_instance) {
        result.instance = std::make_shared<Instance>(filtered(whole<Instance_Object>(value->inst).content));
    } else {
        result.number = *value;
    }
    return result;
}

// A look at content: new objects of the broker's.
CMPIData data_of(Broker& broker, const Value& value)
{
    CMPIData data{};
    data.type = value.type;
    data.state = value.state;
    if (value.null()) return data;
    if (value.type & CMPI_ARRAY) {
        auto* object = make<Array_Object>(broker, broker.array_ft, false);
        object->content = {static_cast<CMPIType>(value.type & ~CMPI_ARRAY), value.elements};
        data.value.array = object;
    } else if (value.type == CMPI_string) {
        data.value.string = make_string(broker, value.text, false, value.null_text);
    } else if (value.type == CMPI_dateTime) {
        auto* object = make<Datetime_Object>(broker, broker.datetime_ft, false);
        object->content = value.text;
        data.value.dateTime = object;
    } else if (value.type == CMPI_ref) {
        data.value.ref = value.path ? make_path(broker, *value.path) : nullptr;
    } else if (value.type == CMPI_instance) {
        data.value.inst = value.instance ? make_instance(broker, *value.instance) : nullptr;
    } else {
        data.value = value.number;
    }
    return data;
}

void put(Values& values, const char* name, const CMPIValue* value, CMPIType type)
{
    Value copy = value_of(value, type);
    for (auto& entry : values)
        if (strcasecmp(entry.first.c_str(), name) == 0) {
            entry.second = copy;
            return;
        }
    values.emplace_back(name, copy);
}

CMPIData data_at(Broker& broker, const Values& values, CMPICount index, CMPIString** name, CMPIStatus* rc)
{
    if (index >= values.size()) {
        report(rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
        return CMPIData{CMPI_null, CMPI_notFound, {}};
    }
    report(rc, CMPI_RC_OK);
    if (name) *name = make_string(broker, values[index].first);
    return data_of(broker, values[index].second);
}

CMPIData data_named(Broker& broker, const Values& values, const char* name, CMPIrc unknown, CMPIStatus* rc)
{
    for (const auto& entry : values)
        if (strcasecmp(entry.first.c_str(), name) == 0) {
            report(rc, CMPI_RC_OK);
            return data_of(broker, entry.second);
        }
    report(rc, unknown);
    return CMPIData{CMPI_null, CMPI_notFound, {}};
}

Value simple(CMPIType type, CMPIValue number)
{
    Value value;
    value.type = type;
    value.state = CMPI_goodValue;
    value.number = number;
    return value;
}

Value with_text(CMPIType type, const std::string& text)
{
    Value value;
    value.type = type;
    value.state = CMPI_goodValue;
    value.text = text;
    return value;
}

// --- Tables
// ------------------------------------------------------------------------------------------------------------

void fill_encapsulation(Broker& broker)
{
    broker.eft.ftVersion = 200;
    broker.eft.newString = [](const CMPIBroker* mb, const char* data, CMPIStatus* rc) -> CMPIString* {
        report(rc, data ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_PARAMETER);
        return data ? make_string(of(mb), data, true) : nullptr;
    };
    broker.eft.newDateTimeFromChars = [](const CMPIBroker* mb, const char* text, CMPIStatus* rc) -> CMPIDateTime* {
        auto* object = make<Datetime_Object>(of(mb), of(mb).datetime_ft, true);
        object->content = text;
        report(rc, CMPI_RC_OK);
        return object;
    };
    broker.eft.newArray = [](const CMPIBroker* mb, CMPICount max, CMPIType type, CMPIStatus* rc) -> CMPIArray* {
        auto* object = make<Array_Object>(of(mb), of(mb).array_ft, true);
        object->content = {type, std::vector<Value>(max, null_value(type))};
        report(rc, CMPI_RC_OK);
        return object;
    };
    broker.eft.newObjectPath = [](const CMPIBroker* mb, const char* ns, const char* cn,
                                  CMPIStatus* rc) -> CMPIObjectPath* {
        report(rc, CMPI_RC_OK);
        return make_path(of(mb), Path{ns ? ns : "", cn, {}}, true);
    };
    broker.eft.newInstance = [](const CMPIBroker* mb, const CMPIObjectPath* op, CMPIStatus* rc) -> CMPIInstance* {
        report(rc, CMPI_RC_OK);
        return make_instance(of(mb), Instance{whole<Path_Object>(op).content, {}}, true);
    };
    broker.eft.newArgs = [](const CMPIBroker* mb, CMPIStatus* rc) -> CMPIArgs* {
        report(rc, CMPI_RC_OK);
        return make<Args_Object>(of(mb), of(mb).args_ft, true);
    };
}

void fill_values(Broker& broker)
{
    broker.string_ft.release = release<String_Object, CMPIString>;
    broker.string_ft.getCharPtr = [](const CMPIString* st, CMPIStatus* rc) -> const char* {
        report(rc, CMPI_RC_OK);
        const Text& text = whole<String_Object>(st).content;
        return text.null ? nullptr : text.text.c_str();
    };
    broker.datetime_ft.release = release<Datetime_Object, CMPIDateTime>;
    broker.datetime_ft.getStringFormat = [](const CMPIDateTime* dt, CMPIStatus* rc) -> CMPIString* {
        Datetime_Object& object = whole<Datetime_Object>(dt);
        report(rc, CMPI_RC_OK);
        return make_string(*object.broker, object.content);
    };
    broker.array_ft.release = release<Array_Object, CMPIArray>;
    broker.array_ft.getSize = [](const CMPIArray* ar, CMPIStatus* rc) {
        report(rc, CMPI_RC_OK);
        return static_cast<CMPICount>(whole<Array_Object>(ar).content.values.size());
    };
    broker.array_ft.getElementAt = [](const CMPIArray* ar, CMPICount index, CMPIStatus* rc) {
        Array_Object& object = whole<Array_Object>(ar);
        report(rc, CMPI_RC_OK);
        return data_of(*object.broker, object.content.values.at(index));
    };
    broker.array_ft.setElementAt = [](CMPIArray* ar, CMPICount index, const CMPIValue* value, CMPIType type) {
        Items& items = whole<Array_Object>(ar).content;
        if (type != items.type) return CMPIStatus{CMPI_RC_ERR_TYPE_MISMATCH, nullptr};
        items.values.at(index) = value_of(value, type);
        return ok;
    };
}

void fill_objects(Broker& broker)
{
    broker.path_ft.release = release<Path_Object, CMPIObjectPath>;
    broker.path_ft.getNameSpace = [](const CMPIObjectPath* op, CMPIStatus* rc) {
        Path_Object& object = whole<Path_Object>(op);
        report(rc, CMPI_RC_OK);
        return make_string(*object.broker, object.content.name_space);
    };
    broker.path_ft.getClassName = [](const CMPIObjectPath* op, CMPIStatus* rc) {
        Path_Object& object = whole<Path_Object>(op);
        report(rc, CMPI_RC_OK);
        return make_string(*object.broker, object.content.class_name);
    };
    broker.path_ft.addKey = [](CMPIObjectPath* op, const char* name, const CMPIValue* value, const CMPIType type) {
        put(whole<Path_Object>(op).content.keys, name, value, type);
        return ok;
    };
    broker.path_ft.getKeyAt = [](const CMPIObjectPath* op, CMPICount index, CMPIString** name, CMPIStatus* rc) {
        Path_Object& object = whole<Path_Object>(op);
        return data_at(*object.broker, object.content.keys, index, name, rc);
    };
    broker.path_ft.getKeyCount = [](const CMPIObjectPath* op, CMPIStatus* rc) {
        report(rc, CMPI_RC_OK);
        return static_cast<CMPICount>(whole<Path_Object>(op).content.keys.size());
    };

    broker.instance_ft.release = release<Instance_Object, CMPIInstance>;
    broker.instance_ft.getObjectPath = [](const CMPIInstance* inst, CMPIStatus* rc) {
        Instance_Object& object = whole<Instance_Object>(inst);
        report(rc, CMPI_RC_OK);
        return make_path(*object.broker, object.content.instance.path);
    };
    broker.instance_ft.setProperty = [](const CMPIInstance* inst, const char* name, const CMPIValue* value,
                                        CMPIType type) {
        put(whole<Instance_Object>(inst).content.instance.properties, name, value, type);
        return ok;
    };
    broker.instance_ft.getPropertyAt = [](const CMPIInstance* inst, CMPICount index, CMPIString** name,
                                          CMPIStatus* rc) {
        Instance_Object& object = whole<Instance_Object>(inst);
        return data_at(*object.broker, object.content.instance.properties, index, name, rc);
    };
    broker.instance_ft.getPropertyCount = [](const CMPIInstance* inst, CMPIStatus* rc) {
        report(rc, CMPI_RC_OK);
        return static_cast<CMPICount>(whole<Instance_Object>(inst).content.instance.properties.size());
    };
    broker.instance_ft.setPropertyFilter = [](CMPIInstance* inst, const char** properties, const char** keys) {
        Instance_Object& object = whole<Instance_Object>(inst);
        object.content.filtered = true;
        object.broker->filter_keys.clear();
        for (; *properties; ++properties)
            object.content.wanted.push_back(*properties);
        for (; keys && *keys; ++keys) {
            object.content.wanted.push_back(*keys);
            object.broker->filter_keys.push_back(*keys);
        }
        return ok;
    };

    broker.args_ft.release = release<Args_Object, CMPIArgs>;
    broker.args_ft.addArg = [](const CMPIArgs* as, const char* name, const CMPIValue* value, const CMPIType type) {
        put(whole<Args_Object>(as).content, name, value, type);
        return ok;
    };
    broker.args_ft.getArgAt = [](const CMPIArgs* as, CMPICount index, CMPIString** name, CMPIStatus* rc) {
        Args_Object& object = whole<Args_Object>(as);
        return data_at(*object.broker, object.content, index, name, rc);
    };
    broker.args_ft.getArgCount = [](const CMPIArgs* as, CMPIStatus* rc) {
        report(rc, CMPI_RC_OK);
        return static_cast<CMPICount>(whole<Args_Object>(as).content.size());
    };

    broker.enumeration_ft.release = release<Enumeration_Object, CMPIEnumeration>;
    broker.enumeration_ft.hasNext = [](const CMPIEnumeration* en, CMPIStatus* rc) -> CMPIBoolean {
        const Walk& walk = whole<Enumeration_Object>(en).content;
        report(rc, CMPI_RC_OK);
        return walk.at < walk.instances.size();
    };
    broker.enumeration_ft.getNext = [](const CMPIEnumeration* en, CMPIStatus* rc) {
        Enumeration_Object& object = whole<Enumeration_Object>(en);
        report(rc, CMPI_RC_OK);
        return data_of(*object.broker, embedded(object.content.instances.at(object.content.at++)));
    };

    broker.context_ft.release = release<Context_Object, CMPIContext>;
    broker.context_ft.getEntry = [](const CMPIContext* ctx, const char* name, CMPIStatus* rc) {
        Context_Object& object = whole<Context_Object>(ctx);
        return data_named(*object.broker, object.content, name, CMPI_RC_ERR_NO_SUCH_PROPERTY, rc);
    };
}

void fill_result(Broker& broker)
{
    broker.result_ft.returnData = [](const CMPIResult* rslt, const CMPIValue* value, const CMPIType type) {
        whole<Result_Object>(rslt).content.values.push_back(value_of(value, type));
        return ok;
    };
    broker.result_ft.returnInstance = [](const CMPIResult* rslt, const CMPIInstance* inst) {
        whole<Result_Object>(rslt).content.instances.push_back(filtered(whole<Instance_Object>(inst).content));
        return ok;
    };
    broker.result_ft.returnObjectPath = [](const CMPIResult* rslt, const CMPIObjectPath* ref) {
        whole<Result_Object>(rslt).content.paths.push_back(whole<Path_Object>(ref).content);
        return ok;
    };
    broker.result_ft.returnDone = [](const CMPIResult* rslt) {
        ++whole<Result_Object>(rslt).content.done;
        return ok;
    };
}

void note(const CMPIBroker* mb, const CMPIContext* ctx, Broker::Up_Call call)
{
    Broker& broker = of(mb);
    if (ctx) whole<Context_Object>(ctx);
    const std::string name = call.name;
    {
        std::lock_guard<std::recursive_mutex> lock(broker.mutex);
        broker.up_calls.push_back(std::move(call));
    }
    if (broker.on_up_call) broker.on_up_call(name); // may come back
}

const Path& path_content(const CMPIObjectPath* op)
{
    return whole<Path_Object>(op).content;
}

void fill_services(Broker& broker)
{
    broker.bft.brokerVersion = 200;
    broker.bft.brokerName = "fake";
    broker.bft.enumerateInstances = [](const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                                       const char**, CMPIStatus* rc) -> CMPIEnumeration* {
        note(mb, ctx, {"enumerateInstances", path_content(op), {}, {}, {}});
        report(rc, of(mb).answer);
        if (of(mb).answer != CMPI_RC_OK) return nullptr;
        auto* object = make<Enumeration_Object>(of(mb), of(mb).enumeration_ft, true);
        object->content.instances = of(mb).found;
        return object;
    };
    broker.bft.getInstance = [](const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op, const char**,
                                CMPIStatus* rc) -> CMPIInstance* {
        const Path asked = path_content(op);
        note(mb, ctx, {"getInstance", asked, {}, {}, {}});
        const auto& gone = of(mb).gone;
        if (!gone.id.empty() && find(asked.keys, "Id").text == gone.id) {
            report(rc, gone.code);
            return nullptr;
        }
        const bool has_one = of(mb).answer == CMPI_RC_OK && !of(mb).found.empty();
        report(rc, has_one ? CMPI_RC_OK : CMPI_RC_ERR_NOT_FOUND);
        return has_one ? make_instance(of(mb), of(mb).found.front(), true) : nullptr;
    };
    broker.bft.createInstance = [](const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                                   const CMPIInstance* inst, CMPIStatus* rc) -> CMPIObjectPath* {
        note(mb, ctx, {"createInstance", path_content(op), whole<Instance_Object>(inst).content.instance, {}, {}});
        report(rc, of(mb).answer);
        return of(mb).answer == CMPI_RC_OK ? make_path(of(mb), path_content(op), true) : nullptr;
    };
    broker.bft.modifyInstance = [](const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                                   const CMPIInstance* inst, const char**) {
        note(mb, ctx, {"modifyInstance", path_content(op), whole<Instance_Object>(inst).content.instance, {}, {}});
        return CMPIStatus{of(mb).answer, nullptr};
    };
    broker.bft.deleteInstance = [](const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op) {
        note(mb, ctx, {"deleteInstance", path_content(op), {}, {}, {}});
        return CMPIStatus{of(mb).answer, nullptr};
    };
    broker.bft.invokeMethod = [](const CMPIBroker* mb, const CMPIContext* ctx, const CMPIObjectPath* op,
                                 const char* method, const CMPIArgs* in, CMPIArgs* out, CMPIStatus* rc) {
        note(mb, ctx, {"invokeMethod", path_content(op), {}, method, whole<Args_Object>(in).content});
        whole<Args_Object>(out).content = of(mb).method_out;
        report(rc, of(mb).answer);
        return data_of(of(mb), of(mb).method_answer);
    };
    broker.bft.deliverIndication = [](const CMPIBroker* mb, const CMPIContext* ctx, const char* ns,
                                      const CMPIInstance* ind) {
        note(mb, ctx, {"deliverIndication", {}, {}, {}, {}});
        std::lock_guard<std::recursive_mutex> lock(of(mb).mutex);
        of(mb).deliveries.emplace_back(ns, whole<Instance_Object>(ind).content.instance);
        return ok;
    };
    broker.bft.prepareAttachThread = [](const CMPIBroker* mb, const CMPIContext* ctx) -> CMPIContext* {
        Broker& broker = of(mb);
        std::lock_guard<std::recursive_mutex> lock(broker.mutex);
        if (broker.refuse_prepare) return nullptr;
        ++broker.prepared;
        auto* object = make<Context_Object>(broker, broker.context_ft, false);
        object->content = whole<Context_Object>(ctx).content;
        return object;
    };
    broker.bft.attachThread = [](const CMPIBroker* mb, const CMPIContext* ctx) {
        whole<Context_Object>(ctx);
        std::lock_guard<std::recursive_mutex> lock(of(mb).mutex);
        if (of(mb).refuse_attach) return CMPIStatus{CMPI_RC_ERR_FAILED, nullptr};
        ++of(mb).attached;
        return ok;
    };
    broker.bft.detachThread = [](const CMPIBroker* mb, const CMPIContext* ctx) {
        std::lock_guard<std::recursive_mutex> lock(of(mb).mutex);
        whole<Context_Object>(ctx).released = true; // the server frees it now
        ++of(mb).detached;
        return ok;
    };
}

} // namespace

// --- Values
// ------------------------------------------------------------------------------------------------------------

Value null_value(CMPIType type)
{
    Value value;
    value.type = type;
    return value;
}

Value boolean(bool value)
{
    CMPIValue number{};
    number.boolean = value;
    return simple(CMPI_boolean, number);
}

Value uint8(unsigned value)
{
    CMPIValue number{};
    number.uint8 = static_cast<CMPIUint8>(value);
    return simple(CMPI_uint8, number);
}

Value uint16(unsigned value)
{
    CMPIValue number{};
    number.uint16 = static_cast<CMPIUint16>(value);
    return simple(CMPI_uint16, number);
}

Value uint32(unsigned value)
{
    CMPIValue number{};
    number.uint32 = value;
    return simple(CMPI_uint32, number);
}

Value uint64(unsigned long long value)
{
    CMPIValue number{};
    number.uint64 = value;
    return simple(CMPI_uint64, number);
}

Value sint32(int value)
{
    CMPIValue number{};
    number.sint32 = value;
    return simple(CMPI_sint32, number);
}

Value sint64(long long value)
{
    CMPIValue number{};
    number.sint64 = value;
    return simple(CMPI_sint64, number);
}

Value string(const std::string& text)
{
    return with_text(CMPI_string, text);
}

Value string_without_chars()
{
    Value value = with_text(CMPI_string, "");
    value.null_text = true;
    return value;
}

Value datetime(const std::string& text)
{
    return with_text(CMPI_dateTime, text);
}

Value reference(const Path& path)
{
    Value value = with_text(CMPI_ref, "");
    value.path = std::make_shared<Path>(path);
    return value;
}

Value embedded(const Instance& instance)
{
    Value value = with_text(CMPI_instance, "");
    value.instance = std::make_shared<Instance>(instance);
    return value;
}

Value array(CMPIType element, std::vector<Value> elements)
{
    Value value = with_text(static_cast<CMPIType>(element | CMPI_ARRAY), "");
    value.elements = std::move(elements);
    return value;
}

const std::string& text_of(const CMPIString* string)
{
    return whole<String_Object>(string).content.text;
}

Value find(const Values& values, const std::string& name)
{
    for (const auto& entry : values)
        if (strcasecmp(entry.first.c_str(), name.c_str()) == 0) return entry.second;
    return {};
}

// --- Broker
// ------------------------------------------------------------------------------------------------------------

Broker::Broker()
{
    cmpi.hdl = this;
    cmpi.bft = &bft;
    cmpi.eft = &eft;
    fill_encapsulation(*this);
    fill_values(*this);
    fill_objects(*this);
    fill_result(*this);
    fill_services(*this);
}

Broker::~Broker() = default;

template <class Object>
Object* Broker::keep(Object* object)
{
    std::lock_guard<std::recursive_mutex> lock(mutex);
    objects.emplace_back(object);
    return object;
}

void Broker::fault(const std::string& text)
{
    std::lock_guard<std::recursive_mutex> lock(mutex);
    faults.push_back(text);
}

CMPIObjectPath* Broker::path(const Path& content)
{
    return make_path(*this, content);
}

CMPIInstance* Broker::instance(const Instance& content)
{
    return make_instance(*this, content);
}

CMPIArgs* Broker::args(const Values& content)
{
    auto* object = make<Args_Object>(*this, args_ft, false);
    object->content = content;
    return object;
}

CMPIContext* Broker::context(const Values& entries)
{
    auto* object = make<Context_Object>(*this, context_ft, false);
    object->content = entries;
    return object;
}

CMPIResult* Broker::result()
{
    return make<Result_Object>(*this, result_ft, false);
}

Broker::Returned& Broker::returned(const CMPIResult* result)
{
    return whole<Result_Object>(result).content;
}

const Values& Broker::content(const CMPIArgs* args)
{
    return whole<Args_Object>(args).content;
}

int Broker::alive(Kind kind)
{
    std::lock_guard<std::recursive_mutex> lock(mutex);
    int count = 0;
    for (const auto& object : objects)
        count += object->kind == kind && object->made && !object->released;
    return count;
}

int Broker::alive()
{
    int count = 0;
    for (int kind = 0; kind < kinds; ++kind)
        count += alive(static_cast<Kind>(kind));
    return count;
}

} // namespace fake
