// What differs between two commits, and where a session is in conflict with its production.
#pragma once

#include <vector>

#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// "ADDED", "UPDATED", "REMOVED".
ZOCL_EXPORT extern const ImmutableString kDifferenceType_Added;
ZOCL_EXPORT extern const ImmutableString kDifferenceType_Updated;
ZOCL_EXPORT extern const ImmutableString kDifferenceType_Removed;

/// The differences between a left and a right commit. Answers IZOCServerResource, by which it is loaded.
/// Accessors read the loaded body and make no request. Threads: any.
class ZOCL_EXPORT IZOCDifferences : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634469666665ull, 0x72656e6365730001ull};

    /// One item that differs. A text that the server did not give is null.
    struct Entry {
        /// The asset; null for an enclosure of the production itself and for the production's properties.
        ImmutableString identifier;
        /// UTF-8. The name of an asset or of an enclosure; for the production's properties
        /// "com.orvane.meridane.properties.difference".
        ImmutableString name;
        /// kDifferenceType_*.
        ImmutableString differenceType;
        /// The content identifier of the other side's state (or "removed" when it has removed the item);
        /// not empty means that the item is in conflict.
        ImmutableString conflictsWithContentID;
        /// The common ancestor of both sides.
        ImmutableString baseCommitID;
        /// Who changed the item last on the right side, and when, in UTC (else not-a-date-time).
        ImmutableString committer;
        ptime committed;
        /// The item itself: asset, enclosure, or production. On the right side, for a removed one on the
        /// left.
        ImmutableString itemURL;
        /// The asset of the item; the production or session for what is no asset's.
        ImmutableString assetURL;
        /// Where to accept one side of a conflict; null when there is none.
        ImmutableString acceptTheirsURL;
        ImmutableString acceptYoursURL;

        bool IsInConflict() const noexcept { return !conflictsWithContentID.empty(); }
    };

    /// Enclosures are told by themselves, also those of assets that were added or removed.
    virtual std::vector<Entry> GetEnclosureDifferences() = 0;
    virtual std::vector<Entry> GetAssetDifferences() = 0;
    /// One entry, or none when the production's properties are equal.
    virtual std::vector<Entry> GetPropertiesDifferences() = 0;
    virtual bool HasDifferences() = 0;
    virtual bool HasConflicts() = 0;
    virtual bool HasAssetConflicts() = 0;
    virtual bool HasEnclosureConflicts() = 0;
    virtual bool HasPropertiesConflicts() = 0;
    /// The right side.
    virtual ImmutableString GetCommitID() = 0;
    /// The left side.
    virtual ImmutableString GetBaseCommitID() = 0;
};

/// The differences between any two commits of a production or session, not loaded. An empty commit on the
/// right stands for the newest, on the left for nothing, against which all is added. Null without a server
/// or when it offers no such thing. Threads: any.
ZOCL_EXPORT InterfaceRef<IZOCDifferences> GetDifferencesByCommit(const InterfaceRef<IZOCDataServer>& inServer,
                                                                 const ImmutableString& inProductionID,
                                                                 const ImmutableString& inBaseCommitID,
                                                                 const ImmutableString& inCommitID);

}  // namespace ZOCL
