#include "tests/module/support/Records.h"

#include <stdexcept>

#include "tests/module/support/Service.h"
#include "tests/support/private_host.h"

namespace nvrtest {

namespace {

constexpr char system_log[] = "/var/log/messages";
constexpr char test_name[] = "NVR:FCHBA Internal Loopback Test";

/// The instance of a class whose InstanceID this is.
host::Path known(const std::string& class_name, const std::string& id)
{
    host::Path path;
    path.name_space = "root/norvane";
    path.class_name = class_name;
    path.set("InstanceID", host::Value::string(id));
    return path;
}

void call(Rig& rig, const host::Path& path, const std::string& method, const Arguments& arguments = {})
{
    const host::Answer answer = rig.server().call(path, method, arguments);
    if (!answer.ok() || answer.value.to_text() != "0")
        throw std::runtime_error(method + " is refused: " + answer.status.message + ' ' + answer.value.to_text());
}

} // namespace

void leave_records(Rig& rig)
{
    host::Instance setting;
    setting.path = known("NVRHBA_FCHBADiagnosticSettingData", test_name);
    setting.set("InstanceID", host::Value::string(test_name));
    setting.set("HaltOnError", host::Value::boolean(true));
    const Service test(rig, "NVRHBA_FCHBADiagnosticTest", test_name);
    call(rig, test.path(), "RunDiagnosticService",
         {{"ManagedElement", host::Value::reference(rig.names("NVRHBA_PortController").paths.at(0))},
          {"DiagnosticSettings", host::Value::instance(setting)}});

    write_file(system_log, "Nov 21 kernel: tsfc one\nNov 21 kernel: tsfc two\n");
    call(rig, known("NVRHBA_RecordLog", "NVR: FC Driver Record Log:" + std::string(rig_host_name)),
         "RequestStateChange", {{"RequestedState", host::Value::uint16(2)}});
    remove(system_log);
}

void clear_test_log(Rig& rig)
{
    call(rig, known("NVRHBA_DiagnosticsLog", test_name), "ClearLog");
}

} // namespace nvrtest
