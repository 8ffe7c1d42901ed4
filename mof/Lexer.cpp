#include "mof/Lexer.h"

#include <cstdlib>
#include <utility>

namespace mof {
namespace {

bool is_digit(char c)
{
    return c >= '0' && c <= '9';
}

bool is_letter(char c)
{
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_';
}

int hex_digit(char c)
{
    if (is_digit(c)) return c - '0';
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    return -1;
}

void append_utf8(std::string& out, unsigned unit)
{
    if (unit < 0x80) {
        out += static_cast<char>(unit);
    } else if (unit < 0x800) {
        out += static_cast<char>(0xC0 | (unit >> 6));
        out += static_cast<char>(0x80 | (unit & 0x3F));
    } else {
        out += static_cast<char>(0xE0 | (unit >> 12));
        out += static_cast<char>(0x80 | ((unit >> 6) & 0x3F));
        out += static_cast<char>(0x80 | (unit & 0x3F));
    }
}

/// The digits of one integer; false where they do not fit 64 bits.
bool to_magnitude(std::string_view digits, unsigned base, std::uint64_t& magnitude)
{
    magnitude = 0;
    for (const char c : digits) {
        const auto digit = static_cast<unsigned>(hex_digit(c));
        if (magnitude > (UINT64_MAX - digit) / base) return false;
        magnitude = magnitude * base + digit;
    }
    return true;
}

} // namespace

Lexer::Lexer(std::string file, std::string_view text) : file_(std::move(file)), text_(text)
{
    if (text_.substr(0, 3) == "\xEF\xBB\xBF") position_ = 3;
}

char Lexer::peek(std::size_t ahead) const
{
    return position_ + ahead < text_.size() ? text_[position_ + ahead] : '\0';
}

void Lexer::advance()
{
    if (position_ >= text_.size()) return;
    if (text_[position_] == '\n') {
        ++line_;
        column_ = 1;
    } else {
        ++column_;
    }
    ++position_;
}

Token Lexer::bad(Token token, std::string reason)
{
    token.kind = Token::Kind::bad;
    token.text = std::move(reason);
    return token;
}

bool Lexer::skip_blanks(Token& fault)
{
    for (;;) {
        const char c = peek();
        if (c == ' ' || c == '\t' || c == '\r' || c == '\n' || c == '\f' || c == '\v') {
            advance();
        } else if (c == '/' && peek(1) == '/') {
            while (position_ < text_.size() && peek() != '\n')
                advance();
        } else if (c == '/' && peek(1) == '*') {
            fault.where = {file_, line_, column_};
            advance();
            advance();
            while (position_ < text_.size() && !(peek() == '*' && peek(1) == '/'))
                advance();
            if (position_ >= text_.size()) return false;
            advance();
            advance();
        } else {
            return true;
        }
    }
}

Token Lexer::next()
{
    Token token;
    if (!skip_blanks(token)) return bad(std::move(token), "the comment that begins here has no end");
    token.where = {file_, line_, column_};
    if (position_ >= text_.size()) return token;

    const char c = peek();
    if (is_letter(c)) {
        token.kind = Token::Kind::identifier;
        while (is_letter(peek()) || is_digit(peek())) {
            token.text += peek();
            advance();
        }
        return token;
    }
    if (is_digit(c) || ((c == '+' || c == '-') && (is_digit(peek(1)) || peek(1) == '.')) ||
        (c == '.' && is_digit(peek(1))))
        return read_number(std::move(token));
    if (c == '"') return read_string(std::move(token));
    if (c == '\'') return read_character(std::move(token));
    if (c == '$') {
        advance();
        token.kind = Token::Kind::alias;
        while (is_letter(peek()) || is_digit(peek())) {
            token.text += peek();
            advance();
        }
        return token.text.empty() ? bad(std::move(token), "an alias needs a name behind \"$\"") : token;
    }
    if (c == '#') {
        advance();
        std::string word;
        while (is_letter(peek())) {
            word += peek();
            advance();
        }
        if (!same_name(word, "pragma")) return bad(std::move(token), "\"#\" begins a pragma only");
        token.kind = Token::Kind::pragma;
        return token;
    }
    if (std::string_view("[]{}(),;:=").find(c) != std::string_view::npos && c != '\0') {
        advance();
        token.kind = Token::Kind::punctuation;
        token.text = c;
        return token;
    }
    return bad(std::move(token), "a character that MOF does not use here");
}

Token Lexer::read_number(Token token)
{
    const std::size_t start = position_;
    if (peek() == '+' || peek() == '-') {
        token.negative = peek() == '-';
        advance();
    }
    const std::size_t digits = position_;
    token.kind = Token::Kind::integer;
    if (peek() == '0' && (peek(1) == 'x' || peek(1) == 'X')) {
        advance();
        advance();
        const std::size_t first = position_;
        while (hex_digit(peek()) >= 0)
            advance();
        if (first == position_ || is_letter(peek())) return bad(std::move(token), "not a hexadecimal number");
        if (!to_magnitude(text_.substr(first, position_ - first), 16, token.magnitude))
            return bad(std::move(token), "the number does not fit 64 bits");
        return token;
    }
    while (is_digit(peek()))
        advance();
    const std::string_view run = text_.substr(digits, position_ - digits);
    if ((peek() == 'b' || peek() == 'B') && !is_letter(peek(1)) && !is_digit(peek(1))) {
        if (run.empty() || run.find_first_not_of("01") != std::string_view::npos)
            return bad(std::move(token), "not a binary number");
        advance();
        if (!to_magnitude(run, 2, token.magnitude)) return bad(std::move(token), "the number does not fit 64 bits");
        return token;
    }
    if (peek() == '.') {
        advance();
        if (!is_digit(peek())) return bad(std::move(token), "a real number needs digits behind its point");
        while (is_digit(peek()))
            advance();
        if (peek() == 'e' || peek() == 'E') {
            advance();
            if (peek() == '+' || peek() == '-') advance();
            if (!is_digit(peek())) return bad(std::move(token), "an exponent needs digits");
            while (is_digit(peek()))
                advance();
        }
        token.kind = Token::Kind::real;
        token.real = std::strtod(std::string(text_.substr(start, position_ - start)).c_str(), nullptr);
        if (is_letter(peek())) return bad(std::move(token), "not a number");
        return token;
    }
    if (is_letter(peek())) return bad(std::move(token), "not a number");
    const bool octal = run.size() > 1 && run[0] == '0';
    if (octal && run.find_first_of("89") != std::string_view::npos)
        return bad(std::move(token), "a leading zero makes the number octal: 8 and 9 cannot be in it");
    if (!to_magnitude(run, octal ? 8 : 10, token.magnitude))
        return bad(std::move(token), "the number does not fit 64 bits");
    return token;
}

bool Lexer::read_escape(std::string& out, std::string& reason)
{
    advance();
    const char c = peek();
    switch (c) {
    case 'b':
        out += '\b';
        break;
    case 't':
        out += '\t';
        break;
    case 'n':
        out += '\n';
        break;
    case 'f':
        out += '\f';
        break;
    case 'r':
        out += '\r';
        break;
    case '"':
    case '\'':
    case '\\':
        out += c;
        break;
    case 'x':
    case 'X': {
        unsigned unit = 0;
        int count = 0;
        while (count < 4 && hex_digit(peek(1)) >= 0) {
            advance();
            unit = unit * 16 + static_cast<unsigned>(hex_digit(peek()));
            ++count;
        }
        if (count == 0) reason = "\\x needs hexadecimal digits";
        if (count > 0 && unit == 0) reason = "a string cannot hold the zero character";
        if (unit >= 0xD800 && unit < 0xE000) reason = "half of a surrogate pair is no character";
        append_utf8(out, unit);
        break;
    }
    default:
        reason = "an unknown escape sequence";
    }
    advance();
    return reason.empty();
}

Token Lexer::read_string(Token token)
{
    std::string reason;
    std::string text;
    advance();
    for (;;) {
        const char c = peek();
        if (position_ >= text_.size() || c == '\n')
            return bad(std::move(token), "the string that begins here has no end");
        if (c == '\0') return bad(std::move(token), "a string cannot hold the zero character");
        if (c == '"') break;
        if (c == '\\') {
            if (!read_escape(text, reason)) return bad(std::move(token), reason);
            continue;
        }
        text += c;
        advance();
    }
    advance();
    token.kind = Token::Kind::string;
    token.text = std::move(text);
    return token;
}

Token Lexer::read_character(Token token)
{
    std::string reason;
    std::string text;
    advance();
    if (peek() == '\\') {
        if (!read_escape(text, reason)) return bad(std::move(token), reason);
    } else {
        while (position_ < text_.size() && peek() != '\'' && peek() != '\n' && text.size() < 4) {
            text += peek();
            advance();
        }
    }
    if (peek() != '\'') return bad(std::move(token), "a character constant holds one character between single quotes");
    advance();

    const auto byte = [&text](std::size_t n) { return static_cast<unsigned char>(text[n]); };
    if (text.size() == 1 && byte(0) < 0x80)
        token.magnitude = byte(0);
    else if (text.size() == 2 && (byte(0) & 0xE0) == 0xC0)
        token.magnitude = ((byte(0) & 0x1Fu) << 6) | (byte(1) & 0x3Fu);
    else if (text.size() == 3 && (byte(0) & 0xF0) == 0xE0)
        token.magnitude = ((byte(0) & 0x0Fu) << 12) | ((byte(1) & 0x3Fu) << 6) | (byte(2) & 0x3Fu);
    else
        return bad(std::move(token), "a character constant holds one character between single quotes");
    token.kind = Token::Kind::character;
    return token;
}

} // namespace mof
