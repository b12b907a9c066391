// The work of the two users, and what is read back of it.
#include "RoadFixture.h"

#include "Connection/LoggedInServer.h"
#include "MergeTest.h"
#include "ostcore/threads/Executor.h"
#include "ostui/MessageBox.h"
#include "ZOClient/IZOCProductionHistory.h"

#include <QtCore/QCoreApplication>
#include <QtCore/QEvent>

namespace ZOCL {

namespace {

std::string LastPart(const std::string& inPath) {
    return inPath.substr(inPath.rfind('/') + 1);
}

}  // namespace

RequestLog::RequestLog(const shared_ptr<ostnet::http::RequestProcessor>& inNext)
    : ForwardingProcessor(inNext) {}

void RequestLog::Clear() {
    std::lock_guard<std::mutex> lock(mMutex);
    mRequests.clear();
}

std::vector<RequestLog::Request> RequestLog::All() const {
    std::lock_guard<std::mutex> lock(mMutex);
    return mRequests;
}

std::vector<std::string> RequestLog::Writes() const {
    std::vector<std::string> writes;
    for (const Request& request : All()) {
        if (request.verb != "GET") {
            writes.push_back(request.verb + " " + LastPart(request.path));
        }
    }
    return writes;
}

std::string RequestLog::BodyOf(const std::string& inEnd) const {
    for (const Request& request : All()) {
        if (request.verb != "GET" && LastPart(request.path) == inEnd) {
            return request.body;
        }
    }
    return "none";
}

void RequestLog::SetOnRequest(std::function<void()> inFunction) {
    std::lock_guard<std::mutex> lock(mMutex);
    mOnRequest.swap(inFunction);
}

void RequestLog::Note(const char* inVerb, const ImmutableString& inURL,
                      const shared_ptr<RecycledMemory const>& inPayload) {
    const std::string url = inURL.str();
    const std::size_t host = url.find("://");
    std::function<void()> onRequest;
    {
        std::lock_guard<std::mutex> lock(mMutex);
        mRequests.push_back({inVerb, url.substr(url.find('/', host + 3)),
                             inPayload ? std::string(inPayload->view()) : std::string()});
        onRequest = mOnRequest;
    }
    if (onRequest) {
        onRequest();
    }
}

bool RequestLog::GET(const Guid& inID, const ostnet::http::CompletionFunction& inCompletion,
                     const ImmutableString& inURL, ostnet::Headers inHeaders,
                     const ostnet::http::RequestOptions& inOptions) {
    Note("GET", inURL, nullptr);
    return Next()->GET(inID, inCompletion, inURL, std::move(inHeaders), inOptions);
}

bool RequestLog::PUT(const Guid& inID, const ostnet::http::CompletionFunction& inCompletion,
                     const ImmutableString& inURL, ostnet::Headers inHeaders,
                     const shared_ptr<RecycledMemory const>& inPayload,
                     const ostnet::http::RequestOptions& inOptions) {
    Note("PUT", inURL, inPayload);
    return Next()->PUT(inID, inCompletion, inURL, std::move(inHeaders), inPayload, inOptions);
}

bool RequestLog::POST(const Guid& inID, const ostnet::http::CompletionFunction& inCompletion,
                      const ImmutableString& inURL, ostnet::Headers inHeaders,
                      const shared_ptr<RecycledMemory const>& inPayload,
                      const ostnet::http::RequestOptions& inOptions) {
    Note("POST", inURL, inPayload);
    return Next()->POST(inID, inCompletion, inURL, std::move(inHeaders), inPayload, inOptions);
}

RoadTest::RoadTest()
    : user(boost::make_shared<User>()),
      log(boost::make_shared<RequestLog>(ostnet::http::GetGlobalRequestProcessor())),
      hostPart([](const Publish::Continuation& inContinue, const ImmutableString& inCommitId) {
          inContinue(kResultSuccess, inCommitId);
      }) {
    mFormer = ostui::SetBackEnd(user);
    ostnet::http::SetGlobalRequestProcessor(log);
    anna = std::make_shared<Member>(hub.URL().str(), "anna");
    ben = std::make_shared<Member>(hub.URL().str(), "ben");
}

RoadTest::~RoadTest() {
    Settle();
    EXPECT_TRUE(ostui::GetRunningDialogs().empty());
    annas.Reset();
    ExchangeLoggedInServer(nullptr);
    anna.reset();
    ben.reset();
    ostui::SetBackEnd(mFormer);
    ostnet::http::SetGlobalRequestProcessor(nullptr);
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
}

void RoadTest::Settle() {
    for (int round = 0; round < 3; ++round) {
        EXPECT_TRUE(ostcore::threads::WaitForExecutors(20000));
        ostcore::threads::PumpMainThread();
    }
}

ImmutableString RoadTest::Head(const Session& inSession) {
    Refresh(inSession);
    return As<IZOCProduction>(inSession)->GetLoadedRevision();
}

std::string RoadTest::Packet(const std::string& inProperties) {
    return PacketText(inProperties);
}

std::string RoadTest::Payload(const InterfaceRef<IZOCProduction>& inProduction,
                              const ImmutableString& inName) {
    const auto list = inProduction->GetEnclosures();
    EXPECT_TRUE(As<IZOCServerResource>(list)->Load(true));
    const auto enclosure = list->GetEnclosure(inName);
    return enclosure ? enclosure->GetEnclosurePayloadAsUTF8() : "none";
}

void RoadTest::Change(const Session& inSession, const UString& inWho, const std::string& inPacket) {
    Head(inSession);
    const auto transaction = OpenTransaction(inSession);
    const auto assets = As<IZOCProduction>(transaction)->GetAssets();
    ASSERT_TRUE(As<IZOCServerResource>(assets)->Load(true));
    for (const UString name : {u"A", u"C"}) {
        AssetBaseProperties properties = assets->GetAssetByName(name)->GetAssetBaseProperties();
        properties.name += u" of " + inWho;
        const auto asset = As<IZOCWritableAsset>(assets->GetAssetByName(name));
        EXPECT_EQ(Perform([&](const Guid& inID, const RequestCompletion& inDone) {
                      return asset->SetAssetBasePropertiesAndUpdate(properties, inID, inDone);
                  }).result,
                  kResultSuccess);
    }
    EXPECT_EQ(Write(transaction, kNotes, "notes of " + ostcore::utility::ToUTF8(inWho) + kNotesEnd),
              kResultSuccess);
    EXPECT_EQ(Write(transaction, kPacketName, inPacket), kResultSuccess);
    EXPECT_EQ(Commit(transaction, inWho), kResultSuccess);
}

void RoadTest::BeginWork() {
    annas = anna->OpenSession();
    const auto start = OpenTransaction(annas);
    Add(start, u"A");
    Add(start, u"C");
    const std::string title = "<own:scene>1</own:scene><own:take>1</own:take>";
    EXPECT_EQ(Write(start, kPacketName, Packet(title)), kResultSuccess);
    EXPECT_EQ(Commit(start), kResultSuccess);
    EXPECT_EQ(Push(annas, u"Start"), kResultSuccess);
    const Session bens = ben->OpenSession();
    Change(bens, u"ben", Packet("<own:scene>2</own:scene><own:take>1</own:take>"));
    EXPECT_EQ(Push(bens, u"His"), kResultSuccess);
    Change(annas, u"anna", Packet("<own:scene>1</own:scene><own:take>7</own:take>"));
    ExchangeLoggedInServer(anna->server);
    log->Clear();
}

void RoadTest::PlayHost(const char* inWhat, const Publish::Continuation& inContinue,
                        const ImmutableString& inCommitId) {
    told.push_back(inWhat);
    hostPart(inContinue, inCommitId);
}

bool RoadTest::Share() {
    const bool isShared = Publish::Publish(
        ostcore::utility::ToUTF16(kProductionName), As<IZOCServerResource>(annas)->GetHTTPURL(), Head(annas),
        true, true,
        [this](bool inSucceeded, const ImmutableString&) {
            told.push_back(inSucceeded ? "shared" : "not shared");
        },
        [this](bool inDone, bool inConflicts, const ImmutableString& inCommitId,
               const Publish::Continuation& inContinue) {
            PlayHost(!inDone ? "no latest" : inConflicts ? "conflicts" : "latest", inContinue, inCommitId);
        },
        [this](bool, const InterfaceRef<IZOCProduction>& inHead, const ImmutableString& inCommitId,
               const Publish::Continuation& inContinue) {
            PlayHost(inHead ? "replaced" : "replaced of nothing", inContinue, inCommitId);
        },
        [this](const std::vector<ImmutableString>& inURLs, const Publish::Continuation& inContinue) {
            PlayHost(inURLs.size() == 1 ? "kept" : "kept others", inContinue, ImmutableString());
        },
        {kAssetType_Bin}, tracker, false, u"");
    return isShared;
}

std::pair<std::string, ImmutableString> RoadTest::Newest() {
    const Member elsewhere(hub.URL().str(), "ben");
    const auto history = elsewhere.production->GetProductionHistory();
    EXPECT_TRUE(As<IZOCServerResource>(history)->Load(true));
    UString date, name, title, message, revision;
    history->GetHistoryVersion(0)->GetInfo(date, name, title, message, revision);
    return {ostcore::utility::ToUTF8(title), history->GetMostRecentRevision()};
}

void RoadTest::ExpectResolve() {
    user->Expect("ZOResolveDialog", [](QDialog& ioWindow) {
        const struct {
            const char* item;
            const char* way;
        } steps[] = {{"A of anna", "Take the shared version"},
                     {"C of anna", "Copy and rename your version, then take the shared version"},
                     {kNotes, "Keep your version"}};
        int left = 3;
        for (const auto& step : steps) {
            if (User::IsOver(ioWindow)) {
                return;
            }
            User::Rows(ioWindow, left);
            // Whatever cell of the row is clicked.
            User::ClickCell(ioWindow, step.item, --left);
            User::Click(ioWindow, step.way);
            User::Click(ioWindow, "Resolve");
        }
    });
}

void RoadTest::ExpectShareWindow() {
    user->Expect("ZOPublishDialog", [](QDialog& ioWindow) {
        User::Type(ioWindow, "First cut, with \"quotes\"");
        User::Click(ioWindow, "Share");
    });
}

void RoadTest::ExpectWholeRoad() {
    user->Expect("MessageBox", [](QDialog& ioWindow) { User::Click(ioWindow, "Get Latest Changes"); });
    ExpectResolve();
    user->Expect("MessageBox", [](QDialog& ioWindow) {
        const ostui::Control* const image = ostui::GetRunningDialogs().back()->Find(ostui::kMessageBoxImage);
        EXPECT_TRUE(image && image->image == "MessageBoxNote");
        User::Click(ioWindow, "OK");
    });
    ExpectShareWindow();
}

}  // namespace ZOCL
