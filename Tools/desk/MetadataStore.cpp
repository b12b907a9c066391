// The steps of a save, from the wait for others to the commit or the rollback.
#include "MetadataStore.h"

#include "Text.h"
#include "ZOClient/XMPMerge.h"

namespace Desk {
namespace {

using ZOCL::Guid;
using ZOCL::ImmutableString;
using ZOCL::InterfaceRef;
using ZOCL::RequestCompletion;

// The session may move between being loaded and the opening of the transaction.
constexpr int kAttempts = 3;

QString Describe(const Outcome& inOutcome) {
    return DescribeResult(inOutcome.result);
}

Metadata Describe(const InterfaceRef<ZOCL::IZOCEnclosure>& inEnclosure) {
    return inEnclosure
               ? Metadata{inEnclosure->GetEnclosurePayloadAsUTF8(), inEnclosure->GetEnclosureContentID()}
               : Metadata();
}

/// One save, step by step. Each step starts a call whose end is the next step; the object lives in them.
class SaveSteps : public std::enable_shared_from_this<SaveSteps> {
public:
    SaveSteps(Requests& ioRequests, const InterfaceRef<ZOCL::IZOCEditingSession>& inSession,
              const AssetItem& inItem, const Metadata& inBase, const std::string& inPacket,
              const MetadataStore::Saved& inSaved)
        : mRequests(ioRequests),
          mSession(inSession),
          mItem(inItem),
          mName(MetadataStore::EnclosureOf(inItem)),
          mBase(inBase),
          mPacket(inPacket),
          mSaved(inSaved) {}

    /// What this application left open on this machine is rolled back; for others the user is asked to wait.
    void Start() {
        Then(
            [this](const Guid& inID, const RequestCompletion& inCompletion) {
                return mSession->GetPendingTransactions(
                    ZOCL::kNoConflictTransactionTypes,
                    [inID, inCompletion](int inResult) { inCompletion(inID, inResult, nullptr, nullptr); });
            },
            &SaveSteps::OnNobodyElse);
    }

private:
    using Step = void (SaveSteps::*)(const Outcome&);

    void Then(const Requests::Start& inStart, Step inStep) {
        mRequests.Run(inStart, [self = shared_from_this(), inStep](const Outcome& inOutcome) {
            (self.get()->*inStep)(inOutcome);
        });
    }
    void ThenLoad(const InterfaceRef<ZOCL::IZOCServerResource>& inResource, Step inStep) {
        mRequests.Load(inResource, [self = shared_from_this(), inStep](const Outcome& inOutcome) {
            (self.get()->*inStep)(inOutcome);
        });
    }

    void OnNobodyElse(const Outcome& inOutcome) {
        if (!inOutcome.Succeeded()) {
            mSaved(Describe(inOutcome));
            return;
        }
        OpenTransaction();
    }

    void OpenTransaction() {
        ++mAttempts;
        Then(
            [this](const Guid& inID, const RequestCompletion& inCompletion) {
                return mSession->CreateTransaction(inID, inCompletion, ZOCL::kTransactionType_Edit);
            },
            &SaveSteps::OnOpened);
    }

    void OnOpened(const Outcome& inOutcome) {
        mTransaction = RFL::QueryInterface<ZOCL::IZOCTransaction>(inOutcome.resource);
        const auto view = RFL::QueryInterface<ZOCL::IZOCProduction>(inOutcome.resource);
        if (inOutcome.Succeeded() && mTransaction && view) {
            mAssets = view->GetAssets();
            ThenLoad(RFL::QueryInterface<ZOCL::IZOCServerResource>(mAssets), &SaveSteps::OnAssets);
        } else if (inOutcome.result == ZOCL::kResultHTTPPreconditionFailed && mAttempts < kAttempts) {
            Then(
                [this](const Guid& inID, const RequestCompletion& inCompletion) {
                    return mSession->Refresh(inID, inCompletion);
                },
                &SaveSteps::OnSessionRefreshed);
        } else {
            mSaved(Describe(inOutcome));
        }
    }

    void OnSessionRefreshed(const Outcome&) { OpenTransaction(); }

    void OnAssets(const Outcome& inOutcome) {
        const auto asset =
            inOutcome.Succeeded() ? mAssets->GetAssetByIdentifier(mItem.assetIdentifier) : nullptr;
        if (!asset) {
            RollBack(inOutcome.Succeeded()
                         ? Text("$$$/ZODesk/Save/Removed=The asset has been removed meanwhile.")
                         : Describe(inOutcome));
            return;
        }
        mEnclosures = asset->GetEnclosures();
        Then(
            [this](const Guid& inID, const RequestCompletion& inCompletion) {
                return mEnclosures && ZOCL::LoadSpecificEnclosure(mEnclosures, mName, inID, inCompletion);
            },
            &SaveSteps::OnPresentPacket);
    }

