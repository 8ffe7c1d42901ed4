/// How the builders write an instance as a table that a person can hold against the class reference:
/// `set(group->NameFormat, "WWN")`, one row a property.
///
/// make gives the namespace and the schema's defaults; set stores the value and clears the null byte; nothing else
/// happens between the rows. Pure functions; std::bad_alloc passes through those that do not say otherwise.
#pragma once

#include <initializer_list>
#include <new>
#include <string>

#include "agent/Map.h"
#include "runtime/Instance.h"

namespace cimple {

constexpr const char* norvane_name_space = "root/norvane";
constexpr const char* interop_name_space = "root/pg_interop";

void logCreationFailed(const char* failure);

template <class T, class Text = const char*>
Ref<T> make(const Text& name_space = norvane_name_space)
{
    Ref<T> instance(create_as<T>(true));
    instance->__name_space = name_space;
    return instance;
}

/// What `maker` makes, a Ref; null without memory for it, after `failure` was logged.
template <class Maker>
auto madeOrLog(const char* failure, Maker maker) -> decltype(maker())
{
    try {
        return maker();
    } catch (const std::bad_alloc&) {
        logCreationFailed(failure);
        return {};
    }
}
/// The same of an instance without anything but defaults.
template <class T>
Ref<T> makeOrLog(const char* failure)
{
    return madeOrLog(failure, [] { return make<T>(); });
}

inline void set(Property<String>& property, const char* value)
{
    property.set(value);
}
inline void set(Property<String>& property, const String& value)
{
    property.set(value);
}
inline void set(Property<String>& property, const std::string& value)
{
    property.set(String(value.data(), value.size()));
}

/// Numbers, booleans and times; a number is cut to the property's type.
template <class T, class V>
void set(Property<T>& property, const V& value)
{
    property.value = static_cast<T>(value);
    property.null = 0;
}

template <class T>
struct Element {
    using type = T;
};
template <class T>
void set(Property<Array<T>>& property, std::initializer_list<typename Element<T>::type> values)
{
    Array<T> made(values);
    property.value.swap(made);
    property.null = 0;
}
template <class T>
void set(Property<Array<T>>& property, const Array<T>& values)
{
    property.value = values;
    property.null = 0;
}

/// A text by printf rules, of any length.
String text(const char* format, ...) __attribute__((format(printf, 1, 2)));

/// A string of the inventory's as an element of an array.
inline String text_of(const std::string& value)
{
    return String(value.data(), value.size());
}

/// The value of the string property `name` of an instance of any class; empty if there is none or it is null.
String string_property(const Instance* instance, const char* name);

/// Thrown by `insert` to end the whole update that builds the instance.
struct Update_Ended {};

/// Moves `instance` into `map`. A known key, or no memory for one more, logs `failure` (null: "Insert Failed :
/// m_<Class>_map") and frees the instance. Result the instance, now the map's; or null.
Instance* insertOrLog(Instance_Map& map, Ref<Instance> instance, const char* failure = nullptr);

/// The same for an instance without which the whole update ends: where it is refused, Update_Ended is thrown.
Instance* insert(Instance_Map& map, Ref<Instance> instance, const char* failure = nullptr);
template <class T>
T* insert(Map<T>& map, Ref<T> instance, const char* failure = nullptr)
{
    return static_cast<T*>(insert(static_cast<Instance_Map&>(map), Ref<Instance>(instance.release()), failure));
}

/// Logs the failure text of a map.
void logInsertFailed(const Instance_Map& map, const char* failure);

} // namespace cimple
