// The software identities: of the provider, the driver, the diagnostics, and of each port's firmware.
#include "agent/Adapter_Update.h"
#include "agent/version_properties.h"
#include "agent/walk_ports.h"
#include "classes/NVRHBA_SoftwareIdentity.h"
#include "foundation/CLogger.h"
#include "inventory/AdapterAttributes.h"

namespace cimple {

namespace {

/// Classifications.
constexpr uint16 class_other = 1;
constexpr uint16 class_driver = 2;
constexpr uint16 class_configuration = 3;
constexpr uint16 class_application = 4;
constexpr uint16 class_diagnostics = 7;
constexpr uint16 class_firmware = 10;
constexpr uint16 class_boot_code = 11;

Ref<NVRHBA_SoftwareIdentity> makeIdentity(const String& id, const char* description, const String& version,
                                          uint16 classification, const char* classification_text)
{
    auto identity = make<NVRHBA_SoftwareIdentity>();
    set(identity->InstanceID, id);
    set(identity->ElementName, id);
    set(identity->Description, description);
    set(identity->VersionString, version);
    set(identity->Classifications, {classification});
    set(identity->ClassificationDescriptions, {classification_text});
    set(identity->IsEntity, true);
    return identity;
}

} // namespace

Instance* Adapter_Update::insertIdentity(Ref<NVRHBA_SoftwareIdentity> identity)
{
    return insert(m_agent.m_NVRHBA_SoftwareIdentity_map, identity);
}

void Adapter_Update::buildProviderIdentity()
{
    const String version = text("%d.%d.%d-%d", agent_major, agent_minor, agent_revision, agent_build);
    const String name = text("Norvane CMPI HBA Provider v%s", version.c_str());
    auto identity =
        makeIdentity(name, "Norvane CMPI HBA Provider", version, class_application, "CMPI HBA CIM Provider");
    set(identity->Name, name);
    set(identity->Manufacturer, "Norvane Corporation");
    set(identity->MajorVersion, agent_major);
    set(identity->MinorVersion, agent_minor);
    set(identity->RevisionNumber, agent_revision);
    set(identity->BuildNumber, agent_build);
    m_providerIdentity = insertIdentity(identity);
    associate(m_agent, Link::InstalledSoftwareIdentity, m_host, m_providerIdentity, name.c_str());
    createSoftwareIdentityLink(m_agent, Link::ProviderSoftwareIdentity,
                               text("Software Identity (CMPI HBA Provider v%s)", version.c_str()).c_str(),
                               m_providerIdentity, m_host, 2, 3, 6);
    associate(m_agent, Link::SoftwareConformsToProfile, m_software, m_providerIdentity, "CMPI HBA Provider, Software");
}

Instance* Adapter_Update::buildTagIdentity()
{
    const String name = text("FC HBA TAG v%s %s %s", "0", "0", "0");
    auto identity =
        makeIdentity(name, "Norvane FC TAG Software", "0", class_configuration, "FC Frames Tagging Software");
    set(identity->Name, name);
    set(identity->Manufacturer, "Norvane Corporation");
    return insertIdentity(identity);
}

void Adapter_Update::buildDriverIdentities()
{
    // Without an FC adapter the texts stay empty.
    std::string driver;
    std::string driverVersion;
    std::string manufacturer;
    uint32 driverType = 0;
    uint32 diagVersion = 0;
    for (Adapter* adapter : m_agent.m_pData->getAdapters()) {
        const auto* from = adapter->type() == Adapter::type_fc
                               ? dynamic_cast<const FCAdapterAttributes*>(adapter->getAttributes())
                               : nullptr;
        if (!from) {
            NVR_LOG("Skippping Adapter [%s] since it is not an FC Adapter", adapter->name().c_str());
            continue;
        }
        driver = from->_DriverName;
        driverVersion = from->_DriverVersion;
        manufacturer = from->_Manufacturer;
        driverType = from->_DriverType;
        diagVersion = from->_DiagVersion;
        break;
    }
    NVR_LOG("driverName: %s, driverVersion: %s, driverManufacturer: %s", driver.c_str(), driverVersion.c_str(),
            manufacturer.c_str());

    const String name = text("%s v%s", driver.c_str(), driverVersion.c_str());
    auto identity = makeIdentity(text("NVR FC HBA: Driver %s", name.c_str()), "Norvane HBA Driver",
                                 text_of(driverVersion), class_driver, "FC HBA Driver");
    set(identity->ElementName, name);
    set(identity->Name, name);
    set(identity->Manufacturer, manufacturer);
    set(identity->IdentityInfoValue,
        {text_of(driver), text_of(driverVersion), text("%d", static_cast<int>(driverType))});
    set(identity->IdentityInfoType, {"NORVANE:DRIVER_NAME", "NORVANE:DRIVER_VERSION", "NORVANE:TSFC_DRIVER_TYPE"});
    m_driverIdentity = insertIdentity(identity);
    associate(m_agent, Link::InstalledSoftwareIdentity, m_host, m_driverIdentity, name.c_str());
    associate(m_agent, Link::SoftwareConformsToProfile, m_softwareInventory, m_driverIdentity,
              "Driver, Software Inventory");

    const String diagnostics = "NVRHBA: Diagnostics";
    const String diagnosticsVersion = text("%d", static_cast<int>(diagVersion));
    const String diagnosticsName = text("%s v%s", diagnostics.c_str(), diagnosticsVersion.c_str());
    identity =
        makeIdentity(diagnosticsName, diagnostics.c_str(), diagnosticsVersion, class_diagnostics, "NVRHBA Diagnostics");
    set(identity->Name, diagnosticsName);
    set(identity->IdentityInfoValue, {diagnostics, diagnosticsVersion});
    const Instance* made = insertIdentity(identity);
    associate(m_agent, Link::InstalledSoftwareIdentity, m_host, made, diagnosticsName.c_str());
    associate(m_agent, Link::SoftwareConformsToProfile, m_softwareInventory, made, "Diagnositc, Software Inventory");
}

void Adapter_Update::buildFirmwareIdentities(const Port_Scope& scope, Instance* controller)
{
    const FCAdapterAttributes& adapter = scope.adapter;
    const std::string port = adapter._Model + ":" + scope.wwpn;
    const auto id = [&](const char* prefix, const std::string& version) {
        return text("%s v%s %s %s", prefix, version.c_str(), adapter._Model.c_str(), scope.wwpn);
    };
    const auto publish = [&](const Ref<NVRHBA_SoftwareIdentity>& identity, const std::string& version, const char* what,
                             const char* words) {
        set(identity->Manufacturer, adapter._Manufacturer);
        setVersion(*identity, version, what);
        const Instance* made = insertIdentity(identity);
        associate(m_agent, Link::InstalledSoftwareIdentity, m_host, made, identity->InstanceID.value.c_str());
        createSoftwareIdentityLink(m_agent, Link::ElementSoftwareIdentity,
                                   text("Software Identity (%s) %s", words, port.c_str()).c_str(), made, controller, 2,
                                   3, 6);
        associate(m_agent, Link::SoftwareConformsToProfile, m_softwareInventory, made,
                  text("%s %s, Software Inventory", words, port.c_str()).c_str());
    };

    const String firmwareName = id("FC HBA Firmware", adapter._FirmwareVersion);
    auto firmware = makeIdentity(
        text("NVR FC HBA:Firmware:v%s %s %s", adapter._FirmwareVersion.c_str(), adapter._Model.c_str(), scope.wwpn),
        "Norvane FC HBA Firmware", text_of(adapter._FirmwareVersion), class_firmware, "FC HBA Firmware");
    set(firmware->ElementName, firmwareName);
    set(firmware->Name, firmwareName);
    set(firmware->OperationalFirmware, adapter._OperationalFirmware);
    set(firmware->ULPFirmwareVersion, adapter._ULPFirmwareVersion);
    set(firmware->ULPFirmwareName, adapter._ULPFirmwareName);
    set(firmware->SPFirmwareVersion, adapter._SPFirmwareVersion);
    set(firmware->SPFirmwareName, adapter._SPFirmwareName);
    publish(firmware, adapter._FirmwareVersion, "Firmware", "Firmware");

    publish(makeIdentity(id("Firmware Kernel", adapter._KERNEL_VERSION), "Norvane FC HBA Firmware Kernel",
                         text_of(adapter._KERNEL_VERSION), class_other, "Firmware Kernel"),
            adapter._KERNEL_VERSION, "FirmwareKernel", "Firmware Kernel");

    auto bootCode = makeIdentity(id("Boot Code - Expansion ROM", adapter._BOOTBIOS_VERSION), "Norvane FC HBA Boot Code",
                                 text_of(adapter._BOOTBIOS_VERSION), class_boot_code, "BIOS/FCode");
    set(bootCode->FCUniversalVersion, adapter._FCUniversalVersion);
    set(bootCode->FC_X86_BIOSVersion, adapter._FC_X86_BIOSVersion);
    set(bootCode->FC_EFIVersion, adapter._FC_EFIVersion);
    set(bootCode->FC_FCODEVersion, adapter._FC_FCODEVersion);
    publish(bootCode, adapter._BOOTBIOS_VERSION, "BootCodeExpansionROM", "Boot Code - Expansion ROM");

    publish(makeIdentity(id("Functional Firmware stub", adapter._INITIAL_FW_LOAD), "Norvane Functional Firmware",
                         text_of(adapter._INITIAL_FW_LOAD), class_other, "Functional Firmware Stub"),
            adapter._INITIAL_FW_LOAD, "FunctionalFirmware", "Functional Firmware stub");

    createSoftwareIdentityLink(m_agent, Link::ElementSoftwareIdentity,
                               text("Software Identity (Driver) %s", port.c_str()).c_str(), m_driverIdentity,
                               controller, 2, 3, 9);
}

} // namespace cimple
