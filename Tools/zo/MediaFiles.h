// Media files as they become assets: their names, sidecars, locations and renditions.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace zo {

/// Larger files get no rendition.
constexpr std::uint64_t kLargestRendition = std::uint64_t(64) << 20;

struct MediaFile {
    std::string path;
    std::string name;
    /// Path of the XMP sidecar; empty when there is none.
    std::string sidecar;
    /// Where clients find the media: a zomedia URL made of the mount's label and the file's name.
    std::string href;
    /// The media type under which the file can be shown as it is; empty when it cannot, or is too large.
    std::string renditionType;
    std::uint64_t bytes = 0;
};

/// Looks at files. A label that is not given is made from the name of the file's folder. Throws a Failure for
/// the first one that is no regular file that can be read, and for a sidecar named as media.
std::vector<MediaFile> LookAtMediaFiles(const std::vector<std::string>& inPaths,
                                        const std::string& inMountLabel);

/// Under which media type a file of this name can be shown as it is: empty for media that cannot, nothing for
/// a name that is no media's.
std::optional<std::string> MediaTypeOfName(const std::string& inName);
/// What follows the last dot, in lower case; empty for a name without one or with none but the first.
std::string ExtensionOf(const std::string& inName);
/// Whether the bytes begin as a file of this rendition type does.
bool LooksLike(std::string_view inBytes, const std::string& inRenditionType);
/// The location of a file below the root of a storage: "zomedia://LABEL/PATH", with the path's slashes kept.
std::string MediaHRef(const std::string& inLabel, const std::string& inPath);

/// A label for the host part of a zomedia URL: lower-case letters, digits and dashes; never one that would
/// mean the reader's own machine.
std::string MountLabelFrom(const std::string& inText);

}  // namespace zo
