// Localised texts and their dictionaries.
#include "ostcore/config/ZString.h"

#include "ostcore/filesupport/File.h"
#include "ostcore/threads/Mutex.h"
#include "ostcore/utility/ReplaceInString.h"
#include "ostcore/utility/StringConversion.h"

namespace ostcore {
namespace config {
namespace {

using threads::Mutex;
using threads::MutexLock;

constexpr std::string_view kKeyMark = "$$$/";
constexpr std::size_t kLargestDictionary = 16 * 1024 * 1024;

using Dictionary = std::map<std::string, std::string, std::less<>>;

class Dictionaries {
public:
    void SetLanguage(std::string_view inLanguage) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        mLanguage = inLanguage;
    }
    std::string Language() const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        return mLanguage;
    }
    void Add(std::string_view inLanguage, const Dictionary& inTexts) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        Dictionary& dictionary = mByLanguage[std::string(inLanguage)];
        for (const auto& [key, text] : inTexts) {
            dictionary[key] = text;
        }
    }
    void Clear() ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        mByLanguage.clear();
        mLanguage.clear();
    }
    optional<std::string> Find(std::string_view inKey) const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        optional<std::string> text = FindIn(mLanguage, inKey);
        if (!text) {
            text = FindIn(mLanguage.substr(0, mLanguage.find('_')), inKey);
        }
        return text;
    }

private:
    optional<std::string> FindIn(const std::string& inLanguage, std::string_view inKey) const
        ZO_REQUIRES(mMutex) {
        const auto dictionary = mByLanguage.find(inLanguage);
        if (dictionary == mByLanguage.end()) {
            return {};
        }
        const auto text = dictionary->second.find(inKey);
        return text == dictionary->second.end() ? optional<std::string>()
                                                : optional<std::string>(text->second);
    }

    mutable Mutex mMutex;
    std::string mLanguage ZO_GUARDED_BY(mMutex);
    std::map<std::string, Dictionary> mByLanguage ZO_GUARDED_BY(mMutex);
};

Dictionaries& TheDictionaries() {
    static Dictionaries* const dictionaries = new Dictionaries;
    return *dictionaries;
}

Dictionary ParseDictionary(std::string_view inText) {
    static const std::vector<utility::Replacement> kEscapes{{"\\n", "\n"}, {"\\t", "\t"}, {"\\\\", "\\"}};
    Dictionary texts;
    while (!inText.empty()) {
        const std::size_t end = std::min(inText.find('\n'), inText.size());
        std::string_view line = inText.substr(0, end);
        inText.remove_prefix(std::min(end + 1, inText.size()));
        if (!line.empty() && line.back() == '\r') {
            line.remove_suffix(1);
        }
        const std::size_t equals = line.find('=');
        if (equals != std::string_view::npos && line.substr(0, kKeyMark.size()) == kKeyMark) {
            texts[std::string(line.substr(0, equals))] =
                utility::ReplaceInString(utility::ReplaceInvalidUTF8(line.substr(equals + 1)), kEscapes);
        }
    }
    return texts;
}

}  // namespace

void Localizer::SetLanguage(std::string_view inLanguage) {
    TheDictionaries().SetLanguage(inLanguage);
}
std::string Localizer::GetLanguage() {
    return TheDictionaries().Language();
}
void Localizer::Reset() {
    TheDictionaries().Clear();
}
optional<std::string> Localizer::Find(std::string_view inKey) {
    return TheDictionaries().Find(inKey);
}

void Localizer::AddText(std::string_view inLanguage, std::string_view inKey, std::string_view inText) {
    TheDictionaries().Add(inLanguage, {{std::string(inKey), std::string(inText)}});
}

bool Localizer::LoadDictionary(std::string_view inLanguage, const std::string& inPath) {
    const auto content = filesupport::File::Read(inPath, kLargestDictionary);
    if (!content) {
        return false;
    }
    LoadDictionaryFromMemory(inLanguage, content->view());
    return true;
}

void Localizer::LoadDictionaryFromMemory(std::string_view inLanguage, std::string_view inText) {
    constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
    if (inText.substr(0, kByteOrderMark.size()) == kByteOrderMark) {
        inText.remove_prefix(kByteOrderMark.size());
    }
    TheDictionaries().Add(inLanguage, ParseDictionary(inText));
}

}  // namespace config

namespace {

std::string LookUp(std::string_view inKeyAndText) {
    const std::size_t equals = inKeyAndText.find('=');
    if (equals == std::string_view::npos ||
        inKeyAndText.substr(0, config::kKeyMark.size()) != config::kKeyMark) {
        return std::string(inKeyAndText);
    }
    return config::Localizer::Find(inKeyAndText.substr(0, equals))
        .value_or(std::string(inKeyAndText.substr(equals + 1)));
}

std::string Fill(const std::string& inText, const std::vector<U8String>& inArguments) {
    constexpr std::size_t kMostArguments = 10;
    std::vector<utility::Replacement> marks;
    for (std::size_t i = 0; i < std::min(inArguments.size(), kMostArguments); ++i) {
        marks.emplace_back(std::string{'@', static_cast<char>('0' + i)}, inArguments[i]);
    }
    return utility::ReplaceInString(inText, marks);
}

}  // namespace

ZString::ZString(std::string_view inKeyAndText) : mText(LookUp(inKeyAndText)) {}

ZString::ZString(std::string_view inKeyAndText, const std::vector<U8String>& inArguments)
    : mText(Fill(LookUp(inKeyAndText), inArguments)) {}

UString ZString::AsString() const {
    return utility::ToUTF16(mText);
}

}  // namespace ostcore
