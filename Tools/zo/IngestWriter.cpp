// Reads files, tells the hub where they lie, and sends what is to be known of them.
#include "IngestWriter.h"

#include <algorithm>
#include <map>
#include <set>

#include "MediaFiles.h"
#include "OrvaneXMP/PacketReader.h"
#include "ostcore/utility/StringConversion.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF16;
using ZOCL::ImmutableString;

/// Payloads that are held at a time; a bulk form of the library is half as large.
constexpr std::size_t kHeldBytes = std::size_t(64) << 20;
constexpr std::uint64_t kLargestSidecar = std::uint64_t(16) << 20;
constexpr std::size_t kRequestsAtOnce = 16;
constexpr std::size_t kClipsAtOnce = 8;

std::size_t BytesOf(const NewClip& inClip) {
    return (inClip.sidecar ? inClip.sidecar->size() : 0) + (inClip.rendition ? inClip.rendition->size() : 0);
}

// Another file may fare better.
bool IsOfOneFile(const Failure& inFailure) {
    return inFailure.Code() == ExitCode::Failure;
}

ZOCL::BulkNewAsset AssetOf(const NewClip& inClip) {
    ZOCL::BulkNewAsset asset;
    asset.properties = PropertiesOf(inClip);
    if (inClip.sidecar) {
        asset.enclosures.emplace(ZOCL::GetXMPEnclosureName(LocatorIDOf(inClip)), inClip.sidecar);
    }
    if (inClip.rendition) {
        asset.renditions.emplace(ImmutableString(inClip.renditionType), inClip.rendition);
    }
    return asset;
}

ZOCL::AssetBaseProperties BinOf(const std::string& inFolder, const BinIDs& inBins) {
    const std::size_t slash = inFolder.rfind('/');
    ZOCL::AssetBaseProperties bin;
    bin.name = ToUTF16(FileNameOf(inFolder));
    bin.assetType = ZOCL::kAssetType_Bin;
    bin.parent = inBins.at(slash == std::string::npos ? std::string() : inFolder.substr(0, slash));
    return bin;
}

std::string IDOf(const Outcome& inOutcome) {
    const auto asset = RFL::QueryInterface<ZOCL::IZOCAsset>(inOutcome.resource);
    return asset ? asset->GetAssetIdentifier().str() : std::string();
}

}  // namespace

Payload ReadSidecar(const FolderReader& inReader, const FolderFile& inFile) {
    const Payload bytes = inReader.Read(inFile.sidecar, kLargestSidecar);
    if (bytes->empty()) {
        return nullptr;
    }
    const OrvaneXMP::ReadResult packet = OrvaneXMP::ReadPacket(bytes->view());
    if (!packet) {
        throw Failure(ExitCode::Failure, inFile.sidecar + " is no XMP packet: " + packet.failure.Text(),
                      "mend it, then run the command again; the file itself comes without it");
    }
    return bytes;
}

IngestOutcome IngestWriter::Write(const std::vector<const PlannedFile*>& inFiles, BinIDs& ioBins) {
    MakeBins(inFiles, ioBins);
    mOutcome.files.resize(inFiles.size());
    std::vector<Prepared> held;
    std::size_t bytes = 0;
    for (std::size_t i = 0; i < inFiles.size(); ++i) {
        mContext.Loop().ThrowIfInterrupted();
        mOutcome.files[i].planned = inFiles[i];
        Prepared file;
        file.index = i;
        if (!Prepare(file, ioBins)) {
            continue;
        }
        bytes += BytesOf(file.clip);
        held.push_back(std::move(file));
        if (bytes >= kHeldBytes) {
            Send(held);
            bytes = 0;
        }
    }
    Send(held);
    return std::move(mOutcome);
}

// Level by level, since a bin must be known before what lies in it.
void IngestWriter::MakeBins(const std::vector<const PlannedFile*>& inFiles, BinIDs& ioBins) {
    std::map<std::size_t, std::set<std::string>> levels;
    for (const PlannedFile* planned : inFiles) {
        if (planned->task != FileTask::Add) {
            continue;
        }
        for (std::string at = planned->file.Folder(); !at.empty() && ioBins.count(at) == 0;) {
            const auto depth = static_cast<std::size_t>(std::count(at.begin(), at.end(), '/'));
            if (!levels[depth].insert(at).second) {
                break;
            }
            at.resize(depth == 0 ? 0 : at.rfind('/'));
        }
    }
    for (const auto& [depth, folders] : levels) {
        MakeBinsOfLevel({folders.begin(), folders.end()}, ioBins);
    }
}

