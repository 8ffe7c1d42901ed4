// nvrsimctl: injects faults, link events and values into a running process that has the simulated libraries, shows what
// it did, and writes scenarios. Speaks the line protocol of Socket.cpp, or works alone where no process is needed.
#include "simulator/nvrsim.h"

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iostream>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

namespace {

constexpr int noProcess = 3;

class Failure : public std::runtime_error {
public:
    Failure(int status, const std::string& text) : std::runtime_error(text), status(status) {}
    const int status;
};

/// Sends one line and gives the answer without its "ok". Throws Failure.
std::string ask(const std::string& socketPath, const std::string& line)
{
    if (socketPath.empty())
        throw Failure(noProcess, "no socket: give --socket, or set NVRSIM_SOCKET as in the process to be controlled");
    if (line.find('\n') != std::string::npos) throw Failure(2, "arguments must not hold line ends");
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    if (socketPath.size() >= sizeof address.sun_path) throw Failure(2, "the socket's name is too long: " + socketPath);
    std::strcpy(address.sun_path, socketPath.c_str());
    const int connection = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (connection < 0 || ::connect(connection, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
        const std::string reason = std::strerror(errno);
        if (connection >= 0) ::close(connection);
        throw Failure(noProcess, "no process answers at " + socketPath + ": " + reason);
    }
    const std::string request = line + "\n";
    for (size_t sent = 0; sent < request.size();) {
        const ssize_t put = ::send(connection, request.data() + sent, request.size() - sent, MSG_NOSIGNAL);
        if (put <= 0) break;
        sent += static_cast<size_t>(put);
    }
    std::string reply;
    char piece[65536];
    for (ssize_t got; (got = ::recv(connection, piece, sizeof piece, 0)) > 0;)
        reply.append(piece, static_cast<size_t>(got));
    ::close(connection);
    if (reply.compare(0, 3, "ok\n") == 0) return reply.substr(3);
    if (reply.compare(0, 6, "error ") == 0) throw Failure(1, reply.substr(6, reply.find('\n') - 6));
    throw Failure(noProcess, "the process broke off without an answer");
}

const char* state_word(unsigned state)
{
    static const char* const words[] = {"?",           "unknown",   "online", "offline", "bypassed",
                                        "diagnostics", "link down", "error",  "loopback"};
    return state < sizeof words / sizeof *words ? words[state] : "?";
}

const char* speed_word(unsigned speed)
{
    switch (speed) {
    case 1:
        return "1 Gbit/s";
    case 2:
        return "2 Gbit/s";
    case 4:
        return "10 Gbit/s";
    case 8:
        return "4 Gbit/s";
    case 16:
        return "8 Gbit/s";
    case 32:
        return "16 Gbit/s";
    default:
        return "-";
    }
}

void print_state(const std::string& text)
{
    const auto json = nlohmann::json::parse(text);
    if (!json["error"].get<std::string>().empty())
        std::cout << "scenario refused: " << json["error"].get<std::string>() << "\n";
    std::printf("%-4s %-16s  %-20s %-11s %-10s %-8s %8s %8s\n", "Port", "WWPN", "Adapter", "State", "Speed", "Beacon",
                "Targets", "Paths");
    for (const auto& adapter : json["adapters"])
        for (const auto& port : adapter["ports"])
            std::printf("%-4u %-16s  %-20s %-11s %-10s %-8s %8u %8u\n", port["number"].get<unsigned>(),
                        port["wwpn"].get<std::string>().c_str(), adapter["name"].get<std::string>().c_str(),
                        !adapter["present"].get<bool>() ? "absent"
                        : !port["enabled"].get<bool>()  ? "disabled"
                                                        : state_word(port["state"].get<unsigned>()),
                        speed_word(port["speed"].get<unsigned>()), port["beacon"].get<std::string>().c_str(),
                        port["targets"].get<unsigned>(), port["paths"].get<unsigned>());
    std::printf("%zu adapters, %u faults, %u open handles\n", json["adapters"].size(), json["faults"].get<unsigned>(),
                json["open_handles"].get<unsigned>());
}

void print_counters(const std::string& text)
{
    const auto json = nlohmann::json::parse(text);
    for (const auto& [name, count] : json.items())
        std::printf("%10llu  %s\n", static_cast<unsigned long long>(count.get<uint64_t>()), name.c_str());
}

std::string from_core(size_t (*give)(char*, size_t))
{
    std::string text(give(nullptr, 0), '\0');
    text.resize(give(&text[0], text.size() + 1));
    return text;
}

void write_out(const std::string& path, const std::string& text)
{
    if (path.empty() || path == "-") {
        std::cout << text;
        return;
    }
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file << text;
    file.close();
    if (!file) throw Failure(1, "cannot write " + path);
}

/// A text as TOML has it between quotes.
std::string in_quotes(const std::string& text)
{
    return nlohmann::json(text).dump();
}

} // namespace

int main(int argc, char** argv)
{
    CLI::App app("Controls the simulated Fibre Channel libraries of a running process, and makes scenarios for them.",
                 "nvrsimctl");
    app.footer("The process must have been started with NVRSIM_SOCKET set to a file name; nvrsimctl takes the same\n"
               "variable. Ports are named by their World Wide Name or by their number over the host, from 0.\n"
               "Exit status: 0 done, 1 refused, 2 wrong arguments, 3 no process answers.");
    app.require_subcommand(1);
    std::string socketPath;
    app.add_option("-s,--socket", socketPath, "Socket of the process to control")->envname("NVRSIM_SOCKET");

    bool asJson = false;
    auto* show = app.add_subcommand("show", "Show adapters and ports with their states");
    show->add_flag("--json", asJson, "Everything, as JSON");
    auto* counters = app.add_subcommand("counters", "Show how often each library function was called");
    counters->add_flag("--json", asJson, "As JSON");
    auto* log = app.add_subcommand("log", "Show the newest calls in order: function, port, result");
    bool clear = false;
    log->add_flag("--clear", clear, "Forget them instead");

    auto* fault = app.add_subcommand("fault", "Make a library function fail; see nvrsimctl(1) for what it can do");
    std::string call, port, damage;
    int64_t status = 0;
    uint64_t from = 1, times = 0, value = 0, keep = 0, delay = 0, number = 0;
    bool absent = false, throws = false, vanish = false;
    fault->add_option("call", call, "Function, for example RM_GetVPD; HBA_* for all that begin so")->required();
    fault->add_option("-p,--port", port, "Only for this port");
    auto* statusOption = fault->add_option("-r,--status", status, "What the function answers");
    fault->add_option("-f,--from", from, "First call to be hit, counted from now on")->check(CLI::PositiveNumber);
    auto* timesOption = fault->add_option("-n,--times", times, "Calls to be hit (all)")->check(CLI::PositiveNumber);
    fault->add_option("-d,--delay", delay, "Milliseconds before it answers");
    auto* valueOption =
        fault->add_option("-v,--value", value, "Number that stands in every count and size handed back");
    auto* numberOption = fault->add_option("--number", number, "Only for this attribute or inquiry page");
    fault->add_option("--damage", damage, "What happens to the bytes handed back")
        ->check(CLI::IsMember({"garbage", "truncated", "ones", "zeros", "null", "unterminated"}));
    auto* keepOption = fault->add_option("--keep", keep, "Bytes that a truncated block keeps");
    fault->add_flag("--absent", absent, "As if the function were missing from its library");
    fault->add_flag("--throws", throws, "The function throws an exception instead of an answer");
    fault->add_flag("--vanish", vanish, "The call's adapter leaves the host before it does anything");

    app.add_subcommand("faults", "List faults with the calls they have seen and hit");
    app.add_subcommand("clear-faults", "Take all faults away");

    auto* link = app.add_subcommand("link", "Take the link of a port up or down; its event goes out");
    std::string direction;
    link->add_option("direction", direction, "up or down")->required()->check(CLI::IsMember({"up", "down"}));
    link->add_option("port", port, "Port")->required();

    auto* event = app.add_subcommand("event", "Send an event of a port without any change of state");
    uint32_t type = 0, fabric = 0;
    event->add_option("port", port, "Port")->required();
    event->add_option("type", type, "Type of the Common HBA API: 513 offline, 514 online, 515 new targets, ...")
        ->required();
    event->add_option("fabric", fabric, "Fabric port identifier");
    uint32_t burst = 1;
    event->add_option("--times", burst, "A burst of so many")->check(CLI::Range(1, 1000000));

    auto* get = app.add_subcommand("get", "Print one value of a port");
    std::string name, text;
    get->add_option("port", port, "Port")->required();
    get->add_option("name", name, "wwpn, state, beacon, boot_code, resets, pending, firmware, ...")->required();
    auto* set = app.add_subcommand("set", "Set one value of a port");
    set->add_option("port", port, "Port")->required();
    set->add_option("name", name, "state, speed, beacon, present, statistic:N, attribute:N, ...")->required();
    set->add_option("value", text, "Number")->required();

    auto* load = app.add_subcommand("load", "Replace the host by another scenario");
    std::string path;
    load->add_option("file", path, "Scenario, as the process sees it")->required();
    app.add_subcommand("reset", "Start the scenario afresh: state, counters, faults");

    auto* generate = app.add_subcommand("generate", "Write a scenario of any size to the output or a file");
    uint32_t ports = 4, targets = 8, luns = 8;
    generate->add_option("--ports", ports, "Ports of the host")->capture_default_str()->check(CLI::Range(0, 65536));
    generate->add_option("--targets", targets, "Targets that each port sees")
        ->capture_default_str()
        ->check(CLI::Range(0, 65536));
    generate->add_option("--luns", luns, "Logical units of each target")
        ->capture_default_str()
        ->check(CLI::Range(0, 65536));
    generate->add_option("-o,--output", path, "File; standard output if not given");

    auto* check = app.add_subcommand("check", "Read a scenario and say what is wrong with it");
    check->add_option("file", path, "Scenario")->required();

    auto* firmware = app.add_subcommand("firmware", "Write a firmware image that the simulated adapters accept");
    std::string version = "2.02a1";
    uint32_t size = 4096;
    firmware->add_option("file", path, "File to write")->required();
    firmware->add_option("--version", version, "Version in its header")->capture_default_str();
    firmware->add_option("--size", size, "Bytes of payload")->capture_default_str()->check(CLI::Range(0, 64 << 20));

    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& wrong) {
        return app.exit(wrong) == 0 ? 0 : 2;
    }

