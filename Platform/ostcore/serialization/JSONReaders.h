// The typed readers from which transfer structures are made, one call a key.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "ostcore/serialization/JSON.h"

namespace ostcore {
namespace serialization {

// Common rules. inObject is an object, or absent or null, which has no keys. A value of the wrong type throws
// boost::bad_any_cast. A null is what an unset optional is written as, so it counts as an absent key for
// every reader here but the mandatory form of a string, where it is a wrong type; inside of a list it is a
// wrong type too. When a key is repeated, its last value counts.
//
// Two spellings of a field are read with two calls of an optional reader into one target: the later wins.

/// Mandatory form: the null string when the key is absent.
ZOPLATFORM_EXPORT ImmutableString ReadMandatoryString(JSONView inObject, std::string_view inKey);

/// The optional readers leave the target as it was when the key is absent, and when they throw.
/// They return true when the target was set.
ZOPLATFORM_EXPORT bool ReadOptionalString(JSONView inObject, std::string_view inKey,
                                          ImmutableString& ioTarget);
ZOPLATFORM_EXPORT bool ReadOptionalString(JSONView inObject, std::string_view inKey, std::string& ioTarget);
ZOPLATFORM_EXPORT bool ReadOptionalBoolean(JSONView inObject, std::string_view inKey, bool& ioTarget);
ZOPLATFORM_EXPORT bool ReadOptionalBoolean(JSONView inObject, std::string_view inKey,
                                           optional<bool>& ioTarget);
ZOPLATFORM_EXPORT bool ReadOptionalInt64(JSONView inObject, std::string_view inKey, std::int64_t& ioTarget);
ZOPLATFORM_EXPORT bool ReadOptionalInt32(JSONView inObject, std::string_view inKey, std::int32_t& ioTarget);
ZOPLATFORM_EXPORT bool ReadOptionalUInt32(JSONView inObject, std::string_view inKey, std::uint32_t& ioTarget);
ZOPLATFORM_EXPORT bool ReadOptionalDouble(JSONView inObject, std::string_view inKey, double& ioTarget);
/// Throws std::runtime_error for a malformed date; see ParseDate.
ZOPLATFORM_EXPORT bool ReadOptionalDate(JSONView inObject, std::string_view inKey, ptime& ioTarget);
ZOPLATFORM_EXPORT bool ReadOptionalStringList(JSONView inObject, std::string_view inKey,
                                              std::vector<ImmutableString>& ioTarget);

/// The ticks of a tick time, the object {"ticks": integer} with an integer of 32 or 64 bits. inDefault when
/// the key is absent; 0 when the object has no "ticks".
ZOPLATFORM_EXPORT std::int64_t ReadTicks(JSONView inObject, std::string_view inKey,
                                         std::int64_t inDefault = 0);

/// The object under a key; the absent view, which has no keys, when there is none.
ZOPLATFORM_EXPORT JSONView ReadObject(JSONView inObject, std::string_view inKey);
/// The list under a key; the absent view, which has no elements, when there is none.
ZOPLATFORM_EXPORT JSONView ReadList(JSONView inObject, std::string_view inKey);

/// Reads "YYYY-MM-DDThh:mm:ss" with an optional fraction of a second (microseconds are kept, further digits
/// dropped) and a zone behind it: "Z" or nothing for UTC, else "+hh:mm" or "-hh:mm". The result is in UTC:
/// 10:00:00-05:00 is 15:00. Years 1400 to 9999. Empty text is not-a-date-time. Throws std::runtime_error for
/// anything else; the error text does not quote the input.
ZOPLATFORM_EXPORT ptime ParseDate(std::string_view inText);

}  // namespace serialization
}  // namespace ostcore
