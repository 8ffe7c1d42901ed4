// The command from end to end: its own process loads the module over a scenario, asks it, and shows what comes back.
#include <string>

#include <gmock/gmock.h>

#include "tests/module/support/Command_Line.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"

using namespace nvrtest;
using testing::HasSubstr;

namespace {

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

TEST(Command, AnswersATraversalWithNothingOfWhatTheModulePrints)
{
    const std::string package = "'NVRHBA_PhysicalPackage.Tag=\"20000000C9A00001\",CreationClassName=\"NVRHBA_Physical"
                                "Package\"'";
    EXPECT_EQ(nvrcim("associators " + package + " --class nvrhba_REALIZES -p DeviceID,ControllerType").output,
              "DeviceID          ControllerType\n10000000C9A00001  FC\n");
    EXPECT_EQ(nvrcim("references " + package + " --class NVRHBA_TransceiverComponent --role groupcomponent").output,
              "GroupComponent                           PartComponent\n"
              "NVRHBA_PhysicalPackage 20000000C9A00001  NVRHBA_Transceiver 10000000C9A00001:NVO0000001\n");
    EXPECT_EQ(nvrcim("references " + package + " --role PartComponent --class NVRHBA_TransceiverComponent").output,
              "no association holds it\n");
}

TEST(Command, ShowsASmallHostAsATree)
{
    const Ended_Command run = nvrcim("tree");
    EXPECT_EQ(run.status, 0);
    // The first line is the host's name, which other tests of this process choose.
    EXPECT_EQ(run.output.substr(run.output.find('\n') + 1),
              "└─ Norvane Corporation FC2162  serial NV216200001  node 20000000C9A00001\n"
              "   └─ port 0  10000000C9A00001  OK  16 Gbit/s  fabric 1000000533A00001  address 0x010100\n"
              "      ├─ target 50060E8005A10000  Unknown  address 0x020000\n"
              "      │  ├─ LUN 0  Storage Volume  Unknown  8 GiB  /dev/sda\n"
              "      │  ├─ LUN 1  Storage Volume  Unknown  16 GiB  /dev/sdb\n"
              "      │  └─ LUN 2  Storage Volume  Unknown  24 GiB  /dev/sdc\n"
              "      └─ target 50060E8005A10001  Unknown  address 0x020001\n"
              "         └─ LUN 0  Tape Drive  Unknown  /dev/st3\n");
}

TEST(Command, FindsNoFaultInTheAssociationsOfATypicalHostInEveryManner)
{
    for (const host::Manner* manner : every_manner()) {
        const Ended_Command run = nvrcim(std::string("--manner ") + manner->name + " check", "typical");
        EXPECT_EQ(run.status, 0) << manner->name << "\n" << run.output;
        EXPECT_THAT(run.output, testing::StartsWith("91 association classes, ")) << manner->name;
        EXPECT_THAT(run.output, testing::EndsWith("; 0 faults\n")) << manner->name;
    }
}

TEST(Command, WritesTheGraphOfASmallHost)
{
    const std::string file = testing::TempDir() + "norvane_graph.dot";
    EXPECT_EQ(nvrcim("graph " + file).output, "");
    const std::string graph = read_file(file);
    std::remove(file.c_str());
    EXPECT_THAT(graph, HasSubstr("<b>target 50060E8005A10000</b>"));
    EXPECT_THAT(graph, HasSubstr("<b>LUN 2</b><font point-size=\"10\" color=\"#5f6b7a\">  Storage Volume  Unknown  24 "
                                 "GiB  /dev/sdc</font>"));
    EXPECT_THAT(graph, HasSubstr("  port2 -> target3 [tailport=e, headport=w, color=\"#0072b2\"]\n"));
}

TEST(Command, SaysThatGraphvizIsMissing)
{
    const Ended_Command run = nvrcim("graph picture.svg", "small", "PATH=/nowhere");
    EXPECT_EQ(run.status, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(run.output,
              "nvrcim: Graphviz is not there: its program dot is not in PATH. Install the package graphviz, or "
              "name a file that ends in .dot for the plain graph\n");
}
