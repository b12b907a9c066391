// zohub serve: opens the data, listens, says where, and runs until it is told to stop.
#include <fcntl.h>
#include <signal.h>
#include <sys/resource.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iostream>

#include "Base/Digest.h"
#include "Base/Text.h"
#include "Commands/Arguments.h"
#include "Commands/Commands.h"
#include "Faults/FaultInjector.h"
#include "Http/Server.h"
#include "Http/Tls.h"
#include "Routes/Hub.h"

namespace zohub {

namespace {

namespace fs = std::filesystem;

constexpr std::uint64_t kPlainPort = 60138;
constexpr std::uint64_t kTlsPort = 60137;

// Connections are descriptors; the soft limit is often 1,024 only.
void RaiseDescriptorLimit() {
    rlimit limit{};
    if (getrlimit(RLIMIT_NOFILE, &limit) != 0)
        return;
    limit.rlim_cur = limit.rlim_max;
    setrlimit(RLIMIT_NOFILE, &limit);
}

void WriteAtomically(fs::path const& inPath, std::string const& inText) {
    fs::path const aside = inPath.string() + ".new" + std::to_string(getpid());
    int const descriptor = open(aside.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_NOFOLLOW, 0600);
    bool written = descriptor >= 0;
    if (written) {
        written = write(descriptor, inText.data(), inText.size()) == static_cast<ssize_t>(inText.size()) &&
                  fsync(descriptor) == 0;
        close(descriptor);
    }
    if (!written)
        throw std::runtime_error("cannot write " + aside.string() + "; check the directory and its rights");
    fs::rename(aside, inPath);
}

std::string HubId(std::string const& inData) {
    fs::path const path = fs::path(inData) / "hub.id";
    std::string id;
    std::ifstream(path) >> id;
    if (IsIdentifier(id) && !id.empty())
        return id;
    id = NewGuid();
    WriteAtomically(path, id + "\n");
    return id;
}

std::string HostInUrl(std::string const& inAddress) {
    if (inAddress == "0.0.0.0" || inAddress == "::")
        return "localhost";
    return inAddress.find(':') == std::string::npos ? inAddress : "[" + inAddress + "]";
}

sigset_t StopSignals() {
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGTERM);
    sigaddset(&signals, SIGINT);
    return signals;
}

ServerLimits ReadLimits(Arguments const& inArguments) {
    ServerLimits limits;
    limits.maxConnections = inArguments.Number("--max-connections", limits.maxConnections, 60000);
    limits.maxBody = inArguments.Number("--max-body", limits.maxBody, 900ull << 20);
    limits.header = std::chrono::milliseconds(inArguments.Number(
        "--header-timeout-ms", static_cast<std::uint64_t>(limits.header.count()), 3600000));
    limits.bodyGrace = std::chrono::milliseconds(inArguments.Number(
        "--body-timeout-ms", static_cast<std::uint64_t>(limits.bodyGrace.count()), 3600000));
    limits.readThreads =
        std::max<std::uint64_t>(1, inArguments.Number("--read-threads", limits.readThreads, 256));
    return limits;
}

// Null without a script.
std::unique_ptr<FaultInjector> ReadFaults(Arguments const& inArguments, Hub& ioHub) {
    if (!inArguments.Has("--faults"))
        return nullptr;
    std::string const path = inArguments.Need("--faults");
    std::ifstream file(path, std::ios::binary);
    std::string const text{std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
    if (!file || fs::is_directory(path))
        throw std::runtime_error("cannot read the fault script " + path);
    return std::make_unique<FaultInjector>(
        ParseFaultScript(text, path), [&ioHub](Request const& inRequest) { ioHub.ForgetToken(inRequest); },
        [](std::string const& inFault) { std::cerr << "zohub: fault, " + inFault + "\n"; });
}

}  // namespace

int RunServe(std::vector<std::string> const& inWords) {
    Arguments const arguments(inWords, {{"--data"},
                                        {"--port"},
                                        {"--tls-port"},
                                        {"--listen"},
                                        {"--ready-file"},
                                        {"--token-lifetime"},
                                        {"--max-connections"},
                                        {"--max-body"},
                                        {"--header-timeout-ms"},
                                        {"--body-timeout-ms"},
                                        {"--read-threads"},
                                        {"--faults"},
                                        {"--no-tls", false}});
    arguments.Words(0, "serve [options]");
    // Before any thread starts, so that all of them leave these signals to this one.
    sigset_t const signals = StopSignals();
    pthread_sigmask(SIG_BLOCK, &signals, nullptr);
    signal(SIGPIPE, SIG_IGN);
    RaiseDescriptorLimit();

    std::string const data = arguments.DataDirectory();
    auto const storage = OpenSqliteStorage(data);
    HubSettings settings;
    settings.id = HubId(data);
    settings.tokenLifetime =
        static_cast<Micros>(arguments.Number("--token-lifetime", 86400, 10ull * 365 * 86400)) * kSecond;
    Hub hub(*storage, settings, SystemClock());

    std::string const address = arguments.Get("--listen", "127.0.0.1");
    auto const faults = ReadFaults(arguments, hub);
    FaultFunction faultOf;
    if (faults)
        faultOf = [&faults](Request const& inRequest) { return faults->PlanFor(inRequest); };
    Server server(
        ReadLimits(arguments), [&hub](Request const& inRequest) { return hub.Handle(inRequest); },
        Hub::LaneOf, faultOf);
    auto const plainPort = server.ListenPlain(
        address, static_cast<std::uint16_t>(arguments.Number("--port", kPlainPort, 65535)));
    std::string const httpUrl = "http://" + HostInUrl(address) + ":" + std::to_string(plainPort);
    std::string tlsUrl;
    if (!arguments.Has("--no-tls")) {
        auto const tlsPort = server.ListenTls(
            address, static_cast<std::uint16_t>(arguments.Number("--tls-port", kTlsPort, 65535)),
            PrepareTls(data));
        tlsUrl = "https://" + HostInUrl(address) + ":" + std::to_string(tlsPort);
    }
    server.Start();

    if (arguments.Has("--ready-file")) {
        std::string const caFile = tlsUrl.empty() ? std::string() : fs::absolute(CaFilePath(data)).string();
        WriteAtomically(arguments.Need("--ready-file"), "{\"httpUrl\":" + JsonString(httpUrl) +
                                                            ",\"tlsUrl\":" + JsonString(tlsUrl) +
                                                            ",\"caFile\":" + JsonString(caFile) +
                                                            ",\"pid\":" + std::to_string(getpid()) + "}\n");
    }

    std::cout << "zohub: listening on " << httpUrl << "\n";
    if (!tlsUrl.empty())
        std::cout << "zohub: listening on " << tlsUrl << "\nzohub: certificate authority " << CaFilePath(data)
                  << "\n";
    if (faults)
        std::cout << "zohub: FAULTS ARE ON, as " << arguments.Get("--faults") << " says\n";
    std::cout << std::flush;

    int received = 0;
    sigwait(&signals, &received);
    std::cout << "zohub: stopping" << std::endl;
    server.Stop();
    return 0;
}

}  // namespace zohub
