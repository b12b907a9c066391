// Thousands of changes to a transaction, sent as a few forms instead of one request each.
#pragma once

#include <cstddef>
#include <map>

#include "ZOClient/CompoundAsyncOperation.h"
#include "ZOClient/IZOCAsset.h"

namespace ZOCL {

/// Where the enclosures of a new asset are copied from: an asset of a production at a commit, which are
/// given as IZOCDataServer::GetProductionByIdAndCommitId takes them. All three empty: from nowhere.
struct SourceAssetReference {
    ImmutableString productionID;
    ImmutableString commitID;
    ImmutableString assetID;
};

/// A new asset with all that it starts with. Payloads are shared, never copied, and must not change any more.
struct BulkNewAsset {
    AssetBaseProperties properties;
    /// Empty: the one of the properties.
    ImmutableString mediaLocator;
    optional<SubClip> subClip;
    /// By name. An empty name is left out; no payload stands for an empty one.
    std::map<ImmutableString, shared_ptr<RecycledMemory const>> enclosures;
    /// By content type (IZOCRendition::kFlavor...). One without a type or payload is left out.
    std::map<ImmutableString, shared_ptr<RecycledMemory const>> renditions;
    SourceAssetReference source;
};

/// Gathers creations, deletions and edits of assets and writes of production enclosures, and sends them to
/// the transaction that made it as multi-part forms of about 32 MiB each.
///
/// The work goes in three phases, whatever the order of the calls: all creations, then all deletions, then
/// all edits. A phase is sent when its finish operation was called and what it waits for has ended; every
/// request of a phase ends before the next phase begins. The whole counts as one request of the parent
/// operation that was given to CreateBulkTransaction: its final function tells that everything has ended, and
/// the first failure. An object is used once; another can be made when it IsCompletelyFinished. That one goes
/// by the lists that the transaction holds, so Refresh the transaction in between.
///
/// Failures: the first one ends the work. Requests under way are asked to cancel, and phases that have not
/// begun send nothing. What stood in a request is told to its completions with the result of that request;
/// completions of what was never sent are not called, they are only released: the result of the parent
/// operation speaks for them. Cancelling the parent operation is such a failure, and needs no finish call.
/// After a failure the transaction holds a part of the changes: roll it back.
///
/// A host that lets go of its last reference before FinishedEditing has given up: what was not sent is
/// dropped, and the parent operation ends with kResultCancelled. After FinishedEditing the reference need not
/// be kept.
///
/// Threads: any. Completions run exactly once where they run, on a worker, with no lock held; they may call
/// this object. Every completion may be empty.
class ZOCL_EXPORT IZOCBulkTransaction : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f6342756c6b54ull, 0x72616e7361630001ull};

    using ResultCompletion = function<void(int inResult)>;
    /// The asset is null after a failure. It is loaded with the properties that were sent and knows its URL;
    /// load it anew for its links.
    using AssetCompletion = function<void(int inResult, const InterfaceRef<IZOCAsset>& inAsset)>;

    /// Adds a new asset; its index is the number of new assets before it. An empty media locator stands for
    /// that of the properties. An enclosure without a name is none, nor is a rendition without a content type
    /// or payload. The enclosures of the source asset are fetched before the creations are sent; what cannot
    /// be fetched is left out silently. False, with the completion dropped, when the creations have been
    /// sent.
    virtual bool CreateNewAsset(const AssetCompletion& inCompletion, const AssetBaseProperties& inProperties,
                                const ImmutableString& inMediaLocator, const optional<SubClip>& inSubClip,
                                const ImmutableString& inEnclosureName,
                                const shared_ptr<RecycledMemory const>& inEnclosureData,
                                const ImmutableString& inRenditionType,
                                const shared_ptr<RecycledMemory const>& inRenditionData,
                                const SourceAssetReference& inSource) = 0;
    /// The operation whose end sends the creations: a host starts requests on it that have to end before.
    /// Null when they have been sent.
    virtual shared_ptr<CompoundAsyncOperation> GetCreateOperation() = 0;
    /// There are no more new assets, but for those that requests of the create operation still add.
    virtual void FinishedCreatingNewAssets() = 0;
    /// Tells of an asset that was brought back during this transaction and that the transaction's list does
    /// not hold, so that it can be edited. Nothing happens for a null asset or when the edits have been sent.
    virtual void NotifyOfRestoredAsset(const InterfaceRef<IZOCAsset>& inAsset) = 0;
    /// False when the deletions have been sent or the server deletes nothing in bulk.
    virtual bool DeleteAsset(const ResultCompletion& inCompletion, const ImmutableString& inAssetID) = 0;
    virtual void FinishedDeletingAssets() = 0;
    /// The three values replace those of an earlier call for this asset; one that is not given clears it, and
    /// the asset keeps what it has. Keys of the asset that this client does not know stay as they are. False
    /// when the edits have been sent.
    virtual bool SetAssetProperties(const ResultCompletion& inCompletion, const ImmutableString& inAssetID,
                                    const optional<AssetBaseProperties>& inProperties,
                                    const optional<SubClip>& inSubClip,
                                    const optional<ImmutableString>& inMediaLocator) = 0;
    /// Writes an enclosure of an asset, over the one of this name or as a new one; of two calls for one name
    /// the second one's data counts, and both completions run. False when the edits have been sent.
    virtual bool SetAssetEnclosure(const ResultCompletion& inCompletion, const ImmutableString& inAssetID,
                                   const ImmutableString& inName,
                                   const shared_ptr<RecycledMemory const>& inData) = 0;
    /// The same for a rendition. Nothing happens when the edits have been sent.
    virtual void SetAssetRendition(const ImmutableString& inAssetID, const ImmutableString& inContentType,
                                   const shared_ptr<RecycledMemory const>& inData) = 0;
    /// The same for an enclosure of the production. With inCreateOnly one that exists stays as it is.
    virtual void SetProductionEnclosure(const ImmutableString& inName,
                                        const shared_ptr<RecycledMemory const>& inData,
                                        bool inCreateOnly) = 0;
    /// The operation whose end sends the edits. Null when they have been sent.
    virtual shared_ptr<CompoundAsyncOperation> GetEditOperation() = 0;
    /// Ends the gathering of all three kinds.
    virtual void FinishedEditing() = 0;
    virtual InterfaceRef<IZOCBulkTransaction> AddRefSelf() = 0;

    /// One more enclosure for a new asset that has not been sent, in the place of one of that name. Nothing
    /// happens for an index that is out of range.
    virtual void AddEnclosureToNewAsset(std::size_t inIndex, const ImmutableString& inName,
                                        const shared_ptr<RecycledMemory const>& inData) = 0;
    /// CreateNewAsset for an asset of many enclosures and renditions.
    virtual bool CreateNewAsset(const AssetCompletion& inCompletion, const BulkNewAsset& inAsset) = 0;
    /// True when everything has ended, also after a failure.
    virtual bool IsCompletelyFinished() = 0;
};

}  // namespace ZOCL
