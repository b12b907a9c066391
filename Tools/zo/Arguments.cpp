// Reads words by the command table; every refusal says what was wrong and what would be right.
#include "Arguments.h"

#include <algorithm>

#include "Failure.h"

namespace zo {
namespace {

std::size_t EditDistance(const std::string& inLeft, const std::string& inRight) {
    std::vector<std::size_t> row(inRight.size() + 1);
    for (std::size_t column = 0; column < row.size(); ++column) {
        row[column] = column;
    }
    for (std::size_t line = 1; line <= inLeft.size(); ++line) {
        std::size_t diagonal = row[0];
        row[0] = line;
        for (std::size_t column = 1; column < row.size(); ++column) {
            const std::size_t substituted = diagonal + (inLeft[line - 1] == inRight[column - 1] ? 0 : 1);
            diagonal = row[column];
            row[column] = std::min({row[column] + 1, row[column - 1] + 1, substituted});
        }
    }
    return row.back();
}

// " (did you mean 'X'?)" for the nearest candidate within two edits, else nothing.
std::string Suggestion(const std::string& inWord, const std::vector<std::string>& inCandidates) {
    std::size_t best = 3;
    std::string nearest;
    for (const std::string& candidate : inCandidates) {
        const std::size_t distance = EditDistance(inWord, candidate);
        if (distance < best && distance < candidate.size()) {
            best = distance;
            nearest = candidate;
        }
    }
    return nearest.empty() ? std::string() : " (did you mean '" + nearest + "'?)";
}

Failure UsageError(const std::string& inText, const Command* inCommand) {
    return Failure(
        ExitCode::Usage, inText,
        inCommand ? "'zo help " + inCommand->name + "' shows what it takes" : "'zo help' lists the verbs");
}

std::string Join(const std::vector<std::string>& inWords) {
    std::string text;
    for (const std::string& word : inWords) {
        text += (text.empty() ? "" : ", ") + word;
    }
    return text;
}

void CheckChoice(const std::string& inWhat, const std::string& inValue, Completes inCompletes,
                 const std::vector<std::string>& inChoices, const Command* inCommand) {
    if (inCompletes != Completes::Choices ||
        std::find(inChoices.begin(), inChoices.end(), inValue) != inChoices.end()) {
        return;
    }
    throw UsageError(inWhat + " cannot be '" + inValue + "': it is one of " + Join(inChoices), inCommand);
}

// Types and flavours that newer hubs know are welcome; their choices are only offered to a shell.
bool IsOpenEnded(const Option& inOption) {
    return inOption.name == "type" || inOption.name == "rendition";
}

}  // namespace

class ArgumentsReader {
public:
    explicit ArgumentsReader(const std::vector<std::string>& inWords) : mWords(inWords) {}

    Arguments Read() {
        while (mNext < mWords.size()) {
            const std::string word = mWords[mNext++];
            if (mOptionsEnded || word == "-" || word.empty() || word[0] != '-') {
                TakeWord(word);
            } else if (word == "--") {
                mOptionsEnded = true;
            } else if (word.compare(0, 2, "--") == 0) {
                TakeLong(word.substr(2));
            } else {
                TakeLetters(word.substr(1));
            }
        }
        Finish();
        return std::move(mResult);
    }

private:
    std::vector<Option> Known() const {
        if (mResult.mCommand) {
            return OptionsOf(*mResult.mCommand);
        }
        std::vector<Option> all = CommonOptions();
        all.insert(all.end(), ConnectionOptions().begin(), ConnectionOptions().end());
        all.push_back({"version", 0, "", ""});
        return all;
    }

    void TakeWord(const std::string& inWord) {
        if (mResult.mCommand) {
            mResult.mPositionals.push_back(inWord);
            return;
        }
        mResult.mCommand = FindCommand(inWord);
        if (!mResult.mCommand) {
            std::vector<std::string> names;
            for (const Command& command : AllCommands()) {
                names.push_back(command.name);
            }
            throw UsageError("zo has no verb '" + inWord + "'" + Suggestion(inWord, names), nullptr);
        }
    }

    void TakeLong(const std::string& inText) {
        const std::size_t equals = inText.find('=');
        const std::string name = inText.substr(0, equals);
        for (const Option& option : Known()) {
            if (option.name == name) {
                const bool attached = equals != std::string::npos;
                if (attached && !option.TakesValue()) {
                    throw UsageError("--" + name + " takes no value", mResult.mCommand);
                }
                Store(option, attached ? std::optional(inText.substr(equals + 1)) : std::nullopt);
                return;
            }
        }
        std::vector<std::string> names;
        for (const Option& option : Known()) {
            names.push_back("--" + option.name);
        }
        throw UsageError("unknown option --" + name + Suggestion("--" + name, names), mResult.mCommand);
    }

