// A whole hub inside the test.
#include "HubFixture.h"

#include <fstream>
#include <iterator>

#include "Base/Password.h"
#include "Routes/Documents.h"

namespace zohub::test {

namespace fs = std::filesystem;

namespace {

// Hashing is slow on purpose; every test of a process can share the result.
std::string const& HashOf(std::string const& inPassword) {
    static std::map<std::string, std::string> hashes;
    std::string& hash = hashes[inPassword];
    if (hash.empty())
        hash = HashPassword(inPassword);
    return hash;
}

}  // namespace

TemporaryDirectory::TemporaryDirectory() {
    std::string pattern = (fs::temp_directory_path() / "zohub-test-XXXXXX").string();
    if (!mkdtemp(pattern.data()))
        throw std::runtime_error("no temporary directory");
    mPath = pattern;
}

TemporaryDirectory::~TemporaryDirectory() {
    std::error_code ignored;
    fs::remove_all(mPath, ignored);
}

void WriteFile(fs::path const& inPath, std::string const& inBytes) {
    fs::create_directories(inPath.parent_path());
    std::ofstream(inPath, std::ios::binary) << inBytes;
}

std::string ReadFile(fs::path const& inPath) {
    std::ifstream file(inPath, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

std::string LinkOf(Json const& inDocument, std::string const& inRelation) {
    std::string const relation =
        inRelation.front() == '/' ? std::string(kRelationBase) + inRelation : inRelation;
    for (auto const& link : inDocument.at("links"))
        if (link.at("rel") == relation)
            return link.at("href").get<std::string>();
    return {};
}

bool HasLink(Json const& inDocument, std::string const& inRelation) {
    return !LinkOf(inDocument, inRelation).empty();
}

RunningHub::RunningHub(ServerLimits const& inLimits, std::string const& inFaultScript)
    : mStorage(OpenSqliteStorage(mDirectory.Path().string())) {
    HubSettings settings;
    settings.id = "hub-under-test";
    settings.tokenLifetime = 3600 * kSecond;
    mHub = std::make_unique<Hub>(*mStorage, settings, [this] { return mNow.load(); });
    mFaults = std::make_unique<FaultInjector>(
        ParseFaultScript(inFaultScript, "script"),
        [this](Request const& inRequest) { mHub->ForgetToken(inRequest); },
        [this](std::string const& inFault) {
            std::lock_guard const lock(mMutex);
            mToldFaults.push_back(inFault);
        });
    FaultFunction faultOf;
    if (!inFaultScript.empty())
        faultOf = [this](Request const& inRequest) { return mFaults->PlanFor(inRequest); };
    mServer = std::make_unique<Server>(
        inLimits, [this](Request const& inRequest) { return mHub->Handle(inRequest); }, Hub::LaneOf, faultOf);
    mPort = mServer->ListenPlain("127.0.0.1", 0);
    mServer->Start();
}

std::vector<std::string> RunningHub::ToldFaults() const {
    std::lock_guard const lock(mMutex);
    return mToldFaults;
}

void RunningHub::AddUser(std::string const& inName, std::string const& inPassword, bool inIsAdmin) {
    auto const transaction = mStorage->BeginWrite();
    UserRecord user;
    user.name = inName;
    user.passwordHash = HashOf(inPassword);
    user.isAdmin = inIsAdmin;
    transaction->PutUser(user);
    transaction->Commit();
}

Client RunningHub::SignedIn(std::string const& inName) {
    Client client(mPort);
    if (client.SignIn(inName, inName + "-secret").status != 200)
        throw std::runtime_error("sign-in failed");
    return client;
}

HubTest::HubTest() : mAnna(0) {
    mHub.AddUser("anna", "anna-secret");
    mHub.AddUser("ben", "ben-secret");
    mAnna = mHub.SignedIn("anna");
}

Json HubTest::MakeProduction(Client const& inClient, std::string const& inName) {
    Json const body = {{"name", inName}, {"description", "made by a test"}, {"isTemporary", false}};
    Answer const answer = inClient.PostJson("/zo/1/p", JsonText(body));
    EXPECT_EQ(answer.status, 201) << answer.body;
    return Json::parse(answer.body);
}

Json HubTest::MakeAsset(Client const& inClient, Json const& inProduction, std::string const& inProperties) {
    Answer const answer = inClient.PostJson(LinkOf(inProduction, "/assets/asset#create"),
                                            "{\"properties\":" + inProperties + "}");
    EXPECT_EQ(answer.status, 201) << answer.body;
    return Json::parse(answer.body);
}

}  // namespace zohub::test
