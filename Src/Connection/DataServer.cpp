// Life of a data server, its tables and what they answer. Login, verbs and resources have sources of their
// own.
#include "Connection/DataServer.h"

#include "Connection/DataServerAnchor.h"
#include "Connection/ServerURLs.h"
#include "HLM/HLM.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"
#include "Relations.h"
#include "ZOClient/Registry.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

DataServer::LinkTable MakeTable(const Links& inLinks) {
    DataServer::LinkTable table;
    for (const Link& link : inLinks) {
        if (!link.relation.IsNull() && !link.href.IsNull()) {
            table.emplace(link.relation, link.href);
        }
    }
    return table;
}

ImmutableString FindHRef(const DataServer::LinkTable& inTable, const ImmutableString& inRelation) {
    const auto found = inTable.find(inRelation);
    return found == inTable.end() ? ImmutableString() : found->second;
}

/// The token that a host left for a headless process of this user. It belongs to the server that it was given
/// by, and goes to no other.
ImmutableString FindTokenLeftByHost(const ImmutableString& inUsername, const ImmutableString& inBaseURL) {
    ZOLoginData data;
    if (!HLM::GetIsHeadless() ||
        !Registry::GetLastLoginData(data, true, ostcore::utility::ToUTF16(inUsername.view()))) {
        return ImmutableString();
    }
    const bool sameServer = IZOCDataServer::MakeDataServerURL(data.serverURL, data.secure) == inBaseURL;
    return sameServer && data.username == inUsername ? data.token : ImmutableString();
}

}  // namespace

InterfaceRef<DataServer> DataServer::Create(const Settings& inSettings) {
    InterfaceRef<DataServer> server(new DataServer);
    server->InitFromDiscoveryURL(inSettings);
    return server;
}

DataServer::~DataServer() {
    if (!mAnchor) {
        return;
    }
    mAnchor->Clear();
    // Nobody is left to renew a token; what is parked must end, and not on this thread, which may hold locks.
    const auto authorization = mChain.authorization;
    const auto endParked = [authorization] { authorization->ClearAuthTokenNotificationFunction(); };
    if (!mChain.global->PostFunction(endParked, 0)) {
        endParked();
    }
}

void DataServer::InitFromDiscoveryURL(const Settings& inSettings) {
    mDiscoveryURL = inSettings.discoveryURL;
    mBaseURL = ImmutableString(CutToBaseURL(mDiscoveryURL.view()));
    mSecure = inSettings.secure;
    mBecomeLoggedIn = inSettings.becomeLoggedIn;
    ZOSCredentials credentials = inSettings.credentials;
    ZOSCredentials saved;
    if (inSettings.keepCredentials) {
        saved = credentials;
        saved.token = ImmutableString();
    }
    const ImmutableString leftByHost = FindTokenLeftByHost(credentials.username, mBaseURL);
    if (!leftByHost.IsNull()) {
        credentials.token = leftByHost;
    }
    mAnchor = boost::make_shared<Anchor>(this);
    ChainCallbacks callbacks;
    callbacks.tokenNotification = [anchor = mAnchor] {
        if (const InterfaceRef<DataServer> server = anchor->Lock()) {
            server->GetNewAuthToken();
        }
    };
    callbacks.recoverableErrors = [anchor = mAnchor](bool inDetected) {
        if (const InterfaceRef<DataServer> server = anchor->Lock()) {
            server->WarnAboutRecoverableErrors(inDetected);
        }
    };
    mChain = BuildRequestChain(callbacks, credentials.token);
    mContentPacking = boost::make_shared<ContentPacking>(mChain.global);
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::InitFromDiscoveryURL");
    mCredentials = std::move(credentials);
    mSavedCredentials = std::move(saved);
    UpdateLoginData();
}

void DataServer::UpdateLoginData() {
    mLoginData.serverURL = ImmutableString(MakeServerText(mBaseURL.view(), mSecure));
    mLoginData.username = mCredentials.username;
    mLoginData.token = mCredentials.token;
    mLoginData.secure = mSecure;
}

std::uint32_t DataServer::AddRef() noexcept {
    return mReferences.fetch_add(1, std::memory_order_relaxed) + 1;
}

std::uint32_t DataServer::Release() noexcept {
    const std::uint32_t left = mReferences.fetch_sub(1, std::memory_order_acq_rel) - 1;
    if (left == 0) {
        delete this;
    }
    return left;
}

int DataServer::QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    const int result = QueryInterfaceNoAddRef(inID, outInterface);
    if (result >= 0) {
        AddRef();
    }
    return result;
}

