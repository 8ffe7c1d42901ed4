#include "tests/agent/Simulated_Host.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <pthread.h>
#include <thread>
#include <unistd.h>

#include "agent/Clock.h"
#include "runtime/Instance.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

namespace nvrtest {

using namespace cimple;

std::function<void(ProviderAgent&)> on_driver_log;
bool no_more_threads = false;
bool no_host_name = false;

namespace {

constexpr uint64 start_of_time = 1700000000000000;
std::atomic<uint64> now{start_of_time};
std::atomic<uint64> asleep{0};

uint64 test_clock()
{
    return now;
}

void test_sleep(uint64 usec)
{
    asleep += usec;
    now += usec;
}

/// Fetch threads that begin less those that end in these words.
long fetches(const std::vector<std::string>& words)
{
    return std::count(words.begin(), words.end(), "PERF: DataFetch_Handler Thread BEGIN") -
           std::count(words.begin(), words.end(), "PERF: DataFetch_Handler Thread END");
}

std::string scalar(const void* place, uint16 type)
{
    switch (type) {
    case BOOLEAN:
        return *static_cast<const bool*>(place) ? "true" : "false";
    case UINT8:
        return std::to_string(*static_cast<const uint8*>(place));
    case UINT16:
        return std::to_string(*static_cast<const uint16*>(place));
    case UINT32:
        return std::to_string(*static_cast<const uint32*>(place));
    case SINT32:
        return std::to_string(*static_cast<const sint32*>(place));
    case UINT64:
        return std::to_string(*static_cast<const uint64*>(place));
    case SINT64:
        return std::to_string(*static_cast<const sint64*>(place));
    case REAL32: {
        char text[32];
        std::snprintf(text, sizeof text, "%.6g", static_cast<double>(*static_cast<const real32*>(place)));
        return text;
    }
    case DATETIME: {
        char text[Datetime::text_size];
        static_cast<const Datetime*>(place)->ascii(text);
        return text;
    }
    case STRING:
        return static_cast<const String*>(place)->c_str();
    default:
        return "?";
    }
}

} // namespace

void advance_clock(uint64 usec)
{
    now += usec;
}

uint64 slept()
{
    return asleep;
}

SimulatedHost::SimulatedHost()
{
    agent_clock = &test_clock;
    agent_sleep = &test_sleep;
    asleep = 0;
    on_driver_log = nullptr;
    no_more_threads = false;
    no_host_name = false;
    install();
    scenario("[[adapter]]\n[[target]]\nluns = 2\n");
    CLogger::instance()->enable();
    log.reset(new Log_Capture);
}

SimulatedHost::~SimulatedHost()
{
    log.reset();
}

void SimulatedHost::install(const std::vector<std::string>& only)
{
    compose_libraries(only);
}

void SimulatedHost::scenario(const std::string& toml)
{
    load_scenario(toml + '\n'); // a text, also an empty one
}

void SimulatedHost::fault(const std::string& table)
{
    add_fault(table);
}

int SimulatedHost::load()
{
    return ProviderAgent::load();
}

void SimulatedHost::unload()
{
    ProviderAgent::unload();
}

// The thread's last words come behind its last look at the flags.
void SimulatedHost::settle()
{
    while (agent().m_bDataFetchRunning || m_fetching + fetches(log->words()) > 0)
        usleep(1000);
}

void SimulatedHost::awaitWord(const std::string& word) const
{
    while (true) {
        const std::vector<std::string> said = log->words();
        if (std::find(said.begin(), said.end(), word) != said.end()) return;
        std::this_thread::yield();
    }
}

void SimulatedHost::refresh()
{
    agent().m_bAdapterRefreshPending.ask();
    agent().BuildCimpleInfo();
    settle();
}

SimulatedHost::Instances SimulatedHost::plain(const Instance_Map& map)
{
    Instances all;
    enumeratePlain(agent(), map, {collect, &all});
    settle();
    return all;
}

SimulatedHost::Instances SimulatedHost::san(const Instance_Map& map)
{
    Instances all;
    enumerateSAN(agent(), map, {collect, &all});
    settle();
    return all;
}

Ref<Instance> LoadedHost::only(const Instances& all, const Instance_Map& map)
{
    EXPECT_EQ(all.size(), 1u);
    return all.size() == 1 ? all[0] : Ref<Instance>(create(map.meta_class(), true));
}

std::vector<std::string> SimulatedHost::words()
{
    CLogger::Hold hold;
    std::vector<std::string> all = log->words();
    log->clear();
    m_fetching += fetches(all);
    return all;
}

void SimulatedHost::listenAgain()
{
    log.reset(new Log_Capture);
    m_fetching = 0;
}

bool collect(Instance* instance, int status, void* data)
{
    EXPECT_EQ(status, 0);
    static_cast<std::vector<Ref<Instance>>*>(data)->emplace_back(instance);
    return true;
}

std::string value(const Instance* instance, const char* name)
{
    const Meta_Feature* feature = find_feature(instance->meta_class, name, META_FLAG_PROPERTY);
    if (!feature) return "no such property";
    const Meta_Property* property = as_property(feature);
    if (null_of(instance, property)) return "null";
    if (property->subscript == 0) return scalar(feature_at(instance, property->offset), property->type);
    const Array_Base& array = array_of(instance, property);
    std::string text;
    for (std::size_t i = 0; i < array.size(); i++)
        text += (i ? "," : "") + scalar(array.at(i), property->type);
    return "{" + text + "}";
}

std::string end(const Instance* association, const char* reference, const char* property)
{
    const Meta_Feature* feature = find_feature(association->meta_class, reference, META_FLAG_REFERENCE);
    if (!feature) return "no such reference";
    const Instance* target = reference_of(association, as_reference(feature));
    return target ? value(target, property) : "null";
}

} // namespace nvrtest

// The linker sends every call of pthread_create in this program here.
extern "C" int __real_pthread_create(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*);
extern "C" int __wrap_pthread_create(pthread_t* thread, const pthread_attr_t* attributes, void* (*procedure)(void*),
                                     void* argument)
{
    if (nvrtest::no_more_threads) return EAGAIN;
    return __real_pthread_create(thread, attributes, procedure, argument);
}

// And every call of gethostname here.
extern "C" int __real_gethostname(char*, std::size_t);
extern "C" int __wrap_gethostname(char* name, std::size_t size)
{
    if (!nvrtest::no_host_name) return __real_gethostname(name, size);
    errno = ENAMETOOLONG;
    return -1;
}
