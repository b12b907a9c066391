// ingest: a folder of media with its sidecars comes into the session, as far as it is not there yet.
#include <filesystem>

#include "Failure.h"
#include "IngestWriter.h"
#include "MediaFiles.h"
#include "Numbers.h"
#include "Verbs.h"
#include "WriteLock.h"

namespace zo {
namespace {

using ZOCL::ImmutableString;

/// What one transaction takes at most. What is in an earlier one stays when the rest is interrupted.
constexpr std::uint64_t kFilesAtOnce = 10'000;
constexpr std::uint64_t kMostFilesAtOnce = 1'000'000;
constexpr std::uint64_t kBytesAtOnce = std::uint64_t(1) << 30;
constexpr std::size_t kLeftOutLines = 10;

// All failed or was empty: there is nothing to be committed.
struct NothingWritten {};

std::string NameOf(const std::string& inRoot) {
    std::error_code error;
    return std::filesystem::canonical(inRoot, error).filename().string();
}

std::uint64_t PayloadOf(const PlannedFile& inPlanned) {
    const FolderFile& file = inPlanned.file;
    const bool hasRendition = inPlanned.task == FileTask::Add && !file.renditionType.empty();
    return file.sidecarBytes + (hasRendition ? file.bytes : 0);
}

FileOutcome OutcomeOf(const PlannedFile& inPlanned) {
    FileOutcome outcome;
    outcome.planned = &inPlanned;
    outcome.assetID = inPlanned.assetID;
    outcome.locator = inPlanned.locator.str();
    return outcome;
}

std::string Counted(std::size_t inCount, const std::string& inWhat) {
    return std::to_string(inCount) + " " + inWhat + (inCount == 1 ? "" : "s");
}

class Ingest {
public:
    Ingest(Context& ioContext, const std::string& inRoot)
        : mContext(ioContext),
          mRoot(inRoot),
          mReader(inRoot),
          mFilesAtOnce(NumberOption(ioContext.Args(), "batch", kFilesAtOnce, 1, kMostFilesAtOnce)) {}

    void Run() {
        mFolder = LookThroughFolder(mRoot, [this] { mContext.Loop().ThrowIfInterrupted(); });
        const OpenRecord open = RequireOpen(mContext);
        const IngestNames names(open.production, mContext.ConnectedTarget().user,
                                MountLabelFrom(mContext.Args().ValueOr("mount", NameOf(mRoot))));
        if (mContext.Args().Has("dry-run")) {
            Plan(LoadForReading(mContext), names);
            TellWouldBe();
        } else {
            const WriteLock lock(mContext);
            RefuseWithOpenTransaction(mContext, "ingesting " + mRoot);
            const WorkSession session = OpenSession(mContext);
            Plan(session.view, names);
            WriteAll(session, names);
        }
        End();
    }

private:
    void Plan(const LoadedProduction& inView, const IngestNames& inNames) {
        const Arguments& args = mContext.Args();
        const auto parent = args.Value("parent");
        const ImmutableString bin =
            parent ? LoadNamedAsset(mContext, inView, *parent).item.assetIdentifier : ImmutableString();
        mPlan = PlanIngest(mContext, inView, mFolder, mReader, inNames, bin,
                           args.Has("update") ? Sidecars::ReplaceChanged : Sidecars::AddMissing);
        TellLeftOut();
        for (const PlannedFile& planned : mPlan.files) {
            if (planned.task == FileTask::Nothing) {
                ++mPresent;
                TellFile(OutcomeOf(planned), "present");
            }
        }
    }

    // --- writing

    void WriteAll(const WorkSession& inSession, const IngestNames& inNames) {
        std::vector<const PlannedFile*> all;
        for (const PlannedFile& planned : mPlan.files) {
            if (planned.task != FileTask::Nothing) {
                all.push_back(&planned);
            }
        }
        mCount.total = all.size();
        try {
            for (std::size_t begin = 0; begin < all.size();) {
                const std::size_t end = EndOfBatch(all, begin);
                WriteBatch(inSession, inNames,
                           {all.begin() + static_cast<std::ptrdiff_t>(begin),
                            all.begin() + static_cast<std::ptrdiff_t>(end)});
                mRemaining = all.size() - end;
                begin = end;
            }
        } catch (const Failure&) {
            mRemaining = all.size() - mHandled;
            TellSummary();
            throw;
        }
    }

