// Where fetched payloads go: folders like the bins, file names like the assets, all of them safe.
#pragma once

#include <map>
#include <set>
#include <string>
#include <vector>

#include "Assets.h"

namespace zo {

/// The file name for a rendition: the asset's name, with the extension of the flavour unless it has it.
std::string RenditionFileName(const std::string& inAsset, const std::string& inFlavour);
/// The file name for an enclosure: the asset's name and ".xmp" for its XMP enclosure, else the asset's name,
/// a dot and the enclosure's name.
std::string EnclosureFileName(const std::string& inAsset, const std::string& inLocator,
                              const std::string& inName);

/// Folders made from bins: the path of an asset is that of its parents' names, below the root.
class BinFolders {
public:
    explicit BinFolders(const std::vector<AssetItem>& inItems);

    /// "" at the root, else "A/B/". Every part is sanitised; a ring of parents is cut.
    std::string FolderOf(const AssetItem& inItem) const;

private:
    struct Bin {
        std::string name;
        std::string parent;
    };
    std::map<std::string, Bin> mBins;
};

/// Gives each path once: a second file of the same name gets "~2" before its extension. Names that differ in
/// the case of ASCII letters alone count as the same.
class UniquePaths {
public:
    std::string Claim(const std::string& inPath);

private:
    std::set<std::string> mTaken;
};

}  // namespace zo
