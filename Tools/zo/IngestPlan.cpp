// Finds the files of a folder among the assets of a production.
#include "IngestPlan.h"

#include <algorithm>
#include <boost/uuid/name_generator_sha1.hpp>
#include <boost/uuid/uuid.hpp>
#include <tuple>

#include "Failure.h"
#include "MediaFiles.h"
#include "ostcore/utility/StringConversion.h"

namespace zo {
namespace {

using ZOCL::ImmutableString;
using ZOCL::InterfaceRef;

/// So many assets at a time are looked into, and so many packets fetched.
constexpr std::size_t kAssetsAtOnce = 500;
constexpr std::size_t kPacketsAtOnce = 16;
/// The length of a document in the text of a locator.
constexpr std::size_t kDocumentLength = 36;

// A name-based identifier (RFC 4122, version 5).
ZOCL::Guid GuidOf(const std::string& inText) {
    // Of this program's own, so that nobody else's names are the same.
    static const boost::uuids::uuid kSpace = {
        {0x5b, 0x1f, 0x7c, 0x0e, 0x2d, 0x64, 0x4a, 0x9b, 0x9c, 0x11, 0x86, 0x3e, 0xf0, 0x57, 0xd2, 0xa8}};
    const boost::uuids::uuid id = boost::uuids::name_generator_sha1(kSpace)(inText);
    std::uint64_t halves[2] = {0, 0};
    for (std::size_t i = 0; i < id.size(); ++i) {
        halves[i / 8] = halves[i / 8] << 8 | id.data[i];
    }
    return ZOCL::Guid(halves[0], halves[1]);
}

class Planner {
public:
    Planner(Context& ioContext, const LoadedProduction& inView, const FolderReader& inReader,
            const IngestNames& inNames)
        : mContext(ioContext),
          mReader(inReader),
          mNames(inNames),
          mList(LoadAssetList(ioContext, inView)),
          mItems(mList->GetAllItems()) {
        for (std::size_t i = 0; i < mItems.size(); ++i) {
            const AssetItem& item = mItems[i];
            const std::string name = ostcore::utility::ToUTF8(item.name);
            mByPlace.emplace(Place{item.parentIdentifier, name, item.assetType == ZOCL::kAssetType_Bin}, i);
            mByDocument.emplace(item.mediaLocatorIdentifier.str().substr(0, kDocumentLength), i);
        }
        mIsTaken.resize(mItems.size());
    }

    IngestPlan Plan(const MediaFolder& inFolder, const ImmutableString& inParent, Sidecars inSidecars) {
        mPlan.bins.emplace("", inParent);
        for (const std::string& folder : inFolder.folders) {
            FindBin(folder);
        }
        for (const FolderFile& file : inFolder.files) {
            mPlan.files.push_back({file});
            FindByDocument(mPlan.files.back());
        }
        for (PlannedFile& planned : mPlan.files) {
            if (planned.assetID.empty()) {
                FindByPlace(planned);
            }
        }
        CompareSidecars(inSidecars);
        return std::move(mPlan);
    }

private:
    struct Place {
        ImmutableString bin;
        std::string name;
        bool isBin;

        friend bool operator<(const Place& inLeft, const Place& inRight) {
            return std::tie(inLeft.isBin, inLeft.name, inLeft.bin) <
                   std::tie(inRight.isBin, inRight.name, inRight.bin);
        }
    };

    void FindBin(const std::string& inFolder) {
        const std::size_t slash = inFolder.rfind('/');
        const bool isTop = slash == std::string::npos;
        const auto parent = mPlan.bins.find(isTop ? std::string() : inFolder.substr(0, slash));
        const auto found = parent == mPlan.bins.end()
                               ? mByPlace.end()
                               : mByPlace.find({parent->second, FileNameOf(inFolder), true});
        if (found == mByPlace.end()) {
            mPlan.newFolders.push_back(inFolder);
        } else {
            mPlan.bins.emplace(inFolder, mItems[found->second].assetIdentifier);
        }
    }

    void Take(PlannedFile& ioPlanned, std::size_t inItem) {
        mIsTaken[inItem] = true;
        ioPlanned.task = FileTask::Nothing;
        ioPlanned.assetID = mItems[inItem].assetIdentifier.str();
        ioPlanned.locator = mItems[inItem].mediaLocatorIdentifier;
        if (ioPlanned.file.sidecarBytes > 0 && !ioPlanned.locator.empty()) {
            mToCompare.push_back({&ioPlanned - mPlan.files.data(), inItem});
        }
    }

    void FindByDocument(PlannedFile& ioPlanned) {
        const auto found = mByDocument.find(mNames.DocumentOf(ioPlanned.file.path).ToString());
        if (found != mByDocument.end()) {
            Take(ioPlanned, found->second);
        }
    }

