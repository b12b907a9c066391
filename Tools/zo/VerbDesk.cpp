// desk: hands over to zo-desk, the desktop host, with zo's hub, user, login and open production.
#include <stdlib.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>

#include "Context.h"
#include "Failure.h"
#include "ostnet/NetworkSettings.h"
#include "Verbs.h"

namespace zo {
namespace {

namespace fs = std::filesystem;

std::string FindDesk() {
    std::error_code error;
    const fs::path program = fs::read_symlink("/proc/self/exe", error).parent_path() / "zo-desk";
    if (error || ::access(program.c_str(), X_OK) != 0) {
        throw Failure(ExitCode::NotFound, "the program zo-desk is not beside zo (" + program.string() + ")",
                      "install it; it is built where Qt 6 is found");
    }
    return program.string();
}

bool IsHubNamed(Context& ioContext) {
    return ioContext.Args().Has("server") || Environment("ZOCLIENT_SERVER") ||
           !ioContext.Remembered().Logins().empty() || ioContext.Settings().Value("server");
}

void Export(const char* inName, const std::string& inValue) {
    if (!inValue.empty()) {
        ::setenv(inName, inValue.c_str(), 1);
    }
}

// The URL of a proxy may hold a password, and the arguments of a process are for everybody to read.
void ExportTransport(Context& ioContext, const Target& inTarget) {
    ApplyTransport(TransportFlagsOf(ioContext.Args()), inTarget.authorityFile, ioContext.Settings());
    const auto settings = ostnet::GetNetworkSettings();
    Export("ZOCLIENT_CA_FILE", settings->certificateAuthorityFile.empty()
                                   ? std::string()
                                   : fs::absolute(settings->certificateAuthorityFile).string());
    Export("ZOCLIENT_PROXY", settings->proxy);
    Export("ZOCLIENT_NO_PROXY", settings->noProxy);
}

std::string ProductionFor(Context& ioContext, const Target& inTarget) {
    if (const auto named = ioContext.Args().Positional(0)) {
        return *named;
    }
    const auto open = ioContext.Remembered().Open(inTarget.server, inTarget.user);
    return open ? open->production : std::string();
}

}  // namespace

void RunDesk(Context& ioContext) {
    std::vector<std::string> words{FindDesk()};
    // With no hub at all the desk asks for one.
    const Target target = IsHubNamed(ioContext) ? ioContext.FindTarget() : Target();
    ExportTransport(ioContext, target);
    if (!target.server.empty()) {
        words.insert(words.end(), {"--server", target.server});
    }
    if (!target.user.empty()) {
        words.insert(words.end(), {"--user", target.user});
    }
    const std::string production = ProductionFor(ioContext, target);
    if (!production.empty()) {
        words.insert(words.end(), {"--", production});
    }
    std::vector<char*> arguments;
    for (std::string& word : words) {
        arguments.push_back(word.data());
    }
    arguments.push_back(nullptr);
    ioContext.Out().Flush();
    Interrupt::RestoreSignals();
    ::execv(arguments[0], arguments.data());
    throw Failure(ExitCode::Failure, "starting " + words[0] + " failed: " + std::strerror(errno));
}

}  // namespace zo
