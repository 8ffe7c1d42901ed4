#include "agent/Instance_Map.h"

#include <utility>

namespace cimple {

int Instance_Map::find(const Instance* key) const
{
    if (!key) return -1;
    return m_index.find(key, m_instances);
}

Instance* Instance_Map::lookup(const Instance* key) const
{
    const int index = find(key);
    return index < 0 ? nullptr : m_instances[static_cast<std::size_t>(index)];
}

int Instance_Map::insert(Instance* instance)
{
    if (!instance) return -1;
    const Key_Index::Entry entry = m_index.entry_of(instance);
    if (m_index.find(entry, instance, m_instances) >= 0) return -1;
    m_instances.append(instance);
    try {
        m_index.append(entry, m_instances);
    } catch (...) {
        // Without memory the caller keeps its instance, as after any refusal, and the list stays as it was.
        m_instances.remove(m_instances.size() - 1);
        throw;
    }
    return static_cast<int>(m_instances.size() - 1);
}

int Instance_Map::create(const Instance* instance)
{
    if (find(instance) >= 0) return CREATE_INSTANCE_DUPLICATE;
    Ref<Instance> copy(clone(instance));
    if (insert(copy.get()) < 0) return CREATE_INSTANCE_FAILED;
    copy.release();
    return CREATE_INSTANCE_OK;
}

int Instance_Map::get(const Instance* key, Instance*& out) const
{
    const Instance* found = lookup(key);
    if (!found) return GET_INSTANCE_NOT_FOUND;
    out = clone(found);
    return GET_INSTANCE_OK;
}

int Instance_Map::modify(const Instance* model, const Instance* instance)
{
    Instance* found = lookup(instance);
    if (!found) return MODIFY_INSTANCE_NOT_FOUND;
    copy(found, instance, model);
    return MODIFY_INSTANCE_OK;
}

int Instance_Map::remove(const Instance* key)
{
    const int index = find(key);
    if (index < 0) return DELETE_INSTANCE_NOT_FOUND;
    Ref<Instance> removed(m_instances[static_cast<std::size_t>(index)]);
    remove_at(static_cast<std::size_t>(index));
    return DELETE_INSTANCE_OK;
}

void Instance_Map::remove_at(std::size_t index)
{
    if (index >= m_instances.size()) return;
    m_instances.remove(index);
    m_index.remove(index);
}

void Instance_Map::clear()
{
    for (Instance* instance : m_instances)
        unref(instance);
    m_instances.clear();
    m_index.clear();
}

void Instance_Map::swap(Instance_Map& other) noexcept
{
    m_instances.swap(other.m_instances);
    std::swap(m_index, other.m_index);
}

int Instance_Map::for_each(const Enum_Handler& handler) const
{
    for (const Instance* instance : m_instances)
        handler.handle(clone(instance));
    return 0;
}

void Instance_Map::hand_over(const Enum_Handler& handler)
{
    Array<Instance*> mine;
    mine.swap(m_instances);
    m_index.clear();
    std::size_t next = 0;
    try {
        while (next < mine.size())
            handler.handle(mine[next++]);
    } catch (...) {
        while (next < mine.size())
            unref(mine[next++]);
        throw;
    }
}

} // namespace cimple
