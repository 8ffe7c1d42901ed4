/// The inventory's catch-alls: a part of the tree that fails costs only itself.
#pragma once

#include "foundation/CLogger.h"
#include "runtime/guarded.h"

namespace cimple {

/// Runs `body`; if it throws anything, runs `words`. Result true if it did not throw. A thread that is being cancelled
/// goes on being so.
template <class Body, class Words>
bool attempt(Body body, Words words)
{
    if (guarded(body)) return true;
    words();
    return false;
}

/// Deletes an owned part; a deletion that throws is logged with `words` and leaves the pointer as it was.
template <class T>
void deletePart(T*& part, const char* words)
{
    attempt(
        [&] {
            delete part;
            part = nullptr;
        },
        [&] { NVR_LOG("%s", words); });
}

} // namespace cimple
