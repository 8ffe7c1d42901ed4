#include "host/command/DriverParams.h"

#include "host/command/Options.h"
#include "host/command/Table.h"
#include "host/command/Verbs.h"
#include "host/command/Views.h"

#include <nlohmann/json.hpp>

namespace host {

int list_driver_params(const Action_Run& run)
{
    const bool global = run.options.given.count("--global") > 0;
    const Answer answer =
        run.server.enumerate(run.options.name_space, global ? "NVRHBA_DriverParamGlobal" : "NVRHBA_DriverParams", {});
    if (!answer.ok()) return tell_failure(answer.status, run.options, run.out, run.complaints);
    const Value* name = run.port.find("DeviceID");
    const std::string start = global || !name ? "" : name->as_text() + ":";

    Table table({"PARAMETER", "CURRENT", global ? "GLOBAL" : "DEFAULT", "LOW", "HIGH", "CHANGES", "HELP"});
    nlohmann::ordered_json json = nlohmann::ordered_json::array();
    for (const Instance& param : answer.instances) {
        if (param.get("InstanceID").as_text().rfind(start, 0) != 0) continue;
        table.add({param.get("paramname").as_text(), param.get("current").to_text(),
                   param.get(global ? "glbl" : "def").to_text(), param.get("lowRange").to_text(),
                   param.get("highRange").to_text(), param.get("dynamic").as_uint() ? "at once" : "at its next start",
                   param.get("help").as_text()});
        json.push_back(to_json(param));
    }
    if (run.options.json)
        run.out << json_text({{"status", 0}, {"port", name ? name->as_text() : ""}, {"instances", json}});
    else if (table.empty())
        run.out << "the driver has no parameters\n";
    else
        run.out << table.to_text(page_width);
    return 0;
}

} // namespace host