int DataServer::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    if (inID == IZOCDataServer::kInterfaceID || inID == RFL::RFLUnknown::kInterfaceID) {
        *outInterface = static_cast<IZOCDataServer*>(this);
    } else if (inID == ResourceCaches::kInterfaceID) {
        *outInterface = static_cast<ResourceCaches*>(this);
    } else if (inID == DataServer::kInterfaceID) {
        *outInterface = this;
    } else {
        *outInterface = nullptr;
        return RFL::kResultInterfaceNotSupported;
    }
    return RFL::kResultSuccess;
}

InterfaceRef<IZOCDataServer> DataServer::AddRefSelf() {
    return Self();
}

DataServer::FilledTables DataServer::GetFilledTables() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::Authenticate");
    return {!mRootLinks.empty(), !mLoginLinks.empty()};
}

void DataServer::TakeRootDocument(const ServiceDocument& inDocument) {
    LinkTable links = MakeTable(inDocument.links);
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::OnServiceDocumentRootLoaded");
    mDescription = inDocument.server;
    mRootLinks.swap(links);
}

void DataServer::TakeLinksDocument(const ServiceDocument& inDocument) {
    LinkTable links = MakeTable(inDocument.links);
    const bool isForLogin = links.count(kRelation_System_Login) > 0;
    const std::uint32_t major = inDocument.majorVersion;
    const std::uint32_t minor = inDocument.minorVersion;
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::OnServiceDocumentLinksLoaded");
    (isForLogin ? mLoginLinks : mAuthenticatedLinks).swap(links);
    // A server 2.0 does not get compressed uploads; servers in the field rely on the rule as it stands.
    mSupportsUploadCompression = major != 0 && minor != 0 && (major > 1 || minor >= 2);
}

ImmutableString DataServer::GetToken() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetToken");
    return mCredentials.token;
}

bool DataServer::SupportsUploadCompression() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::SupportsUploadCompression");
    return mSupportsUploadCompression;
}

ImmutableString DataServer::MakeRequestURL(const ImmutableString& inURL) const {
    const ImmutableString url(MoveOntoBase(inURL.view(), mBaseURL.view()));
    if (IsOnBase(url.view(), mBaseURL.view())) {
        return url;
    }
    if (ostcore::debug::TraceEnabled("ZOCL", ostcore::debug::kTraceLevel_Error)) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error,
                              ostcore::debug::StructuredText(
                                  "A request was not sent, since its URL does not lead to the server that "
                                  "we are connected to; check the links that the server gives")
                                  .Add("uri", inURL.view())
                                  .Add("server", mBaseURL.view()));
    }
    return ImmutableString();
}

ImmutableString DataServer::RebaseURL(const ImmutableString& inURL) {
    return ImmutableString(MoveOntoBase(inURL.view(), mBaseURL.view()));
}

ImmutableString DataServer::GetLink(const ImmutableString& inRelation) {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetLink");
    for (const LinkTable* table : {&mAuthenticatedLinks, &mLoginLinks, &mRootLinks}) {
        const ImmutableString href = FindHRef(*table, inRelation);
        if (!href.IsNull()) {
            return href;
        }
    }
    return ImmutableString();
}

void DataServer::SetHeadlessFatalErrorReportingFunction(const function<void(const UString&)>& inFunction) {
    function<void(const UString&)> former = inFunction;
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::SetHeadlessFatalErrorReportingFunction");
    former.swap(mFatalErrorFunction);
    lock.Unlock();
}

ImmutableString DataServer::GetDiscoveryURL() {
    return mDiscoveryURL;
}

ImmutableString DataServer::GetServerBaseURL() {
    return mBaseURL;
}

ImmutableString DataServer::GetServerID() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetServerID");
    return mDescription.id;
}

ImmutableString DataServer::GetServerVersion() {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetServerVersion");
    return mDescription.version;
}

ImmutableString DataServer::GetServerName() {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetServerName");
    return mDescription.name;
}

ImmutableString DataServer::GetServerDescription() {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetServerDescription");
    return mDescription.description;
}

ImmutableString DataServer::GetSyslogAddress() {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetSyslogAddress");
    return mDescription.syslogAddress;
}

std::uint32_t DataServer::GetSyslogPort() {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetSyslogPort");
    return mDescription.syslogPort;
}

std::vector<std::uint32_t> DataServer::GetRenderProtocolVersions() {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetRenderProtocolVersions");
    return mDescription.renderProtocolVersions;
}

ZOSCredentials DataServer::GetCredentials() {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetCredentials");
    return mCredentials;
}

ZOLoginData DataServer::GetLoginData() {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetLoginData");
    return mLoginData;
}

ImmutableString DataServer::GetCreateUserLink() {
    return GetLink(kRelation_Users_User_Create);
}

bool DataServer::CanCreateUsers() {
    return !GetCreateUserLink().IsNull();
}

bool DataServer::PostFunction(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds) {
    return mChain.global->PostFunction(inFunction, inDelayMilliseconds);
}

}  // namespace ZOCL
