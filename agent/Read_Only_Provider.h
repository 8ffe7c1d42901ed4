/// What every provider shares whose class cannot be read one by one or changed: its life counts the agent, and all but
/// the enumeration is "not supported", so that the bridge serves single instances and associations from that.
///
/// A provider derives from it, adds enum_instances, and overrides what it serves. It has no state.
#pragma once

#include "agent/ProviderAgent.h"
#include "runtime/Registration.h"

namespace cimple {

template <class Class>
class Read_Only_Provider {
public:
    Load_Status load() { return static_cast<Load_Status>(ProviderAgent::load()); }
    Unload_Status unload() { return static_cast<Unload_Status>(ProviderAgent::unload()); }
    Get_Instance_Status get_instance(const Class*, Class*&) { return GET_INSTANCE_UNSUPPORTED; }
    Create_Instance_Status create_instance(Class*) { return CREATE_INSTANCE_UNSUPPORTED; }
    Delete_Instance_Status delete_instance(const Class*) { return DELETE_INSTANCE_UNSUPPORTED; }
    Modify_Instance_Status modify_instance(const Class*, const Class*) { return MODIFY_INSTANCE_UNSUPPORTED; }
};

/// The same for an association.
template <class Class>
class Read_Only_Association_Provider : public Read_Only_Provider<Class> {
public:
    Enum_Associator_Names_Status enum_associator_names(const Instance*, const String*, const String*, const String*,
                                                       const Enum_Handler&)
    {
        return ENUM_ASSOCIATOR_NAMES_UNSUPPORTED;
    }
    Enum_References_Status enum_references(const Instance*, const Class*, const String*, const Enum_Handler&)
    {
        return ENUM_REFERENCES_UNSUPPORTED;
    }
    Enum_Associators_Status enum_associators(const Instance*, const String*, const String*, const String*,
                                             const Enum_Handler&)
    {
        return ENUM_ASSOCIATORS_UNSUPPORTED;
    }
};

} // namespace cimple
