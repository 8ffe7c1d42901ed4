#include "tests/module/support/Elf_File.h"

#include <algorithm>
#include <cstring>
#include <elf.h>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace nvrtest {

template <class Record>
Record Elf_File::record(std::size_t at) const
{
    Record record;
    if (at > m_bytes.size() || m_bytes.size() - at < sizeof record) throw std::runtime_error("the file ends too early");
    std::memcpy(&record, m_bytes.data() + at, sizeof record);
    return record;
}

std::string Elf_File::text(std::size_t at) const
{
    if (at >= m_bytes.size()) throw std::runtime_error("a name lies outside the file");
    return m_bytes.c_str() + at;
}

Elf_File::Elf_File(const std::string& path)
{
    std::ifstream file(path, std::ios::binary);
    std::ostringstream bytes;
    bytes << file.rdbuf();
    m_bytes = bytes.str();
    const auto head = record<Elf64_Ehdr>(0);
    if (std::memcmp(head.e_ident, ELFMAG, SELFMAG) != 0 || head.e_ident[EI_CLASS] != ELFCLASS64)
        throw std::runtime_error(path + " is no 64-bit ELF file");
    for (unsigned i = 0; i < head.e_phnum; i++) {
        const auto segment = record<Elf64_Phdr>(head.e_phoff + i * sizeof(Elf64_Phdr));
        const bool is_constant = segment.p_type == PT_LOAD && !(segment.p_flags & PF_W);
        if (segment.p_type == PT_GNU_RELRO || is_constant)
            m_read_only.push_back({segment.p_vaddr, segment.p_vaddr + segment.p_memsz});
        if (segment.p_type == PT_DYNAMIC) read_dynamic(segment.p_offset, segment.p_filesz);
    }
    for (unsigned i = 0; i < head.e_shnum; i++) {
        const auto section = record<Elf64_Shdr>(head.e_shoff + i * sizeof(Elf64_Shdr));
        if (section.sh_type != SHT_DYNSYM) continue;
        const auto strings = record<Elf64_Shdr>(head.e_shoff + section.sh_link * sizeof(Elf64_Shdr));
        read_symbols(section.sh_offset, section.sh_size, strings.sh_offset);
        for (const Entry& entry : m_dynamic)
            if (entry.tag == DT_NEEDED) m_needed.push_back(text(strings.sh_offset + entry.value));
    }
    std::sort(m_exported.begin(), m_exported.end());
}

void Elf_File::read_dynamic(std::size_t at, std::size_t size)
{
    for (std::size_t i = 0; i < size / sizeof(Elf64_Dyn); i++) {
        const auto entry = record<Elf64_Dyn>(at + i * sizeof(Elf64_Dyn));
        if (entry.d_tag == DT_NULL) break;
        m_dynamic.push_back({entry.d_tag, entry.d_un.d_val});
    }
}

void Elf_File::read_symbols(std::size_t at, std::size_t size, std::size_t strings)
{
    for (std::size_t i = 1; i < size / sizeof(Elf64_Sym); i++) {
        const auto symbol = record<Elf64_Sym>(at + i * sizeof(Elf64_Sym));
        const int visibility = ELF64_ST_VISIBILITY(symbol.st_other);
        if (symbol.st_shndx == SHN_UNDEF) m_imported.push_back(text(strings + symbol.st_name));
        if (symbol.st_shndx == SHN_UNDEF || (visibility != STV_DEFAULT && visibility != STV_PROTECTED)) continue;
        m_exported.push_back(text(strings + symbol.st_name));
        m_symbols.push_back({m_exported.back(), at + i * sizeof(Elf64_Sym)});
    }
}

std::uint64_t Elf_File::dynamic_entry(std::int64_t tag) const
{
    for (const Entry& entry : m_dynamic)
        if (entry.tag == tag) return entry.value;
    return 0;
}

std::size_t Elf_File::initializers() const
{
    return dynamic_entry(DT_INIT_ARRAYSZ) / sizeof(void*);
}

bool Elf_File::is_read_only_data(std::uint64_t offset) const
{
    return std::any_of(m_read_only.begin(), m_read_only.end(),
                       [=](const Range& range) { return range.from <= offset && offset < range.to; });
}

std::string Elf_File::without(const std::string& name) const
{
    const auto symbol =
        std::find_if(m_symbols.begin(), m_symbols.end(), [&](const Symbol& one) { return one.name == name; });
    if (symbol == m_symbols.end()) throw std::runtime_error("the file does not define " + name);
    auto changed = record<Elf64_Sym>(symbol->at);
    changed.st_shndx = SHN_UNDEF;
    changed.st_value = 0;
    std::string bytes = m_bytes;
    bytes.replace(symbol->at, sizeof changed, reinterpret_cast<const char*>(&changed), sizeof changed);
    return bytes;
}

} // namespace nvrtest
