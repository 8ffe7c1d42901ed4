#include "agent/library_name.h"

#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"

namespace cimple {

bool library_name(HBA_WWN& wwn, const char* wwpn, const char* first_words, const char* second_words)
{
    char name[hba_name_size] = {};
    if (Id2HBAName(name, wwpn) != 0) {
        NVR_LOG("%s", first_words);
        return false;
    }
    if (str2HBAName(&wwn, name) != 0) {
        NVR_LOG("%s", second_words);
        return false;
    }
    return true;
}

} // namespace cimple
