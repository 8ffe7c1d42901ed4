#include "host/ModuleSymbols.h"

#include <cerrno>
#include <cstring>
#include <elf.h>
#include <fstream>
#include <iterator>

namespace host {
namespace {

/// The bytes of a file; reads that do not lie inside answer false.
class Bytes {
public:
    explicit Bytes(std::string content) : m_content(std::move(content)) {}

    template <class T>
    bool read(std::uint64_t at, T& record) const
    {
        if (at > m_content.size() || m_content.size() - at < sizeof record) return false;
        std::memcpy(&record, m_content.data() + at, sizeof record);
        return true;
    }

    std::string text(const Elf64_Shdr& section, std::uint64_t at) const
    {
        if (at >= section.sh_size || section.sh_offset > m_content.size() ||
            m_content.size() - section.sh_offset < section.sh_size)
            return "";
        std::uint64_t start = section.sh_offset + at;
        return m_content.substr(start, strnlen(m_content.data() + start, section.sh_size - at));
    }

    std::size_t size() const { return m_content.size(); }

private:
    std::string m_content;
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
    Bytes bytes(std::string(std::istreambuf_iterator<char>(stream), {}));
    Elf64_Ehdr head{};
    if (!bytes.read(0, head) || std::memcmp(head.e_ident, ELFMAG, SELFMAG) != 0 ||
        head.e_ident[EI_CLASS] != ELFCLASS64 || head.e_type != ET_DYN || head.e_shentsize != sizeof(Elf64_Shdr)) {
        error = file + ": not a 64-bit shared object";
        return names;
    }
    for (unsigned i = 0; i < head.e_shnum; ++i) {
        Elf64_Shdr table{}, strings{};
        if (!bytes.read(head.e_shoff + i * sizeof table, table) || table.sh_type != SHT_DYNSYM) continue;
        if (table.sh_size > bytes.size() || !bytes.read(head.e_shoff + table.sh_link * sizeof strings, strings))
            continue;
        for (std::uint64_t at = 0; at + sizeof(Elf64_Sym) <= table.sh_size; at += sizeof(Elf64_Sym)) {
            Elf64_Sym symbol{};
            if (!bytes.read(table.sh_offset + at, symbol)) break;
            if (ELF64_ST_TYPE(symbol.st_info) != STT_FUNC || symbol.st_shndx == SHN_UNDEF) continue;
            names.push_back(bytes.text(strings, symbol.st_name));
        }
    }
    if (names.empty()) error = file + ": exports no function";
    return names;
}

} // namespace host
