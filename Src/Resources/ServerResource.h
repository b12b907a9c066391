// The base of every object that mirrors something on the server: one URL, the last response, the entity tag
// of what is held, and the requests that follow from them.
#pragma once

#include <atomic>
#include <string>

#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/IZOCServerResource.h"

namespace ZOCL {

/// A resource of any content type; JSONServerResource adds a parsed body.
///
/// Threads: any. All fields but the writable flag are guarded by the lock of the connection layer, which is
/// never held across a request, a completion or a function of a host. A request takes its URL and a reference
/// to the resource with it when it starts, so the resource outlives it and a later change of URL does not
/// reach it.
/// The synchronous forms block on the network; they must not be called from a completion.
class ServerResource : public IZOCServerResource, public IZOCWritableServerResource {
public:
    /// Answers with the object itself, for code inside the library.
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f635265736f75ull, 0x7263650000000003ull};

    ServerResource() = default;
    ~ServerResource() override;
    ServerResource(const ServerResource&) = delete;
    ServerResource& operator=(const ServerResource&) = delete;

    /// A plain resource. Makes no request.
    static InterfaceRef<ServerResource> MakePlain(const ImmutableString& inURL,
                                                  const InterfaceRef<IZOCDataServer>& inServer,
                                                  ResourceWritability inWritability);

    std::uint32_t AddRef() noexcept override;
    std::uint32_t Release() noexcept override;
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override;
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

    bool Load(const Guid& inRequestID, const RequestCompletion& inCompletion, bool inReportErrors) override;
    bool Load(bool inReportErrors) override;
    bool LoadTreatingMissingAsEmpty(const Guid& inRequestID, const RequestCompletion& inCompletion,
                                    bool inReportErrors) override;
    bool LoadBlocking(bool inReportErrors) override;
    void LoadInBackground(bool inReportErrors) override;
    bool IsValid() override;
    bool IsLoaded() override;
    bool Refresh(const Guid& inRequestID, const RequestCompletion& inCompletion) override;
    bool Refresh(bool& outChanged, bool inReserved) override;
    bool RefreshTreatingMissingAsEmpty(const Guid& inRequestID,
                                       const RequestCompletion& inCompletion) override;
    ImmutableString GetHTTPURL() override;
    ImmutableString GetLatestVersionLink() override;
    ImmutableString GetETag(bool inNoFetch) override;
    shared_ptr<RecycledMemory const> GetResponseData() override;
    bool TryToCancelRequest(const Guid& inRequestID) override;
    shared_ptr<ServerResourceChangeNotifier> SubscribeToChanges(
        const ServerResourceChangeNotifier::Function& inFunction, bool inNotifyWhenUnloaded,
        std::uint32_t inIntervalMilliseconds) override;

    /// HTTP 404 reaches the completion as kResultGone: what was to be deleted is not there.
    bool Delete(const Guid& inRequestID, const RequestCompletion& inCompletion) override;
    bool Delete() override;

    virtual InterfaceRef<ServerResource> GetSelf();
    virtual ImmutableString GetEditLink();
    virtual ImmutableString GetDeleteLink();
    virtual ImmutableString GetParentLink();
    /// Installs what a response says, or nothing when there is none; true when the resource is loaded then.
    /// A server that is given never replaces one that is there; none stands for the logged-in one.
    virtual bool InternalInit(const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer,
                              const shared_ptr<ostnet::Response>& inResponse,
                              ResourceWritability inWritability, bool inReportErrors);
    virtual bool canLoadType(const ImmutableString& inContentType);

    /// Installs a response that somebody else obtained.
    bool InitFromResponse(const shared_ptr<ostnet::Response>& inResponse, ResourceWritability inWritability);
    /// A null tag is stored too, and traced as an error.
    void SetETag(const ImmutableString& inETag);
    InterfaceRef<IZOCDataServer> GetServer();
    bool IsWritable() const noexcept { return mWritable.load(std::memory_order_acquire) != 0; }
    ResourceWritability GetWritability() const noexcept {
        return IsWritable() ? ResourceWritability::kWritable : ResourceWritability::kReadOnly;
    }

    // --- Writing. Unless told otherwise nothing is installed from the answer. Asynchronous forms: true means
    // that the completion runs once, on a worker. Synchronous forms give the response, null when there is
    // none.

