/// What a provider of indications is given to raise them.
#pragma once

#include "runtime/Instance.h"

namespace cimple {

/// Delivers `instance`, which it takes over, once to each namespace with an active filter of the adapter `data`; true.
/// Null: false, and nothing is delivered. Called on threads with a thread context of the bridge's (anything else ends
/// the process by assertion). Delivers without any lock, so that a disable may wait for the calling thread.
bool _indication_proc(Instance* instance, void* data);

} // namespace cimple
