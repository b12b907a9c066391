// The data server: link tables, request chain, caches of objects, and the login that holds it all together.
#pragma once

#include <atomic>
#include <unordered_map>

#include "Connection/ContentPacking.h"
#include "Connection/ContentReads.h"
#include "Connection/ServiceDocument.h"
#include "ostcore/threads/Scheduler.h"
#include "ostnet/http/ExpiringEntryMap.h"
#include "QM/DataCache.h"
#include "RequestChain/RequestChain.h"
#include "ResourceCaches.h"
#include "ZOClient/IZOCDataServer.h"

namespace ZOCL {

class ReconnectDialog;
class ResourceFactory;
class ZONetworkUnavailableDialog;

/// One server as the client sees it.
///
/// Threads: any. Tables, credentials and caches are guarded by the global lock, which is held for short state
/// changes alone: never over a request start, a completion or a function of the host. What
/// InitFromDiscoveryURL sets before the object is shared is read without a lock.
///
/// Ownership: the chain does not hold the server; a token notification that comes while the server goes finds
/// it or does not, by way of the anchor. The caches hold productions that hold the server, until
/// ReleaseCaches (the end of the session, or another server that takes this one's place).
class DataServer final : public IZOCDataServer, public ResourceCaches {
public:
    /// Answers with the object itself, for code of this floor.
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634461746153ull, 0x6572766572000002ull};
    using LinkTable = std::unordered_map<ImmutableString, ImmutableString>;

    struct Settings {
        ImmutableString discoveryURL;
        ZOSCredentials credentials;
        bool secure = false;
        bool keepCredentials = false;
        bool becomeLoggedIn = true;
    };
    static InterfaceRef<DataServer> Create(const Settings& inSettings);

    std::uint32_t AddRef() noexcept override;
    std::uint32_t Release() noexcept override;
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override;
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

    // --- Connecting (DataServerLogin.cpp).

    /// Runs the login sequence from wherever the tables stand. False: nothing was started.
    bool Authenticate(const ConnectCompletion& inCompletion, const Guid& inRequestID);
    bool TakeTokenFromResponse(const shared_ptr<ostnet::Response>& inResponse);
    bool VerifyAuthentication(const shared_ptr<ostnet::Response>& inResponse);
    /// Drops the token everywhere; what is parked ends with its 401.
    void DropToken();
    /// Ends the login at the server; blocks.
    void SendLogout();
    /// Lets go of all objects; the server is of no more use for signing in again by itself.
    void EndUse();
    void ReleaseCaches();

    // --- A token that was refused (DataServerRenewal.cpp).

    /// Asked by the chain when the hub refuses the token: signs in again with the credentials that were kept,
    /// or sees to it that the user is asked. Any thread.
    void GetNewAuthToken();
    /// Notes that the token is lost and has ShowWarningsIfNeeded run on the main thread, unless both has
    /// happened. Any thread.
    void ScheduleWarnings();
    /// Takes a token that the hub gave for this login elsewhere; what waits for one goes on. False when the
    /// use of this server has ended. Any thread.
    bool AdoptToken(const ImmutableString& inToken);

    // --- A network that is down (DataServerRecovery.cpp).

    /// Told by the chain: true while requests fail one after the other, false when one came through again.
    /// Any thread.
    void WarnAboutRecoverableErrors(bool inDetected);
    /// Tells the user what is wrong, if anything is. Main thread; may run windows.
    void ShowWarningsIfNeeded();
    // For progress windows, which tell of an outage themselves (OutageMinder). Main thread.
    bool IsNetworkDown() const noexcept { return mWarnAboutErrors; }
    bool SignOutFromOutage();
    void OnProgressWindowsGone();

    struct FilledTables {
        bool root = false;
        bool loginLinks = false;
    };
    FilledTables GetFilledTables() const;
    void TakeRootDocument(const ServiceDocument& inDocument);
    void TakeLinksDocument(const ServiceDocument& inDocument);
    ImmutableString GetToken() const;
    bool SupportsUploadCompression() const;
    const RequestChain& Chain() const noexcept { return mChain; }
    /// The URL as a request of this server may use it: moved onto the base. Null, with a trace, when it would
    /// lead to another origin.
    ImmutableString MakeRequestURL(const ImmutableString& inURL) const;

    // --- IZOCDataServer, the server and its tables (DataServer.cpp).

