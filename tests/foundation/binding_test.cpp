#include "foundation/management_binding.h"

#include <cstring>
#include <dlfcn.h>
#include <thread>

#include <gmock/gmock.h>

#include "tests/foundation/fakes/fake_libraries.h"
#include "tests/support/private_host.h"

using testing::Contains;
using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::IsEmpty;
using testing::Not;

namespace {

using cimple::Forward;
using cimple::loadLibraries;
using cimple::loadLibrary;
using cimple::unloadLibraries;

template <class Result, class... Arguments>
Result call(Forward<Result(Arguments...)>& operation)
{
    return operation(Arguments{}...);
}

// What an operation answers when it finds nothing; and that it did not call anything.
enum class Answer { one, zero, null, nothing };

template <class Result, class... Arguments>
Answer answer(Forward<Result(Arguments...)>& operation)
{
    if constexpr (std::is_void_v<Result>) {
        call(operation);
        return Answer::nothing;
    } else if constexpr (std::is_pointer_v<Result>) {
        EXPECT_EQ(call(operation), nullptr) << operation.name();
        return Answer::null;
    } else {
        const auto result = call(operation);
        EXPECT_TRUE(result == 0 || result == 1) << operation.name();
        return result == 1 ? Answer::one : Answer::zero;
    }
}

struct Libraries {
    bool hbaapi;
    bool lrmapi;
    bool rmapi;
    bool tssdm;
    bool rmapi_short = false;

    void install() const
    {
        std::vector<std::string> names;
        if (hbaapi) names.push_back("HBAAPI");
        if (lrmapi) names.push_back("lrmapi");
        if (rmapi) names.push_back(rmapi_short ? "rmapi_short=rmapi" : "rmapi");
        if (tssdm) names.push_back("tssdm");
        fake::install(names);
    }
    // rmapi is opened only where lrmapi is missing, and then stands in for all.
    bool stand_in() const { return !lrmapi && rmapi; }

