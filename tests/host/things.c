/* A provider module in plain C that does what a test tells it, also wrongly.
 * The test program may define test_event and test_setting; without them nothing is told and every setting is 0, or
 * what the environment variable TEST_<name> says. */
#include <cmpift.h>
#include <cmpimacs.h>

#include <pthread.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <unistd.h>

__attribute__((weak)) void test_event(const char* text);
__attribute__((weak)) long test_setting(const char* name);
__attribute__((weak)) void test_throw(void);

/* Each factory writes it, while other providers of the module may be running. */
static const CMPIBroker* _Atomic broker;

static void event(const char* format, const char* a, const char* b, long n)
{
    char text[256];
    if (!test_event) return;
    snprintf(text, sizeof text, format, a, b, n);
    test_event(text);
}

static long setting(const char* name)
{
    char variable[64];
    const char* value;
    if (test_setting) return test_setting(name);
    snprintf(variable, sizeof variable, "TEST_%s", name);
    value = getenv(variable);
    return value ? atol(value) : 0;
}

static CMPIStatus answer(int code)
{
    CMPIStatus status = {(CMPIrc)code, NULL};
    return status;
}

static CMPIStatus answer_text(int code, const char* text)
{
    CMPIStatus status = {(CMPIrc)code, broker->eft->newString(broker, text, NULL)};
    return status;
}

/* One record for each provider: its name and the class it serves. */
typedef struct Provider {
    const char* name;
    const char* class_name;
} Provider;

static const char* class_of(const void* hdl)
{
    return ((const Provider*)hdl)->class_name;
}

static CMPIStatus cleanup(const void* hdl, const char* kind, CMPIBoolean terminating)
{
    char what[64];
    snprintf(what, sizeof what, "%s cleanup", kind);
    event("%s %s %ld", class_of(hdl), what, terminating);
    if (!terminating && setting("refuse_unload")) return answer(CMPI_RC_DO_NOT_UNLOAD);
    return answer(CMPI_RC_OK);
}

static const char* name_space_of(const CMPIObjectPath* op)
{
    CMPIString* text = op->ft->getNameSpace(op, NULL);
    return text && text->ft->getCharPtr(text, NULL) ? text->ft->getCharPtr(text, NULL) : "";
}

static CMPIObjectPath* make_path(const char* ns, const char* class_name, CMPIUint32 id)
{
    CMPIValue value;
    CMPIObjectPath* path = broker->eft->newObjectPath(broker, ns, class_name, NULL);
    value.uint32 = id;
    if (setting("no_keys")) return path;
    path->ft->addKey(path, "Id", &value, CMPI_uint32);
    path->ft->addKey(path, "Realm", (const CMPIValue*)"test \"realm\"", CMPI_chars);
    return path;
}

static CMPIObjectPath* make_link_path(const char* ns, CMPIUint32 id)
{
    CMPIValue value;
    CMPIObjectPath* path = broker->eft->newObjectPath(broker, ns, "TEST_Link", NULL);
    CMPIObjectPath* end = make_path(ns, "TEST_Thing", id);
    value.ref = end;
    path->ft->addKey(path, "First", &value, CMPI_ref);
    end->ft->release(end);
    end = make_path(ns, "TEST_Other", id);
    value.ref = end;
    path->ft->addKey(path, "Second", &value, CMPI_ref);
    end->ft->release(end);
    return path;
}

static void set(CMPIInstance* instance, const char* name, CMPIValue value, CMPIType type)
{
    instance->ft->setProperty(instance, name, &value, type);
}

static void set_text(CMPIInstance* instance, const char* name, const char* text)
{
    CMPIValue value;
    value.string = broker->eft->newString(broker, text, NULL);
    instance->ft->setProperty(instance, name, &value, CMPI_string);
    value.string->ft->release(value.string);
}

