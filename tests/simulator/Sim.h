// What the tests of the simulator share: loading scenarios, names in wire form, blocks read with care.
#ifndef _tests_simulator_Sim_h
#define _tests_simulator_Sim_h

#include "simulator/Calls.h"
#include "simulator/nvrsim.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

inline std::string sim_text(size_t (*give)(char*, size_t))
{
    std::string text(give(nullptr, 0) + 1, '\0');
    text.resize(give(&text[0], text.size()));
    return text;
}

inline std::string sim_value(const char* port, const char* name)
{
    char text[256] = "";
    return nvrsim_get(port, name, text, sizeof text) ? text : "(none)";
}

inline HBA_WWN wire(uint64_t wwn)
{
    HBA_WWN name;
    for (int i = 0; i < 8; ++i)
        name.wwn[i] = static_cast<HBA_UINT8>(wwn >> (56 - 8 * i));
    return name;
}

inline uint64_t number(const HBA_WWN& wwn)
{
    uint64_t name = 0;
    for (HBA_UINT8 byte : wwn.wwn)
        name = name << 8 | byte;
    return name;
}

constexpr uint64_t port0 = 0x10000000C9A00001, port1 = 0x10000000C9A00002;
constexpr uint64_t target0 = 0x50060E8005A10000, target1 = 0x50060E8005A10001;

/// An FCP LUN as callers pass it: eight bytes in memory order.
inline HBA_UINT64 fcp_lun(uint8_t low)
{
    const uint8_t bytes[8] = {0, low, 0, 0, 0, 0, 0, 0};
    HBA_UINT64 lun;
    std::memcpy(&lun, bytes, sizeof lun);
    return lun;
}

/// One adapter with one port and one target of three units, or what the test gives.
class Simulated : public testing::Test {
protected:
    static constexpr const char* plain = "[[adapter]]\n[[target]]\nluns = 3\n";

    void SetUp() override { load(plain); }

    void load(const std::string& toml)
    {
        ASSERT_EQ(0, nvrsim_load_text(toml.c_str(), "test.toml")) << sim_text(nvrsim_error);
    }

    static void fault(const char* table) { ASSERT_GT(nvrsim_fault(table), 0) << sim_text(nvrsim_error); }

    static HBA_HANDLE open(uint32_t index = 0)
    {
        char name[256];
        return nvrsim_HBA_GetAdapterName(index, name) == 0 ? nvrsim_HBA_OpenAdapter(name) : 0;
    }
};

/// A block of the management API with its reader.
struct Block {
    explicit Block(uint32_t capacity) : bytes(capacity, 0), size(capacity) {}

    template <class T>
    bool read(uint16_t attribute, T& value)
    {
        uint16_t length = 0;
        uint32_t status = 1;
        const void* place = nvrsim_RM_GetAttributeValue(bytes.data(), attribute, &length, &status);
        if (!place || status || length != sizeof value) return false;
        std::memcpy(&value, place, sizeof value);
        return true;
    }

    std::string text(uint16_t attribute)
    {
        uint16_t length = 0;
        uint32_t status = 1;
        const void* place = nvrsim_RM_GetAttributeValue(bytes.data(), attribute, &length, &status);
        return place && !status ? std::string(static_cast<const char*>(place), length) : "(none)";
    }

    std::vector<char> bytes;
    uint32_t size;
};

#endif // _tests_simulator_Sim_h
