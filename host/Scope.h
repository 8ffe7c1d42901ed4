/// The lifetime of what the broker makes for a module on one thread: a request, or the time a thread is attached.
///
/// A thread has a stack of scopes; new objects go to the innermost one of their broker. The end of a scope frees what
/// the module did not release and enters it in the ledger. Objects may be released from any thread while it lives.
#pragma once

#include "host/objects/Object.h"

#include <mutex>
#include <string>

namespace host {

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
    /// Takes an object out of the list; it is the caller's then.
    void remove(Object& object);
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
    std::uint64_t m_last_serial = 0;
};

} // namespace host
