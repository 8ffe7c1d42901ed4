// What the server's process sees of the module: its names, how it binds them, and its list of providers.
#include <algorithm>
#include <dlfcn.h>
#include <elf.h>
#include <iostream>
#include <link.h>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "runtime/Meta_Class.h"
#include "runtime/Registration.h"
#include "tests/module/support/Elf_File.h"
#include "tests/module/support/Entries.h"
#include "tests/module/support/Expected.h"
#include "tests/module/support/Rig.h"

using namespace nvrtest;
using testing::ElementsAreArray;

namespace {

struct Provider_Row {
    std::string class_name;
    std::string kind;
};

std::vector<Provider_Row> provider_rows()
{
    std::vector<Provider_Row> rows;
    for (const auto& words : expected_rows("providers.txt"))
        rows.push_back({words.at(0), words.at(1)});
    return rows;
}

std::vector<std::string> kinds_of(const Provider_Row& row)
{
    if (row.kind == "association") return {"Instance", "Method", "Association"};
    if (row.kind == "indication") return {"Indication", "Method"};
    return {"Instance", "Method"};
}

std::vector<cimple::Registration*> registrations(void* handle)
{
    const auto head = reinterpret_cast<cimple::Registration* (*)()>(dlsym(handle, "cimple_module"));
    std::vector<cimple::Registration*> all;
    for (cimple::Registration* one = head ? head() : nullptr; one && all.size() < 1000; one = one->next)
        all.push_back(one);
    return all;
}

} // namespace

TEST(Exports, AreTheEntriesAndTheNamesOfTheRuntimeAndNothingElse)
{
    std::vector<std::string> wanted = {"__cimple_assert", "__cimple_trace", "_thread_context_key",
                                       "_thread_context_key_once", "cimple_module"};
    for (const Provider_Row& row : provider_rows())
        for (const std::string& kind : kinds_of(row)) {
            wanted.push_back(row.class_name + "_Create_" + kind + "MI");
            wanted.push_back(row.class_name + "_Provider_Create_" + kind + "MI");
        }
    ASSERT_EQ(wanted.size(), 746u + 5u);
    std::sort(wanted.begin(), wanted.end());

    const Elf_File module(NVR_MODULE);
    std::vector<std::string> missing, surplus;
    std::set_difference(wanted.begin(), wanted.end(), module.exported().begin(), module.exported().end(),
                        std::back_inserter(missing));
    std::set_difference(module.exported().begin(), module.exported().end(), wanted.begin(), wanted.end(),
                        std::back_inserter(surplus));
    EXPECT_THAT(missing, testing::IsEmpty());
    EXPECT_THAT(surplus, testing::IsEmpty());
}

TEST(Exports, AllResolve)
{
    const Entries module;
    const Elf_File file(NVR_MODULE);
    for (const std::string& name : file.exported())
        EXPECT_TRUE(dlsym(module.handle(), name.c_str())) << name;
}

TEST(Exports, TheModuleStaysLoadedAndBindsItsOwnNamesToItself)
{
    const Elf_File module(NVR_MODULE);
    EXPECT_TRUE(module.dynamic_entry(DT_FLAGS_1) & DF_1_NODELETE);
    EXPECT_TRUE(module.dynamic_entry(DT_FLAGS) & DF_SYMBOLIC);
}

// The loader would ask for memory where a thread first comes to what is its own, and end the process without.
TEST(Exports, WhatBelongsToAThreadNeedsNoMemoryOfItsOwn)
{
    const Elf_File module(NVR_MODULE);
    EXPECT_TRUE(module.dynamic_entry(DT_FLAGS) & DF_STATIC_TLS);
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
    EXPECT_THAT(module.imported(), testing::Not(testing::Contains("__tls_get_addr")));
#endif
}

TEST(Exports, NoManagementLibraryIsLinked)
{
    // The languages' own, and what the sanitizers bring.
    const std::vector<std::string> wanted = {"libstdc++.so", "libgcc_s.so", "libc.so",     "libm.so",
                                             "ld-linux",     "libasan.so",  "libubsan.so", "libtsan.so"};
    const Elf_File module(NVR_MODULE);
    EXPECT_THAT(module.needed(), testing::Not(testing::IsEmpty()));
    for (const std::string& library : module.needed())
        EXPECT_TRUE(std::any_of(wanted.begin(), wanted.end(), [&](const std::string& name) {
            return library.rfind(name, 0) == 0;
        })) << library;
}

