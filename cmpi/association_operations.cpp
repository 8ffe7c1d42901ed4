#include <cstdio>
#include <vector>

#include "cmpi/Converter.h"
#include "cmpi/operation.h"
#include "cmpi/operations.h"
#include "runtime/Selection.h"
#include "runtime/associations.h"

namespace cimple {

namespace {

// --- What is delivered
// -------------------------------------------------------------------------------------------------

// What an answer hands from instance to instance.
struct Answer {
    const CMPIBroker* broker;
    const CMPIContext* context;
    const CMPIResult* result;
    const char* name_space; // of the request's path
    const char** properties;
    int error; // once set, nothing more is delivered

    const char* name_space_for(const Instance* instance) const
    {
        return instance->__name_space.empty() ? name_space : instance->__name_space.c_str();
    }
};

// A handler that owns the instance, and stops at null and behind an error; `deliver` gives 0 or an error.
template <int (*deliver)(Answer&, Instance*)>
bool handle(Instance* instance, int, void* data)
{
    Ref<Instance> owned(instance);
    auto& answer = *static_cast<Answer*>(data);
    if (instance && !answer.error) answer.error = deliver(answer, instance);
    return true;
}

int return_path(Answer& answer, const Instance* instance, const char* name_space)
{
    Made<CMPIObjectPath> path;
    if (int error = make_cmpi_object_path(answer.broker, instance, name_space, path)) return error;
    tell(answer.result, &CMPIResultFT::returnObjectPath, path.get());
    return 0;
}

int deliver_associator_name(Answer& answer, Instance* instance)
{
    return return_path(answer, instance, answer.name_space_for(instance));
}

int deliver_associator(Answer& answer, Instance* instance)
{
    Made<CMPIInstance> made;
    if (int error = make_CMPI_instance(answer.broker, instance, answer.name_space_for(instance), nullptr,
                                       answer.properties, made))
        return error;
    tell(answer.result, &CMPIResultFT::returnInstance, made.get());
    return 0;
}

// An association holds the keys of its ends only; the end's own provider has the rest.
int fetch_associator(Answer& answer, Instance* instance)
{
    Made<CMPIObjectPath> path;
    if (int error = make_cmpi_object_path(answer.broker, instance, answer.name_space_for(instance), path)) return error;
    CMPIStatus status;
    Made<CMPIInstance> found(
        ask(status, answer.broker, &CMPIBrokerFT::getInstance, answer.context, path.get(), answer.properties));
    if (found && status.rc == CMPI_RC_OK) tell(answer.result, &CMPIResultFT::returnInstance, found.get());
    return 0;
}

int deliver_reference_name(Answer& answer, Instance* instance)
{
    nullify_properties(instance, false, true, 1);
    return return_path(answer, instance, answer.name_space);
}

int deliver_reference(Answer& answer, Instance* instance)
{
    const char* name_space = answer.name_space_for(instance);
    Made<CMPIObjectPath> path;
    if (int error = make_cmpi_object_path(answer.broker, instance, name_space, path)) return error;
    filter_properties(instance, answer.properties, false);
    Made<CMPIInstance> made;
    if (int error = make_CMPI_instance(answer.broker, instance, name_space, path.get(), answer.properties, made))
        return error;
    tell(answer.result, &CMPIResultFT::returnInstance, made.get());
    return 0;
}

// --- Traversals
// --------------------------------------------------------------------------------------------------------

struct Reference_Filter : Selection {
    Reference_Filter(const Instance* source, const String& role, Enum_Handler_Proc proc, void* data)
        : Selection(this, Values::keys_of_ends), source(source), role(role), proc(proc), data(data)
    {
    }
    bool wants(const Instance* association) override { return ref_of(source, association, role); }

    const Instance* source;
    String role;
    Enum_Handler_Proc proc;
    void* data;
};

// Each association is told on standard output, wanted or not; of those that the provider left out, their number before
// each wanted one is kept until that is handed out.
struct Associator_Filter : Selection {
    Associator_Filter(const Instance* source, const String& result_class, const String& role, const String& result_role,
                      Enum_Handler_Proc proc, void* data)
        : Selection(this, Values::all, Handler::only_reads), source(source), result_class(result_class), role(role),
          result_role(result_role), proc(proc), data(data)
    {
    }
    bool wants(const Instance* association) override
    {
        if (!ref_of(source, association, role)) {
            unwanted++;
            return false;
        }
        unwanted_before.push_back(unwanted);
        unwanted = 0;
        return true;
    }
    void asked_all() override { is_complete = true; }

