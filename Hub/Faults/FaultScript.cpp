// Reading scripts, and whether a rule matches a request.
#include "Faults/FaultScript.h"

#include <charconv>
#include <set>
#include <sstream>

#include "Base/Text.h"
#include "Http/Multipart.h"

namespace zohub {

namespace {

constexpr std::uint64_t kLongestPause = 600000;
constexpr std::uint64_t kLargestNumber = 1ull << 40;
constexpr char kInjected[] = "A fault script asked for this answer.";

// The words of one line, taken one after the other.
class Words {
public:
    Words(std::string const& inLine, std::string inWhere) : mWhere(std::move(inWhere)) {
        std::istringstream stream(inLine.substr(0, CommentIn(inLine)));
        for (std::string word; stream >> word;)
            mWords.push_back(word);
    }

    bool IsAtEnd() const { return mNext == mWords.size(); }
    bool TakeIf(char const* inWord) {
        bool const isThere = !IsAtEnd() && mWords[mNext] == inWord;
        mNext += isThere ? 1 : 0;
        return isThere;
    }
    std::string Take(std::string const& inExpected) {
        if (IsAtEnd())
            Fail(inExpected);
        return mWords[mNext++];
    }
    std::uint64_t TakeNumber(std::string const& inExpected, std::uint64_t inMinimum,
                             std::uint64_t inMaximum) {
        return ReadNumber(Take(inExpected), inExpected, inMinimum, inMaximum);
    }
    std::chrono::milliseconds TakeTime() {
        constexpr char kExpected[] = "a time such as 250ms or 3s, at most 600s";
        std::string const word = Take(kExpected);
        bool const isMilliseconds = word.size() > 2 && word.substr(word.size() - 2) == "ms";
        bool const isSeconds = !isMilliseconds && word.size() > 1 && word.back() == 's';
        if (!isMilliseconds && !isSeconds)
            FailAtLast(kExpected);
        std::uint64_t const factor = isSeconds ? 1000 : 1;
        std::string const digits = word.substr(0, word.size() - (isSeconds ? 1 : 2));
        return std::chrono::milliseconds(factor * ReadNumber(digits, kExpected, 0, kLongestPause / factor));
    }
    double TakePercent() {
        constexpr char kExpected[] = "a chance from 0% to 100%";
        std::string const word = Take(kExpected);
        if (word.empty() || word.back() != '%')
            FailAtLast(kExpected);
        double percent = -1;
        char const* const end = word.data() + word.size() - 1;
        auto const read = std::from_chars(word.data(), end, percent);
        if (read.ec != std::errc() || read.ptr != end || !(percent >= 0 && percent <= 100))
            FailAtLast(kExpected);
        return percent / 100;
    }
    /// What is left of the line, with single blanks.
    std::string TakeRest() {
        std::string rest;
        while (!IsAtEnd())
            rest += (rest.empty() ? "" : " ") + mWords[mNext++];
        return rest;
    }
    std::string TextFrom(std::size_t inWord) const {
        std::string text;
        for (std::size_t i = inWord; i < mWords.size(); ++i)
            text += (text.empty() ? "" : " ") + mWords[i];
        return text;
    }
    std::size_t Position() const { return mNext; }

    /// At the word that comes next.
    [[noreturn]] void Fail(std::string const& inExpected) const {
        std::string const found = IsAtEnd() ? "the line ends" : "there is '" + mWords[mNext] + "'";
        throw FaultScriptError(mWhere + ": expected " + inExpected + ", but " + found);
    }
    [[noreturn]] void FailAtLast(std::string const& inExpected) {
        --mNext;
        Fail(inExpected);
    }

private:
    // A comment begins with a "#" that is the first of its word; relations have one inside.
    static std::size_t CommentIn(std::string const& inLine) {
        if (inLine.rfind('#', 0) == 0)
            return 0;
        std::size_t const blank = inLine.find(" #");
        std::size_t const tab = inLine.find("\t#");
        return std::min(blank, tab);
    }
    std::uint64_t ReadNumber(std::string const& inText, std::string const& inExpected,
                             std::uint64_t inMinimum, std::uint64_t inMaximum) {
        std::uint64_t number = 0;
        auto const read = std::from_chars(inText.data(), inText.data() + inText.size(), number);
        bool const isWhole = read.ec == std::errc() && read.ptr == inText.data() + inText.size();
        if (!isWhole || number < inMinimum || number > inMaximum)
            FailAtLast(inExpected);
        return number;
    }

