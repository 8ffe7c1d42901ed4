/// The base of every encapsulated object that the broker hands to a module: who made it, when it ends, and the test
/// that a pointer of the module's is really one.
///
/// Each derived class holds its CMPI face (`hdl` is the Object, `ft` the manner's table) and plain data. An object
/// belongs to the Scope it was made in, which frees what the module did not release. One thread at a time uses an
/// object; its release may come from any.
#pragma once

#include "host/Ledger.h"
#include "host/Value.h"

#include <cmpift.h>

#include <cstdint>

namespace host {

class Broker;
class Scope;

class Object {
public:
    static constexpr std::uint32_t alive = 0x0B1EC7A1;
    static constexpr std::uint32_t dead = 0xDEADB1EC;

    Object(Broker& owner, Object_Kind what, Origin from) : broker(owner), kind(what), origin(from) {}
    virtual ~Object() { magic = dead; }
    Object(const Object&) = delete;
    Object& operator=(const Object&) = delete;

    /// For toString: what a person would want to read.
    virtual std::string to_text() const = 0;

    std::uint32_t magic = alive;
    Broker& broker;
    const Object_Kind kind;
    const Origin origin;
    // The scope's list.
    Scope* scope = nullptr;
    Object* previous = nullptr;
    Object* next = nullptr;
    std::uint64_t serial = 0; ///< order within the scope
};

/// The status record of a code, without a message.
CMPIStatus status_of(int code);
/// Writes a code where the caller wants one.
void put_status(CMPIStatus* status, int code);

/// The object behind a handle, if it is a live one of that kind; else null, and use of a released one is noted.
Object* object_at(void* handle, Object_Kind kind);
/// The same for toString and its like, where the kind is not known.
Object* object_at(const void* face);

/// The module releases an object: 60 if the handle is none, 0 else. What the broker lent stays, and that is noted.
CMPIStatus release_object(void* handle, Object_Kind kind);

/// `unwrap<Path_Object>(op)`: the derived object behind a CMPI pointer, or null.
template <class T, class Face>
T* unwrap(const Face* face)
{
    return face ? static_cast<T*>(object_at(face->hdl, T::object_kind)) : nullptr;
}

/// The release slot of a class's table.
template <class T, class Face>
CMPIStatus release_face(Face* face)
{
    return face ? release_object(face->hdl, T::object_kind) : status_of(CMPI_RC_ERR_INVALID_HANDLE);
}

} // namespace host
