// Turns a folder of media with XMP sidecars into a production.
//
// Identifiers are made from the production and the file's path, so a second import finds its own assets
// again. What a file was when it was imported stands in the asset's properties under kSourceKey; a file that
// still is that is left alone, whatever people did with the asset since.
#include "Commands/Importer.h"

#include <algorithm>
#include <map>

#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Text.h"

namespace zohub {

namespace fs = std::filesystem;

namespace {

constexpr char kSourceKey[] = "zohub:source";
constexpr std::size_t kSourceDigits = 24;
constexpr std::uint64_t kMaxSidecar = 16ull << 20;
constexpr std::size_t kBatchBytes = 32u << 20;
constexpr std::size_t kBatchCount = 500;
constexpr char kXmpType[] = "application/rdf+xml";

bool HasMagic(std::string const& inBytes, std::string const& inType) {
    std::string_view const bytes = inBytes;
    if (inType == "image/jpeg")
        return bytes.substr(0, 3) == "\xFF\xD8\xFF";
    if (inType == "image/png")
        return bytes.substr(0, 8) == "\x89PNG\r\n\x1A\n";
    return bytes.size() > 8 && bytes.substr(4, 4) == "ftyp";
}

std::string MountLabel(ImportRequest const& inRequest) {
    std::string const source = inRequest.mount.empty()
                                   ? fs::absolute(inRequest.directory).lexically_normal().parent_path() ==
                                             fs::absolute(inRequest.directory).lexically_normal()
                                         ? std::string("root")
                                         : fs::weakly_canonical(inRequest.directory).filename().string()
                                   : inRequest.mount;
    std::string label;
    for (char c : ToLower(source))
        label += (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') ? c : '-';
    while (!label.empty() && label.front() == '-')
        label.erase(0, 1);
    // Locations of that form mean the machine of whoever reads them, and are not for a server.
    if (label.empty() || label.rfind("localhost", 0) == 0)
        label = "media" + (label.empty() ? label : "-" + label);
    return label.substr(0, 63);
}

// Payloads that wait to be written together.
class ContentBatch {
public:
    explicit ContentBatch(Storage& inStorage) : mStorage(inStorage) {}

    std::string Add(std::string inBytes) {
        std::string hash = Sha256Hex(inBytes);
        mBytes += inBytes.size();
        mWaiting.emplace(hash, std::move(inBytes));
        if (mBytes > kBatchBytes || mWaiting.size() >= kBatchCount)
            Flush();
        return hash;
    }

    void Flush() {
        if (mWaiting.empty())
            return;
        auto const transaction = mStorage.BeginWrite();
        for (auto const& [hash, bytes] : mWaiting)
            transaction->AddContent(hash, bytes);
        transaction->Commit();
        mWaiting.clear();
        mBytes = 0;
    }

private:
    Storage& mStorage;
    std::map<std::string, std::string> mWaiting;
    std::size_t mBytes = 0;
};

// The assets that the production has, by identifier, as far as the import asks for them.
using Present = std::map<std::string, AssetState>;

class ImportRun {
public:
    ImportRun(Storage& inStorage, ImportRequest const& inRequest, Micros inNow)
        : mStorage(inStorage),
          mRequest(inRequest),
          mNow(inNow),
          mBatch(inStorage),
          mLabel(MountLabel(inRequest)) {}

    ImportReport Run(std::function<void(std::size_t, std::size_t)> const& inProgress) {
        LoadPresent();
        MediaFolder const folder = ScanMediaFolder(mRequest.directory);
        mReport.notes = folder.notes;
        for (auto const& path : folder.folders)
            TakeFolder(path);
        std::size_t done = 0;
        for (auto const& file : folder.files) {
            TakeFile(file);
            inProgress(++done, folder.files.size());
        }
        mBatch.Flush();
        Publish();
        return mReport;
    }

private:
    void LoadPresent() {
        auto const transaction = mStorage.BeginRead();
        for (auto const& name : {mRequest.owner})
            RequireUser(*transaction, name);
        for (auto const& name : mRequest.grants)
            RequireUser(*transaction, name);
        auto const line = FindLineByName(*transaction, Kind(), mRequest.production, mRequest.owner);
        if (!line) {
            mReport.isNewProduction = true;
            mSeed = NewKey(kLongKey);
            return;
        }
        mReport.productionId = line->id;
        Repository repository(*transaction);
        View const view = repository.Open(line->id, "", {mRequest.owner, true});
        mHead = view.commit.id;
        mSeed = SeedOf(view.tree);
        for (auto const& [id, hash] : AssetMap(*transaction, view.tree.assets).All())
            mPresent.emplace(id, repository.LoadAsset(hash));
    }

    static void RequireUser(Transaction& inTransaction, std::string const& inName) {
        if (!inTransaction.FindUser(inName))
            throw std::runtime_error("there is no user " + inName + "; add him with zohub user add");
    }

    // Copies of a production keep the identifiers of its assets, so the seed travels in the properties.
    std::string SeedOf(TreeRoot const& inTree) const {
        Json const properties = Json::parse(inTree.properties);
        std::string const seed = StringUnder(properties, kSourceKey);
        return seed.empty() ? mReport.productionId : seed;
    }

    std::string Kind() const { return mRequest.isTemplate ? kLineTemplate : kLineProduction; }
    std::string IdFor(std::string_view inWhat, std::string const& inPath) const {
        return KeyFromText(mSeed + "\n" + std::string(inWhat) + "\n" + inPath, kLongKey);
    }
    std::string BinId(std::string const& inFolder) const {
        return inFolder.empty() ? std::string() : IdFor("bin", inFolder);
    }

    void TakeFolder(std::string const& inPath) {
        std::string const id = BinId(inPath);
        if (mPresent.count(id)) {
            ++mReport.unchanged;
            return;
        }
        std::size_t const slash = inPath.rfind('/');
        Json properties = Json::object();
        properties["name"] = slash == std::string::npos ? inPath : inPath.substr(slash + 1);
        properties["description"] = "";
        std::string const parent =
            BinId(slash == std::string::npos ? std::string() : inPath.substr(0, slash));
        if (!parent.empty())
            properties["zo:parent"] = parent;
        properties["cdzo:assetType"] = "bin";
        properties[kSourceKey] = {{"path", inPath}};
        AssetState bin;
        bin.id = id;
        SetAssetProperties(bin, properties);
        mStates.push_back(std::move(bin));
        ++mReport.added;
    }

    void TakeFile(MediaFile const& inFile) {
        auto const fingerprint = FingerprintBelow(mRequest.directory, inFile.path, mRequest.maxRendition);
        if (!fingerprint) {
            mReport.notes.push_back(inFile.path + " cannot be read");
            return;
        }
        std::optional<std::string> sidecar;
        if (!inFile.sidecar.empty()) {
            sidecar = ReadBelow(mRequest.directory, inFile.sidecar, kMaxSidecar);
            if (!sidecar)
                mReport.notes.push_back(inFile.sidecar + " cannot be read or is too large");
        }
        Json const source = {
            {"path", inFile.path},
            {"media", fingerprint->substr(0, kSourceDigits)},
            {"sidecar", sidecar ? Sha256Hex(*sidecar).substr(0, kSourceDigits) : std::string()}};
        AssetState asset;
        auto const present = mPresent.find(IdFor("asset", inFile.path));
        bool const isNew = present == mPresent.end();
        Json before;
        if (!isNew) {
            asset = present->second;
            Json const properties = Json::parse(asset.properties);
            if (properties.contains(kSourceKey))
                before = properties[kSourceKey];
            if (before == source) {
                ++mReport.unchanged;
                return;
            }
        }
        asset.id = IdFor("asset", inFile.path);
        std::string const oldLocator = asset.locator;
        Json const old = before.is_object() ? before : Json::object();
        SetProperties(asset, inFile, *fingerprint, source, isNew);
        if (StringUnder(old, "media") != source["media"].get<std::string>())
            SetRendition(asset, inFile);
        SetSidecar(asset, oldLocator, sidecar,
                   StringUnder(old, "sidecar") != source["sidecar"].get<std::string>());
        mStates.push_back(std::move(asset));
        ++(isNew ? mReport.added : mReport.changed);
    }

    void SetProperties(AssetState& ioAsset, MediaFile const& inFile, std::string const& inFingerprint,
                       Json const& inSource, bool inIsNew) {
        LocatorRecord locator;
        std::string const documentId = GuidFromText(mSeed + "\n" + inFile.path);
        std::string const contentStateId = GuidFromText(inFingerprint);
        locator.id = documentId + "-" + contentStateId;
        Json const locatorProperties = {
            {"href", "zomedia://" + mLabel + "/" + PercentEncode(inFile.path, "/")},
            {"docId", documentId},
            {"contentStateId", contentStateId},
            {"displayName", inFile.name}};
        locator.properties = JsonText(locatorProperties);
        locator.owner = mRequest.owner;
        locator.created = locator.modified = mNow;
        Json properties = inIsNew ? Json::object() : Json::parse(ioAsset.properties);
        if (inIsNew) {
            properties["name"] = inFile.name;
            properties["description"] = "";
        }
        properties["mediaLocator"] = locator.id;
        if (inIsNew) {
            if (!inFile.folder.empty())
                properties["zo:parent"] = BinId(inFile.folder);
            properties["cdzo:assetType"] = "masterclip";
        }
        properties[kSourceKey] = inSource;
        SetAssetProperties(ioAsset, properties);
        mLocators.push_back(std::move(locator));
    }

    void SetRendition(AssetState& ioAsset, MediaFile const& inFile) {
        if (inFile.renditionType.empty())
            return;
        if (inFile.size > mRequest.maxRendition) {
            mReport.notes.push_back(inFile.path + " is too large to be its own rendition");
            return;
        }
        auto bytes = ReadBelow(mRequest.directory, inFile.path, mRequest.maxRendition);
        if (!bytes || !HasMagic(*bytes, inFile.renditionType)) {
            mReport.notes.push_back(inFile.path + " is not what its extension says; it gets no rendition");
            return;
        }
        RenditionState* rendition = nullptr;
        for (auto& other : ioAsset.renditions)
            if (other.type == inFile.renditionType)
                rendition = &other;
        if (!rendition) {
            ioAsset.renditions.push_back({NewKey(kShortKey), inFile.renditionType, "", 0});
            rendition = &ioAsset.renditions.back();
        }
        rendition->size = bytes->size();
        rendition->content = mBatch.Add(std::move(*bytes));
    }

    // The enclosure is named after the locator; when that changes, it takes the new name.
    void SetSidecar(AssetState& ioAsset, std::string const& inOldLocator,
                    std::optional<std::string>& ioSidecar, bool inIsNews) {
        EnclosureState* enclosure = nullptr;
        for (auto& other : ioAsset.enclosures)
            if (other.name == inOldLocator + "_xmp" || other.name == ioAsset.locator + "_xmp")
                enclosure = &other;
        if (enclosure)
            enclosure->name = ioAsset.locator + "_xmp";
        if (!ioSidecar || !inIsNews)
            return;
        if (!enclosure) {
            ioAsset.enclosures.push_back({NewKey(kShortKey), ioAsset.locator + "_xmp", kXmpType, "", 0});
            enclosure = &ioAsset.enclosures.back();
        }
        enclosure->size = ioSidecar->size();
        enclosure->content = mBatch.Add(std::move(*ioSidecar));
    }

    void Publish() {
        auto const transaction = mStorage.BeginWrite();
        Repository repository(*transaction);
        Actor const owner{mRequest.owner, true};
        if (mReport.isNewProduction) {
            if (FindLineByName(*transaction, Kind(), mRequest.production, mRequest.owner))
                throw std::runtime_error(
                    "a production of that name was made meanwhile; start the import again");
            TreeRoot tree;
            Json const properties = {{"name", mRequest.production}, {"description", ""}, {kSourceKey, mSeed}};
            tree.properties = JsonText(properties);
            mReport.productionId =
                repository.CreateLine(Kind(), tree, "Created " + mRequest.production, owner, false, mNow).id;
        }
        View view = repository.Open(mReport.productionId, "", owner);
        if (!mReport.isNewProduction && view.commit.id != mHead)
            throw std::runtime_error("the production was changed during the import; start it again");
        // A locator of the same file may belong to somebody already whose production this one is a copy of.
        for (auto const& locator : mLocators)
            if (!transaction->FindLocator(locator.id))
                transaction->PutLocator(locator);
        Repository::Edit edit;
        for (auto const& state : mStates)
            edit.assets[state.id] = repository.AddAsset(view.line.production, state);
        if (!edit.assets.empty())
            repository.CommitEdit(view, edit, "Imported " + std::to_string(edit.assets.size()) + " items",
                                  owner, mNow);
        for (auto const& user : mRequest.grants)
            transaction->Grant(view.line.production, user);
        transaction->Commit();
        mReport.commitId = view.commit.id;
    }

    Storage& mStorage;
    ImportRequest const& mRequest;
    Micros const mNow;
    ContentBatch mBatch;
    std::string const mLabel;
    std::string mSeed;
    std::string mHead;
    Present mPresent;
    std::vector<AssetState> mStates;
    std::vector<LocatorRecord> mLocators;
    ImportReport mReport;
};

}  // namespace

std::optional<LineRecord> FindLineByName(Transaction& inTransaction, std::string const& inKind,
                                         std::string const& inName, std::string const& inOwner) {
    Repository repository(inTransaction);
    std::optional<LineRecord> found;
    for (auto const& line : inTransaction.ListLines(inKind)) {
        if (!inOwner.empty() && line.owner != inOwner)
            continue;
        auto const commit = inTransaction.FindCommit(line.headCommit);
        if (!commit)
            continue;
        Json const properties = Json::parse(repository.LoadTree(commit->tree).properties);
        if (StringUnder(properties, "name") != inName)
            continue;
        if (found)
            throw std::runtime_error("there are several productions named " + inName + "; rename one first");
        found = line;
    }
    return found;
}

ImportReport Import(Storage& inStorage, ImportRequest const& inRequest, Micros inNow,
                    std::function<void(std::size_t, std::size_t)> const& inProgress) {
    return ImportRun(inStorage, inRequest, inNow).Run(inProgress);
}

}  // namespace zohub
