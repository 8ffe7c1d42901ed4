#include "host/command/DriverParams.h"

#include "host/command/Listing.h"
#include "host/command/Options.h"
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

    const Listing::Field other = global ? Listing::Field{"global", "GLOBAL"} : Listing::Field{"default", "DEFAULT"};
    Listing listing({{"parameter", "PARAMETER"},
                     {"current", "CURRENT"},
                     other,
                     {"low", "LOW"},
                     {"high", "HIGH"},
                     {"changes", "CHANGES"},
                     {"help", "HELP"}});
    nlohmann::ordered_json json = nlohmann::ordered_json::array();
    for (const Instance& param : answer.instances) {
        if (param.get("InstanceID").as_text().rfind(start, 0) != 0) continue;
        const auto cell = [&param](const char* property) {
            return Listing::Cell(param.get(property).to_text(), param.get(property));
        };
        listing.add({param.get("paramname").as_text(), cell("current"), cell(global ? "glbl" : "def"), cell("lowRange"),
                     cell("highRange"), std::string(param.get("dynamic").as_uint() ? "at once" : "at its next start"),
                     param.get("help").as_text()});
        json.push_back(to_json(param));
    }
    if (run.options.json)
        run.out << json_text({{"status", 0}, {"port", name ? name->as_text() : ""}, {"instances", json}});
    else if (run.options.csv)
        run.out << listing.csv();
    else if (listing.empty())
        run.out << "the driver has no parameters\n";
    else
        run.out << listing.table(page_width);
    return 0;
}

} // namespace host
