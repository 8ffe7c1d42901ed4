#include "logs/NVRHBA_AlertIndication_Provider.h"

#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "logs/Alert_Queue.h"
#include "logs/alert_callbacks.h"
#include "logs/alert_instance.h"
#include "runtime/Thread_Context.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

/// Held through each enabling and each clean-up, also while the latter waits for the worker. Before
/// m_IndicationProviderMutex.
Mutex change_mutex(false, "change_mutex", Lock_Place::alert_changes);

Mutex m_IndicationProviderMutex(false, "m_IndicationProviderMutex", Lock_Place::alerts);

/// The worker's hold of m_IndicationProviderMutex, with its words.
class Spoken_Lock {
public:
    Spoken_Lock()
    {
        NVR_LOG("Waiting for m_IndicationProviderMutex lock...");
        m_IndicationProviderMutex.lock();
        NVR_LOG("m_IndicationProviderMutex lock acquired");
    }
    ~Spoken_Lock()
    {
        m_IndicationProviderMutex.unlock();
        NVR_LOG("m_IndicationProviderMutex lock released");
    }
    Spoken_Lock(const Spoken_Lock&) = delete;
    Spoken_Lock& operator=(const Spoken_Lock&) = delete;
};

/// This thread is within a handler: it holds m_IndicationProviderMutex, and is the worker that a clean-up would join.
thread_local bool delivers = false;

struct Delivery {
    Delivery() { delivers = true; }
    ~Delivery() { delivers = false; }
    Delivery(const Delivery&) = delete;
    Delivery& operator=(const Delivery&) = delete;
};

bool same(const Indication_Handler& a, const Indication_Handler& b)
{
    return a.proc == b.proc && a.data == b.data;
}

} // namespace

Load_Status NVRHBA_AlertIndication_Provider::load()
{
    return static_cast<Load_Status>(ProviderAgent::load());
}

Unload_Status NVRHBA_AlertIndication_Provider::unload()
{
    const uint32 result = cleanUp();
    if (delivers) return UNLOAD_FAILED; // it would wait for itself; the agent stays for the worker
    {
        Auto_Mutex lock(m_IndicationProviderMutex);
        m_unloaded = true;
        retryRemovals();
    }
    ProviderAgent::releaseRef();
    return result == 0 ? UNLOAD_OK : UNLOAD_FAILED;
}

Enable_Indications_Status
NVRHBA_AlertIndication_Provider::enable_indications(std::unique_ptr<Indication_Handler> handler)
{
    if (delivers) return ENABLE_INDICATIONS_FAILED; // it would wait for itself
    Auto_Mutex change(change_mutex);
    Auto_Mutex lock(m_IndicationProviderMutex);
    NVR_LOG("NVRHBA_AlertIndication_Provider::enable_indications()");
    if (m_unloaded) return ENABLE_INDICATIONS_FAILED; // it came in while the last clean-up was under way
    if (const Indication_Handler* in_use = _indication_handler)
        return same(*in_use, *handler) ? ENABLE_INDICATIONS_OK : ENABLE_INDICATIONS_FAILED;
    m_agent = ProviderAgent::GetInstance();
    Alert_Queue& queue = Alert_Queue::instance(); // its first use needs memory
    _indication_handler = handler.get();
    queue.open();
    int created = -1;
    guarded([&] { created = Thread::create_attached(m_IndicationThread, &providerThreadProc, this); });
    if (created != 0) {
        queue.close();
        _indication_handler = nullptr;
        return ENABLE_INDICATIONS_FAILED;
    }
    handler.release(); // it is the worker's from here on, whatever becomes of the ports
    uint32 result = NVR_FAILURE;
    guarded([&] {
        m_agent->BuildCimpleInfo();
        result = setHBACallbacks(true);
    });
    return result == 0 ? ENABLE_INDICATIONS_OK : ENABLE_INDICATIONS_FAILED;
}

Disable_Indications_Status NVRHBA_AlertIndication_Provider::disable_indications()
{
    NVR_LOG("NVRHBA_AlertIndication_Provider::disable_indications()");
    return cleanUp() == 0 ? DISABLE_INDICATIONS_OK : DISABLE_INDICATIONS_FAILED;
}