    void OnPresentPacket(const Outcome& inOutcome) {
        const auto enclosure = RFL::QueryInterface<ZOCL::IZOCEnclosure>(inOutcome.resource);
        const Metadata present = Describe(enclosure);
        if (!inOutcome.Succeeded()) {
            RollBack(Describe(inOutcome));
        } else if (present.contentID != mBase.contentID && !MergeWith(present)) {
            RollBack(Text(
                "$$$/ZODesk/Save/Changed=Somebody else has changed the same properties meanwhile. Revert "
                "your changes to see theirs."));
        } else {
            Write(RFL::QueryInterface<ZOCL::IZOCWritableEnclosure>(enclosure));
        }
    }

    /// A packet that has appeared or gone has nothing in common with the one that was edited.
    bool MergeWith(const Metadata& inPresent) {
        ZOCL::XMPMergeOutcome merged;
        const bool isMerged = !mBase.packet.empty() && !inPresent.packet.empty() &&
                              ZOCL::MergeXMPPackets(mBase.packet, inPresent.packet, mPacket, merged) >= 0 &&
                              merged.conflicts.empty();
        mPacket = isMerged ? merged.packet : mPacket;
        return isMerged;
    }

    void Write(const InterfaceRef<ZOCL::IZOCWritableEnclosure>& inPresent) {
        const auto payload = ZOCL::RecycledMemory::CreateFromBytes(mPacket);
        const auto factory = RFL::QueryInterface<ZOCL::IZOCWritableEnclosures>(mEnclosures);
        Then(
            [this, inPresent, payload, factory](const Guid& inID, const RequestCompletion& inCompletion) {
                if (inPresent) {
                    return inPresent->PutEnclosurePayload(payload, inID, inCompletion);
                }
                return factory && ZOCL::CreateEnclosure(inID, factory->GetEnclosureFactoryURL(),
                                                        ZOCL::IZOCDataServer::GetLoggedInServerRef(), mName,
                                                        payload, inCompletion);
            },
            &SaveSteps::OnWritten);
    }

    void OnWritten(const Outcome& inOutcome) {
        if (!inOutcome.Succeeded()) {
            RollBack(Describe(inOutcome));
            return;
        }
        const QString message =
            Text("$$$/ZODesk/Save/CommitMessage=Changed the metadata of @0", {ToQt(mItem.name)});
        Then(
            [this, message](const Guid& inID, const RequestCompletion& inCompletion) {
                return mTransaction->Commit(inID, inCompletion, FromQt(message));
            },
            &SaveSteps::OnCommitted);
    }

    void OnCommitted(const Outcome& inOutcome) {
        if (inOutcome.Succeeded()) {
            mSaved(QString());
        } else {
            RollBack(Describe(inOutcome));
        }
    }

    /// The error is told when the transaction is out of everybody's way.
    void RollBack(const QString& inError) {
        mError = inError;
        Then(
            [this](const Guid& inID, const RequestCompletion& inCompletion) {
                return mTransaction->Rollback(inID, inCompletion);
            },
            &SaveSteps::OnRolledBack);
    }

    void OnRolledBack(const Outcome&) { mSaved(mError); }

    Requests& mRequests;
    const InterfaceRef<ZOCL::IZOCEditingSession> mSession;
    const AssetItem mItem;
    const ImmutableString mName;
    const Metadata mBase;
    std::string mPacket;
    const MetadataStore::Saved mSaved;
    int mAttempts = 0;
    InterfaceRef<ZOCL::IZOCTransaction> mTransaction;
    InterfaceRef<ZOCL::IZOCAssetList> mAssets;
    InterfaceRef<ZOCL::IZOCEnclosures> mEnclosures;
    QString mError;
};

}  // namespace

ImmutableString MetadataStore::EnclosureOf(const AssetItem& inItem) {
    return inItem.mediaLocatorIdentifier.empty() ? ImmutableString()
                                                 : ZOCL::GetXMPEnclosureName(inItem.mediaLocatorIdentifier);
}

void MetadataStore::Load(const InterfaceRef<ZOCL::IZOCAsset>& inAsset, const AssetItem& inItem,
                         const Loaded& inLoaded) {
    mLoads.Cancel();
    const auto enclosures = inAsset ? inAsset->GetEnclosures() : nullptr;
    mLoads.Run(
        [enclosures, name = EnclosureOf(inItem)](const Guid& inID, const RequestCompletion& inCompletion) {
            return enclosures && ZOCL::LoadSpecificEnclosure(enclosures, name, inID, inCompletion);
        },
        [inLoaded](const Outcome& inOutcome) {
            inLoaded(inOutcome.Succeeded() ? QString() : Describe(inOutcome),
                     Describe(RFL::QueryInterface<ZOCL::IZOCEnclosure>(inOutcome.resource)));
        });
}

void MetadataStore::Save(const InterfaceRef<ZOCL::IZOCEditingSession>& inSession, const AssetItem& inItem,
                         const Metadata& inBase, const std::string& inPacket, const Saved& inSaved) {
    std::make_shared<SaveSteps>(mSaves, inSession, inItem, inBase, inPacket, inSaved)->Start();
}

}  // namespace Desk
