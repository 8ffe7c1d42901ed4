// The parts of a scenario, one function for each kind of table. They read over defaults that the caller has filled in.
#ifndef _simulator_PortReader_h
#define _simulator_PortReader_h

#include "simulator/Defaults.h"
#include "simulator/Fault.h"
#include "simulator/Fields.h"

namespace nvrsim {

/// `number`: what names of a repeated adapter end with, UINT32_MAX for one that stands alone.
void read_adapter_fields(Fields& fields, Adapter& adapter, uint32_t number);
void read_port(Fields& fields, Port& port);
void read_lun(Fields& fields, Lun& lun);
void read_params(Fields& fields, const char* key, std::vector<Driver_Param>& params);
Fault read_fault(const std::string& file, const toml::table& table);

} // namespace nvrsim

#endif // _simulator_PortReader_h
