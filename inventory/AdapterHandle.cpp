#include "inventory/AdapterHandle.h"

#include <exception>

#include "foundation/CLogger.h"

namespace cimple {

AdapterHandle::AdapterHandle(const std::string& adapterName)
{
    std::string name = adapterName; // the library takes a text that it may write to
    m_handle = HBA_OpenAdapter(name.data());
    if (m_handle != 0) return;
    NVR_LOG("HBA_OpenAdapter failed, skipping Adapter %s", adapterName.c_str());
    throw std::exception();
}

HBA_STATUS AdapterHandle::readPort(uint32 index, HBA_PORTATTRIBUTES& record) const
{
    return readRecord(record, [&](HBA_PORTATTRIBUTES* r) { return HBA_GetAdapterPortAttributes(m_handle, index, r); });
}

} // namespace cimple
