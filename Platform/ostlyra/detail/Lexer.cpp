// Tokens of layout texts.
#include "ostlyra/detail/Lexer.h"

#include <algorithm>

#include "ostcore/utility/StringConversion.h"

namespace ostlyra {
namespace detail {
namespace {

constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
constexpr std::string_view kMarks = "(){},:;";

bool IsDigit(char inCharacter) {
    return inCharacter >= '0' && inCharacter <= '9';
}

bool BeginsWord(char inCharacter) {
    return (inCharacter >= 'a' && inCharacter <= 'z') || (inCharacter >= 'A' && inCharacter <= 'Z') ||
           inCharacter == '_';
}

bool BelongsToWord(char inCharacter) {
    return BeginsWord(inCharacter) || IsDigit(inCharacter);
}

bool IsControlCharacter(char inCharacter) {
    const auto byte = static_cast<unsigned char>(inCharacter);
    return byte < 0x20 || byte == 0x7F;
}

std::size_t LengthByFirstByte(char inCharacter) {
    const auto byte = static_cast<unsigned char>(inCharacter);
    return byte < 0xC0 ? 1 : byte < 0xE0 ? 2 : byte < 0xF0 ? 3 : 4;
}

/// Long texts are cut: a message names what it found, it does not repeat the layout.
std::string Shortened(const std::string& inText) {
    constexpr std::size_t kMost = 40;
    return inText.size() <= kMost
               ? inText
               : ostcore::utility::ReplaceInvalidUTF8(std::string_view(inText).substr(0, kMost)) + "...";
}

}  // namespace

std::string Token::Describe() const {
    switch (kind) {
        case TokenKind::kEnd:
            return "the end";
        case TokenKind::kText:
            return "the text \"" + Shortened(text) + "\"";
        case TokenKind::kNumber:
            return "the number " + Shortened(text);
        default:
            return "'" + Shortened(text) + "'";
    }
}

Lexer::Lexer(std::string_view inText) : mText(inText) {
    if (StartsWith(kByteOrderMark)) {
        mPosition = kByteOrderMark.size();
    }
    Read();
}

Token Lexer::Take() {
    Token taken = std::move(mNext);
    Read();
    return taken;
}

void Lexer::Fail(const std::string& inMessage) const {
    throw SyntaxError(mLine, mColumn, inMessage);
}

bool Lexer::StartsWith(std::string_view inText) const noexcept {
    return mText.substr(mPosition, inText.size()) == inText;
}

void Lexer::Advance() {
    const std::size_t length = LengthByFirstByte(Current());
    if (!ostcore::utility::IsValidUTF8(mText.substr(mPosition, length))) {
        Fail("expected UTF-8, found bytes that are not");
    }
    if (Current() == '\n') {
        ++mLine;
        mColumn = 1;
    } else {
        ++mColumn;
    }
    mPosition += length;
}

void Lexer::SkipSpace() {
    while (!AtEnd()) {
        if (Current() == ' ' || Current() == '\t' || Current() == '\r' || Current() == '\n') {
            Advance();
        } else if (StartsWith("//")) {
            while (!AtEnd() && Current() != '\n') {
                Advance();
            }
        } else if (StartsWith("/*")) {
            SkipBlockComment();
        } else {
            return;
        }
    }
}

void Lexer::SkipBlockComment() {
    const int line = mLine;
    const int column = mColumn;
    Advance();
    Advance();
    while (!StartsWith("*/")) {
        if (AtEnd()) {
            throw SyntaxError(line, column, "expected '*/' after this '/*', found the end");
        }
        Advance();
    }
    Advance();
    Advance();
}

void Lexer::Read() {
    SkipSpace();
    mNext = Token{TokenKind::kEnd, {}, mLine, mColumn};
    if (AtEnd()) {
        return;
    }
    const char first = Current();
    if (BeginsWord(first)) {
        mNext.kind = TokenKind::kWord;
        mNext.text = ReadWhile(&BelongsToWord);
    } else if (IsDigit(first)) {
        mNext.kind = TokenKind::kNumber;
        mNext.text = ReadWhile(&BelongsToWord);
    } else if (first == '"' || first == '\'') {
        mNext.kind = TokenKind::kText;
        mNext.text = ReadQuoted();
    } else if (kMarks.find(first) != std::string_view::npos) {
        mNext.kind = TokenKind::kMark;
        mNext.text = first;
        Advance();
    } else {
        const std::size_t start = mPosition;
        const Token here = mNext;
        Advance();
        const std::string found(mText.substr(start, mPosition - start));
        throw SyntaxError(
            here.line, here.column,
            IsControlCharacter(first) ? "found a control character" : "unexpected '" + found + "'");
    }
}

std::string Lexer::ReadWhile(bool (*inBelongs)(char)) {
    const std::size_t start = mPosition;
    while (!AtEnd() && inBelongs(Current())) {
        Advance();
    }
    return std::string(mText.substr(start, mPosition - start));
}

std::string Lexer::ReadQuoted() {
    const int line = mLine;
    const int column = mColumn;
    const char quote = Current();
    Advance();
    std::string text;
    while (Current() != quote) {
        if (AtEnd() || Current() == '\n' || Current() == '\r') {
            throw SyntaxError(line, column, std::string("expected ") + quote + " before the end of the line");
        }
        if (IsControlCharacter(Current())) {
            Fail("found a control character in a text");
        }
        if (Current() == '\\') {
            text += ReadEscape();
        } else {
            const std::size_t start = mPosition;
            Advance();
            text += mText.substr(start, mPosition - start);
        }
    }
    Advance();
    return text;
}

char Lexer::ReadEscape() {
    constexpr std::string_view kEscaped = "\"'\\nt";
    constexpr std::string_view kMeant = "\"'\\\n\t";
    const std::size_t which = kEscaped.find(mText.substr(std::min(mPosition + 1, mText.size()), 1));
    if (mPosition + 1 == mText.size() || which == std::string_view::npos) {
        Fail("expected \\\", \\', \\\\, \\n or \\t");
    }
    Advance();
    Advance();
    return kMeant[which];
}

}  // namespace detail
}  // namespace ostlyra
