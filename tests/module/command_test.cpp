// The command from end to end: its own process loads the module over a scenario, asks it, and shows what comes back.
#include <string>

#include <gmock/gmock.h>

#include "tests/module/support/Command_Line.h"
#include "tests/module/support/Rig.h"
#include "tests/support/Cases.h"
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
    // The thread sanitizer sees a small one: the classes and the threads of each manner are the same.
    const char* const host = each_of_cases(1, 2) == 1 ? "typical" : "small";
    for (const host::Manner* manner : every_manner()) {
        const Ended_Command run = nvrcim(std::string("--manner ") + manner->name + " check", host);
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

TEST(Command, DrawsTheGraphAsAPicture)
{
    for (const auto& [ending, start] : {std::pair<std::string, std::string>{".svg", "<?xml"}, {".png", "\x89PNG"}}) {
        const std::string file = testing::TempDir() + "norvane_graph" + ending;
        const Ended_Command run = nvrcim("graph " + file);
        EXPECT_EQ(run.status, 0) << run.output;
        EXPECT_EQ(read_file(file).substr(0, start.size()), start);
        std::remove(file.c_str());
    }
}

TEST(Command, SaysThatGraphvizIsMissing)
{
    const Ended_Command run = nvrcim("graph picture.svg", "small", "PATH=/nowhere");
    EXPECT_EQ(run.status, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(run.output,
              "nvrcim: Graphviz is not there: its program dot is not in PATH. Install the package graphviz, or "
              "name a file that ends in .dot for the plain graph\n");
}

TEST(Command, ShowsTheRouteOfEachUnitInOneRow)
{
    const Ended_Command run = nvrcim("paths");
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output,
              "DEVICE    BUS:TARGET:LUN  LOCAL WWPN        LOCAL WWNN        FABRIC            TARGET WWPN       "
              "LUN IDENTIFIER                    VENDOR   PRODUCT       SIZE\n"
              "/dev/sda  0:0:0           10000000C9A00001  20000000C9A00001  1000000533A00001  50060E8005A10000  "
              "600C9A0F05A1FF000000000000000000  NORVANE  VIRTUAL-DISK  8 GiB\n"
              "/dev/sdb  0:0:1           10000000C9A00001  20000000C9A00001  1000000533A00001  50060E8005A10000  "
              "600C9A0F05A1FF000000000000000001  NORVANE  VIRTUAL-DISK  16 GiB\n"
              "/dev/sdc  0:0:2           10000000C9A00001  20000000C9A00001  1000000533A00001  50060E8005A10000  "
              "600C9A0F05A1FF000000000000000002  NORVANE  VIRTUAL-DISK  24 GiB\n"
              "/dev/st3  0:1:0           10000000C9A00001  20000000C9A00001  1000000533A00001  50060E8005A10001  "
              "600C9A0F05A1FF010000000000000000  NORVANE  VIRTUAL-TAPE\n");
}

TEST(Command, HasSizesInBytesAndMissingOnesEmptyInCsv)
{
    const std::string rows = nvrcim("paths --csv").output;
    EXPECT_THAT(rows, testing::StartsWith("device,address,localWWPN,localWWNN,fabric,targetWWPN,identifier,vendor,"
                                          "product,size\r\n/dev/sda,0:0:0,10000000C9A00001,20000000C9A00001,"));
    EXPECT_THAT(rows, HasSubstr(",VIRTUAL-DISK,8589934080\r\n"));
    EXPECT_THAT(rows, testing::EndsWith(",VIRTUAL-TAPE,\r\n"));
    EXPECT_THAT(nvrcim("paths --json").output, HasSubstr("\"product\": \"VIRTUAL-TAPE\",\n      \"size\": null\n"));
}

TEST(Command, ShowsAPortLikeAnFcHost)
{
    const std::string port = nvrcim("ports").output;
    EXPECT_THAT(port, testing::StartsWith("Device                host0\n"
                                          "Node name             20000000C9A00001\n"
                                          "Port name             10000000C9A00001\n"
                                          "Port ID               0x010100\n"));
    EXPECT_THAT(port, HasSubstr("\nState                 OK\n"
                                "Speed                 16 Gbit/s\n"
                                "Supported speeds      up to 16 Gbit/s\n"));
    EXPECT_THAT(port, HasSubstr("\nFirmware              2.01a4\nDriver                nvrfc v8.3.7.18\n"));
    EXPECT_THAT(port, testing::EndsWith("\nCRC errors            9\n"));
}

TEST(Command, AsksForEachClassOnceWhateverTheNumberOfRoutes)
{
    const auto requests = [](const std::string& scenario) {
        const std::string log = nvrcim("--server-log - paths", scenario).output;
        std::size_t count = 0;
        for (std::size_t at = log.find(" enumerateInstances "); at != std::string::npos;
             at = log.find(" enumerateInstances ", at + 1))
            count++;
        return count;
    };
    EXPECT_EQ(requests("small"), 17u); // two of them are the module's own
    EXPECT_EQ(requests("typical"), 17u);
}

TEST(Command, SaysWhichCountersAreNotReported)
{
    const std::string scenario = testing::TempDir() + "norvane_counters.toml";
    write_file(scenario, "[[adapter]]\n[[adapter.port]]\nstatistics = { 1030 = -1, 1037 = -1, 1040 = false }\n");
    const std::string table = nvrcim("ports", scenario).output;
    EXPECT_THAT(table, HasSubstr("\nFrames sent           not reported\n"));
    EXPECT_THAT(table, HasSubstr("\nLosses of sync        5\n"));
    EXPECT_THAT(table, testing::Not(HasSubstr("4294967295")));
    EXPECT_THAT(nvrcim("ports --json", scenario).output, HasSubstr("\"txFrames\": null,\n"));
    remove(scenario);
}

TEST(Command, PrintsRowsAsCsvWhereverThereAreRows)
{
    EXPECT_EQ(nvrcim("enum NVRHBA_FCPort --csv -p DeviceID,Speed,SupportedFC4Types").output,
              "DeviceID,Speed,SupportedFC4Types\r\n10000000C9A00001,16000000000,\"{8, 32}\"\r\n");
    EXPECT_THAT(nvrcim("--csv names NVRHBA_Product").output,
                testing::StartsWith("path\r\n\"root/norvane:NVRHBA_Product.Name=\"\"FC2162\"\","));
    EXPECT_EQ(nvrcim("--csv classes FCPortStat").output,
              "class,superclass,kinds,namespaces\r\n"
              "NVRHBA_FCPortStatistics,CIM_FCPortStatistics,instance method,root/norvane\r\n");
    EXPECT_THAT(nvrcim("--csv check").output, HasSubstr("\r\nNVRHBA_ControlledBy,1,2,0,0,0\r\n"));
    EXPECT_THAT(nvrcim("--csv diag list").output, testing::StartsWith("test,loops,ports,options,description\r\n"));
    EXPECT_EQ(nvrcim("--csv diag results").output, "test,outcome,passed,failed,seconds,adapter,result\r\n");
    EXPECT_THAT(nvrcim("--csv driverlog").output, testing::StartsWith("line\r\n"));
    EXPECT_EQ(nvrcim(std::string("--csv set ") + minutes + " current=10").output, "current\r\n10\r\n");
    EXPECT_THAT(nvrcim(std::string("--csv call 'NVRHBA_RecordLog.InstanceID=\"NVRHBA:ProviderLog:") + rig_host_name +
                       "\"' ClearLog")
                    .output,
                "returnValue\r\n0\r\n");
    EXPECT_THAT(
        nvrcim("--csv wwn read").output,
        testing::StartsWith("port,returnValue,meaning,WWPN,WWNN,WWNOperationStatus\r\n10000000C9A00001,0,done,"));
    EXPECT_EQ(nvrcim("--csv port beacon on --yes").output, "port\r\n10000000C9A00001\r\n");
    EXPECT_THAT(
        nvrcim("--csv param list").output,
        testing::StartsWith("parameter,current,default,low,high,changes,help\r\nlog-verbose,0,0,0,4294967295,"));
    EXPECT_EQ(nvrcim("--csv log show").output, "time,level,record\r\n");
    EXPECT_EQ(nvrcim("--csv log enable").output, "returnValue\r\n0\r\n");
    EXPECT_THAT(nvrcim("--csv diag run status").output,
                testing::StartsWith("test,port,returnValue,meaning,outcome,result,job\r\nstatus,10000000C9A00001,0,"));
    EXPECT_THAT(nvrcim("--csv diag clear status").output, "log,returnValue,meaning\r\nstatus,0,cleared\r\n");
    EXPECT_THAT(nvrcim("--csv tree").output, testing::StartsWith("host,adapter,port,target,lun,unit,device\r\n"));
    EXPECT_THAT(nvrcim("--csv tree").output, HasSubstr(",20000000C9A00001,10000000C9A00001,50060E8005A10000,0,"));
    EXPECT_EQ(nvrcim("--csv graph none.svg").status, 64);
    EXPECT_EQ(nvrcim("--csv serve").status, 64);
    EXPECT_EQ(nvrcim("paths --csv --json").status, 64);
}

TEST(Command, CompletesVerbsOptionsAndClasses)
{
    const std::string script = testing::TempDir() + "norvane_completion";
    ASSERT_EQ(nvrcim("completion > " + script).output, "");
    const auto completed = [&](const std::string& words) {
        const std::string command = "bash -c '. " + script + "; COMP_WORDS=(" NVR_NVRCIM " " + words +
                                    "); COMP_CWORD=$((${#COMP_WORDS[@]} - 1)); _nvrcim; echo \"${COMPREPLY[*]}\"'";
        FILE* shell = popen(command.c_str(), "r");
        char buffer[4096];
        const std::size_t size = fread(buffer, 1, sizeof buffer, shell);
        pclose(shell);
        return std::string(buffer, size);
    };
    EXPECT_EQ(completed("po"), "ports port\n");
    EXPECT_EQ(completed("port be"), "beacon\n");
    EXPECT_EQ(completed("--json --manner s"), "strict sfcb sfcb-1.3.7\n");
    EXPECT_EQ(completed("--manner sfcb wwn read --ty"), "--type\n");
    EXPECT_EQ(completed("enum NVRHBA_FCPortStat"), "NVRHBA_FCPortStatistics\n");
    std::remove(script.c_str());
}
