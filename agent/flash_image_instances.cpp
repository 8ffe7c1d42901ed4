// The images in a port's flash.
#include <algorithm>

#include "agent/ProviderAgent.h"
#include "agent/associations.h"
#include "agent/instance_table.h"
#include "agent/library_name.h"
#include "agent/port_data_instances.h"
#include "agent/version_properties.h"
#include "classes/NVRHBA_FlashImageSoftwareIdentity.h"
#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "inventory/AdapterAttributes.h"

namespace cimple {

namespace {

constexpr uint16 class_firmware = 10;

/// The record behind the last image ends the list and is counted with them.
uint32 imagesIn(const RM_FLASHCONTENTS& contents)
{
    return contents.count < 2 ? 0 : std::min(contents.count - 1, RM_FLASH_MAX_IMAGES);
}

Ref<NVRHBA_FlashImageSoftwareIdentity> makeImage(const RM_FLASHIMAGE& image, const FCAdapterAttributes& adapter,
                                                 const char* wwpn)
{
    const std::string version = fieldText(image.version);
    const String name = text("FC HBA Flash Image %s v %s %s %s", fieldText(image.name).c_str(), version.c_str(),
                             adapter._Model.c_str(), wwpn);
    auto made = make<NVRHBA_FlashImageSoftwareIdentity>();
    set(made->InstanceID, name);
    set(made->Name, name);
    set(made->ElementName, name);
    set(made->Description, "FC HBA Flash Image");
    set(made->VersionString, version);
    setVersion(*made, version, "FlashContentsInstance ");
    set(made->Manufacturer, adapter._Manufacturer);
    set(made->Classifications, {class_firmware});
    set(made->ClassificationDescriptions, {"Firmware Kernel"});
    set(made->IsEntity, true);
    return made;
}

} // namespace

uint32 createFlashImages(ProviderAgent& agent, const char* wwpn, const FCAdapterAttributes& adapter,
                         const Instance* controller)
{
    HBA_WWN wwn = {};
    if (!library_name(wwn, wwpn, "Id2HBAName failed", "str2HBAName failed")) return RM_STATUS_ERROR;
    RM_FLASHCONTENTS contents = {};
    if (const uint32 status = RM_DiagGetLoadListParams(wwn, &contents)) {
        NVR_LOG("Failed to retrieve the flash contents. Exited with ErrorCode %d", static_cast<int>(status));
        return status;
    }
    NVR_LOG("Generating NVRHBA_FlashImageSoftwareIdentity.");
    const uint32 images = imagesIn(contents);
    for (uint32 i = 0; i < images; i++) {
        auto made = makeImage(contents.image[i], adapter, wwpn);
        const Instance* image =
            insertOrLog(agent.m_NVRHBA_FlashImageSoftwareIdentity_map, Ref<Instance>(made.release()),
                        "Insert Failed : m_NVRHBA_FlashImageSoftwareIdentity_map ");
        if (!image || !associate(agent, Link::ElementFlashImageSoftwareIdentity, image, controller))
            return RM_STATUS_ERROR;
    }
    NVR_LOG("Success...");
    return 0;
}

} // namespace cimple
