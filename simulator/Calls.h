// The simulated libraries' calls: one exported function `nvrsim_x` for each operation `x`, which the faces forward to.
// Any thread. The tables of foundation/management_api.h are joined here by what only the vendor plug-in offers.
#ifndef _simulator_Calls_h
#define _simulator_Calls_h

#include "foundation/management_api.h"

#define NVRSIM_EXPORT __attribute__((visibility("default")))

/// What a plug-in of the Common HBA API answers beyond the operations of the shared header.
#define NVRSIM_MORE_HBA_OPERATIONS(X)                                                                                  \
    X(HBA_UINT32, HBA_GetVersion, 0, (void), ())                                                                       \
    X(HBA_STATUS, HBA_OpenAdapterByWWN, 1, (HBA_HANDLE * handle, HBA_WWN wwn), (handle, wwn))                          \
    X(HBA_STATUS, HBA_GetPortStatistics, 1,                                                                            \
      (HBA_HANDLE handle, HBA_UINT32 portIndex, HBA_PORTSTATISTICS * statistics), (handle, portIndex, statistics))     \
    X(HBA_STATUS, HBA_GetDiscoveredPortAttributes, 1,                                                                  \
      (HBA_HANDLE handle, HBA_UINT32 portIndex, HBA_UINT32 discovered, HBA_PORTATTRIBUTES * attributes),               \
      (handle, portIndex, discovered, attributes))                                                                     \
    X(HBA_STATUS, HBA_GetPortAttributesByWWN, 1,                                                                       \
      (HBA_HANDLE handle, HBA_WWN portWwn, HBA_PORTATTRIBUTES * attributes), (handle, portWwn, attributes))            \
    X(void, HBA_RefreshAdapterConfiguration, (void)0, (void), ())                                                      \
    X(void, HBA_ResetStatistics, (void)0, (HBA_HANDLE handle, HBA_UINT32 portIndex), (handle, portIndex))              \
    X(HBA_STATUS, HBA_GetFcpTargetMappingV2, 1,                                                                        \
      (HBA_HANDLE handle, HBA_WWN portWwn, HBA_FCPTARGETMAPPINGV2 * mapping), (handle, portWwn, mapping))              \
    X(HBA_STATUS, HBA_ScsiInquiryV2, 1,                                                                                \
      (HBA_HANDLE handle, HBA_WWN portWwn, HBA_WWN target, HBA_UINT64 lun, HBA_UINT8 cdb1, HBA_UINT8 cdb2,             \
       void* response, HBA_UINT32* responseSize, HBA_UINT8* scsiStatus, void* sense, HBA_UINT32* senseSize),           \
      (handle, portWwn, target, lun, cdb1, cdb2, response, responseSize, scsiStatus, sense, senseSize))                \
    X(HBA_STATUS, HBA_ScsiReadCapacityV2, 1,                                                                           \
      (HBA_HANDLE handle, HBA_WWN portWwn, HBA_WWN target, HBA_UINT64 lun, void* response, HBA_UINT32* responseSize,   \
       HBA_UINT8* scsiStatus, void* sense, HBA_UINT32* senseSize),                                                     \
      (handle, portWwn, target, lun, response, responseSize, scsiStatus, sense, senseSize))

/// Of plug-ins only: the wrapper library has another function of this name.
#define NVRSIM_PLUGIN_OPERATIONS(X)                                                                                    \
    X(HBA_UINT32, HBA_GetVendorLibraryAttributes, 0, (HBA_LIBRARYATTRIBUTES * attributes), (attributes))

#define NVRSIM_ALL_OPERATIONS(X)                                                                                       \
    NVR_MANAGEMENT_OPERATIONS(X)                                                                                       \
    NVR_PLAIN_MANAGEMENT_OPERATIONS(X)                                                                                 \
    NVR_HBA_OPERATIONS(X) NVRSIM_MORE_HBA_OPERATIONS(X) NVRSIM_PLUGIN_OPERATIONS(X) NVR_CPQFC_OPERATIONS(X)

extern "C" {
#define NVRSIM_DECLARE(result, name, missing, parameters, arguments) NVRSIM_EXPORT result nvrsim_##name parameters;
NVRSIM_ALL_OPERATIONS(NVRSIM_DECLARE)
#undef NVRSIM_DECLARE
}

#endif // _simulator_Calls_h
