/// Calls of CMPI slots that survive a server which left them out.
///
/// Servers in the field leave slots and whole tables null, so that the bridge never calls one directly: `ask` and
/// `tell` look at the object, its table and the slot first, and answer as a call that failed would. No locks; an object
/// is used on the thread that the server gave it to.
#pragma once

#include <cmpift.h>

#include <memory>
#include <type_traits>
#include <utility>

namespace cimple {

/// The table of an object that holds slots of type `Table`. A broker has two that the bridge uses.
template <class Table>
auto table_of(const CMPIBroker* broker)
{
    if constexpr (std::is_same_v<Table, CMPIBrokerEncFT>)
        return broker->eft;
    else
        return broker->bft;
}
template <class Table, class Object>
auto table_of(const Object* object)
{
    return object->ft;
}

/// The function in a slot of the object's table, or null where object, table or slot are.
template <class Object, class Table, class Function>
Function slot_of(Object* object, Function Table::*slot)
{
    if (!object) return nullptr;
    auto table = table_of<Table>(object);
    return table ? table->*slot : nullptr;
}

/// A call that reports through a status argument, which is added here: `ask(status, path, &CMPIObjectPathFT::getKey,
/// name)`. With an absent slot `status` tells a failure and the result is zero. Brokers may answer a null pointer with
/// an OK, so look at both.
template <class Object, class Table, class Function, class... Args>
auto ask(CMPIStatus& status, Object* object, Function Table::*slot, Args... args)
{
    using Result = decltype((*std::declval<Function>())(object, args..., &status));
    status = {CMPI_RC_OK, nullptr};
    if (Function function = slot_of(object, slot)) return function(object, args..., &status);
    status.rc = CMPI_RC_ERR_FAILED;
    return Result{};
}

/// A call whose result is the status: the code, CMPI_RC_ERR_FAILED with an absent slot.
template <class Object, class Table, class Function, class... Args>
CMPIrc tell(Object* object, Function Table::*slot, Args... args)
{
    Function function = slot_of(object, slot);
    return function ? function(object, args...).rc : CMPI_RC_ERR_FAILED;
}

/// The characters of a CMPI string; null for a null string, null characters or a failing call.
const char* chars_of(const CMPIString* string);

/// Gives an object back to the broker that made it; null is ignored.
void release(CMPIString* object);
void release(CMPIDateTime* object);
void release(CMPIArray* object);
void release(CMPIObjectPath* object);
void release(CMPIInstance* object);
void release(CMPIArgs* object);
void release(CMPIEnumeration* object);
void release(CMPIContext* object);

struct Releaser {
    template <class Object>
    void operator()(Object* object) const
    {
        release(object);
    }
};

/// Owns an object that the bridge had the broker make. On a thread that stays attached such objects would otherwise
/// pile up for the life of the thread, and on a request thread for a whole enumeration.
template <class Object>
using Made = std::unique_ptr<Object, Releaser>;

} // namespace cimple
