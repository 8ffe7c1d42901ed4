#include "cmpi/Converter.h"
#include "cmpi/cmpi_data.h"
#include "cmpi/operation.h"
#include "cmpi/operations.h"
#include "runtime/Selection.h"

namespace cimple {

namespace {

const Meta_Class* class_of(const CMPI_Adapter& adapter, const CMPIObjectPath* op)
{
    CMPIStatus status;
    const char* name = chars_of(ask(status, op, &CMPIObjectPathFT::getClassName));
    return adapter.find_class(name ? name : "");
}

// What an enumeration hands from instance to instance.
struct Delivery {
    const CMPIBroker* broker;
    const CMPIResult* result;
    const char* name_space;
    const char** properties;
    int error = 0; // once set, nothing more is delivered
    Answer_Features features = {};
};

bool deliver_name(Instance* instance, int, void* data)
{
    Ref<Instance> owned(instance);
    auto& delivery = *static_cast<Delivery*>(data);
    if (!instance || delivery.error) return true;
    Made<CMPIObjectPath> path;
    delivery.error = make_cmpi_object_path(delivery.broker, instance, delivery.name_space, path, &delivery.features);
    if (!delivery.error) tell(delivery.result, &CMPIResultFT::returnObjectPath, path.get());
    return true;
}

bool deliver_instance(Instance* instance, int, void* data)
{
    Ref<Instance> owned(instance);
    auto& delivery = *static_cast<Delivery*>(data);
    if (!instance || delivery.error) return true;
    Made<CMPIObjectPath> path;
    Made<CMPIInstance> made;
    delivery.error = make_cmpi_object_path(delivery.broker, instance, delivery.name_space, path, &delivery.features);
    if (!delivery.error)
        delivery.error = make_CMPI_instance(delivery.broker, instance, delivery.name_space, path.get(),
                                            delivery.properties, made, &delivery.features);
    if (!delivery.error) tell(delivery.result, &CMPIResultFT::returnInstance, made.get());
    return true;
}

// Keeps the first instance with the keys of a model.
struct Search : Selection {
    explicit Search(const Instance* model) : Selection(this, Values::keys_of_ends, Handler::only_reads), model(model) {}
    const Instance* key() const override { return model; }

