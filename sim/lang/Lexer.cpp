#include "Lexer.h"

#include <cctype>
#include <cstdio>

#include "Failure.h"

namespace tessel::lang {
namespace {

bool IsIdentStart(char c)
{
    return std::isalpha(static_cast<unsigned char>(c)) || c == '_';
}
bool IsIdentChar(char c)
{
    return std::isalnum(static_cast<unsigned char>(c)) || c == '_';
}

// Bytes a script may hold: printable ASCII and the usual white space. Anything else (a binary
// file, text in another encoding) stops the translation at the first such byte.
bool IsScriptByte(unsigned char c)
{
    return (c >= 0x20 && c < 0x7F) || c == '\t' || c == '\n' || c == '\r' || c == '\f' || c == '\v';
}

constexpr std::string_view kTwoCharPuncts[] = {
    "==", "!=", "<=", ">=", "&&", "||", "+=", "-=", "*=", "/=", "%=", "&=", "|="};
constexpr std::string_view kOneCharPuncts = "{}(),;=+-*/%&|<>!?:";

// Reads characters of one text; knows nothing of directives beyond where lines end.
class Scanner {
public:
    Scanner(std::string_view text, std::int32_t origin) : text_(text), origin_(origin) {}

    std::int32_t where(std::size_t at) const
    {
        return origin_ >= 0 ? origin_ : static_cast<std::int32_t>(at);
    }
    std::size_t pos() const { return pos_; }
    bool atEnd() const { return pos_ >= text_.size(); }
    char peek(std::size_t ahead = 0) const
    {
        return pos_ + ahead < text_.size() ? text_[pos_ + ahead] : '\0';
    }

    // Skips blanks and comments; with lineMode it stops at a line end that is not escaped.
    // Returns false when a line end (lineMode) or the end of the text was reached.
    bool skipSpace(bool lineMode)
    {
        while (pos_ < text_.size()) {
            const char c = text_[pos_];
            if (c == '\n') {
                if (lineMode) {
                    return false;
                }
                ++pos_;
            } else if (c == '\\' && lineMode &&
                       (peek(1) == '\n' || (peek(1) == '\r' && peek(2) == '\n'))) {
                pos_ += peek(1) == '\n' ? 2 : 3;
            } else if (c == ' ' || c == '\t' || c == '\r' || c == '\f' || c == '\v') {
                ++pos_;
            } else if (c == '/' && peek(1) == '/') {
                while (pos_ < text_.size() && text_[pos_] != '\n') {
                    ++pos_;
                }
            } else if (c == '/' && peek(1) == '*') {
                const std::size_t start = pos_;
                const std::size_t end = text_.find("*/", pos_ + 2);
                if (end == std::string_view::npos) {
                    Fail(kSyntax, where(start), "unterminated comment");
                }
                pos_ = end + 2;
            } else {
                return true;
            }
        }
        return false;
    }

    // One token at the current position (not a directive).
    Token token()
    {
        const std::size_t start = pos_;
        const unsigned char c = static_cast<unsigned char>(text_[pos_]);
        Tok kind = Tok::Punct;
        const std::int32_t offset = where(start);
        if (!IsScriptByte(c)) {
            char detail[32];
            std::snprintf(detail, sizeof detail, "illegal character 0x%02x", c);
            Fail(kSyntax, offset, detail);
        }
        if (IsIdentStart(static_cast<char>(c))) {
            while (pos_ < text_.size() && IsIdentChar(text_[pos_])) {
                ++pos_;
            }
            kind = Tok::Ident;
        } else if (std::isdigit(c)) {
            kind = Tok::Number;
            long value = 0;
            if (c == '0' && (peek(1) == 'x' || peek(1) == 'X') &&
                std::isxdigit(static_cast<unsigned char>(peek(2)))) {
                pos_ += 2;
                while (pos_ < text_.size() &&
                       std::isxdigit(static_cast<unsigned char>(text_[pos_]))) {
                    const char d = text_[pos_++];
                    value = value * 16 + (std::isdigit(static_cast<unsigned char>(d))
                                              ? d - '0'
                                              : (d | 0x20) - 'a' + 10);
                    if (value > 0xFFFF) {
                        value = 0x10000; // keeps counting from overflowing; reported below
                    }
                }
            } else {
                while (pos_ < text_.size() &&
                       std::isdigit(static_cast<unsigned char>(text_[pos_]))) {
                    value = value * 10 + (text_[pos_++] - '0');
                    if (value > 0xFFFF) {
                        value = 0x10000;
                    }
                }
            }
            if (pos_ < text_.size() && IsIdentChar(text_[pos_])) {
                while (pos_ < text_.size() && IsIdentChar(text_[pos_])) {
                    ++pos_;
                }
                Fail(kSyntax, offset, text_.substr(start, pos_ - start));
            }
            if (value > 0xFFFF) {
                Fail(kOutOfRange, offset, text_.substr(start, pos_ - start));
            }
        } else {
            std::size_t length = 0;
            for (std::string_view two : kTwoCharPuncts) {
                if (text_.substr(pos_, 2) == two) {
                    length = 2;
                    break;
                }
            }
            if (length == 0 &&
                kOneCharPuncts.find(static_cast<char>(c)) != std::string_view::npos) {
                length = 1;
            }
            if (length == 0) {
                Fail(kSyntax, offset, text_.substr(pos_, 1));
            }
            pos_ += length;
        }
        return Token::Make(kind, text_.substr(start, pos_ - start), offset);
    }

