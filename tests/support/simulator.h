/// The simulated adapters behind a test: which libraries the loader finds, what host they show, what fails.
///
///     Simulator sim;                                      // one adapter, one port, one target of three units
///     sim.fail("HBA_GetAdapterPortAttributes").port(1).with(HBA_STATUS_ERROR);
///
/// Needs a private host (norvane_private_main) and links the simulator's core, which is one a process. Failures throw
/// std::runtime_error with the simulator's own words.
#pragma once

#include <cstdint>
#include <string>

namespace nvrtest {

class Simulator {
public:
    static const char* const one_port;

    /// `libraries`: "" for all that answer, or a variant that lacks something ("rmapi-only", "no-tssdm", ...).
    explicit Simulator(const std::string& scenario = one_port, const std::string& libraries = "");

    /// Replaces host, faults and counters: from TOML text, or from a scenario that ships ("typical").
    void load(const std::string& scenario);
    void load_shipped(const std::string& name);

    /// Which calls of an operation fail, and how; takes effect at the end of the statement.
    class Fault {
    public:
        explicit Fault(std::string operation);
        ~Fault() noexcept(false);
        Fault(const Fault&) = delete;
        Fault& operator=(const Fault&) = delete;

        Fault& port(unsigned number) { return add("port", std::to_string(number)); }
        Fault& number(unsigned attribute_or_page) { return add("number", std::to_string(attribute_or_page)); }
        Fault& from(unsigned call) { return add("from", std::to_string(call)); }
        Fault& times(unsigned calls) { return add("times", std::to_string(calls)); }
        Fault& with(std::int64_t status) { return add("status", std::to_string(status)); }
        Fault& delayed(unsigned milliseconds) { return add("delay_ms", std::to_string(milliseconds)); }
        Fault& counting(std::uint64_t value) { return add("value", std::to_string(value)); }
        Fault& keeping(unsigned bytes) { return add("keep", std::to_string(bytes)); } ///< of a truncated answer
        Fault& absent() { return add("absent", "true"); }
        /// "garbage", "truncated", "ones", "zeros", "null", "unterminated"
        Fault& damaged(const std::string& kind) { return add("damage", '"' + kind + '"'); }

    private:
        Fault& add(const std::string& key, const std::string& value);
        std::string m_table;
    };
    Fault fail(const std::string& operation) { return Fault(operation); }
    void clear_faults();

    /// Calls of an operation since the load.
    std::uint64_t calls(const std::string& operation) const;
    /// A value of a port, as nvrsim_get and nvrsim_set name them.
    std::string get(const std::string& port, const std::string& name) const;
    void set(const std::string& port, const std::string& name, std::uint64_t value);
    std::size_t open_handles() const;
};

} // namespace nvrtest