    void SetHeadlessFatalErrorReportingFunction(const function<void(const UString&)>& inFunction) override;
    ImmutableString GetDiscoveryURL() override;
    ImmutableString GetServerVersion() override;
    ImmutableString GetServerName() override;
    ImmutableString GetServerDescription() override;
    ImmutableString GetServerBaseURL() override;
    ImmutableString RebaseURL(const ImmutableString& inURL) override;
    ZOSCredentials GetCredentials() override;
    ImmutableString GetSyslogAddress() override;
    std::uint32_t GetSyslogPort() override;
    std::vector<std::uint32_t> GetRenderProtocolVersions() override;
    bool CanCreateUsers() override;
    ZOLoginData GetLoginData() override;
    bool PostFunction(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds) override;
    InterfaceRef<IZOCDataServer> AddRefSelf() override;
    ImmutableString GetCreateUserLink() override;
    ImmutableString GetLink(const ImmutableString& inRelation) override;
    ImmutableString GetServerID() const;

    // --- IZOCDataServer, resources (DataServerResources.cpp).

    InterfaceRef<IZOCProductionList> GetProductionList(bool inRefresh) override;
    InterfaceRef<IZOCProductionList> GetProductionTemplateList(bool inRefresh) override;
    InterfaceRef<IZOCEnclosures> GetEnclosures() override;
    UString GetLoggedInUserName() override;
    InterfaceRef<IZOCUser> GetLoggedInUser() override;
    bool CreateProduction(const Guid& inRequestID, const UString& inName, const UString& inDescription,
                          bool inIsTemporary, const RequestCompletion& inCompletion) override;
    InterfaceRef<IZOCProduction> CreateProduction(const UString& inName, const UString& inDescription,
                                                  bool inIsTemporary) override;
    InterfaceRef<IZOCMediaLocator> GetMediaLocator(const ImmutableString& inID) override;
    InterfaceRef<IZOCServerResource> GetMediaLocators() override;
    bool CreateAsset(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                     const AssetBaseProperties& inProperties, const RequestCompletion& inCompletion) override;
    InterfaceRef<IZOCAsset> GetAssetFromURL(const ImmutableString& inURL,
                                            ResourceWritability inWritability) override;
    InterfaceRef<IZOCProduction> GetProductionFromURL(const ImmutableString& inURL) override;
    bool LoadProductionFromURL(const ImmutableString& inURL, const Guid& inRequestID,
                               const RequestCompletion& inCompletion) override;
    InterfaceRef<IZOCProduction> GetWritableProductionFromURL(const ImmutableString& inURL) override;
    InterfaceRef<IZOCProduction> GetProductionByIdAndCommitId(const ImmutableString& inProductionID,
                                                              const ImmutableString& inCommitID) override;
    InterfaceRef<IZOCProduction> GetProductionByIdAndCommitId(const ProductionRevision& inRevision) override;
    shared_ptr<RecycledMemory const> GetPayloadFromURL(const ImmutableString& inURL) override;
    bool PostToURL(const ImmutableString& inURL, const shared_ptr<RecycledMemory const>& inBody,
                   const ImmutableString& inContentType, const Guid& inRequestID,
                   const RequestCompletion& inCompletion) override;
    bool PostToURL(const ImmutableString& inURL, const shared_ptr<RecycledMemory const>& inBody,
                   const ostnet::Headers& inHeaders, const Guid& inRequestID,
                   const RequestCompletion& inCompletion) override;
    bool PostToURL(const ImmutableString& inURL, const ostnet::http::Form& inForm, const Guid& inRequestID,
                   const RequestCompletion& inCompletion) override;

    void CacheProduction(const InterfaceRef<IZOCProduction>& inProduction) override;
    InterfaceRef<IZOCProduction> GetCachedProduction(const ImmutableString& inURL) override;
    InterfaceRef<IZOCProduction> FindOrMakeProduction(const ImmutableString& inURL) override;
    void CacheMediaLocator(const InterfaceRef<IZOCMediaLocator>& inLocator) override;
    InterfaceRef<IZOCMediaLocator> GetCachedMediaLocator(const ImmutableString& inID) override;
    void ClearProductionFromCache(const ImmutableString& inURL) override;
    void ClearMediaLocatorFromCache(const ImmutableString& inID) override;

    // --- IZOCDataServer, verbs (DataServerVerbs.cpp, those by content in DataServerContent.cpp).

    using Completion = ostnet::http::CompletionFunction;
    using Payload = shared_ptr<RecycledMemory const>;
    using ResponseRef = shared_ptr<ostnet::Response>;