    shared_ptr<ostnet::Response> Post(const shared_ptr<RecycledMemory const>& inBody,
                                      const ImmutableString& inContentType);
    /// Null when there is no such file.
    shared_ptr<ostnet::Response> PostFile(const std::string& inPath, const ImmutableString& inContentType);
    /// The asynchronous posts install the answer: one with a Location makes this resource point at what was
    /// created.
    bool Post(const shared_ptr<RecycledMemory const>& inBody, const ostnet::Headers& inHeaders,
              const Guid& inRequestID, const RequestCompletion& inCompletion);
    shared_ptr<ostnet::Response> PostMultiPart(const ostnet::http::Form& inForm);
    bool PostMultiPart(const ostnet::http::Form& inForm, const Guid& inRequestID,
                       const RequestCompletion& inCompletion);

    /// Sends If-Match with the resource's tag unless told to ignore it; for an unloaded resource the tag
    /// costs a HEAD. A 2xx answer sets the tag.
    shared_ptr<ostnet::Response> Put(const shared_ptr<RecycledMemory const>& inBody,
                                     const ImmutableString& inContentType, bool inIgnoreETag);
    /// As above with a tag of the caller's; a null one sends no If-Match.
    shared_ptr<ostnet::Response> PutIfMatch(const shared_ptr<RecycledMemory const>& inBody,
                                            const ImmutableString& inContentType,
                                            const ImmutableString& inETag);
    shared_ptr<ostnet::Response> PutFile(const std::string& inPath, const ImmutableString& inContentType);
    /// The tag stays as it is: the caller deals with the response.
    bool Put(const shared_ptr<RecycledMemory const>& inBody, const ImmutableString& inContentType,
             const Guid& inRequestID, const RequestCompletion& inCompletion, bool inIgnoreETag);
    bool Put(const shared_ptr<RecycledMemory const>& inBody, const ostnet::Headers& inHeaders,
             const Guid& inRequestID, const RequestCompletion& inCompletion);
    shared_ptr<ostnet::Response> PutMultiPart(const ostnet::http::Form& inForm);
    bool PutMultiPart(const ostnet::http::Form& inForm, const Guid& inRequestID,
                      const RequestCompletion& inCompletion);

protected:
    /// Wraps a completion into what the data server calls; keeps this resource alive until then.
    ostnet::http::CompletionFunction MakeCompletionFunction(const RequestCompletion& inCompletion,
                                                            bool inInitOnCompletion, bool inReportErrors);
    /// The one way back of every response.
    void AsyncOperationHelper(const Guid& inRequestID, const shared_ptr<ostnet::Response>& inResponse,
                              const RequestCompletion& inCompletion, const ImmutableString& inURL,
                              const InterfaceRef<IZOCDataServer>& inServer, bool inInitOnCompletion,
                              bool inReportErrors);

    /// What traces call this resource: its own name when it has one, else the URL.
    virtual std::string GetTraceName();

    // --- For derived classes that install bodies. The caller holds the lock.

    /// Stores URL, server and response, clears loaded and the tag, sets the writable flag.
    void ResetFieldsLocked(const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer,
                           const shared_ptr<ostnet::Response>& inResponse, ResourceWritability inWritability)
        ZO_REQUIRES(IZOCDataServer::GetLock());

    bool mLoaded ZO_GUARDED_BY(IZOCDataServer::GetLock()) = false;
    ImmutableString mETag ZO_GUARDED_BY(IZOCDataServer::GetLock());
    ImmutableString mURL ZO_GUARDED_BY(IZOCDataServer::GetLock());
    InterfaceRef<IZOCDataServer> mServer ZO_GUARDED_BY(IZOCDataServer::GetLock());
    shared_ptr<ostnet::Response> mResponse ZO_GUARDED_BY(IZOCDataServer::GetLock());

private:
    struct Target {
        ImmutableString url;
        InterfaceRef<IZOCDataServer> server;
    };
    Target GetTarget(const char* inLabel);

    RFL::RefCount mReferences;
    std::atomic<std::int32_t> mWritable{0};
};

/// The same completion, to which HTTP 404 appears as kResultGone.
RequestCompletion TreatMissingAsGone(const RequestCompletion& inCompletion);
/// Headers with the content type alone, none for a null type.
ostnet::Headers MakeContentTypeHeaders(const ImmutableString& inContentType);

}  // namespace ZOCL
