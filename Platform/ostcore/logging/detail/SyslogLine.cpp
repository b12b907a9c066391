// The text of one syslog line.
#include "ostcore/logging/detail/SyslogLine.h"

#include <boost/date_time/posix_time/posix_time.hpp>

#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"

namespace ostcore {
namespace logging {
namespace {

constexpr std::size_t kLongestLine = 2048;
constexpr int kFacilityUser = 1;
constexpr char kNothing[] = "-";
// The number is the one that is set aside for use without a registration (RFC 5612).
constexpr char kElementName[] = "zoclient@32473";
constexpr char kByteOrderMark[] = "\xEF\xBB\xBF";

// A header field: printable ASCII without blanks, not longer than allowed, "-" for nothing.
std::string HeaderField(std::string_view inText, std::size_t inLongest) {
    std::string field;
    for (const char c : inText.substr(0, inLongest)) {
        field.push_back(c > 0x20 && c < 0x7F ? c : '_');
    }
    return field.empty() ? kNothing : field;
}

std::string FieldName(std::string_view inText) {
    std::string name = HeaderField(inText, 32);
    std::replace_if(
        name.begin(), name.end(), [](char c) { return c == '=' || c == ']' || c == '"'; }, '_');
    return name;
}

std::string Clean(std::string_view inText) {
    std::string text = utility::ReplaceInvalidUTF8(inText);
    std::replace_if(
        text.begin(), text.end(), [](char c) { return static_cast<unsigned char>(c) < 0x20 || c == 0x7F; },
        ' ');
    return text;
}

// Judged together with its name, since it is the name that tells a secret.
std::string RedactedValue(const std::string& inName, const std::string& inValue) {
    const std::string prefix = inName + "=";
    return debug::RedactSecrets(prefix + inValue).substr(prefix.size());
}

void AppendField(std::string& ioLine, const std::string& inName, const std::string& inValue) {
    ioLine.append(" ").append(FieldName(inName)).append("=\"");
    for (const char c : Clean(RedactedValue(inName, inValue))) {
        if (c == '"' || c == '\\' || c == ']') {
            ioLine.push_back('\\');
        }
        ioLine.push_back(c);
    }
    ioLine.push_back('"');
}

// The fields that fit are kept whole; room is left for some of the message.
std::string StructuredElement(const SyslogOrigin& inOrigin, const SyslogFields& inFields) {
    constexpr std::size_t kLongestElement = kLongestLine / 2;
    std::string element = std::string("[") + kElementName;
    AppendField(element, "build", inOrigin.buildNumber);
    AppendField(element, "headless", inOrigin.isHeadless ? "true" : "false");
    for (const auto& [name, value] : inFields) {
        std::string next = element;
        AppendField(next, name, value);
        if (next.size() <= kLongestElement) {
            element.swap(next);
        }
    }
    return element + "]";
}

void CutUTF8(std::string& ioText, std::size_t inLongest) {
    if (ioText.size() <= inLongest) {
        return;
    }
    while (inLongest > 0 && (static_cast<unsigned char>(ioText[inLongest]) & 0xC0) == 0x80) {
        --inLongest;
    }
    ioText.resize(inLongest);
}

}  // namespace

std::string FormatSyslogLine(const SyslogOrigin& inOrigin, const ptime& inTime, SyslogSeverity inSeverity,
                             std::string_view inMessage, const SyslogFields& inFields) {
    std::string line("<");
    line.append(std::to_string(kFacilityUser * 8 + static_cast<int>(inSeverity))).append(">1 ");
    line += boost::posix_time::to_iso_extended_string(inTime) + "Z ";
    line += HeaderField(inOrigin.hostName, 255) + " " + HeaderField(inOrigin.clientName, 48) + " " +
            HeaderField(inOrigin.processID, 128) + " - ";
    line += StructuredElement(inOrigin, inFields) + " " + kByteOrderMark;
    line += Clean(debug::RedactSecrets(inMessage));
    CutUTF8(line, kLongestLine);
    return line;
}

}  // namespace logging
}  // namespace ostcore
