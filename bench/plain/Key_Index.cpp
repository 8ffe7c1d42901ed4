// Keys are looked for from the first element to the last, as key_eq says.
#include "agent/Key_Index.h"

namespace cimple {

Key_Index::Entry Key_Index::entry_of(const Instance*)
{
    return {0, true};
}

void Key_Index::append(const Entry&, const Array<Instance*>&) {}

void Key_Index::remove(std::size_t) {}

void Key_Index::clear() {}

int Key_Index::find(const Instance* key, const Array<Instance*>& list) const
{
    for (std::size_t i = 0; i < list.size(); i++)
        if (key_eq(key, list[i])) return static_cast<int>(i);
    return -1;
}

int Key_Index::find(const Entry&, const Instance* key, const Array<Instance*>& list) const
{
    return find(key, list);
}

} // namespace cimple
