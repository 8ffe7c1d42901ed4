/// The management session: its life is the time in which RM_ operations may be called, and its methods are the
/// management operations of the services.
///
/// One instance, owned by the agent. The constructor initialises the management library, guarded by a semaphore named
/// after the process, and throws std::exception if the library refuses; it waits while another thread's instance is
/// initialising. The destructor lets go of the semaphore; the library stays initialised until it is closed.
#pragma once

#include "foundation/management_api.h"

namespace cimple {

class NVR_MethodWrapper {
public:
    NVR_MethodWrapper();
    ~NVR_MethodWrapper();
    NVR_MethodWrapper(const NVR_MethodWrapper&) = delete;
    NVR_MethodWrapper& operator=(const NVR_MethodWrapper&) = delete;

    /// As the function of the same name in NVR_Common.h.
    int string2HBAName(HBA_WWN* wwn, const char* text);
};

} // namespace cimple
