// Writing a value as JSON text.
#include <charconv>
#include <cmath>
#include <stdexcept>

#include "ostcore/serialization/JSON.h"
#include "ostcore/utility/StringConversion.h"

namespace ostcore {
namespace serialization {

namespace {

class Writer {
public:
    std::string Write(JSONView inValue) {
        WriteValue(inValue, 0);
        return std::move(mText);
    }

private:
    void WriteValue(JSONView inValue, std::size_t inDepth) {
        switch (inValue.Type()) {
            case JSONType::Null:
                mText += "null";
                break;
            case JSONType::Boolean:
                mText += inValue.AsBool() ? "true" : "false";
                break;
            case JSONType::Integer:
                WriteInteger(inValue.AsInt64());
                break;
            case JSONType::Unsigned:
                WriteInteger(inValue.AsUInt64());
                break;
            case JSONType::Double:
                WriteDouble(inValue.AsDouble());
                break;
            case JSONType::String:
                WriteString(inValue.AsString());
                break;
            case JSONType::Array:
                WriteArray(inValue, inDepth);
                break;
            case JSONType::Object:
                WriteObject(inValue, inDepth);
                break;
        }
    }

    void WriteArray(JSONView inArray, std::size_t inDepth) {
        CheckDepth(inDepth);
        char separator = '[';
        inArray.ForEachElement([&](JSONView inElement) {
            mText += separator;
            separator = ',';
            WriteValue(inElement, inDepth + 1);
        });
        mText += separator == '[' ? "[]" : "]";
    }

    void WriteObject(JSONView inObject, std::size_t inDepth) {
        CheckDepth(inDepth);
        char separator = '{';
        inObject.ForEachMember([&](std::string_view inKey, JSONView inValue) {
            mText += separator;
            separator = ',';
            WriteString(inKey);
            mText += ':';
            WriteValue(inValue, inDepth + 1);
        });
        mText += separator == '{' ? "{}" : "}";
    }

    static void CheckDepth(std::size_t inDepth) {
        if (inDepth >= kJSONMaximumDepth) {
            throw std::runtime_error("JSON not written: the nesting is too deep");
        }
    }

    template <class T>
    void WriteInteger(T inNumber) {
        char digits[24];
        mText.append(digits, std::to_chars(digits, digits + sizeof digits, inNumber).ptr);
    }

    void WriteDouble(double inNumber) {
        if (!std::isfinite(inNumber)) {
            mText += "null";
            return;
        }
        char digits[40];
        const std::string_view text(
            digits,
            static_cast<std::size_t>(std::to_chars(digits, digits + sizeof digits, inNumber).ptr - digits));
        mText += text;
        if (text.find_first_of(".e") == std::string_view::npos) {
            mText += ".0";  // it would read back as an integer otherwise
        }
    }

    void WriteString(std::string_view inText) {
        if (!utility::IsValidUTF8(inText)) {
            WriteString(utility::ReplaceInvalidUTF8(inText));
            return;
        }
        mText += '"';
        std::size_t done = 0;
        for (std::size_t at = 0; at < inText.size(); ++at) {
            const auto byte = static_cast<unsigned char>(inText[at]);
            if (byte >= 0x20 && byte != '"' && byte != '\\') {
                continue;
            }
            mText.append(inText, done, at - done);
            WriteEscape(byte);
            done = at + 1;
        }
        mText.append(inText, done);
        mText += '"';
    }

    void WriteEscape(unsigned char inByte) {
        constexpr char kHexDigits[] = "0123456789abcdef";
        mText += '\\';
        switch (inByte) {
            case '"':
            case '\\':
                mText += static_cast<char>(inByte);
                break;
            case '\b':
                mText += 'b';
                break;
            case '\f':
                mText += 'f';
                break;
            case '\n':
                mText += 'n';
                break;
            case '\r':
                mText += 'r';
                break;
            case '\t':
                mText += 't';
                break;
            default:
                mText += "u00";
                mText += kHexDigits[inByte >> 4];
                mText += kHexDigits[inByte & 15];
        }
    }

    std::string mText;
};

}  // namespace

std::string GetJSONUTF8String(const JSONValue& inValue) {
    return Writer().Write(inValue);
}

UString GetJSONString(const JSONValue& inValue) {
    return utility::ToUTF16(GetJSONUTF8String(inValue));
}

}  // namespace serialization
}  // namespace ostcore