    std::string_view word()
    {
        const std::size_t start = pos_;
        while (pos_ < text_.size() && IsIdentChar(text_[pos_])) {
            ++pos_;
        }
        return text_.substr(start, pos_ - start);
    }

    void skipBlanks()
    {
        while (pos_ < text_.size() && (text_[pos_] == ' ' || text_[pos_] == '\t')) {
            ++pos_;
        }
    }

    void advance(std::size_t n) { pos_ += n; }
    std::string_view text() const { return text_; }

private:
    std::string_view text_;
    std::int32_t origin_;
    std::size_t pos_ = 0;
};

} // namespace

std::vector<Token> Lexer::run(std::string_view source)
{
    if (source.size() > limits_.maxSourceBytes) {
        Fail(kSourceRead, 0, "source too large");
    }
    // Reserving for the densest text ("a+b" is a token a byte) costs address space only: the
    // pages that are never written are never touched, and the list is never copied to grow.
    std::vector<Token> raw;
    raw.reserve(source.size() + 16);
    scan(source, -1, raw);
    std::vector<Token> out;
    if (directives_.empty()) {
        out = std::move(raw); // no directive, so no macro either: nothing to expand
    } else {
        out.reserve(raw.size() + 16);
        expand(raw.data(), raw.size(), 0, out);
    }
    out.push_back(Token::Make(Tok::End, {}, static_cast<std::int32_t>(source.size())));
    return out;
}

void Lexer::scan(std::string_view text, std::int32_t origin, std::vector<Token>& out)
{
    Scanner s(text, origin);
    while (s.skipSpace(false)) {
        if (s.peek() != '#') {
            out.push_back(s.token());
            if (out.size() > limits_.maxTokens) {
                Fail(kTranslationStack, out.back().offset, "too many tokens");
            }
            continue;
        }
        const std::int32_t at = s.where(s.pos());
        s.advance(1);
        s.skipBlanks();
        const std::string_view keyword = s.word();
        Directive directive;
        if (keyword == "include") {
            directive.kind = Directive::Include;
            s.skipBlanks();
            const char open = s.peek();
            const char close = open == '<' ? '>' : open == '"' ? '"' : '\0';
            if (close == '\0') {
                Fail(kSyntax, at, "#include");
            }
            s.advance(1);
            const std::size_t start = s.pos();
            while (!s.atEnd() && s.peek() != close && s.peek() != '\n') {
                s.advance(1);
            }
            if (s.peek() != close || s.pos() == start) {
                Fail(kSyntax, at, "#include");
            }
            directive.name = text.substr(start, s.pos() - start);
            s.advance(1);
        } else if (keyword == "define" || keyword == "undef") {
            s.skipBlanks();
            directive.name = s.word();
            if (directive.name.empty() || !IsIdentStart(directive.name[0])) {
                Fail(kNameExpected, at,
                     directive.name.empty() ? std::string_view("#") : directive.name);
            }
            if (keyword == "undef") {
                directive.kind = Directive::Undef;
            } else {
                directive.kind = Directive::Define;
                Macro& macro = directive.macro;
                if (s.peek() == '(') { // no blank before '(': a macro with parameters
                    macro.functionLike = true;
                    s.advance(1);
                    for (;;) {
                        if (!s.skipSpace(true)) {
                            Fail(kSyntax, at, directive.name);
                        }
                        if (s.peek() == ')' && macro.params.empty()) {
                            s.advance(1);
                            break;
                        }
                        const std::string_view param = s.word();
                        if (param.empty() || !IsIdentStart(param[0])) {
                            Fail(kNameExpected, at, directive.name);
                        }
                        for (std::string_view earlier : macro.params) {
                            if (earlier == param) {
                                Fail(kNameDeclared, at, param);
                            }
                        }
                        macro.params.push_back(param);
                        if (!s.skipSpace(true)) {
                            Fail(kSyntax, at, directive.name);
                        }
                        if (s.peek() == ',') {
                            s.advance(1);
                        } else if (s.peek() == ')') {
                            s.advance(1);
                            break;
                        } else {
                            Fail(kSyntax, at, directive.name);
                        }
                    }
                }
                while (s.skipSpace(true)) {
                    if (s.peek() == '#') {
                        Fail(kSyntax, s.where(s.pos()), "#");
                    }
                    Token t = s.token();
                    macro.body.push_back(t);
                }
            }
        } else {
            Fail(kSyntax, at, keyword.empty() ? std::string_view("#") : keyword);
        }
        directives_.push_back(std::move(directive));
        // The index rides in the length bits: a directive has no text of its own.
        Token t = Token::Make(Tok::Directive, {}, at);
        t.bits |= static_cast<std::uint32_t>((directives_.size() - 1) & 0xFFFFFFu);
        out.push_back(t);
    }
}

void Lexer::include(const Directive& directive, std::int32_t offset, std::vector<Token>& out)
{
    std::string name(directive.name);
    for (char& c : name) {
        c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    }
    if (includeDepth_ >= limits_.maxIncludeDepth) {
        Fail(kTranslationStack, offset, directive.name);
    }
    std::string text;
    if (includes_ == nullptr || !includes_->readInclude(name, text)) {
        Fail(kIncludeFailed, offset, directive.name);
    }
    if (text.size() > limits_.maxSourceBytes) {
        Fail(kIncludeFailed, offset, directive.name);
    }
    texts_.push_back(std::move(text));
    std::vector<Token> raw;
    try {
        scan(texts_.back(), offset, raw);
    } catch (Failure& failure) {
        // The fault lies in the include file: name the file, the position is the directive.
        if (failure.detail.empty()) {
            failure.detail = std::string(directive.name);
        }
        throw;
    }
    ++includeDepth_;
    expand(raw.data(), raw.size(), 0, out);
    --includeDepth_;
}

void Lexer::expand(const Token* tokens, std::size_t count, int macroDepth, std::vector<Token>& out)
{
    for (std::size_t i = 0; i < count; ++i) {
        const Token& t = tokens[i];
        if (t.kind() == Tok::Directive) {
            const Directive& directive = directives_[t.index()];
            switch (directive.kind) {
            case Directive::Define:
                macros_[directive.name] = &directive.macro;
                break;
            case Directive::Undef:
                macros_.erase(directive.name);
                break;
            case Directive::Include:
                include(directive, t.offset, out);
                break;
            }
            continue;
        }
        const auto found = t.kind() == Tok::Ident ? macros_.find(t.text()) : macros_.end();
        if (found == macros_.end()) {
            out.push_back(t);
            if (out.size() > limits_.maxTokens) {
                Fail(kTranslationStack, t.offset, "too many tokens");
            }
            continue;
        }
        const Macro& macro = *found->second;
        if (macro.functionLike && (i + 1 >= count || !tokens[i + 1].is("("))) {
            out.push_back(t); // the name alone is no use of the macro
            continue;
        }
        if (macroDepth >= limits_.maxMacroDepth || ++expansions_ > limits_.maxMacroExpansions) {
            Fail(kTranslationStack, t.offset, t.text());
        }
        std::vector<Token> expansion;
        if (!macro.functionLike) {
            expansion.reserve(macro.body.size());
            for (Token b : macro.body) {
                b.offset = t.offset;
                expansion.push_back(b);
            }
        } else {
            // Arguments: tokens up to the matching ')', split at commas outside parentheses.
            std::vector<std::pair<std::size_t, std::size_t>> args; // [begin, end) in tokens
            std::size_t j = i + 2;
            std::size_t argStart = j;
            int depth = 0;
            bool closed = false;
            for (; j < count; ++j) {
                const Token& a = tokens[j];
                if (a.kind() == Tok::Directive) {
                    break;
                }
                if (a.is("(")) {
                    ++depth;
                } else if (a.is(")")) {
                    if (depth == 0) {
                        closed = true;
                        break;
                    }
                    --depth;
                } else if (a.is(",") && depth == 0) {
                    args.emplace_back(argStart, j);
                    argStart = j + 1;
                }
            }
            if (!closed) {
                Fail(kSyntax, t.offset, t.text());
            }
            if (j > argStart || !args.empty()) {
                args.emplace_back(argStart, j);
            }
            if (args.size() > macro.params.size()) {
                Fail(kTooManyMacroParams, t.offset, t.text());
            }
            if (args.size() < macro.params.size()) {
                Fail(kTooFewMacroParams, t.offset, t.text());
            }
            for (const Token& b : macro.body) {
                std::size_t k = 0;
                while (b.kind() == Tok::Ident && k < macro.params.size() &&
                       macro.params[k] != b.text()) {
                    ++k;
                }
                if (b.kind() == Tok::Ident && k < macro.params.size()) {
                    for (std::size_t a = args[k].first; a < args[k].second; ++a) {
                        Token copy = tokens[a];
                        copy.offset = t.offset;
                        expansion.push_back(copy);
                    }
                } else {
                    Token copy = b;
                    copy.offset = t.offset;
                    expansion.push_back(copy);
                }
                if (expansion.size() > limits_.maxTokens) {
                    Fail(kTranslationStack, t.offset, t.text());
                }
            }
            i = j; // past the ')'
        }
        expand(expansion.data(), expansion.size(), macroDepth + 1, out);
    }
}

} // namespace tessel::lang
