// Localised texts: a key with its English text, looked up in the dictionary of the user's language.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostcore {

namespace config {

/// The dictionaries, by language ("de", "pt_BR"). The library reads no locale of its own accord: a host says
/// which language its user reads. Threads: any.
class ZOPLATFORM_EXPORT Localizer {
public:
    /// An empty language means the English texts of the code. "pt_BR" falls back to "pt".
    static void SetLanguage(std::string_view inLanguage);
    static std::string GetLanguage();
    /// Adds the entries of a UTF-8 file, lines of `$$$/Library/Path=text` in which \n, \t and \\ are escapes;
    /// `#` begins a comment line. Later entries replace former ones. False: the file could not be read.
    static bool LoadDictionary(std::string_view inLanguage, const std::string& inPath);
    /// The same from a text that is at hand.
    static void LoadDictionaryFromMemory(std::string_view inLanguage, std::string_view inText);
    static void AddText(std::string_view inLanguage, std::string_view inKey, std::string_view inText);
    /// Forgets all dictionaries and the language.
    static void Reset();
    /// The text of a key in the language that is set; none when no dictionary has it.
    static optional<std::string> Find(std::string_view inKey);
};

}  // namespace config

/// A text for the user: "$$$/ZOCL/Path=English text @0". The key is looked up when the object is made;
/// without an entry the English text is taken. @0 to @9 are replaced by the arguments in one pass; a mark
/// without an argument stays, and arguments are not scanned for marks. A text that is no such key is taken as
/// it is.
class ZOPLATFORM_EXPORT ZString {
public:
    explicit ZString(std::string_view inKeyAndText);
    ZString(std::string_view inKeyAndText, const std::vector<U8String>& inArguments);

    const U8String& AsUTF8() const noexcept { return mText; }
    UString AsString() const;

private:
    U8String mText;
};

}  // namespace ostcore
