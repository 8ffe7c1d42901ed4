/// What extrinsic methods have in common: how they answer, and how they read what a client gives.
///
/// Pure functions. Instances come from a client: their class is what the client claims.
#pragma once

#include "runtime/Instance.h"
#include "runtime/Property.h"
#include "runtime/Registration.h"

namespace cimple {

/// Return values that several methods share.
enum Method_Answer : uint32 {
    ANSWER_DONE = 0,
    ANSWER_UNKNOWN = 1,
    ANSWER_FAILED = 4,            ///< also the wrong service, a file that cannot be written
    ANSWER_INVALID_PARAMETER = 5, ///< also a file that cannot be looked at
    ANSWER_NULL_ARGUMENT = 4097,
    ANSWER_FILE_NOT_FOUND = 4107,
    ANSWER_BAD_ARGUMENT = 32968,
    ANSWER_FOREIGN_INSTANCE = 33068
};

/// The return value for a status of the management library other than 0.
constexpr uint32 libraryAnswer(uint32 status)
{
    return 40000 + status;
}

/// Ends a method with that return value.
inline Invoke_Method_Status answer(Property<uint32>& return_value, uint32 value)
{
    return_value.set(value);
    return INVOKE_METHOD_OK;
}

/// A value that counts as 0 or false where the client gave none.
template <class T>
T given(const Property<T>& property)
{
    return property.null ? T() : property.value;
}

/// True for an instance (not null) of that class or of a class derived from it.
inline bool isOfClass(const Instance* instance, const Meta_Class& ancestor)
{
    return instance && is_subclass(&ancestor, instance->meta_class);
}

} // namespace cimple
