/// From operation codes to the members of a provider class: the procs of the three kinds of provider.
///
/// A provider of class C is a class `<C>_Provider` in namespace cimple, named with its header in providers.txt. It has
/// a default constructor and the members below; each may return the status type of Registration.h or int.
///
///     Load_Status            load();
///     Unload_Status          unload();
///     Get_Instance_Status    get_instance(const C* model, C*& instance);
///     Enum_Instances_Status  enum_instances(const C* model, const Enum_Handler& handler);
///     Create_Instance_Status create_instance(C* instance);
///     Delete_Instance_Status delete_instance(const C* instance);
///     Modify_Instance_Status modify_instance(const C* model, const C* instance);
///
/// an association in addition
///
///     Enum_Associator_Names_Status enum_associator_names(const Instance* instance, const String* result_class,
///                                      const String* role, const String* result_role, const Enum_Handler& handler);
///     Enum_References_Status       enum_references(const Instance* instance, const C* model, const String* role,
///                                      const Enum_Handler& handler);
///     Enum_Associators_Status      enum_associators(as enum_associator_names);
///
/// and an indication, besides load and unload, only
///
///     Enable_Indications_Status    enable_indications(std::unique_ptr<Indication_Handler> handler);
///     Disable_Indications_Status   disable_indications();
///
/// Each method M of C, inherited ones too, is a member too: the target, a reference to each field of the method record
/// in order, and last one to its return value. A scalar reference is a pointer field, owned by the record.
///
///     Invoke_Method_Status M(const C* self, NVRHBA_FCPort*& Target, Property<String>& URI,
///                            Property<uint32>& return_value);
///
/// Derive from `<C>_Methods` (classes/<C>_Methods.h) to answer "not supported" to all that C inherits, and declare what
/// is served. Models, instances and targets come from a client: they are of class C only if the client says so, hence a
/// member that reads more than the keys by name tests `meta_class` first.
///
/// One call at a time reaches a provider object, but for load, unload, constructor and destructor. The procs catch
/// nothing: the bridge ends exceptions.
#pragma once

#include <cstddef>
#include <memory>

#include "runtime/Registration.h"
#include "runtime/String.h"

namespace cimple {

/// One method of a provider's class: its record, and the step from a call's record to the provider's member.
template <class Provider, class Class>
struct Method_Entry {
    const Meta_Method* meta;
    int (*call)(Provider& provider, const Class* self, Instance* record);
};

/// A class's methods in the order of its record. An empty list needs no provider of that shape.
template <class Provider, class Class>
struct Method_List {
    const Method_Entry<Provider, Class>* entries = nullptr;
    std::size_t size = 0;
};

/// The eight words of an operation.
struct Proc_Arguments {
    void* words[8];

