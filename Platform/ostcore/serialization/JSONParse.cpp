// Parsing: simdjson builds the tape, a document of ours keeps it.
#include <simdjson.h>

#include <cstdlib>
#include <stdexcept>

#include "ostcore/serialization/JSON.h"

namespace ostcore {
namespace serialization {

namespace {

static_assert(RecycledMemory::kPadding >= simdjson::SIMDJSON_PADDING, "payloads are parsed in place");

/// Texts up to this size are parsed into buffers of the thread, and the document gets memory of exactly its
/// size; the parser's own buffers are about fourteen times the text.
constexpr std::size_t kSmallText = 256 * 1024;

/// Keeps the parser's buffers as they are. The unused rest of them was never touched, so it costs address
/// space and no memory.
class LargeDocument final : public JSONDocument {
public:
    explicit LargeDocument(simdjson::dom::document inDocument) : mDocument(std::move(inDocument)) {
        mTape = mDocument.tape.get();
        mStrings = mDocument.string_buf.get();
    }

private:
    const simdjson::dom::document mDocument;
};

class SmallDocument final : public JSONDocument {
public:
    SmallDocument(const std::uint64_t* inTape, std::size_t inWords, const std::uint8_t* inStrings,
                  std::size_t inStringBytes) {
        const std::size_t stringWords = (inStringBytes + sizeof(std::uint64_t) - 1) / sizeof(std::uint64_t);
        mBlock.reset(new std::uint64_t[inWords + stringWords]);
        std::memcpy(mBlock.get(), inTape, inWords * sizeof(std::uint64_t));
        std::memcpy(mBlock.get() + inWords, inStrings, inStringBytes);
        mTape = mBlock.get();
        mStrings = reinterpret_cast<const std::uint8_t*>(mBlock.get() + inWords);
    }

private:
    std::unique_ptr<std::uint64_t[]> mBlock;
};

/// The bytes that the strings of a tape take, with the length before and the NUL behind each.
std::size_t MeasureStrings(const std::uint64_t* inTape, std::size_t inWords, const std::uint8_t* inStrings) {
    std::size_t end = 0;
    for (std::size_t index = 1; index < inWords; ++index) {
        const std::uint64_t word = inTape[index];
        const char kind = static_cast<char>(word >> 56);
        if (kind == 'l' || kind == 'u' || kind == 'd') {
            ++index;
        } else if (kind == '"') {
            const std::size_t start = word & 0x00FFFFFFFFFFFFFFull;
            std::uint32_t size;
            std::memcpy(&size, inStrings + start, sizeof size);
            end = start + sizeof size + size + 1;
        }
    }
    return end;
}

const char* Describe(simdjson::error_code inCode) {
    switch (inCode) {
        case simdjson::EMPTY:
            return "the text is empty";
        case simdjson::DEPTH_ERROR:
            return "the nesting is too deep";
        case simdjson::UTF8_ERROR:
            return "the text is not valid UTF-8";
        case simdjson::NUMBER_ERROR:
            return "a number is malformed or out of range";
        case simdjson::STRING_ERROR:
        case simdjson::UNESCAPED_CHARS:
            return "a string holds a bad escape or a bare control character";
        case simdjson::UNCLOSED_STRING:
            return "a string does not end";
        case simdjson::CAPACITY:
            return "the text is too large";
        case simdjson::MEMALLOC:
            return "there is not enough memory";
        default:
            return "the text breaks the grammar or ends early";
    }
}

void ThrowIfFailed(simdjson::error_code inCode, std::size_t inSize) {
    if (inCode != simdjson::SUCCESS) {
        throw std::runtime_error("JSON not well-formed: " + std::string(Describe(inCode)) + " (" +
                                 std::to_string(inSize) + " bytes)");
    }
}

struct ThreadBuffers {
    simdjson::dom::parser parser;
    simdjson::dom::document document;
};

/// inBytes are followed by readable padding.
JSONValue ParsePadded(const char* inBytes, std::size_t inSize) {
    constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
    const std::size_t wholeSize = inSize;
    if (std::string_view(inBytes, inSize).substr(0, kByteOrderMark.size()) == kByteOrderMark) {
        inBytes += kByteOrderMark.size();
        inSize -= kByteOrderMark.size();
    }
    const auto* bytes = reinterpret_cast<const std::uint8_t*>(inBytes);
    if (inSize <= kSmallText) {
        thread_local ThreadBuffers buffers;
        const auto parsed = buffers.parser.parse_into_document(buffers.document, bytes, inSize, false);
        ThrowIfFailed(parsed.error(), wholeSize);
        const std::uint64_t* tape = buffers.document.tape.get();
        const std::uint8_t* strings = buffers.document.string_buf.get();
        const std::size_t words = static_cast<std::size_t>(tape[0] & 0x00FFFFFFFFFFFFFFull);
        return JSONValue::FromDocument(intrusive_ptr<const JSONDocument>(
            new SmallDocument(tape, words, strings, MeasureStrings(tape, words, strings))));
    }
    simdjson::dom::parser parser;
    simdjson::dom::document document;
    const auto parsed = parser.parse_into_document(document, bytes, inSize, false);
    ThrowIfFailed(parsed.error(), wholeSize);
    return JSONValue::FromDocument(intrusive_ptr<const JSONDocument>(new LargeDocument(std::move(document))));
}

}  // namespace

JSONValue JSONParse(const shared_ptr<RecycledMemory const>& inBytes) {
    if (!inBytes || inBytes->empty()) {
        ThrowIfFailed(simdjson::EMPTY, 0);
    }
    return ParsePadded(inBytes->data(), inBytes->size());
}

JSONValue JSONParse(std::string_view inText) {
    if (inText.empty()) {
        ThrowIfFailed(simdjson::EMPTY, 0);
    }
    std::string padded;
    padded.reserve(inText.size() + simdjson::SIMDJSON_PADDING);
    padded.append(inText);
    padded.append(simdjson::SIMDJSON_PADDING, '\0');
    return ParsePadded(padded.data(), inText.size());
}

}  // namespace serialization
}  // namespace ostcore
