// Looks through a folder of media for ingest: what lies in it by kind, with nothing outside of it touched.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "Payloads.h"

namespace zo {

/// A media file below the root.
struct FolderFile {
    /// Relative to the root, with slashes, well-formed UTF-8.
    std::string path;
    /// Relative path of its XMP file; empty when it has none.
    std::string sidecar;
    /// The media type under which it is its own rendition; empty when it cannot be, or is too large.
    std::string renditionType;
    std::uint64_t bytes = 0;
    std::uint64_t sidecarBytes = 0;

    /// The part before the last slash, empty at the root.
    std::string Folder() const;
    std::string Name() const;
};

/// Something that does not come along.
struct LeftOut {
    /// Relative to the root, in a form that can be shown.
    std::string path;
    std::string reason;
    /// Whether media may be missing because of it; the rest is no media, or a second way to it.
    bool isFailure = false;
};

struct MediaFolder {
    /// Relative paths of those with media below, parents before children.
    std::vector<std::string> folders;
    /// In the order of their paths.
    std::vector<FolderFile> files;
    std::vector<LeftOut> leftOut;
};

/// Symbolic links are not followed, hidden entries are passed over. A file's sidecar is FILE.xmp, else the
/// file's name with xmp in the place of its extension. Throws a Failure when the root is no directory that
/// can be read; inCheck is called now and then and may throw to end it.
MediaFolder LookThroughFolder(const std::string& inRoot, const std::function<void()>& inCheck);

/// Reads files below a root, never through a symbolic link. Main thread only.
class FolderReader {
public:
    explicit FolderReader(std::string inRoot) : mRoot(std::move(inRoot)) {}

    /// Throws a Failure when the file is gone, no regular file, larger than the limit or cannot be read.
    Payload Read(const std::string& inPath, std::uint64_t inLargest) const;
    /// A text that is another one when the content is: the size with the first and the last 64 KiB. Throws as
    /// Read.
    std::string Fingerprint(const std::string& inPath) const;

private:
    const std::string mRoot;
};

}  // namespace zo
