// Writing in a transaction, and its two ends.
#include "Model/Asset.h"
#include "Model/AssetList.h"
#include "Model/AssetProperties.h"
#include "Model/ClientMetadata.h"
#include "Model/DataServerCaches.h"
#include "Model/OwnCommit.h"
#include "Model/Production.h"
#include "Model/ResourceCreation.h"
#include "Model/ServerResourceWithEnclosures.h"
#include "Model/TransactionList.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"
#include "Relations.h"
#include "RequestChain/RepeatMark.h"

namespace ZOCL {

using ostcore::serialization::JSONValue;
using ostcore::threads::ScopedLock;

namespace {

// The keys of the body that commits.
constexpr const char* kKey_ResolveStrategy = ":resolveStrategy";
constexpr const char* kKey_CommitMessage = ":commitMessage";

bool PostJSON(const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer,
              const JSONValue& inBody, const Guid& inRequestID, const RequestCompletion& inCompletion) {
    const auto target = ServerResource::MakePlain(inURL, inServer, ResourceWritability::kReadOnly);
    return target->Post(RecycledMemory::CreateFromBytes(ostcore::serialization::GetJSONUTF8String(inBody)),
                        MakeContentTypeHeaders(ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8),
                        inRequestID, inCompletion);
}

bool HasBody(const shared_ptr<ostnet::Response>& inResponse) {
    return inResponse && inResponse->payload && !inResponse->payload->empty();
}

/// The session as the answer to a commit tells it, for a transaction whose session nobody holds; null when it
/// does not.
InterfaceRef<Production> ReadSession(const ImmutableString& inURL,
                                     const InterfaceRef<IZOCDataServer>& inServer,
                                     const shared_ptr<ostnet::Response>& inResponse) {
    if (!HasBody(inResponse)) {
        return nullptr;
    }
    const InterfaceRef<Production> session(new Production);
    const bool isRead =
        session->InternalInit(inURL, inServer, inResponse, ResourceWritability::kWritable, true);
    return isRead ? session : nullptr;
}

}  // namespace

ImmutableString Production::GetAssetFactoryURL() {
    return GetLinkHref(kRelation_Assets_Asset_Create);
}

RequestCompletion Production::MakeNewAssetCompletion(const RequestCompletion& inCompletion) {
    const InterfaceRef<Production> self(this);
    return [self, inCompletion](const Guid& inID, int inResult,
                                const InterfaceRef<IZOCServerResource>& inResource,
                                const shared_ptr<ostnet::Response>& inResponse) {
        const auto asset = RFL::QueryInterface<IZOCAsset>(inResource);
        InterfaceRef<AssetList> assets;
        {
            ScopedLock lock(IZOCDataServer::GetLock(), "Production::OnNewAssetCreated");
            assets = self->mAssets;
        }
        if (inResult >= 0 && asset && assets) {
            assets->AddAsset(asset, "AssetList::AddNewAssetFromTransaction");
        }
        if (inCompletion) {
            inCompletion(inID, inResult, inResource, inResponse);
        }
    };
}

bool Production::CreateNewAsset(const Guid& inRequestID, const RequestCompletion& inCompletion,
                                const AssetBaseProperties& inProperties) {
    return IsLoaded() && IZOCWritableAsset::Create(inRequestID, GetAssetFactoryURL(), GetServer(),
                                                   inProperties, MakeNewAssetCompletion(inCompletion));
}

bool Production::CreateNewAsset(const Guid& inRequestID, const RequestCompletion& inCompletion,
                                const AssetBaseProperties& inProperties, const SubClip& inSubClip) {
    dto::AssetProperties properties = MakeAssetProperties(inProperties);
    WriteSubClip(properties, inSubClip);
    dto::Asset body;
    body.SetProperties(properties);
    return IsLoaded() && PostJSONForNew<Asset>(inRequestID, GetAssetFactoryURL(), GetServer(), body.Body(),
                                               MakeNewAssetCompletion(inCompletion));
}

bool Production::Refresh(const Guid& inRequestID, const RequestCompletion& inCompletion) {
    if (!IsTransaction()) {
        return ServerResource::Refresh(inRequestID, inCompletion);
    }
    const InterfaceRef<Production> self(this);
    const auto complete = [self, inCompletion](const Guid& inID, int inResult,
                                               const shared_ptr<ostnet::Response>& inResponse) {
        if (inCompletion) {
            inCompletion(inID, inResult == kResultHTTPNotModified ? kResultSuccess : inResult, self,
                         inResponse);
        }
    };
    const auto onListRefreshed =
        [complete](const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>&,
                   const shared_ptr<ostnet::Response>& inResponse) { complete(inID, inResult, inResponse); };
    const auto onRefreshed = [self, complete, onListRefreshed](
                                 const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>&,
                                 const shared_ptr<ostnet::Response>& inResponse) {
        const auto assets = RFL::QueryInterface<IZOCServerResource>(self->GetAssets());
        if ((inResult < 0 && inResult != kResultHTTPNotModified) || !assets) {
            complete(inID, inResult, inResponse);
        } else if (!assets->Refresh(inID, onListRefreshed)) {
            complete(inID, kResultNotStarted, inResponse);
        }
    };
    return ServerResource::Refresh(inRequestID, onRefreshed);
}

bool Production::Commit(const Guid& inRequestID, const RequestCompletion& inCompletion,
                        const UString& inMessage) {
    bool isLoaded = false;
    const dto::Production body = GetBody("Production::Commit", isLoaded);
    const ImmutableString link =
        isLoaded ? GetLinkHref(kRelation_Transactions_Transaction_Commit) : ImmutableString();
    if (link.empty()) {
        return false;
    }
    const dto::ClientMetadata metadata = body.Metadata();
    const bool isIngest = metadata.TransactionType() == kTransactionType_Ingest;
    JSONValue commit = JSONValue::EmptyObject();
    AddToObject(commit, kKey_ResolveStrategy, isIngest ? "AUTO" : "NONE");
    AddToObject(commit, kKey_CommitMessage, MakeCommitTitle(inMessage, metadata.Body(), inRequestID));
    const InterfaceRef<Production> self(this);
    return PostJSON(
        link, GetServer(), commit, inRequestID,
        [self, inCompletion](const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>&,
                             const shared_ptr<ostnet::Response>& inResponse) {
            if (IsRefusedRepetition(inResponse)) {
                self->OnRepeatedCommitRefused(inID, inResult, inResponse, inCompletion);
            } else {
                self->OnCommitted(inID, inResult, inResponse, inCompletion);
            }
        });
}

void Production::OnRepeatedCommitRefused(const Guid& inRequestID, int inResult,
                                         const shared_ptr<ostnet::Response>& inResponse,
                                         const RequestCompletion& inCompletion) {
    const InterfaceRef<Production> self(this);
    FindOwnCommit(
        GetParentLink(), GetServer(), inRequestID,
        [=](const InterfaceRef<Production>& inSession, const shared_ptr<ostnet::Response>& inAnswer) {
            self->OnCommitted(inRequestID, inSession ? kResultSuccess : inResult,
                              inSession ? inAnswer : inResponse, inCompletion);
        });
}

void Production::OnCommitted(const Guid& inRequestID, int inResult,
                             const shared_ptr<ostnet::Response>& inResponse,
                             const RequestCompletion& inCompletion) {
    InterfaceRef<Production> session;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::OnCommitted");
        session = mParent;
    }
    if (!session) {
        session = RFL::QueryInterface<Production>(FindCachedProduction(GetServer(), GetParentLink()));
    }
    const bool isHeld = bool(session);
    if (inResult >= 0 && !isHeld) {
        session = ReadSession(GetParentLink(), GetServer(), inResponse);
    }
    const auto complete = [inRequestID, inResult, inResponse, inCompletion, session](
                              const Guid&, int, const InterfaceRef<IZOCServerResource>&,
                              const shared_ptr<ostnet::Response>&) {
        // A refresh that failed leaves nothing behind; the answer to the commit tells the same.
        if (inResult >= 0 && session && !session->IsLoaded() && HasBody(inResponse)) {
            session->InitFromResponse(inResponse, ResourceWritability::kKeep);
        }
        if (inCompletion) {
            inCompletion(inRequestID, inResult, session, inResponse);
        }
    };
    if (inResult >= 0) {
        LeaveListOfParent();
        if (isHeld && session->Refresh(Guid::CreateUnique(), complete)) {
            return;
        }
    }
    complete(inRequestID, inResult, nullptr, inResponse);
}

