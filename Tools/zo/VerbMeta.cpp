// help, version, completion, man: what zo says about itself.
#include "Completions.h"
#include "Context.h"
#include "Failure.h"
#include "FileWriter.h"
#include "Help.h"
#include "ManPages.h"
#include "ostcore/filesupport/File.h"
#include "Verbs.h"
#include "ZOClient/Library.h"

#ifndef ZO_VERSION
#define ZO_VERSION "0"
#endif

namespace zo {
namespace {

Json OptionJson(const Option& inOption) {
    Json json = Json::Part();
    json.Set("name", inOption.name)
        .Set("letter", inOption.letter ? std::string(1, inOption.letter) : std::string())
        .Set("value", inOption.valueName);
    return json.Set("help", inOption.help).SetList("choices", inOption.choices);
}

Json CommandJson(const Command& inCommand) {
    std::vector<Json> options;
    for (const Option& option : OptionsOf(inCommand)) {
        options.push_back(OptionJson(option));
    }
    std::vector<Json> arguments;
    for (const Argument& argument : inCommand.arguments) {
        Json json = Json::Part();
        json.Set("name", argument.name).Set("help", argument.help).Set("required", argument.required);
        arguments.push_back(json.SetList("choices", argument.choices));
    }
    std::vector<int> codes;
    for (const ExitCode code : ExitCodesOf(inCommand)) {
        codes.push_back(static_cast<int>(code));
    }
    Json json("command");
    json.Set("name", inCommand.name)
        .Set("summary", inCommand.summary)
        .Set("description", inCommand.description);
    return json.SetList("arguments", arguments).SetList("options", options).SetList("exitCodes", codes);
}

const Command& NamedCommand(const std::string& inName) {
    const Command* command = FindCommand(inName);
    if (!command) {
        throw Failure(ExitCode::Usage, "zo has no verb '" + inName + "'", "'zo help' lists the verbs");
    }
    return *command;
}

void WriteDocument(const std::string& inPath, const std::string& inText) {
    WriteFileWhole(inPath, inText, Overwrite::Replace);
}

void WriteAllPages(Context& ioContext, const std::string& inDirectory) {
    MakeDirectory(inDirectory);
    for (const auto& [name, page] : AllManPages()) {
        const std::string path = inDirectory + "/" + name;
        WriteDocument(path, page);
        ioContext.Out().Record(Json("man").Set("page", name).Set("path", path).Set("text", nullptr));
    }
}

}  // namespace

void RunHelp(Context& ioContext) {
    const auto verb = ioContext.Args().Positional(0);
    Output& out = ioContext.Out();
    for (const Command& command : AllCommands()) {
        if (!verb || command.name == *verb) {
            out.Record(CommandJson(command));
        }
    }
    if (!out.IsJson()) {
        out.Raw(verb ? CommandHelp(NamedCommand(*verb)) : OverviewHelp());
    } else if (verb) {
        NamedCommand(*verb);
    }
}

void RunVersion(Context& ioContext) {
    const std::string oldest =
        std::to_string(ZOCL::kServerMajorVersion) + "." + std::to_string(ZOCL::kServerMinorVersion);
    ioContext.Out().Record(Json("version").Set("version", ZO_VERSION).Set("oldestServer", oldest));
    ioContext.Out().Line(std::string("zo ") + ZO_VERSION + " (works with hubs from version " + oldest +
                         " on)");
}

void RunCompletion(Context& ioContext) {
    const std::string shell = *ioContext.Args().Positional(0);
    const std::string script = shell == "bash"  ? BashCompletion()
                               : shell == "zsh" ? ZshCompletion()
                                                : FishCompletion();
    Output& out = ioContext.Out();
    if (const auto path = ioContext.Args().Value("output")) {
        WriteDocument(*path, script);
        out.Record(Json("completion").Set("shell", shell).Set("path", *path).Set("text", nullptr));
        return;
    }
    out.Record(Json("completion").Set("shell", shell).Set("path", nullptr).Set("text", script));
    if (!out.IsJson()) {
        out.Raw(script);
    }
}

void RunMan(Context& ioContext) {
    const Arguments& args = ioContext.Args();
    if (args.Has("all") != args.Has("output")) {
        throw Failure(ExitCode::Usage, "--all and --output go together");
    }
    if (args.Has("all")) {
        return WriteAllPages(ioContext, args.ValueOr("output", ""));
    }
    const auto verb = args.Positional(0);
    const std::string page = verb ? CommandManPage(NamedCommand(*verb)) : OverviewManPage();
    const std::string name = verb ? "zo-" + *verb + ".1" : "zo.1";
    ioContext.Out().Record(Json("man").Set("page", name).Set("path", nullptr).Set("text", page));
    if (!ioContext.Out().IsJson()) {
        ioContext.Out().Raw(page);
    }
}

}  // namespace zo
