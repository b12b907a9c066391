// Writing a media locator to the server, also when another client was faster.
#include "Model/DataServerCaches.h"
#include "Model/MediaLocator.h"
#include "ostcore/debug/Assert.h"
#include "Relations.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

void MediaLocator::MarkUnloaded() {
    ScopedLock lock(IZOCDataServer::GetLock(), "MediaLocator::Store");
    mLoaded = false;
    mETag = ImmutableString();
}

bool MediaLocator::ReloadFromServer() {
    MarkUnloaded();
    return Load(false);
}

bool MediaLocator::AcceptAnswer(const shared_ptr<ostnet::Response>& inResponse) {
    if (!inResponse || !inResponse->IsSuccess() ||
        !InitFromResponse(inResponse, ResourceWritability::kKeep)) {
        return false;
    }
    CacheMediaLocator(GetServer(), InterfaceRef<IZOCMediaLocator>(this));
    return true;
}

bool MediaLocator::Store() {
    // Finding out whether the server has the locator reads its properties: what is to be sent is put together
    // first, and kept when nothing could be sent.
    const ostnet::http::Form form = GetForm();
    const MediaLocatorProperties wanted = GetProperties("MediaLocator::Store");
    ReloadFromServer();
    const bool stored = StoreForm(form, Attempt::kFirst);
    if (!stored) {
        ScopedLock lock(IZOCDataServer::GetLock(), "MediaLocator::Store");
        mProperties = wanted;
    }
    return stored;
}

bool MediaLocator::StoreForm(const ostnet::http::Form& inForm, Attempt inAttempt) {
    return IsLoaded() ? PutForm(inForm, inAttempt) : PostForm(inForm, inAttempt);
}

bool MediaLocator::PostForm(const ostnet::http::Form& inForm, Attempt inAttempt) {
    const ImmutableString collection = GetServer()->GetLink(kRelation_MediaLocators);
    shared_ptr<ostnet::Response> response;
    if (!collection.empty()) {
        response = ServerResource::MakePlain(collection, GetServer(), ResourceWritability::kReadOnly)
                       ->PostMultiPart(inForm);
    }
    bool stored = AcceptAnswer(response);
    if (!stored && response && response->status == 409 && inAttempt == Attempt::kFirst) {
        ReloadFromServer();
        return StoreForm(inForm, Attempt::kAfterConflict);
    }
    if (!stored && response && !response->IsSuccess()) {
        // Another client may have made it a moment ago: then it is where it should be.
        stored = ReloadFromServer();
    }
    ZO_ASSERT_ONCE(stored, "stored", "Could not post new media locator!");
    return stored;
}

bool MediaLocator::PutForm(const ostnet::http::Form& inForm, Attempt inAttempt) {
    const ImmutableString url = GetHTTPURL();
    const auto response =
        ServerResource::MakePlain(url, GetServer(), ResourceWritability::kReadOnly)->PutMultiPart(inForm);
    if (response && response->status == 409 && inAttempt == Attempt::kFirst && ReloadFromServer()) {
        return PutForm(inForm, Attempt::kAfterConflict);
    }
    const bool returnValue = AcceptAnswer(response);
    ZO_ASSERT_ONCE(returnValue, "returnValue",
                   JoinText("Failed to put new media locator info to server at ", url,
                            ". Server Response Code: ", response ? response->status : 0));
    return returnValue;
}

RequestCompletion MediaLocator::MakeStoreCompletion(const ostnet::http::Form& inForm,
                                                    const RequestCompletion& inCompletion,
                                                    Attempt inAttempt) {
    const InterfaceRef<MediaLocator> self(this);
    return [=](const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>&,
               const shared_ptr<ostnet::Response>& inResponse) {
        self->OnMediaLocatorCreatedOrUpdated(inID, inResult, inResponse, inForm, inCompletion, inAttempt);
    };
}

bool MediaLocator::Store(const Guid& inRequestID, const RequestCompletion& inCompletion) {
    const ostnet::http::Form form = GetForm();
    const RequestCompletion onStored = MakeStoreCompletion(form, inCompletion, Attempt::kFirst);
    if (IsLoaded()) {
        return ServerResource::MakePlain(GetHTTPURL(), GetServer(), ResourceWritability::kReadOnly)
            ->PutMultiPart(form, inRequestID, onStored);
    }
    const ImmutableString collection = GetServer()->GetLink(kRelation_MediaLocators);
    return !collection.empty() &&
           ServerResource::MakePlain(collection, GetServer(), ResourceWritability::kReadOnly)
               ->PostMultiPart(form, inRequestID, onStored);
}

void MediaLocator::OnMediaLocatorCreatedOrUpdated(const Guid& inRequestID, int inResult,
                                                  const shared_ptr<ostnet::Response>& inResponse,
                                                  const ostnet::http::Form& inForm,
                                                  const RequestCompletion& inCompletion, Attempt inAttempt) {
    const int status = inResponse ? inResponse->status : 0;
    if (status == 409 && inAttempt == Attempt::kFirst) {
        StoreAgainAfterConflict(inRequestID, inForm, inCompletion);
        return;
    }
    const bool success = status >= 200 && status <= 299;
    ZO_ASSERT_ONCE(success, "success",
                   JoinText("Failed to create or update media locator at ", GetHTTPURL()));
    const bool accepted = success && AcceptAnswer(inResponse);
    if (inCompletion) {
        inCompletion(inRequestID, success && !accepted ? kResultFailure : inResult, GetSelf(), inResponse);
    }
}

void MediaLocator::StoreAgainAfterConflict(const Guid& inRequestID, const ostnet::http::Form& inForm,
                                           const RequestCompletion& inCompletion) {
    const InterfaceRef<MediaLocator> self(this);
    const auto onLoaded = [=](const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>&,
                              const shared_ptr<ostnet::Response>& inResponse) {
        int result = inResult;
        if (LoadResultSucceeded(inResult) && self->IsLoaded()) {
            const auto target = ServerResource::MakePlain(self->GetHTTPURL(), self->GetServer(),
                                                          ResourceWritability::kReadOnly);
            if (target->PutMultiPart(
                    inForm, inID, self->MakeStoreCompletion(inForm, inCompletion, Attempt::kAfterConflict))) {
                return;
            }
            result = kResultNotStarted;
        }
        if (inCompletion) {
            inCompletion(inID, result < 0 ? result : kResultFailure, self, inResponse);
        }
    };
    MarkUnloaded();
    if (!Load(inRequestID, onLoaded, true) && inCompletion) {
        inCompletion(inRequestID, kResultNotStarted, self, nullptr);
    }
}

}  // namespace ZOCL
