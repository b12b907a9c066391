// Payloads by their content: kept from run to run, fetched when they cannot be had, never delivered damaged.
#include <sys/stat.h>

#include <filesystem>
#include <fstream>

#include "ConnectSupport.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/threads/Scheduler.h"
#include "ostnet/http/Compression.h"
#include "QM/detail/FileDataCache.h"
#include "ZOClient/ContentCache.h"
#include "ZOClient/ResultCodes.h"

namespace ZOCL {
namespace {

using ostnet::http::kWaitForever;
using testing::HasSubstr;
using testing::Not;

const ImmutableString kURL("http://hub.test:60138/payload/1");
const ImmutableString kID("content-id-1");
const std::string kText = "the text of a project, the text of a project, the text of a project";

ScriptedAnswer Packed(const std::string& inText) {
    const auto packed = ostnet::http::CompressPayload(RecycledMemory::CreateFromBytes(inText));
    return ScriptedAnswer::Body(std::string(packed->view()), "application/json")
        .With("Content-Encoding", "gzip");
}

/// The end of a GETByContentID, waited for and counted.
class ContentOutcome {
public:
    ostnet::http::CompletionFunction Function() {
        const auto state = mState;
        return [state](const Guid&, const shared_ptr<ostnet::Response>& inResponse) {
            std::lock_guard<std::mutex> lock(state->mutex);
            ++state->calls;
            state->response = inResponse;
            state->changed.notify_all();
        };
    }
    shared_ptr<ostnet::Response> Wait() {
        std::unique_lock<std::mutex> lock(mState->mutex);
        EXPECT_TRUE(
            mState->changed.wait_for(lock, std::chrono::seconds(60), [&] { return mState->calls > 0; }));
        EXPECT_EQ(mState->calls, 1);
        return mState->response;
    }

private:
    struct State {
        std::mutex mutex;
        std::condition_variable changed;
        int calls = 0;
        shared_ptr<ostnet::Response> response;
    };
    shared_ptr<State> mState = make_shared<State>();
};

class ContentCacheTest : public ConnectTest {
protected:
    ContentCacheTest() {
        ReleaseContentCache();
        NewRun();
        net->SetHandler([](const RecordedRequest&) { return Packed(kText); });
    }
    ~ContentCacheTest() override {
        net->WaitUntilIdle();
        server = nullptr;
        ReleaseContentCache();
        ostcore::debug::DebugDatabase::ClearOverrides();
    }
    /// As the next process of the user would begin.
    void NewRun(const std::string& inDiscovery = kDiscovery) {
        server = nullptr;
        net->WaitUntilIdle();
        ReleaseContentCache();
        DataServer::Settings settings;
        settings.discoveryURL = ImmutableString(inDiscovery);
        server = DataServer::Create(settings);
        net->ClearRequests();
    }
    std::string GetBlocking(const ImmutableString& inID = kID) {
        const auto response = server->BlockingGETByContentID(inID, kURL, kWaitForever);
        EXPECT_TRUE(response);
        EXPECT_EQ(response->status, 200);
        return response->GetPayloadAsUTF8String();
    }
    std::string Get(const ImmutableString& inID = kID) {
        ContentOutcome outcome;
        EXPECT_TRUE(server->GETByContentID(inID, Guid::CreateUnique(), outcome.Function(), kURL));
        const auto response = outcome.Wait();
        EXPECT_TRUE(response);
        EXPECT_EQ(response->status, 200);
        EXPECT_TRUE(response->headers.empty());
        return response->GetPayloadAsUTF8String();
    }
    void WaitForWrites() const {
        net->WaitUntilIdle();
        ASSERT_TRUE(GetContentCache()->WaitForWrites(60000));
    }
    std::vector<std::string> Files() const {
        std::vector<std::string> files;
        for (const auto& entry : std::filesystem::recursive_directory_iterator(Base())) {
            if (entry.is_regular_file()) {
                files.push_back(entry.path().string());
            }
        }
        return files;
    }
    std::string Base() const { return mDirectory + "/state/MeridaneCache"; }