    void TryToCancelRequest(const Guid& inRequestID) override;
    bool GET(const Guid&, const Completion&, const ImmutableString&, ostnet::Headers) override;
    bool GETByContentID(const ImmutableString&, const Guid&, const Completion&,
                        const ImmutableString&) override;
    bool DELETE(const Guid&, const Completion&, const ImmutableString&, ostnet::Headers) override;
    bool HEAD(const Guid&, const Completion&, const ImmutableString&, ostnet::Headers) override;
    bool POST(const Guid&, const Completion&, const ImmutableString&, ostnet::Headers,
              const Payload&) override;
    bool POST(const Guid&, const Completion&, const ImmutableString&, ostnet::Headers,
              const ostnet::http::Form&) override;
    bool PUT(const Guid&, const Completion&, const ImmutableString&, ostnet::Headers,
             const Payload&) override;
    bool PUT(const Guid&, const Completion&, const ImmutableString&, ostnet::Headers,
             const ostnet::http::Form&) override;
    ResponseRef BlockingGET(const ImmutableString&, ostnet::Headers, std::uint32_t) override;
    ResponseRef BlockingGETByContentID(const ImmutableString&, const ImmutableString&,
                                       std::uint32_t) override;
    ResponseRef BlockingHEAD(const ImmutableString&, ostnet::Headers, std::uint32_t) override;
    ResponseRef BlockingPUT(const ImmutableString&, ostnet::Headers, const Payload&, std::uint32_t) override;
    ResponseRef BlockingPUT(const ImmutableString&, ostnet::Headers, const ostnet::http::Form&,
                            std::uint32_t) override;
    ResponseRef BlockingPOST(const ImmutableString&, ostnet::Headers, const Payload&, std::uint32_t) override;
    ResponseRef BlockingPOST(const ImmutableString&, ostnet::Headers, const ostnet::http::Form&,
                             std::uint32_t) override;
    ResponseRef BlockingDELETE(const ImmutableString&, ostnet::Headers, std::uint32_t) override;

    // --- Payloads that are kept (DataServerContent.cpp).

    /// What a payload of this server is kept under.
    ImmutableString ContentKey(const ImmutableString& inContentID) const;
    /// Gets the inflated payload in a 200 response, or null when the cache could not give it.
    using ContentCompletion = function<void(const ResponseRef&)>;

    /// kResultContentAvailable: outResponse is set, and the completion is not called. kResultContentPending:
    /// the completion is called once, on a worker. A failure: the cache does not hold it.
    int GetCachedContent(const ImmutableString& inContentID, const ContentCompletion& inCompletion,
                         ResponseRef& outResponse, bool inImmediately);
    /// Null when the cache does not hold it or the time, in milliseconds, passed first. Blocks on the disk.
    ResponseRef GetCachedContentSynchronous(const ImmutableString& inContentID,
                                            std::uint32_t inTimeoutMilliseconds);
    /// Keeps what a 2xx answer brought. Returns it inflated as a 200 without headers, 417 for a body that
    /// does not inflate, which is not kept, and any other answer as it is.
    ResponseRef CacheAndDecompressContent(const ImmutableString& inContentID, const ResponseRef& inResponse);
    void CacheContent(const ImmutableString& inContentID, const Payload& inPayload) override;

private:
    class Anchor;
    using ContentMap = ostnet::http::ExpiringEntryMap<ImmutableString, ResponseRef>;
    struct StoredContent {
        ImmutableString contentID;
        ImmutableString name;
        shared_ptr<QM::DataCache> cache;
        ContentCompletion completion;
    };

    DataServer();
    ~DataServer() override;

