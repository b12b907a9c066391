// get: enclosures and renditions become files, byte for byte.
#include <sys/stat.h>

#include <deque>
#include <filesystem>

#include "Assets.h"
#include "Failure.h"
#include "FileNames.h"
#include "FileWriter.h"
#include "ostcore/utility/StringConversion.h"
#include "Sessions.h"
#include "Verbs.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF8;
using Bytes = boost::shared_ptr<ostcore::utility::RecycledMemory const>;

constexpr std::size_t kFetchesAtOnce = 8;

// One payload that is to be fetched.
struct Payload {
    std::string asset;
    std::string assetID;
    // One of the two.
    ZOCL::InterfaceRef<ZOCL::IZOCEnclosure> enclosure;
    ZOCL::InterfaceRef<ZOCL::IZOCServerResource> rendition;
    // Of the enclosure, or the flavour.
    std::string name;
    std::string fileName;
    std::string folder;
    std::string path;

    const char* Kind() const { return enclosure ? "enclosure" : "rendition"; }
    std::string Text() const { return "the " + std::string(Kind()) + " " + name + " of " + asset; }
    Bytes Data() const { return enclosure ? enclosure->GetEnclosurePayload() : rendition->GetResponseData(); }
};

Json FileJson(const Payload& inPayload, std::uint64_t inBytes, bool inWritten) {
    Json json("file");
    json.Set("asset", inPayload.asset).Set("assetId", inPayload.assetID).Set("kind", inPayload.Kind());
    json.Set("name", inPayload.name).Set("path", inPayload.path).Set("written", inWritten);
    return inWritten ? json.Set("bytes", inBytes) : json.Set("bytes", nullptr);
}

bool IsDirectory(const std::string& inPath) {
    struct stat found;
    return ::stat(inPath.c_str(), &found) == 0 && S_ISDIR(found.st_mode);
}

// Chooses the payloads that the command line asks for.
class Selection {
public:
    explicit Selection(Context& ioContext) : mContext(ioContext), mArgs(ioContext.Args()) {}

    std::vector<Payload> Choose() {
        const LoadedProduction loaded = LoadForReading(mContext);
        const auto list = LoadAssetList(mContext, loaded);
        const std::vector<AssetItem> items = list->GetAllItems();
        const auto named = mArgs.Positional(0);
        const std::vector<AssetItem> wanted =
            named ? std::vector<AssetItem>{FindAsset(items, *named, loaded.name)} : items;
        const BinFolders folders(items);
        std::vector<Payload> payloads;
        for (const AssetDetails& details : LoadDetails(mContext, list, wanted, Locators::Leave)) {
            const std::string folder = named ? std::string() : folders.FolderOf(details.item);
            AddEnclosures(details, folder, payloads);
            AddRenditions(details, folder, payloads);
        }
        if (payloads.empty()) {
            throw Failure(
                ExitCode::NotFound,
                named ? *named + " has nothing of what was asked for" : "no asset has what was asked for",
                "'zo assets --long' shows enclosures and renditions");
        }
        return payloads;
    }

private:
    void AddEnclosures(const AssetDetails& inDetails, const std::string& inFolder,
                       std::vector<Payload>& ioAll) const {
        const auto name = mArgs.Value("enclosure");
        if (mArgs.Has("rendition")) {
            return;
        }
        for (const EnclosureText& text : EnclosuresOf(inDetails.enclosures)) {
            if (name && text.name != *name) {
                continue;
            }
            Payload payload = Common(inDetails, inFolder);
            payload.enclosure = inDetails.enclosures->GetEnclosure(ZOCL::ImmutableString(text.name));
            payload.name = text.name;
            payload.fileName =
                EnclosureFileName(payload.asset, inDetails.item.mediaLocatorIdentifier.str(), text.name);
            ioAll.push_back(std::move(payload));
        }
    }

    void AddRenditions(const AssetDetails& inDetails, const std::string& inFolder,
                       std::vector<Payload>& ioAll) const {
        const auto flavour = mArgs.Value("rendition");
        if (mArgs.Has("enclosure")) {
            return;
        }
        for (const RenditionText& text : RenditionsOf(inDetails.renditions)) {
            if (flavour && text.flavour != *flavour) {
                continue;
            }
            Payload payload = Common(inDetails, inFolder);
            payload.rendition = inDetails.renditions->FindRendition(text.flavour)->GetPayloadResource(false);
            payload.name = text.flavour;
            payload.fileName = RenditionFileName(payload.asset, text.flavour);
            ioAll.push_back(std::move(payload));
        }
    }

    static Payload Common(const AssetDetails& inDetails, const std::string& inFolder) {
        Payload payload;
        payload.asset = ToUTF8(inDetails.item.name);
        payload.assetID = inDetails.item.assetIdentifier.str();
        payload.folder = inFolder;
        return payload;
    }

    Context& mContext;
    const Arguments& mArgs;
};

// Gives each payload its path.
void Place(std::vector<Payload>& ioPayloads, const std::string& inOutput, bool inIsWholeProduction) {
    const bool isFolder = inOutput.empty() || inOutput.back() == '/' || IsDirectory(inOutput);
    if (!isFolder && !inIsWholeProduction && ioPayloads.size() == 1) {
        ioPayloads.front().path = inOutput;
        return;
    }
    const std::filesystem::path root(inOutput.empty() ? "." : inOutput);
    UniquePaths paths;
    for (Payload& payload : ioPayloads) {
        const std::string relative = paths.Claim(payload.folder + payload.fileName);
        payload.path = (root / relative).lexically_normal().string();
    }
}

