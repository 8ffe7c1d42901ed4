// Scenario files: defaults, overrides, what is shipped, what is refused and with which words, and how fast they load.
#include "Sim.h"

#include <set>

namespace {

std::string refusal(const std::string& toml)
{
    if (nvrsim_load_text(toml.c_str(), "bad.toml") == 0) return "(accepted)";
    return sim_text(nvrsim_error);
}

struct Wrong {
    const char* toml;
    const char* message;
};

} // namespace

TEST(Scenario, WhatIsWrongIsToldWithFileLineAndReason)
{
    const Wrong rows[] = {
        {"[[adapter]]\nmodle = 'x'\n", "bad.toml:2: unknown key \"modle\""},
        {"[[adapter]]\nmodel = 5\n", "bad.toml:2: \"model\" must be a text"},
        {"\n\nadapter = 5\n", "bad.toml:3: \"adapter\" must be an array"},
        {"adapter = [1]\n", "bad.toml:1: \"adapter\" must hold tables, written [[adapter]]"},
        {"[[adapter]]\n[[adapter.port]]\n\nwwpn = '123'\n",
         "bad.toml:4: \"wwpn\" must be a World Wide Name of 16 hexadecimal digits in quotes"},
        {"[[adapter]]\nports = 300\n", "bad.toml:2: \"ports\" must lie between 0 and 256"},
        {"[[adapter]]\nports = -1\n", "bad.toml:2: \"ports\" must not be negative"},
        {"[[adapter]]\nports = 'two'\n", "bad.toml:2: \"ports\" is no number"},
        {"[[adapter]]\nports = 1.5\n", "bad.toml:2: \"ports\" must be a number"},
        {"[[adapter]]\nports = 2\n[[adapter.port]]\n",
         "bad.toml:1: give either \"ports\" or [[adapter.port]], not both"},
        {"[[adapter]]\nname = 'a'\n[[adapter]]\nname = 'a'\n",
         "bad.toml:1: two adapters have the name \"a\" (allow_twins = true permits it)"},
        {"[[adapter]]\n[[adapter.port]]\nlocal = 1\n", "bad.toml:3: \"local\" must be true or false"},
        {"[[adapter]]\n[[adapter.port]]\nbeacon = 'blue'\n",
         "bad.toml:3: \"beacon\" must be one of \"unavailable\", \"off\", \"on\", \"unsupported\""},
        {"[[adapter]]\n[[adapter.port]]\nattributes = { 70000 = 1 }\n",
         "bad.toml:3: \"70000\" is no attribute number from 1 to 65535"},
        {"[[adapter]]\n[[adapter.port]]\nattributes = { 551 = true }\n",
         "bad.toml:3: \"attributes.551\" may be false, for left out, but not true"},
        {"[[adapter]]\n[[adapter.port]]\ntransceiver = { a0 = '00' }\n",
         "bad.toml:3: \"a0\" has 1 bytes instead of 256"},
        {"[[adapter]]\n[[adapter.port]]\nvpd = { raw = 'abc' }\n",
         "bad.toml:3: \"raw\" has an odd number of hexadecimal digits"},
        {"[[adapter]]\n[[adapter.port]]\nvpd = { raw = 'zz' }\n",
         "bad.toml:3: \"raw\" must hold hexadecimal digits only"},
        {"[[adapter]]\n[[adapter.port]]\nvpd = { entries = [['X', '1']] }\n",
         "bad.toml:3: a tag must have two letters"},
        {"[[adapter]]\n[[adapter.port]]\n[[adapter.port.params]]\nlow = 1\n",
         "bad.toml:3: a driver parameter needs a \"name\""},
        {"[[adapter]]\n[[target]]\nseen_by = [1]\n", "bad.toml:3: there is no port 1, only 1 ports, counted from 0"},
        {"[[adapter]]\n[[target]]\nseen_by = ['1000000000000001']\n",
         "bad.toml:3: no port has the name 1000000000000001"},
        {"[[target]]\n[[target.lun]]\nfcp_lun = '0000000000000000'\n[[target.lun]]\nfcp_lun = '0000000000000000'\n",
         "bad.toml:1: two logical units of target 50060E8005A10000 have the same FCP LUN"},
        {"[[target]]\n[[target.lun]]\ndevice_type = 32\n", "bad.toml:3: \"device_type\" must lie between 0 and 31"},
        {"[[fault]]\nstatus = 1\n", "bad.toml:1: a fault needs a \"call\""},
        {"[defaults.port]\ncolour = 1\n[[adapter]]\n", "bad.toml:2: unknown key \"colour\""},
        {"[generate]\nports = 70000\n", "bad.toml:2: \"ports\" must lie between 0 and 65536"},
        {"\n[generate]\nports = 1\ntargets = 65536\nluns = 65536\n",
         "bad.toml:2: too many logical units: more than 1048576"},
        {"[[adapter]]\n[[target]]\ncount = 17\nluns = 65536\n",
         "bad.toml:2: too many logical units: more than 1048576"},
        {"[[adapter]]\nports = 256\n[[target]]\ncount = 16385\nluns = 0\n",
         "bad.toml:3: too many targets: more than 4194304 views of one by a port"},
    };
    for (const Wrong& row : rows)
        EXPECT_EQ(row.message, refusal(row.toml)) << row.toml;
    EXPECT_EQ(0u, refusal("a = 1\n[[adapter\n").find("bad.toml:2: ")) << "syntax";
}