static CMPIArray* make_texts(const char* first, const char* second)
{
    CMPIValue value;
    CMPIArray* array = broker->eft->newArray(broker, 2, CMPI_string, NULL);
    value.string = broker->eft->newString(broker, first, NULL);
    array->ft->setElementAt(array, 0, &value, CMPI_string);
    value.string->ft->release(value.string);
    value.string = broker->eft->newString(broker, second, NULL);
    array->ft->setElementAt(array, 1, &value, CMPI_string);
    value.string->ft->release(value.string);
    return array;
}

static void fill_thing(CMPIInstance* instance, const char* ns, CMPIUint32 id)
{
    CMPIValue value;
    CMPIUint32 i;
    CMPIArray* array;
    CMPIObjectPath* other;
    memset(&value, 0, sizeof value);
    value.boolean = 1;
    set(instance, "Flag", value, CMPI_boolean);
    value.uint8 = 200;
    set(instance, "U8", value, CMPI_uint8);
    value.sint8 = -100;
    set(instance, "S8", value, CMPI_sint8);
    value.uint16 = 60000;
    set(instance, "U16", value, CMPI_uint16);
    value.sint16 = -30000;
    set(instance, "S16", value, CMPI_sint16);
    value.uint32 = 4000000000u;
    set(instance, "U32", value, CMPI_uint32);
    value.sint32 = -2000000000;
    set(instance, "S32", value, CMPI_sint32);
    value.uint64 = 18000000000000000000ull;
    set(instance, "U64", value, CMPI_uint64);
    value.sint64 = -9000000000000000000ll;
    set(instance, "S64", value, CMPI_sint64);
    value.real32 = 1.5f;
    set(instance, "R32", value, CMPI_real32);
    value.real64 = -2.25;
    set(instance, "R64", value, CMPI_real64);
    value.char16 = 65;
    set(instance, "C16", value, CMPI_char16);
    set_text(instance, "Text", "some text");
    value.dateTime = broker->eft->newDateTimeFromChars(broker, "20240229120000.000000+060", NULL);
    set(instance, "When", value, CMPI_dateTime);
    value.dateTime->ft->release(value.dateTime);
    array = broker->eft->newArray(broker, 3, CMPI_uint32, NULL);
    for (i = 0; i < 3; ++i) {
        value.uint32 = i + id;
        array->ft->setElementAt(array, i, &value, CMPI_uint32);
    }
    value.array = array;
    set(instance, "Numbers", value, CMPI_uint32A);
    array->ft->release(array);
    array = make_texts("one", "two");
    value.array = array;
    set(instance, "Texts", value, CMPI_stringA);
    array->ft->release(array);
    other = make_path(ns, "TEST_Other", id);
    value.ref = other;
    set(instance, "Friend", value, CMPI_ref);
    value.inst = broker->eft->newInstance(broker, other, NULL);
    set_text(value.inst, "Name", "inner");
    set(instance, "Inner", value, CMPI_instance);
    value.inst->ft->release(value.inst);
    other->ft->release(other);
    value.uint16 = (CMPIUint16)(id % 12);
    set(instance, "State", value, CMPI_uint16);
}

static CMPIInstance* make_instance(const char* ns, const char* class_name, CMPIUint32 id, const char** properties)
{
    const char* keys[] = {"Id", "Realm", NULL};
    CMPIValue value;
    CMPIObjectPath* path =
        strcmp(class_name, "TEST_Link") == 0 ? make_link_path(ns, id) : make_path(ns, class_name, id);
    CMPIInstance* instance = broker->eft->newInstance(broker, path, NULL);
    if (strcmp(class_name, "TEST_Link") == 0) {
        path->ft->release(path);
        return instance;
    }
    if (properties) instance->ft->setPropertyFilter(instance, properties, keys);
    value.uint32 = id;
    set(instance, "Id", value, CMPI_uint32);
    set_text(instance, "Realm", "test \"realm\"");
    if (strcmp(class_name, "TEST_Thing") == 0) fill_thing(instance, ns, id);
    if (strcmp(class_name, "TEST_Other") == 0) set_text(instance, "Name", "other");
    if (setting("unknown_property")) set_text(instance, "Nonsense", "x");
    path->ft->release(path);
    return instance;
}

