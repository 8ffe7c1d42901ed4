/// What the loader sees of a shared object, read from its file. Throws std::runtime_error for what is no 64-bit ELF.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace nvrtest {

class Elf_File {
public:
    explicit Elf_File(const std::string& path);

    /// Names that the file defines for others, sorted.
    const std::vector<std::string>& exported() const { return m_exported; }
    /// Entry of the dynamic section, or 0.
    std::uint64_t dynamic_entry(std::int64_t tag) const;
    /// Functions that run when it is loaded.
    std::size_t initializers() const;
    /// Names that it looks for in others.
    const std::vector<std::string>& imported() const { return m_imported; }
    /// Libraries that it names.
    const std::vector<std::string>& needed() const { return m_needed; }
    /// True if an address of the loaded file lies in what is made read-only when relocation is done.
    bool is_read_only_data(std::uint64_t offset) const;
    /// The file's bytes, but that it does not define this name any more. Its own code finds what bore it all the same.
    std::string without(const std::string& name) const;

private:
    void read_dynamic(std::size_t at, std::size_t size);
    void read_symbols(std::size_t at, std::size_t size, std::size_t strings);
    template <class Record>
    Record record(std::size_t at) const;
    std::string text(std::size_t at) const;

    struct Range {
        std::uint64_t from, to;
    };
    struct Entry {
        std::int64_t tag;
        std::uint64_t value;
    };
    struct Symbol {
        std::string name;
        std::size_t at; // of its record
    };
    std::string m_bytes;
    std::vector<Symbol> m_symbols; // that it defines
    std::vector<Range> m_read_only;
    std::vector<Entry> m_dynamic;
    std::vector<std::string> m_exported, m_imported, m_needed;
};

} // namespace nvrtest
