// hub: a hub of one's own, started, stopped and looked at.
#include <filesystem>

#include "Context.h"
#include "Failure.h"
#include "LocalHub.h"
#include "ostcore/config/StateDirectories.h"
#include "ServerAddress.h"
#include "Verbs.h"

namespace zo {
namespace {

Json HubJson(const LocalHub& inHub, const char* inState, const std::optional<HubRecord>& inRecord) {
    Json json("hub");
    json.Set("state", inState).Set("data", inHub.DataDirectory()).Set("log", inHub.LogPath());
    json.Set("url", inRecord ? inRecord->httpURL : std::string());
    json.Set("tlsUrl", inRecord ? inRecord->tlsURL : std::string());
    json.Set("caFile", inRecord ? inRecord->authorityFile : std::string());
    return inRecord ? json.Set("pid", inRecord->pid) : json.Set("pid", nullptr);
}

void ShowHub(Context& ioContext, const LocalHub& inHub, const HubRecord& inRecord) {
    Output& out = ioContext.Out();
    out.Field("url", inRecord.httpURL);
    if (!inRecord.tlsURL.empty()) {
        out.Field("tls url", inRecord.tlsURL);
        out.Field("authority", inRecord.authorityFile);
    }
    out.Field("data", inHub.DataDirectory());
    out.Field("process", std::to_string(inRecord.pid));
}

void CheckPort(const Arguments& inArgs, const std::string& inOption) {
    const auto port = inArgs.Value(inOption);
    if (!port) {
        return;
    }
    const bool digits =
        !port->empty() && port->size() <= 5 && port->find_first_not_of("0123456789") == std::string::npos;
    if (!digits || std::stoi(*port) > 65535) {
        throw Failure(ExitCode::Usage, "--" + inOption + " cannot be '" + *port + "'",
                      "it is a number from 0 to 65535");
    }
}

void CheckUser(const Arguments& inArgs) {
    const auto user = inArgs.Value("user");
    if (user.has_value() != inArgs.Has("password-file")) {
        throw Failure(ExitCode::Usage, "--user and --password-file go together");
    }
    if (user && (user->empty() || user->front() == '-' || !IsUsableUserName(*user))) {
        throw Failure(ExitCode::Usage, "'" + *user + "' cannot be a user name",
                      "it begins with no dash and holds no control characters");
    }
}

void Start(Context& ioContext, LocalHub& ioHub) {
    const Arguments& args = ioContext.Args();
    CheckPort(args, "port");
    CheckPort(args, "tls-port");
    CheckUser(args);
    const std::optional<HubRecord> before = ioHub.Running();
    if (args.Has("dry-run")) {
        ioContext.Out().Record(HubJson(ioHub, before ? "running" : "stopped", before).Set("dryRun", true));
        ioContext.Out().Say(before ? "the hub runs already" : "would start " + LocalHub::FindProgram());
        return;
    }
    if (const auto user = args.Value("user")) {
        ioHub.AddUser(*user, args.ValueOr("password-file", ""));
        ioContext.Out().Say("added the user " + *user);
    }
    const HubRecord hub = ioHub.Start(args.Value("port"), args.Value("tls-port"));
    ioContext.Out().Record(
        HubJson(ioHub, "running", hub).Set("started", !before.has_value()).Set("dryRun", false));
    ioContext.Out().Say(before ? "the hub runs already" : "the hub is running");
    ShowHub(ioContext, ioHub, hub);
}

void Stop(Context& ioContext, LocalHub& ioHub) {
    const std::optional<HubRecord> hub = ioHub.Running();
    const bool dryRun = ioContext.Args().Has("dry-run");
    if (hub && !dryRun) {
        ioHub.Stop(*hub);
    }
    const bool runs = hub && dryRun;
    ioContext.Out().Record(HubJson(ioHub, runs ? "running" : "stopped", runs ? hub : std::nullopt)
                               .Set("stopped", hub && !dryRun)
                               .Set("dryRun", dryRun));
    ioContext.Out().Say(!hub ? "no hub was running" : dryRun ? "would stop the hub" : "the hub has ended");
}

}  // namespace

void RunHub(Context& ioContext) {
    const Arguments& args = ioContext.Args();
    const std::string chosen =
        args.Value("data").value_or(ostcore::config::GetStateDirectory().SubDir("hub").Path());
    LocalHub hub(std::filesystem::absolute(chosen).lexically_normal().string(), ioContext.Signals());
    const std::string action = *args.Positional(0);
    if (action == "start") {
        return Start(ioContext, hub);
    }
    if (action == "stop") {
        return Stop(ioContext, hub);
    }
    const std::optional<HubRecord> running = hub.Running();
    ioContext.Out().Record(HubJson(hub, running ? "running" : "stopped", running));
    if (!running) {
        throw Failure(ExitCode::NotFound, "no hub is running on " + hub.DataDirectory(),
                      "start one with 'zo hub start'");
    }
    ShowHub(ioContext, hub, *running);
}

}  // namespace zo
