// add: media files, with their sidecars and renditions, or bare assets become assets of the session.
#include <deque>

#include "Failure.h"
#include "MediaFiles.h"
#include "NewClip.h"
#include "ostcore/utility/StringConversion.h"
#include "Payloads.h"
#include "Verbs.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF16;
using ZOCL::ImmutableString;

constexpr std::size_t kFilesAtOnce = 8;

Json AddedJson(const MediaFile& inFile, const std::string& inID, const std::string& inLocator,
               const ImmutableString& inType) {
    Json json("added");
    json.Set("id", inID).Set("name", inFile.name).Set("assetType", inType);
    json.Set("path", inFile.path).Set("mediaLocator", inLocator).Set("mediaHref", inFile.href);
    json.Set("sidecar", inFile.sidecar).Set("rendition", inFile.renditionType);
    return json.Set("bytes", inFile.bytes);
}

std::string AddedLine(const MediaFile& inFile) {
    std::string with = inFile.sidecar.empty() ? "" : "sidecar";
    with += inFile.renditionType.empty() ? "" : (with.empty() ? "" : " and ") + std::string("rendition");
    return "added " + inFile.name + (with.empty() ? "" : " with its " + with);
}

NewClip ClipOf(const MediaFile& inFile, const ImmutableString& inParent) {
    NewClip clip;
    clip.path = inFile.path;
    clip.name = inFile.name;
    clip.document = ZOCL::Guid::CreateUnique();
    clip.contentState = ZOCL::Guid::CreateUnique();
    clip.href = inFile.href;
    clip.parent = inParent;
    clip.sidecar = inFile.sidecar.empty() ? nullptr : ReadPayload(inFile.sidecar);
    clip.renditionType = inFile.renditionType;
    clip.rendition = inFile.renditionType.empty() ? nullptr : ReadPayload(inFile.path);
    return clip;
}

// Several files at a time; after the first failure no further one is begun.
class FileAdder {
public:
    FileAdder(Context& ioContext, const OpenTransaction& inTransaction, const std::vector<MediaFile>& inFiles,
              const ImmutableString& inParent)
        : mContext(ioContext),
          mTransaction(inTransaction),
          mWaiting(inFiles.begin(), inFiles.end()),
          mParent(inParent),
          mTotal(inFiles.size()) {}

    Written Run() {
        StartMore();
        mContext.Loop().Wait();
        mContext.Out().EndProgress();
        if (mFailure) {
            throw Failure(*mFailure);
        }
        return mWritten;
    }

private:
    void StartMore() {
        while (!mWaiting.empty() && !mFailure && mUnderWay < kFilesAtOnce) {
            const MediaFile file = std::move(mWaiting.front());
            mWaiting.pop_front();
            try {
                StartOne(file);
            } catch (const Failure& failure) {
                mFailure = std::make_unique<Failure>(failure);
            }
        }
    }

    void StartOne(const MediaFile& inFile) {
        const auto one = std::make_shared<ClipOnItsWay>(
            mContext, mTransaction, ClipOf(inFile, mParent),
            [this, inFile](const ClipOnItsWay& inClip, const Failure* inFailure) {
                OnDone(inFile, inClip, inFailure);
            });
        ++mUnderWay;
        one->Start();
    }

    void OnDone(const MediaFile& inFile, const ClipOnItsWay& inClip, const Failure* inFailure) {
        --mUnderWay;
        if (inFailure) {
            mFailure = mFailure ? std::move(mFailure) : std::make_unique<Failure>(*inFailure);
            return;
        }
        mWritten.Add(AddedJson(inFile, inClip.AssetID(), LocatorIDOf(inClip.Clip()).str(),
                               ZOCL::kAssetType_MasterClip),
                     AddedLine(inFile));
        mBytes += inFile.bytes;
        mContext.Out().Progress(inFile.name, ++mDone, mTotal, mBytes);
        StartMore();
    }

