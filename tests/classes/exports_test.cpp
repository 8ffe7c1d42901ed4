// What a module shows to the process that loads it: the entries, four names of the runtime, and nothing else.
#include "runtime/Registration.h"
#include "tests/classes/Expected.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <dlfcn.h>
#include <memory>
#include <set>

using namespace cimple;
using expected::Mi_Kind;
using expected::mi_kinds;
using expected::rows;

namespace {

/// The dynamic symbols that a library defines.
std::set<std::string> exports_of(const char* path)
{
    std::unique_ptr<FILE, int (*)(FILE*)> pipe(
        popen(("nm --dynamic --defined-only --format=posix '" + std::string(path) + "'").c_str(), "r"), pclose);
    std::set<std::string> names;
    char line[512];
    while (pipe && std::fgets(line, sizeof line, pipe.get()))
        names.insert(std::string(line, std::strcspn(line, " @")));
    return names;
}

/// The module under test: the real one, or the table of fakes that is linked in the same way.
class Exports : public ::testing::TestWithParam<const char*> {};

const char* const modules[] = {FAKE_MODULE,
#ifdef REAL_MODULE
                               REAL_MODULE
#endif
};

INSTANTIATE_TEST_SUITE_P(Module, Exports, ::testing::ValuesIn(modules),
                         [](const auto& info) { return std::string(info.index == 0 ? "OfFakes" : "ThatShips"); });

} // namespace

TEST_P(Exports, AModuleShowsItsEntriesAndTheFourNamesOfTheRuntime)
{
    std::set<std::string> expected = {"cimple_module", "__cimple_trace", "__cimple_assert", "_thread_context_key",
                                      "_thread_context_key_once"};
    for (const auto& row : rows("providers.txt"))
        for (const Mi_Kind& kind : mi_kinds(row[1]))
            for (const char* infix : {"_Create_", "_Provider_Create_"})
                expected.insert(row[0] + infix + kind.word + "MI");
    EXPECT_EQ(expected.size(), 751u);
    EXPECT_EQ(exports_of(GetParam()), expected);
}

TEST_P(Exports, AModuleLoadsAndListsItsProvidersInAnyProcess)
{
    void* module = dlopen(GetParam(), RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(module, nullptr) << dlerror();
    const auto list = reinterpret_cast<Registration* (*)()>(dlsym(module, "cimple_module"));
    ASSERT_NE(list, nullptr);
    int count = 0;
    for (const Registration* at = list(); at; at = at->next)
        ++count;
    EXPECT_EQ(count, 141);
    EXPECT_EQ(dlclose(module), 0);
    EXPECT_NE(dlopen(GetParam(), RTLD_NOW | RTLD_NOLOAD), nullptr) << "its code stays";
}
