// The trials themselves: each is made once, and none can pass where something is wrong.
#include <dlfcn.h>
#include <set>
#include <string>

#include <gmock/gmock.h>

#include "tests/faults/Trials.h"
#include "tests/module/support/Elf_File.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::HasSubstr;

namespace {

const nvrtest::Run& find(const std::vector<nvrtest::Run>& runs, const std::string& name)
{
    for (const nvrtest::Run& run : runs)
        if (run.name == name) return run;
    throw std::runtime_error("there is no run " + name);
}

} // namespace

TEST(Trials, AreMadeOfEachCallAndEachNameOnce)
{
    const Sound_Session sound = Sound_Session::hold();
    EXPECT_GT(sound.all_calls(), 1000u);
    EXPECT_GT(sound.calls.at("HBA_FreeLibrary").in_unload, 0u);
    std::set<std::string> names;
    const auto calls = library_call_trials(sound), missing = missing_symbol_trials(sound);
    for (const auto* trials : {&calls, &missing})
        for (const nvrtest::Run& run : *trials)
            EXPECT_TRUE(names.insert(run.name).second) << run.name;
    EXPECT_GT(calls.size(), sound.all_calls() * failure_kinds().size() / 2);
    EXPECT_LT(calls.size(), sound.all_calls() * failure_kinds().size());
    EXPECT_EQ(names.count("RM_GetVPD#1:garbage"), 1u);
    EXPECT_EQ(names.count("RM_DiagBeacon#1:status-191"), 1u);
    EXPECT_EQ(names.count("RM_DiagBeacon#1:garbage"), 0u) << "it hands nothing out";
    EXPECT_EQ(names.count("RM_GetDriverType#1:unterminated"), 0u) << "it hands no text out";
    EXPECT_EQ(names.count("HBA_FreeLibrary#1:throws"), 1u);
    EXPECT_EQ(names.count("first-choice:lrmapi-LRM_GetVPD"), 1u);
    for (std::size_t i = 0; i < calls.size(); i++)
        EXPECT_EQ(calls[i].name.find(":slow") != std::string::npos, i >= calls.size() - sleeping_trials(sound));
}

TEST(Trials, FailWhereTheFailureIsNotMetOrTheSoundHostIsNotPublished)
{
    Sound_Session sound = Sound_Session::hold();
    sound.calls["RM_GetVPD"].until_unload = 1000;
    sound.calls["RM_GetLunList"].in_unload = 1;
    const auto trials = library_call_trials(sound);
    EXPECT_EQ(do_run(find(trials, "RM_GetVPD#999:null")).failure, "the session does not make this call\n");
    sound.published += "NVRHBA_FCPort[9] string DeviceID = nobody\n";
    const std::string failure = do_run(find(trials, "RM_GetLunList#1:null")).failure;
    EXPECT_THAT(failure, HasSubstr("the unload does not make this call\n"));
    EXPECT_THAT(failure, HasSubstr("after a refresh it does not publish what it should:\n- NVRHBA_FCPort[9]"));
    EXPECT_THAT(failure, HasSubstr("after the second load it does not publish"));
}

TEST(Trials, HideOneNameFromTheLoader)
{
    compose_libraries();
    const std::string path = library_folder() + "/liblrmapi.so", copy = library_folder() + "/copy.so";
    write_file(copy, Elf_File(path).without("LRM_GetVPD"));
    void* whole = ::dlopen(path.c_str(), RTLD_NOW);
    void* less = ::dlopen(copy.c_str(), RTLD_NOW);
    ASSERT_TRUE(whole && less) << ::dlerror();
    EXPECT_TRUE(::dlsym(whole, "LRM_GetVPD"));
    EXPECT_FALSE(::dlsym(less, "LRM_GetVPD"));
    EXPECT_TRUE(::dlsym(less, "LRM_GetSffData"));
    ::dlclose(less);
    ::dlclose(whole);
    EXPECT_THROW(Elf_File(path).without("no_such_name"), std::runtime_error);
}
