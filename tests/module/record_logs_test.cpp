// The record logs through a server: what is set is traced, stored and shown, and the driver's lines come out.
#include <string>

#include <gmock/gmock.h>

#include "tests/module/support/Entries.h"
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

// The logger is one: who steers it by a log that is not there steers it all the same, and no log shows it.
TEST_P(RecordLogs, ALogThatIsNotThereIsSteeredButNotShown)
{
    Rig rig({*GetParam()});
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    const host::Path unknown = log_path("no such log");
    EXPECT_THAT(rig.server().get(unknown), failed_with(CMPI_RC_ERR_NOT_FOUND));
    const auto shown = [&](const char* property) {
        return rig.server().get(provider_log()).instances.at(0).get(property).to_text();
    };
    const std::string mode = shown("LogMode"), path = shown("TracePath"), state = shown("EnabledState");
    EXPECT_EQ(set_params(rig, unknown, 3, 1, "").value.as_uint(), 32968u);
    EXPECT_EQ(set_params(rig, unknown, 5, 4, other_trace).value.as_uint(), 0u);
    EXPECT_EQ(read_file(dmp_path), std::string("4,5,1\n") + other_trace);
    EXPECT_EQ(request(rig, unknown, 77).value.as_uint(), 32968u);
    EXPECT_EQ(request(rig, unknown, 3).value.as_uint(), 0u);
    EXPECT_EQ(read_file(dmp_path), std::string("4,5,0\n") + other_trace);
    EXPECT_EQ(request(rig, unknown, 2).value.as_uint(), 0u);
    EXPECT_EQ(rig.server().call(unknown, "ClearLog").value.as_uint(), 0u);
    EXPECT_EQ(shown("LogMode"), mode);
    EXPECT_EQ(shown("TracePath"), path);
    EXPECT_EQ(shown("EnabledState"), state);
    EXPECT_THAT(rig.enumerate("NVRHBA_RecordLog").instances, SizeIs(2));
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
    rig.stop();
    remove(other_trace);
}

// A server routes by class. What is handed to this provider all the same is no log of its, whatever its methods.
TEST_P(RecordLogs, AnInstanceOfAnotherClassIsNoLog)
{
    Rig rig({*GetParam()});
    const host::Path other = rig.names("NVRHBA_DiagnosticsLog").paths.at(0);
    const std::string id = other.find("InstanceID")->as_text();
    Entries entries;
    rig.settle();
    rig.forget_words();
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        CMPIMethodMI* mi = entries.methods("NVRHBA_RecordLog", broker, context);
        ASSERT_TRUE(mi);
        CMPIStatus status = {CMPI_RC_OK, nullptr};
        CMPIObjectPath* path = broker->eft->newObjectPath(broker, "root/norvane", other.class_name.c_str(), &status);
        ASSERT_TRUE(path);
        path->ft->addKey(path, "InstanceID", reinterpret_cast<const CMPIValue*>(id.c_str()), CMPI_chars);
        CMPIArgs* in = broker->eft->newArgs(broker, &status);
        CMPIArgs* out = broker->eft->newArgs(broker, &status);
        CMPIValue disabled;
        disabled.uint16 = 3;
        in->ft->addArg(in, "RequestedState", &disabled, CMPI_uint16);
        const auto call = [&](const char* method) {
            return mi->ft->invokeMethod(mi, context, nullptr, path, method, in, out).rc;
        };
        EXPECT_EQ(call("SetLogParams"), CMPI_RC_ERR_METHOD_NOT_FOUND) << "which is of record logs alone";
        EXPECT_EQ(call("RequestStateChange"), CMPI_RC_OK);
        EXPECT_EQ(call("ClearLog"), CMPI_RC_OK);
        in->ft->release(in);
        out->ft->release(out);
        path->ft->release(path);
        mi->ft->cleanup(mi, context, 1);
    });
    EXPECT_EQ(rig.count_words("Invalid instance of Record Log"), 2u);
    const std::vector<std::string> words = rig.words();
    EXPECT_THAT(words, testing::Not(testing::AnyOf(Contains("Cleared all the logs"), Contains("Logs disabled"))));
}
