// Lays out help for a terminal of 80 columns.
#include "Help.h"

#include <algorithm>

namespace zo {
namespace {

constexpr std::size_t kWidth = 80;
constexpr std::size_t kTextColumn = 26;

// Breaks a text at blanks; every line but the first begins with the indent.
std::string Wrapped(const std::string& inText, std::size_t inIndent) {
    std::string result;
    std::size_t column = inIndent;
    for (std::size_t start = 0; start < inText.size();) {
        const std::size_t end = std::min(inText.find(' ', start), inText.size());
        const std::size_t length = end - start;
        const bool isFirst = result.empty();
        if (!isFirst && column + 1 + length > kWidth) {
            result += "\n" + std::string(inIndent, ' ');
            column = inIndent;
        } else if (!isFirst) {
            result += ' ';
            ++column;
        }
        result += inText.substr(start, length);
        column += length;
        start = end + 1;
    }
    return result;
}

std::string Row(const std::string& inLeft, const std::string& inRight) {
    std::string line = "  " + inLeft;
    if (line.size() + 2 > kTextColumn) {
        line += "\n" + std::string(kTextColumn, ' ');
    } else {
        line += std::string(kTextColumn - line.size(), ' ');
    }
    return line + Wrapped(inRight, kTextColumn) + "\n";
}

std::string Choices(const std::vector<std::string>& inChoices) {
    std::string text;
    for (const std::string& choice : inChoices) {
        text += (text.empty() ? " One of " : ", ") + choice;
    }
    return text.empty() ? text : text + ".";
}

std::string OptionRows(const std::vector<Option>& inOptions) {
    std::string rows;
    for (const Option& option : inOptions) {
        rows += Row(OptionText(option), option.help + Choices(option.choices));
    }
    return rows;
}

}  // namespace

std::string SynopsisOf(const Command& inCommand) {
    std::string text = "zo " + inCommand.name + " [OPTIONS]";
    for (const Argument& argument : inCommand.arguments) {
        const std::string name = argument.name + (argument.repeats ? "..." : "");
        text += argument.required ? " " + name : " [" + name + "]";
    }
    return text;
}

std::string OptionText(const Option& inOption) {
    const std::string letter = inOption.letter ? std::string("-") + inOption.letter + ", " : "    ";
    return letter + "--" + inOption.name + (inOption.TakesValue() ? " " + inOption.valueName : "");
}

std::string OverviewHelp() {
    std::string text =
        std::string("zo - ") + kToolSummary + "\n\nUsage: zo VERB [OPTIONS] [ARGUMENTS]\n\nVerbs:\n";
    for (const Command& command : AllCommands()) {
        text += Row(command.name, command.summary);
    }
    text += "\nOptions of every verb:\n" + OptionRows(CommonOptions());
    text += "\nOptions of every verb that talks to a hub:\n" + OptionRows(ConnectionOptions());
    return text + "\n'zo help VERB' tells all about a verb.\n";
}

std::string CommandHelp(const Command& inCommand) {
    std::string text = "zo " + inCommand.name + " - " + inCommand.summary +
                       "\n\nUsage: " + SynopsisOf(inCommand) + "\n\n" + Wrapped(inCommand.description, 0) +
                       "\n";
    if (!inCommand.arguments.empty()) {
        text += "\nArguments:\n";
        for (const Argument& argument : inCommand.arguments) {
            text += Row(argument.name, argument.help + Choices(argument.choices));
        }
    }
    if (!inCommand.options.empty()) {
        text += "\nOptions:\n" + OptionRows(inCommand.options);
    }
    if (inCommand.connects) {
        text += "\nConnection:\n" + OptionRows(ConnectionOptions());
    }
    text += "\nCommon options:\n" + OptionRows(CommonOptions());
    text += "\nExamples:\n";
    for (const Example& example : inCommand.examples) {
        text += "  " + example.commandLine + "\n";
        if (!example.meaning.empty()) {
            text += "      " + Wrapped(example.meaning, 6) + "\n";
        }
    }
    text += "\nExit codes:\n";
    for (const ExitCode code : ExitCodesOf(inCommand)) {
        const auto row = std::find_if(AllExitCodes().begin(), AllExitCodes().end(),
                                      [&](const ExitCodeText& inRow) { return inRow.code == code; });
        text += Row(std::to_string(static_cast<int>(code)), row->meaning);
    }
    return text;
}

}  // namespace zo