    Context& mContext;
    const OpenTransaction mTransaction;
    std::deque<MediaFile> mWaiting;
    const ImmutableString mParent;
    const std::size_t mTotal;
    std::size_t mUnderWay = 0;
    std::size_t mDone = 0;
    std::uint64_t mBytes = 0;
    Written mWritten;
    std::unique_ptr<Failure> mFailure;
};

ImmutableString ParentIn(Context& ioContext, const LoadedProduction& inView) {
    const auto parent = ioContext.Args().Value("parent");
    return parent ? LoadNamedAsset(ioContext, inView, *parent).item.assetIdentifier : ImmutableString();
}

// An asset without media, such as a bin.
Written AddBare(Context& ioContext, const LoadedProduction& inView, const OpenTransaction* inTransaction) {
    const Arguments& args = ioContext.Args();
    MediaFile none;
    none.name = *args.Value("name");
    ZOCL::AssetBaseProperties properties;
    properties.name = ToUTF16(none.name);
    properties.assetType = ImmutableString(args.ValueOr("type", ZOCL::kAssetType_Bin.str()));
    properties.parent = ParentIn(ioContext, inView);
    std::string id;
    if (inTransaction) {
        const Outcome outcome = RunRequest(
            ioContext, "adding " + none.name,
            [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                return inTransaction->transaction->CreateNewAsset(inRequest, inCompletion, properties);
            });
        const auto asset = RFL::QueryInterface<ZOCL::IZOCAsset>(outcome.resource);
        id = asset ? asset->GetAssetIdentifier().str() : std::string();
    }
    Written written;
    written.Add(AddedJson(none, id, "", properties.assetType),
                "added " + none.name + " (" + properties.assetType.str() + ")");
    return written;
}

Written WouldAdd(const std::vector<MediaFile>& inFiles) {
    Written written;
    for (const MediaFile& file : inFiles) {
        written.Add(AddedJson(file, "", "", ZOCL::kAssetType_MasterClip), AddedLine(file));
    }
    return written;
}

void AddBareAsset(Context& ioContext) {
    if (ioContext.Args().Has("dry-run")) {
        return TellDryRun(ioContext, AddBare(ioContext, LoadForReading(ioContext), nullptr));
    }
    WritePlan plan;
    plan.message = "Added " + *ioContext.Args().Value("name");
    Write(ioContext, plan, [&](const WorkSession&, const OpenTransaction& inTransaction) {
        return AddBare(ioContext, inTransaction.view, &inTransaction);
    });
}

}  // namespace

void RunAdd(Context& ioContext) {
    const Arguments& args = ioContext.Args();
    const std::vector<std::string> paths = args.PositionalsFrom(0);
    if (paths.empty() != args.Has("name")) {
        throw Failure(ExitCode::Usage, "add takes either media files or --name",
                      "for instance: zo add shot1.mp4 shot2.mp4, or zo add --name 'Day 1' --type bin");
    }
    if (paths.empty()) {
        return AddBareAsset(ioContext);
    }
    if (args.Has("type")) {
        throw Failure(ExitCode::Usage, "--type goes with --name; media files become master clips");
    }
    const std::vector<MediaFile> files = LookAtMediaFiles(paths, args.ValueOr("mount", ""));
    if (args.Has("dry-run")) {
        ParentIn(ioContext, LoadForReading(ioContext));
        return TellDryRun(ioContext, WouldAdd(files));
    }
    WritePlan plan;
    plan.type = ZOCL::kTransactionType_Ingest;
    plan.message =
        "Added " + (files.size() == 1 ? files.front().name : std::to_string(files.size()) + " files");
    Write(ioContext, plan, [&](const WorkSession&, const OpenTransaction& inTransaction) {
        return FileAdder(ioContext, inTransaction, files, ParentIn(ioContext, inTransaction.view)).Run();
    });
}

}  // namespace zo
