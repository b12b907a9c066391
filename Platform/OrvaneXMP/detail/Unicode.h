// Brings the text forms in which a packet may come to the one that the parser reads.
#pragma once

#include <string>
#include <string_view>

namespace OrvaneXMP {

enum class TextForm { EightBit, UTF16Little, UTF16Big, UTF32Little, UTF32Big };

/// By the byte order mark, else by where the zeros of the first character stand.
TextForm FindTextForm(std::string_view inBytes) noexcept;

/// UTF-16 or UTF-32 as UTF-8. False for lone surrogates, values beyond Unicode, a cut last character, and
/// when the result would be larger than a packet may be.
bool ConvertToUTF8(std::string_view inBytes, TextForm inForm, std::string& outText);

}  // namespace OrvaneXMP
