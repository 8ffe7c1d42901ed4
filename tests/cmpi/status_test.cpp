// The names that CMPI codes have in the runtime log.
#include "cmpi/status.h"

#include <gtest/gtest.h>
#include <map>
#include <string>

namespace cimple {
namespace {

TEST(StatusNames, EachCodeOfTheStandardHasItsName)
{
    const std::map<int, std::string> names = {
        {0, "CMPI_RC_OK"},
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
    for (int code = 0; code <= 255; ++code) {
        const auto name = names.find(code);
        EXPECT_EQ(code_name(static_cast<CMPIrc>(code)), name == names.end() ? "CMPI_RC_ERR_FAILED" : name->second)
            << code;
    }
}

} // namespace
} // namespace cimple
