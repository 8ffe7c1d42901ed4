#include "tests/support/simulator.h"

#include <algorithm>
#include <cstdlib>
#include <set>
#include <sstream>
#include <stdexcept>

#include "simulator/nvrsim.h"
#include "tests/support/private_host.h"

namespace nvrtest {

namespace {

template <class Read>
std::string text_of(Read read)
{
    std::string text(read(nullptr, 0) + 1, '\0');
    text.resize(std::min(text.size() - 1, read(text.data(), text.size())));
    return text;
}

[[noreturn]] void fail()
{
    throw std::runtime_error(text_of(nvrsim_error));
}

// One line a fault, "... seen=N hits=N changed=N".
std::uint64_t sum_of_faults(const std::string& count)
{
    std::istringstream lines(text_of(nvrsim_faults));
    std::uint64_t sum = 0;
    for (std::string line; std::getline(lines, line);) {
        const std::string word = ' ' + count + '=';
        const std::size_t at = line.rfind(word);
        if (at == std::string::npos) throw std::runtime_error("no count of " + count + " in: " + line);
        sum += std::strtoull(line.c_str() + at + word.size(), nullptr, 10);
    }
    return sum;
}

const char* const library_names[] = {"HBAAPI", "lrmapi", "rmapi", "tssdm"};

std::string file_of(const std::string& library)
{
    return "/lib" + library + ".so";
}

} // namespace

void load_scenario(const std::string& scenario)
{
    const bool is_text = scenario.find('\n') != std::string::npos;
    const int loaded = is_text ? nvrsim_load_text(scenario.c_str(), "scenario of the test")
                               : nvrsim_load((std::string(NVRSIM_BUILD) + "/scenarios/" + scenario + ".toml").c_str());
    if (loaded != 0) fail();
}

void add_fault(const std::string& fault)
{
    if (nvrsim_fault(fault.c_str()) < 0) fail();
}

void clear_faults()
{
    nvrsim_clear_faults();
}

std::uint64_t fault_hits()
{
    return sum_of_faults("hits");
}

std::uint64_t fault_changes()
{
    return sum_of_faults("changed");
}

const std::vector<Library_Failure>& library_failures()
{
    static const std::vector<Library_Failure> all = {
        {"status-1", "status = 1"},
        {"status-7", "status = 7"},
        {"status-8", "status = 8"},
        {"status-9", "status = 9"},
        {"status-191", "status = 191"},
        {"null", "damage = \"null\""},
        {"ones", "damage = \"ones\""},
        {"garbage", "damage = \"garbage\""},
        {"unterminated", "damage = \"unterminated\""},
        {"count-0", "value = 0"},
        {"count-300", "value = 300"},
        {"count-huge", "value = 4294967295"},
        {"more-than-there-is", "value = 4294967295, status = 7"},
        {"throws", "throws = true"},
    };
    return all;
}

std::vector<std::string> called_operations()
{
    // The first word of each line of the log.
    std::istringstream lines(text_of(nvrsim_log));
    std::set<std::string> names;
    for (std::string line; std::getline(lines, line);)
        names.insert(line.substr(0, line.find(' ')));
    return {names.begin(), names.end()};
}

std::uint64_t calls(const std::string& operation)
{
    return nvrsim_calls(operation.c_str());
}

std::string port_value(unsigned number, const std::string& name)
{
    return text_of([&](char* buffer, std::size_t size) {
        return nvrsim_get(std::to_string(number).c_str(), name.c_str(), buffer, size);
    });
}

void set_port(unsigned number, const std::string& name, std::uint64_t value)
{
    if (nvrsim_set(std::to_string(number).c_str(), name.c_str(), value) != 0) fail();
}

void compose_libraries(const std::vector<std::string>& present)
{
    for (const char* name : library_names) {
        const std::string path = library_folder() + file_of(name);
        if (std::find(present.begin(), present.end(), name) != present.end())
            make_link(NVRSIM_BUILD "/lib" + file_of(name), path);
        else
            write_file(path, "No library of this name is installed.\n");
    }
}

void compose_variant(const std::string& variant)
{
    for (const char* name : library_names) {
        const std::string file = NVRSIM_BUILD "/variants/" + variant + file_of(name);
        const std::string path = library_folder() + file_of(name);
        if (exists(file))
            make_link(file, path);
        else
            remove(path);
    }
}

} // namespace nvrtest
