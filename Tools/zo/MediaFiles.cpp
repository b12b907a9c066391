// Finds out what belongs to a media file.
#include "MediaFiles.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <map>
#include <set>

#include "Failure.h"
#include "ostcore/utility/StringConversion.h"

namespace zo {
namespace {

namespace fs = std::filesystem;

constexpr std::size_t kLongestLabel = 63;

std::string SidecarOf(const fs::path& inPath) {
    fs::path stem = inPath;
    for (const std::string& candidate :
         {inPath.string() + ".xmp", inPath.string() + ".XMP", stem.replace_extension(".xmp").string(),
          stem.replace_extension(".XMP").string()}) {
        std::error_code error;
        if (fs::is_regular_file(candidate, error)) {
            return candidate;
        }
    }
    return {};
}

// Everything but letters, digits, the four marks and slashes.
std::string PercentEncoded(const std::string& inText) {
    static const std::string kPlain = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-._~/";
    std::string text;
    for (const char character : inText) {
        if (kPlain.find(character) != std::string::npos) {
            text += character;
            continue;
        }
        char code[4];
        std::snprintf(code, sizeof code, "%%%02X",
                      static_cast<unsigned>(static_cast<unsigned char>(character)));
        text += code;
    }
    return text;
}

MediaFile LookAt(const std::string& inPath, const std::string& inMountLabel) {
    struct stat found;
    const int result = ::stat(inPath.c_str(), &found);
    if (result < 0 || ::access(inPath.c_str(), R_OK) < 0) {
        throw Failure(errno == ENOENT ? ExitCode::NotFound : ExitCode::Failure,
                      "reading " + inPath + " failed: " + std::strerror(errno), "nothing was added");
    }
    if (!S_ISREG(found.st_mode)) {
        throw Failure(ExitCode::Usage, inPath + " is no regular file", "name the media files themselves");
    }
    MediaFile file;
    const fs::path path(inPath);
    file.path = inPath;
    file.name = path.filename().string();
    if (ExtensionOf(file.name) == "xmp") {
        throw Failure(ExitCode::Usage, inPath + " is a sidecar",
                      "name the media; its sidecar goes along. 'zo xmp set' puts one to an asset");
    }
    file.bytes = static_cast<std::uint64_t>(found.st_size);
    file.sidecar = SidecarOf(path);
    if (file.bytes <= kLargestRendition) {
        file.renditionType = MediaTypeOfName(file.name).value_or("");
    }
    const std::string label = inMountLabel.empty()
                                  ? fs::absolute(path).lexically_normal().parent_path().filename().string()
                                  : inMountLabel;
    file.href = MediaHRef(MountLabelFrom(label), file.name);
    return file;
}

}  // namespace

std::string ExtensionOf(const std::string& inName) {
    const std::size_t dot = inName.rfind('.');
    return dot == std::string::npos || dot == 0 ? std::string()
                                                : ostcore::utility::FoldCaseASCII(inName.substr(dot + 1));
}

std::optional<std::string> MediaTypeOfName(const std::string& inName) {
    static const std::map<std::string, std::string> table{{"jpg", "image/jpeg"}, {"jpeg", "image/jpeg"},
                                                          {"png", "image/png"},  {"mp4", "video/mp4"},
                                                          {"m4v", "video/mp4"},  {"mov", ""},
                                                          {"mxf", ""},           {"avi", ""},
                                                          {"mkv", ""},           {"mts", ""},
                                                          {"mpg", ""},           {"wav", ""},
                                                          {"aif", ""},           {"aiff", ""},
                                                          {"mp3", ""},           {"m4a", ""},
                                                          {"flac", ""},          {"tif", ""},
                                                          {"tiff", ""},          {"bmp", ""},
                                                          {"gif", ""},           {"exr", ""},
                                                          {"dpx", ""},           {"dng", ""}};
    const auto found = table.find(ExtensionOf(inName));
    return found == table.end() ? std::nullopt : std::optional(found->second);
}

bool LooksLike(std::string_view inBytes, const std::string& inRenditionType) {
    if (inRenditionType == "image/jpeg") {
        return inBytes.substr(0, 3) == "\xFF\xD8\xFF";
    }
    if (inRenditionType == "image/png") {
        return inBytes.substr(0, 8) == "\x89PNG\r\n\x1A\n";
    }
    return inBytes.size() > 8 && inBytes.substr(4, 4) == "ftyp";
}

std::string MediaHRef(const std::string& inLabel, const std::string& inPath) {
    return "zomedia://" + inLabel + "/" + PercentEncoded(inPath);
}

std::string MountLabelFrom(const std::string& inText) {
    std::string label;
    for (const char character : ostcore::utility::FoldCaseASCII(inText)) {
        const bool isPlain = (character >= 'a' && character <= 'z') || (character >= '0' && character <= '9');
        if (isPlain || !label.empty()) {
            label += isPlain ? character : '-';
        }
    }
    // "localhost" means the machine of whoever reads it.
    if (label.empty() || label.compare(0, 9, "localhost") == 0) {
        label = label.empty() ? "media" : "media-" + label;
    }
    label.resize(std::min(label.size(), kLongestLabel));
    while (label.back() == '-') {
        label.pop_back();
    }
    return label;
}

std::vector<MediaFile> LookAtMediaFiles(const std::vector<std::string>& inPaths,
                                        const std::string& inMountLabel) {
    std::vector<MediaFile> files;
    std::set<std::string> seen;
    for (const std::string& path : inPaths) {
        if (!seen.insert(path).second) {
            throw Failure(ExitCode::Usage, path + " is named twice");
        }
        files.push_back(LookAt(path, inMountLabel));
    }
    return files;
}

}  // namespace zo
