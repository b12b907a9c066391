// Starting and ending the processes of a campaign.
#include "Team.h"

#include <signal.h>

#include <fstream>
#include <stdexcept>

namespace campaign {

namespace {

constexpr Process::Milliseconds kStartPatience{60000};

std::string TextAfter(const std::string& inText, const std::string& inMark) {
    const std::size_t found = inText.find(inMark);
    return found == std::string::npos ? std::string() : inText.substr(found + inMark.size());
}

std::vector<std::string> EnvironmentOf(const std::filesystem::path& inHome) {
    // Little memory in front of the payload cache's files, so that growth is not what it keeps by rule.
    return {"ZOCLIENT_DEBUG_ZOClient_ContentCacheMemoryMegabytes=1",
            "ZOCLIENT_CONFIG_HOME=" + (inHome / "config").string(),
            "ZOCLIENT_STATE_HOME=" + (inHome / "state").string(),
            "ZOCLIENT_CACHE_HOME=" + (inHome / "cache").string()};
}

}  // namespace

std::string PasswordOf(const std::string& inUser) {
    return inUser + "s-secret";
}

RunningHub::RunningHub(const Setting& inSetting, const std::filesystem::path& inDirectory,
                       const std::vector<std::string>& inUsers)
    : mSetting(inSetting), mData((inDirectory / "hub").string()) {
    for (const std::string& user : inUsers) {
        const std::string file = (inDirectory / "password").string();
        std::ofstream(file) << PasswordOf(user) << "\n";
        std::string text;
        // Schedules sign in over and over: with the usual cost the hub would do little else.
        if (RunToEnd({"user", "add", user, "--admin", "--password-cost", "10", "--password-file", file},
                     text) != 0) {
            throw std::runtime_error("cannot add a user to the hub: " + text);
        }
    }
    std::vector<std::string> words{mSetting.hubProgram, "serve", "--data", mData, "--port", "0", "--no-tls"};
    if (!mSetting.hubFaults.empty()) {
        words.insert(words.end(), {"--faults", mSetting.hubFaults});
    }
    mProcess = std::make_unique<Process>("the hub", words);
    const std::string line = mProcess->ReadLine(kStartPatience);
    mPort = static_cast<std::uint16_t>(std::stoi(TextAfter(line, "127.0.0.1:")));
}

int RunningHub::RunToEnd(const std::vector<std::string>& inWords, std::string& outText) const {
    std::vector<std::string> words{mSetting.hubProgram};
    words.insert(words.end(), inWords.begin(), inWords.end());
    words.insert(words.end(), {"--data", mData});
    Process process("zohub " + inWords[0], words);
    try {
        for (;;) {
            outText += process.ReadLine(kStartPatience) + "\n";
        }
    } catch (const ProcessFailure&) {
        // It has said all.
    }
    return process.WaitForEnd(kStartPatience);
}

zohub::test::Client RunningHub::SignedIn(const std::string& inUser) const {
    zohub::test::Client client(mPort);
    if (client.SignIn(inUser, PasswordOf(inUser)).status != 200) {
        throw std::runtime_error("the hub does not let " + inUser + " in");
    }
    return client;
}

std::string RunningHub::EndAndCheck() {
    mProcess->Signal(SIGTERM);
    const int ended = mProcess->WaitForEnd(kStartPatience);
    std::string text;
    if (RunToEnd({"check"}, text) != 0) {
        return "zohub check: " + text;
    }
    return ended == 0 ? std::string() : "zohub ended with " + std::to_string(ended);
}

bool Reply::WasRefused() const {
    return name.rfind("http-4", 0) == 0;
}

std::string Reply::Describe() const {
    return Succeeded() ? "done" : step + ": " + name;
}

User::User(const Setting& inSetting, const std::filesystem::path& inDirectory, const std::string& inName,
           std::uint16_t inHubPort)
    : mSetting(inSetting),
      mName(inName),
      mProxy(inHubPort, nullptr),
      mProcess(inName, {inSetting.ownProgram, "--worker"}, EnvironmentOf(inDirectory / inName)) {}

Reply User::Connect() {
    mProxy.Follow(nullptr);
    mProxy.BeGood();
    return Do(
        {{"do", "connect"}, {"server", mProxy.URL()}, {"user", mName}, {"password", PasswordOf(mName)}});
}

Reply User::Do(const json& inOrder) {
    mProcess.WriteLine(inOrder.dump());
    Reply reply;
    reply.content = json::parse(mProcess.ReadLine(mSetting.patience));
    reply.result = reply.content.at("result");
    reply.step = reply.content.value("step", "");
    reply.name = reply.content.value("name", "");
    return reply;
}

int User::End() {
    mProcess.WriteLine(R"({"do":"quit"})");
    return mProcess.WaitForEnd(mSetting.patience);
}

void User::Abort() {
    mProcess.Signal(SIGABRT);
}

}  // namespace campaign
