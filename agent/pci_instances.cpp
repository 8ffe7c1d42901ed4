// The PCI function behind a port.
#include <cstring>

#include "agent/Adapter_Update.h"
#include "agent/library_name.h"
#include "classes/NVRHBA_PCIDevice.h"
#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "inventory/AdapterAttributes.h"

namespace cimple {

namespace {

/// The standard configuration header, in its byte order.
class PCI_Header {
public:
    /// Zero if the library cannot read it, which is logged.
    explicit PCI_Header(const HBA_WWN& wwn)
    {
        RM_PCIREGISTERS registers = {};
        const uint32 status = RM_DiagReadPCIRegistersV2(wwn, &registers);
        NVR_LOG("RM_DiagReadPCIRegistersV2 status = %d ", static_cast<int>(status));
        if (status == RM_STATUS_OK) {
            NVR_LOG("RM_DiagReadPCIRegistersV2 call passed");
            std::memcpy(m_bytes, registers.header, sizeof m_bytes);
        } else
            NVR_LOG("RM_DiagReadPCIRegistersV2 call failed");
    }

    uint8 byte(unsigned offset) const { return m_bytes[offset]; }
    uint16 word(unsigned offset) const { return static_cast<uint16>(byte(offset) | byte(offset + 1) << 8); }
    uint32 dword(unsigned offset) const { return word(offset) | static_cast<uint32>(word(offset + 2)) << 16; }

private:
    uint8 m_bytes[64] = {};
};

} // namespace

Instance* Adapter_Update::buildPCIDevice(const Port_Scope& scope)
{
    const PCI_Header header(scope.wwn);
    NVR_LOG("Creating NVRHBA_PCIDevice");
    auto made = makeOrLog<NVRHBA_PCIDevice>("Failed to create NVRHBA_PCIDevice");
    if (!made) return nullptr;
    setHost(*made);
    set(made->CreationClassName, "NVRHBA_PCIDevice");
    set(made->DeviceID, text("%s:0x%04X", scope.wwpn, header.word(2)));
    set(made->ElementName, text("Norvane:FCAdapter%d", static_cast<int>(scope.adapterNumber)));
    set(made->EnabledState, 5);
    set(made->RequestedState, 5);
    set(made->PrimaryStatus, 5);
    set(made->HealthState, 5);
    set(made->FunctionNumber, scope.adapter._PCIFunctionNumber);
    set(made->BusNumber, scope.adapter._PCIBusNumber);
    set(made->VendorID, header.word(0));
    set(made->Command, header.word(4));
    set(made->PCIStatus, header.word(6));
    set(made->RevisionID, header.byte(8));
    set(made->ProgIf, header.byte(9));
    set(made->SubClass, header.byte(10));
    set(made->BaseClass, header.byte(11));
    set(made->CacheLineSize, header.byte(12));
    set(made->LatencyTimer, header.byte(13));
    set(made->HeaderType, header.byte(14));
    set(made->BuiltInSelfTest, header.byte(15));
    set(made->BaseAddresses0, header.dword(16));
    set(made->BaseAddresses1, header.dword(20));
    set(made->BaseAddresses2, header.dword(24));
    set(made->BaseAddresses3, header.dword(28));
    set(made->BaseAddresses4, header.dword(32));
    set(made->BaseAddresses5, header.dword(36));
    set(made->CIS, header.dword(40));
    set(made->SubVendorID, header.word(44));
    set(made->SubsystemID, header.word(46));
    set(made->ExpansionROMBaseAddress, header.dword(48));
    set(made->CapabilitiesPtr, header.byte(52));
    set(made->InterruptLine, header.byte(60));
    set(made->InterruptPin, header.byte(61));
    set(made->MinimumGrant, header.byte(62));
    set(made->MaximumLatency, header.byte(63));
    Instance* device = insert(m_agent.m_NVRHBA_PCIDevice_map, made);

    const bool tied = tieIfMade(Link::PCIElementConformsToProfile, m_pciDevice, device) &&
                      tieIfMade(Link::SystemDevice, m_host, device);
    return tied ? device : nullptr;
}

} // namespace cimple
