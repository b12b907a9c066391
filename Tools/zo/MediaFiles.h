// Media files as they become assets: their names, sidecars, locations and renditions.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace zo {

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

/// A label for the host part of a zomedia URL: lower-case letters, digits and dashes; never one that would
/// mean the reader's own machine.
std::string MountLabelFrom(const std::string& inText);

}  // namespace zo