    std::size_t EndOfBatch(const std::vector<const PlannedFile*>& inAll, std::size_t inBegin) const {
        std::size_t end = inBegin;
        for (std::uint64_t bytes = 0;
             end < inAll.size() && end - inBegin < mFilesAtOnce && bytes < kBytesAtOnce; ++end) {
            bytes += PayloadOf(*inAll[end]);
        }
        return end;
    }

    // What the hub does not take in bulk for the sake of one file is written anew, file by file, so that the
    // others come along and the one is named.
    void WriteBatch(const WorkSession& inSession, const IngestNames& inNames,
                    const std::vector<const PlannedFile*>& inFiles) {
        const IngestCount before = mCount;
        try {
            return WriteBatch(inSession, inNames, inFiles, Way::Bulk);
        } catch (const BulkRefused& failure) {
            mContext.Out().Note(std::string(failure.what()) + "; going on file by file");
        }
        mCount = before;
        WriteBatch(inSession, inNames, inFiles, Way::Single);
    }

    void WriteBatch(const WorkSession& inSession, const IngestNames& inNames,
                    const std::vector<const PlannedFile*>& inFiles, Way inWay) {
        WritePlan plan;
        plan.type = ZOCL::kTransactionType_Ingest;
        plan.message = mContext.Args().ValueOr(
            "message", "Ingested " + Counted(inFiles.size(), "file") + " of " + NameOf(mRoot));
        BinIDs bins = mPlan.bins;
        IngestOutcome outcome;
        std::string transaction;
        try {
            const std::string commit =
                WriteQuietly(mContext, inSession, plan, [&](const OpenTransaction& inTransaction) {
                    transaction = inTransaction.view.id;
                    outcome = IngestWriter(mContext, inTransaction, mReader, inNames, inWay, mCount)
                                  .Write(inFiles, bins);
                    if (outcome.written == 0) {
                        throw NothingWritten();
                    }
                });
            mPlan.bins = bins;
            TellBatch(outcome);
            TellTransaction(inSession, transaction, commit, plan.message, outcome);
        } catch (const NothingWritten&) {
            outcome.newBins.clear();
            TellBatch(outcome);
        }
        mHandled += inFiles.size();
    }

    // --- telling

    Json FileJson(const FileOutcome& inOutcome, const char* inState) const {
        const FolderFile& file = inOutcome.planned->file;
        Json json("ingested");
        json.Set("state", inState).Set("path", file.path).Set("name", file.Name());
        json.Set("id", inOutcome.assetID).Set("assetType", ZOCL::kAssetType_MasterClip);
        json.Set("mediaLocator", inOutcome.locator).Set("mediaHref", inOutcome.href);
        json.Set("sidecar", inOutcome.hasSidecar ? file.sidecar : std::string());
        json.Set("rendition", inOutcome.renditionType).Set("bytes", file.bytes);
        return json.Set("reason", inOutcome.reason);
    }

    void TellFile(const FileOutcome& inOutcome, const char* inState) {
        if (mContext.Out().IsJson()) {
            mContext.Out().Record(FileJson(inOutcome, inState));
        }
    }

    void TellBin(const std::string& inFolder, const std::string& inID) {
        ++mBins;
        Json json("ingested");
        json.Set("state", "added").Set("path", inFolder).Set("name", FileNameOf(inFolder)).Set("id", inID);
        json.Set("assetType", ZOCL::kAssetType_Bin).Set("mediaLocator", "").Set("mediaHref", "");
        json.Set("sidecar", "").Set("rendition", "").Set("bytes", 0).Set("reason", "");
        mContext.Out().Record(json);
    }

    void TellBatch(const IngestOutcome& inOutcome) {
        mContext.Out().EndProgress();
        for (const NewBin& bin : inOutcome.newBins) {
            TellBin(bin.folder, bin.assetID);
        }
        for (const FileOutcome& file : inOutcome.files) {
            const bool isNew = file.planned->task == FileTask::Add;
            ++(!file.isWritten ? mFailed : isNew ? mAdded : mUpdated);
            TellFile(file, !file.isWritten ? "failed" : isNew ? "added" : "updated");
            if (!file.hasFailed && !file.reason.empty()) {
                mContext.Out().Note(file.planned->file.path + ": " + file.reason);
            }
        }
        for (const Failure& failure : inOutcome.failures) {
            mContext.Out().Error(failure);
            mFailures.push_back(failure);
        }
    }

