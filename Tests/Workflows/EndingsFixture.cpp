// How a flow is ended at the request or window that is asked for, and what must be left then.
#include "EndingsTest.h"

#include <chrono>

#include "Connection/ServiceDocument.h"
#include "ZOClient/Dialogs.h"

namespace ZOCL {

using ostcore::threads::Gate;
using testing::IsEmpty;

namespace {

constexpr std::uint32_t kLongestWait = 20000;
/// More than any flow has; a flow that never ends is not gone through for ever.
constexpr std::size_t kMost = 200;
constexpr auto kTickTime = std::chrono::milliseconds(10);

std::chrono::steady_clock::time_point Deadline() {
    return std::chrono::steady_clock::now() + std::chrono::milliseconds(kLongestWait);
}

}  // namespace

std::string EndingsTest::Ending::Text() const {
    const char* const kinds[] = {"cancel", "sign-out", "terminate", "drop"};
    const char* const moments[] = {"before request ", "in flight of request ", "when answered, request ",
                                   "never answered, request ", "while it starts, request "};
    return std::string(kinds[static_cast<int>(kind)]) + " " +
           (window > 0 ? "at window " + std::to_string(window)
                       : moments[static_cast<int>(moment)] + std::to_string(request));
}

EndingsTest::EndingsTest() {
    ostcore::threads::ResetMainThread();
    ostcore::threads::SetMainThread();
    RFL::CloseRegistry();
    ForgetUIProperties();
    RegisterStation();
    windows->player = [this](ostui::Dialog& ioDialog) { OnWindow(ioDialog); };
    windows->tick = [this] { Tick(); };
    mFormer = ostui::SetBackEnd(windows);
    net->SetHandler([this](const RecordedRequest& inRequest) { return OnRequest(inRequest); });
}

EndingsTest::~EndingsTest() {
    Settle();
    mHost.reset();
    ostui::SetBackEnd(mFormer);
    ExchangeLoggedInServer(nullptr);
    ostcore::threads::ResetMainThread();
}

void EndingsTest::Begin(const Ending& inEnding) {
    mEnding = inEnding;
    hub = boost::make_shared<EndingsHub>();
    RFL::QueryInterface<DataServer>(server)->ReleaseCaches();
    DataServer::Settings settings;
    settings.discoveryURL = HubURL("/content/zo/api/discovery.json");
    server = DataServer::Create(settings);
    ServiceDocument document;
    document.links.push_back({kRelation_Productions_Production_ByIdAndCommitId, ImmutableString(),
                              HubURL("/{productionId}/{commitId}"), ImmutableString(), ImmutableString()});
    RFL::QueryInterface<DataServer>(server)->TakeLinksDocument(document);
    ExchangeLoggedInServer(server);
    ReplaceContentCache(QM::CreateDataCacheInMemory());
    net->ClearRequests();
    windows->shown.clear();
    later.clear();
    mShownAfterEnd.clear();
    published = synced = resolved = mWindows = mSilent = 0;
    mRequests = 0;
    mIsHit = mIsTold = false;
    mMayStayOut = true;
    mHost = boost::make_shared<RFL::Listener>(CurrentStation());
    mHost->AddHandler<ZOTerminateConnectionMessage>([this](const ZOTerminateConnectionMessage&) {
        mIsTold = true;
        CloseModalDialogs([] { IZOCDataServer::Terminate(true); });
    });
}

ScriptedAnswer EndingsTest::OnRequest(const RecordedRequest& inRequest) {
    return ++mRequests == mEnding.request ? EndAt(inRequest) : hub->Answer(inRequest);
}

ScriptedAnswer EndingsTest::EndAt(const RecordedRequest& inRequest) {
    mIsHit = true;
    const bool isMain = ostcore::threads::IsMainThread();
    const bool isStarting = mEnding.moment == Moment::kWhileItStarts;
    if (isStarting) {
        mLateAnswer = hub->Answer(inRequest);
    }
    if (isStarting || mEnding.moment == Moment::kBeforeTheRequest) {
        if (isMain) {
            End();
        } else {
            const auto hasEnded = make_shared<Gate>();
            ostcore::threads::AsyncCallFromMainThread([this, hasEnded] {
                End();
                hasEnded->Open();
            });
            Gate::PassThrough(hasEnded, kLongestWait);
        }
    }
    const bool mustBeWaitedFor = isMain || MustBeWaitedFor(inRequest);
    if (isStarting) {
        return mustBeWaitedFor ? ScriptedAnswer(mLateAnswer) : ScriptedAnswer::Hold();
    }
    const ScriptedAnswer answer = hub->Answer(inRequest);
    if (mEnding.moment == Moment::kBeforeTheRequest) {
        return answer;
    }
    // A main thread that blocks in the request can do nothing meanwhile.
    if (mEnding.moment == Moment::kWhenAnswered || isMain) {
        ostcore::threads::AsyncCallFromMainThread([this] { End(); });
        return answer;
    }
    mLateAnswer = answer;
    const bool isReleased = mEnding.moment == Moment::kInFlight || mustBeWaitedFor;
    ostcore::threads::AsyncCallFromMainThread([this, answer, isReleased] {
        End();
        if (isReleased) {
            ostcore::threads::AsyncCallFromMainThread([this, answer] { ReleaseAll(answer); });
        }
    });
    return ScriptedAnswer::Hold();
}

/// The merge of metadata cannot leave its transaction, nor a commit of which it knows no outcome.
bool EndingsTest::MustBeWaitedFor(const RecordedRequest& inRequest) const {
    const std::string path = inRequest.Path();
    if (path == "/s1/transactions" || path == "/s1/new-transaction" || path == "/t1/commit" ||
        path == "/t1/rollback") {
        return true;
    }
    const std::vector<RecordedRequest> requests = net->Requests();
    const auto commit = std::find_if(requests.begin(), requests.end(), [](const RecordedRequest& inOther) {
        return inOther.Path() == "/t1/commit";
    });
    // What follows a commit is a look at what it made of the session.
    return requests.end() - commit > 1 && requests.end() - commit <= 3;
}

/// A request that is out may not be held yet.
void EndingsTest::ReleaseAll(const ScriptedAnswer& inAnswer) {
    while (net->PendingCount() > 0) {
        net->ReleaseHeld(hub->IsDown() ? ScriptedAnswer::NoResponse() : inAnswer);
        std::this_thread::yield();
    }
}

bool EndingsTest::IsLetToFinish() const {
    const std::vector<ostui::Dialog*>& running = ostui::GetRunningDialogs();
    if (running.empty() || running.back()->GetID() != kProgressWindowID) {
        return running.empty();
    }
    // The merge of metadata can be stopped; it runs below no other window.
    return running.back()->GetTitle() != "Resolve Conflicts" || running.size() > 1;
}

void EndingsTest::End() {
    mMayStayOut = IsLetToFinish();
    switch (mEnding.kind) {
        case EndingKind::kCancel:
            if (!ostui::GetRunningDialogs().empty()) {
                CancelWindow(*ostui::GetRunningDialogs().back());
            }
            return;
        case EndingKind::kDrop:
            return hub->GoDown();
        case EndingKind::kTerminate:
            IZOCDataServer::Terminate(true);
            break;
        case EndingKind::kSignOut:
            break;
    }
    ZOTerminateConnectionMessage message;
    message.forced = true;
    PostLibraryMessage(message);
}

void EndingsTest::EndNow(EndingKind inKind) {
    mEnding.kind = inKind;
    End();
    Settle();
}

bool EndingsTest::IsQuiet() {
    for (int round = 0; round < 2; ++round) {
        if (!net->WaitUntilIdle(0) || net->PendingCount() > 0 || !ostcore::threads::WaitForExecutors(0) ||
            ostcore::threads::MainThreadQueueSize() > 0) {
            return false;
        }
    }
    return true;
}

bool EndingsTest::WaitUntil(const std::function<bool()>& inCondition) {
    const auto deadline = Deadline();
    while (!inCondition()) {
        if (IsQuiet() && !inCondition()) {
            return false;
        }
        if (std::chrono::steady_clock::now() >= deadline) {
            ADD_FAILURE() << "what was waited for did not come";
            return false;
        }
        Tick();
    }
    return true;
}

void EndingsTest::Tick() {
    if (ostcore::threads::WaitAndPumpMainThread(1) == 0) {
        mClock->Advance(kTickTime);
    }
}

void EndingsTest::Settle() {
    const auto deadline = Deadline();
    while (!IsQuiet() || mClock->PendingCount() > 0) {
        if (std::chrono::steady_clock::now() >= deadline) {
            ADD_FAILURE() << net->PendingCount() << " requests are out, " << mClock->PendingCount()
                          << " timers run";
            return;
        }
        Tick();
    }
}

void EndingsTest::Continue(const Publish::Continuation& inContinue, const ImmutableString& inCommitId) {
    if (continuesLater) {
        later.push_back(inContinue);
    } else {
        inContinue(kResultSuccess, inCommitId);
    }
}

Publish::SyncCompletion EndingsTest::OnSynced() {
    return [this](bool, bool, const ImmutableString& inCommitId, const Publish::Continuation& inContinue) {
        ++synced;
        Continue(inContinue, inCommitId);
    };
}

Publish::ResolveCompletion EndingsTest::OnResolved() {
    return [this](bool, const InterfaceRef<IZOCProduction>&, const ImmutableString& inCommitId,
                  const Publish::Continuation& inContinue) {
        ++resolved;
        Continue(inContinue, inCommitId);
    };
}

Publish::ConflictsKeptFunction EndingsTest::OnKept() {
    return [this](const std::vector<ImmutableString>& inURLs, const Publish::Continuation& inContinue) {
        EXPECT_EQ(inURLs.size(), 1u);
        ++resolved;
        Continue(inContinue, ImmutableString());
    };
}

void EndingsTest::Share() {
    Publish::Publish(
        u"Film", HubURL("/s1"), ImmutableString("c5"), true, false,
        [this](bool, const ImmutableString&) { ++published; }, OnSynced(), OnResolved(), OnKept(), {},
        nullptr, false, u"");
}

void EndingsTest::GetLatest(bool inIsSilent) {
    mSilent += inIsSilent ? 1 : 0;
    Publish::Sync(u"Film", HubURL("/s1"), HubURL("/p1"), OnSynced(), OnResolved(), OnKept(), {}, nullptr,
                  Publish::WorkflowContinuation(), inIsSilent);
}

void EndingsTest::ResolveOneByOne() {
    GetLatest(true);
    for (const auto& [id, type] : {std::make_pair("a", Publish::kResolveType_AcceptTheirs),
                                   std::make_pair("b", Publish::kResolveType_AcceptYours)}) {
        if (!IsSessionOver()) {
            Publish::ResolveIndividualConflicts(u"Film", HubURL("/s1"), HubURL("/p1"), {ImmutableString(id)},
                                                type, OnResolved(), OnKept(), {});
        }
    }
}

std::size_t EndingsTest::CountOf(const std::string& inLine) const {
    const std::size_t space = inLine.find(' ');
    return SessionTest::CountOf(inLine.substr(0, space), inLine.substr(space + 1));
}

void EndingsTest::ExpectAllIsBack() {
    const auto deadline = Deadline();
    while (net->PendingCount() > 0 && std::chrono::steady_clock::now() < deadline) {
        Tick();
    }
    EXPECT_EQ(net->PendingCount(), 0u) << "nobody waits for it any more: " << net->Lines().back();
}

void EndingsTest::ExpectNothingLeft() {
    EXPECT_THAT(ostui::GetRunningDialogs(), IsEmpty());
    EXPECT_EQ(net->PendingCount(), 0u);
    EXPECT_THAT(mShownAfterEnd, IsEmpty()) << "shown to nobody";
    if (hub->OpenTransactions() > 0) {
        // Nobody can close it who cannot reach the hub; what was known of it must have been tried.
        EXPECT_EQ(mEnding.kind, EndingKind::kDrop) << "a transaction is left";
        EXPECT_TRUE(CountOf("POST /t1/rollback") > 0 || CountOf("GET /t1/enclosures") == 0);
    }
    EXPECT_LE(CountOf("POST /s1/new-transaction"), 1u);
    EXPECT_LE(CountOf("POST /s1/push"), 1u);
}

void EndingsTest::ExpectHostWasTold() {
    EXPECT_EQ(published, windows->CountOf("ZOProgressDialog: Share My Changes"));
    EXPECT_EQ(synced, windows->CountOf("ZOProgressDialog: Get Latest Changes") + mSilent);
    EXPECT_LE(resolved, hub->CountSettled());
    if (!IsSessionOver()) {
        // Of what the hub did, one answer can have got lost.
        EXPECT_GE(resolved + (hub->IsDown() ? 1 : 0), hub->CountSettled());
    }
}

bool EndingsTest::Run(const Flow& inFlow, const Ending& inEnding) {
    SCOPED_TRACE(inEnding.Text());
    Begin(inEnding);
    inFlow();
    if (!mMayStayOut) {
        ExpectAllIsBack();
    }
    ReleaseAll(mLateAnswer);
    Settle();
    ExpectNothingLeft();
    ExpectHostWasTold();
    return mIsHit;
}

std::size_t EndingsTest::EndAtEachRequest(const Flow& inFlow, EndingKind inKind, Moment inMoment) {
    for (std::size_t request = 1; request < kMost && !HasFailure(); ++request) {
        Ending ending;
        ending.kind = inKind;
        ending.request = request;
        ending.moment = inMoment;
        if (!Run(inFlow, ending)) {
            return request - 1;
        }
    }
    ADD_FAILURE() << "the flow has no end";
    return kMost;
}

std::size_t EndingsTest::EndAtEachWindow(const Flow& inFlow, EndingKind inKind) {
    for (std::size_t window = 1; window < kMost && !HasFailure(); ++window) {
        Ending ending;
        ending.kind = inKind;
        ending.window = window;
        if (!Run(inFlow, ending)) {
            return window - 1;
        }
    }
    ADD_FAILURE() << "the flow has no end";
    return kMost;
}

}  // namespace ZOCL