    using Calls = std::vector<std::string>;
    Calls management(const std::string& name) const
    {
        if (lrmapi) return {"lrmapi:L" + name};
        if (stand_in()) return {rmapi_short ? "rmapi:" + name : "rmapi:L" + name};
        return {};
    }
    Calls plain(const std::string& name) const { return lrmapi ? Calls{"lrmapi:" + name} : other(name); }
    Calls hba(const std::string& name) const { return hbaapi ? Calls{"HBAAPI:" + name} : other(name); }
    Calls cpqfc(const std::string& name) const
    {
        return tssdm && name != "CPQFC_CloseAdapter" ? Calls{"tssdm:" + name} : other(name);
    }
    Calls other(const std::string& name) const { return stand_in() ? Calls{"rmapi:" + name} : Calls{}; }
    int result() const { return stand_in() || !tssdm ? 1 : 0; }
};

void expect_every_operation(const Libraries& libraries)
{
#define EXPECT_CALLS(result, name, missing, parameters, arguments, expected)                                           \
    for (int round = 0; round < 2; round++) {                                                                          \
        fake::calls().clear();                                                                                         \
        call(cimple::name);                                                                                            \
        EXPECT_THAT(fake::calls(), ElementsAreArray(libraries.expected(#name))) << #name;                              \
    }
#define MANAGEMENT(result, name, missing, parameters, arguments)                                                       \
    EXPECT_CALLS(result, name, missing, parameters, arguments, management)
#define PLAIN(result, name, missing, parameters, arguments)                                                            \
    EXPECT_CALLS(result, name, missing, parameters, arguments, plain)
#define HBA(result, name, missing, parameters, arguments)                                                              \
    EXPECT_CALLS(result, name, missing, parameters, arguments, hba)
#define CPQFC(result, name, missing, parameters, arguments)                                                            \
    EXPECT_CALLS(result, name, missing, parameters, arguments, cpqfc)
    NVR_MANAGEMENT_OPERATIONS(MANAGEMENT)
    NVR_PLAIN_MANAGEMENT_OPERATIONS(PLAIN)
    NVR_HBA_OPERATIONS(HBA)
    NVR_CPQFC_OPERATIONS(CPQFC)
}

struct Binding : testing::TestWithParam<int> {
    ~Binding() override { unloadLibraries(); }
};

} // namespace

TEST_P(Binding, FindsEveryOperationWhereThePresentLibrariesHaveIt)
{
    const int bits = GetParam();
    const Libraries libraries{(bits & 1) != 0, (bits & 2) != 0, (bits & 4) != 0, (bits & 8) != 0, (bits & 16) != 0};
    libraries.install();
    EXPECT_EQ(loadLibraries(), libraries.result());
    expect_every_operation(libraries);
    EXPECT_EQ(loadLibraries(), libraries.result()) << "a second load changes nothing";
    expect_every_operation(libraries);
}

INSTANTIATE_TEST_SUITE_P(EveryCombination, Binding, testing::Range(0, 32));

TEST_F(Binding, WithoutLibrariesAnswersTheFixedResults)
{
    fake::install({});
    EXPECT_EQ(loadLibraries(), 1);
    EXPECT_EQ(answer(cimple::HBA_GetNumberOfAdapters), Answer::zero);
    EXPECT_EQ(answer(cimple::RM_GetNumberOfLocalAdapters), Answer::zero);
    EXPECT_EQ(answer(cimple::RM_GetNextVpdEntry), Answer::zero);
    EXPECT_EQ(answer(cimple::RM_GetAttributeValue), Answer::null);
    EXPECT_EQ(answer(cimple::HBA_CloseAdapter), Answer::nothing);
    EXPECT_EQ(answer(cimple::HBA_RefreshInformation), Answer::nothing);
    EXPECT_EQ(answer(cimple::CPQFC_CloseAdapter), Answer::nothing);
    int ones = 0;
#define COUNT(result, name, missing, parameters, arguments) ones += answer(cimple::name) == Answer::one;
    NVR_MANAGEMENT_OPERATIONS(COUNT)
    const int management = ones;
#define ALL(result, name, missing, parameters, arguments) +1
    EXPECT_EQ(management, 0 NVR_MANAGEMENT_OPERATIONS(ALL));
    NVR_PLAIN_MANAGEMENT_OPERATIONS(COUNT)
    NVR_HBA_OPERATIONS(COUNT)
    NVR_CPQFC_OPERATIONS(COUNT)
    const int all = 0 NVR_MANAGEMENT_OPERATIONS(ALL) NVR_PLAIN_MANAGEMENT_OPERATIONS(ALL) NVR_HBA_OPERATIONS(ALL)
        NVR_CPQFC_OPERATIONS(ALL);
    EXPECT_EQ(ones, all - 7);
    EXPECT_THAT(fake::calls(), IsEmpty());
}

TEST_F(Binding, BeforeAnyLoadFindsNothing)
{
    EXPECT_EQ(answer(cimple::HBA_GetNumberOfAdapters), Answer::zero);
    EXPECT_EQ(answer(cimple::RM_InitLib), Answer::one);
    EXPECT_EQ(answer(cimple::CPQFC_OpenAdapter), Answer::one);
    EXPECT_EQ(answer(cimple::CPQFC_CloseAdapter), Answer::nothing);
}

TEST_F(Binding, PassesArgumentsAndResultsUnchanged)
{
    fake::install({"HBAAPI", "lrmapi", "tssdm"});
    EXPECT_EQ(loadLibraries(), 0);
    const HBA_WWN wwn = {{1, 2, 3, 4, 5, 6, 7, 8}};
    char block[8];
    uint32_t size = 8;
    fake::operations().RM_GetHBAAttributes = [&](HBA_WWN name, void* buffer, uint32_t* room) {
        EXPECT_EQ(std::memcmp(&name, &wwn, 8), 0);
        EXPECT_EQ(buffer, block);
        EXPECT_EQ(room, &size);
        *room = 4;
        return 64u;
    };
    EXPECT_EQ(cimple::RM_GetHBAAttributes(wwn, block, &size), 64u);
    EXPECT_EQ(size, 4u);
    fake::operations().RM_InitLib = [] { return -5; };
    EXPECT_EQ(cimple::RM_InitLib(), -5);
    fake::operations().RM_GetAttributeValue = [&](void* b, uint16_t number, uint16_t* length, uint32_t* status) {
        EXPECT_EQ(number, 551);
        *length = 2;
        *status = 0;
        return static_cast<void*>(static_cast<char*>(b) + 2);
    };
    uint16_t length = 0;
    uint32_t status = 1;
    EXPECT_EQ(cimple::RM_GetAttributeValue(block, 551, &length, &status), block + 2);
    EXPECT_EQ(length, 2);
    EXPECT_EQ(status, 0u);
}

TEST_F(Binding, DoesNotTryTheOtherNameInTheFirstChoiceLibrary)
{
    fake::install({"HBAAPI", "lrmapi_lacking=lrmapi", "rmapi", "tssdm"});
    EXPECT_EQ(loadLibraries(), 0);
    char block[8];
    uint32_t size = 8;
    EXPECT_EQ(cimple::RM_GetVPD(HBA_WWN{}, block, &size), 1u);
    EXPECT_THAT(fake::calls(), ElementsAre("HBAAPI:HBA_LoadLibrary")) << "and rmapi stays closed";
    EXPECT_EQ(cimple::RM_GetSffData(HBA_WWN{}, block, &size), 0u);
}

TEST_F(Binding, LooksInTheGlobalScopeForOneOperationOnly)
{
    fake::install({});
    const std::string file = nvrtest::library_folder() + "/libelsewhere.so";
    nvrtest::make_link(NVR_FAKE_LIBRARIES "/libfake_rmapi.so", file);
    void* elsewhere = ::dlopen(file.c_str(), RTLD_NOW | RTLD_GLOBAL);
    ASSERT_NE(elsewhere, nullptr);
    fake::install({"HBAAPI", "lrmapi", "tssdm"});
    EXPECT_EQ(loadLibraries(), 0);
    unloadLibraries();
    fake::calls().clear();

    cimple::CPQFC_CloseAdapter(1);
    EXPECT_THAT(fake::calls(), ElementsAre("rmapi:CPQFC_CloseAdapter"));
    EXPECT_EQ(cimple::CPQFC_OpenAdapter("x"), 1u);
    EXPECT_EQ(cimple::HBA_GetNumberOfAdapters(), 0u);
    EXPECT_EQ(cimple::RM_InitLib(), 1);
    EXPECT_EQ(fake::calls().size(), 1u);

    fake::install({});
    loadLibraries();
    fake::calls().clear();
    cimple::CPQFC_CloseAdapter(1);
    EXPECT_THAT(fake::calls(), IsEmpty()) << "not once rmapi is known to be missing";
    ::dlclose(elsewhere);
}

TEST_F(Binding, TellsTheCommonLibraryWhenItIsLoadedAndFreed)
{
    fake::install({"HBAAPI", "lrmapi", "tssdm"});
    fake::operations().HBA_LoadLibrary = [] { return 1u; };
    fake::operations().HBA_FreeLibrary = [] { return 1u; };
    EXPECT_EQ(loadLibraries(), 0) << "its result does not matter";
    EXPECT_EQ(loadLibraries(), 0);
    EXPECT_THAT(fake::calls(), ElementsAre("HBAAPI:HBA_LoadLibrary"));
    EXPECT_EQ(unloadLibraries(), 0);
    EXPECT_EQ(unloadLibraries(), 0);
    EXPECT_THAT(fake::calls(), ElementsAre("HBAAPI:HBA_LoadLibrary", "HBAAPI:HBA_FreeLibrary"));
}

TEST_F(Binding, LeavesLibrariesInTheProcessThatMayStillCallBack)
{
    fake::install({"HBAAPI"});
    loadLibraries();
    cimple::keepLibrariesMapped(true);
    fake::calls().clear();
    EXPECT_EQ(unloadLibraries(), 0);
    cimple::keepLibrariesMapped(false);
    EXPECT_THAT(fake::calls(), IsEmpty()) << "nor are its vendors' libraries freed";
    const std::string file = nvrtest::library_folder() + "/libHBAAPI.so";
    void* left = ::dlopen(file.c_str(), RTLD_NOW | RTLD_NOLOAD);
    EXPECT_NE(left, nullptr);
    EXPECT_EQ(cimple::HBA_GetNumberOfAdapters(), 0u) << "not bound any more";
    ::dlclose(left);
    ::dlclose(left);
}

TEST_F(Binding, TakesACommonLibraryWithoutThoseCalls)
{
    fake::install({"lrmapi", "tssdm=HBAAPI", "tssdm"}); // under the name, a library with none of the operations
    EXPECT_EQ(loadLibraries(), 0);
    EXPECT_EQ(cimple::HBA_GetNumberOfAdapters(), 0u);
    EXPECT_EQ(cimple::HBA_OpenAdapter(nullptr), 1u);
    EXPECT_THAT(fake::calls(), IsEmpty());
}

TEST_F(Binding, BindsAfreshAfterAnUnload)
{
    char block[8];
    uint32_t size = 8;
    const auto library_of_vpd = [&] {
        fake::calls().clear();
        cimple::RM_GetVPD(HBA_WWN{}, block, &size);
        return fake::calls();
    };
    fake::install({});
    EXPECT_EQ(loadLibraries(), 1);
    EXPECT_THAT(library_of_vpd(), IsEmpty());
    unloadLibraries();
    for (int round = 0; round < 3; round++) {
        fake::install({"HBAAPI", "lrmapi", "tssdm"});
        EXPECT_EQ(loadLibraries(), 0);
        EXPECT_THAT(library_of_vpd(), ElementsAre("lrmapi:LRM_GetVPD"));
        unloadLibraries();
        EXPECT_THAT(library_of_vpd(), IsEmpty());
        fake::install({"rmapi_short=rmapi"});
        EXPECT_EQ(loadLibraries(), 1);
        EXPECT_THAT(library_of_vpd(), ElementsAre("rmapi:RM_GetVPD"));
        unloadLibraries();
    }
}

TEST_F(Binding, IsUsedByManyThreads)
{
    for (const auto& libraries : {std::vector<std::string>{"HBAAPI", "lrmapi", "tssdm"}, {"rmapi_short=rmapi"}}) {
        fake::install(libraries);
        loadLibraries();
        std::vector<std::thread> threads;
        for (int t = 0; t < 4; t++)
            threads.emplace_back([] {
                for (int i = 0; i < 100; i++) {
                    EXPECT_EQ(cimple::RM_InitLib(), 0);
                    EXPECT_EQ(cimple::HBA_GetNumberOfAdapters(), 0u);
                    EXPECT_EQ(cimple::CPQFC_OpenAdapter("x"), 0u);
                }
            });
        for (std::thread& thread : threads)
            thread.join();
        unloadLibraries();
    }
}

TEST_F(Binding, OpensALibraryIntoItsSlotOnce)
{
    fake::install({"HBAAPI"});
    EXPECT_EQ(loadLibrary(cimple::SLOT_TSSDM, "tssdm"), 0);
    EXPECT_EQ(loadLibrary(cimple::SLOT_HBAAPI, "HBAAPI"), 1);
    fake::install({});
    EXPECT_EQ(loadLibrary(cimple::SLOT_HBAAPI, "HBAAPI"), 1) << "open already";
}

TEST_F(Binding, EndsTheTextsOfTheLibrary)
{
    fake::install({"lrmapi"});
    loadLibraries();
    fake::operations().RM_StatusString = [](uint32_t, char* buffer, uint32_t size) {
        std::memset(buffer, 'x', size);
        return 0u;
    };
    EXPECT_EQ(std::strlen(cimple::StatusText(5).c_str()), 255u);
    fake::operations().RM_StatusString = [](uint32_t, char*, uint32_t) { return 1u; };
    EXPECT_STREQ(cimple::StatusText(5).c_str(), "");
}
