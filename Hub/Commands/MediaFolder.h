// Walks a folder of media: what lies in it, by kind, with nothing outside of it ever touched.
#pragma once

#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace zohub {

struct MediaFile {
    std::string path;    ///< relative to the root, with slashes, valid UTF-8
    std::string folder;  ///< the part before the last slash, empty at the root
    std::string name;    ///< the file's own name
    std::uint64_t size = 0;
    std::string sidecar;        ///< relative path of its XMP file, or empty
    std::string renditionType;  ///< media type under which the file serves as its own rendition, or empty
};

struct MediaFolder {
    std::vector<std::string>
        folders;                     ///< relative paths, parents before children; only those with media below
    std::vector<MediaFile> files;    ///< in the order of their paths
    std::vector<std::string> notes;  ///< what was left out and why
};

/// Symbolic links are not followed; hidden, special and badly named files are left out with a note.
/// Throws std::runtime_error when the root cannot be read.
MediaFolder ScanMediaFolder(std::filesystem::path const& inRoot);

/// Reads a file below the root without following a link at any step; nothing when it is gone, no regular
/// file, or larger than the limit.
std::optional<std::string> ReadBelow(std::filesystem::path const& inRoot, std::string const& inPath,
                                     std::uint64_t inMaxSize);

/// A hash that changes when the file does: of all bytes up to inFullLimit; of larger files, of the size, the
/// time of change, and the first and last mebibyte. Nothing when the file cannot be read.
std::optional<std::string> FingerprintBelow(std::filesystem::path const& inRoot, std::string const& inPath,
                                            std::uint64_t inFullLimit);

}  // namespace zohub
