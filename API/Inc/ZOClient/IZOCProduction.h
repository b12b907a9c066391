// Productions: the versioned repositories of the hub.
#pragma once

#include <string>
#include <vector>

#include "ZOClient/IZOCAsset.h"
#include "ZOClient/IZOCEnclosure.h"
#include "ZOClient/IZOCProductionHistory.h"

namespace ZOCL {

class IZOCEditingSession;
class IZOCProductionList;

/// A production, an editing session on one, or a transaction on a session: its links tell which.
/// Accessors read the loaded body and make no request; setters change the object alone.
class ZOCL_EXPORT IZOCProduction : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f6350726f6475ull, 0x6374696f6e000001ull};

    virtual UString GetName() = 0;
    virtual void SetName(const UString& inName) = 0;
    virtual ImmutableString GetIdentifier() = 0;
    virtual UString GetDescription() = 0;
    virtual void SetDescription(const UString& inDescription) = 0;
    /// Null before the production is loaded, or when it names no lists. The list itself is loaded by the
    /// caller: it answers IZOCServerResource.
    virtual InterfaceRef<IZOCAssetList> GetAssets() = 0;
    virtual InterfaceRef<IZOCAssetList> GetAssetsWithParent(const ImmutableString& inParentID) = 0;
    /// Loads the asset list when needed; the completion's resource answers IZOCAsset.
    virtual bool GetAssetByIdentifier(const Guid& inRequestID, const ImmutableString& inIdentifier,
                                      const RequestCompletion& inCompletion) = 0;
    /// Blocks; null when there is none.
    virtual InterfaceRef<IZOCAsset> GetAssetByIdentifier(const ImmutableString& inIdentifier) = 0;
    /// The URL of an asset at a commit; an empty commit stands for the newest. Null without the link.
    virtual ImmutableString GetAssetURL(const ImmutableString& inAssetID,
                                        const ImmutableString& inCommit) = 0;
    /// Reads the history for its newest version; kResultHTTPNotFound for an empty one. False without the
    /// link.
    virtual bool GetMostRecentRevision(const HistoryWalkCompletion& inCompletion) = 0;
    /// Loads the history page by page and shows each version to the visitor, newest first, until it ends the
    /// walk; kResultHTTPNotFound and null when nothing is left. The completion runs once, on a worker. False
    /// without the link.
    virtual bool LoadHistoryWith(const HistoryVisitor& inVisitor,
                                 const HistoryWalkCompletion& inCompletion) = 0;
    /// Blocks. Gives the session of this user, loaded: without inIsTemporary one that exists already, else a
    /// new one. False and null when there is none to be had; the reason is traced.
    virtual bool CreateEditingSession(InterfaceRef<IZOCEditingSession>& outSession, const UString& inName,
                                      const UString& inDescription, bool inIsTemporary) = 0;
    /// A new, unloaded list of this production's sessions; null without the link.
    virtual InterfaceRef<IZOCProductionList> GetEditingSessions() = 0;
    /// The href behind which the editing sessions stand, null without it.
    virtual ImmutableString GetSessionsLink() = 0;
    /// New, unloaded; null without the link.
    virtual InterfaceRef<IZOCProductionHistory> GetProductionHistory() = 0;
    /// Blocks: loads the latest version of this production; its commit, null on failure.
    virtual ImmutableString GetMostRecentRevision() = 0;
    /// The commit of the loaded body.
    virtual ImmutableString GetLoadedRevision() = 0;
    /// Blocks. The XMP packet of an item, in UTF-8: of an editing session the one that CacheXMP was given as
    /// a change, else that of the production's enclosure "<key>_xmp". The key is the identifier of the item's
    /// media locator. Empty when there is none or it cannot be loaded; the reason is traced.
    virtual std::string ReadXMP(const ImmutableString& inKey) = 0;
    /// The same with the key of the item; empty for a null one and for one without a media locator.
    virtual std::string ReadXMP(const InterfaceRef<IZOCAsset>& inItem) = 0;
    virtual InterfaceRef<IZOCEnclosures> GetEnclosures() = 0;
    /// Posts a copy; the completion's resource answers IZOCProduction.
    virtual bool Copy(const Guid& inRequestID, const RequestCompletion& inCompletion, const UString& inName,
                      const UString& inDescription, bool inIsTemporary) = 0;

    /// False when the link to the sessions is missing.
    virtual bool GetEditingSessionFactoryURL(ImmutableString& outURL) = 0;
    /// Not-a-date-time when the server gave none. In UTC.
    virtual ptime GetCreationTime() = 0;
    virtual ptime GetModificationTime() = 0;
    virtual ImmutableString GetOwner() = 0;
    virtual std::vector<ImmutableString> GetTags() = 0;
    /// A new, unloaded production at the "latest-version" link; null without the link.
    virtual InterfaceRef<IZOCProduction> GetLatestVersion() = 0;
    virtual bool IsEditingSession() = 0;
    virtual bool IsTransaction() = 0;
    virtual bool IsTemplate() = 0;
};

class ZOCL_EXPORT IZOCProductionList : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f6350726f6475ull, 0x6374696f6e4c6973ull};

    struct Entry {
        UString name;
        UString description;
        ImmutableString identifier;
        ImmutableString owner;
        /// Not-a-date-time when the server gave none. In UTC.
        ptime lastModified;
        ptime lastModifiedOfAllSessions;
        ImmutableString url;
    };

    virtual std::vector<Entry> GetAllItems() = 0;
    /// The production of an entry, from the data server's cache or new; not loaded by this call.
    virtual InterfaceRef<IZOCProduction> GetProduction(const Entry& inEntry) = 0;
    /// Starts a load of the list, as IZOCServerResource does.
    virtual bool Load(const Guid& inRequestID, const RequestCompletion& inCompletion,
                      bool inReportErrors) = 0;
    /// Blocks.
    virtual bool Load(bool inReportErrors) = 0;
    /// Posts a new production through this list; the completion's resource answers IZOCProduction.
    virtual bool GetNewProduction(const Guid& inRequestID, const UString& inName,
                                  const UString& inDescription, bool inIsTemporary,
                                  const RequestCompletion& inCompletion) = 0;
    /// A fresh unloaded list at the "next" link; null when this is the last page.
    virtual InterfaceRef<IZOCProductionList> GetNextPage() = 0;
};

}  // namespace ZOCL