/* ---- instance providers ---- */

static CMPIStatus instance_cleanup(CMPIInstanceMI* mi, const CMPIContext* ctx, CMPIBoolean terminating)
{
    (void)ctx;
    return cleanup(mi->hdl, "Instance", terminating);
}

static CMPIStatus enumerate_names(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                                  const CMPIObjectPath* op)
{
    long i, count = setting("count");
    (void)ctx;
    for (i = 1; i <= count; ++i) {
        const char* class_name = class_of(mi->hdl);
        CMPIObjectPath* path = strcmp(class_name, "TEST_Link") == 0
                                   ? make_link_path(name_space_of(op), (CMPIUint32)i)
                                   : make_path(name_space_of(op), class_name, (CMPIUint32)i);
        rslt->ft->returnObjectPath(rslt, path);
        path->ft->release(path);
    }
    rslt->ft->returnDone(rslt);
    return answer(CMPI_RC_OK);
}

static CMPIStatus enumerate(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                            const CMPIObjectPath* op, const char** properties)
{
    long i, count = setting("count"), early = setting("stop_after");
    (void)ctx;
    event("%s %s %ld", class_of(mi->hdl), "enumerate on another thread", 0);
    if (setting("sleep_ms")) usleep((useconds_t)setting("sleep_ms") * 1000);
    if (setting("throw") && test_throw) test_throw();
    if (setting("return_wrong_kind")) {
        CMPIObjectPath* path = make_path(name_space_of(op), class_of(mi->hdl), 1);
        rslt->ft->returnObjectPath(rslt, path);
        path->ft->release(path);
    }
    if (setting("return_null")) rslt->ft->returnInstance(rslt, NULL);
    for (i = 1; i <= count; ++i) {
        CMPIInstance* instance;
        if (early && i > early) return answer_text(CMPI_RC_ERR_FAILED, "stopped early");
        instance = make_instance(name_space_of(op), class_of(mi->hdl), (CMPIUint32)i, properties);
        rslt->ft->returnInstance(rslt, instance);
        if (!setting("keep_instances")) instance->ft->release(instance);
        if (setting("release_twice")) instance->ft->release(instance);
    }
    if (setting("release_lent")) {
        CMPIObjectPath* lent = (CMPIObjectPath*)op;
        lent->ft->release(lent);
    }
    if (setting("clone_forever")) op->ft->clone(op, NULL);
    if (setting("no_done")) return answer(CMPI_RC_OK);
    rslt->ft->returnDone(rslt);
    if (setting("done_twice")) rslt->ft->returnDone(rslt);
    return answer((int)setting("status"));
}

static CMPIStatus get(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                      const char** properties)
{
    CMPIStatus status = {CMPI_RC_OK, NULL};
    CMPIData key = op->ft->getKey(op, "Id", &status);
    CMPIUint64 id = key.type == CMPI_uint64 || key.type == CMPI_sint64 ? key.value.uint64 : key.value.uint32;
    CMPIInstance* instance;
    (void)ctx;
    if (status.rc != CMPI_RC_OK || id == 0 || id > (CMPIUint64)setting("count"))
        return answer_text(CMPI_RC_ERR_NOT_FOUND, "no such thing");
    if (setting("ok_without_instance")) return answer(CMPI_RC_OK);
    instance = make_instance(name_space_of(op), class_of(mi->hdl), (CMPIUint32)id, properties);
    rslt->ft->returnInstance(rslt, instance);
    instance->ft->release(instance);
    rslt->ft->returnDone(rslt);
    return answer(CMPI_RC_OK);
}

