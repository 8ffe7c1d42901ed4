#include "host/serve/Subscriptions.h"

#include "host/serve/Message.h"
#include "host/serve/Xml_Writer.h"

#include <algorithm>
#include <curl/curl.h>
#include <sstream>

namespace host {
namespace {

constexpr int invalid_parameter = 4, invalid_class = 5, not_found = 6, already_exists = 11;
constexpr std::size_t most_waiting = 10000;
constexpr long delivery_seconds = 10;

constexpr const char* filter_class = "CIM_IndicationFilter";
constexpr const char* subscription_class = "CIM_IndicationSubscription";
constexpr const char* destination_classes[] = {"CIM_ListenerDestinationCIMXML", "CIM_IndicationHandlerCIMXML",
                                               "CIM_ListenerDestination"};

bool is_destination(const std::string& class_name)
{
    return std::any_of(std::begin(destination_classes), std::end(destination_classes),
                       [&](const char* each) { return same_name(class_name, each); });
}

/// Whatever names the same instance: clients and servers spell namespaces and hosts of such references as they like.
bool is_same(const Path& a, const Path& b)
{
    Path left = a, right = b;
    left.name_space = right.name_space = "";
    for (Path* path : {&left, &right})
        for (Named_Value& key : path->keys)
            if (const Path* reference = key.value.as_path()) {
                Path bare = *reference;
                bare.name_space = bare.host = "";
                key.value = Value::reference(bare);
            }
    return left == right;
}

/// The class behind FROM in a query of WQL or CQL.
std::string class_in(const std::string& query)
{
    std::istringstream words(query);
    for (std::string word; words >> word;)
        if (same_name(word, "from") && words >> word) return word;
    return "";
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
        if (entry.id) m_host.unsubscribe(entry.id);
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
    if (find(instance.path)) throw Cim_Fault{already_exists, "there is such an instance already"};
    // The providers are asked without the lock: they may deliver at once.
    const int id = is_subscription ? activate(instance) : 0;
    std::lock_guard<std::mutex> hold(m_mutex);
    m_entries.push_back({instance, id});
    return instance.path;
}

int Subscriptions::activate(const Instance& subscription)
{
    const Path* filter_path = subscription.get("Filter").as_path();
    const Path* handler_path = subscription.get("Handler").as_path();
    const std::optional<Instance> filter = filter_path ? find(*filter_path) : std::nullopt;
    const std::optional<Instance> handler = handler_path ? find(*handler_path) : std::nullopt;
    if (!filter || !handler) throw Cim_Fault{not_found, "the filter or the destination does not exist"};
    const std::string query = filter->get("Query").as_text(), url = handler->get("Destination").as_text();
    const std::string class_name = class_in(query);
    if (!m_host.schema().find(class_name)) throw Cim_Fault{invalid_class, "the filter names no class: " + query};
    std::string name_space = filter->get("SourceNamespace").as_text();
    const std::vector<Value>& name_spaces = filter->get("SourceNamespaces").elements();
    if (name_space.empty() && !name_spaces.empty()) name_space = name_spaces[0].as_text();
    if (name_space.empty()) name_space = "root/norvane";
    int id = 0;
    const Status status = m_host.subscribe(
        name_space, class_name, [this, url](const Indication& indication) { queue(url, indication); }, id, query);
    if (!status.ok()) throw Cim_Fault{status.code <= 17 ? status.code : 1, status.message};
    return id;
}

void Subscriptions::remove(const Path& path)
{
    int id = 0;
    {
        std::lock_guard<std::mutex> hold(m_mutex);
        const auto at = std::find_if(m_entries.begin(), m_entries.end(),
                                     [&](const Entry& entry) { return is_same(entry.instance.path, path); });
        if (at == m_entries.end()) throw Cim_Fault{not_found, "there is no such instance"};
        for (const Entry& entry : m_entries)
            for (const char* end : {"Filter", "Handler"})
                if (const Path* reference = entry.instance.get(end).as_path(); reference && is_same(*reference, path))
                    throw Cim_Fault{1, "a subscription uses it"};
        id = at->id;
        m_entries.erase(at);
    }
    if (id) m_host.unsubscribe(id);
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
