/// The test provider as tests see it: settings that tell it what to do, and the events it told of.
#pragma once

#include "host/Host.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace things {

constexpr const char* space = "root/test";

/// Sets what the provider asks for by name; all are 0 at the start of a test.
void set(const std::string& name, long value);
/// What the provider told since the last look, in order.
std::vector<std::string> events();
/// Forgets settings and events.
void reset();

std::shared_ptr<const host::Schema> schema();
host::Host_Options options(const host::Manner& manner);
/// A host with the provider's classes registered in root/test.
std::unique_ptr<host::Host> make_host(const host::Manner& manner = host::Manner::strict());
/// As `make_host`, by one registration.
host::Registration registration(const std::string& class_name, unsigned kinds);

host::Path thing(std::uint32_t id, const std::string& class_name = "TEST_Thing");

/// Tests that hold in every manner.
class In_Every_Manner : public testing::TestWithParam<const host::Manner*> {
protected:
    void SetUp() override { reset(); }
    const host::Manner& manner() const { return *GetParam(); }
    bool is(const char* name) const { return manner().name == std::string(name); }
};

inline std::string manner_name(const testing::TestParamInfo<const host::Manner*>& info)
{
    std::string name = info.param->name;
    for (char& c : name)
        if (c == '-' || c == '.') c = '_';
    return name;
}

#define FOR_EVERY_MANNER(SUITE)                                                                                        \
    INSTANTIATE_TEST_SUITE_P(Manners, SUITE, testing::ValuesIn(host::Manner::all()), things::manner_name)

} // namespace things
