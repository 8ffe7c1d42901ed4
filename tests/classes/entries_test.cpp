// The exported entries: that they are there, what they hand to the bridge, and that a module exports nothing else.
#include "tests/classes/Expected.h"
#include "tests/classes/fake/fake_adapter.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <dlfcn.h>
#include <memory>
#include <set>

using namespace cimple;
using expected::rows;

namespace {

struct Kind {
    const char* word;
    char letter;
};

std::vector<Kind> kinds_of(const std::string& kind)
{
    if (kind == "association") return {{"Instance", 'I'}, {"Method", 'M'}, {"Association", 'A'}};
    if (kind == "indication") return {{"Indication", 'N'}, {"Method", 'M'}};
    return {{"Instance", 'I'}, {"Method", 'M'}};
}

using Provider_Factory = void* (*)(const CMPIBroker*, const CMPIContext*);
using Class_Factory = void* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);

template <class Factory>
Factory entry(const std::string& name)
{
    return reinterpret_cast<Factory>(dlsym(RTLD_DEFAULT, name.c_str()));
}

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

} // namespace

TEST(Entries, All746HandTheirProviderToTheBridge)
{
    int places[3] = {};
    const auto* broker = reinterpret_cast<const CMPIBroker*>(&places[0]);
    const auto* context = reinterpret_cast<const CMPIContext*>(&places[1]);
    int count = 0;
    std::set<MI_Table_Set*> tables;
    for (const auto& row : rows("providers.txt")) {
        for (const Kind& kind : kinds_of(row[1])) {
            const std::string tail = std::string("_Create_") + kind.word + "MI";
            const auto by_provider = entry<Provider_Factory>(row[0] + "_Provider" + tail);
            const auto by_class = entry<Class_Factory>(row[0] + tail);
            ASSERT_NE(by_provider, nullptr) << row[0] << tail;
            ASSERT_NE(by_class, nullptr) << row[0] << tail;
            count += 2;

            CMPIStatus status = {CMPI_RC_ERR_FAILED, nullptr};
            void* first = by_class(broker, context, &status);
            EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED) << "the status is left as it was";
            EXPECT_EQ(status.msg, nullptr);
            fake::last_factory_call() = {};
            void* second = by_provider(broker, context);
            EXPECT_NE(first, nullptr);
            EXPECT_EQ(first, second) << row[0] << tail;

            const fake::Factory_Call& call = fake::last_factory_call();
            EXPECT_EQ(call.tag, 'C');
            EXPECT_EQ(call.kind, kind.letter);
            EXPECT_EQ(call.broker, broker);
            EXPECT_EQ(call.context, context);
            EXPECT_EQ(call.provider_name, row[0] + "_Provider");
            ASSERT_NE(call.registration, nullptr);
            EXPECT_EQ(call.registration->provider_name, row[0] + "_Provider");
            EXPECT_EQ(call.tables->magic, 0u);
            EXPECT_EQ(call.tables->adapter, nullptr);
            tables.insert(call.tables);
        }
    }
    EXPECT_EQ(count, 746);
    EXPECT_EQ(tables.size(), 141u) << "each provider has a table set of its own";
}

TEST(Entries, ClassesExportNoOtherKind)
{
    for (const auto& row : rows("providers.txt")) {
        std::set<std::string> words = {"Instance", "Method", "Association", "Indication", "Property"};
        for (const Kind& kind : kinds_of(row[1]))
            words.erase(kind.word);
        for (const auto& word : words)
            EXPECT_EQ(entry<void*>(row[0] + "_Create_" + word + "MI"), nullptr) << row[0] << " " << word;
    }
}

TEST(Exports, AModuleShowsItsEntriesAndTheFourNamesOfTheRuntime)
{
    std::set<std::string> expected = {"cimple_module", "__cimple_trace", "__cimple_assert", "_thread_context_key",
                                      "_thread_context_key_once"};
    for (const auto& row : rows("providers.txt"))
        for (const Kind& kind : kinds_of(row[1]))
            for (const char* infix : {"_Create_", "_Provider_Create_"})
                expected.insert(row[0] + infix + kind.word + "MI");
    EXPECT_EQ(expected.size(), 751u);
    EXPECT_EQ(exports_of(FAKE_MODULE), expected);
}

TEST(Exports, AModuleLoadsAndListsItsProvidersInAnyProcess)
{
    void* module = dlopen(FAKE_MODULE, RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(module, nullptr) << dlerror();
    const auto list = reinterpret_cast<Registration* (*)()>(dlsym(module, "cimple_module"));
    ASSERT_NE(list, nullptr);
    int count = 0;
    for (const Registration* at = list(); at; at = at->next)
        ++count;
    EXPECT_EQ(count, 141);
    EXPECT_NE(list(), cimple_module()) << "the module's names bind to itself";
    EXPECT_EQ(dlclose(module), 0);
    EXPECT_NE(dlopen(FAKE_MODULE, RTLD_NOW | RTLD_NOLOAD), nullptr) << "its code stays";
}
