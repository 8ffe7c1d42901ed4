/// Storage for an object that is made and never destroyed.
///
/// A CIM server may call exit() while threads of ours still run, and after the last unload code of ours stays mapped:
/// what such a thread may touch must not go away. Use it for process-wide objects whose constructor is not constexpr,
/// as a function-local static: `static Immortal<Thing> thing; return *thing;`.
#pragma once

#include <new>
#include <utility>

namespace cimple {

template <class T>
class Immortal {
public:
    template <class... Args>
    explicit Immortal(Args&&... args)
    {
        new (m_place) T(std::forward<Args>(args)...);
    }
    Immortal(const Immortal&) = delete;
    Immortal& operator=(const Immortal&) = delete;
    T& operator*() { return *std::launder(reinterpret_cast<T*>(m_place)); }
    T* operator->() { return &**this; }

private:
    alignas(T) unsigned char m_place[sizeof(T)];
};

} // namespace cimple
