// What the module costs as the SAN grows: each point of scale in a fresh process, and a table of them all.
//
// Times are processor time of the process, so that other work on the machine counts little; the time of the simulated
// libraries is taken off a refresh. Results are counted as they are returned, and not kept: what a client or a server
// does with them is not the module's cost. What the traversals print goes to /dev/null.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <dlfcn.h>
#include <exception>
#include <fcntl.h>
#include <fstream>
#include <iostream>
#include <malloc.h>
#include <map>
#include <set>
#include <stdexcept>
#include <string>
#include <thread>
#include <time.h>
#include <unistd.h>
#include <utility>
#include <vector>

#include "bench/Bench_Host.h"
#include "simulator/nvrsim.h"
#include "tests/module/support/Rig.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/private_host_setup.h"

namespace {

struct Point {
    const char* name;
    unsigned ports, targets, luns;
    unsigned paths() const { return ports * targets * luns; }
    /// What a port's endpoint is tied to: its units and their endpoints.
    unsigned port_ends() const { return 2 * targets * luns; }
};

constexpr Point points[] = {
    {"16", 2, 2, 4},  {"64", 2, 4, 8},       {"S", 2, 8, 8},     {"1000", 4, 10, 25},  {"M", 4, 16, 16},
    {"L", 8, 32, 16}, {"10000", 10, 20, 50}, {"XL", 16, 32, 32}, {"XXL", 16, 125, 50},
};

constexpr char name_space[] = "root/norvane";
constexpr char mapping_call[] = "HBA_GetFcpTargetMapping";
constexpr char volume_class[] = "NVRHBA_StorageVolume";

/// The figures of a point by name. Times in microseconds, memory in bytes. Those of all enumerations and traversals
/// are named by their question, which has a space in it.
using Figures = std::map<std::string, double>;

/// Before a question: how many instances or names were answered.
constexpr char answers_to[] = "answers to ";

// --- One point
// -------------------------------------------------------------------------------------------------------

double processor_microseconds()
{
    timespec now{};
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &now);
    return static_cast<double>(now.tv_sec) * 1e6 + static_cast<double>(now.tv_nsec) * 1e-3;
}

template <class Work>
double microseconds_of(Work work)
{
    const double start = processor_microseconds();
    work();
    return processor_microseconds() - start;
}

/// The least of so many runs, or of fewer that take so many microseconds together.
template <class Work>
double least_of(Work work, int runs = 10, double most = 1.5e6)
{
    double least = microseconds_of(work), spent = least;
    for (int i = 1; i < runs && spent < most; i++) {
        const double run = microseconds_of(work);
        least = std::min(least, run);
        spent += run;
    }
    return least;
}

double status_bytes(const char* key)
{
    std::ifstream status("/proc/self/status");
    for (std::string line; std::getline(status, line);)
        if (line.compare(0, std::strlen(key), key) == 0) return std::stod(line.substr(std::strlen(key) + 1)) * 1024;
    throw std::runtime_error("no such line in the process's status");
}

double resident()
{
    malloc_trim(0);
    return status_bytes("VmRSS");
}

void forget_peak()
{
    std::ofstream("/proc/self/clear_refs") << "5";
}

