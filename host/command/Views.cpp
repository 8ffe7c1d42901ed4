#include "host/command/Views.h"

#include "host/command/Table.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <cstdio>
#include <set>

namespace host {
namespace {

struct Column {
    const char* property;
    const char* header;
};

struct View {
    const char* class_name;
    std::vector<Column> columns;
};

/// The columns that a person looks for first; all other classes show keys and names.
const std::vector<View>& views()
{
    static const auto& all = *new std::vector<View>{
        {"NVRHBA_FCPort",
         {{"DeviceID", "PORT WWN"},
          {"PortNumber", "PORT"},
          {"PortType", "TYPE"},
          {"Speed", "SPEED"},
          {"OperationalStatus", "STATUS"},
          {"FCID", "FCID"},
          {"FabricName", "FABRIC"},
          {"NumberOfDiscoveredPorts", "TARGETS"},
          {"AdapterName", "ADAPTER"}}},
        {"NVRHBA_FCPortStatistics",
         {{"InstanceID", "PORT"},
          {"BytesTransmitted", "BYTES OUT"},
          {"BytesReceived", "BYTES IN"},
          {"LinkFailures", "LINK FAIL"},
          {"LossOfSignalCounter", "LOSS SIGNAL"},
          {"LossOfSyncCounter", "LOSS SYNC"},
          {"CRCErrors", "CRC"}}},
        {"NVRHBA_ProviderConfigSetting",
         {{"paramname", "SETTING"},
          {"current", "VALUE"},
          {"def", "DEFAULT"},
          {"lowRange", "FROM"},
          {"highRange", "TO"},
          {"Description", "MEANING"}}},
        {"NVRHBA_Product",
         {{"Name", "MODEL"},
          {"Vendor", "VENDOR"},
          {"IdentifyingNumber", "NODE WWN"},
          {"Version", "HARDWARE"},
          {"Description", "DESCRIPTION"}}},
        {"NVRHBA_PhysicalPackage",
         {{"Model", "MODEL"},
          {"SerialNumber", "SERIAL"},
          {"Tag", "NODE WWN"},
          {"Version", "HARDWARE"},
          {"BoardTemperature", "TEMP"},
          {"Manufacturer", "MANUFACTURER"},
          {"Description", "DESCRIPTION"}}},
        {"NVRHBA_PCIDevice",
         {{"DeviceID", "DEVICE"},
          {"BusNumber", "BUS"},
          {"FunctionNumber", "FUNCTION"},
          {"VendorID", "VENDOR"},
          {"SubsystemID", "SUBSYSTEM"},
          {"ElementName", "ADAPTER"}}},
        {"NVRHBA_SoftwareIdentity",
         {{"InstanceID", "ID"},
          {"ElementName", "NAME"},
          {"VersionString", "VERSION"},
          {"Classifications", "KIND"},
          {"Manufacturer", "MANUFACTURER"}}},
        {"NVRHBA_RegisteredProfile",
         {{"RegisteredName", "PROFILE"},
          {"RegisteredVersion", "VERSION"},
          {"RegisteredOrganization", "ORGANIZATION"},
          {"InstanceID", "ID"}}},
    };
    return all;
}

/// Names that repeat on every line and tell nothing.
bool is_noise(const std::string& name)
{
    return same_name(name, "SystemCreationClassName") || same_name(name, "SystemName") ||
           same_name(name, "CreationClassName");
}

std::vector<Column> columns_for(const Class_Record& record)
{
    for (const View& view : views())
        if (record.is_a(view.class_name)) return view.columns;
    std::vector<Column> columns;
    for (const Element_Record& property : record.properties)
        if (property.key && !is_noise(property.name)) columns.push_back({property.name.c_str(), property.name.c_str()});
    for (const char* name : {"ElementName", "Name", "OperationalStatus", "VersionString", "Description", "Caption"}) {
        const Element_Record* property = record.property(name);
        if (property && !property->key) columns.push_back({property->name.c_str(), property->name.c_str()});
    }
    return columns;
}

/// A reference in a table: the class and what tells it from others of its class.
std::string short_path(const Path& path)
{
    std::string keys;
    for (const Named_Value& key : path.keys)
        if (!is_noise(key.name))
            keys += (keys.empty() ? "" : ",") +
                    (key.value.as_path() ? short_path(*key.value.as_path()) : key.value.to_text());
    return path.class_name + (keys.empty() ? "" : " " + keys);
}

std::string speed_text(std::uint64_t bits)
{
    if (bits >= 1000000000 && bits % 100000000 == 0) {
        std::string text = std::to_string(bits / 1000000000);
        if (bits % 1000000000) text += "." + std::to_string(bits % 1000000000 / 100000000);
        return text + " Gbit/s";
    }
    return bits == 0 ? "-" : std::to_string(bits) + " bit/s";
}

/// An embedded instance on one line.
std::string inline_text(const Instance& instance)
{
    std::string text;
    for (const Named_Value& property : instance.properties)
        text += (text.empty() ? "" : ", ") + property.name + " = " + property.value.to_text();
    return instance.path.class_name + " {" + text + "}";
}

/// A fabric address as people of the field write it: domain, area and port in hexadecimal.
std::string address_text(std::uint64_t address)
{
    char text[24];
    std::snprintf(text, sizeof text, "0x%06llX", static_cast<unsigned long long>(address));
    return text;
}

std::string joined(const Element_Record* property, const Value& value,
                   std::string (*text)(const Element_Record*, const Value&))
{
    std::string all;
    for (const Value& element : value.elements())
        all += (all.empty() ? "" : ", ") + text(property, element);
    return all;
}

/// Lines of at most `width`, broken at blanks where there are any.
std::vector<std::string> wrapped(const std::string& text, std::size_t width)
{
    std::vector<std::string> lines;
    std::string rest = text;
    while (text_width(rest) > width) {
        std::size_t at = 0, count = 0, blank = 0;
        for (; at < rest.size(); ++at) {
            if ((static_cast<unsigned char>(rest[at]) & 0xC0) != 0x80 && count++ == width) break;
            if (rest[at] == ' ' && at > 0) blank = at;
        }
        const bool at_blank = blank > width / 2;
        lines.push_back(rest.substr(0, at_blank ? blank : at));
        rest = rest.substr(at_blank ? blank + 1 : at);
    }
    lines.push_back(rest);
    return lines;
}

/// Every property that one of the instances has, in the order in which they come.
void add_all_properties(std::vector<Listing::Field>& fields, const std::vector<Instance>& instances)
{
    std::set<std::string> known;
    for (const Instance& instance : instances)
        for (const Named_Value& property : instance.properties)
            if (known.insert(lower_case(property.name)).second) fields.push_back({property.name, property.name});
}

} // namespace

std::string value_text(const Element_Record* property, const Value& value)
{
    if (value.is_null()) return "";
    if (value.is_array()) return joined(property, value, value_text);
    std::string word = property ? property->word_for(value) : "";
    if (!word.empty()) return word;
    if (const Path* path = value.as_path()) return short_path(*path);
    if (const Instance* instance = value.as_instance()) return inline_text(*instance);
    if (property && (same_name(property->name, "Speed") || same_name(property->name, "MaxSpeed")))
        return speed_text(value.as_uint());
    if (property && same_name(property->name, "FCID")) return address_text(value.as_uint());
    return value.to_text();
}

std::string value_text_with_number(const Element_Record* property, const Value& value)
{
    if (value.is_null()) return "NULL";
    if (value.is_array()) return joined(property, value, value_text_with_number);
    if (const Instance* instance = value.as_instance()) return inline_text(*instance);
    std::string word = property ? property->word_for(value) : "";
    return word.empty() ? value.to_text() : value.to_text() + " (" + word + ")";
}

Listing instance_listing(const std::vector<Instance>& instances, const Schema& schema,
                         const std::vector<std::string>& columns, bool all)
{
    if (instances.empty()) return Listing({});
    const Class_Record* record = schema.find(instances.front().path.class_name);
    bool mixed = std::any_of(instances.begin(), instances.end(), [&](const Instance& instance) {
        return !same_name(instance.path.class_name, instances.front().path.class_name);
    });
    std::vector<Listing::Field> fields;
    if (mixed) fields = {{"class", "CLASS"}, {"object", "OBJECT"}};
    const std::size_t first = fields.size();
    if (!columns.empty())
        for (const std::string& name : columns)
            fields.push_back({name, name});
    else if (all)
        add_all_properties(fields, instances);
    else if (mixed)
        for (const char* name : {"ElementName", "Name", "Description"})
            fields.push_back({name, name});
    else if (record)
        for (const Column& column : columns_for(*record))
            fields.push_back({column.property, column.header});

    Listing listing(fields);
    for (const Instance& instance : instances) {
        const Class_Record* own = schema.find(instance.path.class_name);
        std::vector<Listing::Cell> cells;
        if (mixed) {
            std::string path = short_path(instance.path);
            std::size_t blank = path.find(' ');
            cells = {instance.path.class_name, blank == std::string::npos ? "" : path.substr(blank + 1)};
        }
        for (std::size_t i = first; i < fields.size(); ++i) {
            const Value* value = instance.find(fields[i].key);
            if (!value) value = instance.path.find(fields[i].key);
            const Value plain = value ? *value : Value();
            cells.emplace_back(value_text(own ? own->property(fields[i].key) : nullptr, plain), plain);
        }
        listing.add(std::move(cells));
    }
    return listing;
}

std::string instance_table(const std::vector<Instance>& instances, const Schema& schema,
                           const std::vector<std::string>& columns)
{
    return instance_listing(instances, schema, columns, false).table(page_width);
}

std::string property_list(const Instance& instance, const Schema& schema, bool nulls)
{
    const Class_Record* record = schema.find(instance.path.class_name);
    std::vector<std::pair<std::string, std::string>> lines;
    auto add = [&](const Element_Record* property, const std::string& name, const Value& value) {
        if (nulls || !value.is_null()) lines.emplace_back(name, printable(value_text_with_number(property, value)));
    };
    if (record)
        for (const Element_Record& property : record->properties)
            add(&property, property.name, instance.get(property.name));
    for (const Named_Value& property : instance.properties)
        if (!record || !record->property(property.name)) add(nullptr, property.name, property.value);

    std::size_t widest = 0;
    for (const auto& [name, text] : lines)
        widest = std::max(widest, name.size());
    std::string text = printable(instance.path.to_text()) + "\n";
    for (const auto& [name, value] : lines) {
        std::string margin = "  " + name + std::string(widest - name.size() + 2, ' ');
        for (const std::string& line :
             wrapped(value, page_width > margin.size() + 20 ? page_width - margin.size() : 20)) {
            text += margin + line;
            text.erase(text.find_last_not_of(' ') + 1);
            text += "\n";
            margin.assign(margin.size(), ' ');
        }
    }
    return text;
}

nlohmann::ordered_json to_json(const Value& value)
{
    if (value.is_null()) return nullptr;
    if (value.is_array()) {
        nlohmann::ordered_json array = nlohmann::ordered_json::array();
        for (const Value& element : value.elements())
            array.push_back(to_json(element));
        return array;
    }
    if (const Instance* instance = value.as_instance()) return to_json(*instance);
    if (value.type() == CMPI_boolean) return value.as_boolean();
    if (is_signed(value.type())) return value.as_int();
    if (is_integer(value.type())) return value.as_uint();
    if (value.type() == CMPI_real32 || value.type() == CMPI_real64) return value.as_real();
    return value.to_text();
}

nlohmann::ordered_json to_json(const Instance& instance)
{
    nlohmann::ordered_json json;
    json["path"] = instance.path.to_text();
    json["class"] = instance.path.class_name;
    nlohmann::ordered_json& properties = json["properties"] = nlohmann::ordered_json::object();
    for (const Named_Value& property : instance.properties)
        properties[property.name] = to_json(property.value);
    return json;
}

std::string json_text(const nlohmann::ordered_json& json)
{
    return json.dump(2, ' ', false, nlohmann::ordered_json::error_handler_t::replace) + "\n";
}

} // namespace host
