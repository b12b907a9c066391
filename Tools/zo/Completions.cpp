// Writes completion scripts for bash, zsh and fish.
#include "Completions.h"

#include <vector>

#include "CommandTable.h"

namespace zo {
namespace {

std::vector<std::string> VerbNames() {
    std::vector<std::string> names;
    for (const Command& command : AllCommands()) {
        names.push_back(command.name);
    }
    return names;
}

std::string Joined(const std::vector<std::string>& inWords) {
    std::string text;
    for (const std::string& word : inWords) {
        text += (text.empty() ? "" : " ") + word;
    }
    return text;
}

std::vector<std::string> ChoicesOf(Completes inCompletes, const std::vector<std::string>& inChoices) {
    return inCompletes == Completes::Verbs ? VerbNames() : inChoices;
}

// --- bash

std::string BashReply(Completes inCompletes, const std::vector<std::string>& inChoices) {
    switch (inCompletes) {
        case Completes::Files:
            return "COMPREPLY=($(compgen -f -- \"$cur\"))";
        case Completes::Directories:
            return "COMPREPLY=($(compgen -d -- \"$cur\"))";
        case Completes::Choices:
        case Completes::Verbs:
            return "COMPREPLY=($(compgen -W \"" + Joined(ChoicesOf(inCompletes, inChoices)) +
                   "\" -- \"$cur\"))";
        case Completes::Nothing:
            break;
    }
    return "COMPREPLY=()";
}

std::string BashPattern(const Option& inOption) {
    return (inOption.letter ? std::string("-") + inOption.letter + "|" : "") + "--" + inOption.name;
}

std::string BashVerb(const Command& inCommand) {
    std::string text = "    " + inCommand.name + ")\n      case \"$prev\" in\n";
    std::vector<std::string> words;
    for (const Option& option : OptionsOf(inCommand)) {
        words.push_back("--" + option.name);
        if (option.TakesValue()) {
            text += "        " + BashPattern(option) + ") " + BashReply(option.completes, option.choices) +
                    "; return ;;\n";
        }
    }
    text += "      esac\n      if [[ \"$cur\" == -* ]]; then\n        COMPREPLY=($(compgen -W \"" +
            Joined(words) + "\" -- \"$cur\"))\n      else\n        ";
    text += inCommand.arguments.empty()
                ? "COMPREPLY=()"
                : BashReply(inCommand.arguments.front().completes, inCommand.arguments.front().choices);
    return text + "\n      fi\n      ;;\n";
}

// --- zsh

std::string ZshEscaped(const std::string& inText) {
    std::string text;
    for (const char character : inText) {
        if (character == '[' || character == ']' || character == ':' || character == '\\') {
            text += '\\';
        }
        text += character == '\'' ? std::string("'\\''") : std::string(1, character);
    }
    return text;
}

std::string ZshAction(Completes inCompletes, const std::vector<std::string>& inChoices) {
    switch (inCompletes) {
        case Completes::Files:
            return "_files";
        case Completes::Directories:
            return "_files -/";
        case Completes::Choices:
        case Completes::Verbs:
            return "(" + Joined(ChoicesOf(inCompletes, inChoices)) + ")";
        case Completes::Nothing:
            break;
    }
    return " ";
}

std::string ZshOption(const Option& inOption) {
    const std::string help = "[" + ZshEscaped(inOption.help) + "]";
    const std::string value = inOption.TakesValue() ? ":" + ZshEscaped(inOption.valueName) + ":" +
                                                          ZshAction(inOption.completes, inOption.choices)
                                                    : "";
    std::string text =
        "        '--" + inOption.name + (inOption.TakesValue() ? "=" : "") + help + value + "' \\\n";
    if (inOption.letter) {
        text += std::string("        '-") + inOption.letter + (inOption.TakesValue() ? "+" : "") + help +
                value + "' \\\n";
    }
    return text;
}

// --- fish

std::string FishQuoted(const std::string& inText) {
    std::string text;
    for (const char character : inText) {
        if (character == '\'' || character == '\\') {
            text += '\\';
        }
        text += character;
    }
    return "'" + text + "'";
}

std::string FishValue(Completes inCompletes, const std::vector<std::string>& inChoices) {
    switch (inCompletes) {
        case Completes::Files:
            return " -r -F";
        case Completes::Directories:
            return " -x -a '(__fish_complete_directories)'";
        case Completes::Choices:
        case Completes::Verbs:
            return " -x -a " + FishQuoted(Joined(ChoicesOf(inCompletes, inChoices)));
        case Completes::Nothing:
            break;
    }
    return " -x";
}

std::string FishOption(const Command& inCommand, const Option& inOption) {
    std::string text =
        "complete -c zo -n '__fish_seen_subcommand_from " + inCommand.name + "' -l " + inOption.name;
    if (inOption.letter) {
        text += std::string(" -s ") + inOption.letter;
    }
    if (inOption.TakesValue()) {
        text += FishValue(inOption.completes, inOption.choices);
    }
    return text + " -d " + FishQuoted(inOption.help) + "\n";
}

}  // namespace

std::string BashCompletion() {
    std::string text =
        "# bash completion for zo\n_zo() {\n  local cur=\"${COMP_WORDS[COMP_CWORD]}\"\n"
        "  local prev=\"${COMP_WORDS[COMP_CWORD-1]}\"\n  local verb=\"\" word\n"
        "  for word in \"${COMP_WORDS[@]:1:COMP_CWORD-1}\"; do\n"
        "    case \"$word\" in -*) ;; *) verb=\"$word\"; break ;; esac\n  done\n"
        "  if [[ -z \"$verb\" ]]; then\n    COMPREPLY=($(compgen -W \"" +
        Joined(VerbNames()) + "\" -- \"$cur\"))\n    return\n  fi\n  case \"$verb\" in\n";
    for (const Command& command : AllCommands()) {
        text += BashVerb(command);
    }
    return text + "  esac\n}\ncomplete -F _zo zo\n";
}

std::string ZshCompletion() {
    std::string text = "#compdef zo\n_zo() {\n  local -a verbs\n  verbs=(\n";
    for (const Command& command : AllCommands()) {
        text += "    '" + command.name + ":" + ZshEscaped(command.summary) + "'\n";
    }
    text +=
        "  )\n  if (( CURRENT == 2 )); then\n    _describe 'verb' verbs\n    return\n  fi\n"
        "  local verb=${words[2]}\n  shift words\n  (( CURRENT-- ))\n  case $verb in\n";
    for (const Command& command : AllCommands()) {
        text += "    " + command.name + ")\n      _arguments -s \\\n";
        for (const Option& option : OptionsOf(command)) {
            text += ZshOption(option);
        }
        for (const Argument& argument : command.arguments) {
            text += std::string("        '") +
                    (argument.repeats    ? "*:"
                     : argument.required ? ":"
                                         : "::") +
                    ZshEscaped(argument.name) + ":" + ZshAction(argument.completes, argument.choices) +
                    "' \\\n";
        }
        text += "        && return\n      ;;\n";
    }
    return text + "  esac\n}\n_zo \"$@\"\n";
}

std::string FishCompletion() {
    std::string text = "# fish completion for zo\ncomplete -c zo -f\n";
    for (const Command& command : AllCommands()) {
        text += "complete -c zo -n __fish_use_subcommand -a " + command.name + " -d " +
                FishQuoted(command.summary) + "\n";
        for (const Option& option : OptionsOf(command)) {
            text += FishOption(command, option);
        }
        for (const Argument& argument : command.arguments) {
            if (argument.completes != Completes::Nothing) {
                text += "complete -c zo -n '__fish_seen_subcommand_from " + command.name + "'" +
                        FishValue(argument.completes, argument.choices) + "\n";
            }
        }
    }
    return text;
}

}  // namespace zo