// All of these add an initialiser to every unit.
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__) && !defined(NORVANE_COVERAGE)

// The class records are constant: only the list of registrations and a few process-wide objects are made at load.
TEST(Exports, LittleCodeRunsAtLoad)
{
    EXPECT_EQ(Elf_File(NVR_MODULE).initializers(), 2u); // the compiler's own and the list of registrations
}

#endif

TEST(Exports, ClassRecordsLieInMemoryThatNobodyWrites)
{
    const Entries module;
    link_map* map = nullptr;
    ASSERT_EQ(dlinfo(module.handle(), RTLD_DI_LINKMAP, &map), 0);
    const Elf_File file(NVR_MODULE);
    const auto list = registrations(module.handle());
    ASSERT_FALSE(list.empty());
    const cimple::Meta_Repository* repository = list.front()->meta_class->meta_repository;
    ASSERT_EQ(repository->num_meta_classes, 260u);
    for (std::size_t i = 0; i < repository->num_meta_classes; i++) {
        const cimple::Meta_Class* record = repository->meta_classes[i];
        EXPECT_TRUE(file.is_read_only_data(reinterpret_cast<std::uintptr_t>(record) - map->l_addr)) << record->name;
    }
}

TEST(Registrations, AreWalkedFromTheLastClassToTheFirst)
{
    const Entries module;
    std::vector<std::string> wanted, found;
    for (const Provider_Row& row : provider_rows())
        wanted.insert(wanted.begin(), row.class_name);
    for (const cimple::Registration* one : registrations(module.handle())) {
        found.push_back(one->meta_class->name);
        EXPECT_STREQ(one->module_name, "norvane_fc_provider_Module");
        EXPECT_EQ(one->provider_name, std::string(one->meta_class->name) + "_Provider");
        EXPECT_TRUE(one->proc);
    }
    EXPECT_EQ(found.size(), 141u);
    EXPECT_THAT(found, ElementsAreArray(wanted));
    EXPECT_EQ(found.front(), "NVRHBA_JobElementSettingData");
    EXPECT_EQ(found.back(), "NVRHBA_Product");
}

class Factories : public Every_Manner {};
NVR_IN_EVERY_MANNER(Factories);

TEST_P(Factories, BothNamesYieldTheSameRecordAndLeaveTheStatusAlone)
{
    Rig rig({*GetParam()});
    const Entries module;
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        for (const Provider_Row& row : provider_rows()) {
            const auto full = reinterpret_cast<CMPIMethodMI* (*)(const CMPIBroker*, const CMPIContext*)>(
                dlsym(module.handle(), (row.class_name + "_Provider_Create_MethodMI").c_str()));
            const auto brief = reinterpret_cast<CMPIMethodMI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*)>(
                dlsym(module.handle(), (row.class_name + "_Create_MethodMI").c_str()));
            ASSERT_TRUE(full && brief) << row.class_name;
            CMPIStatus status = {CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED, nullptr};
            CMPIMethodMI* first = full(broker, context);
            CMPIMethodMI* second = brief(broker, context, &status);
            ASSERT_TRUE(first) << row.class_name;
            EXPECT_EQ(first, second) << row.class_name;
            EXPECT_EQ(status.rc, CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED);
            EXPECT_EQ(first->ft->ftVersion, 100);
            EXPECT_EQ(first->ft->miVersion, 100);
            EXPECT_EQ(first->ft->miName, "method" + row.class_name + "_Provider");
            EXPECT_EQ(first->ft->cleanup(first, context, 1).rc, CMPI_RC_OK);
            EXPECT_EQ(first->ft->cleanup(first, context, 1).rc, CMPI_RC_OK);
        }
    });
    EXPECT_EQ(rig.count_words("Norvane Provider Unloaded"), provider_rows().size());
}
