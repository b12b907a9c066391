// Sends many changes of a transaction in bulk and waits for them.
#pragma once

#include <string>
#include <vector>

#include "Failure.h"
#include "Writing.h"
#include "ZOClient/IZOCBulkTransaction.h"

namespace zo {

/// A packet or other enclosure for an asset that is there.
struct EnclosureEdit {
    std::string assetID;
    ZOCL::ImmutableString name;
    boost::shared_ptr<ostcore::utility::RecycledMemory const> data;
};

struct BulkOutcome {
    /// False when changes are not taken in bulk: nothing was sent.
    bool isOffered = false;
    /// Identifiers of the new assets, in their order.
    std::vector<std::string> ids;
};

/// The hub did not take what was sent in bulk. Of the same things, some may be taken one by one.
class BulkRefused : public Failure {
public:
    explicit BulkRefused(const Failure& inFailure) : Failure(inFailure) {}
};

/// Throws a Failure that begins with what was tried when any of it could not be written, a BulkRefused when
/// it was for what was sent; the transaction then holds a part of it and has to be rolled back.
BulkOutcome SendInBulk(Context& ioContext, const OpenTransaction& inTransaction, const std::string& inWhat,
                       const std::vector<ZOCL::BulkNewAsset>& inAssets,
                       const std::vector<EnclosureEdit>& inEdits);

}  // namespace zo