TEST(Scenario, HeaderThatBeginsWithNoNameIsRefused)
{
    EXPECT_EQ("bad.toml:1: Error while parsing key: expected bare key starting character or string delimiter, saw '#'",
              refusal("[#"));
}

TEST(Scenario, LetterBeyondAsciiOutsideOfQuotesIsRefused)
{
    EXPECT_EQ("bad.toml:2: Error while parsing key-value pair: expected '=', saw '\xc5\x80'", refusal("\nt\xc5\x80"));
    EXPECT_EQ("bad.toml:2: Error while parsing decimal integer: expected digit, saw '\xc5\x80'",
              refusal("\nt = 1\xc5\x80"));
    EXPECT_EQ(
        "bad.toml:2: Error while parsing root table: expected keys, tables, whitespace or comments, saw '\xc3\xa9'",
        refusal("\n\xc3\xa9t\xc3\xa9 = 1"));
}

TEST(Scenario, RefusedOneLeavesNoAdaptersAndTheLibraryDown)
{
    ASSERT_EQ(0, nvrsim_load_text("[[adapter]]", "good"));
    EXPECT_EQ(0, nvrsim_RM_InitLib());
    refusal("nonsense = ");
    EXPECT_EQ(1, nvrsim_RM_InitLib());
    EXPECT_EQ(0u, nvrsim_HBA_GetNumberOfAdapters());
    EXPECT_EQ(0u, nvrsim_RM_GetNumberOfLocalAdapters());
    EXPECT_EQ(-1, nvrsim_load("/no/such/file.toml"));
    EXPECT_EQ("/no/such/file.toml:0: cannot read the file", sim_text(nvrsim_error));
    EXPECT_EQ(-1, nvrsim_load("/tmp")) << "a directory";
}

/// Each in a process of its own, since the environment is read at the first call.
TEST(ScenarioOfTheEnvironment, BadOneIsToldOnStandardErrorAndTheLibraryIsDown)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            setenv("NVRSIM_SCENARIO", "/no/such/host.toml", 1);
            exit(nvrsim_RM_InitLib() == 1 && nvrsim_HBA_GetNumberOfAdapters() == 0 &&
                         sim_text(nvrsim_error) == "/no/such/host.toml:0: cannot read the file"
                     ? 0
                     : 9);
        },
        testing::ExitedWithCode(0), "nvrsim: /no/such/host.toml:0: cannot read the file");
}

TEST(ScenarioOfTheEnvironment, IsReadAtTheFirstCall)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            setenv("NVRSIM_SCENARIO", NVRSIM_SCENARIOS "/typical.toml", 1);
            exit(static_cast<int>(nvrsim_HBA_GetNumberOfAdapters()));
        },
        testing::ExitedWithCode(4), "");
}

TEST(ScenarioOfTheEnvironment, WithoutOneTheHostHasNoAdapters)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            unsetenv("NVRSIM_SCENARIO");
            exit(nvrsim_RM_InitLib() == 0 && nvrsim_HBA_GetNumberOfAdapters() == 0 ? 0 : 9);
        },
        testing::ExitedWithCode(0), "");
}

TEST(Scenario, EmptyOneIsAHostWithoutAdapters)
{
    ASSERT_EQ(0, nvrsim_load_text("", "empty"));
    EXPECT_EQ(0, nvrsim_RM_InitLib());
    EXPECT_EQ(0u, nvrsim_HBA_GetNumberOfAdapters());
}

TEST(Scenario, TextCutAtAnyByteIsReadOrRefusedButNeverCrashes)
{
    const std::string whole =
        "[[adapter]]\nname = \"a\"\n[[adapter.port]]\nwwpn = \"10000000C9A00009\"\nattributes = { 551 = 1, 528 = 'x' "
        "}\n"
        "vpd = { product = 'p', entries = [['PN', '1']] }\n[[adapter.port.flash]]\nname = 'f'\n[[target]]\nseen_by = "
        "[0]\n"
        "[[target.lun]]\nnumber = 3\ninquiry = '0011'\n[[fault]]\ncall = 'RM_GetVPD'\nstatus = 1\n";
    ASSERT_EQ(0, nvrsim_load_text(whole.c_str(), "whole")) << sim_text(nvrsim_error);
    for (size_t cut = 0; cut < whole.size(); ++cut) {
        const int result = nvrsim_load_text(whole.substr(0, cut).c_str(), "cut");
        const std::string error = sim_text(nvrsim_error);
        EXPECT_EQ(result == 0 ? "" : "cut:", error.substr(0, 4)) << error;
    }
}

