/// Clones of a reference array's elements, unreferenced at the end of the scope unless somebody takes them.
///
/// Internal to the runtime. One thread.
#pragma once

#include "runtime/Instance.h"

namespace cimple {

class Owned_References {
public:
    /// Null elements stay null. Throws std::bad_alloc and keeps nothing.
    explicit Owned_References(const Array<Instance*>& source)
    {
        if (source.size() == 0) return;
        m_elements.reserve(source.size());
        for (Instance* element : source) {
            Instance* copy = nullptr;
            m_elements.append(copy); // there is room
            m_elements[m_elements.size() - 1] = clone(element);
        }
    }
    Owned_References(const Owned_References&) = delete;
    Owned_References& operator=(const Owned_References&) = delete;
    ~Owned_References() = default;

    /// Gives the clones to `array` and keeps what it held.
    void swap_with(Array<Instance*>& array) noexcept { m_elements.swap(array); }

private:
    struct Elements : Array<Instance*> {
        ~Elements()
        {
            for (Instance* element : *this)
                unref(element);
        }
    };
    Elements m_elements;
};

} // namespace cimple
