#include "generator/Catalogue.h"

#include <fstream>
#include <set>
#include <sstream>

namespace generator {
namespace {

/// Bits of the flags in class records, by the names of their qualifiers.
struct Flag {
    const char* qualifier;
    unsigned bit;
};
constexpr Flag feature_qualifiers[] = {
    {"Aggregate", 5},  {"Counter", 9},       {"Delete", 10}, {"DN", 11},        {"Exception", 13},
    {"Expensive", 14}, {"Experimental", 15}, {"Gauge", 16},  {"IfDeleted", 17}, {"Invisible", 20},
    {"Large", 22},     {"OctetString", 23},  {"Read", 25},   {"Required", 26},  {"Static", 27},
    {"Weak", 29},      {"Write", 30},
};
constexpr Flag class_qualifiers[] = {
    {"Abstract", 4}, {"Aggregation", 6}, {"Composition", 8}, {"Exception", 13}, {"Experimental", 15}, {"Terminal", 28},
};
constexpr std::uint32_t property = 1u << 0, reference = 1u << 1, method = 1u << 2, plain_class = 1u << 3,
                        association = 1u << 7, embedded_object = 1u << 12, in = 1u << 18, indication = 1u << 19,
                        key = 1u << 21, out = 1u << 24, embedded_instance = 1u << 31;

template <std::size_t size>
std::uint32_t flags_of(const Flag (&table)[size], const mof::Qualifiers& qualifiers)
{
    std::uint32_t flags = 0;
    for (const Flag& flag : table)
        if (qualifiers.has(flag.qualifier)) flags |= 1u << flag.bit;
    return flags;
}

std::uint32_t common_flags(const mof::Typed_Element& element)
{
    std::uint32_t flags = flags_of(feature_qualifiers, element.qualifiers);
    if (element.qualifiers.has("EmbeddedObject")) flags |= embedded_object;
    if (element.qualifiers.has("EmbeddedInstance")) flags |= embedded_instance;
    return flags;
}

/// The lines of a list file without blanks and comments, cut into words.
std::vector<std::vector<std::string>> read_list(const std::string& path)
{
    std::ifstream stream(path);
    if (!stream) throw Error(path + ": cannot read the file");
    std::vector<std::vector<std::string>> rows;
    std::string line;
    while (std::getline(stream, line)) {
        std::istringstream words(line.substr(0, line.find('#')));
        std::vector<std::string> row;
        for (std::string word; words >> word;)
            row.push_back(word);
        if (!row.empty()) rows.push_back(std::move(row));
    }
    return rows;
}

} // namespace

void Catalogue::read(const std::string& mof_folder, const std::string& catalogue_file,
                     const std::string& providers_file)
{
    if (!mof.read_folder(mof_folder) || !mof.resolve()) throw Error(mof.fault_text());

    std::set<const mof::Class*> seen;
    for (const auto& row : read_list(catalogue_file)) {
        const mof::Class* target = mof.find_class(row[0]);
        if (!target) throw Error(catalogue_file + ": no MOF file declares \"" + row[0] + "\"");
        if (row.size() != 1) throw Error(catalogue_file + ": one class a line, not more, at \"" + row[0] + "\"");
        if (!seen.insert(target).second) throw Error(catalogue_file + ": \"" + row[0] + "\" is listed twice");
        classes.push_back(target);
    }
    for (const mof::Class* target : mof.classes())
        if (!seen.count(target)) throw Error(catalogue_file + ": \"" + target->name + "\" is declared but not listed");

    const auto check_target = [this](const mof::Typed_Element& element) {
        const Shape shape = shape_of(element);
        if (shape.target.empty() || mof.find_class(shape.target)) return;
        throw Error(element.where.file + ":" + std::to_string(element.where.line) + ": \"" + element.name +
                    "\" embeds instances of \"" + shape.target + "\", which is not declared");
    };
    for (const mof::Class* target : classes)
        for (const auto& feature : target->declared) {
            check_target(*feature);
            for (const auto& parameter : feature->parameters)
                check_target(parameter);
        }

    if (providers_file.empty()) return;
    std::set<const mof::Class*> provided;
    for (const auto& row : read_list(providers_file)) {
        if (row.size() == 2 && row[0] == "derived") {
            derived_header = row[1];
            continue;
        }
        Provider provider;
        provider.target = mof.find_class(row[0]);
        if (!provider.target) throw Error(providers_file + ": no MOF file declares \"" + row[0] + "\"");
        if (!provided.insert(provider.target).second)
            throw Error(providers_file + ": \"" + row[0] + "\" is listed twice");
        if (row.size() == 2 && (row[1] == "plain" || row[1] == "san")) {
            if (derived_header.empty())
                throw Error(providers_file + ": say \"derived HEADER\" before the first of them");
            provider.kind = row[1] == "san" ? Provider_Kind::san : Provider_Kind::plain;
        } else if (row.size() == 3 && row[1] == "own") {
            provider.kind = Provider_Kind::own;
            provider.header = row[2];
        } else {
            throw Error(providers_file + ": \"" + row[0] + "\" needs \"plain\", \"san\" or \"own HEADER\" behind it");
        }
        providers.push_back(std::move(provider));
    }
}

Shape shape_of(const mof::Typed_Element& element)
{
    Shape shape;
    shape.type = element.type;
    shape.subscript = element.subscript;
    if (element.type == mof::Type::reference) {
        shape.is_reference = true;
        shape.target = element.target;
    } else if (element.qualifiers.has("EmbeddedObject")) {
        shape.is_reference = true;
    } else if (const auto* embedded = element.qualifiers.find("EmbeddedInstance")) {
        shape.is_reference = true;
        shape.target = embedded->value.text();
    }
    if (shape.is_reference && shape.subscript > 0) shape.subscript = -1;
    return shape;
}

std::string Shape::member_type() const
{
    if (is_reference) {
        if (subscript != 0) return "Property<Array<Instance*>>";
        return (target.empty() ? "Instance" : target) + "*";
    }
    std::string value = mof::type_name(type);
    if (type == mof::Type::string) value = "String";
    if (type == mof::Type::datetime) value = "Datetime";
    return subscript == 0 ? "Property<" + value + ">" : "Property<Array<" + value + ">>";
}

std::uint32_t class_flags(const mof::Class& target)
{
    std::uint32_t kind = plain_class;
    for (const mof::Class* at = &target; at; at = at->super) {
        if (at->is_association()) kind = association;
        if (at->is_indication()) kind = indication;
    }
    return kind | flags_of(class_qualifiers, target.qualifiers);
}

std::uint32_t feature_flags(const mof::Feature& feature)
{
    const std::uint32_t flags = common_flags(feature) | (feature.is_key ? key : 0);
    if (feature.kind == mof::Feature::Kind::method) return flags | method;
    return flags | (shape_of(feature).is_reference ? reference : property);
}

std::uint32_t parameter_flags(const mof::Parameter& parameter)
{
    return common_flags(parameter) | (parameter.is_in ? in : 0) | (parameter.is_out ? out : 0) |
           (shape_of(parameter).is_reference ? reference : property);
}

std::string method_record_name(const mof::Feature& feature)
{
    return feature.origin + "_" + feature.name + "_method";
}

std::vector<const mof::Feature*> methods_of(const mof::Class& target)
{
    std::vector<const mof::Feature*> methods;
    for (const auto& feature : target.features)
        if (feature->kind == mof::Feature::Kind::method) methods.push_back(feature.get());
    return methods;
}

} // namespace generator
