#include "tests/faults/Trials.h"

#include <functional>
#include <set>
#include <sstream>
#include <stdexcept>

#include "foundation/management_api.h"
#include "simulator/nvrsim.h"
#include "tests/faults/Session.h"
#include "tests/module/support/Elf_File.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/support/private_host.h"
#include "tests/support/private_host_setup.h"
#include "tests/support/process_state.h"
#include "tests/support/simulator.h"

namespace nvrtest {

namespace {

constexpr std::chrono::seconds delay{2};

const std::vector<std::string> all_libraries = {"HBAAPI", "lrmapi", "rmapi", "tssdm"};

#define NVR_NAME(result, name, missing, parameters, arguments) #name,
const std::vector<std::string> management_names = {NVR_MANAGEMENT_OPERATIONS(NVR_NAME)};
const std::vector<std::string> plain_names = {NVR_PLAIN_MANAGEMENT_OPERATIONS(NVR_NAME)};
const std::vector<std::string> hba_names = {NVR_HBA_OPERATIONS(NVR_NAME)};
const std::vector<std::string> tag_names = {NVR_CPQFC_OPERATIONS(NVR_NAME)};
#undef NVR_NAME
const std::vector<std::vector<std::string>> all_names = {management_names, plain_names, hba_names, tag_names};

/// The life of one trial, from what a process is before it to what is left.
class Trial {
public:
    explicit Trial(Run_Watch& watch)
        : m_watch(watch), m_files(open_files().size()), m_threads(number_of_threads_from_the_start()),
          m_session(std::make_unique<Session>([&](const std::string& what) { m_watch.step(what); }))
    {
    }

    Session& session() { return *m_session; }
    void expect(bool is_so, const std::string& otherwise)
    {
        if (!is_so) m_watch.complain(otherwise);
    }

    /// All parts but the unload.
    void run_to_unload()
    {
        for (const Session::Part& part : Session::parts())
            if (part.name != std::string("unload")) m_session->run(part);
    }
    std::string published() { return m_session->published(); }
    void expect_published(const std::string& sound, const std::string& published, const std::string& when)
    {
        const std::string lines = difference(sound, published);
        expect(lines.empty(), when + " it does not publish what it should:\n" + lines.substr(0, 3000));
    }
    /// What still has a callback then may call it.
    void unload()
    {
        m_session->run(Session::part("unload"));
        constexpr std::uint32_t link_up = 514;
        nvrsim_event("0", link_up, 0);
        nvrsim_drain_events();
        expect_settings();
    }

    /// After the unload: what clients were told is set is there still.
    void expect_settings()
    {
        const std::string wrong = m_session->settings().wrong();
        expect(wrong.empty(), wrong);
    }

