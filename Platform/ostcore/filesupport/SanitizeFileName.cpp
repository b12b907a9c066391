// A harmless file name out of any text.
#include <array>

#include "ostcore/filesupport/File.h"
#include "ostcore/utility/StringConversion.h"

namespace ostcore {
namespace filesupport {
namespace {

constexpr std::size_t kLongestExtension = 16;

bool IsRefused(char inCharacter) {
    const auto byte = static_cast<unsigned char>(inCharacter);
    return byte < 0x20 || byte == 0x7F ||
           std::string_view("/\\:*?\"<>|").find(inCharacter) != std::string_view::npos;
}

// Cuts between characters, never inside one.
std::string_view CutUTF8(std::string_view inText, std::size_t inBytes) {
    if (inText.size() <= inBytes) {
        return inText;
    }
    while (inBytes > 0 && (static_cast<unsigned char>(inText[inBytes]) & 0xC0) == 0x80) {
        --inBytes;
    }
    return inText.substr(0, inBytes);
}

std::string CutKeepingExtension(const std::string& inName, std::size_t inMaximumBytes) {
    if (inName.size() <= inMaximumBytes) {
        return inName;
    }
    const std::size_t dot = inName.rfind('.');
    const bool hasExtension = dot != std::string::npos && dot > 0 &&
                              inName.size() - dot <= kLongestExtension &&
                              inName.size() - dot < inMaximumBytes;
    const std::string extension = hasExtension ? inName.substr(dot) : std::string();
    return std::string(CutUTF8(inName, inMaximumBytes - extension.size())) + extension;
}

std::string WithoutOuterDotsAndBlanks(const std::string& inName) {
    const std::size_t first = inName.find_first_not_of(". ");
    return first == std::string::npos ? std::string()
                                      : inName.substr(first, inName.find_last_not_of(". ") - first + 1);
}

// Names that are devices on some systems, whatever their extension.
bool IsDeviceName(std::string_view inName) {
    std::string stem = utility::FoldCaseASCII(inName.substr(0, inName.find('.')));
    static constexpr std::array<std::string_view, 4> kDevices{"con", "prn", "aux", "nul"};
    if (std::find(kDevices.begin(), kDevices.end(), stem) != kDevices.end()) {
        return true;
    }
    const bool isNumbered = stem.size() == 4 && stem[3] >= '0' && stem[3] <= '9';
    return isNumbered && (stem.compare(0, 3, "com") == 0 || stem.compare(0, 3, "lpt") == 0);
}

}  // namespace

std::string SanitizeFileName(std::string_view inText, std::size_t inMaximumBytes) {
    std::string name = utility::ReplaceInvalidUTF8(inText);
    std::replace_if(name.begin(), name.end(), IsRefused, '_');
    name = WithoutOuterDotsAndBlanks(name);
    if (IsDeviceName(name)) {
        name.insert(0, 1, '_');
    }
    name = WithoutOuterDotsAndBlanks(CutKeepingExtension(name, std::max<std::size_t>(inMaximumBytes, 1)));
    return name.empty() ? "_" : name;
}

}  // namespace filesupport
}  // namespace ostcore
