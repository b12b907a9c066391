// The library's own files, and the functions that hand them out.
#include "Frame/LibraryModule.h"

#include <set>

#include "ostcore/config/ZString.h"
#include "ZOClient/Library.h"

namespace ZOCL {

using ostcore::config::Localizer;
using ostcore::utility::GetBinaryFromModule;

/// In the source that the build makes from the folder Resources.
extern const ostcore::utility::BinaryModule kLibraryModule;

namespace {

constexpr const char* kDictionaryType = "TEXT";
constexpr const char* kIconType = "SVG";

}  // namespace

const ostcore::utility::BinaryModule& GetLibraryModule() {
    return kLibraryModule;
}

bool LoadShippedLanguage(const std::string& inLanguage) {
    bool isLoaded = false;
    // The general one first, so that what the special one says goes over it.
    for (const std::string& language :
         std::set<std::string>{inLanguage.substr(0, inLanguage.find('_')), inLanguage}) {
        if (const auto dictionary = GetBinaryFromModule(kLibraryModule, kDictionaryType, language)) {
            Localizer::LoadDictionaryFromMemory(language, dictionary.View());
            isLoaded = true;
        }
    }
    return isLoaded;
}

std::vector<std::string> GetShippedLanguages() {
    return ostcore::utility::GetBinaryNames(kLibraryModule, kDictionaryType);
}

ImageSupply GetGenericButtonImageSupply() {
    return [](const std::string& inName) { return GetBinaryFromModule(kLibraryModule, kIconType, inName); };
}

}  // namespace ZOCL
