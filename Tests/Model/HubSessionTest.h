// Users who work on one production of a hub that runs as a process of its own.
#pragma once

#include <future>

#include "ClientTest.h"
#include "HubProcess.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "RFL/Registry.h"
#include "ZOClient/IZOCEditingSession.h"
#include "ZOClient/Library.h"

namespace ZOCL {

using Start = std::function<bool(const Guid&, const RequestCompletion&)>;

constexpr const char* kProductionName = "Harbour Film";

struct Ended {
    int result = 1;
    InterfaceRef<IZOCServerResource> resource;
    shared_ptr<ostnet::Response> response;
};

inline Ended Perform(const Start& inStart) {
    Outcome outcome;
    if (!inStart(Guid::CreateUnique(), outcome.Function())) {
        ADD_FAILURE() << "nothing was started";
        return {};
    }
    const int result = outcome.Wait();
    return {result, outcome.Resource(), outcome.Response()};
}

template <class To, class From>
inline InterfaceRef<To> As(const InterfaceRef<From>& inObject) {
    return RFL::QueryInterface<To>(inObject);
}

inline InterfaceRef<IZOCDataServer> Connect(const std::string& inHub, const std::string& inUser) {
    ZOSCredentials credentials;
    credentials.username = ImmutableString(inUser);
    credentials.password = inUser + "s-secret";
    std::promise<InterfaceRef<IZOCDataServer>> ended;
    Guid id;
    EXPECT_TRUE(IZOCDataServer::ConnectToServer(
        ImmutableString(inHub), credentials, id, false,
        [&ended](const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int,
                 const shared_ptr<ostnet::Response>&) { ended.set_value(inServer); },
        false, false));
    const auto server = ended.get_future().get();
    EXPECT_TRUE(server) << inUser << " could not sign in";
    return server;
}

/// One user at one host, with the production as that host sees it.
struct Member {
    Member(const std::string& inHub, const std::string& inUser) : server(Connect(inHub, inUser)) {
        const auto list = server->GetProductionList(true);
        for (const auto& entry : list->GetAllItems()) {
            if (entry.name == ostcore::utility::ToUTF16(kProductionName)) {
                production = server->GetWritableProductionFromURL(entry.url);
            }
        }
        EXPECT_TRUE(production) << inUser << " does not see the production";
    }
    Member(const Member&) = delete;
    Member& operator=(const Member&) = delete;
    ~Member() { RFL::QueryInterface<DataServer>(server)->ReleaseCaches(); }

    InterfaceRef<IZOCEditingSession> OpenSession() const {
        InterfaceRef<IZOCEditingSession> session;
        EXPECT_TRUE(production->CreateEditingSession(session, u"Mine", u"", false));
        return session;
    }

    InterfaceRef<IZOCDataServer> server;
    InterfaceRef<IZOCProduction> production;
};

inline Ended TryToOpen(const InterfaceRef<IZOCEditingSession>& inSession, const ImmutableString& inType) {
    return Perform([&](const Guid& inID, const RequestCompletion& inDone) {
        return inSession->CreateTransaction(inID, inDone, inType);
    });
}

inline InterfaceRef<IZOCTransaction> OpenTransaction(const InterfaceRef<IZOCEditingSession>& inSession,
                                                     const ImmutableString& inType = kTransactionType_Edit) {
    const Ended ended = TryToOpen(inSession, inType);
    EXPECT_EQ(ended.result, kResultSuccess);
    return As<IZOCTransaction>(ended.resource);
}

inline InterfaceRef<IZOCAsset> Add(const InterfaceRef<IZOCTransaction>& inTransaction,
                                   const UString& inName) {
    AssetBaseProperties properties;
    properties.name = inName;
    properties.assetType = kAssetType_Bin;
    const Ended ended = Perform([&](const Guid& inID, const RequestCompletion& inDone) {
        return inTransaction->CreateNewAsset(inID, inDone, properties);
    });
    EXPECT_EQ(ended.result, kResultSuccess);
    return As<IZOCAsset>(ended.resource);
}

inline int Write(const InterfaceRef<IZOCTransaction>& inTransaction, const char* inName,
                 const std::string& inText) {
    return Perform([&](const Guid& inID, const RequestCompletion& inDone) {
               return inTransaction->WriteEnclosure(inName, inText, inID, inDone, "text/plain");
           })
        .result;
}

inline int Commit(const InterfaceRef<IZOCTransaction>& inTransaction, const UString& inMessage = u"") {
    return Perform([&](const Guid& inID, const RequestCompletion& inDone) {
               return inTransaction->Commit(inID, inDone, inMessage);
           })
        .result;
}

inline int Push(const InterfaceRef<IZOCEditingSession>& inSession, const UString& inMessage,
                const UString& inCommit = u"", int inStrategy = kResolveStrategy_None) {
    return Perform([&](const Guid& inID, const RequestCompletion& inDone) {
               return inSession->Push(inID, inDone, inMessage, inStrategy, inCommit);
           })
        .result;
}

inline int Pull(const InterfaceRef<IZOCEditingSession>& inSession, int inStrategy) {
    return Perform([&](const Guid& inID, const RequestCompletion& inDone) {
               return inSession->Pull(inID, inDone, inStrategy, u"");
           })
        .result;
}

inline int Refresh(const InterfaceRef<IZOCEditingSession>& inSession) {
    return Perform([&](const Guid& inID, const RequestCompletion& inDone) {
               return inSession->Refresh(inID, inDone);
           })
        .result;
}

inline std::vector<UString> Names(const InterfaceRef<IZOCProduction>& inProduction) {
    const auto assets = inProduction->GetAssets();
    As<IZOCServerResource>(assets)->Load(true);
    std::vector<UString> names;
    for (const auto& item : assets->GetAllItems()) {
        names.push_back(item.name);
    }
    return names;
}

inline std::size_t CountOpen(const InterfaceRef<IZOCEditingSession>& inSession) {
    const auto list = inSession->GetOrCreateTransactionList();
    bool changed = false;
    As<IZOCServerResource>(list)->Refresh(changed, false);
    return list->GetAllItems().size();
}

class HubSessionTest : public testing::Test {
protected:
    HubSessionTest() {
        setenv("ZOCLIENT_CONFIG_HOME", (hub.Directory() + "/config").c_str(), 1);
        RFL::CloseRegistry();
        Initialize();
        hub.AddUser("ben");
        std::filesystem::create_directory(hub.Directory() + "/media");
        std::ofstream(hub.Directory() + "/media/one.mov") << "media";
        const pid_t importing =
            Spawn({ZO_HUB_PROGRAM, "import", hub.Directory() + "/media", "--production", kProductionName,
                   "--owner", "anna", "--grant", "ben", "--data", hub.Directory() + "/data"},
                  STDERR_FILENO);
        int status = -1;
        waitpid(importing, &status, 0);
        EXPECT_EQ(status, 0) << "the production could not be made";
    }
    ~HubSessionTest() override {
        ostcore::threads::PumpMainThread();
        Shutdown();
        RFL::CloseRegistry();
    }
    Member SignIn(const std::string& inUser) const { return Member(hub.URL().str(), inUser); }

    RunningHub hub;
};

}  // namespace ZOCL
