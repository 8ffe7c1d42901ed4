#include "mof/Parser.h"

#include "mof/Repository.h"

#include <limits>
#include <optional>
#include <utility>

namespace mof {
namespace {

constexpr const char* type_names[] = {
    "boolean", "uint8",  "sint8",  "uint16", "sint16", "uint32", "sint32",
    "uint64",  "sint64", "real32", "real64", "char16", "string", "datetime",
};

std::optional<Type> type_of(std::string_view word)
{
    for (std::size_t i = 0; i < std::size(type_names); ++i)
        if (same_name(word, type_names[i])) return static_cast<Type>(i);
    return std::nullopt;
}

/// Largest absolute values of an integer type, above and below zero.
struct Range {
    std::uint64_t above;
    std::uint64_t below;
};

std::optional<Range> range_of(Type type)
{
    switch (type) {
    case Type::uint8:
        return Range{UINT8_MAX, 0};
    case Type::uint16:
        return Range{UINT16_MAX, 0};
    case Type::uint32:
        return Range{UINT32_MAX, 0};
    case Type::uint64:
        return Range{UINT64_MAX, 0};
    case Type::sint8:
        return Range{INT8_MAX, std::uint64_t{1} << 7};
    case Type::sint16:
        return Range{INT16_MAX, std::uint64_t{1} << 15};
    case Type::sint32:
        return Range{INT32_MAX, std::uint64_t{1} << 31};
    case Type::sint64:
        return Range{INT64_MAX, std::uint64_t{1} << 63};
    default:
        return std::nullopt;
    }
}

/// The 25 characters of a date-time: digits or asterisks but for the point and the sign or colon.
bool is_datetime(std::string_view text)
{
    if (text.size() != 25 || text[14] != '.') return false;
    if (text[21] != ':' && text[21] != '+' && text[21] != '-') return false;
    for (std::size_t i = 0; i < text.size(); ++i)
        if (i != 14 && i != 21 && text[i] != '*' && (text[i] < '0' || text[i] > '9')) return false;
    return true;
}

} // namespace

const char* type_name(Type type)
{
    return type == Type::reference ? "ref" : type_names[static_cast<std::size_t>(type)];
}

bool fits(const Literal& literal, Type type)
{
    if (literal.kind == Literal::Kind::null) return true;
    if (const auto range = range_of(type))
        return literal.kind == Literal::Kind::integer &&
               literal.magnitude <= (literal.negative ? range->below : range->above);
    switch (type) {
    case Type::boolean:
        return literal.kind == Literal::Kind::boolean;
    case Type::real32:
    case Type::real64:
        return literal.kind == Literal::Kind::real || literal.kind == Literal::Kind::integer;
    case Type::char16:
        return literal.kind == Literal::Kind::character ||
               (literal.kind == Literal::Kind::integer && !literal.negative && literal.magnitude <= UINT16_MAX);
    case Type::string:
        return literal.kind == Literal::Kind::string;
    case Type::datetime:
        return literal.kind == Literal::Kind::string && is_datetime(literal.text);
    default:
        return false;
    }
}

Parser::Parser(Repository& repository, std::string file, std::string_view text, unsigned depth)
    : repository_(repository), lexer_(std::move(file), text), depth_(depth)
{
    take();
}

void Parser::take()
{
    token_ = lexer_.next();
}

std::string Parser::found() const
{
    switch (token_.kind) {
    case Token::Kind::end:
        return "the end of the text";
    case Token::Kind::identifier:
    case Token::Kind::punctuation:
        return "\"" + token_.text + "\"";
    case Token::Kind::integer:
    case Token::Kind::real:
        return "a number";
    case Token::Kind::string:
        return "a string";
    case Token::Kind::character:
        return "a character";
    case Token::Kind::alias:
        return "an alias";
    case Token::Kind::pragma:
        return "a pragma";
    case Token::Kind::bad:
        break;
    }
    return token_.text;
}

bool Parser::fail_at(const Location& where, std::string reason)
{
    repository_.add_fault(where, std::move(reason));
    return false;
}

bool Parser::fail(std::string reason)
{
    if (token_.kind == Token::Kind::bad) return fail_at(token_.where, token_.text);
    return fail_at(token_.where, std::move(reason));
}

bool Parser::expect(char punctuation, const char* place)
{
    if (!token_.is(punctuation))
        return fail(std::string("expected \"") + punctuation + "\" " + place + ", found " + found());
    take();
    return true;
}

bool Parser::identifier(std::string& name, const char* what)
{
    if (token_.kind != Token::Kind::identifier) return fail(std::string("expected ") + what + ", found " + found());
    name = token_.text;
    take();
    return true;
}

bool Parser::run()
{
    while (token_.kind != Token::Kind::end) {
        if (token_.kind == Token::Kind::pragma) {
            if (!pragma()) return false;
            continue;
        }
        if (token_.is_word("Qualifier")) {
            if (!qualifier_declaration()) return false;
            continue;
        }
        Qualifiers qualifiers;
        if (token_.is('[') && !qualifier_list(qualifiers)) return false;
        if (token_.is_word("instance")) return fail("instance declarations are not read here: declare classes only");
        if (!token_.is_word("class"))
            return fail("expected a class, a qualifier declaration or a pragma, found " + found());
        if (!class_declaration(std::move(qualifiers))) return false;
    }
    return true;
}

bool Parser::pragma()
{
    take();
    std::string name;
    if (!identifier(name, "the pragma's name") || !expect('(', "behind the pragma's name")) return false;
    const Location where = token_.where;
    std::string argument;
    if (token_.kind != Token::Kind::string) return fail("expected the pragma's argument as a string, found " + found());
    while (token_.kind == Token::Kind::string) {
        argument += token_.text;
        take();
    }
    if (!expect(')', "behind the pragma's argument")) return false;
    // Name spaces are chosen by whoever loads the classes; other pragmas are for other compilers.
    if (!same_name(name, "include")) return true;

    std::string path = argument;
    const std::size_t slash = where.file.rfind('/');
    if (!path.empty() && path[0] != '/' && slash != std::string::npos) path = where.file.substr(0, slash + 1) + path;
    return repository_.read_file_at_depth(path, depth_ + 1, where);
}

bool Parser::qualifier_declaration()
{
    take();
    Qualifier_Declaration declared;
    declared.where = token_.where;
    if (!identifier(declared.name, "the qualifier's name") || !expect(':', "behind the qualifier's name")) return false;
    Typed_Element element;
    if (!typed(element)) return false;
    if (element.type == Type::reference) return fail_at(declared.where, "a qualifier cannot be a reference");
    if (!subscript(element)) return false;
    declared.type = element.type;
    declared.is_array = element.subscript != 0;
    if (token_.is('=')) {
        take();
        declared.has_default = true;
        if (!checked_value(element, declared.default_value)) return false;
    }
    while (token_.is(',')) {
        take();
        std::string word;
        if (!identifier(word, "Scope or Flavor")) return false;
        const bool is_scope = same_name(word, "scope");
        if (!is_scope && !same_name(word, "flavor")) return fail("expected Scope or Flavor, found \"" + word + "\"");
        if (!expect('(', "behind Scope or Flavor")) return false;
        auto& list = is_scope ? declared.scopes : declared.flavors;
        for (;;) {
            std::string item;
            if (!identifier(item, is_scope ? "a scope" : "a flavor")) return false;
            list.push_back(std::move(item));
            if (!token_.is(',')) break;
            take();
        }
        if (!expect(')', "behind the list")) return false;
    }
    return expect(';', "behind the qualifier's declaration") && repository_.add_qualifier(std::move(declared));
}

bool Parser::class_declaration(Qualifiers qualifiers)
{
    take();
    Class declared;
    declared.qualifiers = std::move(qualifiers);
    declared.where = token_.where;
    if (!identifier(declared.name, "the class's name")) return false;
    if (token_.is_word("as")) {
        take();
        if (token_.kind != Token::Kind::alias) return fail("expected an alias behind \"as\", found " + found());
        take();
    }
    if (token_.is(':')) {
        take();
        if (!identifier(declared.super_name, "the superclass's name")) return false;
    }
    if (!expect('{', "before the features of the class")) return false;
    while (!token_.is('}'))
        if (!feature(declared)) return false;
    take();
    return expect(';', "behind the class") && repository_.add_class(std::move(declared));
}

bool Parser::feature(Class& owner)
{
    auto declared = std::make_shared<Feature>();
    if (token_.is('[') && !qualifier_list(declared->qualifiers)) return false;
    if (!typed(*declared)) return false;
    declared->where = token_.where;
    if (!identifier(declared->name, "the feature's name")) return false;
    declared->origin = owner.name;
    for (const auto& other : owner.declared)
        if (same_name(other->name, declared->name))
            return fail_at(declared->where, "\"" + declared->name + "\" is declared twice in " + owner.name);

    if (token_.is('(')) {
        if (declared->type == Type::reference) return fail_at(declared->where, "a method cannot return a reference");
        declared->kind = Feature::Kind::method;
        if (!parameters(*declared)) return false;
    } else {
        declared->kind = declared->type == Type::reference ? Feature::Kind::reference : Feature::Kind::property;
        if (!subscript(*declared)) return false;
        if (token_.is('=')) {
            take();
            if (declared->type == Type::reference) return fail("a reference has no default here");
            declared->has_default = true;
            if (!checked_value(*declared, declared->default_value)) return false;
        }
    }
    declared->is_key = declared->kind != Feature::Kind::method && declared->qualifiers.has("Key");
    if (!expect(';', "behind the feature")) return false;
    owner.declared.push_back(std::move(declared));
    return true;
}

bool Parser::parameters(Feature& method)
{
    take();
    while (!token_.is(')')) {
        Parameter parameter;
        if (token_.is('[') && !qualifier_list(parameter.qualifiers)) return false;
        if (!typed(parameter)) return false;
        parameter.where = token_.where;
        if (!identifier(parameter.name, "the parameter's name")) return false;
        for (const auto& other : method.parameters)
            if (same_name(other.name, parameter.name))
                return fail_at(parameter.where, "\"" + parameter.name + "\" is declared twice in " + method.name);
        if (!subscript(parameter)) return false;
        parameter.is_in = !parameter.qualifiers.find("In") || parameter.qualifiers.has("In");
        parameter.is_out = parameter.qualifiers.has("Out");
        method.parameters.push_back(std::move(parameter));
        if (token_.is(')')) break;
        if (!expect(',', "between parameters")) return false;
        if (token_.is(')')) return fail("expected a parameter behind \",\", found \")\"");
    }
    take();
    return true;
}

bool Parser::qualifier_list(Qualifiers& qualifiers)
{
    take();
    for (;;) {
        Qualifier qualifier;
        qualifier.where = token_.where;
        if (!identifier(qualifier.name, "a qualifier's name")) return false;
        if (qualifiers.find(qualifier.name))
            return fail_at(qualifier.where, "\"" + qualifier.name + "\" is said twice");
        if (!qualifier_value(qualifier)) return false;
        if (token_.is(':')) {
            take();
            while (token_.kind == Token::Kind::identifier)
                take();
        }
        qualifiers.push_back(std::move(qualifier));
        if (token_.is(']')) break;
        if (!expect(',', "between qualifiers")) return false;
    }
    take();
    return true;
}

bool Parser::qualifier_value(Qualifier& qualifier)
{
    if (token_.is('{')) return value(qualifier.value);
    if (!token_.is('(')) return true;
    take();
    return value(qualifier.value) && expect(')', "behind the qualifier's value");
}

bool Parser::typed(Typed_Element& element)
{
    const Location where = token_.where;
    std::string word;
    if (!identifier(word, "a type")) return false;
    if (token_.is_word("ref")) {
        take();
        element.type = Type::reference;
        element.target = std::move(word);
        return true;
    }
    const auto type = type_of(word);
    if (!type) return fail_at(where, "\"" + word + "\" is no type, and no class without REF behind it");
    element.type = *type;
    return true;
}

bool Parser::subscript(Typed_Element& element)
{
    if (!token_.is('[')) return true;
    take();
    element.subscript = -1;
    if (token_.kind == Token::Kind::integer) {
        if (token_.negative || token_.magnitude == 0 || token_.magnitude > INT16_MAX)
            return fail("the length of an array is 1 to 32767");
        element.subscript = static_cast<int>(token_.magnitude);
        take();
    }
    return expect(']', "behind the length of the array");
}

bool Parser::literal(Literal& result)
{
    switch (token_.kind) {
    case Token::Kind::integer:
        result.kind = Literal::Kind::integer;
        result.magnitude = token_.magnitude;
        result.negative = token_.negative && token_.magnitude != 0;
        result.real = static_cast<double>(token_.magnitude) * (token_.negative ? -1 : 1);
        break;
    case Token::Kind::real:
        result.kind = Literal::Kind::real;
        result.real = token_.real;
        break;
    case Token::Kind::character:
        result.kind = Literal::Kind::character;
        result.magnitude = token_.magnitude;
        break;
    case Token::Kind::string:
        result.kind = Literal::Kind::string;
        while (token_.kind == Token::Kind::string) {
            result.text += token_.text;
            take();
        }
        return true;
    case Token::Kind::identifier:
        if (token_.is_word("null")) break;
        result.kind = Literal::Kind::boolean;
        result.boolean = token_.is_word("true");
        if (!result.boolean && !token_.is_word("false")) return fail("expected a value, found " + found());
        break;
    default:
        return fail("expected a value, found " + found());
    }
    take();
    return true;
}

bool Parser::value(Value& result)
{
    if (!token_.is('{')) {
        result.items.emplace_back();
        return literal(result.items.back());
    }
    take();
    result.is_array = true;
    while (!token_.is('}')) {
        result.items.emplace_back();
        if (!literal(result.items.back())) return false;
        if (token_.is('}')) break;
        if (!expect(',', "between values")) return false;
        if (token_.is('}')) return fail("expected a value behind \",\", found \"}\"");
    }
    take();
    return true;
}

bool Parser::checked_value(const Typed_Element& element, Value& result)
{
    const Location where = token_.where;
    if (!value(result)) return false;
    const bool is_null = !result.is_array && result.items[0].kind == Literal::Kind::null;
    if (!is_null && result.is_array != (element.subscript != 0))
        return fail_at(where, result.is_array ? "a list as the value of a scalar" : "a single value for an array");
    if (element.subscript > 0 && result.items.size() > static_cast<std::size_t>(element.subscript))
        return fail_at(where, "more values than the array holds");
    for (const auto& item : result.items)
        if (!fits(item, element.type)) return fail_at(where, std::string("the value is no ") + type_name(element.type));
    return true;
}

} // namespace mof