// Fetches payloads, several at a time, and hands each to a function on the main thread.
class Fetch {
public:
    /// inUse may throw a Failure, which then counts as that of the payload.
    Fetch(Context& ioContext, std::vector<Payload> inPayloads,
          std::function<void(const Payload&, std::string_view)> inUse)
        : mContext(ioContext), mTotal(inPayloads.size()), mUse(std::move(inUse)) {
        std::move(inPayloads.begin(), inPayloads.end(), std::back_inserter(mWaiting));
    }

    /// Throws when not everything was done.
    void Run() {
        StartMore();
        mContext.Loop().Wait();
        mContext.Out().EndProgress();
        if (mFailures.empty()) {
            return;
        }
        if (mFailures.size() == mTotal) {
            throw Failure(mFailures.front());
        }
        for (const Failure& failure : mFailures) {
            mContext.Out().Error(failure);
        }
        throw Failure(ExitCode::PartlyDone,
                      std::to_string(mFailures.size()) + " of " + std::to_string(mTotal) + " payloads failed",
                      "run the command again, with --force for the files that are there now");
    }

private:
    void StartMore() {
        while (!mWaiting.empty() && mContext.Loop().InFlight() < kFetchesAtOnce) {
            const Payload payload = std::move(mWaiting.front());
            mWaiting.pop_front();
            const auto server = mContext.Server();
            mContext.Loop().Start(
                [payload](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                    return payload.enclosure
                               ? payload.enclosure->LoadEnclosureData(inRequest, inCompletion)
                               : payload.rendition && payload.rendition->Load(inRequest, inCompletion, false);
                },
                [server](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); },
                [this, payload](const Outcome& inOutcome) { OnFetched(payload, inOutcome); });
        }
    }

    void OnFetched(const Payload& inPayload, const Outcome& inOutcome) {
        ++mDone;
        try {
            Use(inPayload, inOutcome);
        } catch (const Failure& failure) {
            mFailures.push_back(failure);
        } catch (const std::exception& error) {
            mFailures.emplace_back(ExitCode::Failure, "fetching " + inPayload.Text() + ": " + error.what());
        }
        mContext.Out().Progress(inPayload.path, mDone, mTotal, mBytes);
        StartMore();
    }

    void Use(const Payload& inPayload, const Outcome& inOutcome) {
        if (!inOutcome.Succeeded()) {
            throw Failure::OfRequest("fetching " + inPayload.Text(), inOutcome.result, inOutcome.response);
        }
        const Bytes bytes = inPayload.Data();
        const std::string_view view = bytes ? bytes->view() : std::string_view();
        mUse(inPayload, view);
        mBytes += view.size();
    }

    Context& mContext;
    const std::size_t mTotal;
    const std::function<void(const Payload&, std::string_view)> mUse;
    std::deque<Payload> mWaiting;
    std::vector<Failure> mFailures;
    std::size_t mDone = 0;
    std::uint64_t mBytes = 0;
};

void CheckArguments(const Arguments& inArgs) {
    if (inArgs.Has("enclosure") + inArgs.Has("rendition") + inArgs.Has("all") > 1) {
        throw Failure(ExitCode::Usage, "--enclosure, --rendition and --all exclude each other");
    }
    if (!inArgs.Positional(0) && !inArgs.Has("all")) {
        throw Failure(ExitCode::Usage, "no asset is named", "name one, or fetch everything with --all");
    }
    if (inArgs.ValueOr("output", "") == "-" && inArgs.Has("json")) {
        throw Failure(ExitCode::Usage, "--json and -o - both want standard output", "write to a file");
    }
}

void WriteToStandardOutput(Context& ioContext, std::vector<Payload> inPayloads) {
    if (inPayloads.size() != 1) {
        throw Failure(ExitCode::Usage,
                      std::to_string(inPayloads.size()) + " payloads cannot go to standard output",
                      "choose one with --enclosure NAME or --rendition FLAVOUR");
    }
    if (ioContext.Args().Has("dry-run")) {
        ioContext.Out().Note("would write " + inPayloads.front().Text() + " to standard output");
        return;
    }
    Fetch(ioContext, std::move(inPayloads), [&](const Payload&, std::string_view inBytes) {
        ioContext.Out().Raw(inBytes);
    }).Run();
}

void WriteToFiles(Context& ioContext, std::vector<Payload> inPayloads, Overwrite inOverwrite) {
    Output& out = ioContext.Out();
    Fetch(ioContext, std::move(inPayloads), [&](const Payload& inPayload, std::string_view inBytes) {
        const std::string folder = std::filesystem::path(inPayload.path).parent_path().string();
        if (!folder.empty()) {
            MakeDirectory(folder);
        }
        WriteFileWhole(inPayload.path, inBytes, inOverwrite);
        out.Record(FileJson(inPayload, inBytes.size(), true));
        out.Say("wrote " + inPayload.path + " (" + std::to_string(inBytes.size()) + " bytes)");
    }).Run();
}

}  // namespace

void RunGet(Context& ioContext) {
    const Arguments& args = ioContext.Args();
    CheckArguments(args);
    std::vector<Payload> payloads = Selection(ioContext).Choose();
    const std::string output = args.ValueOr("output", "");
    if (output == "-") {
        return WriteToStandardOutput(ioContext, std::move(payloads));
    }
    Place(payloads, output, !args.Positional(0));
    const Overwrite overwrite = args.Has("force") ? Overwrite::Replace : Overwrite::Never;
    // Nothing is fetched when some of it could not be written.
    for (const Payload& payload : payloads) {
        CheckMayWrite(payload.path, overwrite);
    }
    if (args.Has("dry-run")) {
        for (const Payload& payload : payloads) {
            ioContext.Out().Record(FileJson(payload, 0, false));
            ioContext.Out().Say("would write " + payload.path + " from " + payload.Text());
        }
        return;
    }
    WriteToFiles(ioContext, std::move(payloads), overwrite);
}

}  // namespace zo
