// Gathers what a window about the changes of a session shows: its assets, its outgoing changes, and the
// assets that are told of there but that its list has no more.
#pragma once

#include <vector>

#include "Collaboration/ProductionItemData.h"
#include "Operations/PrepareOperationBase.h"
#include "ostcore/threads/Mutex.h"
#include "ZOClient/IZOCEditingSession.h"

namespace ZOCL {

/// Ends with 0 once the outgoing changes are there, with or without the assets that were to be fetched, with
/// kResultFailure when they could not be had, and with kResultCancelled after an Abort, which also stops the
/// requests in flight.
///
/// Threads: any, but Start on the main thread. What a getter gives is final when the end has been told.
class PrepareChangesOperation : public ZOPrepareOperationBase {
public:
    void Run() override;

    /// Loaded when the result is 0, else perhaps null.
    InterfaceRef<IZOCDifferences> GetOutgoingChanges() const;
    /// The session; null before the end and when there is none.
    InterfaceRef<IZOCEditingSession> GetSession() const;

protected:
    struct AssetToFetch {
        ImmutableString url;
        /// What the derived class knows it by.
        std::size_t row = 0;
    };
    using Assets = std::vector<IZOCAssetList::AssetListItem>;

    /// Without a session the one at the URL is taken.
    PrepareChangesOperation(const ImmutableString& inProductionURL,
                            const InterfaceRef<IZOCEditingSession>& inSession);
    ~PrepareChangesOperation() override;

    /// Called once each, one after the other; no lock is held.
    virtual void OnAssetList(const Assets& inAssets) = 0;
    virtual std::vector<AssetToFetch> OnChanges(const InterfaceRef<IZOCDifferences>& inChanges) = 0;
    /// Called for each asset that was fetched, also on several threads at once; no lock is held.
    virtual void OnAsset(const AssetToFetch& inRequest, const InterfaceRef<IZOCAsset>& inAsset) = 0;

    /// Leaf lock of what is handed out.
    ostcore::threads::Mutex mMutex;

private:
    using AfterLoad = function<void(int inResult)>;
    void StartLoad(const InterfaceRef<IZOCServerResource>& inResource, const AfterLoad& inNext);
    void OnAssetsLoaded(int inResult, const InterfaceRef<IZOCAssetList>& inList);
    void OnOutgoingChangesLoaded(int inResult, const InterfaceRef<IZOCDifferences>& inChanges);
    void FetchAsset(const AssetToFetch& inRequest);
    void OnRemovedAssetLoaded(const Guid& inRequestID);

    const ImmutableString mProductionURL;
    InterfaceRef<IZOCEditingSession> mSession ZO_GUARDED_BY(mMutex);
    InterfaceRef<IZOCDifferences> mOutgoingChanges ZO_GUARDED_BY(mMutex);
    /// Set before the first of them is asked for.
    unsigned mExpectedAssets = 0;
};

}  // namespace ZOCL
