/// An adapter of another kind than Fibre Channel, without ports.
#pragma once

#include "inventory/Adapter.h"

namespace nvrtest {

struct Other_Adapter : cimple::Adapter {
    Other_Adapter() : Adapter("Other-0", 0, 2) {}
    const std::string* getAdapterName() override { return &m_adapterName; }
    const cimple::uint32* getAdapterNumber() override { return &m_adapterNumber; }
    const cimple::uint32* getFunctionType() override { return &m_functionType; }
    cimple::AdapterAttributes* getAttributes() override { return nullptr; }
    cimple::AdapterStatistics* getStatistics() override { return nullptr; }
    cimple::uint32 getNumberOfPorts() override { return 0; }
    std::vector<cimple::Port*>* getPorts() override { return &m_ports; }
    cimple::Port* getPort(cimple::uint32) override { return nullptr; }
    void rescanTargets() override {}
};

} // namespace nvrtest
