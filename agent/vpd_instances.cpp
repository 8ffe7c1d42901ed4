// The vital product data of a port.
#include "agent/ProviderAgent.h"
#include "agent/instance_table.h"
#include "agent/library_name.h"
#include "agent/port_data_instances.h"
#include "agent/vpd.h"
#include "classes/NVRHBA_VitalProductData.h"
#include "foundation/CLogger.h"
#include "foundation/management_binding.h"

namespace cimple {

namespace {

struct Vpd_Row {
    const char* tag;
    Property<String> NVRHBA_VitalProductData::*property;
};

constexpr Vpd_Row vpd_rows[] = {
    {vpd_product_name, &NVRHBA_VitalProductData::ProductName},
    {"SN", &NVRHBA_VitalProductData::VPDSerialNumber},
    {"PN", &NVRHBA_VitalProductData::PartNumber},
    {"V0", &NVRHBA_VitalProductData::FieldV0},
    {"V1", &NVRHBA_VitalProductData::FieldV1},
    {"V2", &NVRHBA_VitalProductData::FieldV2},
    {"V3", &NVRHBA_VitalProductData::FieldV3},
    {"V4", &NVRHBA_VitalProductData::FieldV4},
    {"V5", &NVRHBA_VitalProductData::FieldV5},
    {"VB", &NVRHBA_VitalProductData::FieldVB},
};

Property<String>* propertyOf(NVRHBA_VitalProductData& vpd, const std::string& tag)
{
    for (const Vpd_Row& row : vpd_rows)
        if (tag == row.tag) return &(vpd.*row.property);
    return nullptr;
}

} // namespace

uint32 CreateVPD(ProviderAgent& agent, const char* wwpn, Instance*& made)
{
    NVR_LOG("Inside CreateVPD");
    made = nullptr;
    HBA_WWN wwn = {};
    if (!library_name(wwn, wwpn, "Id2HBAName failed", "str2HBAName failed")) return RM_STATUS_ERROR;
    std::vector<Vpd_Entry> entries;
    if (const uint32 status = readVPD(wwn, entries)) {
        NVR_LOG("ERROR: RM_GetVPD call failed : %d", static_cast<int>(status));
        return status;
    }
    auto vpd = make<NVRHBA_VitalProductData>();
    set(vpd->InstanceID, wwpn);
    Array<String> tags;
    Array<String> values;
    for (const Vpd_Entry& entry : entries) {
        NVR_LOG("%s--%s", entry.first.c_str(), entry.second.c_str());
        if (Property<String>* property = propertyOf(*vpd, entry.first)) {
            set(*property, entry.second);
            continue;
        }
        tags.append(text_of(entry.first));
        values.append(text_of(entry.second));
    }
    if (tags.size() != 0) {
        set(vpd->VPDTags, tags);
        set(vpd->VPDTagValues, values);
    }
    made = insertOrLog(agent.m_NVRHBA_VitalProductData_map, Ref<Instance>(vpd.release()));
    return made ? 0 : RM_STATUS_ERROR;
}

} // namespace cimple
