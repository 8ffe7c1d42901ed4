// The class reference as Markdown. Texts of the MOF files are escaped; what is written here is not.
#include "generator/Reference.h"

#include <algorithm>
#include <cctype>
#include <functional>
#include <sstream>

namespace generator {
namespace {

bool is_word(char c)
{
    return std::isalnum(static_cast<unsigned char>(c)) || c == '_';
}

std::string link(const mof::Class& target)
{
    return "[" + target.name + "](" + target.name + ".md)";
}

std::string link(const Catalogue& catalogue, const std::string& name)
{
    const mof::Class* target = catalogue.mof.find_class(name);
    return target ? link(*target) : name;
}

/// A text for a paragraph or a table's cell.
std::string escaped(const std::string& text)
{
    std::string result;
    for (const char c : text) {
        if (c == '\n') {
            result += ' ';
            continue;
        }
        // An underscore within a word is taken as it is.
        if (std::string("\\`*[]<>|#~&").find(c) != std::string::npos) result += '\\';
        result += c;
    }
    return result;
}

/// The same, with a link on each class that it names.
std::string prose(const Catalogue& catalogue, const std::string& text)
{
    std::string result;
    for (std::size_t at = 0; at < text.size();) {
        std::size_t end = at;
        while (end < text.size() && is_word(text[end]) == is_word(text[at]))
            ++end;
        const std::string piece = text.substr(at, end - at);
        const bool names_class = piece.find('_') != std::string::npos && catalogue.mof.find_class(piece);
        result += names_class ? link(catalogue, piece) : escaped(piece);
        at = end;
    }
    return result;
}

std::string literal_text(const mof::Literal& literal)
{
    switch (literal.kind) {
    case mof::Literal::Kind::null:
        return "null";
    case mof::Literal::Kind::boolean:
        return literal.boolean ? "true" : "false";
    case mof::Literal::Kind::integer:
        return (literal.negative ? "-" : "") + std::to_string(literal.magnitude);
    case mof::Literal::Kind::character:
        return std::to_string(literal.magnitude);
    case mof::Literal::Kind::string:
        return literal.text;
    case mof::Literal::Kind::real:
        break;
    }
    std::ostringstream text;
    text << literal.real;
    return text.str();
}

std::string value_text(const mof::Value& value)
{
    std::string text;
    for (const mof::Literal& item : value.items)
        text += (text.empty() ? "" : ", ") + literal_text(item);
    return text;
}

using Qualifier_Finder = std::function<const mof::Qualifier*(const char*)>;

/// "0 Unknown, 2 On": the values of a ValueMap with their meanings.
std::string values_text(const Qualifier_Finder& find)
{
    const mof::Qualifier* const map = find("ValueMap");
    const mof::Qualifier* const values = find("Values");
    if (!map && !values) return "";
    const std::size_t count = (map ? map : values)->value.items.size();
    std::string text;
    for (std::size_t i = 0; i < count; ++i) {
        const std::string number = map ? map->value.items[i].text : std::to_string(i);
        const std::string meaning = values && i < values->value.items.size() ? values->value.items[i].text : "";
        text += i ? ", " : "";
        text += number == ".." ? "others" : "`" + number + "`";
        if (!meaning.empty() && meaning != number) text += " " + escaped(meaning);
    }
    return text;
}

/// Meaning, unit, values and default of a property or parameter.
std::string meaning_text(const Catalogue& catalogue, const Qualifier_Finder& find)
{
    std::string text;
    const auto add = [&text](const std::string& words) { text += (text.empty() ? "" : " ") + words; };
    if (const mof::Qualifier* description = find("Description")) add(prose(catalogue, description->value.text()));
    if (const mof::Qualifier* units = find("Units"))
        add("*Unit:* " + escaped(units->value.text()) + ".");
    else if (const mof::Qualifier* unit = find("PUnit"))
        add("*Unit:* " + escaped(unit->value.text()) + ".");
    const std::string values = values_text(find);
    if (!values.empty()) add("*Values:* " + values + ".");
    return text;
}

std::string type_text(const Catalogue& catalogue, const mof::Typed_Element& element)
{
    std::string array;
    if (element.subscript) array = element.subscript > 0 ? "[" + std::to_string(element.subscript) + "]" : "[]";
    if (element.type == mof::Type::reference) return link(catalogue, element.target) + " ref" + array;
    if (const mof::Qualifier* embedded = element.qualifiers.find("EmbeddedInstance"))
        return "instance of " + link(catalogue, embedded->value.text()) + array;
    if (element.qualifiers.has("EmbeddedObject")) return "instance" + array;
    return "`" + std::string(mof::type_name(element.type)) + array + "`";
}

std::string marks_of(const mof::Feature& feature)
{
    std::string marks = feature.is_key ? ", key" : "";
    constexpr std::pair<const char*, const char*> words[] = {
        {"Write", ", writable"}, {"Required", ", required"}, {"Counter", ", counter"}, {"Gauge", ", gauge"}};
    for (const auto& [qualifier, word] : words)
        if (feature.qualifiers.has(qualifier)) marks += word;
    return marks;
}

std::string feature_row(const Catalogue& catalogue, const mof::Feature& feature)
{
    const Qualifier_Finder find = [&feature](const char* name) { return feature.inherited_qualifier(name); };
    std::string meaning = meaning_text(catalogue, find);
    if (feature.has_default) meaning += " *Default:* " + escaped(value_text(feature.default_value)) + ".";
    return "| **" + feature.name + "** | " + type_text(catalogue, feature) + marks_of(feature) + " | " + meaning +
           " |\n";
}

bool is_method(const mof::Feature& feature)
{
    return feature.kind == mof::Feature::Kind::method;
}

/// A table of the features of `target` that `chosen` takes, or nothing.
std::string feature_table(const Catalogue& catalogue, const mof::Class& target, const std::string& heading,
                          const std::function<bool(const mof::Feature&)>& chosen)
{
    std::string rows;
    for (const auto& feature : target.features)
        if (!is_method(*feature) && chosen(*feature)) rows += feature_row(catalogue, *feature);
    if (rows.empty()) return "";
    return "\n## " + heading + "\n\n| name | type | meaning |\n|---|---|---|\n" + rows;
}

std::string method_text(const Catalogue& catalogue, const mof::Feature& method)
{
    const Qualifier_Finder find = [&method](const char* name) { return method.inherited_qualifier(name); };
    std::string text = "\n### " + method.name + "\n\n";
    if (const mof::Qualifier* description = find("Description"))
        text += prose(catalogue, description->value.text()) + "\n\n";
    text += "Returns " + type_text(catalogue, method) + ".";
    const std::string values = values_text(find);
    if (!values.empty()) text += " *Values:* " + values + ".";
    text += "\n";
    if (method.parameters.empty()) return text + "\nIt takes no parameters.\n";
    text += "\n| parameter | | type | meaning |\n|---|---|---|---|\n";
    for (const mof::Parameter& parameter : method.parameters) {
        const char* way = parameter.is_in ? (parameter.is_out ? "in, out" : "in") : "out";
        const Qualifier_Finder of_parameter = [&parameter](const char* name) {
            return parameter.qualifiers.find(name);
        };
        text += "| **" + parameter.name + "** | " + way + " | " + type_text(catalogue, parameter) + " | " +
                meaning_text(catalogue, of_parameter) + " |\n";
    }
    return text;
}

std::string methods_text(const Catalogue& catalogue, const mof::Class& target)
{
    std::string own, inherited;
    for (const mof::Feature* method : methods_of(target))
        if (mof::same_name(method->origin, target.name))
            own += method_text(catalogue, *method);
        else
            inherited += "\n- " + method->name + ", from " + link(catalogue, method->origin);
    std::string text;
    if (!own.empty()) text += "\n## Methods\n" + own;
    if (!inherited.empty())
        text += "\n## Inherited methods\n\nThose that the module does not serve answer \"not supported\".\n" +
                inherited + "\n";
    return text;
}

/// The associations of the module in which instances of `target` may be an end.
std::string associations_text(const Catalogue& catalogue, const mof::Class& target)
{
    std::string rows;
    for (const Provider& provider : catalogue.providers) {
        const mof::Class& association = *provider.target;
        if (!association.is_association()) continue;
        for (const auto& end : association.features) {
            if (end->kind != mof::Feature::Kind::reference || !target.derives_from(end->target)) continue;
            std::string others;
            for (const auto& other : association.features)
                if (other->kind == mof::Feature::Kind::reference && other != end)
                    others += (others.empty() ? "" : ", ") + link(catalogue, other->target) + " (" + other->name + ")";
            rows += "| " + link(association) + " | " + end->name + " | " + others + " |\n";
        }
    }
    if (rows.empty()) return "";
    return "\n## Associations\n\n| association | this class is its | and it leads to |\n|---|---|---|\n" + rows;
}

const Provider* provider_of(const Catalogue& catalogue, const mof::Class& target)
{
    for (const Provider& provider : catalogue.providers)
        if (provider.target == &target) return &provider;
    return nullptr;
}

std::string kind_text(const mof::Class& target)
{
    std::string kind = target.is_association() ? "association" : target.is_indication() ? "indication" : "class";
    return (target.is_abstract() ? "abstract " : "") + kind;
}

std::string instances_text(const Catalogue& catalogue, const mof::Class& target)
{
    const Provider* provider = provider_of(catalogue, target);
    if (!provider) return "none by this module";
    if (target.is_indication()) return "delivered to subscribers";
    switch (provider->kind) {
    case Provider_Kind::plain:
        return "by this module, from its cache of the adapters";
    case Provider_Kind::san:
        return "by this module, from its cache of the SAN";
    case Provider_Kind::own:
        break;
    }
    return "by this module, by a provider of its own";
}

std::string head_table(const Catalogue& catalogue, const std::vector<Subject>& subjects, const mof::Class& target)
{
    std::string text = "| | |\n|---|---|\n| kind | " + kind_text(target) + " |\n";
    std::string supers;
    for (const mof::Class* at = target.super; at; at = at->super)
        supers += (supers.empty() ? "" : " \\< ") + link(*at);
    text += "| superclass | " + (supers.empty() ? "none" : supers) + " |\n";
    std::string subs;
    for (const mof::Class* sub : catalogue.mof.subclasses(target.name))
        subs += (subs.empty() ? "" : ", ") + link(*sub);
    if (!subs.empty()) text += "| subclasses | " + subs + " |\n";
    std::string profiles, beyond;
    for (const Subject& subject : subjects) {
        if (std::find(subject.classes.begin(), subject.classes.end(), &target) == subject.classes.end()) continue;
        std::string& list = subject.is_profile ? profiles : beyond;
        list += (list.empty() ? "" : ", ") + ("[" + subject.name + "](index.md#" + anchor_of(subject) + ")");
    }
    if (!profiles.empty()) text += "| profiles | " + profiles + " |\n";
    if (!beyond.empty()) text += "| beyond the profiles | " + beyond + " |\n";
    text += "| instances | " + instances_text(catalogue, target) + " |\n";
    std::string keys;
    for (const auto& feature : target.features)
        if (feature->is_key) keys += (keys.empty() ? "" : ", ") + feature->name;
    if (!keys.empty()) text += "| keys | " + keys + " |\n";
    return text;
}

/// Up to the first full stop.
std::string first_sentence(const std::string& text)
{
    const auto stop = text.find(". ");
    return stop == std::string::npos ? text : text.substr(0, stop + 1);
}

std::string class_rows(const std::vector<const mof::Class*>& classes)
{
    std::string rows = "| class | what it is |\n|---|---|\n";
    for (const mof::Class* target : classes)
        rows += "| " + link(*target) + " | " + escaped(first_sentence(target->qualifiers.text("Description"))) + " |\n";
    return rows;
}

} // namespace

std::string anchor_of(const Subject& subject)
{
    std::string anchor;
    for (const char c : subject.name)
        if (is_word(c))
            anchor += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
        else if (c == ' ')
            anchor += '-';
    return anchor;
}

std::string emit_class_page(const Catalogue& catalogue, const std::vector<Subject>& subjects, const mof::Class& target)
{
    std::string text = "# " + target.name + "\n\n";
    const std::string& description = target.qualifiers.text("Description");
    if (!description.empty()) text += prose(catalogue, description) + "\n\n";
    text += head_table(catalogue, subjects, target);

    const auto is_reference = [](const mof::Feature& feature) { return feature.kind == mof::Feature::Kind::reference; };
    text += feature_table(catalogue, target, "Ends", is_reference);
    text += feature_table(catalogue, target, "Own properties", [&](const mof::Feature& feature) {
        return !is_reference(feature) && mof::same_name(feature.origin, target.name);
    });
    text += methods_text(catalogue, target);
    text += associations_text(catalogue, target);
    for (const mof::Class* super = target.super; super; super = super->super)
        text += feature_table(catalogue, target, "Inherited from " + link(*super), [&](const mof::Feature& feature) {
            return !is_reference(feature) && mof::same_name(feature.origin, super->name);
        });
    return text + "\n---\nAll classes [by profile](index.md) and [by name](names.md).\n";
}

std::string emit_profile_index(const std::vector<Subject>& subjects)
{
    std::string text =
        "# Class reference\n\nWhat the module publishes, by the profiles that it registers, and what stands beyond "
        "them. A class may belong to several profiles. [All classes by name](names.md).\n\n";
    const auto list = [&](bool profiles) {
        for (const Subject& subject : subjects)
            if (subject.is_profile == profiles) text += "- [" + subject.name + "](#" + anchor_of(subject) + ")\n";
    };
    list(true);
    text += "\nBeyond the profiles:\n\n";
    list(false);
    for (const Subject& subject : subjects)
        text += "\n<a id=\"" + anchor_of(subject) + "\"></a>\n\n## " + subject.name + "\n\n" + escaped(subject.about) +
                "\n\n" + class_rows(subject.classes);
    return text;
}

std::string emit_name_index(const Catalogue& catalogue)
{
    std::vector<const mof::Class*> own, schema;
    for (const mof::Class* target : catalogue.classes)
        (provider_of(catalogue, *target) ? own : schema).push_back(target);
    const auto by_name = [](const mof::Class* a, const mof::Class* b) { return a->name < b->name; };
    std::sort(own.begin(), own.end(), by_name);
    std::sort(schema.begin(), schema.end(), by_name);
    return "# Classes by name\n\nThe same [by profile](index.md).\n\n## Classes that the module publishes\n\n" +
           class_rows(own) + "\n## Classes that they derive from or refer to\n\n" + class_rows(schema);
}

} // namespace generator
