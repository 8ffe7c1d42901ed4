// One library: FACE is its name; FACE_HBA, FACE_CPQFC, FACE_LONG, FACE_SHORT and FACE_PLAIN say which operations it has
// (FACE_LONG: LRM_ names, FACE_SHORT: RM_ names of the management operations). FACE_LACKS_GETVPD leaves one symbol out.

#include "tests/foundation/fakes/fake_libraries.h"

namespace {

template <class Result>
Result nothing()
{
    return Result();
}

} // namespace

#ifdef FACE_LACKS_GETVPD
#define LRM_GetVPD LRM_GetVPD_by_another_name
#endif

#define TEXT(x) TEXT_OF(x)
#define TEXT_OF(x) #x

#define DEFINE(result, symbol, operation, parameters, arguments)                                                       \
    extern "C" __attribute__((visibility("default"))) result symbol parameters                                         \
    {                                                                                                                  \
        fake::record_call(FACE ":" TEXT(symbol));                                                                      \
        const auto& definition = fake::operations().operation;                                                         \
        return definition ? definition arguments : nothing<result>();                                                  \
    }
#define DEFINE_LONG(result, name, missing, parameters, arguments) DEFINE(result, L##name, name, parameters, arguments)
#define DEFINE_SAME(result, name, missing, parameters, arguments) DEFINE(result, name, name, parameters, arguments)

#ifdef FACE_LONG
NVR_MANAGEMENT_OPERATIONS(DEFINE_LONG)
#endif
#ifdef FACE_SHORT
NVR_MANAGEMENT_OPERATIONS(DEFINE_SAME)
#endif
#ifdef FACE_PLAIN
NVR_PLAIN_MANAGEMENT_OPERATIONS(DEFINE_SAME)
#endif
#ifdef FACE_HBA
NVR_HBA_OPERATIONS(DEFINE_SAME)
#endif
#ifdef FACE_CPQFC
NVR_CPQFC_OPERATIONS(DEFINE_SAME)
#endif
