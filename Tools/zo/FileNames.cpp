// Names for files, made from names at the hub.
#include "FileNames.h"

#include "ostcore/filesupport/File.h"
#include "ostcore/utility/StringConversion.h"

namespace zo {
namespace {

using ostcore::filesupport::SanitizeFileName;

constexpr std::size_t kDeepestFolder = 64;

bool EndsWith(const std::string& inText, const std::string& inEnd) {
    return inText.size() > inEnd.size() &&
           ostcore::utility::EqualsIgnoreCaseASCII(inText.substr(inText.size() - inEnd.size()), inEnd);
}

// The usual extensions of a media type, the first one for new names.
std::vector<std::string> ExtensionsOf(const std::string& inFlavour) {
    static const std::map<std::string, std::vector<std::string>> table{
        {"image/jpeg", {".jpg", ".jpeg"}}, {"image/png", {".png"}}, {"video/mp4", {".mp4", ".m4v"}}};
    const auto found = table.find(inFlavour);
    if (found != table.end()) {
        return found->second;
    }
    const std::size_t slash = inFlavour.find('/');
    const std::string subtype = slash == std::string::npos ? inFlavour : inFlavour.substr(slash + 1);
    return {"." + SanitizeFileName(subtype, 40)};
}

}  // namespace

std::string RenditionFileName(const std::string& inAsset, const std::string& inFlavour) {
    const std::vector<std::string> extensions = ExtensionsOf(inFlavour);
    for (const std::string& extension : extensions) {
        if (EndsWith(inAsset, extension)) {
            return SanitizeFileName(inAsset);
        }
    }
    return SanitizeFileName(inAsset + extensions.front());
}

std::string EnclosureFileName(const std::string& inAsset, const std::string& inLocator,
                              const std::string& inName) {
    const bool isXMP =
        !inLocator.empty() && inName == ZOCL::GetXMPEnclosureName(ZOCL::ImmutableString(inLocator)).str();
    return SanitizeFileName(isXMP ? inAsset + ".xmp" : inAsset + "." + inName);
}

BinFolders::BinFolders(const std::vector<AssetItem>& inItems) {
    for (const AssetItem& item : inItems) {
        mBins[item.assetIdentifier.str()] = {ostcore::utility::ToUTF8(item.name),
                                             item.parentIdentifier.str()};
    }
}

std::string BinFolders::FolderOf(const AssetItem& inItem) const {
    std::string folder;
    std::string at = inItem.parentIdentifier.str();
    for (std::size_t depth = 0; depth < kDeepestFolder; ++depth) {
        const auto bin = mBins.find(at);
        if (bin == mBins.end()) {
            break;
        }
        folder = SanitizeFileName(bin->second.name) + "/" + folder;
        at = bin->second.parent;
    }
    return folder;
}

std::string UniquePaths::Claim(const std::string& inPath) {
    const std::size_t slash = inPath.rfind('/');
    const std::size_t nameStart = slash == std::string::npos ? 0 : slash + 1;
    const std::size_t dot = inPath.rfind('.');
    const std::size_t stemEnd = dot == std::string::npos || dot <= nameStart ? inPath.size() : dot;
    std::string path = inPath;
    for (std::size_t number = 2; !mTaken.insert(ostcore::utility::FoldCaseASCII(path)).second; ++number) {
        path = inPath.substr(0, stemEnd) + "~" + std::to_string(number) + inPath.substr(stemEnd);
    }
    return path;
}

}  // namespace zo
