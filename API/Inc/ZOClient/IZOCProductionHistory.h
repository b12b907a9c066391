// The commits of a production or of an editing session, newest first.
#pragma once

#include "ZOClient/CommitMetadata.h"
#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// One commit. Answers IZOCServerResource; it is loaded as it comes from its history.
/// Accessors make no request. Threads: any.
class ZOCL_EXPORT IZOCHistoryVersion : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634869737456ull, 0x657273696f6e0001ull};

    /// The commit's identifier.
    virtual ImmutableString GetRevision() = 0;
    /// Who committed.
    virtual ImmutableString GetUserID() = 0;
    /// What a list shows: the local time as text (empty when there is none), the committer's display name
    /// (else the identifier), the title as it stands, the message alone (out of a title that carries
    /// metadata, else the title), and the short form of the commit's identifier.
    virtual void GetInfo(UString& outDate, UString& outUserName, UString& outTitle, UString& outMessage,
                         UString& outShortRevision) = 0;
    /// Several lines for the user; the production's name comes first unless it is empty.
    virtual UString GetToolTipString(const UString& inProductionName) = 0;
    /// In UTC; not-a-date-time when the server gave none.
    virtual ptime GetTime() = 0;
};

/// One page of a history. Answers IZOCServerResource, by which the caller loads it.
/// Accessors read the loaded body and make no request. Threads: any.
class ZOCL_EXPORT IZOCProductionHistory : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634869737450ull, 0x726f640000000001ull};

    virtual int GetHistoryVersionCount() = 0;
    /// Newest first. An index past the end gives the last version, a negative one the first. Not to be
    /// called for an empty page; it gives null then.
    virtual InterfaceRef<IZOCHistoryVersion> GetHistoryVersion(int inIndex) = 0;
    /// An unloaded page of what comes after this one; null for the last page.
    virtual InterfaceRef<IZOCProductionHistory> GetNextPage() = 0;
    /// The commit of the first version on this page; null for an empty page.
    virtual ImmutableString GetRevision() = 0;
    /// The same: the newest of them.
    virtual ImmutableString GetMostRecentRevision() = 0;
};

/// Looks at one version; returns true to end the walk there, with outResult (0 at the call) as its result.
using HistoryVisitor = function<bool(const InterfaceRef<IZOCHistoryVersion>& inVersion, int& outResult)>;
/// Told once how a walk ended, with the version at which it was ended, null when it was not.
using HistoryWalkCompletion = function<void(int inResult, const InterfaceRef<IZOCHistoryVersion>& inVersion)>;

}  // namespace ZOCL
