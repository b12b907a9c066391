// Opens a transaction on a session: the factory is loaded once, then each transaction is one POST.
#include "Model/ClientMetadata.h"
#include "Model/Production.h"
#include "Model/ResourceCreation.h"
#include "Model/TransactionList.h"
#include "ostcore/debug/Assert.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/utility/StringConversion.h"
#include "Relations.h"

namespace ZOCL {

using ostcore::debug::kTraceLevel_Error;
using ostcore::debug::kTraceLevel_Progress;
using ostcore::serialization::JSONValue;
using ostcore::threads::ScopedLock;

namespace {

// The keys of the body that opens a transaction.
constexpr const char* kKey_CommitID = ":commitId";
constexpr const char* kKey_RequireHead = ":requireHead";
constexpr const char* kKey_Metadata = "metadata";

ostcore::debug::TraceChannel& Channel() {
    static ostcore::debug::TraceChannel channel("ZOCL.Production");
    return channel;
}

template <class... Pieces>
void TraceAt(int inLevel, const Pieces&... inPieces) {
    if (Channel().IsEnabled(inLevel)) {
        ostcore::debug::Trace(Channel(), inLevel, JoinText(inPieces...));
    }
}

/// The new transaction, loaded when the answer holds it, else at the place that the answer names; null when
/// it does neither.
InterfaceRef<Production> ReadNewTransaction(const ImmutableString& inFactoryURL,
                                            const InterfaceRef<IZOCDataServer>& inServer,
                                            const shared_ptr<ostnet::Response>& inResponse) {
    const InterfaceRef<Production> transaction(new Production);
    if (transaction->InternalInit(inFactoryURL, inServer, inResponse, ResourceWritability::kWritable, true)) {
        return transaction;
    }
    const ImmutableString location =
        inResponse ? ostnet::GetHeader(inResponse->headers, ostnet::kHEADER_LOCATION) : ImmutableString();
    return MakeAtURL<Production>(location, inServer, ResourceWritability::kWritable);
}

}  // namespace

/// One call of CreateTransaction. It does not change, so that steps on any thread may read it.
struct Production::TransactionRequest {
    Guid requestID;
    RequestCompletion completion;
    ImmutableString type;
    ExtraTransactionMetadata extra;
    InterfaceRef<IZOCDataServer> server;

    void Complete(int inResult, const InterfaceRef<IZOCServerResource>& inTransaction,
                  const shared_ptr<ostnet::Response>& inResponse) const {
        if (completion) {
            completion(requestID, inResult, inTransaction, inResponse);
        }
    }
};

bool Production::CreateTransaction(const Guid& inRequestID, const RequestCompletion& inCompletion,
                                   const ImmutableString& inTransactionType,
                                   const optional<ExtraTransactionMetadata>& inExtraMetadata) {
    const InterfaceRef<IZOCDataServer> server = GetServer();
    if (!server || !IsLoaded()) {
        return false;
    }
    const auto request = boost::make_shared<TransactionRequest>();
    request->requestID = inRequestID;
    request->completion = inCompletion;
    request->type = inTransactionType.empty() ? kTransactionType_Edit : inTransactionType;
    request->extra = inExtraMetadata.value_or(ExtraTransactionMetadata());
    request->server = server;
    return GetOrCreateTransactionFactory(request);
}

bool Production::GetOrCreateTransactionFactory(const shared_ptr<TransactionRequest>& inRequest) {
    InterfaceRef<TransactionList> factory;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::GetOrCreateTransactionFactory()");
        factory = mTransactionFactory;
    }
    if (!factory) {
        return CreateTransactionFactory(inRequest);
    }
    // Not on the caller's stack, where a failure to start could not be told from a call that did nothing.
    const InterfaceRef<Production> self(this);
    return ostcore::threads::GetIOBoundExecutor()->Post([self, inRequest, factory] {
        self->OnReadyToCreateTransaction(inRequest, kResultSuccess, factory, nullptr);
    });
}