void Production::LeaveListOfParent() {
    InterfaceRef<TransactionList> list;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::LeaveListOfParent");
        list = mListOfParent;
    }
    if (list) {
        list->RemoveItem(GetIdentifier());
    }
    ForgetCachedProduction(GetServer(), GetHTTPURL());
}

void Production::ClearCachedState() {
    InterfaceRef<AssetList> assets;
    InterfaceRef<Enclosures> enclosures;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::ClearCachedState");
        std::swap(mAssets, assets);
        std::swap(mEnclosures, enclosures);
    }
    if (assets) {
        assets->InvalidateContent();
    }
}

bool Production::Rollback(const Guid& inRequestID, const RequestCompletion& inCompletion) {
    const ImmutableString link =
        IsLoaded() ? GetLinkHref(kRelation_Transactions_Transaction_Rollback) : ImmutableString();
    if (link.empty()) {
        return false;
    }
    ClearCachedState();
    const InterfaceRef<Production> self(this);
    const auto onRolledBack = [self, inCompletion](const Guid& inID, int inResult,
                                                   const InterfaceRef<IZOCServerResource>&,
                                                   const shared_ptr<ostnet::Response>& inResponse) {
        if (inResult >= 0) {
            self->LeaveListOfParent();
        } else {
            // It is still there, and so are its lists.
            self->PostLoadDTO();
        }
        if (inCompletion) {
            inCompletion(inID, inResult, self, inResponse);
        }
    };
    const bool started =
        PostJSON(link, GetServer(), JSONValue::EmptyObject(), inRequestID, TreatMissingAsGone(onRolledBack));
    if (!started) {
        PostLoadDTO();
    }
    return started;
}

}  // namespace ZOCL
