/// Stand-ins for the adapter maker's libraries whose every operation a test defines: small shared libraries under the
/// libraries' names, all steered by what lies here.
///
///     fake::install({"HBAAPI", "lrmapi"});
///     fake::operations().HBA_GetNumberOfAdapters = [] { return 2u; };
///
/// An operation without a definition answers 0. Needs a private host, whose library folder `install` fills.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "foundation/management_api.h"

namespace fake {

#define NVR_FAKE_OPERATION(result, name, missing, parameters, arguments) std::function<name##_t> name;
struct Operations {
    NVR_MANAGEMENT_OPERATIONS(NVR_FAKE_OPERATION)
    NVR_PLAIN_MANAGEMENT_OPERATIONS(NVR_FAKE_OPERATION)
    NVR_HBA_OPERATIONS(NVR_FAKE_OPERATION)
    NVR_CPQFC_OPERATIONS(NVR_FAKE_OPERATION)
};
#undef NVR_FAKE_OPERATION

Operations& operations();

/// "library:symbol" of each call so far, in order.
std::vector<std::string>& calls();
void record_call(const char* call);

/// Makes exactly these libraries visible to the loader, by base name ("HBAAPI"), or by build and base name where a
/// build of its own is meant: "lrmapi_lacking=lrmapi" (without LRM_GetVPD), "rmapi_short=rmapi" (only RM_ names). A
/// library that is not named is not found, also where the machine has one.
void install(const std::vector<std::string>& libraries);

} // namespace fake
