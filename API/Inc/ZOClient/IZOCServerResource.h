// The face of every object that mirrors something on the server.
#pragma once

#include "ZOClient/Export.h"
#include "ZOClient/ResultCodes.h"
#include "ZOClient/ServerResourceChangeNotifier.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// Read side of a resource: one URL, the data server through which it is reached, the last response and
/// the entity tag of what is held.
///
/// A resource is invalid (no URL or server), unloaded, or loaded. There is no loading state: a load in
/// flight is visible only as its request identifier. Operations that need a server throw
/// RFL::NullInterfaceException when there is none.
///
/// Threads: any. Completions run on workers of the network layer, except where told.
class ZOCL_EXPORT IZOCServerResource : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f635265736f75ull, 0x7263650000000001ull};

    /// A plain resource at a URL, of any content type. Makes no request. A null server stands for the
    /// logged-in one.
    static InterfaceRef<IZOCServerResource> Create(const ImmutableString& inURL,
                                                   const InterfaceRef<IZOCDataServer>& inServer,
                                                   ResourceWritability inWritability);

    /// Loads with a GET. A loaded resource makes no request and calls the completion at once, on this
    /// thread, with result 0 and no response. A body that is not accepted reaches the completion with the
    /// result of its HTTP status, so look at IsLoaded.
    virtual bool Load(const Guid& inRequestID, const RequestCompletion& inCompletion,
                      bool inReportErrors) = 0;
    /// Blocks; true when the resource is loaded.
    virtual bool Load(bool inReportErrors) = 0;
    /// As the first, but HTTP 404 reaches the completion as kResultGone, a success.
    virtual bool LoadTreatingMissingAsEmpty(const Guid& inRequestID, const RequestCompletion& inCompletion,
                                            bool inReportErrors) = 0;
    /// Second entry of the blocking Load.
    virtual bool LoadBlocking(bool inReportErrors) = 0;
    virtual void LoadInBackground(bool inReportErrors) = 0;
    virtual bool IsValid() = 0;
    virtual bool IsLoaded() = 0;
    /// Asks for the latest version, with If-None-Match when a tag is held. HTTP 304 reaches the completion
    /// as kResultHTTPNotModified and leaves the resource as it was. A failed refresh leaves it unloaded.
    virtual bool Refresh(const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;
    /// Blocks and always fetches the whole body. The second argument is reserved.
    virtual bool Refresh(bool& outChanged, bool inReserved) = 0;
    virtual bool RefreshTreatingMissingAsEmpty(const Guid& inRequestID,
                                               const RequestCompletion& inCompletion) = 0;
    virtual ImmutableString GetHTTPURL() = 0;
    virtual ImmutableString GetLatestVersionLink() = 0;
    /// The tag of what is held. For an unloaded resource: null, or, when a fetch is allowed, the tag that a
    /// blocking HEAD brings.
    virtual ImmutableString GetETag(bool inNoFetch) = 0;
    /// The payload of the last response, null when there is none.
    virtual shared_ptr<RecycledMemory const> GetResponseData() = 0;
    /// A request only: what was started still completes.
    virtual bool TryToCancelRequest(const Guid& inRequestID) = 0;
    /// Asks for the latest version every so many milliseconds, and calls the function whenever the tag has
    /// moved, at once when it already has. Without inNotifyWhenUnloaded a failed request is no news. The
    /// caller stops watching with StopNotifications of the result, which it keeps until then. Null: nobody
    /// watches.
    virtual shared_ptr<ServerResourceChangeNotifier> SubscribeToChanges(
        const function<void(const InterfaceRef<IZOCServerResource>& inResource)>& inFunction,
        bool inNotifyWhenUnloaded, std::uint32_t inIntervalMilliseconds) = 0;
};

/// Write side; only a resource that was made writable answers the query for it.
class ZOCL_EXPORT IZOCWritableServerResource : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f635265736f75ull, 0x7263650000000002ull};

    /// Deletes what the "delete" link names. The resource object stays as it is.
    virtual bool Delete(const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;
    /// Blocks; true for a 2xx answer.
    virtual bool Delete() = 0;
};

}  // namespace ZOCL
