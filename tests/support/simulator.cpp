#include "tests/support/simulator.h"

#include <dirent.h>
#include <stdexcept>

#include "simulator/nvrsim.h"
#include "tests/support/private_host.h"

namespace nvrtest {

namespace {

const std::string build = NVRSIM_BUILD;

void check(bool done)
{
    if (done) return;
    std::string text(nvrsim_error(nullptr, 0) + 1, '\0');
    text.resize(nvrsim_error(text.data(), text.size()));
    throw std::runtime_error(text);
}

void show_libraries(const std::string& folder)
{
    DIR* entries = ::opendir(folder.c_str());
    if (!entries) throw std::runtime_error("no libraries in " + folder);
    while (const dirent* entry = ::readdir(entries)) {
        const std::string name = entry->d_name;
        if (name.rfind("lib", 0) == 0) link(folder + "/" + name, library_folder() + "/" + name);
    }
    ::closedir(entries);
}

} // namespace

const char* const Simulator::one_port = "[[adapter]]\n[[target]]\nluns = 3\n";

Simulator::Simulator(const std::string& scenario, const std::string& libraries)
{
    show_libraries(libraries.empty() ? build + "/lib" : build + "/variants/" + libraries);
    load(scenario);
}

void Simulator::load(const std::string& scenario)
{
    check(nvrsim_load_text(scenario.c_str(), "test") == 0);
}

void Simulator::load_shipped(const std::string& name)
{
    check(nvrsim_load((build + "/scenarios/" + name + ".toml").c_str()) == 0);
}

Simulator::Fault::Fault(std::string operation) : m_table("call = \"" + operation + "\"") {}

Simulator::Fault::~Fault() noexcept(false)
{
    check(nvrsim_fault(m_table.c_str()) > 0);
}

Simulator::Fault& Simulator::Fault::add(const std::string& key, const std::string& value)
{
    m_table += ", " + key + " = " + value;
    return *this;
}

void Simulator::clear_faults()
{
    nvrsim_clear_faults();
}

std::uint64_t Simulator::calls(const std::string& operation) const
{
    return nvrsim_calls(operation.c_str());
}

std::string Simulator::get(const std::string& port, const std::string& name) const
{
    std::string text(nvrsim_get(port.c_str(), name.c_str(), nullptr, 0) + 1, '\0');
    text.resize(nvrsim_get(port.c_str(), name.c_str(), text.data(), text.size()));
    return text;
}

void Simulator::set(const std::string& port, const std::string& name, std::uint64_t value)
{
    check(nvrsim_set(port.c_str(), name.c_str(), value) == 0);
}

std::size_t Simulator::open_handles() const
{
    return nvrsim_open_handles();
}

} // namespace nvrtest
