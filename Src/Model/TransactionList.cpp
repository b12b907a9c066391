// Reading the list of open transactions.
#include "Model/TransactionList.h"

#include <algorithm>

#include "Model/ClientMetadata.h"
#include "Model/ProductionList.h"
#include "Model/ResourceCreation.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

IZOCTransactionList::Entry MakeEntry(const dto::ProductionListItem& inItem) {
    IZOCTransactionList::Entry entry;
    entry.identifier = inItem.Identifier();
    entry.sessionIdentifier = inItem.SessionIdentifier();
    entry.owner = inItem.Owner();
    entry.baseCommit = inItem.BaseCommitID();
    entry.created = inItem.Created();
    entry.modified = inItem.Modified();
    entry.metadata = ReadClientMetadata(inItem.Metadata());
    entry.url = FindItemURL(inItem.GetLinks());
    return entry;
}

}  // namespace

InterfaceRef<TransactionList> TransactionList::Make(const ImmutableString& inURL,
                                                    const InterfaceRef<IZOCDataServer>& inServer,
                                                    const ImmutableString& inSessionID) {
    const auto list = MakeAtURL<TransactionList>(inURL, inServer, ResourceWritability::kReadOnly);
    if (list) {
        ScopedLock lock(IZOCDataServer::GetLock(), "TransactionList::Make");
        list->mSessionID = inSessionID;
    }
    return list;
}

std::vector<IZOCTransactionList::Entry> TransactionList::GetAllItems() {
    dto::Productions body;
    std::set<ImmutableString> removed;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "TransactionList::GetAllItems");
        body = mBody;
        removed = mRemoved;
    }
    std::vector<Entry> entries;
    for (const dto::ProductionListItem& item : body.Items()) {
        Entry entry = MakeEntry(item);
        if (removed.count(entry.identifier) == 0) {
            entries.push_back(std::move(entry));
        }
    }
    return entries;
}

std::vector<IZOCTransactionList::Entry> TransactionList::GetPendingItems(
    const std::vector<ImmutableString>& inIgnoredTypes) {
    ImmutableString sessionID;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "TransactionList::GetPendingItems");
        sessionID = mSessionID;
    }
    std::vector<Entry> entries = GetAllItems();
    const auto isNotPending = [&](const Entry& inEntry) {
        const auto type =
            std::find(inIgnoredTypes.begin(), inIgnoredTypes.end(), inEntry.metadata.transactionType);
        return inEntry.sessionIdentifier != sessionID || type != inIgnoredTypes.end();
    };
    entries.erase(std::remove_if(entries.begin(), entries.end(), isNotPending), entries.end());
    return entries;
}

ImmutableString TransactionList::GetTransactionURL(const Entry& inEntry) {
    return inEntry.url;
}

void TransactionList::RemoveItem(const ImmutableString& inIdentifier) {
    ScopedLock lock(IZOCDataServer::GetLock(), "TransactionList::RemoveItem");
    mRemoved.insert(inIdentifier);
}

int TransactionList::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    if (inID == kInterfaceID) {
        *outInterface = this;
        return kResultSuccess;
    }
    return Implements::QueryInterfaceNoAddRef(inID, outInterface);
}

void TransactionList::PostLoadDTO() {
    ScopedLock lock(IZOCDataServer::GetLock(), "TransactionList::PostLoadDTO");
    mRemoved.clear();
}

}  // namespace ZOCL
