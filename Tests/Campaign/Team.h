// A hub, the proxies before it, and the two users who work through them.
#pragma once

#include <filesystem>
#include <memory>
#include <nlohmann/json.hpp>
#include <string>

#include "FaultProxy.h"
#include "Process.h"
#include "RawClient.h"

namespace campaign {

using nlohmann::json;

/// What a run of the campaign needs to know of its surroundings.
struct Setting {
    std::string hubProgram;
    /// This program itself, which is the worker as well.
    std::string ownProgram;
    /// How long one order may take before it counts as a hang.
    Process::Milliseconds patience{60000};
    bool withSwaps = false;
    /// A script of faults for the hub itself; empty for none.
    std::string hubFaults;
};

/// A hub process with data of its own, and clients that speak to it with no proxy in between.
class RunningHub {
public:
    RunningHub(const Setting& inSetting, const std::filesystem::path& inDirectory,
               const std::vector<std::string>& inUsers);

    std::uint16_t Port() const { return mPort; }
    zohub::test::Client SignedIn(const std::string& inUser) const;
    /// Ends it and has it check its data; what it found wrong, or nothing.
    std::string EndAndCheck();

private:
    int RunToEnd(const std::vector<std::string>& inWords, std::string& outText) const;

    const Setting& mSetting;
    const std::string mData;
    std::unique_ptr<Process> mProcess;
    std::uint16_t mPort = 0;
};

/// How an order ended.
struct Reply {
    int result = 0;
    std::string step;
    std::string name;
    json content;

    bool Succeeded() const { return result >= 0; }
    /// The hub understood the request and said no.
    bool WasRefused() const;
    bool IsConflict() const { return name == "http-409"; }
    std::string Describe() const;
};

/// One user: a worker process and the proxy through which it works.
class User {
public:
    User(const Setting& inSetting, const std::filesystem::path& inDirectory, const std::string& inName,
         std::uint16_t inHubPort);

    /// Signs in, through a proxy that lets everything pass.
    Reply Connect();
    Reply Do(const json& inOrder);
    /// Asks the worker to end, and gives its exit code.
    int End();
    /// Says why, on standard error, and leaves a trace of where its threads are when it can.
    void Abort();

    const std::string& Name() const { return mName; }
    faultproxy::FaultProxy& Proxy() { return mProxy; }

private:
    const Setting& mSetting;
    const std::string mName;
    faultproxy::FaultProxy mProxy;
    Process mProcess;
};

std::string PasswordOf(const std::string& inUser);

}  // namespace campaign