    try {
        if (*show) {
            const std::string state = ask(socketPath, "state");
            if (asJson)
                std::cout << state;
            else
                print_state(state);
        } else if (*counters) {
            const std::string counted = ask(socketPath, "counters");
            if (asJson)
                std::cout << counted;
            else
                print_counters(counted);
        } else if (*log) {
            std::cout << ask(socketPath, clear ? "clear-log" : "log");
        } else if (*fault) {
            std::string line = "fault call = " + in_quotes(call) + ", from = " + std::to_string(from);
            if (!port.empty()) line += ", port = " + (port.size() < 16 ? port : in_quotes(port));
            if (*statusOption) line += ", status = " + std::to_string(status);
            if (*timesOption) line += ", times = " + std::to_string(times);
            if (delay) line += ", delay_ms = " + std::to_string(delay);
            if (*valueOption) {
                char digits[24];
                std::snprintf(digits, sizeof digits, "\"0x%llx\"", static_cast<unsigned long long>(value));
                line += std::string(", value = ") + digits;
            }
            if (*numberOption) line += ", number = " + std::to_string(number);
            if (!damage.empty()) line += ", damage = " + in_quotes(damage);
            if (*keepOption) line += ", keep = " + std::to_string(keep);
            if (absent) line += ", absent = true";
            if (throws) line += ", throws = true";
            if (vanish) line += ", vanish = true";
            std::cout << "fault " << ask(socketPath, line);
        } else if (*link) {
            std::cout << ask(socketPath, "link " + direction + " " + port);
        } else if (*event) {
            std::cout << "callbacks called: "
                      << ask(socketPath, "event " + port + " " + std::to_string(type) + " " + std::to_string(fabric) +
                                             " " + std::to_string(burst));
        } else if (*get) {
            std::cout << ask(socketPath, "get " + port + " " + name);
        } else if (*set) {
            std::cout << ask(socketPath, "set " + port + " " + name + " " + text);
        } else if (*load) {
            std::cout << ask(socketPath, "load " + path);
        } else if (*generate) {
            const size_t length = nvrsim_generate(ports, targets, luns, nullptr, 0);
            std::string scenario(length + 1, '\0');
            nvrsim_generate(ports, targets, luns, &scenario[0], scenario.size());
            scenario.resize(length);
            write_out(path, scenario);
        } else if (*check) {
            if (nvrsim_load(path.c_str()) != 0) throw Failure(1, from_core(nvrsim_error));
            print_state(from_core(nvrsim_state));
        } else if (*firmware) {
            if (nvrsim_make_firmware(path.c_str(), version.c_str(), size) != 0)
                throw Failure(1, from_core(nvrsim_error));
        } else {
            std::cout << ask(socketPath, app.get_subcommands().front()->get_name());
        }
    } catch (const Failure& failure) {
        std::cerr << "nvrsimctl: " << failure.what() << "\n";
        return failure.status;
    } catch (const std::exception& failure) {
        std::cerr << "nvrsimctl: " << failure.what() << "\n";
        return 1;
    }
    return 0;
}
