// A whole hub inside the test: own data directory, real sockets on a free port, a clock that the test sets.
#pragma once

#include <gtest/gtest.h>

#include <atomic>
#include <filesystem>
#include <memory>
#include <mutex>

#include "Base/Json.h"
#include "Faults/FaultInjector.h"
#include "Http/Server.h"
#include "RawClient.h"
#include "Routes/Hub.h"

namespace zohub::test {

/// A directory that is gone with the object.
class TemporaryDirectory {
public:
    TemporaryDirectory();
    ~TemporaryDirectory();
    TemporaryDirectory(TemporaryDirectory const&) = delete;
    TemporaryDirectory& operator=(TemporaryDirectory const&) = delete;
    std::filesystem::path const& Path() const { return mPath; }

private:
    std::filesystem::path mPath;
};

void WriteFile(std::filesystem::path const& inPath, std::string const& inBytes);
std::string ReadFile(std::filesystem::path const& inPath);

/// The href of the first link with the relation; a leading slash means one below the relation base.
std::string LinkOf(Json const& inDocument, std::string const& inRelation);
bool HasLink(Json const& inDocument, std::string const& inRelation);

class RunningHub {
public:
    /// With a script of faults it follows that.
    explicit RunningHub(ServerLimits const& inLimits = {}, std::string const& inFaultScript = {});

    std::uint16_t Port() const { return mPort; }
    Storage& Data() { return *mStorage; }
    std::filesystem::path const& DataPath() const { return mDirectory.Path(); }
    void Advance(Micros inTime) { mNow += inTime; }
    void AddUser(std::string const& inName, std::string const& inPassword, bool inIsAdmin = false);
    Client SignedIn(std::string const& inName);
    void Stop() { mServer->Stop(); }
    /// What it said of the faults that have come.
    std::vector<std::string> ToldFaults() const;

private:
    TemporaryDirectory mDirectory;
    std::unique_ptr<Storage> mStorage;
    std::atomic<Micros> mNow{1800000000 * kSecond};
    std::unique_ptr<Hub> mHub;
    std::unique_ptr<FaultInjector> mFaults;
    std::unique_ptr<Server> mServer;
    mutable std::mutex mMutex;
    std::vector<std::string> mToldFaults;  // under mMutex
    std::uint16_t mPort = 0;
};

/// A hub with two users, anna and ben, whose passwords are their names followed by "-secret".
class HubTest : public ::testing::Test {
protected:
    HubTest();

    /// Makes a production and gives its document.
    Json MakeProduction(Client const& inClient, std::string const& inName);
    Json MakeAsset(Client const& inClient, Json const& inProduction, std::string const& inProperties);

    RunningHub mHub;
    Client mAnna;
};

inline constexpr char kClip[] = R"({"name":"clip","description":"","cdzo:assetType":"masterclip"})";

}  // namespace zohub::test
