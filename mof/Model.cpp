#include "mof/Model.h"

namespace mof {
namespace {

const std::string no_text;

char lower(char c)
{
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

} // namespace

bool same_name(std::string_view a, std::string_view b)
{
    if (a.size() != b.size()) return false;
    for (std::size_t i = 0; i < a.size(); ++i)
        if (lower(a[i]) != lower(b[i])) return false;
    return true;
}

const std::string& Value::text() const
{
    return items.empty() || items[0].kind != Literal::Kind::string ? no_text : items[0].text;
}

const Qualifier* Qualifiers::find(std::string_view name) const
{
    for (const auto& qualifier : *this)
        if (same_name(qualifier.name, name)) return &qualifier;
    return nullptr;
}

bool Qualifiers::has(std::string_view name) const
{
    const Qualifier* qualifier = find(name);
    if (!qualifier) return false;
    if (qualifier->value.items.size() != 1 || qualifier->value.is_array) return true;
    const Literal& item = qualifier->value.items[0];
    if (item.kind == Literal::Kind::boolean) return item.boolean;
    return item.kind != Literal::Kind::null;
}

const std::string& Qualifiers::text(std::string_view name) const
{
    const Qualifier* qualifier = find(name);
    return qualifier ? qualifier->value.text() : no_text;
}

const Qualifier* Feature::inherited_qualifier(std::string_view qualifier_name) const
{
    for (const Feature* feature = this; feature; feature = feature->overridden)
        if (const Qualifier* qualifier = feature->qualifiers.find(qualifier_name)) return qualifier;
    return nullptr;
}

const Feature* Class::find_feature(std::string_view feature_name) const
{
    for (const auto& feature : features)
        if (same_name(feature->name, feature_name)) return feature.get();
    return nullptr;
}

const Feature* Class::find_method(std::string_view method_name) const
{
    const Feature* feature = find_feature(method_name);
    return feature && feature->kind == Feature::Kind::method ? feature : nullptr;
}

const Feature* Class::find_property(std::string_view property_name) const
{
    const Feature* feature = find_feature(property_name);
    return feature && feature->kind != Feature::Kind::method ? feature : nullptr;
}

bool Class::derives_from(std::string_view ancestor) const
{
    for (const Class* at = this; at; at = at->super)
        if (same_name(at->name, ancestor)) return true;
    return false;
}

} // namespace mof
