// The open transactions of a session, and the factory for new ones.
#pragma once

#include <set>

#include "dto/Production.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCTransaction.h"

namespace ZOCL {

class TransactionList final
    : public Implements<JSONServerResource<dto::Productions>, Readable<IZOCTransactionList>> {
public:
    /// Answers with the object itself, for code of this floor.
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f635472616e73ull, 0x61634c6973740002ull};

    /// Unloaded; null for a null URL. Sends nothing.
    static InterfaceRef<TransactionList> Make(const ImmutableString& inURL,
                                              const InterfaceRef<IZOCDataServer>& inServer,
                                              const ImmutableString& inSessionID);

    std::vector<Entry> GetAllItems() override;
    std::vector<Entry> GetPendingItems(const std::vector<ImmutableString>& inIgnoredTypes) override;
    ImmutableString GetTransactionURL(const Entry& inEntry) override;

    /// Leaves an item out until the list is loaded anew.
    void RemoveItem(const ImmutableString& inIdentifier);

    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

protected:
    void PostLoadDTO() override;

private:
    ImmutableString mSessionID ZO_GUARDED_BY(IZOCDataServer::GetLock());
    std::set<ImmutableString> mRemoved ZO_GUARDED_BY(IZOCDataServer::GetLock());
};

}  // namespace ZOCL
