/// A hash index over the keys of a list of instances, beside the list that owns them.
///
/// key_eq is not symmetric across classes, so the index answers only where it can be exact: for a key and elements of
/// one shape (the same classes, or classes with the very same keys, in the instance and in all that its key references
/// reach). A list that holds an instance of another shape, or is asked for one, is scanned. No locks: the owner of the
/// list sees to that.
#pragma once

#include <cstddef>
#include <vector>

#include "runtime/Instance.h"

namespace cimple {

class Key_Index {
public:
    /// What the index knows of an instance: made once, for the search and for the place.
    struct Entry {
        uint32 hash;
        bool strange; // of another shape than the list's first element: it has no hash, and no slot
    };
    /// The entry of an instance that may be appended; the first one gives the index its shape.
    Entry entry_of(const Instance* instance);
    /// Notes the element that has just been appended to `list`. An exception leaves the index as it was.
    void append(const Entry& entry, const Array<Instance*>& list);
    /// Notes that the element at `position` has left the list.
    void remove(std::size_t position);
    /// Forgets all elements and their shape.
    void clear();

    /// The position of the first element of `list` whose keys agree with `key`'s, or -1.
    int find(const Instance* key, const Array<Instance*>& list) const;
    /// The same for a key whose entry was made.
    int find(const Entry& entry, const Instance* key, const Array<Instance*>& list) const;

private:
    /// The hash of an instance of this index's shape; false for another shape.
    bool hash(const Instance* instance, uint32& value) const;
    bool walk(const Instance* instance, std::size_t& depth, uint64& value) const;
    void learn_shape(const Instance* instance);

    /// One instance of the shape: its class (null: no instance) and its keys, `count` of m_keys from `first` on.
    struct Node {
        const Meta_Class* meta_class;
        std::size_t first, count;
    };
    std::vector<Node> m_shape; // in walking order; of the first element
    std::vector<const Meta_Feature*> m_keys;
    /// A lookup reads one place of memory, and an element only where its hash agrees.
    struct Slot {
        uint32 hash = 0;
        uint32 position = 0; // behind it by one; 0: free
    };
    static void place(std::vector<Slot>& slots, const Slot& slot);
    std::size_t m_strangers = 0;
    std::vector<Slot> m_slots; // open addressing; a power of two, at most half full
};

} // namespace cimple
