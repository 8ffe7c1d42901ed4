// Hosts that lack libraries, or symbols in them: the module answers all the same, says what it lacks, and works again
// when they are there at its next load.
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::Contains;
using testing::IsEmpty;
using testing::Not;

namespace {

const char* const libraries[] = {"HBAAPI", "lrmapi", "rmapi", "tssdm"};

std::vector<std::string> combination(unsigned bits)
{
    std::vector<std::string> present;
    for (unsigned i = 0; i < 4; i++)
        if (bits >> i & 1) present.push_back(libraries[i]);
    return present;
}

bool has(unsigned bits, unsigned library)
{
    return bits >> library & 1;
}

enum { hbaapi, lrmapi, rmapi, tssdm };

void expect_all_answer(Rig& rig)
{
    for (const std::string& name : rig.classes())
        if (name != "NVRHBA_AlertIndication") {
            EXPECT_THAT(rig.enumerate(name), succeeded()) << name;
        }
}

} // namespace

class Installed : public testing::TestWithParam<unsigned> {};

TEST_P(Installed, EveryClassAnswersAndTheLoadIsLogged)
{
    const unsigned bits = GetParam();
    Rig rig({host::Manner::strict(), "small", "", combination(bits)});
    expect_all_answer(rig);
    EXPECT_EQ(rig.enumerate("NVRHBA_RegisteredProfile").instances.size(), 13u);

    const bool is_managed = has(bits, lrmapi) || has(bits, rmapi);
    const bool has_ports = is_managed && has(bits, hbaapi);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), has_ports ? 1u : 0u);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPortStatistics").instances.size(), has_ports ? 1u : 0u);

    // With the second choice the load counts as faulty though all works; with neither, only the third library counts.
    const bool is_faulty = has(bits, rmapi) && !has(bits, lrmapi) ? true : !has(bits, tssdm);
    EXPECT_EQ(rig.count_words("Error : In Loading Library ") > 0, is_faulty);
    EXPECT_EQ(rig.count_words("Norvane CIM Provider load failure") > 0, !is_managed);
    if (!is_managed) {
        EXPECT_THAT(rig.words(), Contains("Error : Initialization of RMLib:: RM_InitLib failed with[1]"));
        EXPECT_THAT(rig.words(), Contains(testing::StartsWith("RM Init failed for ")));
        EXPECT_THAT(rig.words(),
                    Contains("Norvane Provider dependent library load has failed..do nothing is the only option"));
    }
}

TEST_P(Installed, ALoadAfterTheRepairFindsThePorts)
{
    Rig rig({host::Manner::strict(), "small", "", combination(GetParam())});
    expect_all_answer(rig);
    rig.stop();
    compose_libraries({"HBAAPI", "lrmapi", "rmapi", "tssdm"});
    rig.restart();
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
}

INSTANTIATE_TEST_SUITE_P(Libraries, Installed, testing::Range(0u, 16u), [](const auto& info) {
    std::string label;
    for (const std::string& name : combination(info.param))
        label += name;
    return label.empty() ? std::string("none") : label;
});

TEST(MissingLibraries, TheSecondChoiceCanStandForAll)
{
    for (const char* variant : {"rmapi-only", "rmapi-both-names"}) {
        Rig rig({host::Manner::strict(), "small", "", {}, variant});
        const host::Answer ports = rig.enumerate("NVRHBA_FCPort");
        EXPECT_THAT(ports, succeeded()) << variant;
        EXPECT_EQ(ports.instances.size(), 1u) << variant;
        EXPECT_THAT(rig.words(), Contains("Error : In Loading Library ")) << variant;
    }
}

TEST(MissingLibraries, AFirstChoiceWithoutASymbolIsNotHelpedByTheSecond)
{
    Rig rig({host::Manner::strict(), "small", "", {}, "lrm-without-LRM_GetVPD"});
    const host::Answer ports = rig.enumerate("NVRHBA_FCPort");
    ASSERT_EQ(ports.instances.size(), 1u);
    EXPECT_EQ(ports.instances[0].get("IdentifyingDescriptions").to_text(), "{OS Device Name, NORVANE:IEEE_ADDRESS}");
    EXPECT_THAT(rig.words(), Contains("ERROR: RM_GetVPD call failed, Returned with error code : 1"));
}

TEST(MissingLibraries, WithoutTheInitialisationNothingIsLoaded)
{
    Rig rig({host::Manner::strict(), "small", "", {}, "lrm-without-LRM_InitLib"});
    EXPECT_THAT(rig.enumerate("NVRHBA_FCPort").instances, IsEmpty());
    EXPECT_THAT(rig.words(), Contains("Norvane CIM Provider load failure"));
}

TEST(MissingLibraries, AnAdapterLibraryWithoutSymbolsFindsNoAdapters)
{
    Rig rig({host::Manner::strict(), "small", "", {}, "hba-without-symbols"});
    expect_all_answer(rig);
    EXPECT_THAT(rig.enumerate("NVRHBA_FCPort").instances, IsEmpty());
    EXPECT_THAT(rig.words(), Contains("HBAAPI reports that there are NO HBAs in the system."));
}

TEST(MissingLibraries, AnAdapterLibraryNeedsNoLoadFunction)
{
    Rig rig({host::Manner::strict(), "small", "", {}, "hba-without-load"});
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
}

TEST(MissingLibraries, APortWithoutAMappingIsPublished)
{
    Rig rig({host::Manner::strict(), "small", "", {}, "hba-without-mapping"});
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
    EXPECT_THAT(rig.enumerate("NVRHBA_LogicalDisk"), succeeded());
    EXPECT_THAT(rig.words(), Contains("Error hbaStatus=1"));
}

TEST(MissingLibraries, AFailingInitialisationIsTriedAgainAtTheNextLoad)
{
    Rig rig({host::Manner::strict(), "small"});
    add_fault("call = \"RM_InitLib\", status = 3");
    expect_all_answer(rig);
    EXPECT_THAT(rig.words(), Contains("Error : Initialization of RMLib:: RM_InitLib failed with[3]"));
    EXPECT_THAT(rig.enumerate("NVRHBA_FCPort").instances, IsEmpty());
    rig.stop();
    clear_faults();
    rig.restart();
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
}

TEST(MissingLibraries, ANegativeAnswerOfTheInitialisationIsASuccess)
{
    Rig rig({host::Manner::strict(), "small"});
    add_fault("call = \"RM_InitLib\", status = -1");
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
    EXPECT_THAT(rig.words(), Not(Contains("Norvane CIM Provider load failure")));
}

TEST(MissingLibraries, AFailedLoadDoesNotHideTheSettingsFile)
{
    Rig rig({host::Manner::strict(), "small", "NVR_PROVIDER_CACHE_TIMEOUT = 20\n", {}});
    expect_all_answer(rig);
    rig.stop();
    EXPECT_THAT(read_file(conf_path), testing::HasSubstr("NVR_PROVIDER_CACHE_TIMEOUT = 20\n"));
}
