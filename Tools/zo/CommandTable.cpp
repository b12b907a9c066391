// The table of verbs, as data.
#include "CommandTable.h"

#include <algorithm>

#include "Verbs.h"

namespace zo {
namespace {

const Option kDryRun{"dry-run", 'n', "", "Tell what would be done and do nothing."};
const Option kShared{"shared", 0, "",
                     "Read the shared production at the open commit, also when a session is in use."};
const Option kForce{"force", 'f', "", "Replace files that exist already."};

const std::vector<ExitCode> kOfRequests{ExitCode::NotAuthenticated, ExitCode::NotPermitted,
                                        ExitCode::NotFound, ExitCode::Network, ExitCode::Tls};
const std::vector<ExitCode> kOfConnections{ExitCode::NotAuthenticated, ExitCode::NotPermitted,
                                           ExitCode::Network, ExitCode::Tls};

Command Hub() {
    return {
        "hub",
        "start, stop or look at a hub of your own",
        "Runs zohub for one person on this machine, bound to the loopback interface, with its own data "
        "directory under the state directory. 'start' waits until the hub answers and prints its address; a "
        "hub that runs already is left alone. 'stop' ends it cleanly. The program zohub is looked for in "
        "ZOCLIENT_ZOHUB, beside zo, in ../libexec/zoclient and in PATH.",
        {{"ACTION", "What to do.", true, Completes::Choices, {"start", "stop", "status"}}},
        {{"data", 0, "DIR", "Keep the hub's data in DIR.", Completes::Directories},
         {"port", 0, "PORT", "Listen here for plain HTTP; 0 takes any free port."},
         {"tls-port", 0, "PORT", "Listen here for TLS; 0 takes any free port, the default with --port 0."},
         {"user", 'u', "NAME", "With start: add this user to the hub; needs --password-file."},
         {"password-file", 0, "FILE", "The new user's password is the first line of FILE.", Completes::Files},
         kDryRun},
        false,
        {{"zo hub start", "Start the hub on its usual ports."},
         {"zo hub start --port 0 --user ada --password-file pw", "Start it on a free port and add a user."},
         {"zo hub status --json", "One JSON object that tells whether it runs and where."}},
        {ExitCode::NotFound},
        RunHub};
}

Command Login() {
    return {
        "login",
        "sign in to a hub",
        "Signs in and remembers hub and user for the verbs that follow; the token is kept in the user's "
        "registry (mode 0600), the password nowhere. Without --password-file and --password-stdin the "
        "password is asked for on the terminal; off a terminal nothing is ever asked. A hub named without a "
        "scheme is reached over TLS unless --plain is given. A password is sent unencrypted to another "
        "machine only with --plain.",
        {},
        {{"password-file", 0, "FILE", "The password is the first line of FILE.", Completes::Files},
         {"password-stdin", 0, "", "The password is the first line of standard input."},
         {"secure", 0, "", "Use TLS (the default when --server has no scheme)."},
         {"plain", 0, "", "Use plain HTTP."},
         kDryRun},
        true,
        {{"zo login --server https://hub.example:60137 --user ada", "Sign in; the password is asked for."},
         {"zo login --server hub.example --user ada --password-file pw --ca hub-ca.pem",
          "Sign in from a script to a hub with its own authority, which is remembered."}},
        kOfConnections,
        RunLogin};
}

Command Logout() {
    return {
        "logout",
        "end the login and forget its token",
        "Ends the login at the hub and removes the token from this machine. When the hub cannot be reached "
        "the token is removed all the same and the exit code is 11: at the hub it then lives until it "
        "expires.",
        {},
        {kDryRun},
        true,
        {{"zo logout", "Sign out."}},
        {ExitCode::NotAuthenticated, ExitCode::PartlyDone},
        RunLogout};
}

Command WhoAmI() {
    return {"whoami",
            "show who is signed in, and where",
            "Asks the hub for the logged-in user, so it also tells whether the login is still good.",
            {},
            {},
            true,
            {{"zo whoami", "Name, user and hub."}},
            kOfConnections,
            RunWhoAmI};
}

Command Productions() {
    return {"productions",
            "list the productions of the hub",
            "Lists the productions that the user may see, or with --templates the templates.",
            {},
            {{"templates", 0, "", "List the templates from which productions are made."}},
            true,
            {{"zo productions", "A table of names, owners and dates."},
             {"zo productions --json", "One JSON object a production."}},
            kOfConnections,
            RunProductions};
}

Command Open() {
    return {
        "open",
        "open a production at a commit",
        "Loads a production and remembers it, with its commit, as the open production of this user; show, "
        "assets and get then work on exactly this commit until another one is opened, or until the first "
        "change or 'zo session show' brings the user's own session into use. PRODUCTION is a name, "
        "an identifier or a URL; without it the open production is meant. --latest goes on to the newest "
        "commit by the production's own latest-version link.",
        {{"PRODUCTION", "Name, identifier or URL; the open production when it is left out."}},
        {{"commit", 'c', "COMMIT", "Open this commit instead of the newest one."},
         {"latest", 0, "", "Follow the production to its latest version."},
         kDryRun},
        true,
        {{"zo open \"Harbour Film\"", "Open the newest commit."},
         {"zo open \"Harbour Film\" --commit 3f2a", "Open an older commit."},
         {"zo open --latest", "Move the open production to the newest commit."}},
        kOfRequests,
        RunOpen};
}

Command Show() {
    return {
        "show",
        "show a production or one of its assets",
        "Shows the open production, or another one at its newest commit: dates, commit, whether a newer "
        "commit exists, enclosures and how many assets of which type. With --asset it shows one asset with "
        "its locator, enclosures and renditions.",
        {{"PRODUCTION", "Name, identifier or URL; the open production when it is left out."}},
        {{"asset", 'a', "ASSET", "Show this asset, by name or identifier."}, kShared},
        true,
        {{"zo show", "The open production."}, {"zo show --asset clip01", "One asset of it."}},
        kOfRequests,
        RunShow};
}

Command Assets() {
    return {
        "assets",
        "list the assets of the open production",
        "Lists the assets at the open commit. --long adds what needs a closer look: where the media lies, "
        "the enclosures and the renditions.",
        {},
        {{"type",
          't',
          "TYPE",
          "Only assets of this type.",
          Completes::Choices,
          {"bin", "smartbin", "masterclip", "subclip", "sequence", "synthetic", "synthetic-sf",
           "composition"}},
         {"parent", 'p', "ASSET", "Only assets directly in this bin, by name or identifier."},
         {"long", 'l', "", "Add locators, enclosures and renditions."},
         kShared},
        true,
        {{"zo assets --type masterclip --long", "All clips with everything known of them."},
         {"zo assets --json", "One JSON object an asset."}},
        kOfRequests,
        RunAssets};
}

Command Get() {
    return {
        "get",
        "fetch enclosures and renditions of assets",
        "Writes payloads of an asset of the open production to files, byte for byte: one enclosure, one "
        "rendition, or everything the asset has. --all without ASSET fetches everything of every asset into "
        "one folder an asset. File names are made from the names at the hub with everything unsafe removed. "
        "A file appears under its name only when it is whole; one that exists already is kept unless --force "
        "is given.",
        {{"ASSET", "The asset, by name or identifier."}},
        {{"enclosure", 'e', "NAME", "Only the enclosure of this name."},
         {"rendition",
          'r',
          "FLAVOUR",
          "Only the rendition of this flavour, such as image/jpeg.",
          Completes::Choices,
          {"image/jpeg", "image/png", "video/mp4"}},
         {"all", 0, "", "All payloads; without ASSET those of all assets."},
         {"output", 'o', "PATH",
          "A file, a folder (existing, or with a slash at its end), or - for standard output.",
          Completes::Files},
         kShared,
         kForce,
         kDryRun},
        true,
        {{"zo get clip01 --rendition image/jpeg -o thumb.jpg", "One rendition into one file."},
         {"zo get clip01 -o clip01/", "All payloads of one asset into a folder."},
         {"zo get --all -o backup/", "Everything of every asset."}},
        {ExitCode::NotAuthenticated, ExitCode::NotPermitted, ExitCode::NotFound, ExitCode::Network,
         ExitCode::Tls, ExitCode::PartlyDone},
        RunGet};
}

Command Help() {
    return {"help",
            "show help for zo or one verb",
            "Shows the list of verbs, or all that a verb takes. With --json the command table itself.",
            {{"VERB", "The verb to explain.", false, Completes::Verbs}},
            {},
            false,
            {{"zo help get", "All about get."}},
            {},
            RunHelp};
}

Command Version() {
    return {"version",
            "show the version",
            "Shows the version of zo and the oldest hub that it works with.",
            {},
            {},
            false,
            {{"zo version", ""}},
            {},
            RunVersion};
}

Command Desk() {
    return {"desk",
            "open the desktop window",
            "Starts zo-desk, the desktop host, with this hub and user and the login of zo: the assets of a "
            "production as a tree, their metadata to edit, and buttons to share, get the latest and resolve. "
            "zo-desk must lie beside zo; it is built where Qt 6 is found.",
            {{"PRODUCTION", "By name or identifier; the open one when it is left out.", false}},
            {},
            true,
            {{"zo desk 'Harbour Film'", "Work on a production."}},
            {ExitCode::NotFound},
            RunDesk};
}

Command Completion() {
    return {"completion",
            "print a completion script for a shell",
            "Prints the script that makes a shell complete zo's verbs and options.",
            {{"SHELL", "The shell.", true, Completes::Choices, {"bash", "zsh", "fish"}}},
            {{"output", 'o', "FILE", "Write to FILE instead of standard output, replacing it.",
              Completes::Files}},
            false,
            {{"source <(zo completion bash)", "Completion in the running bash."}},
            {},
            RunCompletion};
}

Command Man() {
    return {"man",
            "print a manual page",
            "Prints the manual page of zo or of one verb as roff. --all writes all pages into a folder.",
            {{"VERB", "The verb; the page of zo itself when it is left out.", false, Completes::Verbs}},
            {{"all", 0, "", "Write every page; needs --output."},
             {"output", 'o', "DIR", "With --all: the folder, made if needed.", Completes::Directories}},
            false,
            {{"zo man get | man -l -", "Read the page of get."}},
            {},
            RunMan};
}

}  // namespace

const char* const kToolSummary = "work with productions on a collaboration hub";
const char* const kToolDescription =
    "zo signs in to a hub, lists and opens productions, shows their assets and fetches their payloads. It "
    "opens productions at a commit, so that what a script reads does not move under it. Changes go into the "
    "user's own session, each in a transaction that is committed or rolled back; the session is shared with "
    "others, and gets their latest commits, by one verb each. Every verb takes --json and then writes one "
    "JSON object a line on standard output; errors and progress are JSON lines on standard error.";

const std::vector<Command>& AllCommands() {
    static const std::vector<Command> table = [] {
        std::vector<Command> all{Hub(),  Login(), Logout(), WhoAmI(), Productions(),
                                 Open(), Show(),  Assets(), Get()};
        for (const auto& commands :
             {WorkCommands(), std::vector<Command>{Desk(), Help(), Version(), Completion(), Man()}}) {
            all.insert(all.end(), commands.begin(), commands.end());
        }
        return all;
    }();
    return table;
}

const Command* FindCommand(const std::string& inName) {
    for (const Command& command : AllCommands()) {
        if (command.name == inName) {
            return &command;
        }
    }
    return nullptr;
}

const std::vector<Option>& CommonOptions() {
    static const std::vector<Option> table{
        {"json", 0, "", "Write one JSON object a line."},
        {"quiet", 'q', "", "Write results and errors only."},
        {"no-input", 0, "", "Ask nothing, also on a terminal."},
        {"color",
         0,
         "WHEN",
         "Use colours: auto, always or never.",
         Completes::Choices,
         {"auto", "always", "never"}},
        {"help", 'h', "", "Show help and exit."},
    };
    return table;
}

const std::vector<Option>& ConnectionOptions() {
    static const std::vector<Option> table{
        {"server", 's', "URL", "The hub; the one of the last login when it is left out."},
        {"user", 'u', "NAME", "The user; the one of the last login when it is left out."},
        {"ca", 0, "FILE", "Trust the authorities in this PEM file, and no others.", Completes::Files},
        {"proxy", 0, "URL", "Reach the hub through this proxy."},
    };
    return table;
}

std::vector<Option> OptionsOf(const Command& inCommand) {
    std::vector<Option> all = inCommand.options;
    if (inCommand.connects) {
        all.insert(all.end(), ConnectionOptions().begin(), ConnectionOptions().end());
    }
    all.insert(all.end(), CommonOptions().begin(), CommonOptions().end());
    return all;
}

std::vector<ExitCode> ExitCodesOf(const Command& inCommand) {
    std::vector<ExitCode> all{ExitCode::Ok, ExitCode::Failure, ExitCode::Usage, ExitCode::Cancelled};
    all.insert(all.end(), inCommand.exitCodes.begin(), inCommand.exitCodes.end());
    std::sort(all.begin(), all.end());
    return all;
}

const std::vector<EnvironmentVariable>& EnvironmentVariables() {
    static const std::vector<EnvironmentVariable> table{
        {"ZOCLIENT_SERVER", "The hub, when --server is not given; before the one of the last login."},
        {"ZOCLIENT_USER", "The user, when --user is not given; before the one of the last login."},
        {"ZOCLIENT_CA_FILE", "Authorities to trust, when --ca is not given."},
        {"ZOCLIENT_PROXY", "The proxy, when --proxy is not given."},
        {"SSL_CERT_FILE, SSL_CERT_DIR", "Authorities to trust, after ZOCLIENT_CA_FILE."},
        {"HTTPS_PROXY, http_proxy, NO_PROXY", "The usual proxy settings, after ZOCLIENT_PROXY."},
        {"ZOCLIENT_ZOHUB", "The program that 'zo hub start' starts."},
        {"ZOCLIENT_CONFIG_HOME, ZOCLIENT_STATE_HOME",
         "Where registry and zo.conf, and where state and the hub's data lie; else the XDG directories."},
        {"ZOCLIENT_CACHE_HOME", "Where payloads are kept that were fetched before; else the XDG directory."},
        {"NO_COLOR", "When set and not empty: no colours, unless --color always."},
        {"COLUMNS", "The width of the terminal, when it cannot be asked."},
    };
    return table;
}

}  // namespace zo
