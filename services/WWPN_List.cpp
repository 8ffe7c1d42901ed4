#include "services/WWPN_List.h"

#include <cstdio>
#include <cstring>
#include <new>

namespace cimple {

bool WWPN_List::isDuplicateEntryInWWPNList(const HBA_WWN& wwpn)
{
    for (const auto& name : m_names)
        if (std::memcmp(name->wwn, wwpn.wwn, sizeof wwpn.wwn) == 0) return true;
    const char* failed = "\nERROR: isDuplicateEntryInWWPNList: realloc failed";
    try {
        m_names.reserve(m_names.size() + 1);
        failed = "\nERROR: isDuplicateEntryInWWPNList: malloc failed";
        m_names.push_back(std::make_unique<HBA_WWN>(wwpn));
    } catch (const std::bad_alloc&) {
        std::fputs(failed, stdout);
        m_names.clear();
    }
    return false;
}

} // namespace cimple
