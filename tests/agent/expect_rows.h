/// An instance held against a table of its properties, and the ends of an association against their keys.
#pragma once

#include <initializer_list>

#include "tests/agent/Simulated_Host.h"

namespace nvrtest {

struct Row {
    const char* property;
    std::string expected; ///< as `value` tells it
};

inline void expect_rows(const Instance* instance, std::initializer_list<Row> rows)
{
    ASSERT_NE(instance, nullptr);
    EXPECT_STREQ(instance->__name_space.c_str(), "root/norvane");
    for (const Row& row : rows)
        EXPECT_EQ(value(instance, row.property), row.expected) << row.property;
}

} // namespace nvrtest
