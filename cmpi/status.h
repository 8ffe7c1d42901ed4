/// What a provider's status numbers become as CMPI codes, and the codes' names in the runtime log.
#pragma once

#include <cmpidt.h>

#include <cstddef>

namespace cimple {

/// "CMPI_RC_ERR_NOT_FOUND"; codes without a name read as "CMPI_RC_ERR_FAILED".
const char* code_name(CMPIrc code);

struct Status_Row {
    int status;
    CMPIrc code;
};

/// The rows of each operation. A status that has no row is taken as a success by whoever asks.
struct Status_Map {
    const Status_Row* rows;
    std::size_t size;

    /// The row of `status`, or null.
    const Status_Row* find(int status) const;
    /// Its code, or CMPI_RC_OK.
    CMPIrc code(int status) const;
};

extern const Status_Map get_instance_codes;
extern const Status_Map enum_instances_codes;
extern const Status_Map create_instance_codes;
extern const Status_Map delete_instance_codes;
extern const Status_Map modify_instance_codes;
extern const Status_Map invoke_method_codes;
extern const Status_Map enable_indications_codes;
extern const Status_Map disable_indications_codes;
extern const Status_Map enum_associators_codes; // of the operation itself
extern const Status_Map association_codes;      // of the traversals

} // namespace cimple
