#include "tests/host/Things.h"

#include <map>
#include <mutex>
#include <stdexcept>

namespace {

std::mutex mutex;
std::map<std::string, long> settings;
std::vector<std::string> told;

} // namespace

// What the provider module finds in this program.
extern "C" __attribute__((visibility("default"))) void test_event(const char* text)
{
    std::lock_guard lock(mutex);
    told.emplace_back(text);
}

extern "C" __attribute__((visibility("default"))) long test_setting(const char* name)
{
    std::lock_guard lock(mutex);
    auto found = settings.find(name);
    return found == settings.end() ? 0 : found->second;
}

extern "C" __attribute__((visibility("default"))) void test_throw()
{
    throw std::runtime_error("thrown by a test");
}

namespace things {

void set(const std::string& name, long value)
{
    std::lock_guard lock(mutex);
    settings[name] = value;
}

std::vector<std::string> events()
{
    std::lock_guard lock(mutex);
    return std::exchange(told, {});
}

void reset()
{
    std::lock_guard lock(mutex);
    settings.clear();
    told.clear();
}

std::shared_ptr<const host::Schema> schema()
{
    static const auto& read = *new std::shared_ptr<const host::Schema>([] {
        std::string error;
        auto schema = host::Schema::from_files({THINGS_MOF}, error);
        if (!schema) ADD_FAILURE() << error;
        return schema;
    }());
    return read;
}

host::Host_Options options(const host::Manner& manner)
{
    host::Host_Options options;
    options.manner = manner;
    return options;
}

std::unique_ptr<host::Host> make_host(const host::Manner& manner)
{
    auto server = std::make_unique<host::Host>(schema(), options(manner));
    std::string error;
    EXPECT_EQ(4u, server->add_module(THINGS_MODULE, space, &error)) << error;
    return server;
}

host::Registration registration(const std::string& class_name, unsigned kinds)
{
    return {class_name, class_name + "_Provider", THINGS_MODULE, kinds, {space}, false};
}

host::Path thing(std::uint32_t id, const std::string& class_name)
{
    host::Path path;
    path.name_space = space;
    path.class_name = class_name;
    path.set("Id", host::Value::uint32(id));
    path.set("Realm", host::Value::string("test \"realm\""));
    return path;
}

} // namespace things