    InterfaceRef<DataServer> server;
};

TEST_F(ContentCacheTest, APayloadIsFetchedOnceForAllRuns) {
    EXPECT_EQ(Get(), kText);
    EXPECT_FALSE(net->Requests().back().decompressPayload) << "it is kept as the server sent it";
    EXPECT_THAT(Traces(), HasSubstr("GETByContentID(): Content not found in cache, will request from server: "
                                    "content-id-1"));
    EXPECT_EQ(Get(), kText);
    EXPECT_THAT(Traces(), HasSubstr("GetCachedContent(): Retrieved from cache immediately: content-id-1, but "
                                    "will decompress asynchronously."));
    EXPECT_EQ(GetBlocking(), kText);
    EXPECT_THAT(Traces(), HasSubstr("GetCachedContentSynchronous(): Retrieved from cache immediately: "));
    EXPECT_EQ(net->RequestCount(), 1u);

    NewRun();
    EXPECT_EQ(Get(), kText);
    for (const char* text : {"GETByContentID(): Will retrieve from cache asynchronously: content-id-1",
                             "OnGetCachedContentComplete(): Retrieved from cache asynchronously: ",
                             "OnGetCachedContentComplete(): Decompressed payload: content-id-1"}) {
        EXPECT_THAT(Traces(), HasSubstr(text));
    }
    NewRun();
    EXPECT_EQ(GetBlocking(), kText);
    EXPECT_THAT(Traces(),
                HasSubstr("GetCachedContentSynchronous(): Waiting for async response from cache: "));
    EXPECT_THAT(Traces(), HasSubstr("GetCachedContentSynchronous(): Async request from cache completed: "));
    EXPECT_EQ(net->RequestCount(), 0u) << "the second run asks nobody";
}

TEST_F(ContentCacheTest, OneHubDoesNotAnswerForAnother) {
    EXPECT_EQ(Get(), kText);
    NewRun("http://other.example/content/zo/api/discovery.json");
    net->SetHandler([](const RecordedRequest&) { return Packed("of the other hub"); });
    EXPECT_EQ(Get(), "of the other hub");
    NewRun();
    EXPECT_EQ(Get(), kText);
    EXPECT_EQ(net->RequestCount(), 0u);
}

TEST_F(ContentCacheTest, WhatThisClientHasWrittenAndWhatCameUnpackedIsKeptPacked) {
    server->CacheContent(kID, RecycledMemory::CreateFromBytes(kText));
    server->CacheContent(ImmutableString(), RecycledMemory::CreateFromBytes(kText));
    server->CacheContent(ImmutableString("empty"), RecycledMemory::CreateFromBytes(""));
    WaitForWrites();
    EXPECT_EQ(Get(), kText);
    EXPECT_EQ(net->RequestCount(), 0u);
    EXPECT_EQ(Files().size(), 1u);

    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Body(kText, "text/plain"); });
    EXPECT_EQ(Get(ImmutableString("plain")), kText);
    WaitForWrites();
    NewRun();
    EXPECT_EQ(Get(ImmutableString("plain")), kText);
    EXPECT_EQ(net->RequestCount(), 0u);
}

TEST_F(ContentCacheTest, ABodyThatDoesNotInflateIs417AndIsNotKept) {
    net->Expect("GET", kURL.str(),
                ScriptedAnswer::Body("no gzip at all, no gzip at all", "application/json")
                    .With("Content-Encoding", "gzip"));
    net->Expect("GET", kURL.str(), ScriptedAnswer::Status(404));
    const auto damaged = server->BlockingGETByContentID(kID, kURL, kWaitForever);
    EXPECT_EQ(damaged->status, 417);
    EXPECT_FALSE(damaged->payload);
    EXPECT_EQ(server->BlockingGETByContentID(kID, kURL, kWaitForever)->status, 404);
    EXPECT_EQ(Get(), kText) << "fetched anew, since nothing was kept";
    EXPECT_EQ(net->RequestCount(), 3u);
}

