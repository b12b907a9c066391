// One multi-part form of a bulk request: how its parts are named, and when it is full.
#pragma once

#include "Model/BulkRecords.h"
#include "ostnet/http/RequestProcessor.h"

namespace ZOCL {

/// What became of an item that a form was asked to take.
enum class BulkWritten {
    kWritten,
    /// There was nothing to write, or the server has nothing of that kind to write to.
    kNothing,
    /// An identifier or content type cannot stand in a form; the form is as it was before.
    kRefused
};

/// A form is one block of memory that grows part by part; an item goes in whole or not at all.
/// Threads: one at a time.
class BulkForm {
public:
    /// A form with more bytes of payload than this takes no further item, so it exceeds it by one at most.
    static constexpr std::size_t kPayloadLimit = 33554432;
    /// Names, properties and the heads of parts have this much room besides, before they fill a form too.
    static constexpr std::size_t kHeadLimit = kPayloadLimit / 8;

    bool IsFull() const noexcept {
        return mPayloadSize > kPayloadLimit || Size() > kPayloadLimit + kHeadLimit;
    }
    bool IsEmpty() const noexcept { return Size() == 0; }

    // The index counts the new assets, or the new production enclosures, of this form.

    BulkWritten AddNewAsset(std::size_t inIndex, const BulkAssetCreation& inCreation);
    BulkWritten AddDeletion(const ImmutableString& inAssetID);
    /// Enclosures and renditions that the asset does not have yet.
    BulkWritten AddNewItems(const ImmutableString& inAssetID, const BulkAssetEdit& inEdit);
    /// What is there already; an enclosure or rendition that the state does not know is left out.
    BulkWritten AddEdit(const ImmutableString& inAssetID, const BulkAssetEdit& inEdit,
                        const BulkAssetState& inState);
    BulkWritten AddNewProductionEnclosure(std::size_t inIndex, const ImmutableString& inName,
                                          const BulkPayload& inData);
    BulkWritten AddProductionEnclosureEdit(const ImmutableString& inEnclosureID, const BulkPayload& inData);

    /// Closes the form; it must not be used again.
    shared_ptr<RecycledMemory const> Complete(ostnet::Headers& outHeaders);

private:
    class Item;

    std::size_t Size() const noexcept { return mBuilder.Body()->size(); }

    ostnet::http::FormBuilder mBuilder;
    std::size_t mPayloadSize = 0;
};

}  // namespace ZOCL
