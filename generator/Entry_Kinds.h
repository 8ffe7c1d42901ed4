#pragma once

#include "mof/Model.h"

#include <vector>

namespace generator {

enum class Class_Kind { plain, association, indication };

/// What a class's flags make it.
Class_Kind kind_of(const mof::Class& target);

/// A kind of provider interface that a class exports: word in the factory's name, and letter for the bridge.
struct Entry_Kind {
    const char* word;
    char letter;
};

/// The kinds of a class that has a provider, in the order of its factories.
std::vector<Entry_Kind> entries_of(const mof::Class& target);

} // namespace generator