TEST_F(ContentCacheTest, ADamagedOrUselessFileIsFetchedAgainOnce) {
    const auto damage = [&](const std::function<void(const std::string&)>& inDo) {
        WaitForWrites();
        ReleaseContentCache();
        ASSERT_EQ(Files().size(), 1u);
        inDo(Files().front());
        NewRun();
    };
    EXPECT_EQ(Get(), kText);
    damage([](const std::string& inFile) { std::filesystem::resize_file(inFile, 80); });
    EXPECT_EQ(Get(), kText);
    EXPECT_EQ(net->RequestCount(), 1u);
    EXPECT_THAT(Traces(), HasSubstr("OnGetCachedContentComplete(): Failed to retrieve from cache "
                                    "asynchronously: content-id-1"));
    // Sound, but no gzip: as if another program had stored it.
    const auto storeNonsense = [&] {
        ASSERT_TRUE(GetContentCache()->Write(server->ContentKey(kID), ContentName(),
                                             RecycledMemory::CreateFromBytes("nonsense")));
        WaitForWrites();
    };
    storeNonsense();
    NewRun();
    EXPECT_EQ(GetBlocking(), kText);
    EXPECT_EQ(GetBlocking(), kText);
    EXPECT_EQ(net->RequestCount(), 1u);
    storeNonsense();
    EXPECT_EQ(Get(), kText) << "from memory, not at once";
    storeNonsense();
    EXPECT_EQ(GetBlocking(), kText) << "from memory, at once";
    EXPECT_EQ(Get(), kText);
    EXPECT_EQ(net->RequestCount(), 3u);
}

/// The disk refuses everything from now on.
class DeadDisk : public QM::detail::FileOperations {
public:
    int OpenAt(int inDirectory, const char* inPath, int inFlags, mode_t inMode) override {
        if (mIsDead) {
            errno = EIO;
            return -1;
        }
        return FileOperations::OpenAt(inDirectory, inPath, inFlags, inMode);
    }
    int OpenBeneath(int inDirectory, const char* inPath, int inFlags) override {
        if (mIsDead) {
            errno = EIO;
            return -1;
        }
        return FileOperations::OpenBeneath(inDirectory, inPath, inFlags);
    }
    std::atomic<bool> mIsDead{false};
};

TEST_F(ContentCacheTest, RequestsSucceedWithoutTheDisk) {
    const auto disk = boost::make_shared<DeadDisk>();
    std::string error;
    const auto files = QM::detail::FileDataCache::Create(
        QM::detail::CacheDirectory::Open(mDirectory + "/state/own", true, disk, error));
    ReplaceContentCache(files);
    EXPECT_EQ(Get(), kText);
    WaitForWrites();
    EXPECT_EQ(Get(), kText);
    EXPECT_EQ(net->RequestCount(), 1u);
    disk->mIsDead = true;
    EXPECT_EQ(Get(), kText) << "known to be there, and cannot be read";
    EXPECT_EQ(Get(ImmutableString("other")), kText);
    EXPECT_EQ(GetBlocking(ImmutableString("other")), kText);
    EXPECT_GE(net->RequestCount(), 3u);
    files->Close(60000);
    EXPECT_EQ(Get(), kText) << "a cache that has been closed";
    ReplaceContentCache(nullptr);
    EXPECT_EQ(Get(), kText) << "no cache at all";
}

TEST_F(ContentCacheTest, ABaseDirectoryThatIsALinkOrCannotBeMadeMeansMemoryAlone) {
    std::filesystem::create_directories(mDirectory + "/elsewhere");
    std::filesystem::create_directories(mDirectory + "/state");
    std::filesystem::remove_all(Base());
    std::filesystem::create_directory_symlink(mDirectory + "/elsewhere", Base());
    ostcore::filesupport::Dir base;
    EXPECT_FALSE(GetZOCacheBaseDir(base));
    EXPECT_THAT(Traces(), HasSubstr("GetZOCacheBaseDir(): Can't create cache folder!"));
    EXPECT_EQ(Get(), kText);
    EXPECT_TRUE(std::filesystem::is_empty(mDirectory + "/elsewhere"));

    std::filesystem::remove(Base());
    std::filesystem::create_directories(Base() + "/ZOClient");
    std::filesystem::create_directory_symlink(mDirectory + "/elsewhere", Base() + "/ZOClient/Content");
    EXPECT_TRUE(GetZOCacheBaseDir(base));
    EXPECT_EQ(base.Path(), Base());
    NewRun();
    EXPECT_EQ(Get(), kText);
    EXPECT_EQ(Get(), kText) << "from memory";
    EXPECT_EQ(net->RequestCount(), 1u);
    WaitForWrites();
    EXPECT_TRUE(std::filesystem::is_empty(mDirectory + "/elsewhere"));
}