TEST(Scenario, DefaultsStandBehindEveryTableOfTheirKind)
{
    ASSERT_EQ(0, nvrsim_load_text(
                     "[defaults.adapter]\nmodel = 'M'\n[defaults.port]\nspeed = 8\n[defaults.lun]\nvendor = 'V'\n"
                     "[[adapter]]\n[[adapter]]\nmodel = 'own'\n[[adapter.port]]\nspeed = 16\n[[target]]\n",
                     "defaults"))
        << sim_text(nvrsim_error);
    EXPECT_EQ("8", sim_value("0", "speed"));
    EXPECT_EQ("16", sim_value("1", "speed"));
    const std::string state = sim_text(nvrsim_state);
    EXPECT_NE(std::string::npos, state.find("\"model\": \"M\""));
    EXPECT_NE(std::string::npos, state.find("\"model\": \"own\""));
}

TEST(Scenario, SmallHasOnePortAndTwoTargets)
{
    ASSERT_EQ(0, nvrsim_load(NVRSIM_SCENARIOS "/small.toml")) << sim_text(nvrsim_error);
    EXPECT_EQ(1u, nvrsim_RM_GetNumberOfLocalAdapters());
    EXPECT_EQ("2", sim_value("0", "targets"));
    EXPECT_EQ("4", sim_value("0", "paths"));
}

TEST(Scenario, TypicalHasFourAdapterNamesEightTargetsAndSixtyFourPaths)
{
    ASSERT_EQ(0, nvrsim_load(NVRSIM_SCENARIOS "/typical.toml")) << sim_text(nvrsim_error);
    EXPECT_EQ(4u, nvrsim_HBA_GetNumberOfAdapters());
    int targets = 0, paths = 0;
    std::set<uint64_t> nodes;
    for (uint32_t i = 0; i < 4; ++i) {
        char name[256];
        HBA_ADAPTERATTRIBUTES attributes;
        ASSERT_EQ(0u, nvrsim_HBA_GetAdapterName(i, name));
        ASSERT_EQ(0u, nvrsim_HBA_GetAdapterAttributes(nvrsim_HBA_OpenAdapter(name), &attributes));
        EXPECT_EQ(1u, attributes.NumberOfPorts);
        nodes.insert(number(attributes.NodeWWN));
        targets += std::stoi(sim_value(std::to_string(i).c_str(), "targets"));
        paths += std::stoi(sim_value(std::to_string(i).c_str(), "paths"));
    }
    EXPECT_EQ(4u, nodes.size()) << "a node name for each";
    EXPECT_EQ(8, targets);
    EXPECT_EQ(64, paths);
}

TEST(Scenario, DualPortHasBothPortsUnderOneName)
{
    ASSERT_EQ(0, nvrsim_load(NVRSIM_SCENARIOS "/dual-port.toml")) << sim_text(nvrsim_error);
    EXPECT_EQ(1u, nvrsim_HBA_GetNumberOfAdapters());
    EXPECT_EQ(2u, nvrsim_RM_GetNumberOfLocalAdapters());
    EXPECT_EQ(sim_value("0", "wwnn"), sim_value("1", "wwnn"));
}

TEST(Scenario, GeneratedHostsOfAHundredThousandPathsLoad)
{
    const uint32_t shapes[][3] = {{10, 100, 100}, {1, 10, 10000}, {1000, 10, 10}};
    for (const auto& shape : shapes) {
        std::string toml(nvrsim_generate(shape[0], shape[1], shape[2], nullptr, 0) + 1, '\0');
        nvrsim_generate(shape[0], shape[1], shape[2], &toml[0], toml.size());
        ASSERT_EQ(0, nvrsim_load_text(toml.c_str(), "generated")) << sim_text(nvrsim_error);
        EXPECT_EQ(std::to_string(shape[1] * shape[2]), sim_value("0", "paths"));
        EXPECT_EQ(shape[0], nvrsim_RM_GetNumberOfLocalAdapters());
    }
}

TEST(Scenario, TwinsArePossibleWhenAskedFor)
{
    ASSERT_EQ(0, nvrsim_load_text("allow_twins = true\n[[adapter]]\n[[adapter.port]]\nwwpn = '1000000000000001'\n"
                                  "[[adapter]]\n[[adapter.port]]\nwwpn = '1000000000000001'\n",
                                  "twins"))
        << sim_text(nvrsim_error);
    EXPECT_EQ("1000000000000001", sim_value("1", "wwpn"));
}
