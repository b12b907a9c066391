// Cuts a layout text into words, numbers, quoted texts and marks.
#pragma once

#include <stdexcept>
#include <string>
#include <string_view>

namespace ostlyra {
namespace detail {

enum class TokenKind { kWord, kNumber, kText, kMark, kEnd };

struct Token {
    TokenKind kind = TokenKind::kEnd;
    /// A quoted text without its quotation marks and escapes; a mark's character; else what stands there.
    std::string text;
    int line = 1;
    int column = 1;

    bool IsMark(char inMark) const noexcept {
        return kind == TokenKind::kMark && text.size() == 1 && text.front() == inMark;
    }
    /// For messages: "'view'", "the text \"abc\"", "the end".
    std::string Describe() const;
};

/// What stands at a place is not what the grammar wants there.
struct SyntaxError : std::runtime_error {
    SyntaxError(int inLine, int inColumn, const std::string& inMessage)
        : std::runtime_error(inMessage), line(inLine), column(inColumn) {}
    const int line;
    const int column;
};

/// Throws SyntaxError at what is no token, from the constructor on, which reads the first one.
class Lexer {
public:
    /// The text must outlive the lexer.
    explicit Lexer(std::string_view inText);

    const Token& Next() const noexcept { return mNext; }
    Token Take();

private:
    bool AtEnd() const noexcept { return mPosition == mText.size(); }
    char Current() const noexcept { return AtEnd() ? '\0' : mText[mPosition]; }
    bool StartsWith(std::string_view inText) const noexcept;
    /// Goes on by one character, which must be well-formed.
    void Advance();
    void SkipSpace();
    void SkipBlockComment();
    void Read();
    std::string ReadWhile(bool (*inBelongs)(char));
    std::string ReadQuoted();
    char ReadEscape();
    [[noreturn]] void Fail(const std::string& inMessage) const;

    const std::string_view mText;
    std::size_t mPosition = 0;
    int mLine = 1;
    int mColumn = 1;
    Token mNext;
};

}  // namespace detail
}  // namespace ostlyra