    template <class T>
    T* pointer(unsigned index) const
    {
        return static_cast<T*>(words[index]);
    }
    Enum_Handler handler(unsigned index) const
    {
        return {reinterpret_cast<Enum_Handler_Proc>(words[index]), words[index + 1]};
    }
};

/// Operations that every kind has: records, and the life of the provider.
template <class Provider, class Class>
int common_operation(int code, const Proc_Arguments& arguments)
{
    switch (code) {
    case OP_GET_META_CLASS:
        *arguments.pointer<const Meta_Class*>(0) = &Class::meta;
        return 0;
    case OP_GET_REPOSITORY:
        *arguments.pointer<const Meta_Repository*>(0) = Class::meta.meta_repository;
        return 0;
    case OP_CREATE_PROVIDER:
        *arguments.pointer<void*>(0) = new Provider;
        return 0;
    case OP_DESTROY_PROVIDER:
        delete arguments.pointer<Provider>(0);
        return 0;
    case OP_LOAD:
        return arguments.pointer<Provider>(0)->load();
    case OP_UNLOAD:
        return arguments.pointer<Provider>(0)->unload();
    default:
        return -1;
    }
}

/// Finds the method by its name, without case. A record that bears the name of another class's method has another
/// shape, so it is refused rather than written to.
template <class Provider, class Class>
int invoke_method(const Method_List<Provider, Class>& methods, const Proc_Arguments& arguments)
{
    if (methods.size == 0) return -1;
    Instance* record = arguments.pointer<Instance>(2);
    const Meta_Record* called = record_of(record);
    for (std::size_t i = 0; i < methods.size; ++i) {
        const Method_Entry<Provider, Class>& entry = methods.entries[i];
        if (!equali(entry.meta->name, called->name)) continue;
        if (static_cast<const Meta_Record*>(entry.meta) != called) return -1;
        return entry.call(*arguments.pointer<Provider>(0), arguments.pointer<const Class>(1), record);
    }
    return -1;
}

/// The proc of a plain class.
template <class Provider, class Class>
int plain_proc(const Method_List<Provider, Class>& methods, int code, const Proc_Arguments& arguments)
{
    switch (code) {
    case OP_INVOKE_METHOD:
        return invoke_method(methods, arguments);
    case OP_GET_INSTANCE: {
        Class* found = nullptr;
        const int status = arguments.pointer<Provider>(0)->get_instance(arguments.pointer<const Class>(1), found);
        *arguments.pointer<Instance*>(2) = found;
        return status;
    }
    case OP_CREATE_INSTANCE:
        return arguments.pointer<Provider>(0)->create_instance(arguments.pointer<Class>(1));
    case OP_DELETE_INSTANCE:
        return arguments.pointer<Provider>(0)->delete_instance(arguments.pointer<const Class>(1));
    case OP_MODIFY_INSTANCE:
        return arguments.pointer<Provider>(0)->modify_instance(arguments.pointer<const Class>(1),
                                                               arguments.pointer<const Class>(2));
    case OP_ENUM_INSTANCES: {
        const Enum_Handler handler = arguments.handler(2);
        const int status = arguments.pointer<Provider>(0)->enum_instances(arguments.pointer<const Class>(1), handler);
        handler.proc(nullptr, status, handler.data);
        return status;
    }
    default:
        return common_operation<Provider, Class>(code, arguments);
    }
}

/// The end of an association operation: "unsupported" goes back without a closing call, so that the bridge can answer
/// from enum_instances; any other status closes the enumeration.
inline int close_enumeration(const Enum_Handler& handler, int status, int unsupported)
{
    if (status != unsupported) handler.proc(nullptr, status, handler.data);
    return status;
}

/// The proc of an association class. No association has a method.
template <class Provider, class Class>
int association_proc(int code, const Proc_Arguments& arguments)
{
    const auto provider = [&arguments] { return arguments.pointer<Provider>(0); };
    const auto text = [&arguments](unsigned index) { return arguments.pointer<const String>(index); };
    const Instance* instance = arguments.pointer<const Instance>(1);
    switch (code) {
    case OP_ENUM_ASSOCIATOR_NAMES: {
        const Enum_Handler handler = arguments.handler(5);
        return close_enumeration(handler,
                                 provider()->enum_associator_names(instance, text(2), text(3), text(4), handler),
                                 ENUM_ASSOCIATOR_NAMES_UNSUPPORTED);
    }
    case OP_ENUM_REFERENCES: {
        const Enum_Handler handler = arguments.handler(4);
        return close_enumeration(
            handler, provider()->enum_references(instance, arguments.pointer<const Class>(2), text(3), handler),
            ENUM_REFERENCES_UNSUPPORTED);
    }
    case OP_ENUM_ASSOCIATORS: {
        const Enum_Handler handler = arguments.handler(5);
        return close_enumeration(handler, provider()->enum_associators(instance, text(2), text(3), text(4), handler),
                                 ENUM_ASSOCIATORS_UNSUPPORTED);
    }
    default:
        return plain_proc<Provider, Class>({}, code, arguments);
    }
}

/// The proc of an indication class.
template <class Provider, class Class>
int indication_proc(int code, const Proc_Arguments& arguments)
{
    switch (code) {
    case OP_ENABLE_INDICATIONS:
        return arguments.pointer<Provider>(0)->enable_indications(std::make_unique<Indication_Handler>(
            Indication_Handler{reinterpret_cast<Indication_Handler_Proc>(arguments.words[1]), arguments.words[2]}));
    case OP_DISABLE_INDICATIONS:
        return arguments.pointer<Provider>(0)->disable_indications();
    default:
        return common_operation<Provider, Class>(code, arguments);
    }
}

} // namespace cimple
