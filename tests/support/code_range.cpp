#include "tests/support/code_range.h"

#include <link.h>

namespace nvrtest {

bool Code_Range::find(std::string_view name)
{
    auto take = [&](const dl_phdr_info& object) {
        if (std::string_view(object.dlpi_name).find(name) == std::string_view::npos) return 0;
        for (int i = 0; i < object.dlpi_phnum; i++) {
            const auto& segment = object.dlpi_phdr[i];
            if (segment.p_type != PT_LOAD || !(segment.p_flags & PF_X)) continue;
            m_base = object.dlpi_addr;
            m_first = object.dlpi_addr + segment.p_vaddr;
            m_end = object.dlpi_addr + segment.p_vaddr + segment.p_memsz;
        }
        return 1;
    };
    const auto call = [](dl_phdr_info* object, std::size_t, void* data) {
        return (*static_cast<decltype(take)*>(data))(*object);
    };
    return dl_iterate_phdr(call, &take) == 1;
}

} // namespace nvrtest