    void tell() const { std::puts("cimple _proc _enum_associator_names"); }
    void tell_unwanted()
    {
        if (!is_complete) return;
        std::size_t count = handed_out < unwanted_before.size() ? unwanted_before[handed_out++] : unwanted;
        for (; count; --count)
            tell();
    }

    const Instance* source;
    String result_class;
    String role;
    String result_role;
    Enum_Handler_Proc proc;
    void* data;

private:
    std::vector<std::size_t> unwanted_before;
    std::size_t unwanted = 0;
    std::size_t handed_out = 0;
    bool is_complete = false;
};

bool pass_reference(Instance* instance, int, void* data)
{
    Ref<Instance> owned(instance);
    auto& filter = *static_cast<Reference_Filter*>(data);
    if (instance && ref_of(filter.source, instance, filter.role)) filter.proc(owned.release(), 0, filter.data);
    return true;
}

bool pass_associators(Instance* instance, int, void* data)
{
    Ref<Instance> owned(instance);
    auto& filter = *static_cast<Associator_Filter*>(data);
    filter.tell_unwanted();
    if (!instance) return true;
    filter.tell();
    Array<Instance*> ends; // borrowed from the association
    get_associators(filter.source, instance, filter.result_class, filter.role, filter.result_role, ends);
    for (Instance* end : ends) {
        ref(end);
        Ref<Instance> handed(end);
        std::printf("Provider_Handle enum_associator_names call proc name NS = %s\n", end->__name_space.c_str());
        print(stdout, end, false);
        filter.proc(handed.release(), 0, filter.data);
    }
    return true;
}

Ref<Instance> keys_only_model(const CMPI_Adapter& adapter)
{
    Ref<Instance> model(create(adapter.meta_class, false));
    nullify_properties(model.get(), false, true, 1);
    return model;
}

bool is_association(const CMPI_Adapter& adapter)
{
    return adapter.meta_class && (adapter.meta_class->flags & META_FLAG_ASSOCIATION);
}

// All association instances that hold the source: from the provider, or out of its enumeration.
int traverse_references(const CMPI_Adapter& adapter, const Instance* source, const Instance* model, const String& role,
                        Enum_Handler_Proc proc, void* data)
{
    int status = adapter.call(OP_ENUM_REFERENCES, adapter.provider, source, model, &role, proc, data);
    if (status != ENUM_REFERENCES_UNSUPPORTED) return status;

    Reference_Filter filter(source, role, proc, data);
    status = adapter.call(OP_ENUM_INSTANCES, adapter.provider, model, &pass_reference, &filter);
    proc(nullptr, 0, data);
    switch (status) {
    case ENUM_INSTANCES_FAILED:
        return ENUM_REFERENCES_FAILED;
    case ENUM_INSTANCES_ACCESS_DENIED:
        return ENUM_REFERENCES_ACCESS_DENIED;
    default:
        return ENUM_REFERENCES_OK;
    }
}

// All far ends of association instances that hold the source: from the provider, or out of its enumeration.
int traverse_associators(const CMPI_Adapter& adapter, const Instance* source, const String& result_class,
                         const String& role, const String& result_role, Enum_Handler_Proc proc, void* data)
{
    if (!is_association(adapter)) return ENUM_ASSOCIATOR_NAMES_FAILED;
    int status = adapter.call(OP_ENUM_ASSOCIATOR_NAMES, adapter.provider, source, &result_class, &role, &result_role,
                              proc, data);
    if (status == ENUM_ASSOCIATOR_NAMES_ACCESS_DENIED) return ENUM_ASSOCIATOR_NAMES_FAILED;
    if (status != ENUM_ASSOCIATOR_NAMES_UNSUPPORTED) return status;

    Ref<Instance> model = keys_only_model(adapter);
    Associator_Filter filter(source, result_class, role, result_role, proc, data);
    status = adapter.call(OP_ENUM_INSTANCES, adapter.provider, model.get(), &pass_associators, &filter);
    proc(nullptr, 0, data);
    switch (status) {
    case ENUM_INSTANCES_FAILED:
        return ENUM_ASSOCIATOR_NAMES_FAILED;
    case ENUM_INSTANCES_ACCESS_DENIED:
        return ENUM_ASSOCIATOR_NAMES_ACCESS_DENIED;
    default:
        return ENUM_ASSOCIATOR_NAMES_OK;
    }
}

// --- The common start
// --------------------------------------------------------------------------------------------------

// The operation with the source that `op` stands for. A server asks every association provider about every class, so
// that a class this one does not know is simply without result; `logged` is what the log says then.
template <class Steps>
CMPIStatus traverse(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIObjectPath* op, const char* label,
                    CMPIrc logged, Steps steps)
{
    return operate(mi, ctx, label, [&](CMPI_Adapter& adapter) -> Outcome {
        CMPIStatus status;
        const char* name = chars_of(ask(status, op, &CMPIObjectPathFT::getClassName));
        const Meta_Class* source_class = adapter.find_class(name ? name : "");
        if (!source_class) return {CMPI_RC_OK, nullptr, logged};
        Instance* source = nullptr;
        if (int error = make_cimple_reference(adapter.broker, source_class, op, source)) return CMPIrc(error);
        Ref<Instance> owned(source);
        return steps(adapter, source);
    });
}

} // namespace

CMPIStatus associatorNames(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                           const CMPIObjectPath* op, const char*, const char* resultClass, const char* role,
                           const char* resultRole)
{
    auto steps = [&](CMPI_Adapter& adapter, const Instance* source) -> Outcome {
        Answer answer{adapter.broker, ctx, rslt, name_space_of(op), nullptr, 0};
        return association_codes.code(traverse_associators(adapter, source, resultClass, role, resultRole,
                                                           handle<deliver_associator_name>, &answer));
    };
    return traverse(mi, ctx, op, "associatorNames", CMPI_RC_ERR_INVALID_CLASS, steps);
}

CMPIStatus associators(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                       const char*, const char* resultClass, const char* role, const char* resultRole,
                       const char** properties)
{
    auto steps = [&](CMPI_Adapter& adapter, const Instance* source) -> Outcome {
        print(stdout, source, false);
        const String result_class(resultClass), near_role(role), far_role(resultRole);
        Answer answer{adapter.broker, ctx, rslt, name_space_of(op), properties, 0};
        int status = adapter.call(OP_ENUM_ASSOCIATORS, adapter.provider, source, &result_class, &near_role, &far_role,
                                  &handle<deliver_associator>, &answer);
        if (status != ENUM_ASSOCIATORS_UNSUPPORTED) return enum_associators_codes.code(status);

        Answer fetched{adapter.broker, ctx, rslt, name_space_of(op), properties, 0};
        return association_codes.code(traverse_associators(adapter, source, result_class, near_role, far_role,
                                                           handle<fetch_associator>, &fetched));
    };
    return traverse(mi, ctx, op, "associators", CMPI_RC_OK, steps);
}

CMPIStatus referenceNames(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                          const CMPIObjectPath* op, const char*, const char* role)
{
    auto steps = [&](CMPI_Adapter& adapter, const Instance* source) -> Outcome {
        if (!is_association(adapter)) return association_codes.code(ENUM_REFERENCES_FAILED);
        Ref<Instance> model = keys_only_model(adapter);
        Answer answer{adapter.broker, ctx, rslt, name_space_of(op), nullptr, 0};
        return association_codes.code(
            traverse_references(adapter, source, model.get(), role, handle<deliver_reference_name>, &answer));
    };
    return traverse(mi, ctx, op, "referenceNames", CMPI_RC_ERR_INVALID_CLASS, steps);
}

CMPIStatus references(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                      const char*, const char* role, const char** properties)
{
    auto steps = [&](CMPI_Adapter& adapter, const Instance* source) -> Outcome {
        if (!is_association(adapter)) return association_codes.code(ENUM_REFERENCES_FAILED);
        Ref<Instance> model(create(adapter.meta_class, false));
        Answer answer{adapter.broker, ctx, rslt, name_space_of(op), properties, 0};
        return association_codes.code(
            traverse_references(adapter, source, model.get(), role, handle<deliver_reference>, &answer));
    };
    return traverse(mi, ctx, op, "references", CMPI_RC_ERR_INVALID_CLASS, steps);
}

} // namespace cimple
