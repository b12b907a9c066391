// Conversion between the text forms of the house, and the small questions of ASCII case that go with it.
#pragma once

#include <string>
#include <string_view>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace utility {

/// UTF-16 to UTF-8. A lone surrogate becomes U+FFFD; never throws for bad text.
ZOPLATFORM_EXPORT U8String ToUTF8(std::u16string_view inText);

/// UTF-8 to UTF-16. Each maximal subpart of an ill-formed sequence becomes one U+FFFD (Unicode, section 3.9,
/// "U+FFFD Substitution of Maximal Subparts"); surrogates and overlong forms are ill-formed.
ZOPLATFORM_EXPORT UString ToUTF16(std::string_view inText);

/// True when the text is well-formed UTF-8 to its last byte.
ZOPLATFORM_EXPORT bool IsValidUTF8(std::string_view inText) noexcept;

/// The text with every maximal subpart of an ill-formed sequence replaced by U+FFFD.
ZOPLATFORM_EXPORT U8String ReplaceInvalidUTF8(std::string_view inText);

/// 'A' to 'Z' in lower case; every other byte as it is. Knows nothing of locales.
ZOPLATFORM_EXPORT std::string FoldCaseASCII(std::string_view inText);

/// Equal but for the case of ASCII letters.
ZOPLATFORM_EXPORT bool EqualsIgnoreCaseASCII(std::string_view inLeft, std::string_view inRight) noexcept;

}  // namespace utility
}  // namespace ostcore
