#include "generator/Entry_Kinds.h"

#include "generator/Catalogue.h"

namespace generator {

Class_Kind kind_of(const mof::Class& target)
{
    const std::uint32_t flags = class_flags(target);
    if (flags & (1u << 7)) return Class_Kind::association;
    return flags & (1u << 19) ? Class_Kind::indication : Class_Kind::plain;
}

std::vector<Entry_Kind> entries_of(const mof::Class& target)
{
    switch (kind_of(target)) {
    case Class_Kind::association:
        return {{"Instance", 'I'}, {"Method", 'M'}, {"Association", 'A'}};
    case Class_Kind::indication:
        return {{"Indication", 'N'}, {"Method", 'M'}};
    default:
        return {{"Instance", 'I'}, {"Method", 'M'}};
    }
}

} // namespace generator