void IngestWriter::MakeBinsOfLevel(const std::vector<std::string>& inFolders, BinIDs& ioBins) {
    const std::string what = "making the bins of the folders";
    BulkOutcome made;
    if (mWay == Way::Bulk) {
        std::vector<ZOCL::BulkNewAsset> bins(inFolders.size());
        for (std::size_t i = 0; i < inFolders.size(); ++i) {
            bins[i].properties = BinOf(inFolders[i], ioBins);
        }
        made = SendInBulk(mContext, mTransaction, what, bins, {});
    }
    for (std::size_t i = 0; i < inFolders.size(); ++i) {
        const std::string id =
            made.isOffered ? made.ids[i]
                           : IDOf(RunRequest(mContext, what,
                                             [&](const ZOCL::Guid& inRequest,
                                                 const ZOCL::RequestCompletion& inCompletion) {
                                                 return mTransaction.transaction->CreateNewAsset(
                                                     inRequest, inCompletion, BinOf(inFolders[i], ioBins));
                                             }));
        if (id.empty()) {
            throw Failure(ExitCode::Failure, what + ": the hub's answer is not what it should be");
        }
        ioBins.emplace(inFolders[i], ImmutableString(id));
        mOutcome.newBins.push_back({inFolders[i], id});
    }
}

// False when the file cannot be written; that is noted then.
bool IngestWriter::Prepare(Prepared& ioFile, const BinIDs& inBins) {
    FileOutcome& outcome = mOutcome.files[ioFile.index];
    const FolderFile& file = outcome.planned->file;
    ioFile.clip.path = file.path;
    try {
        if (IsNew(ioFile)) {
            ioFile.clip.parent = inBins.at(file.Folder());
            ReadMedia(ioFile);
        } else {
            outcome.locator = outcome.planned->locator.str();
        }
    } catch (const Failure& failure) {
        OnFailed(ioFile.index, failure);
        return false;
    }
    if (file.sidecar.empty()) {
        return true;
    }
    try {
        ioFile.clip.sidecar = ReadSidecar(mReader, file);
        outcome.hasSidecar = static_cast<bool>(ioFile.clip.sidecar);
        outcome.reason = outcome.hasSidecar ? outcome.reason : "its sidecar is empty";
    } catch (const Failure& failure) {
        OnFailed(ioFile.index, failure);
    }
    if (!IsNew(ioFile) && !outcome.hasFailed && !outcome.hasSidecar) {
        OnFailed(ioFile.index, Failure(ExitCode::Failure, file.sidecar + " is empty now"));
    }
    return IsNew(ioFile) || outcome.hasSidecar;
}

void IngestWriter::ReadMedia(Prepared& ioFile) {
    FileOutcome& outcome = mOutcome.files[ioFile.index];
    const FolderFile& file = outcome.planned->file;
    NewClip& clip = ioFile.clip;
    clip.name = file.Name();
    clip.document = mNames.DocumentOf(file.path);
    clip.contentState = IngestNames::ContentStateOf(mReader.Fingerprint(file.path));
    clip.href = mNames.HRefOf(file.path);
    outcome.locator = LocatorIDOf(clip).str();
    outcome.href = clip.href;
    if (file.renditionType.empty()) {
        return;
    }
    const Payload media = mReader.Read(file.path, kLargestRendition);
    if (!LooksLike(media->view(), file.renditionType)) {
        outcome.reason = "it is not what its extension says, and has no rendition";
        return;
    }
    clip.renditionType = outcome.renditionType = file.renditionType;
    clip.rendition = media;
}

void IngestWriter::Send(std::vector<Prepared>& ioFiles) {
    StoreLocators(ioFiles);
    if (!ioFiles.empty() && (mWay == Way::Single || !SendAll(ioFiles))) {
        mWay = Way::Single;
        SendOneByOne(ioFiles);
    }
    ioFiles.clear();
}

// Files whose locator the hub does not take are out.
void IngestWriter::StoreLocators(std::vector<Prepared>& ioFiles) {
    ForEach(ioFiles, kRequestsAtOnce, [this](const Prepared& inFile, const std::function<void()>& inEnded) {
        StoreLocator(inFile, inEnded);
    });
    ioFiles.erase(std::remove_if(ioFiles.begin(), ioFiles.end(),
                                 [this](const Prepared& inFile) {
                                     return mOutcome.files[inFile.index].locator.empty();
                                 }),
                  ioFiles.end());
}

void IngestWriter::StoreLocator(const Prepared& inFile, const std::function<void()>& inEnded) {
    if (!IsNew(inFile)) {
        Count(inFile);
        return inEnded();
    }
    const auto server = mContext.Server();
    const auto notStored = [this, &inFile](const Failure& inFailure) {
        mOutcome.files[inFile.index].locator.clear();
        OnFailed(inFile.index, inFailure);
    };
    ZOCL::InterfaceRef<ZOCL::IZOCMediaLocator> locator;
    try {
        locator = LocatorOf(server, inFile.clip);
    } catch (const Failure& failure) {
        notStored(failure);
        return inEnded();
    }
    mContext.Loop().Start(
        [locator](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return locator->Store(inRequest, inCompletion);
        },
        [server](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); },
        [this, &inFile, inEnded, notStored](const Outcome& inOutcome) {
            if (!inOutcome.Succeeded()) {
                notStored(Failure::OfRequest("adding " + inFile.clip.path + ", telling where the media lies",
                                             inOutcome.result, inOutcome.response));
            } else {
                Count(inFile);
            }
            inEnded();
        });
}

