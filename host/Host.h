/// A CIM server in one object: it loads provider modules as a server does, asks them through the CMPI interface, and
/// answers their calls back.
///
///     std::string error;
///     auto schema = host::Schema::from_files({"classes/mof"}, error);
///     host::Host server(schema, {host::Manner::strict()});
///     server.add_module("build/release/libnorvane_fc_provider.so");
///     host::Answer ports = server.enumerate("root/norvane", "NVRHBA_FCPort");
///
/// Every operation may be called from any thread, many at once; each request runs on a thread of its own (or a pooled
/// one), as the manner says, while the caller waits. Nothing of a module is loaded before the first request to it.
/// Answers are plain data and stay valid after the host is gone. What goes wrong is a status in the answer, never an
/// exception.
///
/// Namespaces are those of registrations and of instances put in by `add_instance`. Statuses of the host's own: 3 for
/// an unknown namespace, 5 for an unknown class, 7 where no provider serves what was asked, 1 where a module or a
/// factory fails; the message tells whose fault it is. All others come from the provider.
#pragma once

#include "host/Ledger.h"
#include "host/Manner.h"
#include "host/Schema.h"
#include "host/Value.h"

#include <cmpift.h>

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace host {

/// Whose fault a failure is.
enum class Fault {
    nobody,
    request, ///< asked for what is not there
    server,  ///< the host itself: no thread, already stopped
    module,  ///< cannot be loaded, a factory failed, an exception came out of it
    provider ///< answered with this status
};

/// A CMPI return code and its text; 0 is success.
struct Status {
    int code = 0;
    std::string message;
    Fault fault = Fault::nobody;

    bool ok() const { return code == 0; }
};

/// "CMPI_RC_ERR_NOT_FOUND" for 6, "status 4711" for what has no name.
std::string status_name(int code);

/// What a request brought; which fields are filled depends on the operation. Results that came before a failure stay.
struct Answer {
    Status status;
    std::vector<Instance> instances;
    std::vector<Path> paths;
    Value value;                  ///< a method's return value, a property
    std::vector<Named_Value> out; ///< a method's out parameters
    std::size_t handed_on = 0;    ///< instances or paths that went to a sink instead

    bool ok() const { return status.ok(); }
};

/// Takes an answer result by result, while the provider is still returning the others: what a server does that sends it
/// on in portions instead of keeping all of it. Called inside the provider's call and on its thread, by several at once
/// where the manner asks subclasses in parallel; must not throw, nor call back into the host.
struct Result_Sink {
    std::function<void(Instance&&)> instance; ///< empty: instances stay in the answer
    std::function<void(Path&&)> path;         ///< empty: paths stay in the answer
};

/// Kinds of provider a class can be registered with.
enum Provider_Kind : unsigned {
    instance_kind = 1,
    association_kind = 2,
    method_kind = 4,
    property_kind = 8,
    indication_kind = 16
};

/// One class and who serves it.
struct Registration {
    std::string class_name;
    std::string provider; ///< factories are <provider>_Create_<Kind>MI
    std::string module;   ///< path of the shared object
    unsigned kinds = 0;   ///< Provider_Kind bits
    std::vector<std::string> name_spaces;
    bool never_unload = false;
};

/// Null: all properties. An empty list asks for none but the keys.
using Property_List = std::optional<std::vector<std::string>>;

struct Host_Options {
    Manner manner = Manner::strict();
    /// The user that requests come from; empty: what the manner has for an unknown one.
    std::string principal;
    /// File that gets one line for each thing done with a module ("-" for standard error); empty: none.
    std::string log_file;
};

/// An indication as it was delivered.
struct Indication {
    std::string name_space;
    Instance instance;
};
/// Called on the module's own thread for each delivery; must not call back into the host.
using Indication_Sink = std::function<void(const Indication&)>;

/// What a sample for idle modules, or the stop of the server, did.
struct Unload_Result {
    int cleanups = 0;             ///< cleanup calls made
    int refused = 0;              ///< of them, answered other than OK
    int closed = 0;               ///< modules closed with dlclose
    std::vector<Status> statuses; ///< of the cleanup calls, in order
};

class Host {
public:
    explicit Host(std::shared_ptr<const Schema> schema, Host_Options options = {});
    /// Stops the server, if that was not done. A server whose manner leaves MIs without a clean-up ends the module's
    /// process then; the host's own lives on, so these get theirs here, and the next host finds a module that is new.
    /// What threads of a module were lent stays for the rest of the process while one of them has not detached.
    ~Host();
    Host(const Host&) = delete;
    Host& operator=(const Host&) = delete;

    // --- Who serves what -------------------------------------------------------------------------------------------

    /// Registers one class. A later registration of the same class and namespace is asked as well.
    void add(const Registration& registration);
    /// Registers every class of the schema for which the file exports factories, `<Class>_Provider_Create_<Kind>MI`
    /// or `<Class>_Create_<Kind>MI`; no code of the module runs. Classes are registered in `name_space`, and those of
    /// profile registration also in "root/pg_interop" and "root/interop". Result: how many classes; 0 with `error`
    /// filled if the file cannot be read as a shared object.
    std::size_t add_module(const std::string& file, const std::string& name_space = "root/norvane",
                           std::string* error = nullptr);
    /// Puts an instance into the server itself (namespace and class from its path; keys are taken from its properties
    /// when the path has none), for what other providers of a real server would publish. Requests and up-calls find
    /// it like any other.
    void add_instance(Instance instance);
    /// Takes them all out again.
    void clear_instances();
    /// All registrations, in order.
    std::vector<Registration> registrations() const;

    // --- Requests of a client --------------------------------------------------------------------------------------

    /// A `sink` outlives the request; null: all results stay in the answer.
    Answer enumerate(const std::string& name_space, const std::string& class_name, Property_List properties = {},
                     const Result_Sink* sink = nullptr);
    Answer names(const std::string& name_space, const std::string& class_name, const Result_Sink* sink = nullptr);
    Answer get(const Path& path, Property_List properties = {});
    /// `paths` has the new instance's path.
    Answer create(const Instance& instance);
    Answer modify(const Instance& instance, Property_List properties = {});
    Answer remove(const Path& path);
    Answer exec_query(const std::string& name_space, const std::string& class_name, const std::string& query,
                      const std::string& language);
    /// Through the class's property provider, or else by `modify` with this property alone.
    Answer set_property(const Path& path, const std::string& name, const Value& value);
    /// Through the class's property provider, or else by `get`.
    Answer get_property(const Path& path, const std::string& name);
    Answer call(const Path& path, const std::string& method, const std::vector<Named_Value>& in = {});
    Answer associators(const Path& path, const std::string& association_class = "",
                       const std::string& result_class = "", const std::string& role = "",
                       const std::string& result_role = "", Property_List properties = {},
                       const Result_Sink* sink = nullptr);
    Answer associator_names(const Path& path, const std::string& association_class = "",
                            const std::string& result_class = "", const std::string& role = "",
                            const std::string& result_role = "", const Result_Sink* sink = nullptr);
    Answer references(const Path& path, const std::string& result_class = "", const std::string& role = "",
                      Property_List properties = {}, const Result_Sink* sink = nullptr);
    Answer reference_names(const Path& path, const std::string& result_class = "", const std::string& role = "",
                           const Result_Sink* sink = nullptr);

    // --- Indications -----------------------------------------------------------------------------------------------

    /// Activates a filter for a class (and its subclasses) in a namespace. `id` gets the number for `unsubscribe`.
    Status subscribe(const std::string& name_space, const std::string& class_name, Indication_Sink sink, int& id,
                     const std::string& query = "");
    Status unsubscribe(int id);
    /// Waits until calls that the manner makes on other threads (enableIndications) have returned.
    void settle();

    // --- Life of the modules ---------------------------------------------------------------------------------------

    /// One sample of the manner for idle modules, as if their idle time had passed: clean-ups with terminating false,
    /// then dlclose where all answered OK. A module with a request in flight is not idle.
    Unload_Result unload_idle();
    /// The server stops: clean-ups with terminating true, then dlclose. Requests after it answer 1.
    Unload_Result stop();
    /// True while the file is open by this host.
    bool is_loaded(const std::string& module) const;

    // --- What was seen ---------------------------------------------------------------------------------------------

    Report report() const;
    void reset_report();
    /// All lines of the server's log so far, without times; kept also when there is no file. At most the last 10,000.
    std::vector<std::string> log() const;
    const Schema& schema() const;
    const Manner& manner() const;
    /// The broker that modules get, for tests that call a factory or a table themselves (inside `on_request_thread`).
    const CMPIBroker* broker() const;
    /// Runs `body` as a request would run: on the manner's thread, with a context, and objects that end with it.
    void on_request_thread(const std::function<void(const CMPIBroker*, const CMPIContext*)>& body);

private:
    struct Parts;
    std::unique_ptr<Parts> m_parts;
};

} // namespace host