    void InitFromDiscoveryURL(const Settings& inSettings);
    void UpdateLoginData() ZO_REQUIRES(IZOCDataServer::GetLock());
    void EnableRetries();
    bool BecomeLoggedInServer();
    void OnRenewed(const Guid& inRequest, int inResult, const InterfaceRef<IZOCDataServer>& inServer);
    void ShowTokenLostIfNeeded();
    void PromptForReconnect();
    /// False when the user gave up.
    bool AskUntilReconnected(ReconnectDialog& ioDialog, const ZOLoginData& inLoginData);
    void OnNetworkDown();
    void OnNetworkBack();
    void QueueShowWarnings();
    void PromptForRecoverableErrors();
    void SignOutFromWarning();
    void CloseNetworkWarning();
    void HandleHeadlessNetworkFailureTimeout();
    /// Only a headless process: tells the host and ends the process.
    void ReportFatalHeadlessError(const std::string& inMessage);
    bool HasUseEnded() const;
    /// Signs a token out that came too late to be used.
    void Revoke(const ImmutableString& inToken);
    void OnProductionLoadedForCache(const ImmutableString& inURL,
                                    const InterfaceRef<IZOCProduction>& inProduction);
    InterfaceRef<IZOCProductionList> MakeProductionList(const ImmutableString& inRelation);
    ResponseRef WaitForResponse(std::uint32_t inTimeoutMilliseconds,
                                const function<bool(const Guid&, const Completion&)>& inStart);
    int GetSimplyCachedContent(const ImmutableString& inContentID, ResponseRef& outResponse);
    int GetStoredContent(const ImmutableString& inContentID, const ContentCompletion& inCompletion,
                         ResponseRef& outResponse, bool inImmediately);
    int UseHeldContent(const StoredContent& inContent, const Payload& inStored, ResponseRef& outResponse);
    int UseHeldContentLater(const StoredContent& inContent, const Payload& inStored);
    void OnGetCachedContentComplete(const StoredContent& inContent, const Payload& inStored);
    void DropContent(const StoredContent& inContent);
    void CacheSimply(const ImmutableString& inContentID, const ResponseRef& inResponse);
    bool RequestContent(const ImmutableString& inContentID, const Guid& inRequestID,
                        const Completion& inCompletion, const ImmutableString& inURL);
    void OnContentFromCache(const ImmutableString& inContentID, const Guid& inRequestID,
                            const Completion& inCompletion, const ImmutableString& inURL,
                            const ResponseRef& inResponse);
    InterfaceRef<IZOCDataServer> Self() { return InterfaceRef<IZOCDataServer>(this); }

    std::atomic<std::uint32_t> mReferences{0};
    shared_ptr<Anchor> mAnchor;

    // Set once, before the server is shared.
    ImmutableString mDiscoveryURL;
    ImmutableString mBaseURL;
    bool mSecure = false;
    bool mBecomeLoggedIn = true;
    RequestChain mChain;
    shared_ptr<ContentPacking> mContentPacking;
    const bool mUseSimpleContentCache;
    /// Null unless it is used.
    const shared_ptr<ContentMap> mSimpleContentCache;
    ContentReads mContentReads;

    ServiceDocument::Description mDescription ZO_GUARDED_BY(IZOCDataServer::GetLock());
    LinkTable mRootLinks ZO_GUARDED_BY(IZOCDataServer::GetLock());
    LinkTable mAuthenticatedLinks ZO_GUARDED_BY(IZOCDataServer::GetLock());
    LinkTable mLoginLinks ZO_GUARDED_BY(IZOCDataServer::GetLock());
    ZOLoginData mLoginData ZO_GUARDED_BY(IZOCDataServer::GetLock());
    function<void(const UString&)> mFatalErrorFunction ZO_GUARDED_BY(IZOCDataServer::GetLock());
    ZOSCredentials mCredentials ZO_GUARDED_BY(IZOCDataServer::GetLock());
    ZOSCredentials mSavedCredentials ZO_GUARDED_BY(IZOCDataServer::GetLock());
    bool mSupportsUploadCompression ZO_GUARDED_BY(IZOCDataServer::GetLock()) = false;
    bool mUseHasEnded ZO_GUARDED_BY(IZOCDataServer::GetLock()) = false;
    /// The sign-in that renews the token, the null identifier when there is none.
    Guid mRenewal ZO_GUARDED_BY(IZOCDataServer::GetLock());
    shared_ptr<ReconnectDialog> mReconnectDialog ZO_GUARDED_BY(IZOCDataServer::GetLock());
    shared_ptr<ZONetworkUnavailableDialog> mNetworkWarning ZO_GUARDED_BY(IZOCDataServer::GetLock());
    /// When the present failure began, in a headless process alone.
    optional<ostcore::threads::MonotonicTime> mFirstFailureTime ZO_GUARDED_BY(IZOCDataServer::GetLock());
    /// The network is considered down.
    std::atomic<bool> mWarnAboutErrors{false};
    /// PromptForRecoverableErrors runs.
    std::atomic<bool> mPromptActive{false};
    std::atomic<bool> mTokenLost{false};
    /// A login of this server has been accepted before.
    std::atomic<bool> mWasAccepted{false};
    std::atomic<bool> mReconnectActive{false};
    std::unordered_map<ImmutableString, InterfaceRef<IZOCProduction>> mProductionCache
        ZO_GUARDED_BY(IZOCDataServer::GetLock());
    std::unordered_map<ImmutableString, InterfaceRef<IZOCMediaLocator>> mMediaLocatorCache
        ZO_GUARDED_BY(IZOCDataServer::GetLock());
    InterfaceRef<IZOCUser> mLoggedInUser ZO_GUARDED_BY(IZOCDataServer::GetLock());
};

}  // namespace ZOCL