bool Production::CreateTransactionFactory(const shared_ptr<TransactionRequest>& inRequest) {
    const ImmutableString url = GetLinkHref(kRelation_Transactions);
    const auto factory = TransactionList::Make(url, inRequest->server, GetIdentifier());
    if (!factory) {
        return false;
    }
    TraceAt(kTraceLevel_Progress, "Load Transaction List Resource with URL ", url);
    const InterfaceRef<Production> self(this);
    const auto onLoaded = [self, inRequest, factory, url](const Guid&, int inResult,
                                                          const InterfaceRef<IZOCServerResource>&,
                                                          const shared_ptr<ostnet::Response>& inResponse) {
        const int result = inResult >= 0 && !factory->IsLoaded() ? kResultFailure : inResult;
        InterfaceRef<TransactionList> used = factory;
        if (result >= 0) {
            TraceAt(kTraceLevel_Progress, "Transaction List Resource successfully loaded with URL ", url);
            ScopedLock lock(IZOCDataServer::GetLock(), "Production::CreateTransactionFactory()");
            // Another thread may have been first.
            if (!self->mTransactionFactory) {
                self->mTransactionFactory = factory;
            }
            used = self->mTransactionFactory;
        }
        self->OnReadyToCreateTransaction(inRequest, result, used, inResponse);
    };
    return factory->Load(inRequest->requestID, onLoaded, true);
}

JSONValue Production::MakeTransactionBody(const TransactionRequest& inRequest) {
    JSONValue body = JSONValue::EmptyObject();
    AddToObject(body, kKey_CommitID, GetLoadedRevision());
    AddToObject(body, kKey_RequireHead, inRequest.type != kTransactionType_Ingest);
    AddToObject(body, kKey_Metadata,
                MakeClientMetadataBody(MakeClientMetadata(inRequest.type), inRequest.extra));
    return body;
}

void Production::OnReadyToCreateTransaction(const shared_ptr<TransactionRequest>& inRequest, int inResult,
                                            const InterfaceRef<TransactionList>& inFactory,
                                            const shared_ptr<ostnet::Response>& inResponse) {
    if (inResult < 0) {
        TraceAt(kTraceLevel_Error, "Failed to create transaction factory, RFL result == ", inResult);
        inRequest->Complete(inResult, nullptr, inResponse);
        return;
    }
    const ImmutableString url = inFactory->GetLinkHref(kRelation_Create);
    ZO_ASSERT_ONCE(!url.empty(), "factoryURL",
                   JoinText("Failed to create server resource for transaction factory URL \"",
                            inFactory->GetHTTPURL(), "\""));
    if (url.empty()) {
        inRequest->Complete(kResultFailure, nullptr, inResponse);
        return;
    }
    const std::string name = GetTraceName();
    TraceAt(kTraceLevel_Progress, "Start creating transaction body for ", name);
    const JSONValue body = MakeTransactionBody(*inRequest);
    TraceAt(kTraceLevel_Progress, "Finished creating transaction body for ", name);
    TraceAt(kTraceLevel_Progress, "Start creating transaction resource ", name);

    const InterfaceRef<Production> self(this);
    const auto onPosted = [self, inRequest, inFactory](const Guid&, int inPostResult,
                                                       const InterfaceRef<IZOCServerResource>&,
                                                       const shared_ptr<ostnet::Response>& inAnswer) {
        self->OnTransactionCreated(inRequest, inPostResult, inFactory, inAnswer);
    };
    const auto target = ServerResource::MakePlain(url, inRequest->server, ResourceWritability::kReadOnly);
    const bool createTransactionPosted =
        target->Post(RecycledMemory::CreateFromBytes(ostcore::serialization::GetJSONUTF8String(body)),
                     MakeContentTypeHeaders(ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8),
                     inRequest->requestID, onPosted);
    if (createTransactionPosted) {
        TraceAt(kTraceLevel_Progress, "Transaction resource creation successfully started for ", name);
        return;
    }
    ostcore::debug::StructuredText text("Failed to start creating transaction");
    text.Add("uri", url);
    text.Add("expression", "! createTransactionPosted");
    ostcore::debug::Trace(Channel(), kTraceLevel_Error, text);
    inRequest->Complete(kResultNotStarted, nullptr, nullptr);
}

