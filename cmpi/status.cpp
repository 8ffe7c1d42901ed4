#include "cmpi/status.h"

#include "runtime/Registration.h"

namespace cimple {

namespace {

struct Code_Name {
    CMPIrc code;
    const char* name;
};

constexpr Code_Name code_names[] = {
    {CMPI_RC_OK, "CMPI_RC_OK"},
    {CMPI_RC_ERR_ACCESS_DENIED, "CMPI_RC_ERR_ACCESS_DENIED"},
    {CMPI_RC_ERR_INVALID_NAMESPACE, "CMPI_RC_ERR_INVALID_NAMESPACE"},
    {CMPI_RC_ERR_INVALID_PARAMETER, "CMPI_RC_ERR_INVALID_PARAMETER"},
    {CMPI_RC_ERR_INVALID_CLASS, "CMPI_RC_ERR_INVALID_CLASS"},
    {CMPI_RC_ERR_NOT_FOUND, "CMPI_RC_ERR_NOT_FOUND"},
    {CMPI_RC_ERR_NOT_SUPPORTED, "CMPI_RC_ERR_NOT_SUPPORTED"},
    {CMPI_RC_ERR_CLASS_HAS_CHILDREN, "CMPI_RC_ERR_CLASS_HAS_CHILDREN"},
    {CMPI_RC_ERR_CLASS_HAS_INSTANCES, "CMPI_RC_ERR_CLASS_HAS_INSTANCES"},
    {CMPI_RC_ERR_INVALID_SUPERCLASS, "CMPI_RC_ERR_INVALID_SUPERCLASS"},
    {CMPI_RC_ERR_ALREADY_EXISTS, "CMPI_RC_ERR_ALREADY_EXISTS"},
    {CMPI_RC_ERR_NO_SUCH_PROPERTY, "CMPI_RC_ERR_NO_SUCH_PROPERTY"},
    {CMPI_RC_ERR_TYPE_MISMATCH, "CMPI_RC_ERR_TYPE_MISMATCH"},
    {CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED, "CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED"},
    {CMPI_RC_ERR_INVALID_QUERY, "CMPI_RC_ERR_INVALID_QUERY"},
    {CMPI_RC_ERR_METHOD_NOT_AVAILABLE, "CMPI_RC_ERR_METHOD_NOT_AVAILABLE"},
    {CMPI_RC_ERR_METHOD_NOT_FOUND, "CMPI_RC_ERR_METHOD_NOT_FOUND"},
    {CMPI_RC_DO_NOT_UNLOAD, "CMPI_RC_DO_NOT_UNLOAD"},
    {CMPI_RC_NEVER_UNLOAD, "CMPI_RC_NEVER_UNLOAD"},
    {CMPI_RC_ERR_INVALID_HANDLE, "CMPI_RC_ERR_INVALID_HANDLE"},
    {CMPI_RC_ERR_INVALID_DATA_TYPE, "CMPI_RC_ERR_INVALID_DATA_TYPE"},
    {CMPI_RC_ERROR_SYSTEM, "CMPI_RC_ERROR_SYSTEM"},
    {CMPI_RC_ERROR, "CMPI_RC_ERROR"},
};

constexpr Status_Row get_instance_rows[] = {
    {GET_INSTANCE_NOT_FOUND, CMPI_RC_ERR_NOT_FOUND},
    {GET_INSTANCE_UNSUPPORTED, CMPI_RC_ERR_FAILED},
    {GET_INSTANCE_INVALID_PARAMETER, CMPI_RC_ERR_INVALID_PARAMETER},
    {GET_INSTANCE_ACCESS_DENIED, CMPI_RC_ERR_ACCESS_DENIED},
    {GET_INSTANCE_FAILED, CMPI_RC_ERR_FAILED},
};
constexpr Status_Row enum_instances_rows[] = {
    {ENUM_INSTANCES_FAILED, CMPI_RC_ERR_FAILED},
    {ENUM_INSTANCES_ACCESS_DENIED, CMPI_RC_ERR_ACCESS_DENIED},
};
constexpr Status_Row create_instance_rows[] = {
    {CREATE_INSTANCE_DUPLICATE, CMPI_RC_ERR_ALREADY_EXISTS},
    {CREATE_INSTANCE_UNSUPPORTED, CMPI_RC_ERR_NOT_SUPPORTED},
    {CREATE_INSTANCE_INVALID_PARAMETER, CMPI_RC_ERR_INVALID_PARAMETER},
    {CREATE_INSTANCE_ACCESS_DENIED, CMPI_RC_ERR_ACCESS_DENIED},
    {CREATE_INSTANCE_FAILED, CMPI_RC_ERR_FAILED},
};
constexpr Status_Row delete_instance_rows[] = {
    {DELETE_INSTANCE_NOT_FOUND, CMPI_RC_ERR_NOT_FOUND},
    {DELETE_INSTANCE_UNSUPPORTED, CMPI_RC_ERR_NOT_SUPPORTED},
    {DELETE_INSTANCE_ACCESS_DENIED, CMPI_RC_ERR_ACCESS_DENIED},
    {DELETE_INSTANCE_FAILED, CMPI_RC_ERR_FAILED},
};
constexpr Status_Row modify_instance_rows[] = {
    {MODIFY_INSTANCE_NOT_FOUND, CMPI_RC_ERR_NOT_FOUND},
    {MODIFY_INSTANCE_UNSUPPORTED, CMPI_RC_ERR_NOT_SUPPORTED},
    {MODIFY_INSTANCE_INVALID_PARAMETER, CMPI_RC_ERR_INVALID_PARAMETER},
    {MODIFY_INSTANCE_ACCESS_DENIED, CMPI_RC_ERR_ACCESS_DENIED},
    {MODIFY_INSTANCE_FAILED, CMPI_RC_ERR_FAILED},
};
constexpr Status_Row invoke_method_rows[] = {
    {INVOKE_METHOD_FAILED, CMPI_RC_ERR_FAILED},
    {INVOKE_METHOD_UNSUPPORTED, CMPI_RC_ERR_NOT_SUPPORTED},
    {INVOKE_METHOD_ACCESS_DENIED, CMPI_RC_ERR_ACCESS_DENIED},
};
constexpr Status_Row enable_indications_rows[] = {{ENABLE_INDICATIONS_FAILED, CMPI_RC_ERR_FAILED}};
constexpr Status_Row disable_indications_rows[] = {{DISABLE_INDICATIONS_FAILED, CMPI_RC_ERR_FAILED}};
constexpr Status_Row enum_associators_rows[] = {
    {ENUM_ASSOCIATORS_FAILED, CMPI_RC_ERR_FAILED},
    {ENUM_ASSOCIATORS_ACCESS_DENIED, CMPI_RC_ERR_ACCESS_DENIED},
};
constexpr Status_Row association_rows[] = {
    {ENUM_ASSOCIATOR_NAMES_FAILED, CMPI_RC_ERR_FAILED},
    {ENUM_ASSOCIATOR_NAMES_UNSUPPORTED, CMPI_RC_ERR_NOT_SUPPORTED},
    {ENUM_ASSOCIATOR_NAMES_ACCESS_DENIED, CMPI_RC_ERR_ACCESS_DENIED},
    {ENUM_REFERENCES_FAILED, CMPI_RC_ERR_FAILED},
    {ENUM_REFERENCES_UNSUPPORTED, CMPI_RC_ERR_NOT_SUPPORTED},
    {ENUM_REFERENCES_ACCESS_DENIED, CMPI_RC_ERR_ACCESS_DENIED},
};

template <std::size_t N>
constexpr Status_Map map_of(const Status_Row (&rows)[N])
{
    return {rows, N};
}

} // namespace

const char* code_name(CMPIrc code)
{
    for (const Code_Name& row : code_names)
        if (row.code == code) return row.name;
    return "CMPI_RC_ERR_FAILED";
}

const Status_Row* Status_Map::find(int status) const
{
    for (std::size_t i = 0; i < size; ++i)
        if (rows[i].status == status) return rows + i;
    return nullptr;
}

CMPIrc Status_Map::code(int status) const
{
    const Status_Row* row = find(status);
    return row ? row->code : CMPI_RC_OK;
}

const Status_Map get_instance_codes = map_of(get_instance_rows);
const Status_Map enum_instances_codes = map_of(enum_instances_rows);
const Status_Map create_instance_codes = map_of(create_instance_rows);
const Status_Map delete_instance_codes = map_of(delete_instance_rows);
const Status_Map modify_instance_codes = map_of(modify_instance_rows);
const Status_Map invoke_method_codes = map_of(invoke_method_rows);
const Status_Map enable_indications_codes = map_of(enable_indications_rows);
const Status_Map disable_indications_codes = map_of(disable_indications_rows);
const Status_Map enum_associators_codes = map_of(enum_associators_rows);
const Status_Map association_codes = map_of(association_rows);

} // namespace cimple
