#include "host/serve/Subscriptions.h"

#include "host/serve/Message.h"
#include "host/serve/Xml_Writer.h"

#include <algorithm>
#include <curl/curl.h>
#include <sstream>

namespace host {

using namespace cim_status;

namespace {

constexpr std::size_t most_waiting = 10000, most_kept = 1000, most_name_spaces = 16;
constexpr long delivery_seconds = 10;

constexpr const char* filter_class = "CIM_IndicationFilter";
constexpr const char* subscription_class = "CIM_IndicationSubscription";
constexpr const char* destination_classes[] = {"CIM_ListenerDestinationCIMXML", "CIM_IndicationHandlerCIMXML",
                                               "CIM_ListenerDestination"};

constexpr const char* declarations = R"(
class CIM_IndicationFilter {
  [Key] string SystemCreationClassName; [Key] string SystemName; [Key] string CreationClassName; [Key] string Name;
  string SourceNamespace; string SourceNamespaces[]; [Required] string Query; [Required] string QueryLanguage;
};
class CIM_ListenerDestination {
  [Key] string SystemCreationClassName; [Key] string SystemName; [Key] string CreationClassName; [Key] string Name;
  uint16 PersistenceType = 2; [Required] string Destination; uint16 Protocol;
};
class CIM_ListenerDestinationCIMXML : CIM_ListenerDestination {};
class CIM_IndicationHandlerCIMXML : CIM_ListenerDestination {};
[Association]
class CIM_IndicationSubscription {
  [Key] CIM_IndicationFilter REF Filter; [Key] CIM_ListenerDestination REF Handler;
};
)";

bool is_destination(const std::string& class_name)
{
    return std::any_of(std::begin(destination_classes), std::end(destination_classes),
                       [&](const char* each) { return same_name(class_name, each); });
}

/// Whatever names the same instance: clients and servers spell namespaces and hosts of such references as they like.
bool is_same(const Path& a, const Path& b)
{
    if (!same_name(a.class_name, b.class_name) || a.keys.size() != b.keys.size()) return false;
    return std::all_of(a.keys.begin(), a.keys.end(), [&](const Named_Value& key) {
        const Value* other = b.find(key.name);
        if (!other) return false;
        const Path *left = key.value.as_path(), *right = other->as_path();
        return left && right ? is_same(*left, *right) : key.value == *other;
    });
}

/// The class behind FROM in a query of WQL or CQL.
std::string class_in(const std::string& query)
{
    std::istringstream words(query);
    for (std::string word; words >> word;)
        if (same_name(word, "from") && words >> word) return word;
    return "";
}

/// An address that a delivery can go to, and nothing that could end its line in a request.
bool is_address(const std::string& url)
{
    const std::string start = lower_case(url.substr(0, 8));
    const bool is_known = start.compare(0, 7, "http://") == 0 || start == "https://";
    return is_known && std::all_of(url.begin(), url.end(), [](unsigned char c) { return c > ' ' && c != 0x7F; });
}

std::size_t drop(char*, std::size_t size, std::size_t count, void*)
{
    return size * count;
}

void post(const std::string& url, const std::string& body)
{
    CURL* handle = curl_easy_init();
    if (!handle) return;
    curl_slist* headers = nullptr;
    for (const char* line : {"Content-Type: application/xml; charset=\"utf-8\"", "CIMExport: MethodRequest",
                             "CIMExportMethod: ExportIndication", "Expect:"})
        headers = curl_slist_append(headers, line);
    curl_easy_setopt(handle, CURLOPT_URL, url.c_str());
    curl_easy_setopt(handle, CURLOPT_PROTOCOLS_STR, "http,https");
    curl_easy_setopt(handle, CURLOPT_NOPROXY, "*");
    curl_easy_setopt(handle, CURLOPT_HTTPHEADER, headers);
    curl_easy_setopt(handle, CURLOPT_POSTFIELDSIZE, static_cast<long>(body.size()));
    curl_easy_setopt(handle, CURLOPT_POSTFIELDS, body.data());
    curl_easy_setopt(handle, CURLOPT_TIMEOUT, delivery_seconds);
    curl_easy_setopt(handle, CURLOPT_NOSIGNAL, 1L);
    curl_easy_setopt(handle, CURLOPT_WRITEFUNCTION, &drop);
    // A listener that does not answer loses the indication: CIM-XML has no retry.
    curl_easy_perform(handle);
    curl_slist_free_all(headers);
    curl_easy_cleanup(handle);
}

} // namespace

