/// Which ends of an association instance belong to a source: the traversal behind associators and references.
///
/// Pure functions over instances and class records; any thread that may read the instances. A reference holds the
/// source if its target class is the source's class or a superclass of it and the keys agree. Reference arrays are no
/// ends. Role names compare without case; an empty String means any.
#pragma once

#include "runtime/Instance.h"

namespace cimple {

/// True if a reference of `association` that fits `role` holds `source`. False for null instances.
bool ref_of(const Instance* source, const Instance* association, const String& role);

/// Appends to `result` the far ends of `association` as seen from `source`: the non-null references that do not hold
/// it, whose class or one of its superclasses is named `result_class`, under the name `result_role`. The pointers are
/// borrowed from `association`. Result: the number appended, or -1 if no near end fits `role` (nothing is appended
/// then, and none for null instances).
int get_associators(const Instance* source, const Instance* association, const String& result_class, const String& role,
                    const String& result_role, Array<Instance*>& result);

} // namespace cimple
