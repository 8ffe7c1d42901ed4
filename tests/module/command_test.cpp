// The command from end to end: its own process loads the module over a scenario, asks it, and shows what comes back.
#include <cstdio>
#include <stdexcept>
#include <string>
#include <sys/wait.h>

#include <gmock/gmock.h>

#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"

using namespace nvrtest;
using testing::HasSubstr;

namespace {

struct Ended_Command {
    std::string output; // both streams
    int status = -1;    // of the exit; -1 after a signal
};

Ended_Command nvrcim(const std::string& arguments, const std::string& scenario = "small")
{
    const std::string command = std::string("'") + NVR_NVRCIM + "' --module '" + NVR_MODULE + "' --scenario '" +
                                NVR_SCENARIO_DIR + "/" + scenario + ".toml' " + arguments + " 2>&1";
    FILE* child = popen(command.c_str(), "r");
    if (!child) throw std::runtime_error("cannot start a shell");
    Ended_Command run;
    char buffer[4096];
    while (const std::size_t size = std::fread(buffer, 1, sizeof buffer, child))
        run.output.append(buffer, size);
    const int status = pclose(child);
    if (WIFEXITED(status)) run.status = WEXITSTATUS(status);
    return run;
}

constexpr char minutes[] =
    "'root/norvane:NVRHBA_ProviderConfigSetting.InstanceID=\"Norvane HBA Provider:cachetimeout\"'";

} // namespace

TEST(Command, ShowsTheOnePortOfASmallHost)
{
    const Ended_Command run = nvrcim("enum NVRHBA_FCPort");
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(
        run.output,
        "PORT WWN          PORT  TYPE  SPEED      STATUS  FCID      FABRIC            TARGETS  ADAPTER\n"
        "10000000C9A00001     0  N     16 Gbit/s  OK      0x010100  1000000533A00001        2  Norvane-FC2162-0\n");
}

TEST(Command, ShowsTheFourPortsOfATypicalHostInEveryManner)
{
    for (const host::Manner* manner : every_manner()) {
        const Ended_Command run = nvrcim(std::string("--manner ") + manner->name + " enum NVRHBA_FCPort", "typical");
        EXPECT_EQ(run.status, 0) << manner->name;
        EXPECT_EQ(
            run.output,
            "PORT WWN          PORT  TYPE  SPEED      STATUS  FCID      FABRIC            TARGETS  ADAPTER\n"
            "10000000C9A00001     0  N     16 Gbit/s  OK      0x010100  1000000533A00001        2  Norvane-FC2162-0\n"
            "10000000C9A00002     1  N     16 Gbit/s  OK      0x020100  1000000533A10001        2  Norvane-FC2162-1\n"
            "10000000C9A00003     0  N     16 Gbit/s  OK      0x010101  1000000533A00001        2  Norvane-FC2162-2\n"
            "10000000C9A00004     1  N     16 Gbit/s  OK      0x020101  1000000533A10001        2  Norvane-FC2162-3\n")
            << manner->name;
    }
}

TEST(Command, NamesArePathsThatGetTakes)
{
    const Ended_Command names = nvrcim("names NVRHBA_ProviderConfigSetting");
    EXPECT_EQ(names.status, 0);
    EXPECT_EQ(names.output,
              "root/norvane:NVRHBA_ProviderConfigSetting.InstanceID=\"Norvane HBA Provider:cachetimeout\"\n"
              "root/norvane:NVRHBA_ProviderConfigSetting.InstanceID=\"Norvane HBA Provider:adapterrefresh\"\n"
              "root/norvane:NVRHBA_ProviderConfigSetting.InstanceID=\"Norvane HBA Provider:sanrefresh\"\n");
    const Ended_Command got = nvrcim(std::string("get ") + minutes);
    EXPECT_EQ(got.status, 0) << got.output;
    EXPECT_THAT(got.output, HasSubstr("cachetimeout"));
}

TEST(Command, WhatItSetsIsThereInTheNextProcess)
{
    const Ended_Command set = nvrcim(std::string("set ") + minutes + " current=3");
    EXPECT_EQ(set.status, 0) << set.output;
    EXPECT_THAT(read_file(conf_path), HasSubstr("NVR_PROVIDER_CACHE_TIMEOUT = 3\n"));
    EXPECT_THAT(nvrcim(std::string("get ") + minutes + " --json").output, HasSubstr("\"current\": 3"));
}

TEST(Command, TellsByItsExitStatusWhyTheModuleRefuses)
{
    EXPECT_EQ(nvrcim(std::string("set ") + minutes + " current=31").status, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(
        nvrcim("call 'root/norvane:NVRHBA_FCPortStatistics.InstanceID=\"NVR FC HBA:HBA Statistics:10000000C9A00001\"' "
               "ResetSelectedStats")
            .status,
        CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(nvrcim("get 'root/norvane:NVRHBA_Product.Name=\"x\",IdentifyingNumber=\"x\",Vendor=\"x\",Version=\"x\"'")
                  .status,
              CMPI_RC_ERR_NOT_FOUND);
    EXPECT_EQ(nvrcim("enum NVRHBA_Nonsense").status, CMPI_RC_ERR_INVALID_CLASS);
}
