/// Providers that do what a test tells them, over the generated table of the module: one for each line of the list.
#pragma once

#include "runtime/Registration.h"

#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace cimple::fake {

/// What the providers of this process were asked, and how they shall answer. One thread.
struct Script {
    std::vector<std::string> calls; ///< "NVRHBA_Product.load", in order
    int instances = 0;              ///< how many instances an enumeration hands over
    int enum_status = 0;
    int names_status = ENUM_ASSOCIATOR_NAMES_UNSUPPORTED;
    int references_status = ENUM_REFERENCES_UNSUPPORTED;
    int associators_status = ENUM_ASSOCIATORS_UNSUPPORTED;
    std::unique_ptr<Indication_Handler> indications;
    int living = 0; ///< provider objects

    static Script& current()
    {
        static Script script;
        return script;
    }
};

/// The members that a plain, association or indication provider has, each noted in the script.
template <class Class>
class Provider {
public:
    Provider() { ++Script::current().living; }
    ~Provider() { --Script::current().living; }

    Load_Status load() { return note("load"), LOAD_OK; }
    Unload_Status unload() { return note("unload"), UNLOAD_OK; }
    Get_Instance_Status get_instance(const Class*, Class*&) { return note("get_instance"), GET_INSTANCE_UNSUPPORTED; }
    int enum_instances(const Class*, const Enum_Handler& handler)
    {
        note("enum_instances");
        for (int i = 0; i < script().instances; ++i)
            handler.handle(create_as<Class>());
        return script().enum_status;
    }
    Create_Instance_Status create_instance(Class*) { return note("create_instance"), CREATE_INSTANCE_UNSUPPORTED; }
    Delete_Instance_Status delete_instance(const Class*)
    {
        return note("delete_instance"), DELETE_INSTANCE_UNSUPPORTED;
    }
    Modify_Instance_Status modify_instance(const Class*, const Class*)
    {
        return note("modify_instance"), MODIFY_INSTANCE_UNSUPPORTED;
    }
    int enum_associator_names(const Instance*, const String* result_class, const String* role,
                              const String* result_role, const Enum_Handler&)
    {
        note(std::string("enum_associator_names ") + result_class->c_str() + " " + role->c_str() + " " +
             result_role->c_str());
        return script().names_status;
    }
    int enum_references(const Instance*, const Class*, const String* role, const Enum_Handler&)
    {
        note(std::string("enum_references ") + role->c_str());
        return script().references_status;
    }
    int enum_associators(const Instance*, const String*, const String*, const String*, const Enum_Handler&)
    {
        note("enum_associators");
        return script().associators_status;
    }
    Enable_Indications_Status enable_indications(std::unique_ptr<Indication_Handler> handler)
    {
        note("enable_indications");
        script().indications = std::move(handler);
        return ENABLE_INDICATIONS_OK;
    }
    Disable_Indications_Status disable_indications()
    {
        note("disable_indications");
        script().indications.reset();
        return DISABLE_INDICATIONS_OK;
    }

protected:
    static Script& script() { return Script::current(); }
    static void note(const std::string& what) { script().calls.push_back(std::string(Class::meta.name) + "." + what); }
    /// An own method's answer: noted, and `return_value` 0.
    template <class Return>
    static Invoke_Method_Status serve(const char* method, Property<Return>& return_value)
    {
        note(method);
        return_value.set(Return{});
        return INVOKE_METHOD_OK;
    }
};

} // namespace cimple::fake

namespace cimple {

template <class Family>
class Derived_Provider : public fake::Provider<typename Family::Class> {
};

} // namespace cimple
