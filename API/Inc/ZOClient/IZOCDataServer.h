// The client's picture of one server: connection, link tables, request verbs and factory of resources.
#pragma once

#include <vector>

#include "ostcore/threads/RecursiveMutex.h"
#include "ostnet/http/RequestProcessor.h"
#include "ZOClient/Credentials.h"
#include "ZOClient/IZOCAsset.h"
#include "ZOClient/IZOCEnclosure.h"
#include "ZOClient/IZOCMediaLocator.h"
#include "ZOClient/IZOCProduction.h"
#include "ZOClient/IZOCServerResource.h"
#include "ZOClient/IZOCUser.h"

namespace ZOCL {

// Declared before their own header when that is the one that led here.
class IZOCProduction;
class IZOCProductionList;

/// Names a production at a commit; an empty commit stands for the newest.
struct ProductionRevision {
    ImmutableString productionID;
    ImmutableString commitID;
};

/// One server. Everything that talks to it goes through this object.
///
/// Threads: any. URLs given to the verbs are first rebased onto the server that the client connected to.
/// The blocking forms wait for ever when the time-out is ostnet::http::kWaitForever, and on the main thread
/// always; a wait elsewhere that times out cancels its request and then waits for its end.
class ZOCL_EXPORT IZOCDataServer : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634461746153ull, 0x6572766572000001ull};

    /// Posted at the end of every connect request (Messages.h).
    struct LoginCompleteMessage;

    using ConnectCompletion =
        function<void(const Guid& inRequestID, const InterfaceRef<IZOCDataServer>& inServer, int inResult,
                      const shared_ptr<ostnet::Response>& inResponse)>;

    // --- Connecting. Completions run once, on a worker, with no lock held.

    /// Loads the service documents, signs in, and completes with the server, or with null and the reason.
    /// False: nothing was started and the completion will not run.
    static bool ConnectToServer(const ImmutableString& inServer, const ZOSCredentials& inCredentials,
                                Guid& outRequestID, bool inSecure, const ConnectCompletion& inCompletion,
                                bool inKeepCredentials, bool inBecomeLoggedIn);
    static bool ConnectToServerFromDiscoveryURL(const ImmutableString& inDiscoveryURL,
                                                const ZOSCredentials& inCredentials, Guid& outRequestID,
                                                bool inSecure, const ConnectCompletion& inCompletion,
                                                bool inKeepCredentials, bool inBecomeLoggedIn);
    /// Builds the object and its chain and starts nothing.
    static InterfaceRef<IZOCDataServer> CreateDataServerRef(const ImmutableString& inServer,
                                                            const ZOSCredentials& inCredentials,
                                                            bool inSecure, bool inKeepCredentials,
                                                            bool inBecomeLoggedIn);
    /// For services that work without login: loads the documents and stops there.
    static bool CreateUnauthenticatedDataServer(
        const Guid& inRequestID, const ImmutableString& inServer,
        const function<void(int inResult, InterfaceRef<IZOCDataServer> inServer)>& inCompletion,
        bool inSecure);
    /// Adds the scheme and the default port where they are missing.
    static ImmutableString MakeDataServerURL(const ImmutableString& inServer, bool inSecure);
    static ImmutableString GetDiscoveryURL(const ImmutableString& inServer);
    static void CancelConnectRequest(const Guid& inRequestID);
    /// Gives up the logged-in server; with inEndSession also its token and its login at the server (blocks).
    static void Terminate(bool inEndSession);
    static InterfaceRef<IZOCDataServer> GetLoggedInServerRef();
    /// The global lock of the connection layer. Held only for short state changes.
    static const ostcore::threads::RecursiveMutex& GetLock();

    // --- The server and its resources. A getter yields null when the server has no such link.

    virtual void SetHeadlessFatalErrorReportingFunction(const function<void(const UString&)>& inFunction) = 0;
    virtual InterfaceRef<IZOCProductionList> GetProductionList(bool inRefresh) = 0;
    virtual InterfaceRef<IZOCProductionList> GetProductionTemplateList(bool inRefresh) = 0;
    virtual InterfaceRef<IZOCEnclosures> GetEnclosures() = 0;
    virtual ImmutableString GetDiscoveryURL() = 0;
    virtual ImmutableString GetServerVersion() = 0;
    virtual ImmutableString GetServerName() = 0;
    virtual ImmutableString GetServerDescription() = 0;
    /// The full name of the logged-in user when it is known, else the user name. Blocks for the first load.
    virtual UString GetLoggedInUserName() = 0;
    /// Not loaded by this call; answers IZOCServerResource.
    virtual InterfaceRef<IZOCUser> GetLoggedInUser() = 0;
    /// The discovery URL without its fixed path.
    virtual ImmutableString GetServerBaseURL() = 0;
    virtual bool CreateProduction(const Guid& inRequestID, const UString& inName,
                                  const UString& inDescription, bool inIsTemporary,
                                  const RequestCompletion& inCompletion) = 0;
    /// Blocks; null on failure.
    virtual InterfaceRef<IZOCProduction> CreateProduction(const UString& inName, const UString& inDescription,
                                                          bool inIsTemporary) = 0;
    virtual InterfaceRef<IZOCMediaLocator> GetMediaLocator(const ImmutableString& inID) = 0;
    virtual InterfaceRef<IZOCServerResource> GetMediaLocators() = 0;
    virtual bool CreateAsset(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                             const AssetBaseProperties& inProperties,
                             const RequestCompletion& inCompletion) = 0;
    virtual InterfaceRef<IZOCAsset> GetAssetFromURL(const ImmutableString& inURL,
                                                    ResourceWritability inWritability) = 0;
    /// From the cache, or created; loaded, which blocks. A production that cannot be loaded is returned
    /// unloaded.
    virtual InterfaceRef<IZOCProduction> GetProductionFromURL(const ImmutableString& inURL) = 0;
    virtual bool LoadProductionFromURL(const ImmutableString& inURL, const Guid& inRequestID,
                                       const RequestCompletion& inCompletion) = 0;
    virtual InterfaceRef<IZOCProduction> GetWritableProductionFromURL(const ImmutableString& inURL) = 0;
    /// Unloaded; null without the link.
    virtual InterfaceRef<IZOCProduction> GetProductionByIdAndCommitId(const ImmutableString& inProductionID,
                                                                      const ImmutableString& inCommitID) = 0;
    virtual InterfaceRef<IZOCProduction> GetProductionByIdAndCommitId(
        const ProductionRevision& inRevision) = 0;
    /// Blocks; null when there was no 2xx answer.
    virtual shared_ptr<RecycledMemory const> GetPayloadFromURL(const ImmutableString& inURL) = 0;
    virtual bool PostToURL(const ImmutableString& inURL, const shared_ptr<RecycledMemory const>& inBody,
                           const ImmutableString& inContentType, const Guid& inRequestID,
                           const RequestCompletion& inCompletion) = 0;
    virtual bool PostToURL(const ImmutableString& inURL, const shared_ptr<RecycledMemory const>& inBody,
                           const ostnet::Headers& inHeaders, const Guid& inRequestID,
                           const RequestCompletion& inCompletion) = 0;
    virtual bool PostToURL(const ImmutableString& inURL, const ostnet::http::Form& inForm,
                           const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;

    // --- The verbs. As RequestProcessor: a true result means exactly one completion, on a worker.

    virtual void TryToCancelRequest(const Guid& inRequestID) = 0;
    virtual bool GET(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
                     const ImmutableString& inURL, ostnet::Headers inHeaders) = 0;
    /// By content identifier, so that a cache of payloads may answer without the network.
    virtual bool GETByContentID(const ImmutableString& inContentID, const Guid& inRequestID,
                                const ostnet::http::CompletionFunction& inCompletion,
                                const ImmutableString& inURL) = 0;
    virtual bool DELETE(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
                        const ImmutableString& inURL, ostnet::Headers inHeaders) = 0;
    virtual bool HEAD(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
                      const ImmutableString& inURL, ostnet::Headers inHeaders) = 0;
    virtual bool POST(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
                      const ImmutableString& inURL, ostnet::Headers inHeaders,
                      const shared_ptr<RecycledMemory const>& inPayload) = 0;
    virtual bool POST(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
                      const ImmutableString& inURL, ostnet::Headers inHeaders,
                      const ostnet::http::Form& inForm) = 0;
    virtual bool PUT(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
                     const ImmutableString& inURL, ostnet::Headers inHeaders,
                     const shared_ptr<RecycledMemory const>& inPayload) = 0;
    virtual bool PUT(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
                     const ImmutableString& inURL, ostnet::Headers inHeaders,
                     const ostnet::http::Form& inForm) = 0;

    // --- Blocking verbs; null when the request could not be started. Never from a completion.

    virtual shared_ptr<ostnet::Response> BlockingGET(const ImmutableString& inURL, ostnet::Headers inHeaders,
                                                     std::uint32_t inTimeoutMilliseconds) = 0;
    virtual shared_ptr<ostnet::Response> BlockingGETByContentID(const ImmutableString& inContentID,
                                                                const ImmutableString& inURL,
                                                                std::uint32_t inTimeoutMilliseconds) = 0;
    virtual shared_ptr<ostnet::Response> BlockingHEAD(const ImmutableString& inURL, ostnet::Headers inHeaders,
                                                      std::uint32_t inTimeoutMilliseconds) = 0;
    virtual shared_ptr<ostnet::Response> BlockingPUT(const ImmutableString& inURL, ostnet::Headers inHeaders,
                                                     const shared_ptr<RecycledMemory const>& inPayload,
                                                     std::uint32_t inTimeoutMilliseconds) = 0;
    virtual shared_ptr<ostnet::Response> BlockingPUT(const ImmutableString& inURL, ostnet::Headers inHeaders,
                                                     const ostnet::http::Form& inForm,
                                                     std::uint32_t inTimeoutMilliseconds) = 0;
    virtual shared_ptr<ostnet::Response> BlockingPOST(const ImmutableString& inURL, ostnet::Headers inHeaders,
                                                      const shared_ptr<RecycledMemory const>& inPayload,
                                                      std::uint32_t inTimeoutMilliseconds) = 0;
    virtual shared_ptr<ostnet::Response> BlockingPOST(const ImmutableString& inURL, ostnet::Headers inHeaders,
                                                      const ostnet::http::Form& inForm,
                                                      std::uint32_t inTimeoutMilliseconds) = 0;
    virtual shared_ptr<ostnet::Response> BlockingDELETE(const ImmutableString& inURL,
                                                        ostnet::Headers inHeaders,
                                                        std::uint32_t inTimeoutMilliseconds) = 0;

    /// Moves a URL onto the scheme, host and port that the client connected to.
    virtual ImmutableString RebaseURL(const ImmutableString& inURL) = 0;
    virtual ZOSCredentials GetCredentials() = 0;
    virtual ImmutableString GetSyslogAddress() = 0;
    virtual std::uint32_t GetSyslogPort() = 0;
    virtual std::vector<std::uint32_t> GetRenderProtocolVersions() = 0;
    virtual bool CanCreateUsers() = 0;
    virtual ZOLoginData GetLoginData() = 0;
    /// Runs a function on a worker of the network layer after the delay in milliseconds.
    virtual bool PostFunction(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds) = 0;
    virtual InterfaceRef<IZOCDataServer> AddRefSelf() = 0;
    virtual ImmutableString GetCreateUserLink() = 0;
    /// The href of a relation in the service documents, the fuller document first; null when none has it.
    virtual ImmutableString GetLink(const ImmutableString& inRelation) = 0;
};

/// Whether the URL begins with "https://".
ZOCL_EXPORT bool HasSecureProtocol(const UString& inURL);

}  // namespace ZOCL
