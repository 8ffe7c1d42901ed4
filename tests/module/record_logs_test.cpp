// The record logs through a server: what is set is traced, stored and shown, and the driver's lines come out.
#include <string>

#include <gmock/gmock.h>

#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"
#include "tests/support/trace.h"

using namespace nvrtest;
using testing::Contains;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

namespace {

constexpr char other_trace[] = "/var/log/other.trace";
constexpr char system_log[] = "/var/log/messages";

host::Path log_path(const std::string& id)
{
    host::Path path;
    path.name_space = "root/norvane";
    path.class_name = "NVRHBA_RecordLog";
    path.keys = {{"InstanceID", host::Value::string(id)}};
    return path;
}
host::Path provider_log()
{
    return log_path("NVRHBA:ProviderLog:" + std::string(rig_host_name));
}
host::Path driver_log()
{
    return log_path("NVR: FC Driver Record Log:" + std::string(rig_host_name));
}

host::Answer set_params(Rig& rig, const host::Path& log, unsigned level, unsigned mode, const std::string& path)
{
    return rig.server().call(log, "SetLogParams",
                             {{"LogLevel", host::Value::uint16(static_cast<std::uint16_t>(level))},
                              {"LogMode", host::Value::uint16(static_cast<std::uint16_t>(mode))},
                              {"TracePath", host::Value::string(path)}});
}
host::Answer request(Rig& rig, const host::Path& log, unsigned state)
{
    return rig.server().call(log, "RequestStateChange",
                             {{"RequestedState", host::Value::uint16(static_cast<std::uint16_t>(state))}});
}

class RecordLogs : public Every_Manner {};
NVR_IN_EVERY_MANNER(RecordLogs);

} // namespace

TEST_P(RecordLogs, AreSteeredByTheirMethods)
{
    Rig rig({*GetParam()});
    ASSERT_THAT(rig.enumerate("NVRHBA_RecordLog").instances, SizeIs(2));
    EXPECT_EQ(set_params(rig, provider_log(), 3, 1, "").value.as_uint(), 32968u);
    EXPECT_EQ(set_params(rig, provider_log(), 5, 2, "").value.as_uint(), 32968u);
    EXPECT_EQ(set_params(rig, provider_log(), 5, 9, "").value.as_uint(), 32968u);
    const host::Answer set = set_params(rig, provider_log(), 5, 4, other_trace);
    ASSERT_THAT(set, succeeded());
    EXPECT_EQ(set.value.as_uint(), 0u);
    EXPECT_EQ(read_file(dmp_path), std::string("4,5,1\n") + other_trace);
    const host::Answer shown = rig.server().get(provider_log());
    ASSERT_THAT(shown, succeeded());
    EXPECT_EQ(shown.instances[0].get("TracePath").as_text(), other_trace);
    EXPECT_EQ(shown.instances[0].get("LogMode").as_uint(), 4u);
    EXPECT_THAT(trace_file_words(other_trace), Contains(std::string("Setting path as ") + other_trace));

    EXPECT_EQ(request(rig, provider_log(), 3).value.as_uint(), 0u);
    EXPECT_EQ(read_file(dmp_path), std::string("4,5,0\n") + other_trace);
    EXPECT_EQ(request(rig, provider_log(), 2).value.as_uint(), 0u);
    EXPECT_EQ(request(rig, provider_log(), 4).value.as_uint(), 32968u);
    EXPECT_EQ(rig.server().call(provider_log(), "ClearLog").value.as_uint(), 0u);
    EXPECT_THAT(trace_file_words(other_trace), Contains("Cleared all the logs"));
    EXPECT_THAT(rig.enumerate("NVRHBA_LogEntry").instances, IsEmpty());
    EXPECT_THAT(rig.enumerate("NVRHBA_RecordLogManagesRecord").instances, IsEmpty());
    // The driver's log has no parameters at all.
    EXPECT_THAT(set_params(rig, driver_log(), 5, 1, ""), failed_with(CMPI_RC_ERR_NOT_SUPPORTED));
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
    remove(other_trace);
}

TEST_P(RecordLogs, WhatIsSetLastsBeyondAnUnload)
{
    Rig rig({*GetParam()});
    ASSERT_EQ(set_params(rig, provider_log(), 5, 2, other_trace).value.as_uint(), 0u);
    rig.restart();
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    const host::Answer shown = rig.server().get(provider_log());
    EXPECT_EQ(shown.instances.at(0).get("TracePath").as_text(), other_trace);
    EXPECT_EQ(shown.instances.at(0).get("LogMode").as_uint(), 2u);
    rig.stop();
    remove(other_trace);
}

TEST_P(RecordLogs, TheDriversLinesComeWhenAsked)
{
    write_file(system_log, "Nov 21 kernel: tsfc one\nNov 21 kernel: other\nNov 21 kernel: \001tsfc \377two\n");
    Rig rig({*GetParam()});
    EXPECT_THAT(rig.enumerate("NVRHBA_FCDriverLogEntry").instances, IsEmpty());
    const host::Answer read = request(rig, driver_log(), 2);
    ASSERT_THAT(read, succeeded());
    EXPECT_EQ(read.value.as_uint(), 0u);
    const host::Answer lines = rig.enumerate("NVRHBA_FCDriverLogEntry");
    ASSERT_THAT(lines.instances, SizeIs(2));
    EXPECT_EQ(lines.instances[0].get("RecordData").as_text(), "Nov 21 kernel: ?tsfc ?two");
    EXPECT_EQ(lines.instances[1].get("RecordData").as_text(), "Nov 21 kernel: tsfc one");
    EXPECT_EQ(rig.server().get(driver_log()).instances.at(0).get("CurrentNumberOfRecords").as_uint(), 2u);
    EXPECT_THAT(rig.enumerate("NVRHBA_DriverRecordLogManagesRecord").instances, SizeIs(2));
    EXPECT_THAT(rig.server().associator_names(driver_log(), "NVRHBA_DriverRecordLogManagesRecord").paths, SizeIs(2));
    EXPECT_THAT(rig.server().get(lines.instances[1].path), succeeded());

    EXPECT_EQ(rig.server().call(driver_log(), "ClearLog").value.as_uint(), 0u);
    EXPECT_THAT(rig.enumerate("NVRHBA_FCDriverLogEntry").instances, IsEmpty());
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
    remove(system_log);
}

TEST_P(RecordLogs, MethodsOfAForeignInstanceAreRefused)
{
    Rig rig({*GetParam()});
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    host::Path unknown = log_path("no such log");
    EXPECT_EQ(request(rig, unknown, 77).value.as_uint(), 32968u);
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}
