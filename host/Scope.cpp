#include "host/Scope.h"

#include <algorithm>

#include "host/Broker.h"

namespace host {
namespace {
thread_local Scope* innermost = nullptr;
constexpr std::size_t most_retired = 256;
constexpr std::size_t most_kept = 32; // of a scope that ends
} // namespace

std::unique_ptr<Object> Retired_Objects::add(std::unique_ptr<Object> object)
{
    m_objects.push_back(std::move(object));
    if (m_objects.size() <= most_retired) return nullptr;
    std::unique_ptr<Object> oldest = std::move(m_objects.front());
    m_objects.pop_front();
    return oldest;
}

Retired_Objects Retired_Objects::add_last(Retired_Objects& others)
{
    Retired_Objects oldest;
    const std::size_t count = std::min(others.m_objects.size(), most_kept);
    for (auto object = others.m_objects.end() - static_cast<std::ptrdiff_t>(count); object != others.m_objects.end();
         ++object)
        if (std::unique_ptr<Object> one = add(std::move(*object))) oldest.m_objects.push_back(std::move(one));
    return oldest;
}

Scope::Scope(Broker& broker, Sort sort, std::string what) : m_broker(broker), m_sort(sort), m_what(std::move(what)) {}

Scope::~Scope()
{
    while (Object* object = m_first) {
        m_first = object->next;
        bool held =
            m_sort == Sort::attached && object->kind == Object_Kind::enumeration && object->origin == Origin::made;
        if (held) m_broker.violation(m_what + ": an enumeration of an up-call is still held at the detach");
        m_broker.ledger().settled(object->kind, object->origin);
        delete object;
    }
    m_broker.keep(m_retired);
}

void Scope::enter()
{
    m_outer = innermost;
    innermost = this;
}

void Scope::leave()
{
    // An attachment that ended out of order is somewhere below the innermost.
    for (Scope** link = &innermost; *link; link = &(*link)->m_outer)
        if (*link == this) {
            *link = m_outer;
            return;
        }
}

Scope* Scope::current(const Broker& broker)
{
    for (Scope* scope = innermost; scope; scope = scope->m_outer)
        if (&scope->m_broker == &broker) return scope;
    return nullptr;
}

void Scope::add(Object& object)
{
    std::lock_guard lock(m_mutex);
    object.scope = this;
    object.serial = ++m_last_serial;
    object.next = m_first;
    object.previous = nullptr;
    if (m_first) m_first->previous = &object;
    m_first = &object;
}

void Scope::retire(Object& object)
{
    std::unique_ptr<Object> oldest; // freed without the mutex
    std::lock_guard lock(m_mutex);
    if (object.previous)
        object.previous->next = object.next;
    else
        m_first = object.next;
    if (object.next) object.next->previous = object.previous;
    object.previous = object.next = nullptr;
    object.scope = nullptr;
    object.magic = Object::dead;
    oldest = m_retired.add(std::unique_ptr<Object>(&object));
}

std::uint64_t Scope::mark() const
{
    std::lock_guard lock(m_mutex);
    return m_last_serial;
}

void Scope::release_since(std::uint64_t mark)
{
    for (;;) {
        Object* object = nullptr;
        {
            // The list runs from the newest to the oldest.
            std::lock_guard lock(m_mutex);
            object = m_first;
            while (object && object->serial > mark && object->origin == Origin::lent)
                object = object->next;
        }
        if (!object || object->serial <= mark) return;
        release_object(object, object->kind);
    }
}

} // namespace host
