// zohub export: writes a production into a folder: bins as folders, renditions and enclosures as files.
#include <fcntl.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iostream>
#include <set>

#include "Base/Text.h"
#include "Commands/Arguments.h"
#include "Commands/Commands.h"
#include "Commands/Importer.h"

namespace zohub {

namespace fs = std::filesystem;

namespace {

constexpr std::size_t kMaxFileName = 200;
constexpr int kMaxBinDepth = 64;

// A name that came over the network becomes a name in this folder and nothing else.
std::string SafeName(std::string inName) {
    for (char& c : inName)
        if (static_cast<unsigned char>(c) < 0x20 || c == 0x7F || c == '/' || c == '\\')
            c = '_';
    if (inName.size() > kMaxFileName) {
        inName.resize(kMaxFileName);
        while (!inName.empty() && !IsValidUtf8(inName))
            inName.pop_back();
    }
    bool const isHiddenOrEmpty = inName.empty() || inName[0] == '.';
    return isHiddenOrEmpty ? "_" + inName : inName;
}

std::string ExtensionFor(std::string const& inType) {
    if (inType == "image/jpeg")
        return ".jpg";
    if (inType == "image/png")
        return ".png";
    return inType == "video/mp4" ? ".mp4" : ".bin";
}

class ExportRun {
public:
    ExportRun(Transaction& inTransaction, fs::path inRoot)
        : mTransaction(inTransaction), mRoot(std::move(inRoot)) {}

    std::size_t Run(View const& inView) {
        if (fs::exists(mRoot) && !fs::is_empty(mRoot))
            throw std::runtime_error("cannot export to " + mRoot.string() + ": it is not empty");
        fs::create_directories(mRoot);
        Repository repository(mTransaction);
        for (auto const& [id, hash] : AssetMap(mTransaction, inView.tree.assets).All())
            mAssets.emplace(id, repository.LoadAsset(hash));
        Json index = Json::object();
        index["properties"] = Json::parse(inView.tree.properties);
        index["commit"] = inView.commit.id;
        index["assets"] = Json::array();
        for (auto const& enclosure : inView.tree.enclosures)
            WriteContent(mRoot, SafeName(enclosure.name), enclosure.content);
        for (auto const& [id, asset] : mAssets)
            index["assets"].push_back(WriteAsset(asset));
        WriteFile(Unused(mRoot, "production.json"), index.dump(2) + "\n");
        return mFiles;
    }

private:
    static std::string NameOf(AssetState const& inAsset) {
        return SafeName(StringUnder(Json::parse(inAsset.properties), "name"));
    }

    static bool IsBin(AssetState const& inAsset) {
        return StringUnder(Json::parse(inAsset.properties), "cdzo:assetType") == "bin";
    }

    fs::path FolderOf(std::string const& inBin, int inDepth = 0) {
        auto const bin = mAssets.find(inBin);
        // A chain of parents that leads nowhere, or in a circle, ends at the root.
        if (bin == mAssets.end() || inDepth > kMaxBinDepth)
            return mRoot;
        if (auto const known = mFolders.find(inBin); known != mFolders.end())
            return known->second;
        fs::path const folder = Unused(FolderOf(bin->second.parent, inDepth + 1), NameOf(bin->second));
        fs::create_directory(folder);
        mFolders[inBin] = folder;
        return folder;
    }

    Json WriteAsset(AssetState const& inAsset) {
        Json entry = {
            {"id", inAsset.id}, {"properties", Json::parse(inAsset.properties)}, {"files", Json::array()}};
        if (IsBin(inAsset)) {
            FolderOf(inAsset.id);
            return entry;
        }
        fs::path const folder = FolderOf(inAsset.parent);
        std::string const name = NameOf(inAsset);
        auto const add = [&](fs::path const& inPath) {
            entry["files"].push_back(inPath.lexically_relative(mRoot).generic_string());
        };
        for (auto const& rendition : inAsset.renditions) {
            std::string const wanted = ToLower(fs::path(name).extension().string());
            bool const nameFits = wanted == ExtensionFor(rendition.type) || wanted == ".jpeg";
            add(WriteContent(folder, nameFits ? name : name + ExtensionFor(rendition.type),
                             rendition.content));
        }
        for (auto const& enclosure : inAsset.enclosures) {
            bool const isXmp = enclosure.name == inAsset.locator + "_xmp";
            add(WriteContent(folder, isXmp ? name + ".xmp" : name + "." + SafeName(enclosure.name),
                             enclosure.content));
        }
        return entry;
    }

    fs::path Unused(fs::path const& inFolder, std::string const& inName) {
        fs::path path = inFolder / inName;
        for (int number = 2; fs::exists(fs::symlink_status(path)) || mTaken.count(path); ++number) {
            fs::path const plain(inName);
            path = inFolder /
                   (plain.stem().string() + " " + std::to_string(number) + plain.extension().string());
        }
        mTaken.insert(path);
        return path;
    }

    fs::path WriteContent(fs::path const& inFolder, std::string const& inName, std::string const& inContent) {
        auto const bytes = mTransaction.FindContent(inContent);
        if (!bytes)
            throw std::runtime_error("the content " + inContent + " is missing; run zohub check");
        fs::path const path = Unused(inFolder, inName);
        WriteFile(path, *bytes);
        return path;
    }

    void WriteFile(fs::path const& inPath, std::string const& inBytes) {
        int const descriptor =
            open(inPath.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0644);
        std::size_t done = 0;
        while (descriptor >= 0 && done < inBytes.size()) {
            ssize_t const count = write(descriptor, inBytes.data() + done, inBytes.size() - done);
            if (count <= 0)
                break;
            done += static_cast<std::size_t>(count);
        }
        bool const isWhole = descriptor >= 0 && close(descriptor) == 0 && done == inBytes.size();
        if (!isWhole)
            throw std::runtime_error("cannot write " + inPath.string() + "; check space and rights");
        ++mFiles;
    }

    Transaction& mTransaction;
    fs::path const mRoot;
    std::map<std::string, AssetState> mAssets;
    std::map<std::string, fs::path> mFolders;
    std::set<fs::path> mTaken;
    std::size_t mFiles = 0;
};

std::string FindProduction(Transaction& inTransaction, std::string const& inNameOrId) {
    if (inTransaction.FindLine(inNameOrId))
        return inNameOrId;
    for (char const* kind : {kLineProduction, kLineTemplate})
        if (auto const line = FindLineByName(inTransaction, kind, inNameOrId, ""))
            return line->id;
    throw std::runtime_error("there is no production " + inNameOrId);
}

}  // namespace

int RunExport(std::vector<std::string> const& inWords) {
    Arguments const arguments(inWords, {{"--data"}, {"--production"}, {"--commit"}});
    std::string const directory = arguments.Words(1, "export DIR --production NAME|ID [--commit ID]")[0];
    auto const storage = OpenSqliteStorage(arguments.DataDirectory());
    auto const transaction = storage->BeginRead();
    std::string const id = FindProduction(*transaction, arguments.Need("--production"));
    View const view = Repository(*transaction).Open(id, arguments.Get("--commit"), {"", true});
    std::size_t const files = ExportRun(*transaction, fs::absolute(directory).lexically_normal()).Run(view);
    std::cout << "zohub: exported commit " << view.commit.id << " as " << files << " files\n";
    return 0;
}

}  // namespace zohub