    /// After the unload: what the server lent is given back.
    void expect_nothing_lent()
    {
        const host::Report report = m_session->rig().server().report();
        expect(left_beside_strings(report) == 0, "objects of the server are left: " + report.to_text());
        for (const std::string& violation : report.violations)
            expect(false, "the server was asked for what it forbids: " + violation);
    }
    /// So many handles of the libraries are open, as without a failure, but for those that it may have lost.
    void expect_handles(std::size_t sound, std::size_t lost)
    {
        const std::size_t open = nvrsim_open_handles();
        expect(open <= sound + lost, std::to_string(open) + " adapters stay open, not " + std::to_string(sound));
    }
    /// A second life, in which nothing fails.
    void load_again(const Sound_Session& sound)
    {
        m_session->rig().restart();
        expect_published(sound.published, published(), "after the second load");
        for (const std::string& failure : m_session->serve_clients())
            expect(false, "after the second load " + failure);
        unload();
        expect_nothing_lent();
    }
    /// At the very end.
    void expect_nothing_left(bool may_keep_callbacks = false)
    {
        m_session.reset();
        m_watch.step("the end of the threads");
        wait_for_threads(m_threads + nvrsim_threads());
        expect(open_files().size() <= m_files, "a descriptor stays open");
        expect(nvrsim_callbacks() == 0 || may_keep_callbacks, "a callback stays registered");
    }

private:
    Run_Watch& m_watch;
    const std::size_t m_files, m_threads;
    std::unique_ptr<Session> m_session;
};

std::map<std::string, std::uint64_t> counts()
{
    std::map<std::string, std::uint64_t> made;
    for (const auto& names : all_names)
        for (const std::string& name : names)
            if (const std::uint64_t count = calls(name)) made[name] = count;
    return made;
}

std::string fault_of(const std::string& call, std::uint64_t ordinal, const Failure_Kind& kind)
{
    return "call = \"" + call + "\", from = " + std::to_string(ordinal) + ", times = 1, " + kind.failure.fault;
}

// Of so many calls, from the one of that number in the simulator's log on.
void note_changing(const std::string& name, std::uint64_t first, std::uint64_t count, Sound_Session::Calls& calls)
{
    for (std::uint64_t ordinal = first; ordinal < first + count; ordinal++) {
        std::uint32_t kinds = 0;
        for (std::size_t kind = 0; kind < failure_kinds().size(); kind++)
            if (nvrsim_would_change(fault_of(name, ordinal, failure_kinds()[kind]).c_str()) == 1) kinds |= 1u << kind;
        calls.changing.push_back(kinds);
    }
}

bool can_change(const Sound_Session::Calls& calls, std::uint64_t ordinal, std::size_t kind)
{
    return ordinal > calls.changing.size() || (calls.changing[ordinal - 1] >> kind & 1);
}

// "CALL N M" a line and the kinds of each call, then "handles N", then what is published.
std::string describe(const Sound_Session& sound)
{
    std::ostringstream text;
    for (const auto& [name, count] : sound.calls) {
        text << name << ' ' << count.until_unload << ' ' << count.in_unload;
        for (const std::uint32_t kinds : count.changing)
            text << ' ' << kinds;
        text << '\n';
    }
    text << "handles " << sound.handles.until_unload << ' ' << sound.handles.after_unload << ' '
         << sound.handles.after_second_unload << '\n'
         << sound.published;
    return text.str();
}

Sound_Session understand(const std::string& text)
{
    Sound_Session sound;
    std::istringstream stream(text);
    std::string name;
    std::uint64_t first = 0, second = 0;
    while (stream >> name >> first >> second && name != "handles") {
        Sound_Session::Calls& calls = sound.calls[name] = {first, second, {}};
        calls.changing.resize(first + second);
        for (std::uint32_t& kinds : calls.changing)
            stream >> kinds;
    }
    sound.handles = {first, second, 0};
    stream >> sound.handles.after_second_unload;
    stream.ignore(1);
    std::ostringstream rest;
    rest << stream.rdbuf();
    sound.published = rest.str();
    return sound;
}

Sound_Session measure(Run_Watch& watch)
{
    Sound_Session sound;
    Trial trial(watch);
    trial.run_to_unload();
    for (const auto& [name, count] : counts()) {
        sound.calls[name].until_unload = count;
        note_changing(name, 1, count, sound.calls[name]);
    }
    sound.handles.until_unload = nvrsim_open_handles();
    sound.published = trial.published();
    const auto before = counts();
    trial.unload();
    for (const auto& [name, count] : counts()) {
        const auto earlier = before.find(name);
        const std::uint64_t known = earlier == before.end() ? 0 : earlier->second;
        sound.calls[name].in_unload = count - known;
        note_changing(name, known + 1, count - known, sound.calls[name]);
    }
    sound.handles.after_unload = nvrsim_open_handles();
    for (const std::string& failure : trial.session().failures())
        trial.expect(false, failure);
    trial.expect_nothing_lent();
    trial.load_again(sound);
    sound.handles.after_second_unload = nvrsim_open_handles();
    trial.expect_nothing_left();
    return sound;
}

bool is_one_of(const std::string& call, std::initializer_list<const char*> calls)
{
    for (const char* one : calls)
        if (call == one) return true;
    return false;
}

void try_call(const Sound_Session& sound, const std::string& call, std::uint64_t ordinal, const Failure_Kind& kind,
              Run_Watch& watch)
{
    const std::uint64_t until_unload = sound.calls.at(call).until_unload;
    const bool is_in_unload = ordinal > until_unload;
    const auto arm = [&](std::uint64_t from) { add_fault(fault_of(call, from, kind)); };
    Trial trial(watch);
    if (!is_in_unload) arm(ordinal);
    trial.run_to_unload();
    if (!is_in_unload) {
        trial.expect(fault_hits() == 1, "the session does not make this call");
        if (fault_changes() == 0) watch.tell(changed_nothing);
    }
    // A call that gives a handle out, or takes it back, and fails at it may lose that one.
    const bool may_lose =
        !kind.is_slow && is_one_of(call, {"HBA_OpenAdapter", "HBA_CloseAdapter", "CPQFC_OpenAdapter"});
    trial.expect_handles(sound.handles.until_unload, !is_in_unload && may_lose);
    const std::string published = trial.published();
    // A load whose library did not start, or that an exception ended, publishes no adapters up to its unload.
    const bool may_end_load =
        (call == "RM_InitLib" && !kind.is_slow) ||
        (kind.failure.name == std::string("throws") && is_one_of(call, {"HBA_LoadLibrary", "CPQFC_LoadLibrary"}));
    if (!may_end_load) trial.expect_published(sound.published, published, "after a refresh");
    if (is_in_unload) arm(ordinal - until_unload);
    trial.unload();
    if (is_in_unload) {
        trial.expect(fault_hits() == 1, "the unload does not make this call");
        if (fault_changes() == 0) watch.tell(changed_nothing);
    }
    trial.expect_handles(sound.handles.after_unload, is_in_unload && may_lose);
    trial.expect_nothing_lent();
    clear_faults();
    trial.load_again(sound);
    trial.expect_handles(sound.handles.after_second_unload, 0);
    trial.expect_nothing_left(is_one_of(call, {"HBA_RegisterForAdapterPortEvents", "HBA_RemoveCallback"}));
}

// --- What is missing

/// Libraries as an administrator may have installed them.
struct Installation {
    const char* name;
    std::vector<std::string> libraries;
    const char* variant;  ///< of the simulator; null: as they are
    bool has_other_names; ///< each with an L in front is there without it too
    /// Which names are looked up where, in the first place.
    struct Lookup {
        const char* library;
        const char* prefix;
        const std::vector<std::string>& names;
    };
    std::vector<Lookup> lookups;
};

const std::vector<Installation>& installations()
{
    static const std::vector<Installation> all = {
        {"first-choice",
         {"HBAAPI", "lrmapi", "tssdm"},
         nullptr,
         false,
         {{"lrmapi", "L", management_names},
          {"lrmapi", "", plain_names},
          {"HBAAPI", "", hba_names},
          {"tssdm", "", tag_names}}},
        {"second-choice",
         {"rmapi"},
         "rmapi-both-names",
         true,
         {{"rmapi", "L", management_names},
          {"rmapi", "", plain_names},
          {"rmapi", "", hba_names},
          {"rmapi", "", tag_names}}},
        {"second-choice-by-its-own-names", {"rmapi"}, "rmapi-only", false, {{"rmapi", "", management_names}}},
    };
    return all;
}

void install(const Installation& installation)
{
    if (installation.variant)
        compose_variant(installation.variant);
    else
        compose_libraries(installation.libraries);
}

void hide(const std::string& library, const std::string& symbol)
{
    const std::string path = library_folder() + "/lib" + library + ".so";
    const std::string bytes = Elf_File(path).without(symbol);
    write_file(path, bytes);
}

/// What a host lacks.
struct Lack {
    std::function<void()> install;
    bool has_other_name = false;     ///< another name of the same library stands in for it
    bool may_keep_callbacks = false; ///< nothing can take them back
    bool may_keep_handles = false;
};

void try_without(const Sound_Session& sound, const Lack& lack, Run_Watch& watch)
{
    Trial trial(watch);
    lack.install();
    trial.run_to_unload();
    if (!lack.may_keep_handles) trial.expect_handles(sound.handles.until_unload, 0);
    compose_libraries(all_libraries);
    const std::string published = trial.published(); // what is bound already stays as it is
    if (lack.has_other_name) trial.expect_published(sound.published, published, "by another name");
    trial.unload();
    if (!lack.may_keep_handles) trial.expect_handles(sound.handles.after_unload, 0);
    trial.expect_nothing_lent();
    trial.load_again(sound);
    trial.expect_handles(sound.handles.after_second_unload, 0);
    trial.expect_nothing_left(lack.may_keep_callbacks);
}

} // namespace

const char changed_nothing[] = "the failure changed nothing";

std::uint64_t Sound_Session::all_calls() const
{
    std::uint64_t sum = 0;
    for (const auto& one : calls)
        sum += one.second.until_unload + one.second.in_unload;
    return sum;
}

std::vector<std::string> Sound_Session::not_called() const
{
    std::set<std::string> names;
    for (const auto& some : all_names)
        names.insert(some.begin(), some.end());
    for (const auto& one : calls)
        names.erase(one.first);
    return {names.begin(), names.end()};
}

Sound_Session Sound_Session::hold(std::chrono::seconds patience)
{
    const Run_Result result = do_run(
        {"the session without a failure", patience, [](Run_Watch& watch) { watch.tell(describe(measure(watch))); }});
    if (!result.failure.empty()) throw std::runtime_error("the session without a failure fails:\n" + result.failure);
    Sound_Session sound = understand(result.told);
    sound.patience = patience;
    return sound;
}

const std::vector<Failure_Kind>& failure_kinds()
{
    static const std::vector<Failure_Kind> all = [] {
        std::vector<Failure_Kind> kinds;
        for (const Library_Failure& failure : library_failures())
            kinds.push_back({failure, false});
        kinds.push_back({{"vanishes", "vanish = true"}, false});
        kinds.push_back({{"slow", "delay_ms = 2000"}, true});
        return kinds;
    }();
    return all;
}

std::vector<Run> library_call_trials(const Sound_Session& sound)
{
    std::vector<Run> trials;
    for (const bool is_slow : {false, true})
        for (const auto& [call, count] : sound.calls)
            for (std::uint64_t ordinal = 1; ordinal <= count.until_unload + count.in_unload; ordinal++)
                for (std::size_t i = 0; i < failure_kinds().size(); i++) {
                    const Failure_Kind& kind = failure_kinds()[i];
                    if (kind.is_slow != is_slow || !can_change(count, ordinal, i)) continue;
                    trials.push_back({call + '#' + std::to_string(ordinal) + ':' + kind.failure.name,
                                      is_slow ? sound.patience + delay : sound.patience,
                                      [&sound, call = call, ordinal, &kind](Run_Watch& watch) {
                                          try_call(sound, call, ordinal, kind, watch);
                                      }});
                }
    return trials;
}

std::size_t sleeping_trials(const Sound_Session& sound)
{
    return sound.all_calls();
}

std::vector<Run> missing_symbol_trials(const Sound_Session& sound)
{
    std::vector<Run> trials;
    const auto add = [&](const std::string& name, const Lack& lack) {
        trials.push_back({name, sound.patience, [&sound, lack](Run_Watch& watch) { try_without(sound, lack, watch); }});
    };
    for (const Installation& installation : installations())
        for (const Installation::Lookup& lookup : installation.lookups)
            for (const std::string& name : lookup.names) {
                const std::string symbol = lookup.prefix + name;
                const auto without = [&installation, library = lookup.library, symbol] {
                    install(installation);
                    hide(library, symbol);
                };
                add(std::string(installation.name) + ':' + lookup.library + '-' + symbol,
                    {without, installation.has_other_names && *lookup.prefix != '\0', name == "HBA_RemoveCallback",
                     name == "HBA_CloseAdapter"});
            }
    for (unsigned bits = 0; bits < 1u << all_libraries.size(); bits++) {
        std::vector<std::string> libraries;
        std::string name = "installed";
        for (std::size_t i = 0; i < all_libraries.size(); i++)
            if (bits >> i & 1) {
                libraries.push_back(all_libraries[i]);
                name += '-' + all_libraries[i];
            }
        add(name, {[libraries] { compose_libraries(libraries); }});
    }
    return trials;
}

} // namespace nvrtest
