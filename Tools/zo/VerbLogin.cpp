// login, logout, whoami: the user's session at the hub.
#include <filesystem>

#include "Context.h"
#include "Failure.h"
#include "ostcore/utility/StringConversion.h"
#include "PasswordInput.h"
#include "Productions.h"
#include "ServerAddress.h"
#include "StoredToken.h"
#include "Verbs.h"
#include "ZOClient/IZOCUser.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF8;

// A token that was taken out of the registry and comes back unless a new login succeeds. With the old token
// in place a wrong password would go unnoticed.
class TokenAside {
public:
    explicit TokenAside(const std::string& inUser) : mStored(inUser), mToken(mStored.Take()) {}
    ~TokenAside() {
        if (!mToken) {
            return;
        }
        try {
            mStored.PutBack(*mToken);
        } catch (const Failure&) {
            // The login is lost then; the failure that ends the verb is told, and the next verb asks for a
            // new one.
        }
    }
    TokenAside(const TokenAside&) = delete;
    TokenAside& operator=(const TokenAside&) = delete;
    void Forget() { mToken.reset(); }

private:
    StoredToken mStored;
    std::optional<std::u16string> mToken;
};

std::string ObtainUser(Context& ioContext, const Target& inTarget) {
    if (!inTarget.user.empty()) {
        return inTarget.user;
    }
    std::string user;
    if (ioContext.Out().MayAsk()) {
        user = AskOnTerminal("User: ", ioContext.Signals());
    }
    if (user.empty() || !IsUsableUserName(user)) {
        throw Failure(ExitCode::Usage, "no user is named", "give --user NAME");
    }
    return user;
}

std::string ObtainPassword(Context& ioContext, const Target& inTarget) {
    const Arguments& args = ioContext.Args();
    if (args.Has("password-stdin")) {
        return PasswordFromStandardInput(ioContext.Signals());
    }
    if (const auto file = args.Value("password-file")) {
        return PasswordFromFile(*file);
    }
    if (!ioContext.Out().MayAsk()) {
        throw Failure(ExitCode::Usage, "there is no password and no terminal to ask for it",
                      "give --password-file FILE or --password-stdin");
    }
    return AskPassword("Password of " + inTarget.user + " at " + inTarget.server + ": ", ioContext.Signals());
}

void RefuseOpenPassword(const Context& inContext, const Target& inTarget) {
    if (!inTarget.secure && !IsLoopbackAddress(inTarget.server) && !inContext.Args().Has("plain")) {
        throw Failure(ExitCode::Usage,
                      "the password would cross the network to " + inTarget.server + " unencrypted",
                      "use https://, or say --plain if that is what you want");
    }
}

std::string AuthorityFileToRemember(const Context& inContext) {
    const auto file = inContext.Args().Value("ca");
    return file ? std::filesystem::absolute(*file).lexically_normal().string() : std::string();
}

ZOCL::InterfaceRef<ZOCL::IZOCDataServer> SignIn(Context& ioContext, const Target& inTarget) {
    ZOCL::ZOSCredentials credentials;
    credentials.username = ZOCL::ImmutableString(inTarget.user);
    credentials.password = ObtainPassword(ioContext, inTarget);
    const auto outcome = ioContext.Loop().Connect([&](ZOCL::Guid& outRequest, const auto& inCompletion) {
        return ZOCL::IZOCDataServer::ConnectToServer(ZOCL::ImmutableString(inTarget.server), credentials,
                                                     outRequest, inTarget.secure, inCompletion, false, true);
    });
    const std::string what = "signing in to " + inTarget.server + " as " + inTarget.user;
    if (!outcome.started || outcome.result < 0) {
        const bool refused = ExitCodeFor(outcome.result, outcome.response) == ExitCode::NotAuthenticated;
        throw Failure::OfRequest(what, outcome.result, outcome.response,
                                 refused ? "check user name and password" : "");
    }
    if (!outcome.server) {
        throw Failure(ExitCode::NotAuthenticated, what + ": the hub gave no login",
                      "check the address of the hub");
    }
    return outcome.server;
}

}  // namespace