/// Lets the cache grow old and waits until the SAN is read anew. The thread holds the lock that an enumeration of ports
/// takes from its first call into the libraries until the new maps are ready. An earlier thread that is still at its
/// end takes the new time for its own, so the time-out may have to come twice.
void refresh_san(nvrbench::Bench_Host& host)
{
    const std::uint64_t calls = nvrsim_calls(mapping_call);
    while (nvrsim_calls(mapping_call) == calls) {
        nvrtest::advance_clock(std::chrono::minutes(31));
        (void)host.enumerate("NVRHBA_Product");
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    (void)host.enumerate("NVRHBA_FCPort");
}

void require(bool is_so, const char* what)
{
    if (!is_so) throw std::runtime_error(what);
}

void measure_memory(nvrbench::Bench_Host& host, const Point& point, Figures& figures)
{
    const double resident_before = resident();
    const auto start = std::chrono::steady_clock::now();
    figures["first_answer"] = microseconds_of([&] { (void)host.enumerate("NVRHBA_TapeDrive"); });
    figures["first_elapsed"] =
        std::chrono::duration<double, std::micro>(std::chrono::steady_clock::now() - start).count();
    const double steady = resident() - resident_before;
    figures["resident"] = steady / point.paths();
    forget_peak();
    refresh_san(host);
    figures["peak_ratio"] = (status_bytes("VmHWM") - resident_before) / steady;
}

void measure_refresh(nvrbench::Bench_Host& host, const Point& point, Figures& figures)
{
    double total = 0, own = 0;
    constexpr int rounds = 3;
    for (int i = 0; i < rounds; i++) {
        nvrsim_time_calls(1);
        const double run = microseconds_of([&] { refresh_san(host); });
        const double mine = run - nvrsim_call_seconds() * 1e6;
        nvrsim_time_calls(0);
        total = i == 0 ? run : std::min(total, run);
        own = i == 0 ? mine : std::min(own, mine);
    }
    figures["refresh"] = own / point.paths();
    figures["refresh_total"] = total / point.paths();
}

/// What takes results and does nothing with them.
const host::Result_Sink& nowhere()
{
    static const host::Result_Sink sink{[](host::Instance&&) {}, [](host::Path&&) {}};
    return sink;
}

void measure_enumerations(host::Host& server, const Point& point, const std::string& suffix, Figures& figures)
{
    const auto count = [&](const host::Answer& answer) {
        require(answer.handed_on == point.paths(), "not all volumes were told");
    };
    figures["instances" + suffix] =
        least_of([&] { count(server.enumerate(name_space, volume_class, {}, &nowhere())); }) / point.paths();
    figures["names" + suffix] =
        least_of([&] { count(server.names(name_space, volume_class, &nowhere())); }) / point.paths();
}

void measure_lookups(nvrbench::Bench_Host& host, const Point& point, Figures& figures)
{
    host::Host& server = host.server();
    const host::Path volume = server.names(name_space, volume_class).paths.at(point.paths() / 2);
    figures["get"] = least_of([&] { require(server.get(volume).ok(), "a volume was not found"); });
    figures["volume_paths"] = least_of([&] {
        const char* path_class = "NVRHBA_SCSIInitiatorTargetStorageVolumePath";
        require(server.associators(volume, path_class).instances.size() == 2, "a volume lost its ends");
    });
    figures["volume_all"] =
        least_of([&] { require(server.associators(volume).instances.size() >= 2, "a volume lost its ends"); });
    const host::Path initiator = server.names(name_space, "NVRHBA_SCSIProtocolInitiatorEndpoint").paths.at(0);
    const std::size_t ends = point.port_ends();
    figures["port_devices"] = least_of([&] {
                                  const char* path_class = "NVRHBA_SCSIInitiatorTargetStorageVolumePath";
                                  const host::Answer answer =
                                      server.associators(initiator, path_class, "", "", "", {}, &nowhere());
                                  require(answer.handed_on == ends, "a port lost its devices");
                              }) /
                              static_cast<double>(ends);
}

/// What an answered instance or name costs, if that is less than what was measured before, and how many there were, if
/// any.
template <class Ask>
void measure_question(Figures& figures, const std::string& question, Ask ask)
{
    std::size_t answered = 0;
    const auto run = [&] {
        const host::Answer answer = ask();
        require(answer.ok() || answer.handed_on == 0, "an answer broke off");
        answered = answer.handed_on;
    };
    double least = microseconds_of(run);
    if (answered == 0) return;
    constexpr double most = 3e5;
    if (least < most) least = std::min(least, least_of(run, 4, most));
    const double each = least / static_cast<double>(answered);
    double& figure = figures.emplace(question, each).first->second;
    figure = std::min(figure, each);
    figures[answers_to + question] = static_cast<double>(answered);
}

/// All enumerations, and all traversals of one association class from the host, from a port and from its endpoint.
void ask_all_questions(host::Host& server, Figures& figures)
{
    const auto first_of = [&server](const char* class_name) {
        return server.names(name_space, class_name).paths.at(0);
    };
    const host::Instance in_host = server.enumerate(name_space, "NVRHBA_FCPortSystemDevice").instances.at(0);
    const host::Path* const host = in_host.get("GroupComponent").as_path();
    require(host, "a port is in no host");
    const host::Path sources[] = {*host, first_of("NVRHBA_FCPort"), first_of("NVRHBA_SCSIProtocolInitiatorEndpoint")};
    const host::Result_Sink* const sink = &nowhere();
    for (const host::Registration& one : server.registrations()) {
        const std::string& name = one.class_name;
        if (one.kinds & host::instance_kind) {
            measure_question(figures, "instances of " + name,
                             [&] { return server.enumerate(name_space, name, {}, sink); });
            measure_question(figures, "names of " + name, [&] { return server.names(name_space, name, sink); });
        }
        if (!(one.kinds & host::association_kind)) continue;
        for (const host::Path& source : sources) {
            const std::string over = " of " + source.class_name + " over " + name;
            measure_question(figures, "associators" + over,
                             [&] { return server.associators(source, name, "", "", "", {}, sink); });
            measure_question(figures, "associator names" + over,
                             [&] { return server.associator_names(source, name, "", "", "", sink); });
            measure_question(figures, "references" + over,
                             [&] { return server.references(source, name, "", {}, sink); });
            measure_question(figures, "reference names" + over,
                             [&] { return server.reference_names(source, name, "", sink); });
        }
    }
}

/// Twice all of them: what disturbs the machine for a while then meets no question each time.
void measure_questions(host::Host& server, Figures& figures)
{
    for (int round = 0; round < 2; round++)
        ask_all_questions(server, figures);
}

void measure_floor(const Point& point, const std::set<std::string>& shape, Figures& figures)
{
    void* library = dlopen(NVR_FLOOR, RTLD_NOW | RTLD_LOCAL);
    if (!library) throw std::runtime_error(dlerror());
    reinterpret_cast<void (*)(unsigned)>(dlsym(library, "floor_instances"))(point.paths());
    host::Host server(nvrtest::module_schema());
    server.add({volume_class, "NVRHBA_StorageVolume_Provider", NVR_FLOOR, host::instance_kind, {name_space}, false});
    nvrbench::require_same(shape, nvrbench::shape_of(server, volume_class));
    measure_enumerations(server, point, "_floor", figures);
}

const Point& point_of(const std::string& name)
{
    for (const Point& point : points)
        if (name == point.name) return point;
    throw std::runtime_error("no point of scale is named " + name);
}

void measure(const Point& point)
{
    const int answer = dup(STDOUT_FILENO);
    const int null = open("/dev/null", O_WRONLY);
    dup2(null, STDOUT_FILENO);
    Figures figures;
    {
        nvrbench::Bench_Host host(point.ports, point.targets, point.luns);
        measure_memory(host, point, figures);
        measure_refresh(host, point, figures);
        measure_enumerations(host.server(), point, "", figures);
        measure_lookups(host, point, figures);
        if (std::getenv("NVR_SCALE_QUESTIONS")) measure_questions(host.server(), figures);
        measure_floor(point, nvrbench::shape_of(host.server(), volume_class), figures);
    }
    for (const auto& [name, figure] : figures)
        dprintf(answer, "%.6g %s\n", figure, name.c_str());
}

// --- The tables
// ------------------------------------------------------------------------------------------------------

Figures measured_apart(const char* name, bool with_questions)
{
    const std::string command = std::string(with_questions ? "NVR_SCALE_QUESTIONS=1 " : "") +
                                "NVR_SCALE_POINT=" + name + " /proc/" + std::to_string(getpid()) + "/exe";
    FILE* child = popen(command.c_str(), "r");
    require(child, "no process could be started");
    Figures figures;
    double figure;
    char figure_name[200];
    while (std::fscanf(child, "%lf %199[^\n]", &figure, figure_name) == 2)
        figures[figure_name] = figure;
    require(pclose(child) == 0, "a point of scale failed");
    return figures;
}

void print_row(const Point& point, const Figures& f)
{
    std::printf(
        "| %s | %u | %.3f | %.3f | %.1f | %.1f | %.0f | %.2f | %.1f | %.2f | %.1f | %.2f | %.0f | %.1f | %.1f | %.1f "
        "|\n",
        point.name, point.paths(), f.at("first_answer") * 1e-6, f.at("first_elapsed") * 1e-6, f.at("refresh"),
        f.at("refresh_total"), f.at("resident"), f.at("peak_ratio"), f.at("instances"),
        f.at("instances") / f.at("instances_floor"), f.at("names"), f.at("names") / f.at("names_floor"), f.at("get"),
        f.at("volume_paths") * 1e-3, f.at("volume_all") * 1e-3, f.at("port_devices"));
    std::fflush(stdout);
}

/// The points a power of ten apart: whole times, and what a path costs relative to the host of 1,000.
void print_growth(const std::map<std::string, Figures>& measured)
{
    const char* const compared[] = {"64", "1000", "10000", "XXL"};
    const Figures& unit = measured.at("1000");
    std::puts("\n| paths | refresh s | a path to 1,000 | enumeration s | a path to 1,000 | names s | a path to 1,000 | "
              "resident B/path | to 1,000 | "
              "from a port s | an end to 1,000 |");
    std::puts("|---|---|---|---|---|---|---|---|---|---|---|");
    for (const char* name : compared) {
        const auto found = measured.find(name);
        if (found == measured.end()) continue;
        const Point& point = point_of(name);
        const Figures& f = found->second;
        std::printf("| %u |", point.paths());
        for (const char* figure : {"refresh", "instances", "names"})
            std::printf(" %.4f | %.2f |", f.at(figure) * point.paths() * 1e-6, f.at(figure) / unit.at(figure));
        std::printf(" %.0f | %.2f | %.4f | %.2f |\n", f.at("resident"), f.at("resident") / unit.at("resident"),
                    f.at("port_devices") * point.port_ends() * 1e-6, f.at("port_devices") / unit.at("port_devices"));
    }
}

/// The points between which each question's growth is told: M and XXL, or else the smallest and the largest. One or
/// none is no growth.
std::pair<std::string, std::string> compared_points(const std::vector<std::string>& names)
{
    const auto named = [&names](const char* name) {
        return std::find(names.begin(), names.end(), name) != names.end();
    };
    if (named("M") && named("XXL")) return {"M", "XXL"};
    const auto [smallest, largest] =
        std::minmax_element(names.begin(), names.end(), [](const std::string& one, const std::string& other) {
            return point_of(one).paths() < point_of(other).paths();
        });
    if (smallest == largest) return {};
    return {*smallest, *largest};
}

/// A question and how many times more an answer to it costs at the larger point.
struct Growth {
    std::string question;
    double ratio = 0;

    void keep_worse(const std::string& other, double its_ratio)
    {
        if (its_ratio > ratio) *this = {other, its_ratio};
    }
};

/// A row for each question whose answer grows by more than the ports do, the worst of each kind, and the worst of all
/// others.
void print_questions(const Point& smaller, const Figures& before, const Point& larger, const Figures& after)
{
    std::printf(
        "\n| question | answers at %s | us each | answers at %s | us each | ratio |\n|---|---|---|---|---|---|\n",
        smaller.name, larger.name);
    std::map<std::string, Growth> worst;
    Growth worst_other;
    for (const auto& [question, us] : after) {
        const auto answers_after = after.find(answers_to + question);
        const auto answers_before = before.find(answers_to + question);
        if (answers_after == after.end() || answers_before == before.end()) continue;
        const double us_before = before.at(question), ratio = us / us_before;
        if (answers_after->second * smaller.ports <= answers_before->second * larger.ports) {
            worst_other.keep_worse(question, ratio);
            continue;
        }
        worst[question.substr(0, question.find(" of "))].keep_worse(question, ratio);
        std::printf("| %s | %.0f | %.1f | %.0f | %.1f | %.2f |\n", question.c_str(), answers_before->second, us_before,
                    answers_after->second, us, ratio);
    }
    require(worst.size() == 6 && worst_other.ratio > 0, "some kind of question has no answers");
    std::puts("");
    for (const auto& [kind, growth] : worst)
        std::printf("worst: %s: %.2f\n", growth.question.c_str(), growth.ratio);
    std::printf("worst whose answer does not grow with the SAN: %s: %.2f\n", worst_other.question.c_str(),
                worst_other.ratio);
}

void print_table(const std::vector<std::string>& names)
{
    const auto compared = compared_points(names);
    std::map<std::string, Figures> measured;
    std::puts(
        "| point | paths | first answer s | elapsed s | refresh us/path | with libraries | resident B/path | peak | "
        "instances us | of floor | names us | of floor | get us | associators ms | all classes ms | from a port us/end "
        "|");
    std::puts("|---|---|---|---|---|---|---|---|---|---|---|---|---|---|---|---|");
    for (const std::string& name : names) {
        const Point& point = point_of(name);
        measured[name] = measured_apart(point.name, name == compared.first || name == compared.second);
        print_row(point, measured[name]);
    }
    if (measured.count("1000")) print_growth(measured);
    if (!compared.first.empty())
        print_questions(point_of(compared.first), measured[compared.first], point_of(compared.second),
                        measured[compared.second]);
}

} // namespace

int main(int argc, char** argv)
{
    try {
        nvrtest::enter_private_host(argv);
        if (const char* name = std::getenv("NVR_SCALE_POINT")) {
            measure(point_of(name));
            return 0;
        }
        std::vector<std::string> names(argv + 1, argv + argc);
        if (names.empty())
            for (const Point& point : points)
                names.push_back(point.name);
        print_table(names);
    } catch (const std::exception& error) {
        std::cerr << "nvr_scale: " << error.what() << '\n';
        return 1;
    }
    return 0;
}
