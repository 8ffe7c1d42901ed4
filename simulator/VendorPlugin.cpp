// A plug-in for the system's libHBAAPI: the same simulated host, offered by the registration functions of
// vendorhbaapi.h. The wrapper library finds it by a line of its hba.conf.
#include "simulator/Calls.h"

#include <vendorhbaapi.h>

#include <cstring>

namespace {

/// What both versions of the table begin with. Entries that stay null are functions that this plug-in lacks.
template <class Table>
void fill_first(Table& table)
{
    std::memset(&table, 0, sizeof table);
    table.GetVersionHandler = nvrsim_HBA_GetVersion;
    table.LoadLibraryHandler = nvrsim_HBA_LoadLibrary;
    table.FreeLibraryHandler = nvrsim_HBA_FreeLibrary;
    table.GetNumberOfAdaptersHandler = nvrsim_HBA_GetNumberOfAdapters;
    table.GetAdapterNameHandler = nvrsim_HBA_GetAdapterName;
    table.OpenAdapterHandler = nvrsim_HBA_OpenAdapter;
    table.CloseAdapterHandler = nvrsim_HBA_CloseAdapter;
    table.GetAdapterAttributesHandler = nvrsim_HBA_GetAdapterAttributes;
    table.GetAdapterPortAttributesHandler = nvrsim_HBA_GetAdapterPortAttributes;
    table.GetPortStatisticsHandler = nvrsim_HBA_GetPortStatistics;
    table.GetDiscoveredPortAttributesHandler = nvrsim_HBA_GetDiscoveredPortAttributes;
    table.GetPortAttributesByWWNHandler = nvrsim_HBA_GetPortAttributesByWWN;
    table.RefreshInformationHandler = nvrsim_HBA_RefreshInformation;
    table.ResetStatisticsHandler = nvrsim_HBA_ResetStatistics;
    table.GetFcpTargetMappingHandler = nvrsim_HBA_GetFcpTargetMapping;
    table.ScsiInquiryHandler = nvrsim_HBA_SendScsiInquiry;
    table.ReadCapacityHandler = nvrsim_HBA_SendReadCapacity;
}

} // namespace

extern "C" {

NVRSIM_EXPORT HBA_STATUS HBA_RegisterLibrary(HBA_ENTRYPOINTS* table)
{
    if (!table) return HBA_STATUS_ERROR_ARG;
    fill_first(*table);
    return HBA_STATUS_OK;
}

NVRSIM_EXPORT HBA_STATUS HBA_RegisterLibraryV2(HBA_ENTRYPOINTSV2* table)
{
    if (!table) return HBA_STATUS_ERROR_ARG;
    fill_first(*table);
    table->OpenAdapterByWWNHandler = nvrsim_HBA_OpenAdapterByWWN;
    table->GetFcpTargetMappingV2Handler = nvrsim_HBA_GetFcpTargetMappingV2;
    table->RefreshAdapterConfigurationHandler = nvrsim_HBA_RefreshAdapterConfiguration;
    table->ScsiInquiryV2Handler = nvrsim_HBA_ScsiInquiryV2;
    table->ScsiReadCapacityV2Handler = nvrsim_HBA_ScsiReadCapacityV2;
    table->GetVendorLibraryAttributesHandler = nvrsim_HBA_GetVendorLibraryAttributes;
    table->RemoveCallbackHandler = nvrsim_HBA_RemoveCallback;
    table->RegisterForAdapterPortEventsHandler = nvrsim_HBA_RegisterForAdapterPortEvents;
    return HBA_STATUS_OK;
}

} // extern "C"