static CMPIStatus create(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                         const CMPIInstance* inst)
{
    CMPIData id = inst->ft->getProperty(inst, "Id", NULL);
    CMPIObjectPath* path = make_path(name_space_of(op), class_of(mi->hdl), id.value.uint32);
    (void)ctx;
    event("%s %s %ld", class_of(mi->hdl), "create", id.value.uint32);
    rslt->ft->returnObjectPath(rslt, path);
    path->ft->release(path);
    rslt->ft->returnDone(rslt);
    return answer(CMPI_RC_OK);
}

static CMPIStatus modify(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                         const CMPIInstance* inst, const char** properties)
{
    CMPIData state = inst->ft->getProperty(inst, "State", NULL);
    (void)ctx;
    (void)rslt;
    (void)op;
    event("%s modify %s", class_of(mi->hdl), properties && properties[0] ? properties[0] : "everything", 0);
    if (state.type != CMPI_uint16 || (state.state & CMPI_nullValue)) return answer(CMPI_RC_ERR_INVALID_PARAMETER);
    if (state.value.uint16 > 12) return answer_text(CMPI_RC_ERR_INVALID_PARAMETER, "a state is 0 to 12");
    return answer(CMPI_RC_OK);
}

static CMPIStatus delete_instance(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                                  const CMPIObjectPath* op)
{
    (void)mi;
    (void)ctx;
    (void)rslt;
    (void)op;
    return answer(CMPI_RC_ERR_ACCESS_DENIED);
}

/* execQuery is left null: a table may end early. */
static CMPIInstanceMIFT instance_table = {
    200, 200, "test", instance_cleanup, enumerate_names, enumerate, get, create, modify, delete_instance, NULL};

/* ---- methods ---- */

static CMPIStatus method_cleanup(CMPIMethodMI* mi, const CMPIContext* ctx, CMPIBoolean terminating)
{
    (void)ctx;
    return cleanup(mi->hdl, "Method", terminating);
}

/* Up-calls of every kind, told as events. */
static void up_calls(const CMPIContext* ctx, const CMPIObjectPath* op)
{
    CMPIStatus status = {CMPI_RC_OK, NULL};
    CMPIObjectPath* path = broker->eft->newObjectPath(broker, name_space_of(op), "TEST_Base", NULL);
    CMPIEnumeration* all = broker->bft->enumerateInstances(broker, ctx, path, NULL, &status);
    long count = 0;
    event("%s%senumerate %ld", "", "", status.rc);
    while (all && all->ft->hasNext(all, NULL)) {
        CMPIData data = all->ft->getNext(all, NULL);
        if (data.type == CMPI_instance) ++count;
    }
    event("%s%sinstances %ld", "", "", count);
    if (all && !setting("keep_enumeration")) all->ft->release(all);
    path->ft->release(path);
    path = make_path(name_space_of(op), "TEST_Other", 1);
    {
        CMPIInstance* other = broker->bft->getInstance(broker, ctx, path, NULL, &status);
        event("%s%sget %ld", "", "", status.rc);
        if (other) other->ft->release(other);
    }
    path->ft->release(path);
}

typedef struct Attached {
    CMPIContext* context;
    CMPIObjectPath* path;
} Attached;

static void* attached_thread(void* argument)
{
    Attached* attached = argument;
    broker->bft->attachThread(broker, attached->context);
    up_calls(attached->context, attached->path);
    attached->path->ft->release(attached->path);
    if (!setting("never_detach")) broker->bft->detachThread(broker, attached->context);
    return NULL;
}

static void* stray_thread(void* argument)
{
    CMPIString* text = broker->eft->newString(broker, "stray", NULL);
    (void)argument;
    text->ft->release(text);
    return NULL;
}

static void run_thread(const CMPIContext* ctx, const CMPIObjectPath* op)
{
    pthread_t thread;
    Attached attached;
    attached.context = broker->bft->prepareAttachThread(broker, ctx);
    attached.path = op->ft->clone(op, NULL);
    pthread_create(&thread, NULL, attached_thread, &attached);
    pthread_join(thread, NULL);
}

