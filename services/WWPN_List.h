/// World Wide Port Names that were seen before, to pass over records that name the same port again.
#pragma once

#include <cstddef>
#include <memory>
#include <vector>

#include "foundation/management_api.h"

namespace cimple {

class WWPN_List {
public:
    /// True, and nothing changes, if the name was seen before. Otherwise it is kept. Without memory the list tells it
    /// on standard output and is given up, so that the names in it count as new once more; throws nothing.
    bool isDuplicateEntryInWWPNList(const HBA_WWN& wwpn);

    std::size_t size() const { return m_names.size(); }

private:
    std::vector<std::unique_ptr<HBA_WWN>> m_names;
};

} // namespace cimple
