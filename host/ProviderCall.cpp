#include "host/ProviderCall.h"

#include <cstring>

namespace host {

Status read_status(const CMPIStatus& status)
{
    Status result;
    static_assert(sizeof status.rc == sizeof result.code);
    // A module may answer with any number, also one that the enumeration does not have.
    std::memcpy(&result.code, &status.rc, sizeof result.code);
    if (result.code != CMPI_RC_OK) result.fault = Fault::provider;
    if (auto* text = unwrap<String_Object>(status.msg)) {
        result.message = text->to_text();
        // A status hands its text over: the module cannot release it.
        if (text->origin == Origin::made) text->broker.retire(*text);
    }
    return result;
}

std::string status_name(int code)
{
    struct Row {
        int code;
        const char* name;
    };
    constexpr Row rows[] = {
        {0, "CMPI_RC_OK"},
        {1, "CMPI_RC_ERR_FAILED"},
        {2, "CMPI_RC_ERR_ACCESS_DENIED"},
        {3, "CMPI_RC_ERR_INVALID_NAMESPACE"},
        {4, "CMPI_RC_ERR_INVALID_PARAMETER"},
        {5, "CMPI_RC_ERR_INVALID_CLASS"},
        {6, "CMPI_RC_ERR_NOT_FOUND"},
        {7, "CMPI_RC_ERR_NOT_SUPPORTED"},
        {8, "CMPI_RC_ERR_CLASS_HAS_CHILDREN"},
        {9, "CMPI_RC_ERR_CLASS_HAS_INSTANCES"},
        {10, "CMPI_RC_ERR_INVALID_SUPERCLASS"},
        {11, "CMPI_RC_ERR_ALREADY_EXISTS"},
        {12, "CMPI_RC_ERR_NO_SUCH_PROPERTY"},
        {13, "CMPI_RC_ERR_TYPE_MISMATCH"},
        {14, "CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED"},
        {15, "CMPI_RC_ERR_INVALID_QUERY"},
        {16, "CMPI_RC_ERR_METHOD_NOT_AVAILABLE"},
        {17, "CMPI_RC_ERR_METHOD_NOT_FOUND"},
        {50, "CMPI_RC_DO_NOT_UNLOAD"},
        {51, "CMPI_RC_NEVER_UNLOAD"},
        {60, "CMPI_RC_ERR_INVALID_HANDLE"},
        {61, "CMPI_RC_ERR_INVALID_DATA_TYPE"},
        {100, "CMPI_RC_ERROR_SYSTEM"},
        {200, "CMPI_RC_ERROR"},
    };
    for (const Row& row : rows)
        if (row.code == code) return row.name;
    return "status " + std::to_string(code);
}

} // namespace host