    void TellTransaction(const WorkSession& inSession, const std::string& inID, const std::string& inCommit,
                         const std::string& inMessage, const IngestOutcome& inOutcome) {
        ++mTransactions;
        mSession = inSession.productionName;
        Json json("transaction");
        json.Set("state", "committed").Set("id", inID).Set("session", inSession.view.id);
        json.Set("commit", inCommit).Set("message", inMessage);
        json.Set("changes", inOutcome.written + inOutcome.newBins.size());
        mContext.Out().Record(json.Set("dryRun", false));
    }

    void TellLeftOut() {
        std::size_t lines = 0;
        for (const LeftOut& entry : mFolder.leftOut) {
            const std::string text = entry.path + " " + entry.reason;
            Json json("ingested");
            json.Set("state", entry.isFailure ? "failed" : "left-out").Set("path", entry.path);
            json.Set("name", FileNameOf(entry.path)).Set("id", "").Set("assetType", "");
            json.Set("mediaLocator", "").Set("mediaHref", "").Set("sidecar", "").Set("rendition", "");
            mContext.Out().Record(json.Set("bytes", 0).Set("reason", entry.reason));
            if (entry.isFailure) {
                ++mFailed;
                mFailures.emplace_back(ExitCode::Failure, text, "nothing of it came along");
                mContext.Out().Error(mFailures.back());
            } else if (++mLeftOut && ++lines <= kLeftOutLines) {
                mContext.Out().Note("left out: " + text);
            }
        }
        if (lines > kLeftOutLines) {
            mContext.Out().Note("left out: " + std::to_string(lines - kLeftOutLines) + " more");
        }
    }

    void TellWouldBe() {
        for (const std::string& folder : mPlan.newFolders) {
            TellBin(folder, "");
        }
        for (const PlannedFile& planned : mPlan.files) {
            if (planned.task == FileTask::Nothing) {
                continue;
            }
            FileOutcome outcome = OutcomeOf(planned);
            outcome.renditionType = planned.task == FileTask::Add ? planned.file.renditionType : "";
            outcome.hasSidecar = planned.file.sidecarBytes > 0;
            ++(planned.task == FileTask::Add ? mAdded : mUpdated);
            TellFile(outcome, planned.task == FileTask::Add ? "added" : "updated");
        }
    }

    void TellSummary() {
        Output& out = mContext.Out();
        out.EndProgress();
        const bool isDryRun = mContext.Args().Has("dry-run");
        Json json("ingest");
        json.Set("directory", mRoot).Set("added", mAdded).Set("updated", mUpdated).Set("present", mPresent);
        json.Set("bins", mBins).Set("failed", mFailed).Set("leftOut", mLeftOut);
        json.Set("remaining", mRemaining).Set("transactions", mTransactions);
        out.Record(json.Set("dryRun", isDryRun));
        out.Say((isDryRun ? "would have added " : "added ") + Counted(mAdded, "clip") + " and " +
                Counted(mBins, "bin") + ", gave " + Counted(mUpdated, "clip") + " new metadata; " +
                std::to_string(mPresent) + " were there");
        if (mTransactions > 0) {
            out.Say("committed to your session on " + mSession + " in " +
                    Counted(mTransactions, "transaction"));
        }
        if (mRemaining > 0) {
            out.Note(Counted(mRemaining, "file") + " did not come along; run the command again for the rest");
        }
    }

    void End() {
        TellSummary();
        if (mFailures.empty()) {
            return;
        }
        if (mAdded + mUpdated + mPresent == 0) {
            throw Failure(mFailures.front());
        }
        throw Failure(ExitCode::PartlyDone,
                      "ingesting " + mRoot + ": " + Counted(mFailures.size(), "thing") + " failed",
                      "what they say mended, run the command again: it adds only what is missing");
    }

    Context& mContext;
    const std::string mRoot;
    const FolderReader mReader;
    const std::uint64_t mFilesAtOnce;
    MediaFolder mFolder;
    IngestPlan mPlan;
    IngestCount mCount;
    std::vector<Failure> mFailures;
    std::string mSession;
    std::size_t mAdded = 0;
    std::size_t mUpdated = 0;
    std::size_t mPresent = 0;
    std::size_t mBins = 0;
    std::size_t mFailed = 0;
    std::size_t mLeftOut = 0;
    std::size_t mHandled = 0;
    std::size_t mRemaining = 0;
    std::size_t mTransactions = 0;
};

}  // namespace

void RunIngest(Context& ioContext) {
    Ingest(ioContext, *ioContext.Args().Positional(0)).Run();
}

}  // namespace zo