    void FindByPlace(PlannedFile& ioPlanned) {
        const auto bin = mPlan.bins.find(ioPlanned.file.Folder());
        if (bin == mPlan.bins.end()) {
            return;
        }
        const auto found = mByPlace.find({bin->second, ioPlanned.file.Name(), false});
        if (found != mByPlace.end() && !mIsTaken[found->second]) {
            Take(ioPlanned, found->second);
        }
    }

    void CompareSidecars(Sidecars inSidecars) {
        for (std::size_t begin = 0; begin < mToCompare.size(); begin += kAssetsAtOnce) {
            const std::size_t end = std::min(begin + kAssetsAtOnce, mToCompare.size());
            std::vector<AssetItem> items;
            for (std::size_t i = begin; i < end; ++i) {
                items.push_back(mItems[mToCompare[i].item]);
            }
            const std::vector<AssetDetails> details = LoadDetails(mContext, mList, items, Locators::Leave);
            std::vector<Packet> packets;
            for (std::size_t i = begin; i < end; ++i) {
                PlannedFile& planned = mPlan.files[static_cast<std::size_t>(mToCompare[i].file)];
                const auto enclosures = details[i - begin].enclosures;
                const auto packet = enclosures
                                        ? enclosures->GetEnclosure(ZOCL::GetXMPEnclosureName(planned.locator))
                                        : nullptr;
                if (!packet) {
                    planned.task = FileTask::AddSidecar;
                } else if (inSidecars == Sidecars::ReplaceChanged) {
                    packets.push_back({&planned, packet});
                }
            }
            ComparePackets(packets);
        }
    }

    struct Packet {
        PlannedFile* planned;
        InterfaceRef<ZOCL::IZOCEnclosure> enclosure;
    };

    void ComparePackets(const std::vector<Packet>& inPackets) {
        for (std::size_t begin = 0; begin < inPackets.size(); begin += kPacketsAtOnce) {
            const std::size_t end = std::min(begin + kPacketsAtOnce, inPackets.size());
            for (std::size_t i = begin; i < end; ++i) {
                LoadPacket(inPackets[i]);
            }
            mContext.Loop().Wait();
            if (mFailure) {
                throw Failure(*mFailure);
            }
            for (std::size_t i = begin; i < end; ++i) {
                if (Differs(inPackets[i])) {
                    inPackets[i].planned->task = FileTask::ReplaceSidecar;
                }
            }
        }
    }

    void LoadPacket(const Packet& inPacket) {
        const auto server = mContext.Server();
        const auto enclosure = inPacket.enclosure;
        mContext.Loop().Start(
            [enclosure](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                return enclosure->LoadEnclosureData(inRequest, inCompletion);
            },
            [server](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); },
            [this, path = inPacket.planned->file.path](const Outcome& inOutcome) {
                if (!inOutcome.Succeeded() && !mFailure) {
                    mFailure = Failure::OfRequest("fetching the XMP packet of " + path, inOutcome.result,
                                                  inOutcome.response);
                }
            });
    }

    // A sidecar that cannot be read counts as another one: whoever writes it meets, and tells, the reason.
    bool Differs(const Packet& inPacket) const {
        const auto bytes = inPacket.enclosure->GetEnclosurePayload();
        const FolderFile& file = inPacket.planned->file;
        if (!bytes || bytes->size() != file.sidecarBytes) {
            return true;
        }
        try {
            return mReader.Read(file.sidecar, file.sidecarBytes)->view() != bytes->view();
        } catch (const Failure&) {
            return true;
        }
    }

    struct Compared {
        std::ptrdiff_t file;
        std::size_t item;
    };

    Context& mContext;
    const FolderReader& mReader;
    const IngestNames& mNames;
    const InterfaceRef<ZOCL::IZOCAssetList> mList;
    const std::vector<AssetItem> mItems;
    std::map<Place, std::size_t> mByPlace;
    std::map<std::string, std::size_t> mByDocument;
    std::vector<bool> mIsTaken;
    std::vector<Compared> mToCompare;
    std::optional<Failure> mFailure;
    IngestPlan mPlan;
};

}  // namespace

IngestNames::IngestNames(const std::string& inProductionID, const std::string& inUser, std::string inLabel)
    : mLabel(std::move(inLabel)), mSeed(inProductionID + "\n" + inUser + "\n" + mLabel + "\n") {}

ZOCL::Guid IngestNames::DocumentOf(const std::string& inPath) const {
    return GuidOf(mSeed + inPath);
}

ZOCL::Guid IngestNames::ContentStateOf(const std::string& inFingerprint) {
    return GuidOf(inFingerprint);
}

std::string IngestNames::HRefOf(const std::string& inPath) const {
    return MediaHRef(mLabel, inPath);
}

IngestPlan PlanIngest(Context& ioContext, const LoadedProduction& inView, const MediaFolder& inFolder,
                      const FolderReader& inReader, const IngestNames& inNames,
                      const ImmutableString& inParent, Sidecars inSidecars) {
    return Planner(ioContext, inView, inReader, inNames).Plan(inFolder, inParent, inSidecars);
}

}  // namespace zo
