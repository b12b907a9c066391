// add: media files, with their sidecars and renditions, or bare assets become assets of the session.
#include <deque>

#include "Failure.h"
#include "MediaFiles.h"
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

// One file on its way: locator, asset, sidecar and rendition, one request after the other. All on the main
// thread.
class FileOnItsWay : public std::enable_shared_from_this<FileOnItsWay> {
public:
    using Done = std::function<void(const FileOnItsWay&, const Failure*)>;

    FileOnItsWay(Context& ioContext, const OpenTransaction& inTransaction, MediaFile inFile,
                 ImmutableString inParent, Done inDone)
        : mContext(ioContext),
          mServer(ioContext.Server()),
          mTransaction(inTransaction),
          mFile(std::move(inFile)),
          mParent(std::move(inParent)),
          mDone(std::move(inDone)) {}

    const MediaFile& File() const { return mFile; }
    Json Record() const {
        return AddedJson(mFile, mAssetID, mLocator->GetID().str(), ZOCL::kAssetType_MasterClip);
    }

    /// Ends with one call of the function, also when nothing could be started.
    void Start() {
        const ZOCL::Guid document = ZOCL::Guid::CreateUnique();
        const ZOCL::Guid content = ZOCL::Guid::CreateUnique();
        mLocator = mServer->GetMediaLocator(ZOCL::IZOCMediaLocator::CreateMediaLocatorID(document, content));
        if (!mLocator) {
            return Fail(Failure(ExitCode::Failure, What() + ": the hub keeps no media locators"));
        }
        mLocator->SetDocumentIDAndContentState(document, content);
        mLocator->SetMediaHRef(ImmutableString(mFile.href));
        mLocator->SetDisplayName(ImmutableString(mFile.name));
        Step(
            "telling where the media lies",
            [this](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                return mLocator->Store(inRequest, inCompletion);
            },
            &FileOnItsWay::OnLocatorStored);
    }

private:
    using Next = void (FileOnItsWay::*)(const Outcome&);

    std::string What() const { return "adding " + mFile.path; }

    void Step(const char* inWhat, const StartFunction& inStart, Next inNext) {
        const auto self = shared_from_this();
        const auto server = mServer;
        mContext.Loop().Start(
            inStart, [server](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); },
            [self, inWhat, inNext](const Outcome& inOutcome) {
                self->OnStepDone(inWhat, inNext, inOutcome);
            });
    }

    void OnStepDone(const char* inWhat, Next inNext, const Outcome& inOutcome) {
        if (!inOutcome.Succeeded()) {
            return Fail(Failure::OfRequest(What() + ", " + inWhat, inOutcome.result, inOutcome.response));
        }
        try {
            (this->*inNext)(inOutcome);
        } catch (const Failure& failure) {
            Fail(failure);
        } catch (const std::exception& error) {
            Fail(Failure(ExitCode::Failure, What() + ": " + error.what()));
        }
    }

    void OnLocatorStored(const Outcome&) {
        ZOCL::AssetBaseProperties properties;
        properties.name = ToUTF16(mFile.name);
        properties.assetType = ZOCL::kAssetType_MasterClip;
        properties.mediaLocator = mLocator->GetID();
        properties.parent = mParent;
        Step(
            "making the asset",
            [this, properties](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                return mTransaction.transaction->CreateNewAsset(inRequest, inCompletion, properties);
            },
            &FileOnItsWay::OnAssetMade);
    }

    void OnAssetMade(const Outcome& inOutcome) {
        const auto asset = RFL::QueryInterface<ZOCL::IZOCAsset>(inOutcome.resource);
        mWritable = RFL::QueryInterface<ZOCL::IZOCWritableAsset>(inOutcome.resource);
        if (!asset || !mWritable) {
            return Fail(Failure(ExitCode::Failure, What() + ": the hub's answer is not what it should be"));
        }
        mAssetID = asset->GetAssetIdentifier().str();
        if (mFile.sidecar.empty()) {
            return OnSidecarWritten(inOutcome);
        }
        const Payload sidecar = ReadPayload(mFile.sidecar);
        const ImmutableString name = ZOCL::GetXMPEnclosureName(mLocator->GetID());
        Step(
            "writing its sidecar",
            [this, sidecar, name](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                return ZOCL::CreateEnclosure(inRequest, mWritable->GetEnclosureFactoryURL(), mServer, name,
                                             sidecar, inCompletion);
            },
            &FileOnItsWay::OnSidecarWritten);
    }

    void OnSidecarWritten(const Outcome& inOutcome) {
        if (mFile.renditionType.empty()) {
            return OnRenditionWritten(inOutcome);
        }
        const Payload bytes = ReadPayload(mFile.path);
        Step(
            "writing its rendition",
            [this, bytes](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                return ZOCL::IZOCWritableRenditions::CreateRendition(
                    mServer, mWritable->GetRenditionFactoryURL(), ImmutableString(mFile.renditionType), bytes,
                    inRequest, inCompletion);
            },
            &FileOnItsWay::OnRenditionWritten);
    }

    void OnRenditionWritten(const Outcome&) { mDone(*this, nullptr); }
    void Fail(const Failure& inFailure) { mDone(*this, &inFailure); }

    Context& mContext;
    const ZOCL::InterfaceRef<ZOCL::IZOCDataServer> mServer;
    const OpenTransaction mTransaction;
    const MediaFile mFile;
    const ImmutableString mParent;
    const Done mDone;
    ZOCL::InterfaceRef<ZOCL::IZOCMediaLocator> mLocator;
    ZOCL::InterfaceRef<ZOCL::IZOCWritableAsset> mWritable;
    std::string mAssetID;
};

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
            MediaFile file = std::move(mWaiting.front());
            mWaiting.pop_front();
            ++mUnderWay;
            const auto one = std::make_shared<FileOnItsWay>(
                mContext, mTransaction, std::move(file), mParent,
                [this](const FileOnItsWay& inFile, const Failure* inFailure) { OnDone(inFile, inFailure); });
            one->Start();
        }
    }

    void OnDone(const FileOnItsWay& inFile, const Failure* inFailure) {
        --mUnderWay;
        if (inFailure) {
            mFailure = mFailure ? std::move(mFailure) : std::make_unique<Failure>(*inFailure);
            return;
        }
        mWritten.Add(inFile.Record(), AddedLine(inFile.File()));
        mBytes += inFile.File().bytes;
        mContext.Out().Progress(inFile.File().name, ++mDone, mTotal, mBytes);
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
