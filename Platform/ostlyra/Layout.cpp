// The parser of layouts: recursive descent over the grammar of Docs/layouts.md, which checks each view
// against the table of tags as it is read.
#include "ostlyra/Layout.h"

#include <algorithm>
#include <map>

#include "ostlyra/detail/Lexer.h"
#include "ostlyra/Tags.h"

namespace ostlyra {
namespace {

using detail::Lexer;
using detail::SyntaxError;
using detail::Token;
using detail::TokenKind;
using ostui::View;
using ostui::ViewParameter;

constexpr std::size_t kLargestText = 1024 * 1024;
constexpr std::size_t kMostViews = 10000;
constexpr int kGreatestDepth = 64;
constexpr std::string_view kKeyMark = "$$$/";
constexpr std::string_view kRadioGroupTag = "ost_radio_button_group";

[[noreturn]] void FailAt(int inLine, int inColumn, const std::string& inMessage) {
    throw SyntaxError(inLine, inColumn, inMessage);
}
[[noreturn]] void FailAt(const Token& inToken, const std::string& inMessage) {
    FailAt(inToken.line, inToken.column, inMessage);
}
[[noreturn]] void FailAt(const View& inView, const std::string& inMessage) {
    FailAt(inView.line, inView.column, inMessage);
}

std::string Quoted(std::string_view inText) {
    return "'" + std::string(inText) + "'";
}

/// "'a', 'b' or 'c'"
template <class Names>
std::string Choice(const Names& inNames) {
    std::string text;
    for (std::size_t i = 0; i < inNames.size(); ++i) {
        text += (i == 0 ? "" : i + 1 == inNames.size() ? " or " : ", ") + Quoted(inNames[i]);
    }
    return text;
}

std::vector<std::string_view> NamesOf(const std::vector<TagParameter>& inParameters) {
    std::vector<std::string_view> names;
    for (const TagParameter& parameter : inParameters) {
        names.push_back(parameter.name);
    }
    return names;
}

bool IsName(std::string_view inText) {
    const auto belongs = [](char inCharacter) {
        return inCharacter == '_' || (inCharacter >= '0' && inCharacter <= '9') ||
               (inCharacter >= 'a' && inCharacter <= 'z') || (inCharacter >= 'A' && inCharacter <= 'Z');
    };
    return !inText.empty() && (inText.front() < '0' || inText.front() > '9') &&
           std::all_of(inText.begin(), inText.end(), belongs);
}

bool IsNumber(const Token& inToken) {
    constexpr std::size_t kMostDigits = 5;
    return inToken.kind == TokenKind::kNumber && inToken.text.size() <= kMostDigits &&
           inToken.text.find_first_not_of("0123456789") == std::string::npos &&
           std::stoi(inToken.text) <= kLargestNumber;
}

/// What is known across a layout and all that it pulls in.
struct Common {
    const LayoutSource& source;
    /// The layouts that are being read, the outermost first.
    std::vector<std::string> open;
    /// Where each identifier stands.
    std::map<std::string, std::string> identifiers;
    std::size_t bytes = 0;
    std::size_t views = 0;
    int unnamed = 0;
};

/// Where a view stands.
struct Surroundings {
    TagContent content = TagContent::kViews;
    int depth = 0;
    bool isInRadioGroup = false;
};

class Parser {
public:
    Parser(std::string_view inText, Common& ioCommon) : mLexer(inText), mCommon(ioCommon) {}

    Layout Parse(const Surroundings& inAround);

private:
    Token TakeWord(const std::string& inExpected);
    void TakeMark(char inMark, const std::string& inContext);
    View ParseView(const Surroundings& inAround);
    void ParseParameters(const Tag& inTag, View& ioView);
    ViewParameter ParseParameter(const Tag& inTag, const View& inView);
    std::string ParseValue(const TagParameter& inParameter);
    std::string ParseText(const TagParameter& inParameter);
    void ParseChildren(const Tag& inTag, View& ioView, const Surroundings& inAround);
    View PullIn(const View& inScript, const Surroundings& inAround);
    static void CheckPlace(const Tag& inTag, const View& inView, const Surroundings& inAround);
    static void CheckRequired(const Tag& inTag, const View& inView);
    void NoteIdentifiers(const Tag& inTag, View& ioView);
    void NoteIdentifier(const View& inView, const std::string& inIdentifier);

