#include "cmpi/CMPI_Thread_Context.h"

#include <memory>

#include "cmpi/CMPI_Adapter.h"
#include "cmpi/CMPI_Containers.h"
#include "cmpi/Converter.h"
#include "cmpi/cmpi_data.h"
#include "cmpi/warnings.h"

namespace cimple {

/// An open enumeration of an up-call. Instances are read into the class that was asked for.
struct Instance_Enumerator_Rep {
    Made<CMPIEnumeration> enumeration;
    const Meta_Class* meta_class;
    Ref<Instance> current;
    String name_space;
};

namespace {

// An instance that the server gave, as one of `meta_class`, or null.
Instance* read_instance(const CMPIBroker* broker, const Meta_Class* meta_class, const char* name_space,
                        const CMPIInstance* instance)
{
    CMPIStatus status;
    const CMPIObjectPath* path = ask(status, instance, &CMPIInstanceFT::getObjectPath);
    Instance* made = nullptr;
    if (make_cimple_instance(broker, meta_class, path, instance, made) != 0) return nullptr;
    Ref<Instance> result(made);
    set_name_space_recursive(made, name_space, false);
    return result.release();
}

Made<CMPIObjectPath> path_of(const CMPIBroker* broker, const char* name_space, const Instance* instance)
{
    Made<CMPIObjectPath> path;
    if (name_space && instance) make_cmpi_object_path(broker, instance, name_space, path);
    return path;
}

int failed()
{
    CONVERSION_WARN("failed");
    return -1;
}

} // namespace

CMPI_Thread_Context::CMPI_Thread_Context(const CMPIBroker* broker, const CMPIContext* context, CMPI_Adapter* adapter)
    : broker(broker), context(context), adapter(adapter)
{
}

CMPI_Thread_Context::~CMPI_Thread_Context()
{
    // The server frees the context of a thread that detached; one that never attached is still ours.
    if (m_attachment == Attachment::prepared) release(const_cast<CMPIContext*>(context));
    if (m_attachment != Attachment::lent) adapter->give_back();
}

// --- Threads
// -----------------------------------------------------------------------------------------------------------

Thread_Context* CMPI_Thread_Context::thread_create_hook(void*)
{
    auto prepare = slot_of(broker, &CMPIBrokerFT::prepareAttachThread);
    if (!prepare || !context) return nullptr; // servers read what they are given
    auto child = std::make_unique<CMPI_Thread_Context>(broker, nullptr, adapter);
    CMPIContext* prepared = prepare(broker, context);
    if (!prepared) return nullptr;
    if (!adapter->hold()) {
        release(prepared);
        return nullptr;
    }
    child->context = prepared;
    child->m_attachment = Attachment::prepared;
    return child.release();
}

void CMPI_Thread_Context::thread_start_hook()
{
    if (m_attachment == Attachment::prepared && tell(broker, &CMPIBrokerFT::attachThread, context) == CMPI_RC_OK)
        m_attachment = Attachment::attached;
}

void CMPI_Thread_Context::thread_exit_hook()
{
    if (m_attachment != Attachment::attached) return;
    m_attachment = Attachment::detached;
    tell(broker, &CMPIBrokerFT::detachThread, context);
}

// --- Enumerations
// ------------------------------------------------------------------------------------------------------

Instance_Enumerator_Rep* CMPI_Thread_Context::instance_enumerator_create(const char* name_space, const Instance* model)
{
    Made<CMPIObjectPath> path = path_of(broker, name_space, model);
    if (!path) return nullptr;
    CMPIStatus status;
    Made<CMPIEnumeration> enumeration(
        ask(status, broker, &CMPIBrokerFT::enumerateInstances, context, path.get(), nullptr));
    if (!enumeration || status.rc != CMPI_RC_OK) return nullptr;
    auto rep = std::make_unique<Instance_Enumerator_Rep>(
        Instance_Enumerator_Rep{std::move(enumeration), model->meta_class, Ref<Instance>(), String(name_space)});
    instance_enumerator_next(rep.get());
    return rep.release();
}

void CMPI_Thread_Context::instance_enumerator_destroy(Instance_Enumerator_Rep* enumerator)
{
    delete enumerator;
}

bool CMPI_Thread_Context::instance_enumerator_more(Instance_Enumerator_Rep* enumerator)
{
    return enumerator && enumerator->current;
}

void CMPI_Thread_Context::instance_enumerator_next(Instance_Enumerator_Rep* enumerator)
{
    if (!enumerator) return;
    enumerator->current.reset();
    CMPIEnumeration* enumeration = enumerator->enumeration.get();
    CMPIStatus status;
    if (!ask(status, enumeration, &CMPIEnumerationFT::hasNext) || status.rc != CMPI_RC_OK) return;
    CMPIData data = ask(status, enumeration, &CMPIEnumerationFT::getNext);
    if (status.rc != CMPI_RC_OK || data.type != CMPI_instance || (data.state & CMPI_nullValue) || !data.value.inst)
        return;
    enumerator->current.reset(
        read_instance(broker, enumerator->meta_class, enumerator->name_space.c_str(), data.value.inst));
}

Instance* CMPI_Thread_Context::instance_enumerator_get(Instance_Enumerator_Rep* enumerator)
{
    if (!enumerator) return nullptr;
    ref(enumerator->current.get());
    return enumerator->current.get();
}

// --- Single instances
// --------------------------------------------------------------------------------------------------

Instance* CMPI_Thread_Context::get_instance(const char* name_space, const Instance* model)
{
    Made<CMPIObjectPath> path = path_of(broker, name_space, model);
    if (!path) return nullptr;
    CMPIStatus status;
    Made<CMPIInstance> found(ask(status, broker, &CMPIBrokerFT::getInstance, context, path.get(), nullptr));
    if (!found || status.rc != CMPI_RC_OK) return nullptr;
    return read_instance(broker, model->meta_class, name_space, found.get());
}

int CMPI_Thread_Context::create_instance(const char* name_space, const Instance* instance)
{
    Made<CMPIObjectPath> path = path_of(broker, name_space, instance);
    Made<CMPIInstance> made;
    if (!path || make_CMPI_instance(broker, instance, name_space, path.get(), nullptr, made) != 0) return -1;
    CMPIStatus status;
    Made<CMPIObjectPath> created(ask(status, broker, &CMPIBrokerFT::createInstance, context, path.get(), made.get()));
    return status.rc == CMPI_RC_OK ? 0 : -1;
}

int CMPI_Thread_Context::delete_instance(const char* name_space, const Instance* instance)
{
    Made<CMPIObjectPath> path = path_of(broker, name_space, instance);
    if (!path) return -1;
    CMPIrc code = tell(broker, &CMPIBrokerFT::deleteInstance, context, path.get());
    return code == CMPI_RC_OK ? 0 : -1;
}

int CMPI_Thread_Context::modify_instance(const char* name_space, const Instance* instance)
{
    Made<CMPIObjectPath> path = path_of(broker, name_space, instance);
    Made<CMPIInstance> made;
    if (!path || make_CMPI_instance(broker, instance, name_space, path.get(), nullptr, made) != 0) return -1;
    CMPIrc code = tell(broker, &CMPIBrokerFT::modifyInstance, context, path.get(), made.get(), nullptr);
    return code == CMPI_RC_OK ? 0 : -1;
}

// --- Methods
// -----------------------------------------------------------------------------------------------------------

int CMPI_Thread_Context::invoke_method(const char* name_space, const Instance* instance, Instance* method)
{
    if (!name_space || !instance || !method) return failed();
    const Meta_Class* meta_class = instance->meta_class;
    if (!meta_class || !meta_class->meta_repository) return failed();
    if (!Thread_Context::top()) return failed();
    if (!broker || !context) return failed();

    const Meta_Record* call = record_of(method);
    CMPIStatus status;
    Made<CMPIObjectPath> path;
    if (call->flags & META_FLAG_STATIC)
        path.reset(ask(status, broker, &CMPIBrokerEncFT::newObjectPath, name_space, meta_class->name));
    else
        path = path_of(broker, name_space, instance);
    if (!path) return failed();

    const Meta_Repository* repository = meta_class->meta_repository;
    Made<CMPIArgs> in(ask(status, broker, &CMPIBrokerEncFT::newArgs));
    if (!in || CMPIArgs_Container(broker, repository, name_space, in.get()).convert(method, META_FLAG_IN) != 0)
        return failed();
    Made<CMPIArgs> out(ask(status, broker, &CMPIBrokerEncFT::newArgs));
    if (!out) return failed();

    CMPIData result =
        ask(status, broker, &CMPIBrokerFT::invokeMethod, context, path.get(), call->name, in.get(), out.get());
    if (status.rc != CMPI_RC_OK) {
        CONVERSION_WARN("failed[%u]", static_cast<unsigned>(status.rc));
        return -1;
    }

    if (CMPIArgs_Container(broker, repository, name_space, out.get()).convert(call, META_FLAG_OUT, method) != 0)
        return failed();
    set_name_space_recursive(method, name_space_of(path.get()), false);

    const Meta_Feature* return_value = find_feature(call, "return_value", META_FLAG_PROPERTY);
    Value value;
    if (!return_value || cmpi_to_cimple_value(broker, repository, result, 0, value) != 0 ||
        value.set(method, return_value) != 0)
        return failed();
    return 0;
}

// --- The rest
// ----------------------------------------------------------------------------------------------------------

void CMPI_Thread_Context::allow_unload(bool flag)
{
    adapter->allow_unload = flag;
}

bool CMPI_Thread_Context::get_username(String& name)
{
    CMPIStatus status;
    CMPIData entry = ask(status, context, &CMPIContextFT::getEntry, CMPIPrincipal);
    if (status.rc != CMPI_RC_OK) {
        CONVERSION_WARN("username not OK cmpirc=%d", static_cast<int>(status.rc));
        return false;
    }
    // A server that does not know its client may give a string without characters.
    const bool has_string = entry.type == CMPI_string && !(entry.state & CMPI_nullValue);
    const char* text = has_string ? chars_of(entry.value.string) : nullptr;
    name = text ? text : "";
    return true;
}

} // namespace cimple