Subscriptions::Subscriptions(Host& host) : m_host(host)
{
    curl_global_init(CURL_GLOBAL_DEFAULT);
    m_thread = std::thread([this] { deliver_all(); });
}

Subscriptions::~Subscriptions()
{
    for (const Entry& entry : m_entries)
        end(entry.ids);
    {
        std::lock_guard<std::mutex> hold(m_queue_mutex);
        m_stopped = true;
    }
    m_changed.notify_all();
    m_thread.join();
    curl_global_cleanup();
}

bool Subscriptions::serves(const std::string& class_name) const
{
    return same_name(class_name, filter_class) || same_name(class_name, subscription_class) ||
           is_destination(class_name);
}

const Schema& Subscriptions::schema()
{
    static const std::shared_ptr<const Schema> classes = [] {
        std::string error;
        return Schema::from_text(declarations, error);
    }();
    return *classes;
}

std::vector<Instance> Subscriptions::instances(const std::string& class_name) const
{
    std::lock_guard<std::mutex> hold(m_mutex);
    std::vector<Instance> found;
    for (const Entry& entry : m_entries)
        if (same_name(entry.instance.path.class_name, class_name) ||
            (same_name(class_name, "CIM_ListenerDestination") && is_destination(entry.instance.path.class_name)))
            found.push_back(entry.instance);
    return found;
}

std::optional<Instance> Subscriptions::find(const Path& path) const
{
    std::lock_guard<std::mutex> hold(m_mutex);
    for (const Entry& entry : m_entries)
        if (is_same(entry.instance.path, path)) return entry.instance;
    return std::nullopt;
}

Path Subscriptions::create(Instance instance)
{
    const bool is_subscription = same_name(instance.path.class_name, subscription_class);
    instance.path.keys.clear();
    const std::vector<const char*> keys =
        is_subscription
            ? std::vector<const char*>{"Filter", "Handler"}
            : std::vector<const char*>{"SystemCreationClassName", "SystemName", "CreationClassName", "Name"};
    for (const char* key : keys) {
        if (instance.get(key).is_null()) {
            if (is_subscription || same_name(key, "Name"))
                throw Cim_Fault{invalid_parameter, std::string(key) + " is missing"};
            instance.set(key, Value::string(same_name(key, "CreationClassName") ? instance.path.class_name : ""));
        }
        instance.path.set(key, instance.get(key));
    }
    if (is_destination(instance.path.class_name) && !is_address(instance.get("Destination").as_text()))
        throw Cim_Fault{invalid_parameter, "Destination is no address of http or https"};
    const auto is_it = [&](const Entry& entry) { return is_same(entry.instance.path, instance.path); };
    {
        std::lock_guard<std::mutex> hold(m_mutex);
        if (std::any_of(m_entries.begin(), m_entries.end(), is_it))
            throw Cim_Fault{already_exists, "there is such an instance already"};
        if (m_entries.size() >= most_kept) throw Cim_Fault{failed, "there are too many already"};
        m_entries.push_back({instance});
    }
    if (!is_subscription) return instance.path;
    // The providers are asked without the lock: they may deliver at once. The entry keeps its place meanwhile, and
    // holds its filter and destination.
    std::vector<int> ids;
    try {
        ids = activate(instance);
    } catch (...) {
        std::lock_guard<std::mutex> hold(m_mutex);
        m_entries.erase(std::remove_if(m_entries.begin(), m_entries.end(), is_it), m_entries.end());
        throw;
    }
    {
        std::lock_guard<std::mutex> hold(m_mutex);
        const auto at = std::find_if(m_entries.begin(), m_entries.end(), is_it);
        if (at != m_entries.end()) at->ids.swap(ids);
    }
    end(ids); // another client has taken it back already
    return instance.path;
}