static CMPIStatus invoke(CMPIMethodMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                         const char* method, const CMPIArgs* in, CMPIArgs* out)
{
    CMPIValue value;
    CMPIStatus status = {CMPI_RC_OK, NULL};
    (void)mi;
    if (strcasecmp(method, "Double") == 0) {
        CMPIData number = in->ft->getArg(in, "Number", &status);
        CMPIArray* texts = make_texts("b", "a");
        if (status.rc != CMPI_RC_OK || number.type != CMPI_uint32)
            return answer_text(CMPI_RC_ERR_INVALID_PARAMETER, "a number is wanted");
        value.uint32 = number.value.uint32 * 2;
        out->ft->addArg(out, "Result", &value, CMPI_uint32);
        value.array = texts;
        out->ft->addArg(out, "Back", &value, CMPI_stringA);
        texts->ft->release(texts);
        value.uint32 = number.value.uint32 == 13 ? 1 : 0;
        rslt->ft->returnData(rslt, &value, CMPI_uint32);
    } else if (strcasecmp(method, "Hello") == 0) {
        if (setting("up_calls")) up_calls(ctx, op);
        if (setting("thread")) run_thread(ctx, op);
        if (setting("stray_thread")) {
            pthread_t thread;
            pthread_create(&thread, NULL, stray_thread, NULL);
            pthread_join(thread, NULL);
        }
        rslt->ft->returnData(rslt, (const CMPIValue*)"hello", CMPI_chars);
    } else {
        return answer(CMPI_RC_ERR_METHOD_NOT_FOUND);
    }
    rslt->ft->returnDone(rslt);
    return answer(CMPI_RC_OK);
}

static CMPIMethodMIFT method_table = {100, 100, "test", method_cleanup, invoke};

/* ---- associations ---- */

static CMPIStatus association_cleanup(CMPIAssociationMI* mi, const CMPIContext* ctx, CMPIBoolean terminating)
{
    (void)ctx;
    return cleanup(mi->hdl, "Association", terminating);
}

static CMPIStatus associators(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                              const CMPIObjectPath* op, const char* association_class, const char* result_class,
                              const char* role, const char* result_role, const char** properties)
{
    CMPIInstance* instance = make_instance(name_space_of(op), "TEST_Other", 1, properties);
    (void)mi;
    (void)ctx;
    (void)result_class;
    (void)result_role;
    event("associators %s %s", association_class ? association_class : "null", role ? role : "null", 0);
    rslt->ft->returnInstance(rslt, instance);
    instance->ft->release(instance);
    return answer(CMPI_RC_OK);
}

static CMPIStatus associator_names(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                                   const CMPIObjectPath* op, const char* association_class, const char* result_class,
                                   const char* role, const char* result_role)
{
    CMPIObjectPath* path = make_path(name_space_of(op), "TEST_Other", 1);
    (void)mi;
    (void)ctx;
    (void)association_class;
    (void)result_class;
    (void)role;
    (void)result_role;
    rslt->ft->returnObjectPath(rslt, path);
    path->ft->release(path);
    return answer(CMPI_RC_OK);
}

static CMPIStatus references(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                             const CMPIObjectPath* op, const char* result_class, const char* role,
                             const char** properties)
{
    CMPIInstance* instance = make_instance(name_space_of(op), "TEST_Link", 1, properties);
    (void)mi;
    (void)ctx;
    event("references %s %s", result_class ? result_class : "null", role ? role : "null", 0);
    rslt->ft->returnInstance(rslt, instance);
    instance->ft->release(instance);
    return answer(CMPI_RC_OK);
}

static CMPIStatus reference_names(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                                  const CMPIObjectPath* op, const char* result_class, const char* role)
{
    CMPIObjectPath* path = make_link_path(name_space_of(op), 1);
    (void)mi;
    (void)ctx;
    (void)result_class;
    (void)role;
    rslt->ft->returnObjectPath(rslt, path);
    path->ft->release(path);
    return answer(CMPI_RC_OK);
}