TEST_F(ContentCacheTest, TheSimpleModeKeepsWholeAnswersInMemory) {
    ostcore::debug::DebugDatabase::SetOverride("ZOClient.UseSimpleContentCache", "true");
    const auto scheduler = make_shared<ostcore::threads::VirtualScheduler>();
    const ostcore::threads::ScopedGlobalScheduler time(scheduler);
    NewRun();
    net->SetHandler([](const RecordedRequest& inRequest) {
        EXPECT_TRUE(inRequest.decompressPayload);
        return ScriptedAnswer::Body(kText, "text/plain").With("ETag", "\"t1\"");
    });
    const auto first = server->BlockingGETByContentID(kID, kURL, kWaitForever);
    EXPECT_THAT(Traces(), HasSubstr("CacheAndDecompressContent(): Caching with simple content cache: "
                                    "content-id-1"));
    EXPECT_EQ(server->BlockingGETByContentID(kID, kURL, kWaitForever), first) << "the very answer";
    EXPECT_THAT(Traces(), HasSubstr("GetCachedContent(): Found using simple content cache: content-id-1"));
    EXPECT_EQ(ostnet::GetHeader(first->headers, ImmutableString("ETag")), ImmutableString("\"t1\""));
    ContentOutcome outcome;
    EXPECT_TRUE(server->GETByContentID(kID, Guid::CreateUnique(), outcome.Function(), kURL));
    scheduler->Advance(std::chrono::milliseconds(1));
    EXPECT_EQ(outcome.Wait(), first);
    EXPECT_EQ(net->RequestCount(), 1u);
    EXPECT_FALSE(std::filesystem::exists(Base()));
    server->BlockingGETByContentID(ImmutableString(), kURL, kWaitForever);
    server->BlockingGETByContentID(ImmutableString(), kURL, kWaitForever);
    EXPECT_EQ(net->RequestCount(), 3u) << "what has no identifier is not kept";
}

/// Holds the reads back until the test lets them go.
class HeldCache : public QM::DataCache {
public:
    std::vector<ImmutableString> ListNames(const ImmutableString&) override { return {ContentName()}; }
    int Read(const ImmutableString&, const ImmutableString&, const QM::ReadCompletion& inCompletion,
             QM::Payload&) override {
        mHeld.push_back(inCompletion);
        return QM::kResultContentPending;
    }
    bool Contains(const ImmutableString&, const ImmutableString&) override { return false; }
    bool Write(const ImmutableString&, const ImmutableString&, const QM::Payload&) override { return false; }
    void Remove(const ImmutableString&, const ImmutableString&) override {}
    bool WaitForWrites(std::uint32_t) override { return true; }
    void Close(std::uint32_t) override {}

    std::vector<QM::ReadCompletion> mHeld;
};

TEST_F(ContentCacheTest, ALookIntoTheCacheCanBeCancelledAndTimesOut) {
    const auto held = boost::make_shared<HeldCache>();
    ReplaceContentCache(held);
    const Guid id = Guid::CreateUnique();
    ContentOutcome outcome;
    EXPECT_TRUE(server->GETByContentID(kID, id, outcome.Function(), kURL));
    server->TryToCancelRequest(id);
    server->TryToCancelRequest(id);
    held->mHeld.at(0)(0, ostnet::http::CompressPayload(RecycledMemory::CreateFromBytes(kText)));
    EXPECT_EQ(outcome.Wait()->status, ostnet::Response::kStatusCancelled);
    EXPECT_EQ(net->RequestCount(), 0u);

    EXPECT_FALSE(server->GetCachedContentSynchronous(kID, 1));
    EXPECT_THAT(Traces(), HasSubstr("GetCachedContentSynchronous(): Async request from cache timed out: "));
    held->mHeld.at(1)(0, ostnet::http::CompressPayload(RecycledMemory::CreateFromBytes(kText)));

    ContentOutcome second;
    EXPECT_TRUE(server->GETByContentID(kID, Guid::CreateUnique(), second.Function(), kURL));
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::FailStart(); });
    held->mHeld.at(2)(QM::kResultFailure, nullptr);
    EXPECT_EQ(second.Wait()->status, ostnet::Response::kStatusNoResponse)
        << "neither the cache nor the server can give it, and the request has to end";
    held->mHeld.clear();  // each holds the cache
}

}  // namespace
}  // namespace ZOCL
