/// The CMPIBroker that modules get: its function tables as the manner has them, and the making and freeing of the
/// encapsulated objects.
///
/// One for each host. Thread-safe; objects go to the scope of the calling thread.
#pragma once

#include "host/Ledger.h"
#include "host/Manner.h"
#include "host/Request.h"
#include "host/Schema.h"
#include "host/Scope.h"
#include "host/ServerLog.h"
#include "host/objects/ContextObject.h"
#include "host/objects/Object.h"
#include "host/objects/StringObject.h"

#include <cmpift.h>

#include <memory>
#include <mutex>
#include <string>
#include <vector>

namespace host {

/// One table for each encapsulated type.
struct Object_Tables {
    CMPIInstanceFT instance;
    CMPIObjectPathFT path;
    CMPIArgsFT args;
    CMPIStringFT string;
    CMPIArrayFT array;
    CMPIDateTimeFT datetime;
    CMPIEnumerationFT enumeration;
    CMPIResultFT result;
    CMPIContextFT context;
    CMPISelectExpFT select_exp;
    CMPIErrorFT error;
};

/// Takes a delivered indication; true if somebody had subscribed to it.
class Indication_Taker {
public:
    virtual ~Indication_Taker() = default;
    virtual bool deliver(const std::string& name_space, const Instance& instance) = 0;
};

class Broker {
public:
    /// Its end frees what modules did not release. No thread may be attached then, nor prepared for it: see `is_lent`.
    Broker(const Schema& schema, const Manner& manner, Server_Log& log);
    Broker(const Broker&) = delete;
    Broker& operator=(const Broker&) = delete;

    /// Where up-calls and indications go; set before a module is loaded.
    void connect(Request_Runner* requests, Indication_Taker* indications);

    const CMPIBroker* face() const { return &m_face; }
    static Broker* of(const CMPIBroker* face) { return face ? static_cast<Broker*>(face->hdl) : nullptr; }

    const Schema& schema() const { return m_schema; }
    const Manner& manner() const { return m_manner; }
    Ledger& ledger() { return m_ledger; }
    Server_Log& log() { return m_log; }
    Object_Tables& tables() { return m_tables; }
    Request_Runner* requests() const { return m_requests; }
    Indication_Taker* indications() const { return m_indications; }
    const std::string& host_name() const { return m_host_name; }

    /// A new object in the scope of this thread; clones live apart.
    template <class T, class... Arguments>
    T* make(Origin origin, Arguments&&... arguments)
    {
        T* object = new T(*this, origin, std::forward<Arguments>(arguments)...);
        adopt(*object);
        return object;
    }
    CMPIString* make_string(Origin origin, const std::string& text);
    /// The context of a request; an empty principal gets what the manner has for nobody.
    CMPIContext* make_request_context(const std::string& principal, const std::string& name_space);
    CMPIContext* make_factory_context();
    /// A context for attachThread, with the entries of another.
    CMPIContext* prepare_context(const Context_Object& source);

    /// Attaches this thread with a prepared context, and detaches it, which frees the context. CMPI codes.
    int attach(const CMPIContext* context);
    int detach(const CMPIContext* context);

    /// True while a context for a thread is out: that thread may call the broker at any time. False for good when no
    /// request runs any more.
    bool is_lent() const { return m_ledger.contexts_out() > 0; }

    /// Frees an object that the module released.
    void retire(Object& object);
    /// Keeps the last of what a scope's end would free, for as long as they count as released a moment ago.
    void keep(Retired_Objects& retired);
    /// Notes a broken rule, in the ledger and the log.
    void violation(const std::string& text);
    /// Notes a call of a broker function on a thread that has neither a request nor an attachment.
    void expect_known_thread(const char* call);

private:
    void adopt(Object& object);
    void fill_object_tables();

    const Schema& m_schema;
    const Manner& m_manner;
    Server_Log& m_log;
    Ledger m_ledger;
    Request_Runner* m_requests = nullptr;
    Indication_Taker* m_indications = nullptr;
    std::string m_host_name;

    Object_Tables m_tables{};
    CMPIBrokerFT m_bft{};
    CMPIBrokerEncFT m_eft{};
    CMPIBrokerExtFT m_xft{};
    CMPIBroker m_face{};

    std::mutex m_mutex;
    Retired_Objects m_retired;
    std::vector<std::unique_ptr<Scope>> m_attached;
    Scope m_orphans, m_explicit;
};

/// The parts of the face, each filled in a file of its own.
void fill_up_calls(CMPIBrokerFT& table, const Manner& manner);
void fill_encapsulation(CMPIBrokerEncFT& table, const Manner& manner);
void fill_threads(CMPIBrokerExtFT& table, const Manner& manner);
/// Null where the manner has no such table; constant data otherwise.
CMPIBrokerMemFT* memory_table(const Manner& manner);

} // namespace host