    void TakeLetters(const std::string& inLetters) {
        const std::vector<Option> known = Known();
        for (std::size_t index = 0; index < inLetters.size(); ++index) {
            const auto option = std::find_if(known.begin(), known.end(), [&](const Option& inOption) {
                return inOption.letter == inLetters[index];
            });
            if (option == known.end()) {
                throw UsageError(std::string("unknown option -") + inLetters[index], mResult.mCommand);
            }
            if (option->TakesValue()) {
                const std::string rest = inLetters.substr(index + 1);
                Store(*option, rest.empty() ? std::nullopt : std::optional(rest));
                return;
            }
            Store(*option, std::nullopt);
        }
    }

    void Store(const Option& inOption, std::optional<std::string> inValue) {
        if (!inOption.TakesValue()) {
            mResult.mOptions[inOption.name] = "";
            return;
        }
        if (!inValue) {
            if (mNext >= mWords.size()) {
                throw UsageError("--" + inOption.name + " needs " + inOption.valueName, mResult.mCommand);
            }
            inValue = mWords[mNext++];
        }
        if (inValue->find('\0') != std::string::npos) {
            throw UsageError("--" + inOption.name + " cannot hold a NUL", mResult.mCommand);
        }
        if (!IsOpenEnded(inOption)) {
            CheckChoice("--" + inOption.name, *inValue, inOption.completes, inOption.choices,
                        mResult.mCommand);
        }
        mResult.mOptions[inOption.name] = *inValue;
    }

    void Finish() {
        if (!mResult.mCommand) {
            FinishWithoutVerb();
            return;
        }
        const Command& command = *mResult.mCommand;
        if (mResult.Has("help")) {
            mResult.mPositionals = {command.name};
            mResult.mCommand = FindCommand("help");
            return;
        }
        const std::vector<Option> known = OptionsOf(command);
        for (const auto& [name, value] : mResult.mOptions) {
            const bool allowed =
                std::any_of(known.begin(), known.end(),
                            [&, option = name](const Option& inOption) { return inOption.name == option; });
            if (!allowed) {
                throw UsageError("'zo " + command.name + "' takes no --" + name, &command);
            }
        }
        CheckPositionals(command);
    }

    void FinishWithoutVerb() {
        const bool version = mResult.Has("version");
        if (!version && !mResult.Has("help")) {
            throw UsageError("a verb is missing", nullptr);
        }
        mResult.mCommand = FindCommand(version ? "version" : "help");
    }

    void CheckPositionals(const Command& inCommand) const {
        for (std::size_t index = 0; index < inCommand.arguments.size(); ++index) {
            const Argument& argument = inCommand.arguments[index];
            if (index >= mResult.mPositionals.size()) {
                if (argument.required) {
                    throw UsageError("'zo " + inCommand.name + "' needs " + argument.name, &inCommand);
                }
                return;
            }
            CheckChoice(argument.name, mResult.mPositionals[index], argument.completes, argument.choices,
                        &inCommand);
        }
        const bool repeats = !inCommand.arguments.empty() && inCommand.arguments.back().repeats;
        if (!repeats && mResult.mPositionals.size() > inCommand.arguments.size()) {
            throw UsageError("'" + mResult.mPositionals[inCommand.arguments.size()] +
                                 "' is one argument too many for 'zo " + inCommand.name + "'",
                             &inCommand);
        }
    }

    const std::vector<std::string>& mWords;
    std::size_t mNext = 0;
    bool mOptionsEnded = false;
    Arguments mResult;
};

Arguments Arguments::Parse(const std::vector<std::string>& inWords) {
    return ArgumentsReader(inWords).Read();
}

std::optional<std::string> Arguments::Value(const std::string& inOption) const {
    const auto found = mOptions.find(inOption);
    return found == mOptions.end() ? std::nullopt : std::optional(found->second);
}

std::string Arguments::ValueOr(const std::string& inOption, const std::string& inDefault) const {
    return Value(inOption).value_or(inDefault);
}

std::optional<std::string> Arguments::Positional(std::size_t inIndex) const {
    return inIndex < mPositionals.size() ? std::optional(mPositionals[inIndex]) : std::nullopt;
}

std::vector<std::string> Arguments::PositionalsFrom(std::size_t inIndex) const {
    const auto begin =
        mPositionals.begin() + static_cast<std::ptrdiff_t>(std::min(inIndex, mPositionals.size()));
    return {begin, mPositionals.end()};
}

bool AsksForJson(const std::vector<std::string>& inWords) {
    const auto end = std::find(inWords.begin(), inWords.end(), "--");
    return std::find(inWords.begin(), end, "--json") != end;
}

}  // namespace zo
