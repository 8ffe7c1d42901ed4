/// The provider of link alerts: while they are on, each port of the host that goes down or comes up is told to the
/// handler, in order, on a worker thread.
///
/// Off until enable_indications; off again after disable_indications or unload. A library's thread only queues a record
/// (logs/Alert_Queue.h). Enabling and cleaning up exclude each other; m_IndicationProviderMutex guards the handler and
/// is held while it is called, with no lock of the agent. The agent's locks are taken inside it, never around it.
#pragma once

#include <atomic>
#include <memory>

#include "agent/ProviderAgent.h"
#include "foundation/management_api.h"
#include "runtime/Registration.h"
#include "runtime/Thread.h"

namespace cimple {

class NVRHBA_AlertIndication_Provider {
public:
    NVRHBA_AlertIndication_Provider() = default;
    NVRHBA_AlertIndication_Provider(const NVRHBA_AlertIndication_Provider&) = delete;
    NVRHBA_AlertIndication_Provider& operator=(const NVRHBA_AlertIndication_Provider&) = delete;

    Load_Status load();
    /// Ends alerts as disable_indications does. 40 if a port could not be unregistered: what the library may still
    /// call stays mapped then.
    Unload_Status unload();

    /// 140 where the worker cannot be started or has no thread context (alerts stay off), where a
    /// port cannot be registered (they are on, with the ports before it), and for another handler than the one in use.
    /// The same handler again changes nothing.
    Enable_Indications_Status enable_indications(std::unique_ptr<Indication_Handler> handler);
    /// When it returns nothing is delivered any more, and what was still queued is dropped. 150 if a port could not be
    /// unregistered: that is tried again at the next enabling and at unload.
    Disable_Indications_Status disable_indications();

    /// What the library calls with a port event, on a thread of its own, at any time: `data` is not touched.
    static void hbaThreadProc(void* data, HBA_WWN portWWN, HBA_UINT32 eventType, HBA_UINT32 fabricPortID);

private:
    /// Registers each port of the FC adapters for events, resp. takes the registrations back; result 0 or 32769, at the
    /// first failure. Under m_IndicationProviderMutex.
    uint32 setHBACallbacks(bool register_ports);
    uint32 registerPorts();
    static void* providerThreadProc(void* provider);
    /// Makes the indication of one event and delivers it: 0, or 32769 for one that is dropped.
    uint32 generateIndication(HBA_WWN portWWN, uint32 eventType);
    uint32 cleanUp();

    std::atomic<Indication_Handler*> _indication_handler{nullptr}; // owned; null: alerts are off
    bool m_unloaded = false;                                       // nothing is enabled any more
    ProviderAgent* m_agent = nullptr;                              // good while a handler is there
    Thread m_IndicationThread;
};

} // namespace cimple