// False when changes are not taken in bulk.
bool IngestWriter::SendAll(const std::vector<Prepared>& inFiles) {
    std::vector<ZOCL::BulkNewAsset> assets;
    std::vector<EnclosureEdit> edits;
    for (const Prepared& file : inFiles) {
        const PlannedFile& planned = *mOutcome.files[file.index].planned;
        if (IsNew(file)) {
            assets.push_back(AssetOf(file.clip));
        } else {
            edits.push_back({planned.assetID, ZOCL::GetXMPEnclosureName(planned.locator), file.clip.sidecar});
        }
    }
    const BulkOutcome sent =
        SendInBulk(mContext, mTransaction, "sending " + std::to_string(inFiles.size()) + " files in bulk",
                   assets, edits);
    std::size_t asset = 0;
    for (const Prepared& file : inFiles) {
        if (sent.isOffered) {
            OnWritten(file, IsNew(file) ? sent.ids[asset++] : mOutcome.files[file.index].planned->assetID);
        }
    }
    return sent.isOffered;
}

void IngestWriter::SendOneByOne(const std::vector<Prepared>& inFiles) {
    for (const Prepared& file : inFiles) {
        if (!IsNew(file)) {
            WriteSidecar(file);
        }
    }
    ForEach(inFiles, kClipsAtOnce, [this](const Prepared& inFile, const std::function<void()>& inEnded) {
        return IsNew(inFile) ? SendClip(inFile, inEnded) : inEnded();
    });
}

void IngestWriter::SendClip(const Prepared& inFile, const std::function<void()>& inEnded) {
    std::make_shared<ClipOnItsWay>(
        mContext, mTransaction, inFile.clip,
        [this, &inFile, inEnded](const ClipOnItsWay& inClip, const Failure* inFailure) {
            if (inFailure) {
                OnFailed(inFile.index, *inFailure);
            } else {
                OnWritten(inFile, inClip.AssetID());
            }
            inEnded();
        })
        ->StartWithAsset();
}

void IngestWriter::WriteSidecar(const Prepared& inFile) {
    const PlannedFile& planned = *mOutcome.files[inFile.index].planned;
    try {
        const NamedAsset asset = LoadNamedAsset(mContext, mTransaction.view, planned.assetID);
        WriteAssetEnclosure(mContext, asset, ZOCL::GetXMPEnclosureName(planned.locator).str(),
                            inFile.clip.sidecar);
        OnWritten(inFile, planned.assetID);
    } catch (const Failure& failure) {
        if (!IsOfOneFile(failure)) {
            throw;
        }
        OnFailed(inFile.index, failure);
    }
}

// Runs a step for each file, so many at a time, and waits for all. A step calls the function that it is given
// when it has ended. After a failure that ends the transaction no further one is begun.
void IngestWriter::ForEach(const std::vector<Prepared>& inFiles, std::size_t inAtOnce,
                           const std::function<void(const Prepared&, const std::function<void()>&)>& inStep) {
    std::size_t next = 0;
    std::size_t underWay = 0;
    bool isStarting = false;
    // A step may end before it returns: then the loop that began it goes on.
    std::function<void()> startMore = [&] {
        if (isStarting) {
            return;
        }
        isStarting = true;
        while (next < inFiles.size() && underWay < inAtOnce && !mFatal) {
            ++underWay;
            inStep(inFiles[next++], [&] {
                --underWay;
                startMore();
            });
        }
        isStarting = false;
    };
    startMore();
    mContext.Loop().Wait();
    if (mFatal) {
        throw Failure(*mFatal);
    }
}

void IngestWriter::OnWritten(const Prepared& inFile, const std::string& inAssetID) {
    FileOutcome& outcome = mOutcome.files[inFile.index];
    outcome.isWritten = true;
    outcome.assetID = inAssetID;
    ++mOutcome.written;
}

void IngestWriter::OnFailed(std::size_t inIndex, const Failure& inFailure) {
    mOutcome.files[inIndex].reason = inFailure.what();
    mOutcome.files[inIndex].hasFailed = true;
    if (IsOfOneFile(inFailure)) {
        mOutcome.failures.push_back(inFailure);
    } else if (!mFatal) {
        mFatal = std::make_unique<Failure>(inFailure);
    }
}

void IngestWriter::Count(const Prepared& inFile) {
    mCount.bytes += BytesOf(inFile.clip);
    mContext.Out().Progress(inFile.clip.path, ++mCount.done, mCount.total, mCount.bytes);
}

}  // namespace zo