void RunLogin(Context& ioContext) {
    if (ioContext.Args().Has("password-stdin") && ioContext.Args().Has("password-file")) {
        throw Failure(ExitCode::Usage, "--password-file and --password-stdin exclude each other");
    }
    Target target = ioContext.FindTarget();
    RefuseOpenPassword(ioContext, target);
    target.user = ObtainUser(ioContext, target);
    Json json("login");
    json.Set("server", target.server).Set("user", target.user).Set("secure", target.secure);
    if (ioContext.Args().Has("dry-run")) {
        ioContext.Out().Record(json.Set("dryRun", true));
        ioContext.Out().Say("would sign in to " + target.server + " as " + target.user);
        return;
    }
    ioContext.StartLibrary();
    ApplyTransport(TransportFlagsOf(ioContext.Args()), target.authorityFile, ioContext.Settings());
    TokenAside former(target.user);
    const auto server = SignIn(ioContext, target);
    former.Forget();
    const std::string named = AuthorityFileToRemember(ioContext);
    ioContext.Remembered().SetLogin(
        {target.server, target.user, target.secure, named.empty() ? target.authorityFile : named});
    json.Set("serverName", server->GetServerName()).Set("serverVersion", server->GetServerVersion());
    ioContext.Out().Record(json.Set("dryRun", false));
    ioContext.Out().Say("signed in to " + target.server + " as " + target.user);
}

void RunLogout(Context& ioContext) {
    const Target target = ioContext.FindTarget();
    if (!target.isKnown) {
        throw Failure(ExitCode::NotAuthenticated, "nobody is signed in at " + target.server,
                      "there is nothing to do");
    }
    Json json("logout");
    json.Set("server", target.server).Set("user", target.user);
    if (ioContext.Args().Has("dry-run")) {
        ioContext.Out().Record(json.Set("dryRun", true));
        ioContext.Out().Say("would sign out " + target.user + " at " + target.server);
        return;
    }
    ioContext.StartLibrary();
    // The library forgets it together with the login.
    const bool hadToken = StoredToken(target.user).Exists();
    std::string trouble;
    try {
        ioContext.Server();
        ZOCL::IZOCDataServer::Terminate(true);
    } catch (const Failure& failure) {
        // An expired login has ended by itself.
        trouble = failure.Code() == ExitCode::NotAuthenticated ? "" : failure.what();
    }
    StoredToken(target.user).Take();
    ioContext.Out().Record(json.Set("endedAtHub", trouble.empty()).Set("dryRun", false));
    if (!trouble.empty()) {
        throw Failure(
            ExitCode::PartlyDone,
            "the token was removed from this machine, but the login could not be ended at the hub: " +
                trouble,
            "at the hub it ends when it expires");
    }
    ioContext.Out().Say((hadToken ? "signed out " : "was not signed in: ") + target.user + " at " +
                        target.server);
}

void RunWhoAmI(Context& ioContext) {
    const auto server = ioContext.Server();
    const auto user = server->GetLoggedInUser();
    LoadResource(ioContext, user, "asking " + ioContext.ConnectedTarget().server + " who is signed in");
    const Target& target = ioContext.ConnectedTarget();
    Json json("user");
    json.Set("user", target.user)
        .Set("id", user->GetUserID())
        .Set("firstName", user->GetFirstName())
        .Set("lastName", user->GetLastName());
    json.Set("email", user->GetEmail()).Set("server", target.server).Set("secure", target.secure);
    json.Set("serverName", server->GetServerName()).Set("serverVersion", server->GetServerVersion());
    Output& out = ioContext.Out();
    out.Record(json);
    const std::string fullName = ToUTF8(user->GetFirstName()) + " " + ToUTF8(user->GetLastName());
    out.Field("user", target.user + (fullName == " " ? "" : " (" + fullName + ")"));
    if (!user->GetEmail().empty()) {
        out.Field("email", user->GetEmail());
    }
    out.Field("hub", target.server);
    out.Field("hub name", server->GetServerName().str() + " " + server->GetServerVersion().str());
}

}  // namespace zo
