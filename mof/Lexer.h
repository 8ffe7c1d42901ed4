#pragma once

#include "mof/Model.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace mof {

/// One word of MOF text.
struct Token {
    enum class Kind : std::uint8_t {
        end,
        identifier, ///< also keywords: MOF reserves them by position and in any case
        integer,
        real,
        string, ///< one quoted string, escapes resolved; the parser joins neighbours
        character,
        alias,  ///< "$name"
        pragma, ///< "#pragma"
        punctuation,
        bad, ///< `text` is the reason
    };

    Kind kind = Kind::end;
    std::string text; ///< identifier, string, alias without "$", punctuation, reason
    bool negative = false;
    std::uint64_t magnitude = 0; ///< integer, character
    double real = 0;
    Location where;

    bool is(char punctuation) const { return kind == Kind::punctuation && text.size() == 1 && text[0] == punctuation; }
    /// An identifier that is this word in any case.
    bool is_word(std::string_view word) const { return kind == Kind::identifier && same_name(text, word); }
};

/// Cuts MOF text into tokens, passing over blanks and comments. Borrows the text.
class Lexer {
public:
    Lexer(std::string file, std::string_view text);

    /// The next token; `end` again and again at the end, and a `bad` token where the text is no MOF.
    Token next();

private:
    bool skip_blanks(Token& fault);
    Token read_number(Token token);
    Token read_string(Token token);
    Token read_character(Token token);
    bool read_escape(std::string& out, std::string& reason);
    char peek(std::size_t ahead = 0) const;
    void advance();
    static Token bad(Token token, std::string reason);

    std::string file_;
    std::string_view text_;
    std::size_t position_ = 0;
    std::size_t line_ = 1;
    std::size_t column_ = 1;
};

} // namespace mof