void Production::OnTransactionCreated(const shared_ptr<TransactionRequest>& inRequest, int inResult,
                                      const InterfaceRef<TransactionList>& inFactory,
                                      const shared_ptr<ostnet::Response>& inResponse) {
    const auto transaction =
        inResult < 0 ? nullptr : ReadNewTransaction(inFactory->GetHTTPURL(), inRequest->server, inResponse);
    if (!transaction) {
        inRequest->Complete(inResult < 0 ? inResult : kResultFailure, nullptr, inResponse);
        return;
    }
    InterfaceRef<TransactionList> list;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::OnTransactionCreated");
        list = mTransactions;
    }
    transaction->SetCreationContext(InterfaceRef<Production>(this), list);
    const ImmutableString url = transaction->GetHTTPURL();
    TraceAt(kTraceLevel_Progress, "Load Transaction resource ", url);
    const auto onLoaded = [inRequest, transaction, inResponse, url](
                              const Guid&, int inLoadResult, const InterfaceRef<IZOCServerResource>&,
                              const shared_ptr<ostnet::Response>& inAnswer) {
        const int result = inLoadResult >= 0 && !transaction->IsLoaded() ? kResultFailure : inLoadResult;
        TraceAt(result < 0 ? kTraceLevel_Error : kTraceLevel_Progress, "Transaction resource ", url,
                result < 0 ? " could not be loaded, RFL result == " : " is loaded, RFL result == ", result);
        const InterfaceRef<IZOCServerResource> made =
            result < 0 ? InterfaceRef<IZOCServerResource>() : InterfaceRef<IZOCServerResource>(transaction);
        inRequest->Complete(result, made, inAnswer ? inAnswer : inResponse);
    };
    if (!transaction->Load(inRequest->requestID, onLoaded, true)) {
        inRequest->Complete(kResultNotStarted, nullptr, inResponse);
    }
}

bool Production::CreateTransactionAndStoreChanges(const Guid& inRequestID,
                                                  const RequestCompletion& inCompletion,
                                                  const InterfaceRef<IZOCProduction>& inProduction,
                                                  const UString& inTransactionType) {
    const auto changed = RFL::QueryInterface<IZOCEditingSession>(inProduction);
    if (!changed) {
        return false;
    }
    const auto onCreated = [changed, inCompletion](const Guid& inID, int inResult,
                                                   const InterfaceRef<IZOCServerResource>& inResource,
                                                   const shared_ptr<ostnet::Response>& inResponse) {
        const auto complete = [inID, inCompletion, inResponse](
                                  int inFinalResult, const InterfaceRef<IZOCServerResource>& inTransaction) {
            if (inCompletion) {
                inCompletion(inID, inFinalResult, inTransaction, inResponse);
            }
        };
        const auto transaction = RFL::QueryInterface<IZOCTransaction>(inResource);
        if (inResult < 0 || !transaction) {
            complete(inResult < 0 ? inResult : kResultFailure, nullptr);
            return;
        }
        // A transaction without the changes is of no use to the caller, and would be in everybody's way.
        const auto giveUp = [transaction, complete](int inFailure) {
            const auto onRolledBack =
                [complete, inFailure](const Guid&, int, const InterfaceRef<IZOCServerResource>&,
                                      const shared_ptr<ostnet::Response>&) { complete(inFailure, nullptr); };
            if (!transaction->Rollback(Guid::CreateUnique(), onRolledBack)) {
                complete(inFailure, nullptr);
            }
        };
        const auto onStored = [inResource, complete, giveUp](int inStoreResult) {
            if (inStoreResult < 0) {
                giveUp(inStoreResult);
            } else {
                complete(inStoreResult, inResource);
            }
        };
        if (!changed->StoreProductionChangesInTransaction(transaction, onStored)) {
            giveUp(kResultNotStarted);
        }
    };
    return CreateTransaction(inRequestID, onCreated,
                             ImmutableString(ostcore::utility::ToUTF8(inTransactionType)), boost::none);
}

}  // namespace ZOCL
