// A media locator as a resource of the server.
#pragma once

#include "dto/MediaLocator.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCMediaLocator.h"

namespace ZOCL {

/// The properties stand beside the body, since a locator has them before the server knows it.
class MediaLocator final
    : public Implements<JSONServerResource<dto::MediaLocator>, Readable<IZOCMediaLocator>> {
public:
    /// At a URL, unloaded. Sends nothing.
    static InterfaceRef<MediaLocator> Make(const ImmutableString& inURL, const ImmutableString& inID,
                                           const InterfaceRef<IZOCDataServer>& inServer);

    ostnet::http::Form GetForm() override;
    bool Store() override;
    ImmutableString GetMediaHRef() override;
    void SetMediaHRef(const ImmutableString& inHRef) override;
    void SetDocumentIDAndContentState(const Guid& inDocumentID, const Guid& inContentStateID) override;
    ImmutableString GetDisplayName() override;
    void SetDisplayName(const ImmutableString& inName) override;
    optional<MediaLocatorStillSequenceParams> GetStillSequenceParams() override;
    void SetStillSequenceParams(const optional<MediaLocatorStillSequenceParams>& inParams) override;
    ImmutableString GetID() override;
    InterfaceRef<IZOCMediaLocator> Duplicate() override;
    bool Store(const Guid& inRequestID, const RequestCompletion& inCompletion) override;

protected:
    void PostLoadDTO() override;

private:
    enum class Attempt { kFirst, kAfterConflict };

    MediaLocatorProperties GetProperties(const char* inLabel);
    void MarkUnloaded();
    bool ReloadFromServer();
    bool StoreForm(const ostnet::http::Form& inForm, Attempt inAttempt);
    bool PostForm(const ostnet::http::Form& inForm, Attempt inAttempt);
    bool PutForm(const ostnet::http::Form& inForm, Attempt inAttempt);
    bool AcceptAnswer(const shared_ptr<ostnet::Response>& inResponse);

    RequestCompletion MakeStoreCompletion(const ostnet::http::Form& inForm,
                                          const RequestCompletion& inCompletion, Attempt inAttempt);
    void OnMediaLocatorCreatedOrUpdated(const Guid& inRequestID, int inResult,
                                        const shared_ptr<ostnet::Response>& inResponse,
                                        const ostnet::http::Form& inForm,
                                        const RequestCompletion& inCompletion, Attempt inAttempt);
    void StoreAgainAfterConflict(const Guid& inRequestID, const ostnet::http::Form& inForm,
                                 const RequestCompletion& inCompletion);

    ImmutableString mID ZO_GUARDED_BY(IZOCDataServer::GetLock());
    MediaLocatorProperties mProperties ZO_GUARDED_BY(IZOCDataServer::GetLock());
};

}  // namespace ZOCL
