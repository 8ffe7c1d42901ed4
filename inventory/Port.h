/// A port of an adapter and the targets behind it.
///
/// A port owns its attributes, statistics and targets, and knows the adapter that owns it. No locks: readers and
/// builders hold the agent's data mutex.
#pragma once

#include <string>
#include <vector>

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

class Adapter;
class PortAttributes;
class PortStatistics;
class Target;

class Port {
public:
    explicit Port(Adapter* adapter);
    virtual ~Port() noexcept(false);
    Port(const Port&) = delete;
    Port& operator=(const Port&) = delete;

    virtual PortAttributes* getAttributes() = 0;
    virtual PortStatistics* getStatistics() = 0;
    virtual Adapter* getAdapter() = 0;
    virtual void rescanTargets(Adapter* adapter) = 0;
    virtual std::vector<Target*>* getTargets() = 0;
    /// Throws std::exception beyond the end.
    virtual Target* getTarget(uint32 index) = 0;
    virtual uint32 getNumberOfTargets() = 0;

    const std::string& portName() const { return m_portName; } ///< the WWPN as 16 digits
    uint32 portIndex() const { return m_portIndex; }           ///< as the Common HBA API counts
    /// What getStatistics read last; null if it never succeeded.
    PortStatistics* statistics() const { return m_statistics; }

protected:
    void freeTargets();

    std::string m_portName;
    uint32 m_portIndex = 0;
    PortAttributes* m_attributes = nullptr;
    PortStatistics* m_statistics = nullptr;
    std::vector<Target*> m_targets;
    Adapter* m_adapter;
};

class FCPort : public Port {
public:
    /// Reads the port's attributes; throws what they throw.
    FCPort(Adapter* adapter, uint32 index);
    ~FCPort() noexcept(false) override;

    PortAttributes* getAttributes() override { return m_attributes; }
    /// Reads the counters anew on each call and replaces the object that an earlier call returned. If that fails, the
    /// earlier object stays (`statistics()`) and the exception passes on.
    PortStatistics* getStatistics() override;
    Adapter* getAdapter() override { return m_adapter; }
    /// Replaces the targets by those that the adapter's mapping lists now; none if the mapping cannot be had. Throws
    /// std::exception if the adapter cannot be opened.
    void rescanTargets(Adapter* adapter) override;
    std::vector<Target*>* getTargets() override { return &m_targets; }
    Target* getTarget(uint32 index) override;
    uint32 getNumberOfTargets() override { return static_cast<uint32>(m_targets.size()); }

    const std::string& nodeName() const { return m_nodeName; } ///< the port's WWNN as 16 digits

    /// Fetches the mapping of an open adapter, with at most three attempts. Result the last status; `*mapping` is null
    /// or a buffer for the caller to free(), zeroed behind what the library wrote, whose count never exceeds its room
    /// when the status is 0.
    static uint32 getTargetMapping(HBA_HANDLE handle, HBA_FCPTARGETMAPPING** mapping);

private:
    std::string m_nodeName;
};

} // namespace cimple
