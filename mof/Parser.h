#pragma once

#include "mof/Lexer.h"
#include "mof/Model.h"

#include <string>
#include <string_view>

namespace mof {

class Repository;

/// Reads the productions of one MOF text into a repository. Lives for the one call of `run`.
///
/// MOF nests to a fixed depth, so the functions below call each other without recursion; only includes nest, and the
/// repository bounds those.
class Parser {
public:
    /// `depth` is how many files include this text.
    Parser(Repository& repository, std::string file, std::string_view text, unsigned depth);

    /// Result: false after the first fault, which then stands in the repository.
    bool run();

private:
    bool pragma();
    bool qualifier_declaration();
    bool class_declaration(Qualifiers qualifiers);
    bool feature(Class& owner);
    bool parameters(Feature& method);
    bool qualifier_list(Qualifiers& qualifiers);
    bool qualifier_value(Qualifier& qualifier);

    /// A type's name, or a class's name and REF.
    bool typed(Typed_Element& element);
    bool subscript(Typed_Element& element);
    bool value(Value& result);
    bool literal(Literal& result);
    bool checked_value(const Typed_Element& element, Value& result);

    void take();
    bool expect(char punctuation, const char* place);
    bool identifier(std::string& name, const char* what);
    bool fail(std::string reason);
    bool fail_at(const Location& where, std::string reason);
    std::string found() const;

    Repository& repository_;
    Lexer lexer_;
    unsigned depth_;
    Token token_;
};

/// Does `literal` fit an element of `type`? Null fits everything.
bool fits(const Literal& literal, Type type);

} // namespace mof