static CMPIAssociationMIFT association_table = {
    100, 100, "test", association_cleanup, associators, associator_names, references, reference_names};

/* ---- properties ---- */

static CMPIStatus property_cleanup(CMPIPropertyMI* mi, const CMPIContext* ctx, CMPIBoolean terminating)
{
    (void)ctx;
    return cleanup(mi->hdl, "Property", terminating);
}

static CMPIStatus set_property(CMPIPropertyMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                               const CMPIObjectPath* op, const char* name, const CMPIData data)
{
    (void)mi;
    (void)ctx;
    (void)rslt;
    (void)op;
    event("set property %s%s %ld", name, "", data.value.uint16);
    return answer(CMPI_RC_OK);
}

static CMPIStatus get_property(CMPIPropertyMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                               const CMPIObjectPath* op, const char* name)
{
    CMPIValue value;
    (void)mi;
    (void)ctx;
    (void)op;
    value.uint16 = strcmp(name, "State") == 0 ? 7 : 0;
    rslt->ft->returnData(rslt, &value, CMPI_uint16);
    rslt->ft->returnDone(rslt);
    return answer(CMPI_RC_OK);
}

static CMPIPropertyMIFT property_table = {100, 100, "test", property_cleanup, set_property, get_property, NULL};

/* ---- indications ---- */

static CMPIContext* delivery_context;
static char delivery_name_space[64];

static CMPIStatus indication_cleanup(CMPIIndicationMI* mi, const CMPIContext* ctx, CMPIBoolean terminating)
{
    (void)ctx;
    return cleanup(mi->hdl, "Indication", terminating);
}

static CMPIStatus authorize(CMPIIndicationMI* mi, const CMPIContext* ctx, const CMPISelectExp* filter,
                            const char* class_name, const CMPIObjectPath* op, const char* owner)
{
    CMPIString* query = filter->ft->getString(filter, NULL);
    (void)mi;
    (void)ctx;
    (void)op;
    (void)owner;
    event("authorize %s: %s", class_name, query->ft->getCharPtr(query, NULL), 0);
    return answer((int)setting("authorize_status"));
}

static CMPIStatus must_poll(CMPIIndicationMI* mi, const CMPIContext* ctx, const CMPISelectExp* filter,
                            const char* class_name, const CMPIObjectPath* op)
{
    (void)mi;
    (void)ctx;
    (void)filter;
    (void)op;
    event("mustPoll %s%s", class_name, "", 0);
    return answer(CMPI_RC_ERR_FAILED);
}

static CMPIStatus activate(CMPIIndicationMI* mi, const CMPIContext* ctx, const CMPISelectExp* filter,
                           const char* class_name, const CMPIObjectPath* op, CMPIBoolean first)
{
    (void)mi;
    (void)ctx;
    (void)filter;
    snprintf(delivery_name_space, sizeof delivery_name_space, "%s", name_space_of(op));
    event("activate %s in %s %ld", class_name, delivery_name_space, first);
    return answer(CMPI_RC_OK);
}

static CMPIStatus deactivate(CMPIIndicationMI* mi, const CMPIContext* ctx, const CMPISelectExp* filter,
                             const char* class_name, const CMPIObjectPath* op, CMPIBoolean last)
{
    (void)mi;
    (void)ctx;
    (void)filter;
    event("deactivate '%s' in %s %ld", class_name, name_space_of(op), last);
    return answer(CMPI_RC_OK);
}