void NVRHBA_AlertIndication_Provider::hbaThreadProc(void*, HBA_WWN portWWN, HBA_UINT32 eventType,
                                                    HBA_UINT32 fabricPortID)
{
    NVR_LOG("NVRHBA_AlertIndication_Provider::hbaThreadProc");
    NVR_LOG("For link event, type= 0x%x fabricPortID= 0x%d, eventType std::string is %s .", eventType,
            static_cast<int>(fabricPortID), port_event(eventType).log_text);
    if (eventType != HBA_EVENT_PORT_OFFLINE && eventType != HBA_EVENT_PORT_ONLINE) {
        NVR_LOG("Could not generate the indication as the event type is not supported");
        return;
    }
    Alert_Queue::instance().push({portWWN, eventType, fabricPortID});
}

void* NVRHBA_AlertIndication_Provider::providerThreadProc(void* data)
{
    NVR_LOG("NVRHBA_AlertIndication_Provider::providerThreadProc()");
    auto* provider = static_cast<NVRHBA_AlertIndication_Provider*>(data);
    if (!provider) {
        NVR_LOG("Error in converting the pointer to NVRHBA_AlertIndication_Provider");
        return nullptr;
    }
    while (provider->_indication_handler) {
        indication_data record;
        if (!Alert_Queue::instance().pop(record)) {
            NVR_LOG("NVRHBA_AlertIndication_Provider::providerThreadProc() Received signal from cleanup()");
            break;
        }
        NVR_LOG("Popped from Queue: IndicationType 0x%x", record.eventType);
        if (!guarded([&] { provider->generateIndication(record.portWWN, record.eventType); }))
            NVR_LOG("Error: Failed to generate or deliver the indication");
    }
    NVR_LOG("NVRHBA_AlertIndication_Provider::providerThreadProc() finished");
    return nullptr;
}

uint32 NVRHBA_AlertIndication_Provider::generateIndication(HBA_WWN portWWN, uint32 eventType)
{
    NVR_LOG("NVRHBA_AlertIndication_Provider::generateIndication");
    {
        const Spoken_Lock lock;
        if (!_indication_handler) {
            NVR_LOG("Indication Handler is not passed properly");
            return NVR_FAILURE;
        }
    }
    Ref<NVRHBA_AlertIndication> alert = makeAlert(*m_agent, portWWN, eventType);
    if (!alert) return NVR_FAILURE;
    const Spoken_Lock lock;
    const Indication_Handler* handler = _indication_handler;
    // A thread whose context could not be set up has no way to the server.
    if (handler && !Alert_Queue::instance().isCleanUp() && Thread_Context::top()) {
        NVR_LOG("Calling Indication handler to deliver Indication to the specified client");
        const Delivery delivery;
        handler->handle(alert.release());
        NVR_LOG("Indication Delivered to the specified client");
    } else {
        NVR_LOG("Error: Failed to deliver indication as the indication handler is 0 or cleanUp signalled !");
    }
    return 0;
}

uint32 NVRHBA_AlertIndication_Provider::cleanUp()
{
    NVR_LOG("NVRHBA_AlertIndication_Provider::cleanUp()");
    if (delivers) return NVR_FAILURE; // it would wait for itself
    Auto_Mutex change(change_mutex);
    uint32 result;
    {
        Auto_Mutex lock(m_IndicationProviderMutex);
        if (!_indication_handler) {
            NVR_LOG("NVRHBA_AlertIndication_Provider::cleanUp() Nothing to cleanUp, Exiting...");
            return 0;
        }
        result = setHBACallbacks(false);
        Alert_Queue::instance().close();
        NVR_LOG("NVRHBA_AlertIndication_Provider::cleanUp():: Worker thread signalled for cancellation.");
    }
    NVR_LOG("Waiting for Worker thread termination...");
    void* ignored = nullptr;
    Thread::join(m_IndicationThread, ignored);
    NVR_LOG("NVRHBA_AlertIndication_Provider::cleanUp():: Worker thread terminated successfully");

    Auto_Mutex lock(m_IndicationProviderMutex);
    const std::unique_ptr<Indication_Handler> handler(_indication_handler.exchange(nullptr));
    if (!handler) {
        NVR_LOG("NVRHBA_AlertIndication_Provider::cleanUp() Nothing to cleanUp at this moment, Exiting...");
        return 0;
    }
    handler->handle(nullptr); // the stop word
    NVR_LOG("NVRHBA_AlertIndication_Provider::cleanUp():: _indication_handler deleted.");
    NVR_LOG("NVRHBA_AlertIndication_Provider::cleanUp() finished");
    return result;
}

} // namespace cimple
