// Writes man(7) roff.
#include "ManPages.h"

#include <algorithm>

#include "Help.h"

#ifndef ZO_VERSION
#define ZO_VERSION "0"
#endif

namespace zo {
namespace {

// Text as roff takes it literally: no escapes, no requests at the beginning of a line, true minus signs.
std::string Roff(const std::string& inText) {
    std::string roff;
    for (const char character : inText) {
        const bool startsLine = roff.empty() || roff.back() == '\n';
        if (startsLine && (character == '.' || character == '\'')) {
            roff += "\\&";
        }
        switch (character) {
            case '\\':
                roff += "\\e";
                break;
            case '-':
                roff += "\\-";
                break;
            default:
                roff += character;
        }
    }
    return roff;
}

std::string Quoted(const std::string& inText) {
    std::string text = Roff(inText);
    for (std::size_t at = text.find('"'); at != std::string::npos; at = text.find('"', at + 4)) {
        text.replace(at, 1, "\\(dq");
    }
    return "\"" + text + "\"";
}

std::string Header(const std::string& inTitle, const std::string& inSummary) {
    return ".TH " + Quoted(inTitle) + " 1 \"\" " + Quoted(std::string("zo ") + ZO_VERSION) +
           " \"User Commands\"\n" + ".SH NAME\n" + Roff(inTitle) + " \\- " + Roff(inSummary) + "\n";
}

std::string Term(const std::string& inTerm, const std::string& inText) {
    return ".TP\n.B " + Quoted(inTerm) + "\n" + Roff(inText) + "\n";
}

std::string Choices(const std::vector<std::string>& inChoices) {
    std::string text;
    for (const std::string& choice : inChoices) {
        text += (text.empty() ? " One of " : ", ") + choice;
    }
    return text.empty() ? text : text + ".";
}

std::string Options(const std::string& inTitle, const std::vector<Option>& inOptions) {
    std::string text = ".SH " + Quoted(inTitle) + "\n";
    for (const Option& option : inOptions) {
        std::string term = OptionText(option);
        term.erase(0, term.find_first_not_of(' '));
        text += Term(term, option.help + Choices(option.choices));
    }
    return text;
}

std::string ExitStatus(const std::vector<ExitCode>& inCodes) {
    std::string text = ".SH EXIT STATUS\n";
    for (const ExitCodeText& row : AllExitCodes()) {
        if (std::find(inCodes.begin(), inCodes.end(), row.code) != inCodes.end()) {
            text += Term(std::to_string(static_cast<int>(row.code)), row.meaning);
        }
    }
    return text;
}

}  // namespace

std::string OverviewManPage() {
    std::string page = Header("zo", kToolSummary) + ".SH SYNOPSIS\n.B zo\n.I VERB\n[OPTIONS] [ARGUMENTS]\n" +
                       ".SH DESCRIPTION\n" + Roff(kToolDescription) + "\n.SH VERBS\n";
    for (const Command& command : AllCommands()) {
        page += Term(command.name, command.summary + ". See zo-" + command.name + "(1).");
    }
    page += Options("OPTIONS", CommonOptions()) + Options("CONNECTION OPTIONS", ConnectionOptions());
    page += ".SH ENVIRONMENT\n";
    for (const EnvironmentVariable& variable : EnvironmentVariables()) {
        page += Term(variable.name, variable.meaning);
    }
    page += ".SH FILES\n" +
            Term("zo.conf",
                 "In the configuration directory: lines 'key = value' with the keys server, user, ca, "
                 "proxy and no-proxy. It counts after flags, environment and the last login.") +
            Term("zo.json",
                 "In the state directory, mode 0600: who signed in where, and the open production of "
                 "each. It holds no token.");
    std::vector<ExitCode> codes;
    for (const ExitCodeText& row : AllExitCodes()) {
        codes.push_back(row.code);
    }
    return page + ExitStatus(codes);
}

std::string CommandManPage(const Command& inCommand) {
    std::string page = Header("zo-" + inCommand.name, inCommand.summary) + ".SH SYNOPSIS\n.B " +
                       Quoted("zo " + inCommand.name) + "\n" +
                       Roff(SynopsisOf(inCommand).substr(4 + inCommand.name.size())) + "\n.SH DESCRIPTION\n" +
                       Roff(inCommand.description) + "\n";
    if (!inCommand.arguments.empty()) {
        page += ".SH ARGUMENTS\n";
        for (const Argument& argument : inCommand.arguments) {
            page += Term(argument.name, argument.help + Choices(argument.choices));
        }
    }
    page += Options("OPTIONS", OptionsOf(inCommand)) + ".SH EXAMPLES\n";
    for (const Example& example : inCommand.examples) {
        page += Term(example.commandLine, example.meaning.empty() ? inCommand.summary : example.meaning);
    }
    return page + ExitStatus(ExitCodesOf(inCommand)) + ".SH SEE ALSO\n.BR zo (1)\n";
}

std::vector<std::pair<std::string, std::string>> AllManPages() {
    std::vector<std::pair<std::string, std::string>> pages{{"zo.1", OverviewManPage()}};
    for (const Command& command : AllCommands()) {
        pages.emplace_back("zo-" + command.name + ".1", CommandManPage(command));
    }
    return pages;
}

}  // namespace zo