    std::string const mWhere;
    std::vector<std::string> mWords;
    std::size_t mNext = 0;
};

Response AnswerWith(int inStatus) {
    return ErrorResponse(inStatus, "injected", kInjected);
}

std::string ReadMethod(Words& ioWords) {
    static std::set<std::string> const kMethods = {"GET", "HEAD", "POST", "PUT", "DELETE", "any"};
    constexpr char kExpected[] = "a method (GET, HEAD, POST, PUT, DELETE or any)";
    std::string const word = ioWords.Take(kExpected);
    if (kMethods.count(word) == 0)
        ioWords.FailAtLast(kExpected);
    return word == "any" ? std::string() : word;
}

std::vector<FaultTarget> ReadTargets(Words& ioWords) {
    if (ioWords.TakeIf("anywhere"))
        return {};
    if (ioWords.TakeIf("path")) {
        constexpr char kExpected[] =
            "a path such as /zo/1/p/*/push, with * for one segment and ** at the end for all that follow";
        std::string const pattern = ioWords.Take(kExpected);
        auto const rest = pattern.find("**");
        if (pattern[0] != '/' || (rest != std::string::npos && rest + 2 != pattern.size()))
            ioWords.FailAtLast(kExpected);
        return {{{}, SplitPattern(pattern)}};
    }
    if (ioWords.TakeIf("rel")) {
        constexpr char kExpected[] = "a link relation of this hub such as /sessions/session#push";
        auto targets = TargetsOfRelation(ioWords.Take(kExpected));
        if (targets.empty())
            ioWords.FailAtLast(kExpected);
        return targets;
    }
    ioWords.Fail("'anywhere', 'path' or 'rel'");
}

void ReadOccasion(Words& ioWords, FaultOccasion& outOccasion) {
    constexpr char kExpected[] = "a number from 1 on";
    if (ioWords.TakeIf("nth")) {
        outOccasion.first = ioWords.TakeNumber(kExpected, 1, kLargestNumber);
        outOccasion.last = outOccasion.first;
    } else if (ioWords.TakeIf("first")) {
        outOccasion.last = ioWords.TakeNumber(kExpected, 1, kLargestNumber);
    } else if (ioWords.TakeIf("from")) {
        outOccasion.first = ioWords.TakeNumber(kExpected, 1, kLargestNumber);
    } else if (ioWords.TakeIf("every")) {
        outOccasion.step = ioWords.TakeNumber(kExpected, 1, kLargestNumber);
        outOccasion.first = outOccasion.step;
    }
    if (ioWords.TakeIf("chance"))
        outOccasion.chance = ioWords.TakePercent();
}

void ReadCut(Words& ioWords, FaultPlan& outPlan) {
    if (ioWords.TakeIf("at"))
        outPlan.cutAt = ioWords.TakeNumber("a number of bytes", 0, kLargestNumber);
}

Response ReadAnswer(Words& ioWords) {
    auto const status = ioWords.TakeNumber("a status from 200 to 599", 200, 599);
    Response response = status == 204 || status == 304 ? EmptyResponse(static_cast<int>(status))
                                                       : AnswerWith(static_cast<int>(status));
    if (ioWords.TakeIf("retry-after")) {
        if (ioWords.IsAtEnd())
            ioWords.Fail("the value of the Retry-After header");
        response.headers.emplace_back("Retry-After", ioWords.TakeRest());
    }
    return response;
}

void ReadAction(Words& ioWords, FaultRule& outRule) {
    FaultPlan& plan = outRule.plan;
    if (ioWords.TakeIf("refuse")) {
        plan.isRefused = true;
    } else if (ioWords.TakeIf("delay")) {
        plan.delay = ioWords.TakeTime();
    } else if (ioWords.TakeIf("drop-reply")) {
        plan.ending = FaultPlan::Ending::Drop;
    } else if (ioWords.TakeIf("reset-in-body")) {
        plan.ending = FaultPlan::Ending::Reset;
        ReadCut(ioWords, plan);
    } else if (ioWords.TakeIf("truncate")) {
        plan.ending = FaultPlan::Ending::Truncate;
        ReadCut(ioWords, plan);
    } else if (ioWords.TakeIf("stall")) {
        plan.ending = FaultPlan::Ending::Stall;
        plan.pause = ioWords.TakeTime();
        ReadCut(ioWords, plan);
    } else if (ioWords.TakeIf("trickle")) {
        plan.ending = FaultPlan::Ending::Trickle;
        plan.piece = ioWords.TakeNumber("a number of bytes from 1 on", 1, kLargestNumber);
        plan.pause = ioWords.TakeTime();
    } else if (ioWords.TakeIf("garbage")) {
        plan.ending = FaultPlan::Ending::Garbage;
    } else if (ioWords.TakeIf("answer")) {
        plan.insteadOfWork = ReadAnswer(ioWords);
    } else if (ioWords.TakeIf("answer-after-work")) {
        plan.insteadOfAnswer = ReadAnswer(ioWords);
    } else if (ioWords.TakeIf("expire-token")) {
        outRule.expiresToken = true;
    } else {
        ioWords.Fail(
            "an action (refuse, delay, drop-reply, reset-in-body, truncate, stall, trickle, garbage, answer, "
            "answer-after-work or expire-token)");
    }
}

FaultRule ReadRule(Words& ioWords, std::size_t inLine) {
    FaultRule rule;
    rule.line = inLine;
    rule.method = ReadMethod(ioWords);
    rule.targets = ReadTargets(ioWords);
    if (ioWords.TakeIf("parts"))
        rule.formParts = ioWords.TakeNumber("a number of form parts from 1 on", 1, 20000);
    ReadOccasion(ioWords, rule.occasion);
    if (!ioWords.TakeIf("do"))
        ioWords.Fail("'parts', 'nth', 'first', 'from', 'every', 'chance' or 'do'");
    rule.text = ioWords.TextFrom(ioWords.Position());
    ReadAction(ioWords, rule);
    return rule;
}

// How many parts the body has, as far as that can be told.
std::size_t CountFormParts(Request const& inRequest) {
    try {
        return Form(inRequest).Parts().size();
    } catch (std::exception const&) {
        return 0;
    }
}

}  // namespace

bool FaultTarget::Matches(Request const& inRequest) const {
    if (!method.empty() && method != inRequest.method)
        return false;
    auto const& path = inRequest.segments;
    for (std::size_t i = 0; i < segments.size(); ++i) {
        if (segments[i] == "**")
            return true;
        if (i >= path.size() || (segments[i] != "*" && segments[i] != path[i]))
            return false;
    }
    return path.size() == segments.size();
}

bool FaultOccasion::Includes(std::uint64_t inNumber, double inDraw) const {
    bool const isInside = inNumber >= first && inNumber <= last.value_or(inNumber);
    return isInside && (inNumber - first) % step == 0 && inDraw < chance;
}

bool FaultRule::Matches(Request const& inRequest) const {
    if (!method.empty() && method != inRequest.method)
        return false;
    bool isTarget = targets.empty();
    for (auto const& target : targets)
        isTarget = isTarget || target.Matches(inRequest);
    return isTarget && (formParts == 0 || CountFormParts(inRequest) >= formParts);
}

FaultScript ParseFaultScript(std::string const& inText, std::string const& inName) {
    FaultScript script;
    std::istringstream lines(inText);
    std::string line;
    for (std::size_t number = 1; std::getline(lines, line); ++number) {
        Words words(line, inName + ", line " + std::to_string(number));
        if (words.IsAtEnd())
            continue;
        if (words.TakeIf("seed"))
            script.seed = words.TakeNumber("a number", 0, kLargestNumber);
        else if (words.TakeIf("on"))
            script.rules.push_back(ReadRule(words, number));
        else
            words.Fail("'on', 'seed' or a comment that begins with #");
        if (!words.IsAtEnd())
            words.Fail("the end of the line");
    }
    return script;
}

}  // namespace zohub
