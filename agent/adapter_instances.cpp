// The walk over the adapters, and the classes that an adapter has once.
#include "agent/Adapter_Update.h"
#include "agent/library_name.h"
#include "classes/NVRHBA_LogicalPortGroup.h"
#include "classes/NVRHBA_PhysicalPackage.h"
#include "classes/NVRHBA_Product.h"
#include "foundation/CLogger.h"
#include "inventory/Adapter.h"
#include "inventory/AdapterAttributes.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"
#include "inventory/PortAttributes.h"

namespace cimple {

namespace {

Ref<NVRHBA_PhysicalPackage> makePackage(const FCAdapterAttributes& adapter)
{
    auto package = make<NVRHBA_PhysicalPackage>();
    set(package->Name, adapter._Model);
    set(package->Model, adapter._Model);
    set(package->PartNumber, adapter._Model);
    set(package->Manufacturer, adapter._Manufacturer);
    set(package->Tag, adapter._NodeWWN);
    set(package->CreationClassName, "NVRHBA_PhysicalPackage");
    set(package->Description, adapter._ModelDescription);
    set(package->ElementName, adapter._NodeSymbolicName);
    set(package->SerialNumber, adapter._SerialNumber);
    set(package->Version, adapter._HardwareVersion);
    set(package->SLIMode, adapter._SLIMode);
    if (adapter._Temperature0 > 0) {
        set(package->BoardTemperature, adapter._Temperature0);
        set(package->ThresholdCriticalTemp, adapter._Temperature1);
        set(package->ThresholdWarningTemp, adapter._Temperature2);
    }
    set(package->TemperatureUnit, "Celsius");
    set(package->VendorSpecID, adapter._VendorSpecificID);
    set(package->DeviceID, adapter._DeviceID);
    set(package->ModelID, adapter._ModelID);
    set(package->PackageType, 9);
    return package;
}

Ref<NVRHBA_Product> makeProduct(const FCAdapterAttributes& adapter)
{
    auto product = make<NVRHBA_Product>();
    set(product->Description, adapter._ModelDescription);
    set(product->ElementName, adapter._NodeSymbolicName);
    set(product->Name, adapter._Model);
    set(product->IdentifyingNumber, adapter._NodeWWN);
    set(product->Vendor, adapter._Manufacturer);
    set(product->Version, adapter._HardwareVersion);
    return product;
}

Ref<NVRHBA_LogicalPortGroup> makePortGroup(const FCAdapterAttributes& adapter)
{
    auto group = make<NVRHBA_LogicalPortGroup>();
    set(group->Description, "The Fibre Channel ports of the HBA.");
    set(group->Name, adapter._NodeWWN);
    set(group->InstanceID, text("NVR FC HBA:%s", adapter._NodeWWN.c_str()));
    set(group->NameFormat, "WWN");
    set(group->ElementName, text("%s:%s", adapter._Model.c_str(), adapter._NodeWWN.c_str()));
    return group;
}

} // namespace

void Adapter_Update::testForAdapters()
{
    if (m_agent.m_pData->haveAdapters()) return;
    NVR_LOG("FC Adapter Not present !!!!, throw error !!!");
    throw std::exception();
}

Instance* Adapter_Update::tie(Link link, const Instance* first, const Instance* second)
{
    Instance* association = associate(m_agent, link, first, second);
    if (!association) throw Update_Ended();
    return association;
}

bool Adapter_Update::tieIfMade(Link link, const Instance* first, const Instance* second)
{
    if (first && second) return tie(link, first, second) != nullptr;
    return associate(m_agent, link, first, second) != nullptr;
}

void Adapter_Update::walkAdapters()
{
    uint32 number = 0;
    for (Adapter* adapter : m_agent.m_pData->getAdapters()) {
        auto* fc = adapter->type() == Adapter::type_fc ? dynamic_cast<FCAdapter*>(adapter) : nullptr;
        if (fc) {
            NVR_LOG("%s", fc->name().c_str());
            buildAdapter(*fc, number);
        } else
            NVR_LOG("Skippping Adapter [%s] since it is not an FC Adapter", adapter->name().c_str());
        number++;
    }
}

void Adapter_Update::buildAdapter(FCAdapter& adapter, uint32 number)
{
    const auto& attributes = dynamic_cast<const FCAdapterAttributes&>(*adapter.getAttributes());
    Instance* package = insert(m_agent.m_NVRHBA_PhysicalPackage_map, makePackage(attributes));
    tie(Link::SystemPackaging, package, m_host);
    Instance* product = insert(m_agent.m_NVRHBA_Product_map, makeProduct(attributes));
    Instance* group = insert(m_agent.m_NVRHBA_LogicalPortGroup_map, makePortGroup(attributes));
    tie(Link::HostedCollection, m_host, group);

    uint32 count = 0;
    for (Port* port : *adapter.getPorts()) {
        NVR_LOG("Creating classes for port %d.", static_cast<int>(count));
        auto& fc = dynamic_cast<FCPort&>(*port);
        HBA_WWN wwn = {};
        if (!library_name(wwn, fc.portName().c_str(), "NVRHBA_PCIPort Id2HBAName failed", "::str2HBAName failed"))
            throw Update_Ended();
        buildPort({attributes, fc, dynamic_cast<const FCPortAttributes&>(*fc.getAttributes()), number,
                   adapter.name().c_str(), adapter.getNumberOfPorts(), fc.portName().c_str(), wwn, package, product,
                   group, count == 0});
        count++;
    }
}

} // namespace cimple
