// Small text helpers for what comes from the network and from disk: percent coding, checks, JSON quoting.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace zohub {

/// Undoes percent coding; nothing when a "%" is not followed by two hexadecimal digits.
std::optional<std::string> PercentDecode(std::string_view inText);

/// Percent-codes everything but letters, digits and "-._~", and "/" when asked for by the caller's extra set.
std::string PercentEncode(std::string_view inText, std::string_view inAlsoKept = {});

bool IsValidUtf8(std::string_view inText);
bool HasControlCharacter(std::string_view inText);
bool EqualIgnoringCase(std::string_view inLeft, std::string_view inRight);
std::string ToLower(std::string_view inText);
std::string_view Trim(std::string_view inText);
std::vector<std::string_view> Split(std::string_view inText, char inSeparator);

/// Appends the text as a JSON string with its quotes. The text is valid UTF-8.
void AppendJsonString(std::string& ioTarget, std::string_view inText);
std::string JsonString(std::string_view inText);

/// Appends "key":"value" to an object that is being written, with a comma before it unless it is the first.
void AppendMember(std::string& ioTarget, std::string_view inKey, std::string_view inValue);

/// An identifier that may stand in a path segment as it is: letters, digits and "-_.{}", 1 to 160 of them,
/// and not made of dots alone.
bool IsIdentifier(std::string_view inText);

/// A name that people give (a user, a production): 1 to 255 bytes of UTF-8 without control characters.
bool IsDisplayName(std::string_view inText);

/// A name of an enclosure: as a display name, relative, and without a ".." between its slashes.
bool IsEnclosureName(std::string_view inText);

/// A media type as it may stand in a header: "type/subtype" and plain parameters.
bool IsMediaType(std::string_view inText);

}  // namespace zohub