    Lexer mLexer;
    Common& mCommon;
};

Layout Parser::Parse(const Surroundings& inAround) {
    if (const Token word = TakeWord("'layout'"); word.text != "layout") {
        FailAt(word, "expected 'layout', found " + word.Describe());
    }
    Layout layout;
    const Token name = TakeWord("the layout's name");
    layout.name = name.text;
    if (mCommon.open.back().empty()) {
        mCommon.open.back() = name.text;
    } else if (mCommon.open.back() != name.text) {
        FailAt(name, "expected the name " + Quoted(mCommon.open.back()) + ", found " + name.Describe());
    }
    TakeMark('{', "after the layout's name");
    if (const Token word = TakeWord("'view'"); word.text != "view") {
        FailAt(word, "expected 'view', found " + word.Describe());
    }
    if (const Token& tag = mLexer.Next(); tag.text != "ost_dialog" && tag.text != "ost_tab_view") {
        FailAt(tag, "expected 'ost_dialog' or 'ost_tab_view', found " + tag.Describe());
    }
    layout.view = ParseView(inAround);
    TakeMark('}', "after the layout's view");
    if (mLexer.Next().kind != TokenKind::kEnd) {
        FailAt(mLexer.Next(), "expected the end after the layout, found " + mLexer.Next().Describe());
    }
    return layout;
}

Token Parser::TakeWord(const std::string& inExpected) {
    if (mLexer.Next().kind != TokenKind::kWord) {
        FailAt(mLexer.Next(), "expected " + inExpected + ", found " + mLexer.Next().Describe());
    }
    return mLexer.Take();
}

void Parser::TakeMark(char inMark, const std::string& inContext) {
    if (!mLexer.Next().IsMark(inMark)) {
        FailAt(mLexer.Next(),
               "expected " + Quoted({&inMark, 1}) + " " + inContext + ", found " + mLexer.Next().Describe());
    }
    mLexer.Take();
}

View Parser::ParseView(const Surroundings& inAround) {
    const Token word = TakeWord("a tag");
    const Tag* const tag = FindTag(word.text);
    if (!tag) {
        FailAt(word, "unknown tag " + word.Describe());
    }
    if (inAround.depth > kGreatestDepth) {
        FailAt(word, "views are nested more than " + std::to_string(kGreatestDepth) + " deep");
    }
    if (++mCommon.views > kMostViews) {
        FailAt(word, "more than " + std::to_string(kMostViews) + " views");
    }
    View view;
    view.tag = word.text;
    view.line = word.line;
    view.column = word.column;
    ParseParameters(*tag, view);
    CheckRequired(*tag, view);
    if (tag->name == kLayoutScriptTag) {
        TakeMark(';', "after " + Quoted(tag->name));
        return PullIn(view, inAround);
    }
    CheckPlace(*tag, view, inAround);
    NoteIdentifiers(*tag, view);
    if (mLexer.Next().IsMark(';')) {
        mLexer.Take();
    } else {
        ParseChildren(*tag, view, inAround);
    }
    return view;
}

void Parser::ParseParameters(const Tag& inTag, View& ioView) {
    if (!mLexer.Next().IsMark('(')) {
        return;
    }
    mLexer.Take();
    while (!mLexer.Next().IsMark(')')) {
        ioView.parameters.push_back(ParseParameter(inTag, ioView));
        if (mLexer.Next().IsMark(',')) {
            mLexer.Take();
        } else if (!mLexer.Next().IsMark(')')) {
            FailAt(mLexer.Next(), "expected ',' or ')' after a parameter, found " + mLexer.Next().Describe());
        }
    }
    mLexer.Take();
}

ViewParameter Parser::ParseParameter(const Tag& inTag, const View& inView) {
    const Token name = TakeWord("a parameter or ')'");
    const TagParameter* const parameter = inTag.FindParameter(name.text);
    if (!parameter) {
        FailAt(name, Quoted(inTag.name) + " has no parameter " + name.Describe() + "; it has " +
                         Choice(NamesOf(inTag.parameters)));
    }
    if (inView.Find(name.text)) {
        FailAt(name, "the parameter " + name.Describe() + " stands twice");
    }
    TakeMark(':', "after " + Quoted(name.text));
    return {name.text, ParseValue(*parameter)};
}

std::string Parser::ParseValue(const TagParameter& inParameter) {
    if (inParameter.kind == ValueKind::kText) {
        return ParseText(inParameter);
    }
    const Token token = mLexer.Take();
    const std::vector<std::string_view>& words = GetWords(inParameter.kind);
    std::string expected = Choice(words);
    bool isGood = token.kind == TokenKind::kWord && std::count(words.begin(), words.end(), token.text) != 0;
    if (inParameter.kind == ValueKind::kNumber) {
        expected = "a number from 0 to " + std::to_string(kLargestNumber);
        isGood = IsNumber(token);
    } else if (inParameter.kind == ValueKind::kName) {
        expected = "a name of letters, digits and '_'";
        isGood = (token.kind == TokenKind::kWord || token.kind == TokenKind::kText) && IsName(token.text);
    }
    if (!isGood) {
        FailAt(token,
               "expected " + expected + " for " + Quoted(inParameter.name) + ", found " + token.Describe());
    }
    return token.text;
}

std::string Parser::ParseText(const TagParameter& inParameter) {
    const Token first = mLexer.Next();
    std::string text;
    while (mLexer.Next().kind == TokenKind::kText) {
        text += mLexer.Take().text;
    }
    if (first.kind != TokenKind::kText) {
        FailAt(first,
               "expected a quoted text for " + Quoted(inParameter.name) + ", found " + first.Describe());
    }
    // Without the English text the user would read the key.
    if (text.compare(0, kKeyMark.size(), kKeyMark) == 0 && text.find('=') == std::string::npos) {
        FailAt(first, "expected '=' and the English text after the key, found " + first.Describe());
    }
    return text;
}

void Parser::ParseChildren(const Tag& inTag, View& ioView, const Surroundings& inAround) {
    const std::string holder = Quoted(inTag.name) + " of line " + std::to_string(ioView.line);
    if (inTag.content == TagContent::kNothing) {
        TakeMark(';', "after " + Quoted(inTag.name) + ", which holds no views");
        return;
    }
    if (!mLexer.Next().IsMark('{')) {
        FailAt(mLexer.Next(),
               "expected ';' or '{' after " + Quoted(inTag.name) + ", found " + mLexer.Next().Describe());
    }
    mLexer.Take();
    Surroundings inside;
    inside.content = inTag.content;
    inside.depth = inAround.depth + 1;
    inside.isInRadioGroup = inAround.isInRadioGroup || inTag.name == kRadioGroupTag;
    while (!mLexer.Next().IsMark('}')) {
        if (mLexer.Next().kind != TokenKind::kWord) {
            FailAt(mLexer.Next(),
                   "expected a tag, or '}' to close " + holder + ", found " + mLexer.Next().Describe());
        }
        ioView.children.push_back(ParseView(inside));
    }
    mLexer.Take();
}

View Parser::PullIn(const View& inScript, const Surroundings& inAround) {
    const std::string name = inScript.GetIdentifier();
    if (std::count(mCommon.open.begin(), mCommon.open.end(), name) != 0) {
        FailAt(inScript, "the layout " + Quoted(name) + " pulls in itself");
    }
    const optional<std::string> text = mCommon.source ? mCommon.source(name) : optional<std::string>();
    if (!text) {
        FailAt(inScript, "there is no layout " + Quoted(name));
    }
    if ((mCommon.bytes += text->size()) > kLargestText) {
        FailAt(inScript, "with the layout " + Quoted(name) + ", all together are larger than " +
                             std::to_string(kLargestText) + " bytes");
    }
    mCommon.open.push_back(name);
    Layout layout = Parser(*text, mCommon).Parse(inAround);
    mCommon.open.pop_back();
    return std::move(layout.view);
}

void Parser::CheckPlace(const Tag& inTag, const View& inView, const Surroundings& inAround) {
    const auto mustStand = [&](bool inFits, const char* inWhere) {
        if (!inFits) {
            FailAt(inView, Quoted(inTag.name) + " stands " + inWhere);
        }
    };
    const TagContent content = inAround.content;
    switch (inTag.place) {
        case TagPlace::kTop:
            return mustStand(inAround.depth == 0, "at the top of a window's layout only");
        case TagPlace::kTabs:
            return mustStand(inAround.depth == 0 || content == TagContent::kTabs,
                             "in 'ost_tab_container' only");
        case TagPlace::kPopup:
            return mustStand(content == TagContent::kItems, "in 'ost_popup' only");
        case TagPlace::kRadioGroup:
            return mustStand(content == TagContent::kViews && inAround.isInRadioGroup,
                             "in 'ost_radio_button_group' only");
        case TagPlace::kAnywhere:
            mustStand(inTag.name != kRadioGroupTag || !inAround.isInRadioGroup,
                      "not inside another one, whose buttons its own would be");
            mustStand(content != TagContent::kTabs, "not in 'ost_tab_container', which holds 'ost_tab_view'");
            return mustStand(content != TagContent::kItems,
                             "not in 'ost_popup', which holds 'ost_popup_item'");
    }
}

void Parser::CheckRequired(const Tag& inTag, const View& inView) {
    for (const TagParameter& parameter : inTag.parameters) {
        if (parameter.isRequired && !inView.Find(parameter.name)) {
            FailAt(inView, Quoted(inTag.name) + " must have the parameter " + Quoted(parameter.name));
        }
    }
}

void Parser::NoteIdentifiers(const Tag& inTag, View& ioView) {
    if (const std::string* const identifier = ioView.Find("identifier")) {
        NoteIdentifier(ioView, *identifier);
    } else if (inTag.isControl) {
        ioView.parameters.push_back({"identifier", "#" + std::to_string(++mCommon.unnamed)});
    }
    // The buttons of a row have identifiers, too.
    for (const char* const button : {"ok", "cancel"}) {
        const std::string parameter = std::string(button) + "Identifier";
        if (inTag.FindParameter(parameter)) {
            const std::string* const own = ioView.Find(parameter);
            NoteIdentifier(ioView, own ? *own : std::string(button) + "Button");
        }
    }
}

void Parser::NoteIdentifier(const View& inView, const std::string& inIdentifier) {
    const std::string here = mCommon.open.back() + ":" + std::to_string(inView.line);
    const auto [former, isNew] = mCommon.identifiers.emplace(inIdentifier, here);
    if (!isNew) {
        FailAt(inView, "the identifier " + Quoted(inIdentifier) + " stands already at " + former->second);
    }
}

}  // namespace

std::string LayoutError::AsText() const {
    return (layout.empty() ? std::string("layout") : layout) + ":" + std::to_string(line) + ":" +
           std::to_string(column) + ": " + message;
}

optional<Layout> ParseLayout(std::string_view inText, LayoutError& outError, const LayoutSource& inSource) {
    Common common{inSource, {std::string()}, {}, inText.size(), 0, 0};
    try {
        if (inText.size() > kLargestText) {
            FailAt(1, 1, "the layout is larger than " + std::to_string(kLargestText) + " bytes");
        }
        return Parser(inText, common).Parse(Surroundings());
    } catch (const SyntaxError& error) {
        outError = {common.open.back(), error.line, error.column, error.what()};
        return {};
    }
}

}  // namespace ostlyra
