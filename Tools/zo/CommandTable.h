// The one table of all verbs: what they take, what they mean, how they end. Parsing, help, man pages and
// completions are all made from it.
#pragma once

#include <string>
#include <vector>

#include "ExitCodes.h"

namespace zo {

class Context;

/// What a shell offers when the value is being typed.
enum class Completes { Nothing, Files, Directories, Choices, Verbs };

struct Option {
    /// Without the dashes.
    std::string name;
    /// 0 when there is none.
    char letter = 0;
    /// Empty for a switch.
    std::string valueName;
    std::string help;
    Completes completes = Completes::Nothing;
    std::vector<std::string> choices = {};

    bool TakesValue() const { return !valueName.empty(); }
};

struct Argument {
    std::string name;
    std::string help;
    bool required = false;
    Completes completes = Completes::Nothing;
    std::vector<std::string> choices = {};
    /// The last argument may stand for any number of words.
    bool repeats = false;
};

struct Example {
    std::string commandLine;
    std::string meaning;
};

struct Command {
    std::string name;
    std::string summary;
    std::string description;
    std::vector<Argument> arguments;
    std::vector<Option> options;
    /// Whether the options of a connection apply.
    bool connects = false;
    std::vector<Example> examples;
    /// Beside ok, failure, usage and cancelled, which every verb can end with.
    std::vector<ExitCode> exitCodes;
    void (*run)(Context&) = nullptr;
};

const std::vector<Command>& AllCommands();
/// The part of the table with which a user works in a session: writing, sharing, getting, looking.
std::vector<Command> WorkCommands();
/// Null when there is no such verb.
const Command* FindCommand(const std::string& inName);
/// Options that every verb takes.
const std::vector<Option>& CommonOptions();
/// Options of every verb that talks to a hub.
const std::vector<Option>& ConnectionOptions();
/// All options that a verb takes: its own, those of a connection, the common ones.
std::vector<Option> OptionsOf(const Command& inCommand);
/// All exit codes that a verb can end with, in numeric order.
std::vector<ExitCode> ExitCodesOf(const Command& inCommand);

/// What the tool is, for help and manual.
extern const char* const kToolSummary;
extern const char* const kToolDescription;

struct EnvironmentVariable {
    std::string name;
    std::string meaning;
};
const std::vector<EnvironmentVariable>& EnvironmentVariables();

}  // namespace zo