    const Instance* model;
    Ref<Instance> found;
};

bool keep_match(Instance* instance, int, void* data)
{
    Ref<Instance> owned(instance);
    auto& search = *static_cast<Search*>(data);
    if (instance && !search.found && key_eq(search.model, instance)) search.found = std::move(owned);
    return true;
}

// For providers that can only enumerate.
int get_by_enumeration(const CMPI_Adapter& adapter, const Instance* model, Ref<Instance>& found)
{
    Search search(model);
    int status = adapter.call(OP_ENUM_INSTANCES, adapter.provider, model, &keep_match, &search);
    if (status != ENUM_INSTANCES_OK || !search.found) return GET_INSTANCE_NOT_FOUND;
    found = std::move(search.found);
    return GET_INSTANCE_OK;
}

CMPIrc return_done(const CMPIResult* result)
{
    tell(result, &CMPIResultFT::returnDone);
    return CMPI_RC_OK;
}

// A client may name the keys in the path alone.
int fill_keys_from_path(const CMPIBroker* broker, const CMPIObjectPath* op, Instance* instance)
{
    if (keys_non_null(instance)) return 0;
    Instance* read = nullptr;
    if (int error = make_cimple_reference(broker, instance->meta_class, op, read)) return error;
    Ref<Instance> reference(read);
    const Meta_Record* record = record_of(instance);
    for (std::size_t i = 0; i < record->num_meta_features; ++i) {
        const Meta_Feature* feature = record->meta_features[i];
        Value own, given;
        if (!is_key(feature) || own.view(instance, feature) != 0 || !own.null()) continue;
        if (given.view(reference.get(), feature) == 0) given.set(instance, feature);
    }
    return 0;
}

} // namespace

CMPIStatus enumerateInstanceNames(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                                  const CMPIObjectPath* op)
{
    return operate(mi, ctx, "enumInstanceNames", [&](CMPI_Adapter& adapter) -> Outcome {
        const Meta_Class* meta_class = class_of(adapter, op);
        if (!meta_class) return CMPI_RC_ERR_FAILED;
        Instance* read = nullptr;
        if (int error = make_cimple_reference(adapter.broker, meta_class, op, read)) return CMPIrc(error);
        Ref<Instance> model(read);
        nullify_properties(read, false, true, 1);

        Delivery delivery{adapter.broker, rslt, name_space_of(op), nullptr};
        const Selection names(&delivery, Selection::Values::keys, Selection::Handler::only_reads);
        int status = adapter.call(OP_ENUM_INSTANCES, adapter.provider, read, &deliver_name, &delivery);
        if (status == ENUM_INSTANCES_OK) return return_done(rslt);
        return enum_instances_codes.code(status);
    });
}

CMPIStatus enumerateInstances(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                              const CMPIObjectPath* op, const char** properties)
{
    return operate(mi, ctx, "enumInstances", [&](CMPI_Adapter& adapter) -> Outcome {
        const Meta_Class* meta_class = class_of(adapter, op);
        if (!meta_class) return CMPI_RC_ERR_FAILED;
        Instance* read = nullptr;
        if (int error = make_cimple_reference(adapter.broker, meta_class, op, read)) return CMPIrc(error);
        Ref<Instance> model(read);
        filter_properties(read, properties, true);

        Delivery delivery{adapter.broker, rslt, name_space_of(op), properties};
        const Selection instances(&delivery, Selection::Values::keys_of_ends, // references become paths
                                  Selection::Handler::only_reads);
        int status = adapter.call(OP_ENUM_INSTANCES, adapter.provider, read, &deliver_instance, &delivery);
        if (const Status_Row* failure = enum_instances_codes.find(status)) return failure->code;
        return return_done(rslt);
    });
}

CMPIStatus getInstance(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                       const char** properties)
{
    return operate(mi, ctx, "getInstance", [&](CMPI_Adapter& adapter) -> Outcome {
        const Meta_Class* meta_class = class_of(adapter, op);
        if (!meta_class) return CMPI_RC_ERR_FAILED;
        Instance* read = nullptr;
        if (int error = make_cimple_reference(adapter.broker, meta_class, op, read)) return CMPIrc(error);
        Ref<Instance> model(read);
        nullify_properties(read, true, true, 0);
        filter_properties(read, properties, true);

        Instance* got = nullptr;
        int status = adapter.call(OP_GET_INSTANCE, adapter.provider, read, &got);
        Ref<Instance> instance(got);
        if (status == GET_INSTANCE_UNSUPPORTED) status = get_by_enumeration(adapter, read, instance);
        if (const Status_Row* failure = get_instance_codes.find(status)) return failure->code;

        Made<CMPIInstance> made;
        if (int error = make_CMPI_instance(adapter.broker, instance.get(), name_space_of(op), op, properties, made))
            return CMPIrc(error);
        tell(rslt, &CMPIResultFT::returnInstance, made.get());
        return return_done(rslt);
    });
}

CMPIStatus createInstance(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                          const CMPIInstance* inst)
{
    return operate(mi, ctx, "createInstance", [&](CMPI_Adapter& adapter) -> Outcome {
        const Meta_Class* meta_class = class_of(adapter, op);
        if (!meta_class) return CMPI_RC_ERR_FAILED;
        Instance* read = nullptr;
        if (int error = make_cimple_instance(adapter.broker, meta_class, op, inst, read)) return CMPIrc(error);
        Ref<Instance> instance(read);

        int status = adapter.call(OP_CREATE_INSTANCE, adapter.provider, read);
        if (status != CREATE_INSTANCE_OK) return create_instance_codes.code(status);
        Made<CMPIObjectPath> path;
        if (int error = make_cmpi_object_path(adapter.broker, read, name_space_of(op), path)) return CMPIrc(error);
        tell(rslt, &CMPIResultFT::returnObjectPath, path.get());
        return return_done(rslt);
    });
}

CMPIStatus modifyInstance(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                          const CMPIInstance* inst, const char** properties)
{
    return operate(mi, ctx, "modifyInstance", [&](CMPI_Adapter& adapter) -> Outcome {
        const Meta_Class* meta_class = class_of(adapter, op);
        if (!meta_class) return CMPI_RC_ERR_FAILED;
        Instance* read = nullptr;
        if (int error = make_cimple_instance(adapter.broker, meta_class, op, inst, read)) return CMPIrc(error);
        Ref<Instance> instance(read);
        if (int error = fill_keys_from_path(adapter.broker, op, read)) return CMPIrc(error);
        Ref<Instance> model(clone(read));
        filter_properties(model.get(), properties, true);

        int status = adapter.call(OP_MODIFY_INSTANCE, adapter.provider, model.get(), read);
        if (status != MODIFY_INSTANCE_OK) return modify_instance_codes.code(status);
        tell(rslt, &CMPIResultFT::returnObjectPath, op);
        return return_done(rslt);
    });
}

CMPIStatus deleteInstance(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op)
{
    return operate(mi, ctx, "deleteInstance", [&](CMPI_Adapter& adapter) -> Outcome {
        const Meta_Class* meta_class = class_of(adapter, op);
        if (!meta_class) return CMPI_RC_ERR_FAILED;
        Instance* read = nullptr;
        if (int error = make_cimple_reference(adapter.broker, meta_class, op, read)) return CMPIrc(error);
        Ref<Instance> reference(read);

        int status = adapter.call(OP_DELETE_INSTANCE, adapter.provider, read);
        if (const Status_Row* failure = delete_instance_codes.find(status)) return failure->code;
        return return_done(rslt);
    });
}

CMPIStatus execQuery(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*, const char*,
                     const char*)
{
    log_enter("execQuery");
    log_return("execQuery", CMPI_RC_ERR_NOT_SUPPORTED);
    return status_of(CMPI_RC_ERR_NOT_SUPPORTED);
}

CMPIStatus invokeMethod(CMPIMethodMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                        const char* method, const CMPIArgs* in, CMPIArgs* out)
{
    return operate(mi, ctx, "invokeMethod", [&](CMPI_Adapter& adapter) -> Outcome {
        const Meta_Class* meta_class = class_of(adapter, op);
        if (!meta_class) return {CMPI_RC_ERR_FAILED, "MetaClass not found"};
        if (!method) method = "";
        const Meta_Feature* feature = find_feature(meta_class, method, META_FLAG_METHOD);
        if (!feature) return {CMPI_RC_ERR_METHOD_NOT_FOUND, method};
        if (equali(meta_class->name, method)) return CMPI_RC_ERR_INVALID_CLASS;

        Instance* read = nullptr;
        if (int error = make_cimple_reference(adapter.broker, meta_class, op, read))
            return {CMPIrc(error), "CIMPLE reference creation failed"};
        Ref<Instance> target(read);
        Instance* record = nullptr;
        if (int error = make_cimple_method(adapter.broker, meta_class, as_method(feature), op, in, record))
            return {CMPIrc(error), "CIMPLE make_cimple_method function failed"};
        Ref<Instance> call(record);

        int status = adapter.call(OP_INVOKE_METHOD, adapter.provider, target.get(), record);
        if (const Status_Row* failure = invoke_method_codes.find(status)) return failure->code;

        const char* name_space = name_space_of(op);
        Value return_value;
        Made_Data made;
        if (int error = make_method_out(adapter.broker, name_space, record, out, return_value)) return CMPIrc(error);
        if (to_cmpi_data(adapter.broker, name_space, return_value, 0, nullptr, made) != 0) return CMPI_RC_ERR_FAILED;
        tell(rslt, &CMPIResultFT::returnData, made.value(), made.data.type);
        return return_done(rslt);
    });
}

} // namespace cimple
