#include "agent/port_tables.h"

namespace cimple {

namespace {

constexpr Status_Row port_states[] = {
    {1, 0, "Unknown"},
    {2, 2, "OK"},
    {3, 10, "Stopped"},
    {4, 1, "Other"},
    {5, 11, "InService"},
    {6, 1, "Other"},
    {7, 6, "Error"},
    {8, 32776, "InService"},
    {20, 32788, "Operational. Need RESET"},
    {21, 32789, "Link down. Need RESET"},
    {22, 32790, "Disable"},
};

constexpr Status_Row controller_states[] = {
    {1, 0, "Unknown"},    {2, 2, "OK"},    {3, 10, "Stopped"}, {4, 1, "Other"},
    {5, 11, "InService"}, {6, 1, "Other"}, {7, 6, "Error"},    {8, 11, "InService"},
};

constexpr Status_Row unknown_state = {0, 0, "Unknown"};

constexpr Port_Type_Row port_types[] = {
    {1, 0, nullptr},  {2, 1, "Other"},  {5, 10, nullptr},  {6, 11, nullptr},        {7, 16, nullptr},
    {8, 15, nullptr}, {9, 14, nullptr}, {10, 18, nullptr}, {20, 1, "Private Loop"}, {21, 1, "Point to Point"},
};

constexpr Port_Type_Row unknown_type = {0, 0, nullptr};

struct Speed_Row {
    uint32 code;
    uint64 speed;
};

// Fastest first, as a mask is read.
constexpr Speed_Row speeds[] = {
    {32, 16000000000}, {4, 10000000000}, {16, 8000000000}, {8, 4000000000}, {2, 2000000000}, {1, 1000000000},
};

struct Service_Class_Row {
    uint32 bit;
    uint16 service_class;
};

constexpr Service_Class_Row service_classes[] = {{0x01, 7}, {0x02, 1}, {0x04, 2}, {0x08, 3}, {0x10, 4}, {0x40, 5}};

// The types that CIM has a number for, which is their own.
constexpr uint16 named_fc4_types[] = {4,  5,  8,  9,  17, 18, 19, 21, 22, 23, 25, 26,
                                      27, 28, 32, 34, 36, 64, 80, 81, 82, 88, 96};

// The bits of the map that are "Other". Type 88 lies in one of the whole bytes: it is shown as itself and as "Other".
constexpr uint8 other_fc4_types[32] = {0xE1, 0x11, 0xFC, 0xCF, 0xFF, 0xFF, 0xFF, 0xEA, 0xFF, 0xF8, 0xFF,
                                       0xFE, 0xFF, 0xFF, 0xFF, 0xFE, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF,
                                       0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF};
constexpr uint16 fc4_unknown = 0;
constexpr uint16 fc4_other = 1;

bool has_fc4_type(const uint32 (&map)[32], unsigned type)
{
    const unsigned entry = 4 * (type / 32) + 3 - (type % 32) / 8;
    return (map[entry] >> (type % 8)) & 1;
}

template <std::size_t N>
const Status_Row& status_of(const Status_Row (&rows)[N], uint32 state)
{
    for (const Status_Row& row : rows)
        if (row.state == state) return row;
    return unknown_state;
}

} // namespace

const Status_Row& port_status(uint32 state)
{
    return status_of(port_states, state);
}

const Status_Row& controller_status(uint32 state)
{
    return status_of(controller_states, state);
}

const Port_Type_Row& port_type(uint32 type)
{
    for (const Port_Type_Row& row : port_types)
        if (row.from == type) return row;
    return unknown_type;
}

uint64 port_speed(uint32 code)
{
    for (const Speed_Row& row : speeds)
        if (row.code == code) return row.speed;
    return 0;
}

uint64 max_port_speed(uint32 codes)
{
    for (const Speed_Row& row : speeds)
        if (codes & row.code) return row.speed;
    return 0;
}

Array<uint16> classes_of_service(uint32 mask)
{
    Array<uint16> classes;
    for (const Service_Class_Row& row : service_classes)
        if (mask & row.bit) classes.append(row.service_class);
    if (classes.size() == 0) classes.append(uint16(0));
    return classes;
}

Array<uint16> fc4_types(const uint32 (&map)[32])
{
    Array<uint16> types;
    bool any = false;
    bool other = false;
    for (std::size_t i = 0; i < 32; i++) {
        any = any || map[i] != 0;
        other = other || (map[i] & other_fc4_types[i]) != 0;
    }
    if (!any) types.append(fc4_unknown);
    for (const uint16 type : named_fc4_types)
        if (has_fc4_type(map, type)) types.append(type);
    if (other) types.append(fc4_other);
    return types;
}

uint16 access_state(uint32 state)
{
    return state == 1 ? 0 : state == 2 ? 1 : 2;
}

} // namespace cimple
