/// The walk over the FC ports of the inventory, in order, that passes other adapters over with their line in the log.
#pragma once

#include "foundation/CLogger.h"
#include "inventory/Adapter.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"

namespace cimple {

/// Calls `visit(adapter, port)` for each; stops when it answers false.
template <class Visit>
void walkFCPorts(const NVR_Data& data, Visit visit)
{
    for (Adapter* adapter : data.getAdapters()) {
        auto* fc = adapter->type() == Adapter::type_fc ? dynamic_cast<FCAdapter*>(adapter) : nullptr;
        if (!fc) {
            NVR_LOG("Skippping Adapter [%s] since it is not an FC Adapter", adapter->name().c_str());
            continue;
        }
        for (Port* port : *fc->getPorts())
            if (!visit(*fc, dynamic_cast<FCPort&>(*port))) return;
    }
}

} // namespace cimple