void Subscriptions::end(const std::vector<int>& ids)
{
    for (const int id : ids)
        m_host.unsubscribe(id);
}

std::vector<int> Subscriptions::activate(const Instance& subscription)
{
    const Path* filter_path = subscription.get("Filter").as_path();
    const Path* handler_path = subscription.get("Handler").as_path();
    const std::optional<Instance> filter = filter_path ? find(*filter_path) : std::nullopt;
    const std::optional<Instance> handler = handler_path ? find(*handler_path) : std::nullopt;
    if (!filter || !same_name(filter->path.class_name, filter_class) || !handler ||
        !is_destination(handler->path.class_name))
        throw Cim_Fault{not_found, "the filter or the destination does not exist"};
    const std::string query = filter->get("Query").as_text(), url = handler->get("Destination").as_text();
    const std::string class_name = class_in(query), language = filter->get("QueryLanguage").as_text();
    const char* const languages[] = {"", "WQL", "CQL", "DMTF:CQL"};
    if (std::none_of(std::begin(languages), std::end(languages),
                     [&](const char* known) { return same_name(language, known); }))
        throw Cim_Fault{unknown_language, "no queries of " + language};
    if (!m_host.schema().find(class_name)) throw Cim_Fault{invalid_class, "the filter names no class: " + query};
    std::vector<std::string> name_spaces;
    for (const Value& each : filter->get("SourceNamespaces").elements())
        name_spaces.push_back(each.as_text());
    if (name_spaces.size() > most_name_spaces) throw Cim_Fault{invalid_parameter, "SourceNamespaces has too many"};
    if (name_spaces.empty()) name_spaces.push_back(filter->get("SourceNamespace").as_text());
    std::vector<int> ids;
    for (const std::string& name_space : name_spaces) {
        int id = 0;
        const Status status = m_host.subscribe(
            name_space.empty() ? "root/norvane" : name_space, class_name,
            [this, url](const Indication& indication) { queue(url, indication); }, id, query);
        if (!status.ok()) {
            end(ids);
            throw Cim_Fault{status.code > 0 && status.code <= 17 ? status.code : failed, status.message};
        }
        ids.push_back(id);
    }
    return ids;
}

void Subscriptions::remove(const Path& path)
{
    std::vector<int> ids;
    {
        std::lock_guard<std::mutex> hold(m_mutex);
        const auto at = std::find_if(m_entries.begin(), m_entries.end(),
                                     [&](const Entry& entry) { return is_same(entry.instance.path, path); });
        if (at == m_entries.end()) throw Cim_Fault{not_found, "there is no such instance"};
        for (const Entry& entry : m_entries)
            for (const char* end : {"Filter", "Handler"})
                if (const Path* reference = entry.instance.get(end).as_path(); reference && is_same(*reference, path))
                    throw Cim_Fault{failed, "a subscription uses it"};
        ids.swap(at->ids);
        m_entries.erase(at);
    }
    end(ids);
}

void Subscriptions::queue(const std::string& url, const Indication& indication)
{
    std::lock_guard<std::mutex> hold(m_queue_mutex);
    std::string body =
        "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE";
    write_attribute(body, "ID", std::to_string(++m_sent));
    body += " PROTOCOLVERSION=\"1.0\"><SIMPLEEXPREQ><EXPMETHODCALL NAME=\"ExportIndication\">"
            "<EXPPARAMVALUE NAME=\"NewIndication\">";
    write_instance(body, indication.instance, m_host.schema(), {});
    body += "</EXPPARAMVALUE></EXPMETHODCALL></SIMPLEEXPREQ></MESSAGE></CIM>\n";
    if (m_queue.size() >= most_waiting) m_queue.pop_front();
    m_queue.push_back({url, std::move(body)});
    m_changed.notify_one();
}

void Subscriptions::deliver_all()
{
    std::unique_lock<std::mutex> hold(m_queue_mutex);
    for (;;) {
        m_changed.wait(hold, [this] { return m_stopped || !m_queue.empty(); });
        if (m_stopped) return;
        const Delivery next = std::move(m_queue.front());
        m_queue.pop_front();
        hold.unlock();
        post(next.url, next.body);
        hold.lock();
    }
}

} // namespace host
