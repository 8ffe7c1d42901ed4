#include "host/ModuleSymbols.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <elf.h>
#include <fstream>

namespace host {
namespace {

/// A file whose tables are read one by one, each where it lies inside and not at all where it does not.
class Tables {
public:
    explicit Tables(std::istream& stream) : m_stream(stream)
    {
        m_stream.seekg(0, std::ios::end);
        m_size = static_cast<std::uint64_t>(std::max<std::streamoff>(m_stream.tellg(), 0));
    }

    std::string read(std::uint64_t at, std::uint64_t size) const
    {
        std::string bytes;
        if (at > m_size || m_size - at < size) return bytes;
        bytes.resize(size);
        m_stream.seekg(static_cast<std::streamoff>(at));
        m_stream.read(bytes.data(), static_cast<std::streamsize>(size));
        if (!m_stream) bytes.clear(); // it has been cut meanwhile
        m_stream.clear();
        return bytes;
    }

    template <class T>
    bool read(std::uint64_t at, T& record) const
    {
        const std::string bytes = read(at, sizeof record);
        if (!bytes.empty()) std::memcpy(&record, bytes.data(), sizeof record);
        return !bytes.empty();
    }

private:
    std::istream& m_stream;
    std::uint64_t m_size = 0;
};

} // namespace

std::vector<std::string> exported_functions(const std::string& file, std::string& error)
{
    std::vector<std::string> names;
    std::ifstream stream(file, std::ios::binary);
    if (!stream) {
        error = file + ": " + std::strerror(errno);
        return names;
    }
    const Tables file_tables(stream);
    Elf64_Ehdr head{};
    if (!file_tables.read(0, head) || std::memcmp(head.e_ident, ELFMAG, SELFMAG) != 0 ||
        head.e_ident[EI_CLASS] != ELFCLASS64 || head.e_type != ET_DYN || head.e_shentsize != sizeof(Elf64_Shdr)) {
        error = file + ": not a 64-bit shared object";
        return names;
    }
    for (unsigned i = 0; i < head.e_shnum; ++i) {
        Elf64_Shdr table{}, texts{};
        if (!file_tables.read(head.e_shoff + i * sizeof table, table) || table.sh_type != SHT_DYNSYM) continue;
        if (!file_tables.read(head.e_shoff + table.sh_link * sizeof texts, texts)) continue;
        const std::string symbols = file_tables.read(table.sh_offset, table.sh_size);
        const std::string strings = file_tables.read(texts.sh_offset, texts.sh_size);
        for (std::size_t at = 0; at + sizeof(Elf64_Sym) <= symbols.size(); at += sizeof(Elf64_Sym)) {
            Elf64_Sym symbol{};
            std::memcpy(&symbol, symbols.data() + at, sizeof symbol);
            if (ELF64_ST_TYPE(symbol.st_info) != STT_FUNC || symbol.st_shndx == SHN_UNDEF) continue;
            // The last text need not end.
            names.push_back(symbol.st_name < strings.size() ? strings.c_str() + symbol.st_name : "");
        }
    }
    if (names.empty()) error = file + ": exports no function";
    return names;
}

} // namespace host
