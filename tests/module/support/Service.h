/// A service of the module, called through its factories, and what a test holds against the call: return value, out
/// parameters, and the log's words in order.
///
///     Service names(rig, "NVRHBA_FCHBAWWNService");
///     const Called read = names.call("ReadWWN", {{"Target", port(rig)}, {"Type", host::Value::uint16(2)}});
///     EXPECT_THAT(read, returned(0));
///     EXPECT_EQ(read.out("WWPN").as_text(), "10:00:00:00:c9:a0:00:01");
///     EXPECT_EQ(read.words, joined({{"Entering ReadWWN", gate}, known_port(), converted(first_port), ...}));
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "tests/module/support/Rig.h"

namespace nvrtest {

using Words = std::vector<std::string>;
using Arguments = std::vector<host::Named_Value>;

/// What came of a call.
struct Called {
    host::Answer answer;
    Words words; ///< of the call's own thread, as `words_of_thread` gives them

    std::uint64_t value() const { return answer.value.as_uint(); }
    /// An out parameter; null (also if it did not come back).
    const host::Value& out(const std::string& name) const;
};

/// Matches a call whose status is OK and whose method returned that value.
MATCHER_P(returned, value, "")
{
    *result_listener << "status " << host::status_name(arg.answer.status.code) << ' ' << arg.answer.status.message
                     << ", value " << arg.answer.value.to_text();
    return arg.answer.ok() && !arg.answer.value.is_null() && arg.value() == static_cast<std::uint64_t>(value);
}

class Service {
public:
    /// The service's instance, the first one or the one with that key "Name". Throws std::runtime_error without one.
    Service(Rig& rig, const std::string& class_name, const std::string& name = {});
    /// Waits for what its calls have started.
    ~Service();
    Service(const Service&) = delete;
    Service& operator=(const Service&) = delete;

    /// Calls when no refresh runs. One that the call starts may still run at its end.
    Called call(const std::string& method, const Arguments& arguments = {});
    /// The same on another path: of another instance, or class.
    Called call_on(const host::Path& path, const std::string& method, const Arguments& arguments = {});

    const host::Path& path() const { return m_path; }
    /// Its path with a name that no service has.
    host::Path stranger() const;

private:
    Rig& m_rig;
    host::Path m_path;
};

/// References to ports, as the Target of a method: of the inventory, by its place, and of none.
host::Value port(Rig& rig, std::size_t place = 0);
host::Value unknown_port(Rig& rig);
/// With that key instead of the port's.
host::Value port_with_id(Rig& rig, const host::Value& device_id);
/// An instance of another class.
host::Value no_port(Rig& rig);

/// Keys of the "typical" scenario's first ports.
constexpr char first_port[] = "10000000C9A00001";
constexpr char second_port[] = "10000000C9A00002";

// ---- Words. The passage through the refresh gate is one word in the lists, as are the waits behind it.

constexpr char gate[] = "(gate)";                                   ///< no refresh was needed
constexpr char gate_refreshing[] = "(gate: a refresh was started)"; ///< there was need, or one was asked for
constexpr char gate_running[] = "(gate: a refresh runs)";           ///< and it ran already

/// The words of the thread that logged first; gates as above, and without what loading a provider and the up-calls of
/// a refresh say.
Words words_of_thread(const std::vector<Trace_Line>& lines);

Words joined(const std::vector<Words>& parts);

/// The look-up of a Target by its key, found and not found.
Words known_port();
Words no_known_port();
/// The way from a key or a client's text (16 digits, or with colons already) to the library's name.
Words converted(const std::string& digits);
/// The same for a text that is too short or has other characters: it ends with the words of str2HBAName.
Words not_converted(const std::string& text);
/// The question whether a port is local, answered with yes and with no.
Words local();
Words not_local();
/// "Status: <5>:..." as the simulated library knows it.
std::string status_line(std::uint32_t status);

} // namespace nvrtest
