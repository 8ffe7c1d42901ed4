/// The Instance_Map of one class, by its C++ structure.
///
/// The structure may be incomplete where the map is only declared: its class record is needed where the map is
/// constructed, and its members where an element is read.
#pragma once

#include "agent/Instance_Map.h"

namespace cimple {

template <class T>
class Map : public Instance_Map {
public:
    Map() : Instance_Map(&T::meta) {}

    /// As the base's; elements are of the very class, since nothing else is inserted.
    T* operator[](std::size_t index) const { return static_cast<T*>(Instance_Map::operator[](index)); }

    /// The element that a client's instance names: null for null, for an instance of another class (whatever its keys),
    /// and for keys that no element has.
    T* lookup_own(const Instance* given) const
    {
        return given && is_subclass(meta_class(), given->meta_class) ? static_cast<T*>(lookup(given)) : nullptr;
    }
};

} // namespace cimple
