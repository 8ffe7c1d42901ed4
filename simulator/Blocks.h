// The blocks of the management API: numbered attributes, and the walk through vital product data. Pure functions.
#ifndef _simulator_Blocks_h
#define _simulator_Blocks_h

#include "simulator/Model.h"

namespace nvrsim {

Bytes build_block(const Attributes& attributes);

/// Place of a value inside `block`, null if the block is damaged or lacks the number. Never reads past the length that
/// the header gives, which its check word vouches for.
void* find_attribute(void* block, uint16_t number, uint16_t& length);

/// One step of the walk through PCI vital product data: entry `index`, counted from 0. False at the end.
bool vpd_entry(const uint8_t* data, size_t size, uint32_t index, std::string& tag, std::string& value);

} // namespace nvrsim

#endif // _simulator_Blocks_h
