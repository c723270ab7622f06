// Tokens of scripts, with the preprocessor folded in: #define (with parameters), #undef and
// #include are carried out while the token list is built, so the parser sees one flat list.
//
// Every token carries an offset into the main source: tokens that come from an include file or
// a macro expansion carry the offset of the directive or macro use that brought them in, which
// is where an error in them is shown.
#pragma once

#include <cstdint>
#include <deque>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "Translator.h"

namespace tessel::lang {

enum class Tok : std::uint8_t { Ident, Number, Punct, Directive, End };

// 16 bytes: a long script has a token every two or three characters, and the list is held
// whole while the program is compiled.
struct Token {
    const char* start = nullptr;
    std::int32_t offset = 0;
    std::uint32_t bits = static_cast<std::uint32_t>(Tok::End) << 24; // kind, then length or index

    static Token Make(Tok kind, std::string_view text, std::int32_t offset)
    {
        Token t;
        t.start = text.data();
        t.offset = offset;
        t.bits = (static_cast<std::uint32_t>(kind) << 24) |
                 static_cast<std::uint32_t>(text.size() & 0xFFFFFFu);
        return t;
    }

    Tok kind() const { return static_cast<Tok>(bits >> 24); }
    // Directives have no text of their own; "#" stands for them in messages.
    std::string_view text() const
    {
        return kind() == Tok::Directive ? std::string_view("#")
                                        : std::string_view(start, bits & 0xFFFFFFu);
    }
    // A directive's index into the directive list.
    std::size_t index() const { return bits & 0xFFFFFFu; }
    // A number's value (the scanner has checked that it is one, 0 to 65535).
    std::int32_t value() const
    {
        const std::string_view digits = text();
        std::int32_t value = 0;
        if (digits.size() > 2 && (digits[1] == 'x' || digits[1] == 'X')) {
            for (char c : digits.substr(2)) {
                value = value * 16 + (c <= '9' ? c - '0' : (c | 0x20) - 'a' + 10);
            }
        } else {
            for (char c : digits) {
                value = value * 10 + (c - '0');
            }
        }
        return value;
    }

    bool is(std::string_view punct) const { return kind() == Tok::Punct && text() == punct; }
    bool isWord(std::string_view word) const { return kind() == Tok::Ident && text() == word; }
};

class Lexer {
public:
    Lexer(const TranslateLimits& limits, IncludeReader* includes)
        : limits_(limits), includes_(includes)
    {
    }

    // The main source's tokens, macros expanded and includes read, ended by one End token.
    // Throws Failure.
    std::vector<Token> run(std::string_view source);

private:
    struct Macro {
        bool functionLike = false;
        std::vector<std::string_view> params;
        std::vector<Token> body;
    };
    struct Directive {
        enum Kind { Define, Undef, Include } kind = Define;
        std::string_view name;
        Macro macro;
    };

    // Raw tokens of one text; directives become Directive tokens. origin >= 0 gives every
    // token that offset (an included file).
    void scan(std::string_view text, std::int32_t origin, std::vector<Token>& out);
    void expand(const Token* tokens, std::size_t count, int macroDepth, std::vector<Token>& out);
    void include(const Directive& directive, std::int32_t offset, std::vector<Token>& out);

    TranslateLimits limits_;
    IncludeReader* includes_;
    std::deque<std::string> texts_;    // include texts; tokens point into them
    std::deque<Directive> directives_; // stable: tokens refer to them by index
    std::unordered_map<std::string_view, const Macro*> macros_;
    int includeDepth_ = 0;
    long expansions_ = 0;
};

} // namespace tessel::lang
