// Writes what was changed on an editing session's object into a transaction: name and description, and the
// cached XMP packets.
#include "Model/EnclosureWrite.h"
#include "Model/Production.h"
#include "ZOClient/CompoundAsyncOperation.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

struct Production::UnstoredChanges {
    PropertyChanges properties;
    XMPCache::Packets packets;

    bool IsEmpty() const { return properties.empty() && packets.empty(); }
};

namespace {

/// A copy of what the server had must not go over something newer.
bool IsToBeWritten(const XMPCache::Packet& inPacket, const EnclosureWrite& inWrite) {
    return inPacket.isDirty || !inWrite.list->GetEnclosure(inWrite.name);
}

/// The list is loaded.
void WritePackets(const shared_ptr<CompoundAsyncOperation>& inOperation, const XMPCache::Packets& inPackets,
                  const InterfaceRef<Enclosures>& inList) {
    for (const auto& [key, packet] : inPackets) {
        const EnclosureWrite write{inList, inList->GetServer(), GetXMPEnclosureName(key), packet.text,
                                   ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8};
        if (!IsToBeWritten(packet, write)) {
            continue;
        }
        inOperation->Initiate(
            [write](const Guid& inRequestID, const RequestCompletion& inCompletion) {
                return StartEnclosureWrite(write, inRequestID, inCompletion);
            },
            nullptr);
    }
}

void StorePackets(const shared_ptr<CompoundAsyncOperation>& inOperation, const XMPCache::Packets& inPackets,
                  const InterfaceRef<Enclosures>& inList) {
    inOperation->Initiate(
        [inList](const Guid& inRequestID, const RequestCompletion& inCompletion) {
            return inList && inList->Load(inRequestID, inCompletion, true);
        },
        [inOperation, inPackets, inList](int inResult) {
            if (inResult < 0) {
                return inResult;
            }
            if (!inList->IsLoaded()) {
                return kResultFailure;
            }
            WritePackets(inOperation, inPackets, inList);
            return inResult;
        });
}

}  // namespace

Production::UnstoredChanges Production::TakeUnstoredChanges() {
    UnstoredChanges changes;
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::StoreProductionChangesInTransaction()");
    changes.properties.swap(mPropertyChanges);
    mXMPCache.Swap(changes.packets);
    return changes;
}

void Production::PutBackUnstoredChanges(const UnstoredChanges& inChanges) {
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::PutBackUnstoredChanges");
    mPropertyChanges.insert(inChanges.properties.begin(), inChanges.properties.end());
    mXMPCache.PutBack(inChanges.packets);
}

bool Production::PutPropertiesInTransaction(const InterfaceRef<Production>& inTransaction,
                                            const Guid& inRequestID, const RequestCompletion& inCompletion) {
    inTransaction->SetName(GetName());
    inTransaction->SetDescription(GetDescription());
    const auto onStored = [inTransaction, inCompletion](const Guid& inID, int inResult,
                                                        const InterfaceRef<IZOCServerResource>& inResource,
                                                        const shared_ptr<ostnet::Response>& inResponse) {
        if (inResult >= 0) {
            inTransaction->TakeUnstoredChanges();
        }
        inCompletion(inID, inResult, inResource, inResponse);
    };
    return inTransaction->UpdateProductionBaseProperties(inRequestID, onStored);
}

bool Production::StoreProductionChangesInTransaction(const InterfaceRef<IZOCTransaction>& inTransaction,
                                                     const ResultCompletion& inCompletion) {
    const auto transaction = RFL::QueryInterface<Production>(inTransaction);
    if (!transaction) {
        return false;
    }
    const UnstoredChanges changes = TakeUnstoredChanges();
    const InterfaceRef<Production> self(this);
    const auto onStored = [self, changes, inCompletion](int inResult) {
        if (inResult < 0) {
            self->PutBackUnstoredChanges(changes);
        }
        if (inCompletion) {
            inCompletion(inResult);
        }
    };
    if (changes.IsEmpty()) {
        return transaction->GetServer()->PostFunction([onStored] { onStored(kResultSuccess); }, 0);
    }
    InterfaceRef<Enclosures> list;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::StoreProductionChangesInTransaction()");
        list = transaction->mEnclosures;
    }
    const auto operation = CompoundAsyncOperation::Create(onStored, transaction->GetServer(), false);
    if (changes.properties.empty()) {
        StorePackets(operation, changes.packets, list);
        return true;
    }
    // One after the other: a packet that is written makes the tag of the properties another one.
    operation->Initiate(
        [self, transaction](const Guid& inRequestID, const RequestCompletion& inStored) {
            return self->PutPropertiesInTransaction(transaction, inRequestID, inStored);
        },
        [operation, changes, list](int inResult) {
            if (inResult >= 0 && !changes.packets.empty()) {
                StorePackets(operation, changes.packets, list);
            }
            return inResult;
        });
    return true;
}

}  // namespace ZOCL