static void* alert_thread(void* argument)
{
    CMPIStatus status;
    CMPIValue value;
    CMPIObjectPath* path;
    CMPIInstance* alert;
    (void)argument;
    broker->bft->attachThread(broker, delivery_context);
    path = broker->eft->newObjectPath(broker, delivery_name_space, "TEST_Alert", NULL);
    alert = broker->eft->newInstance(broker, path, NULL);
    value.uint32 = 42;
    set(alert, "Number", value, CMPI_uint32);
    status = broker->bft->deliverIndication(broker, delivery_context, delivery_name_space, alert);
    event("%s%sdelivered %ld", "", "", status.rc);
    status = broker->bft->deliverIndication(broker, delivery_context, "root/nobody", alert);
    event("%s%sto nobody %ld", "", "", status.rc);
    alert->ft->release(alert);
    path->ft->release(path);
    broker->bft->detachThread(broker, delivery_context);
    return NULL;
}

static CMPIStatus enable(CMPIIndicationMI* mi, const CMPIContext* ctx)
{
    pthread_t thread;
    (void)mi;
    event("%s%s", "enable", "", 0);
    if (!setting("alert")) return answer((CMPIrc)setting("enable_status"));
    delivery_context = broker->bft->prepareAttachThread(broker, ctx);
    pthread_create(&thread, NULL, alert_thread, NULL);
    pthread_join(thread, NULL);
    return answer(CMPI_RC_OK);
}

static CMPIStatus disable(CMPIIndicationMI* mi, const CMPIContext* ctx)
{
    (void)mi;
    (void)ctx;
    event("%s%s", "disable", "", 0);
    return answer(CMPI_RC_OK);
}

static CMPIIndicationMIFT indication_table = {
    100, 100, "test", indication_cleanup, authorize, must_poll, activate, deactivate, enable, disable};

/* ---- factories ---- */

static int factory(const CMPIBroker* mb, const CMPIContext* ctx, CMPIStatus* status, const char* class_name,
                   const char* kind)
{
    CMPIStatus own = {CMPI_RC_OK, NULL};
    CMPIData principal = ctx->ft->getEntry(ctx, CMPIPrincipal, &own);
    const char* text =
        own.rc == CMPI_RC_OK ? principal.value.string->ft->getCharPtr(principal.value.string, NULL) : "none";
    char what[64];
    broker = mb;
    snprintf(what, sizeof what, "%s factory, principal", kind);
    event("%s %s", class_name, what, 0);
    event("principal %s%s", text ? text : "null", "", 0);
    if (setting("factory_null")) return 0;
    if (setting("factory_status")) {
        status->rc = (CMPIrc)setting("factory_status");
        status->msg = mb->eft->newString(mb, "not today", NULL);
    }
    return 1;
}

#define FACTORY(CLASS, KIND, TABLE)                                                                                    \
    CMPI_EXPORT CMPI##KIND##MI* CLASS##_Provider_Create_##KIND##MI(const CMPIBroker* mb, const CMPIContext* ctx,       \
                                                                   CMPIStatus* status);                                \
    CMPI_EXPORT CMPI##KIND##MI* CLASS##_Provider_Create_##KIND##MI(const CMPIBroker* mb, const CMPIContext* ctx,       \
                                                                   CMPIStatus* status)                                 \
    {                                                                                                                  \
        static Provider provider = {#CLASS "_Provider", #CLASS};                                                       \
        static CMPI##KIND##MI mi = {&provider, &TABLE};                                                                \
        return factory(mb, ctx, status, #CLASS, #KIND) ? &mi : NULL;                                                   \
    }

FACTORY(TEST_Thing, Instance, instance_table)
FACTORY(TEST_Thing, Method, method_table)
FACTORY(TEST_Other, Instance, instance_table)
FACTORY(TEST_Link, Instance, instance_table)
FACTORY(TEST_Link, Method, method_table)
FACTORY(TEST_Link, Association, association_table)
FACTORY(TEST_Alert, Method, method_table)
FACTORY(TEST_Alert, Indication, indication_table)
/* Registered by hand only: no class of that name. */
FACTORY(TEST_State, Property, property_table)
FACTORY(TEST_State, Instance, instance_table)
