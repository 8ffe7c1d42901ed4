/// The lifetime of what the broker makes for a module on one thread: a request, or the time a thread is attached.
///
/// A thread has a stack of scopes; new objects go to the innermost one of their broker. The end of a scope frees what
/// the module did not release and enters it in the ledger. Objects may be released from any thread while it lives.
#pragma once

#include "host/objects/Object.h"

#include <deque>
#include <memory>
#include <mutex>
#include <string>

namespace host {

/// The last objects that were released, marked dead.
class Retired_Objects {
public:
    /// Takes one more, and gives the oldest back if there are too many then.
    [[nodiscard]] std::unique_ptr<Object> add(std::unique_ptr<Object> object);
    /// Takes the last ones of another, and gives the oldest back that are too many then.
    [[nodiscard]] Retired_Objects add_last(Retired_Objects& others);

private:
    std::deque<std::unique_ptr<Object>> m_objects;
};

class Scope {
public:
    enum class Sort {
        request,
        attached,     ///< between attachThread and detachThread
        orphans,      ///< what was made on threads that the server does not know
        explicit_life ///< clones and prepared contexts: until released, whatever ends
    };

    Scope(Broker& broker, Sort sort, std::string what);
    /// Frees what is left; `leave` must have come first if `enter` did.
    ~Scope();
    Scope(const Scope&) = delete;
    Scope& operator=(const Scope&) = delete;

    /// Makes it the innermost scope of this thread, and the reverse.
    void enter();
    void leave();
    /// The innermost scope of this thread that belongs to the broker, or null.
    static Scope* current(const Broker& broker);

    void add(Object& object);
    /// Frees an object that the module released, but not at once: a second use of one of the last is still seen.
    void retire(Object& object);
    /// The number of the last object added, and the release of all that came after such a number.
    std::uint64_t mark() const;
    void release_since(std::uint64_t mark);

    Broker& broker() const { return m_broker; }
    Sort sort() const { return m_sort; }
    const std::string& what() const { return m_what; }

    /// Of an attached scope: the context it was attached with.
    const void* context = nullptr;

private:
    Broker& m_broker;
    const Sort m_sort;
    const std::string m_what;
    Scope* m_outer = nullptr;
    mutable std::mutex m_mutex;
    Object* m_first = nullptr;
    Retired_Objects m_retired;
    std::uint64_t m_last_serial = 0;
};

} // namespace host
