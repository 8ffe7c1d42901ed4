// MOF out again: what CIM servers compile, in an order that their compilers take.
#include "generator/Emit_Server_Files.h"

#include <algorithm>
#include <set>

namespace generator {
namespace {

constexpr std::size_t line_width = 100;

std::string mof_text(const std::string& text)
{
    std::string result = "\"";
    for (const char c : text) {
        if (c == '"' || c == '\\') result += '\\';
        if (c == '\n')
            result += "\\n";
        else if (c == '\t')
            result += "\\t";
        else if (c == '\r')
            result += "\\r";
        else
            result += c;
    }
    return result + '"';
}

/// A long text as several strings, one a line, which MOF joins: compilers bound the length of a line.
std::string wrapped(const std::string& text, std::size_t indent)
{
    const std::string margin = "\n" + std::string(indent, ' ');
    const std::size_t room = line_width - indent - 4;
    std::string result;
    for (std::size_t start = 0; start < text.size();) {
        std::size_t length = std::min(room, text.size() - start);
        if (start + length < text.size()) {
            const std::size_t blank = text.rfind(' ', start + length);
            if (blank != std::string::npos && blank > start) length = blank + 1 - start;
        }
        result += margin + mof_text(text.substr(start, length));
        start += length;
    }
    return result.empty() ? mof_text("") : result;
}

std::string literal_text(const mof::Literal& literal, std::size_t indent)
{
    switch (literal.kind) {
    case mof::Literal::Kind::null:
        return "NULL";
    case mof::Literal::Kind::boolean:
        return literal.boolean ? "true" : "false";
    case mof::Literal::Kind::integer:
    case mof::Literal::Kind::character:
        return (literal.negative ? "-" : "") + std::to_string(literal.magnitude);
    case mof::Literal::Kind::real:
        return std::to_string(literal.real);
    case mof::Literal::Kind::string:
        return literal.text.size() + indent + 4 < line_width ? mof_text(literal.text) : wrapped(literal.text, indent);
    }
    return "NULL";
}

std::string array_text(const mof::Value& value, std::size_t indent)
{
    const std::string margin = "\n" + std::string(indent, ' ');
    std::string text = "{";
    std::size_t column = line_width;
    for (std::size_t i = 0; i < value.items.size(); ++i) {
        const std::string item = literal_text(value.items[i], indent) + (i + 1 < value.items.size() ? "," : "");
        if (column + item.size() + 1 > line_width) {
            text += margin;
            column = indent;
        } else {
            text += ' ';
            ++column;
        }
        text += item;
        column += item.size();
    }
    return text + " }";
}

/// The value of what is no list; a bare NULL holds none.
const mof::Literal& scalar(const mof::Value& value)
{
    static const mof::Literal null;
    return value.items.empty() ? null : value.items[0];
}

std::string value_text(const mof::Value& value, std::size_t indent)
{
    return value.is_array ? array_text(value, indent) : literal_text(scalar(value), indent);
}

bool is_true(const mof::Value& value)
{
    return !value.is_array && value.items.size() == 1 && value.items[0].kind == mof::Literal::Kind::boolean &&
           value.items[0].boolean;
}

std::string qualifier_text(const mof::Qualifier& qualifier, std::size_t indent)
{
    if (is_true(qualifier.value)) return qualifier.name;
    if (qualifier.value.is_array) return qualifier.name + " " + array_text(qualifier.value, indent + 4);
    return qualifier.name + " (" + literal_text(scalar(qualifier.value), indent + 4) + ")";
}

/// A list that compilers want to open with Association or Indication where it has them.
std::string qualifiers_text(const mof::Qualifiers& qualifiers, std::size_t indent)
{
    if (qualifiers.empty()) return "";
    std::vector<const mof::Qualifier*> order;
    for (const mof::Qualifier& qualifier : qualifiers)
        order.push_back(&qualifier);
    std::stable_partition(order.begin(), order.end(), [](const mof::Qualifier* qualifier) {
        return mof::same_name(qualifier->name, "Association") || mof::same_name(qualifier->name, "Indication");
    });
    const std::string margin(indent, ' ');
    std::string text = margin + "[";
    for (const mof::Qualifier* qualifier : order)
        text += (qualifier == order.front() ? "" : ",\n" + margin + " ") + qualifier_text(*qualifier, indent);
    return text + "]\n";
}

std::string element_text(const mof::Typed_Element& element)
{
    std::string text = element.type == mof::Type::reference ? element.target + " REF" : mof::type_name(element.type);
    text += " " + element.name;
    if (element.subscript < 0) text += "[]";
    if (element.subscript > 0) text += "[" + std::to_string(element.subscript) + "]";
    return text;
}

std::string feature_text(const mof::Feature& feature)
{
    std::string text = qualifiers_text(feature.qualifiers, 4);
    if (feature.kind != mof::Feature::Kind::method) {
        text += "    " + element_text(feature);
        if (feature.has_default) text += " = " + value_text(feature.default_value, 8);
        return text + ";\n";
    }
    text += std::string("    ") + mof::type_name(feature.type) + " " + feature.name + "(";
    for (std::size_t i = 0; i < feature.parameters.size(); ++i) {
        text += "\n" + qualifiers_text(feature.parameters[i].qualifiers, 8) + "        " +
                element_text(feature.parameters[i]);
        if (i + 1 < feature.parameters.size()) text += ",";
    }
    return text + ");\n";
}

/// Puts each class behind its superclass and behind the classes of its methods' parameters and of its references. A
/// circle can only close over the end of an association, which is what a compiler takes before its declaration.
class Ordered {
public:
    explicit Ordered(const mof::Repository& classes) : m_classes(classes) {}

