/// The inventory: the adapters of the host, their ports, and the targets behind them, as the libraries reported them
/// last.
///
/// Owns the tree. No lock of its own: builders and readers hold the agent's data mutex. Every pointer into the
/// inventory is dead after the next `buildAdapterData`, every pointer to a target after the next `buildSANData`.
#pragma once

#include <vector>

#include "runtime/Type.h"

namespace cimple {

class Adapter;
class Port;

class NVR_Data {
public:
    /// No more adapters are looked at, whatever the library reports.
    static constexpr uint32 max_adapters = 4096;

    NVR_Data();
    ~NVR_Data();
    NVR_Data(const NVR_Data&) = delete;
    NVR_Data& operator=(const NVR_Data&) = delete;

    /// Throws the inventory away and reads adapters and ports anew. An adapter that cannot be read is logged and left
    /// out, as are the converged cards. Throws nothing.
    void buildAdapterData();
    /// Reads the targets of every port anew; an adapter that fails is logged and costs only itself. Throws nothing.
    void buildSANData();
    void freeAllData();

    const std::vector<Adapter*>& getAdapters() const { return m_adapters; }
    /// The ports of all adapters, in the order of discovery.
    const std::vector<Port*>& getPorts() const { return m_ports; }
    /// 1 once an adapter was kept, else 0.
    sint32 haveAdapters() const { return m_haveAdapters; }
    /// What the library reported, less one for each adapter that was left out.
    sint32 getNumberOfAdapters() const { return m_numberOfAdapters; }

private:
    void buildAdapter(uint32 index);
    void leaveOutAdapter();

    std::vector<Adapter*> m_adapters;
    std::vector<Port*> m_ports;
    sint32 m_haveAdapters = 0;
    sint32 m_numberOfAdapters = 0;
};

} // namespace cimple
