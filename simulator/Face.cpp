// A face: one of the closed libraries' names over the core. Which families it carries, and under which prefix, is said
// by definitions at compile time (NVRSIM_FACE_*); what a variant lacks is hidden by its version script.
#include "simulator/Calls.h"

// The system's header has declared the HBA_* functions already, with names of its own.
#pragma GCC diagnostic ignored "-Wmissing-declarations"

#define FACE(result, name, missing, parameters, arguments)                                                             \
    NVRSIM_EXPORT result name parameters                                                                               \
    {                                                                                                                  \
        return nvrsim_##name arguments;                                                                                \
    }
#define FACE_WITH_L(result, name, missing, parameters, arguments)                                                      \
    NVRSIM_EXPORT result L##name parameters                                                                            \
    {                                                                                                                  \
        return nvrsim_##name arguments;                                                                                \
    }

extern "C" {
#ifdef NVRSIM_FACE_LRM
NVR_MANAGEMENT_OPERATIONS(FACE_WITH_L)
#endif
#ifdef NVRSIM_FACE_RM
NVR_MANAGEMENT_OPERATIONS(FACE)
#endif
#ifdef NVRSIM_FACE_PLAIN
NVR_PLAIN_MANAGEMENT_OPERATIONS(FACE)
#endif
#ifdef NVRSIM_FACE_HBA
NVR_HBA_OPERATIONS(FACE)
NVRSIM_MORE_HBA_OPERATIONS(FACE)
#endif
#ifdef NVRSIM_FACE_CPQFC
NVR_CPQFC_OPERATIONS(FACE)
#endif
}
