#include "host/command/Actions.h"

#include "host/command/DriverParams.h"

namespace host {
namespace {

constexpr char boot_service[] = "NVRHBA_BootBIOSService";
constexpr char dump_service[] = "NVRHBA_DumpService";
constexpr char firmware_service[] = "NVRHBA_SoftwareInstallationService";
constexpr char firmware_service_name[] = "NVRHBA_FCSoftwareInstallationService";
constexpr char names_service[] = "NVRHBA_FCHBAWWNService";
constexpr char params_service[] = "NVRHBA_FCHBADriverParamService";
constexpr char tag_service[] = "NVRHBA_FCTagService";

/// Codes that tell when written names become active; `first` is what 1 means.
Meanings activation(const std::string& first)
{
    return {{1, first},
            {2, "the name is the WWNN of a virtual port"},
            {3, "the name is the WWPN of a virtual port's target"},
            {4, "the name is the WWNN of a virtual port's target"},
            {5, "volatile names are written, a restart of the host activates them"},
            {6, "non-volatile names are written, a restart of the host activates them"},
            {7, "volatile names are written, a reset of the adapter activates them"},
            {8, "non-volatile names are written, a reset of the adapter activates them"},
            {65535, "the library did not tell"}};
}

const Meanings reading = {{0, "read"},
                          {1, "volatile names are active"},
                          {3, "volatile"},
                          {4, "non-volatile"},
                          {5, "volatile, a restart of the host activates them"},
                          {6, "non-volatile, a restart of the host activates them"},
                          {7, "volatile, a restart of the adapter activates them"},
                          {8, "non-volatile, a restart of the adapter activates them"},
                          {9, "there are none"},
                          {65535, "nothing was read"}};

Input global_flag(const std::string& help)
{
    return {Input::flag, "--global", "bGlobal", help, {{"yes", "true"}, {"no", "false"}}};
}

std::vector<Action> make_actions()
{
    std::vector<Action> all;
    const auto add = [&all](Action action) { all.push_back(std::move(action)); };
    Action action;

    action = {"port", "beacon", "Switch the beacon of a port, so that it can be found in the rack", ""};
    action.inputs = {{Input::choice, "state", "LocationIndicator", "on or off", {{"on", "2"}, {"off", "3"}}}};
    action.question = "Switch the beacon of port";
    add(action);

    action = {"port", "reset", "Reset the adapter of a port", firmware_service, firmware_service_name, "ResetHBA"};
    action.question = "All traffic of the adapter stops while it starts again. Reset the adapter of port";
    action.doing = "resetting the adapter";
    add(action);

    action = {"port", "enable", "Enable a port", firmware_service, firmware_service_name, "SetPortEnabled"};
    action.fixed = {{"PortEnabled", "true"}};
    action.question = "Enable port";
    add(action);

    action = {"port", "disable", "Disable a port", firmware_service, firmware_service_name, "SetPortEnabled"};
    action.fixed = {{"PortEnabled", "false"}};
    action.question = "All traffic of the port stops. Disable port";
    add(action);

    action = {"wwn", "read", "Show the World Wide Names of a port", names_service, "", "ReadWWN"};
    action.inputs = {
        {Input::choice,
         "--type",
         "Type",
         "Which names",
         {{"volatile", "0"}, {"non-volatile", "1"}, {"factory", "2"}, {"current", "3"}, {"configured", "4"}},
         "current"}};
    action.out_meanings = {{"WWNOperationStatus", reading}};
    add(action);

    action = {"wwn", "change", "Give a port new World Wide Names", names_service, "", "ChangeWWN"};
    action.inputs = {{Input::name, "wwpn", "NewWWPN", "The new port name, sixteen hexadecimal digits"},
                     {Input::name, "wwnn", "NewWWNN", "The new node name"},
                     {Input::choice,
                      "--type",
                      "Type",
                      "How long the names last",
                      {{"volatile", "0"}, {"non-volatile", "1"}},
                      "non-volatile"}};
    action.question = "The fabric and the storage know a port by its names. Change the names of port";
    action.doing = "writing the names";
    action.out_meanings = {{"WWNOperationStatus", activation("the name is the WWPN of a virtual port")}};
    add(action);

    action = {"wwn", "restore", "Give a port back the names that it had", names_service, "", "RestoreWWN"};
    action.inputs = {
        {Input::choice, "--type", "Type", "Which names", {{"factory", "0"}, {"non-volatile", "1"}}, "factory"}};
    action.question = "The fabric and the storage know a port by its names. Restore the names of port";
    action.doing = "restoring the names";
    action.out_meanings = {{"WWNOperationStatus", activation("the names are active already")}};
    add(action);

    action = {"wwn", "capability", "Show which names of a port can be changed", names_service, "", "GetWWNCapability"};
    action.out_bits = {{"WWNCapability",
                        {{0x8000, "read-only"},
                         {0x0004, "non-volatile names can be changed"},
                         {0x0008, "volatile names can be changed"},
                         {0x1000, "a restart of the host activates them"},
                         {0x2000, "a reset of the adapter activates them"}}}};
    add(action);

    action = {"firmware",
              "install",
              "Write a firmware image to the adapter of a port",
              firmware_service,
              firmware_service_name,
              "InstallFromURI"};
    action.inputs = {{Input::text, "image", "URI", "The image: the path of a file, or an address to fetch it from"},
                     {Input::flag,
                      "--reset",
                      "InstallOptions",
                      "Reset the adapter when the image is written, which makes it active",
                      {{"reset", "[2]"}, {"none", "NULL"}}}};
    action.question = "An adapter that loses power while it is written to may not start again. Write firmware to the "
                      "adapter of port";
    action.doing = "writing the firmware";
    action.meanings = {{5, "the image is no file that can be read"},
                       {4107, "the image is not there, or could not be fetched"}};
    add(action);

    action = {"bootbios", "status", "Show whether the boot code is enabled", boot_service, "", "GetBootBIOSStatus"};
    action.out_meanings = {{"nBootBIOSStatus", {{0, "disabled"}, {1, "enabled"}}}};
    add(action);

    action = {"bootbios", "enable", "Enable the boot code", boot_service, "", "EnableBootBIOS"};
    action.question = "Enable the boot code of port";
    add(action);

    action = {"bootbios", "disable", "Disable the boot code", boot_service, "", "DisableBootBIOS"};
    action.question = "Disable the boot code of port";
    add(action);

    action = {"dump", "generate", "Write a dump of an adapter for its maker", dump_service, "", "GenerateDump"};
    action.question = "The oldest dump goes where more are kept than shall be. Write a dump of port";
    action.doing = "writing the dump";
    add(action);

    action = {"dump", "list", "Show the names of the dumps", dump_service, "", "GetDumpFileNames"};
    add(action);

    action = {"dump", "delete", "Delete the dumps", dump_service, "", "DeleteDump"};
    action.question = "Delete all dumps of port";
    add(action);

    action = {"param", "list", "Show the driver's parameters", params_service};
    action.inputs = {global_flag("Those of all ports")};
    action.own = list_driver_params;
    add(action);

    action = {"param", "set", "Set a parameter of the driver", params_service, "", "SetDriverParameter"};
    action.inputs = {{Input::text, "name", "strParam", "The parameter's name"},
                     {Input::text, "value", "strValue", "Its new value"},
                     global_flag("For all ports"),
                     {Input::flag,
                      "--permanent",
                      "bPermanent",
                      "Also for the driver's next starts",
                      {{"yes", "true"}, {"no", "false"}}}};
    action.question = "Set a parameter of the driver for port";
    action.meanings = {{40001, "the port is not local, or name and value are too long, or the library does not have "
                               "the call"},
                       {40004, "there is no such parameter, or the value is outside its limits"}};
    add(action);

    action = {"tag", "get", "Show whether frames are tagged", tag_service, "", "GetGlobalFlag"};
    action.out_meanings = {{"State", {{0, "off"}, {1, "on"}}}};
    add(action);

    action = {"tag", "set", "Switch the tagging of frames", tag_service, "", "SetGlobalFlag"};
    action.inputs = {{Input::choice, "state", "State", "on or off", {{"on", "1"}, {"off", "0"}}}};
    action.question = "Switch the tagging of frames of the adapter of port";
    add(action);

    action = {"tag",       "save", "Write the tag table to a file in the port's dump directory",
              tag_service, "",     "GetConfigTable"};
    action.inputs = {{Input::text, "name", "URI", "The file's bare name"}};
    action.meanings = {{0, "done, unless the log tells otherwise"},
                       {32968, "the adapter cannot be opened, or the file's path is too long"}};
    add(action);

    action = {"tag", "load", "Load the tag table from a file", tag_service, "", "SetConfigTable"};
    action.inputs = {{Input::text, "file", "URI", "A file of this host, or where to fetch it from"}};
    action.question = "Replace the tag table of the adapter of port";
    action.doing = "loading the table";
    action.meanings = {{1, "the adapter refused the table"},
                       {32968, "the adapter or the file cannot be opened, or the file is no whole tag table"},
                       {32774, "memory ran out, or the file has more entries than an adapter can have"}};
    add(action);
    return all;
}

} // namespace

const std::vector<Action>& actions()
{
    static const std::vector<Action> all = make_actions();
    return all;
}

const std::vector<std::pair<std::string, std::string>>& action_groups()
{
    static const std::vector<std::pair<std::string, std::string>> groups = {
        {"port", "Find a port by its beacon, reset its adapter, enable or disable it"},
        {"wwn", "Show and change the World Wide Names of a port"},
        {"firmware", "Write firmware to the adapter of a port"},
        {"bootbios", "Show and switch the boot code of an adapter"},
        {"dump", "Write, list and delete dumps of an adapter"},
        {"param", "Show and set the parameters of the driver"},
        {"tag", "Switch the tagging of frames, save and load the tag table"},
    };
    return groups;
}

} // namespace host