    void add(const mof::Class& target)
    {
        if (!m_seen.insert(target.name).second) return;
        if (target.super) add(*target.super);
        for (const auto& feature : target.declared) {
            add_target(*feature);
            for (const mof::Parameter& parameter : feature->parameters)
                add_target(parameter);
        }
        m_order.push_back(&target);
    }
    std::vector<const mof::Class*> take() { return std::move(m_order); }

private:
    void add_target(const mof::Typed_Element& element)
    {
        if (element.type != mof::Type::reference) return;
        if (const mof::Class* target = m_classes.find_class(element.target)) add(*target);
    }

    const mof::Repository& m_classes;
    std::set<std::string> m_seen;
    std::vector<const mof::Class*> m_order;
};

} // namespace

std::string emit_mof(const mof::Class& target)
{
    std::string text = qualifiers_text(target.qualifiers, 0) + "class " + target.name;
    if (!target.super_name.empty()) text += " : " + target.super_name;
    text += " {\n";
    bool first = true;
    for (const auto& feature : target.declared) {
        if (!first) text += '\n';
        first = false;
        text += feature_text(*feature);
    }
    return text + "};\n";
}

std::string emit_mof(const mof::Qualifier_Declaration& qualifier)
{
    const auto list = [](const std::vector<std::string>& words) {
        std::string text;
        for (const std::string& word : words)
            text += (text.empty() ? "" : ", ") + word;
        return text;
    };
    std::string text = "Qualifier " + qualifier.name + " : " + mof::type_name(qualifier.type);
    if (qualifier.is_array) text += "[]";
    if (qualifier.has_default) text += " = " + value_text(qualifier.default_value, 4);
    text += ",\n    Scope(" + list(qualifier.scopes) + ")";
    if (!qualifier.flavors.empty()) text += ",\n    Flavor(" + list(qualifier.flavors) + ")";
    return text + ";\n";
}

std::vector<const mof::Class*> compile_order(const mof::Repository& classes,
                                             const std::vector<const mof::Class*>& wanted)
{
    Ordered ordered(classes);
    for (const mof::Class* target : wanted)
        ordered.add(*target);
    return ordered.take();
}

} // namespace generator
