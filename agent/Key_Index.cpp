#include "agent/Key_Index.h"

#include <algorithm>
#include <cstring>

namespace cimple {

namespace {

constexpr std::size_t first_slots = 16;

void mix(uint64& value, uint64 word)
{
    value = (value ^ word) * 0x9E3779B97F4A7C15u;
    value ^= value >> 29;
}

void mix_text(uint64& value, const String& text)
{
    const char* bytes = text.c_str();
    std::size_t left = text.size();
    mix(value, left);
    for (; left >= 8; left -= 8, bytes += 8) {
        uint64 word;
        std::memcpy(&word, bytes, 8);
        mix(value, word);
    }
    uint64 tail = 0;
    std::memcpy(&tail, bytes, left);
    mix(value, tail);
}

/// Values that can be equal without the same bytes (reals, times) and arrays add nothing: key_eq decides there.
void mix_property(uint64& value, const Instance* instance, const Meta_Property* property)
{
    mix(value, null_of(instance, property));
    if (property->subscript != 0) return;
    const void* place = feature_at(instance, property->offset);
    switch (property->type) {
    case STRING:
        mix_text(value, *static_cast<const String*>(place));
        break;
    case REAL32:
    case REAL64:
    case DATETIME:
        break;
    default: {
        uint64 word = 0;
        std::memcpy(&word, place, type_sizes[property->type]);
        mix(value, word);
    }
    }
}

/// True for the features that key_eq looks at.
bool is_compared(const Meta_Feature* feature)
{
    if (!is_key(feature)) return false;
    return is_property(feature) || (is_reference(feature) && as_reference(feature)->subscript == 0);
}

/// True if key_eq looks at the very same features, in the same places, of instances of the two classes: it is symmetric
/// between them then.
bool share_keys(const Meta_Class* a, const Meta_Class* b)
{
    if (!a || !b) return a == b;
    const std::size_t most = std::max(a->num_meta_features, b->num_meta_features);
    const auto key_of = [](const Meta_Class* of, std::size_t i) -> const Meta_Feature* {
        return i < of->num_meta_features && is_compared(of->meta_features[i]) ? of->meta_features[i] : nullptr;
    };
    for (std::size_t i = 0; i < most; i++)
        if (key_of(a, i) != key_of(b, i)) return false;
    return true;
}

} // namespace

bool Key_Index::walk(const Instance* instance, std::size_t& depth, uint64& value) const
{
    const Meta_Class* meta_class = instance ? instance->meta_class : nullptr;
    if (depth == m_shape.size()) return false;
    if (m_shape[depth].meta_class != meta_class && !share_keys(m_shape[depth].meta_class, meta_class)) return false;
    const Node& node = m_shape[depth++];
    for (std::size_t i = node.first; i < node.first + node.count; i++) {
        const Meta_Feature* key = m_keys[i];
        if (is_property(key))
            mix_property(value, instance, as_property(key));
        else if (!walk(reference_of(instance, as_reference(key)), depth, value))
            return false;
    }
    return true;
}

bool Key_Index::hash(const Instance* instance, uint32& value) const
{
    std::size_t depth = 0;
    uint64 mixed = 0;
    const bool has_shape = walk(instance, depth, mixed);
    value = static_cast<uint32>(mixed >> 32);
    return has_shape;
}

void Key_Index::learn_shape(const Instance* instance)
{
    const std::size_t first = m_keys.size();
    if (instance)
        for (const Meta_Feature* feature : features_of(instance->meta_class))
            if (is_compared(feature)) m_keys.push_back(feature);
    const std::size_t count = m_keys.size() - first;
    m_shape.push_back({instance ? instance->meta_class : nullptr, first, count});
    for (std::size_t i = first; i < first + count; i++)
        if (is_reference(m_keys[i])) learn_shape(reference_of(instance, as_reference(m_keys[i])));
}

Key_Index::Entry Key_Index::entry_of(const Instance* instance)
{
    if (m_shape.empty()) learn_shape(instance);
    Entry entry{0, false};
    entry.strange = !hash(instance, entry.hash);
    return entry;
}

void Key_Index::append(const Entry& entry, const Array<Instance*>& list)
{
    if (m_slots.size() < 2 * list.size()) {
        std::vector<Slot> wider(m_slots.empty() ? first_slots : 2 * m_slots.size());
        for (const Slot& slot : m_slots)
            if (slot.position != 0) place(wider, slot);
        m_slots.swap(wider);
    }
    if (entry.strange)
        m_strangers++;
    else
        place(m_slots, {entry.hash, static_cast<uint32>(list.size())});
}

void Key_Index::place(std::vector<Slot>& slots, const Slot& slot)
{
    std::size_t i = slot.hash & (slots.size() - 1);
    while (slots[i].position != 0)
        i = (i + 1) & (slots.size() - 1);
    slots[i] = slot;
}

void Key_Index::remove(std::size_t position)
{
    const std::size_t last = m_slots.size() - 1;
    std::size_t hole = m_slots.size();
    for (std::size_t i = 0; i < m_slots.size(); i++) {
        if (m_slots[i].position == position + 1)
            hole = i;
        else if (m_slots[i].position > position + 1)
            m_slots[i].position--;
    }
    if (hole == m_slots.size()) {
        m_strangers--;
        return;
    }
    // What stands behind the hole moves into it, unless it would come to stand before the place of its hash.
    for (std::size_t i = (hole + 1) & last; m_slots[i].position != 0; i = (i + 1) & last) {
        if (((i - m_slots[i].hash) & last) < ((i - hole) & last)) continue;
        m_slots[hole] = m_slots[i];
        hole = i;
    }
    m_slots[hole] = Slot();
}

void Key_Index::clear()
{
    *this = Key_Index();
}

int Key_Index::find(const Instance* key, const Array<Instance*>& list) const
{
    Entry entry{0, false};
    entry.strange = !hash(key, entry.hash);
    return find(entry, key, list);
}

int Key_Index::find(const Entry& entry, const Instance* key, const Array<Instance*>& list) const
{
    if (list.size() == 0) return -1;
    if (m_strangers != 0 || entry.strange) {
        for (std::size_t i = 0; i < list.size(); i++)
            if (key_eq(key, list[i])) return static_cast<int>(i);
        return -1;
    }
    for (std::size_t i = entry.hash & (m_slots.size() - 1); m_slots[i].position != 0;
         i = (i + 1) & (m_slots.size() - 1)) {
        const Slot& slot = m_slots[i];
        if (slot.hash == entry.hash && key_eq(key, list[slot.position - 1])) return static_cast<int>(slot.position - 1);
    }
    return -1;
}

} // namespace cimple
