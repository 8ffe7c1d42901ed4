/// A keyed list of the instances of one CIM class, in order of insertion; it owns them.
///
/// Keys agree as key_eq says, asked with the given instance first, so that a model of a base class finds derived ones.
/// No lock: whoever walks or changes an agent's map holds the agent's locks. Readers through operator[] may write the
/// properties of an element, but never its keys. Results are the provider statuses of runtime/Registration.h.
#pragma once

#include <cstddef>

#include "agent/Key_Index.h"
#include "runtime/Instance.h"
#include "runtime/Registration.h"

namespace cimple {

class Instance_Map {
public:
    explicit Instance_Map(const Meta_Class* meta_class) : m_meta_class(meta_class) {}
    ~Instance_Map() { clear(); }
    Instance_Map(const Instance_Map&) = delete;
    Instance_Map& operator=(const Instance_Map&) = delete;

    const Meta_Class* meta_class() const { return m_meta_class; }
    std::size_t size() const { return m_instances.size(); }
    bool empty() const { return size() == 0; }
    /// The element at a valid index; it stays the map's.
    Instance* operator[](std::size_t index) const { return m_instances[index]; }

    /// The index of the first element whose keys agree with `key`'s, or -1. A null key finds nothing.
    int find(const Instance* key) const;
    /// That element itself (the map's own), or null.
    Instance* lookup(const Instance* key) const;

    /// Takes `instance` over and gives its index; or -1 for null or a known key: the caller keeps it then.
    int insert(Instance* instance);
    /// Appends a clone: 0, or 80 for a known key.
    int create(const Instance* instance);
    /// Clones the element to the caller: 0, or 60.
    int get(const Instance* key, Instance*& out) const;
    /// Copies those features of `instance` that are not null in `model` into the element with `instance`'s keys: 0, or
    /// 100.
    int modify(const Instance* model, const Instance* instance);
    /// Destroys the element: 0, or 90.
    int remove(const Instance* key);
    /// Gives the element at `index` up without destroying it; an index past the end does nothing.
    void remove_at(std::size_t index);
    void clear();
    /// Exchanges the elements with those of another map of the same class.
    void swap(Instance_Map& other) noexcept;

    /// Hands a clone of each element to `handler`, whatever it answers. Result 0.
    int for_each(const Enum_Handler& handler) const;
    /// Hands the elements themselves over, in order, and leaves the map empty. One that was handed over is the
    /// handler's, also if the handler throws.
    void hand_over(const Enum_Handler& handler);

private:
    const Meta_Class* m_meta_class;
    Array<Instance*> m_instances;
    Key_Index m_index;
};

} // namespace cimple
