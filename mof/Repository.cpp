#include "mof/Repository.h"

#include "mof/Parser.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <utility>

namespace mof {
namespace {

constexpr unsigned max_include_depth = 16;
constexpr unsigned max_class_depth = 64;
constexpr std::uintmax_t max_file_size = std::uintmax_t{64} << 20;

std::string key_of(std::string_view name)
{
    std::string key(name);
    for (char& c : key)
        if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
    return key;
}

std::string in_quotes(const std::string& name)
{
    return "\"" + name + "\"";
}

} // namespace

std::string Fault::text() const
{
    return where.file + ":" + std::to_string(where.line) + ":" + std::to_string(where.column) + ": " + reason;
}

void Repository::add_fault(Location where, std::string reason)
{
    faults_.push_back({std::move(where), std::move(reason)});
}

std::string Repository::fault_text() const
{
    std::string text;
    for (const auto& fault : faults_)
        text += fault.text() + "\n";
    return text;
}

bool Repository::read_file(const std::string& path)
{
    return read_file_at_depth(path, 0, {path, 0, 0});
}

bool Repository::read_file_at_depth(const std::string& path, unsigned depth, const Location& from)
{
    if (depth > max_include_depth) {
        add_fault(from, "includes are nested too deep");
        return false;
    }
    std::error_code error;
    const auto canonical = std::filesystem::canonical(path, error);
    const bool regular = !error && std::filesystem::is_regular_file(canonical, error);
    const std::uintmax_t size = regular ? std::filesystem::file_size(canonical, error) : 0;
    if (error || !regular) {
        add_fault(from, "cannot read the file " + in_quotes(path));
        return false;
    }
    if (size > max_file_size) {
        add_fault(from, "the file " + in_quotes(path) + " is too large");
        return false;
    }
    if (!files_read_.emplace(canonical.string(), true).second) return true;
    std::string text(static_cast<std::size_t>(size), '\0');
    std::ifstream stream(canonical, std::ios::binary);
    if (!text.empty() && !stream.read(text.data(), static_cast<std::streamsize>(text.size()))) {
        add_fault(from, "cannot read the file " + in_quotes(path));
        return false;
    }
    return parse(path, text, depth);
}

bool Repository::read_folder(const std::string& folder)
{
    std::vector<std::string> paths;
    std::error_code error;
    std::filesystem::recursive_directory_iterator entry(folder, error);
    for (; !error && entry != std::filesystem::recursive_directory_iterator(); entry.increment(error))
        if (entry->path().extension() == ".mof") paths.push_back(entry->path().string());
    if (error || paths.empty()) {
        add_fault({folder, 0, 0}, error ? "cannot read the folder" : "the folder holds no MOF file");
        return false;
    }
    std::sort(paths.begin(), paths.end());
    bool good = true;
    for (const auto& path : paths)
        good = read_file(path) && good;
    return good;
}

bool Repository::read_text(const std::string& name, std::string_view text)
{
    return parse(name, text, 0);
}

bool Repository::parse(const std::string& name, std::string_view text, unsigned depth)
{
    return Parser(*this, name, text, depth).run();
}

bool Repository::add_class(Class&& declared)
{
    const auto [at, is_new] = by_name_.emplace(key_of(declared.name), nullptr);
    if (!is_new) {
        const Location& first = at->second->where;
        add_fault(declared.where, "the class " + in_quotes(declared.name) + " was declared before, at " + first.file +
                                      ":" + std::to_string(first.line));
        return false;
    }
    classes_.push_back(std::move(declared));
    at->second = &classes_.back();
    order_.push_back(&classes_.back());
    return true;
}

bool Repository::add_qualifier(Qualifier_Declaration&& declared)
{
    const auto [at, is_new] = qualifiers_by_name_.emplace(key_of(declared.name), nullptr);
    if (!is_new) {
        add_fault(declared.where, "the qualifier " + in_quotes(declared.name) + " was declared before");
        return false;
    }
    qualifiers_.push_back(std::move(declared));
    at->second = &qualifiers_.back();
    return true;
}

bool Repository::resolve()
{
    if (resolved_) return faults_.empty();
    resolved_ = true;
    for (auto& declared : classes_)
        check_qualifiers(declared);
    link_supers();

    // A class after its superclass, whatever the order of the text; without recursion, since the text decides the
    // depth.
    std::unordered_map<const Class*, bool> done;
    for (auto& declared : classes_) {
        std::vector<Class*> chain;
        for (Class* at = &declared; at && !done[at]; at = const_cast<Class*>(at->super))
            chain.push_back(at);
        for (auto at = chain.rbegin(); at != chain.rend(); ++at) {
            resolve_features(**at);
            done[*at] = true;
        }
    }
    for (auto& declared : classes_)
        check_references(declared);
    return faults_.empty();
}

void Repository::link_supers()
{
    for (auto& declared : classes_) {
        if (declared.super_name.empty()) continue;
        const auto at = by_name_.find(key_of(declared.super_name));
        if (at == by_name_.end())
            add_fault(declared.where, "the superclass " + in_quotes(declared.super_name) + " is not declared");
        else {
            declared.super = at->second;
            declared.super_name = declared.super->name;
        }
    }
    for (auto& declared : classes_) {
        unsigned depth = 0;
        for (const Class* at = declared.super; at; at = at->super) {
            if (++depth <= max_class_depth) continue;
            add_fault(declared.where, "the superclasses of " + in_quotes(declared.name) + " are a circle, or too many");
            declared.super = nullptr;
            break;
        }
    }
}

/// What a bare boolean qualifier says.
static Value truth()
{
    Literal literal;
    literal.kind = Literal::Kind::boolean;
    literal.boolean = true;
    return {false, {literal}};
}

void Repository::check_qualifiers(Qualifiers& qualifiers)
{
    for (auto& qualifier : qualifiers) {
        const Qualifier_Declaration* declared = find_qualifier(qualifier.name);
        if (!declared) {
            if (!qualifiers_.empty())
                add_fault(qualifier.where, "the qualifier " + in_quotes(qualifier.name) + " is not declared");
            continue;
        }
        if (qualifier.value.items.empty() && !qualifier.value.is_array) {
            qualifier.value = declared->type == Type::boolean ? truth() : declared->default_value;
            continue;
        }
        if (qualifier.value.is_array != declared->is_array) {
            add_fault(qualifier.where, "the qualifier " + in_quotes(qualifier.name) +
                                           (declared->is_array ? " takes a list" : " takes a single value"));
            continue;
        }
        for (const auto& item : qualifier.value.items)
            if (!fits(item, declared->type)) {
                add_fault(qualifier.where,
                          "the value of " + in_quotes(qualifier.name) + " is no " + type_name(declared->type));
                break;
            }
    }
}

void Repository::check_qualifiers(Class& target)
{
    check_qualifiers(target.qualifiers);
    for (auto& feature : target.declared) {
        check_qualifiers(feature->qualifiers);
        for (auto& parameter : feature->parameters)
            check_qualifiers(parameter.qualifiers);
    }
}

void Repository::resolve_features(Class& target)
{
    if (target.super) target.features = target.super->features;
    const std::size_t inherited = target.features.size();
    for (const auto& feature : target.declared) {
        const std::string& overrides = feature->qualifiers.text("Override");
        if (!overrides.empty() && !same_name(overrides, feature->name)) {
            add_fault(feature->where, in_quotes(feature->name) + " overrides a feature of another name");
            continue;
        }
        std::size_t position = 0;
        while (position < inherited && !same_name(target.features[position]->name, feature->name))
            ++position;
        if (position < inherited) {
            override_feature(*feature, *target.features[position]);
            target.features[position] = feature;
            continue;
        }
        if (feature->qualifiers.find("Override"))
            add_fault(feature->where, in_quotes(feature->name) + " overrides nothing: no superclass declares it");
        target.features.push_back(feature);
    }
}

void Repository::override_feature(Feature& feature, const Feature& overridden)
{
    if (feature.kind != overridden.kind || feature.type != overridden.type ||
        (feature.subscript == 0) != (overridden.subscript == 0)) {
        add_fault(feature.where, in_quotes(feature.name) + " is of another kind or type than in " + overridden.origin);
        return;
    }
    feature.overridden = &overridden;
    feature.is_key = feature.is_key || overridden.is_key;
    if (!feature.has_default && overridden.has_default) {
        feature.has_default = true;
        feature.default_value = overridden.default_value;
    }
}

void Repository::check_references(Class& target)
{
    // The target's declared spelling replaces the one of the reference, so that names can be used as they are.
    const auto known = [this](Typed_Element& element) {
        if (element.type != Type::reference) return true;
        const Class* referred = find_class(element.target);
        if (referred)
            element.target = referred->name;
        else
            add_fault(element.where,
                      in_quotes(element.name) + " refers to " + in_quotes(element.target) + ", which is not declared");
        return referred != nullptr;
    };
    for (auto& feature : target.declared) {
        for (auto& parameter : feature->parameters)
            known(parameter);
        if (!known(*feature) || feature->type != Type::reference || !feature->overridden) continue;
        const Class* narrowed = find_class(feature->target);
        if (find_class(feature->overridden->target) && !narrowed->derives_from(feature->overridden->target))
            add_fault(feature->where, in_quotes(feature->name) + " refers to " + in_quotes(feature->target) +
                                          ", which does not derive from " + in_quotes(feature->overridden->target));
    }
}

const Class* Repository::find_class(std::string_view name) const
{
    const auto at = by_name_.find(key_of(name));
    return at == by_name_.end() ? nullptr : at->second;
}

std::vector<const Class*> Repository::subclasses(std::string_view name) const
{
    std::vector<const Class*> result;
    for (const Class* declared : order_)
        if (declared->super && same_name(declared->super->name, name)) result.push_back(declared);
    return result;
}

const Qualifier_Declaration* Repository::find_qualifier(std::string_view name) const
{
    const auto at = qualifiers_by_name_.find(key_of(name));
    return at == qualifiers_by_name_.end() ? nullptr : at->second;
}

} // namespace mof
