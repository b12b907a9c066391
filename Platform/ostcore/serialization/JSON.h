// JSON in memory: one value type over two kinds of storage, an immutable parsed document that is only
// looked at, and a small mutable tree for what is written.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostcore/utility/ImmutableString.h"
#include "ostcore/utility/RecycledMemory.h"

namespace ostcore {
namespace serialization {

using utility::ImmutableString;
using utility::RecycledMemory;

class JSONValue;
class JSONView;

enum class JSONType : std::uint8_t { Null, Boolean, Integer, Unsigned, Double, String, Array, Object };

/// Nesting deeper than this is refused, by the parser and by the writer.
constexpr std::size_t kJSONMaximumDepth = 1024;

/// Throws boost::bad_any_cast: a value is not of the type that was asked for.
[[noreturn]] ZOPLATFORM_EXPORT void ThrowWrongJSONType();

/// Anything that values share: counted, freed by its last reference.
class ZOPLATFORM_EXPORT JSONShared {
public:
    JSONShared() noexcept = default;
    JSONShared(const JSONShared&) = delete;
    JSONShared& operator=(const JSONShared&) = delete;
    virtual ~JSONShared();

    /// True when the caller's reference is the only one. Orders what former holders did before.
    bool IsUnique() const noexcept { return mCount.load(std::memory_order_acquire) == 1; }

    friend void intrusive_ptr_add_ref(const JSONShared* inShared) noexcept {
        inShared->mCount.fetch_add(1, std::memory_order_relaxed);
    }
    friend void intrusive_ptr_release(const JSONShared* inShared) noexcept {
        if (inShared->mCount.fetch_sub(1, std::memory_order_acq_rel) == 1) {
            delete inShared;
        }
    }

private:
    mutable std::atomic<std::uint32_t> mCount{0};
};

/// A parsed document: a tape of words, each with a kind in its upper byte and a payload below, and the
/// unescaped strings beside it. Immutable, so any number of threads may read it. The layout is known to
/// JSONView alone.
class JSONDocument : public JSONShared {
public:
    const std::uint64_t* Tape() const noexcept { return mTape; }
    const std::uint8_t* Strings() const noexcept { return mStrings; }

protected:
    const std::uint64_t* mTape = nullptr;
    const std::uint8_t* mStrings = nullptr;
};

/// Looks at one value without owning it: two words, copied freely, valid while a JSONValue of the same
/// document or tree lives and is not changed. The default view stands for an absent value; it reads as null.
///
/// Threads: any, as long as nobody changes the tree that is looked at.
/// Errors: every As... operation throws boost::bad_any_cast when the value is of another type.
class JSONView {
public:
    constexpr JSONView() noexcept = default;
    /// The value at a position of a document, as returned by TapeIndex.
    JSONView(const JSONDocument& inDocument, std::size_t inIndex) noexcept
        : mDocument(&inDocument), mIndex(inIndex) {}
    /// A value in whatever storage it has.
    inline JSONView(const JSONValue& inValue) noexcept;

    /// False for the default view, which a look-up gives for a key that is not there.
    bool IsPresent() const noexcept { return mDocument || mValue; }
    inline JSONType Type() const noexcept;
    bool IsNull() const noexcept { return Type() == JSONType::Null; }
    bool IsObject() const noexcept { return Type() == JSONType::Object; }
    bool IsArray() const noexcept { return Type() == JSONType::Array; }
    bool IsString() const noexcept { return Type() == JSONType::String; }
    bool IsBool() const noexcept { return Type() == JSONType::Boolean; }
    bool IsInteger() const noexcept { return Type() == JSONType::Integer || Type() == JSONType::Unsigned; }
    bool IsNumber() const noexcept { return IsInteger() || Type() == JSONType::Double; }

    /// UTF-8, NUL characters included; valid as long as the document or tree.
    inline std::string_view AsString() const;
    ImmutableString AsInternedString() const { return ImmutableString(AsString()); }
    inline bool AsBool() const;
    /// Integers of every width; one that does not fit is a wrong type.
    ZOPLATFORM_EXPORT std::int64_t AsInt64() const;
    ZOPLATFORM_EXPORT std::uint64_t AsUInt64() const;
    ZOPLATFORM_EXPORT std::int32_t AsInt32() const;
    ZOPLATFORM_EXPORT std::uint32_t AsUInt32() const;
    /// Any number; integers are converted to the nearest double.
    ZOPLATFORM_EXPORT double AsDouble() const;

    /// The number of elements or members, duplicate keys counted each. 0 for null and absent values.
    ZOPLATFORM_EXPORT std::size_t Size() const;
    /// The value under a key: the last one when the key is repeated, the absent view when there is none.
    /// An absent or null object has no keys; any other type throws.
    inline JSONView Find(std::string_view inKey) const;

    /// Calls inFunction(string_view key, JSONView value) for each member in source order. Nothing is
    /// allocated. An absent or null object has no members; any other type throws.
    template <class F>
    void ForEachMember(F&& inFunction) const;
    /// Calls inFunction(JSONView element) for each element in order; null and absent as above.
    template <class F>
    void ForEachElement(F&& inFunction) const;

    /// The position in a document, for those who keep positions instead of values. 0 in a tree.
    std::size_t TapeIndex() const noexcept { return mDocument ? mIndex : 0; }
    const JSONDocument* Document() const noexcept { return mDocument; }

private:
    friend class JSONValue;
    static JSONView InTree(const JSONValue& inValue) noexcept {
        JSONView result;
        result.mValue = &inValue;
        return result;
    }
    std::uint64_t Word() const noexcept { return mDocument->Tape()[mIndex]; }
    static std::size_t NextIndex(const std::uint64_t* inTape, std::size_t inIndex) noexcept;
    static std::string_view StringAt(const JSONDocument& inDocument, std::uint64_t inWord) noexcept;
    /// Index behind the last child of a container.
    std::size_t ContainerEnd() const noexcept { return static_cast<std::uint32_t>(Word()) - 1; }

    const JSONDocument* mDocument = nullptr;
    /// With a document the position in it, without one the value in a tree. Two words pass in registers.
    union {
        const JSONValue* mValue = nullptr;
        std::size_t mIndex;
    };
};

/// A JSON value that owns what it shows. Copies are cheap and share storage; to its user it is a plain
/// value: a change through one copy is never seen through another (copy on write, one level at a time).
///
/// Threads: as a shared_ptr. Distinct values may be used and changed from different threads even when they
/// share storage; one value may not be changed while another thread uses it.
class ZOPLATFORM_EXPORT JSONValue {
public:
    using Member = std::pair<std::string, JSONValue>;

    /// null
    JSONValue() noexcept = default;
    JSONValue(std::nullptr_t) noexcept {}
    template <class T, std::enable_if_t<std::is_same<T, bool>::value, int> = 0>
    JSONValue(T inValue) noexcept : mKind(Kind::Boolean), mBits(inValue ? 1 : 0) {}
    template <class T, std::enable_if_t<std::is_integral<T>::value && !std::is_same<T, bool>::value, int> = 0>
    JSONValue(T inValue) noexcept
        : mKind(std::is_signed<T>::value ? Kind::Integer : Kind::Unsigned),
          mBits(static_cast<std::uint64_t>(inValue)) {}
    /// Infinities and NaN have no form in JSON and are written as null.
    JSONValue(double inValue) noexcept : mKind(Kind::Double) { std::memcpy(&mBits, &inValue, sizeof mBits); }
    /// UTF-8; what is not valid becomes U+FFFD when it is written.
    JSONValue(std::string_view inText);
    JSONValue(const char* inText) : JSONValue(std::string_view(inText)) {}
    JSONValue(const std::string& inText) : JSONValue(std::string_view(inText)) {}
    JSONValue(const ImmutableString& inText) : JSONValue(inText.view()) {}
    /// UTF-16; lone surrogates become U+FFFD.
    JSONValue(const UString& inText);
    /// An unset optional is null.
    template <class T>
    JSONValue(const optional<T>& inValue) : JSONValue(inValue ? JSONValue(*inValue) : JSONValue()) {}
    static JSONValue EmptyObject();
    static JSONValue EmptyArray();

    JSONType Type() const noexcept { return JSONView(*this).Type(); }
    bool IsNull() const noexcept { return JSONView(*this).IsNull(); }
    bool IsObject() const noexcept { return JSONView(*this).IsObject(); }
    bool IsArray() const noexcept { return JSONView(*this).IsArray(); }
    bool IsString() const noexcept { return JSONView(*this).IsString(); }
    bool IsBool() const noexcept { return JSONView(*this).IsBool(); }
    bool IsInteger() const noexcept { return JSONView(*this).IsInteger(); }
    bool IsNumber() const noexcept { return JSONView(*this).IsNumber(); }
    /// The view is valid while this value lives and is not changed.
    std::string_view AsString() const { return JSONView(*this).AsString(); }
    ImmutableString AsInternedString() const { return JSONView(*this).AsInternedString(); }
    bool AsBool() const { return JSONView(*this).AsBool(); }
    std::int64_t AsInt64() const { return JSONView(*this).AsInt64(); }
    std::uint64_t AsUInt64() const { return JSONView(*this).AsUInt64(); }
    double AsDouble() const { return JSONView(*this).AsDouble(); }
    std::size_t Size() const { return JSONView(*this).Size(); }

    /// The owning form of a view into this value's own storage.
    JSONValue Own(JSONView inPart) const;
    /// The value at a position of this value's document (JSONView::TapeIndex). Only for parsed values.
    JSONValue AtTapeIndex(std::size_t inIndex) const noexcept;
    /// True for a value that lies in a parsed document and was not changed since.
    bool IsParsed() const noexcept { return mKind == Kind::Parsed; }
    /// True when both share one storage, so that equality needs no look.
    bool IsSameAs(const JSONValue& inOther) const noexcept {
        return mKind == inOther.mKind && mBits == inOther.mBits && mHolder == inOther.mHolder;
    }

    /// The value of a whole parsed document.
    static JSONValue FromDocument(intrusive_ptr<const JSONDocument> inDocument) noexcept;

private:
    friend class JSONView;
    friend class JSONTreeAccess;
    enum class Kind : std::uint8_t {
        Null,
        Boolean,
        Integer,
        Unsigned,
        Double,
        String,
        Array,
        Object,
        Parsed
    };

    struct StringNode;
    struct ArrayNode;
    struct ObjectNode;
    const JSONDocument& Document() const noexcept { return static_cast<const JSONDocument&>(*mHolder); }
    static std::string_view TreeString(const JSONValue& inValue) noexcept;
    static const std::vector<JSONValue>& TreeElements(const JSONValue& inValue) noexcept;
    static const std::vector<Member>& TreeMembers(const JSONValue& inValue) noexcept;

    Kind mKind = Kind::Null;
    /// Number, truth value or index in the document, by kind.
    std::uint64_t mBits = 0;
    intrusive_ptr<const JSONShared> mHolder;
};

/// Parses one JSON text (RFC 8259) in place. A UTF-8 byte order mark before it is skipped. When a key is
/// repeated in an object, the last value counts.
/// Throws std::runtime_error for anything that is not exactly one well-formed text: empty or cut input, bad
/// UTF-8, unpaired surrogate escapes, nesting beyond kJSONMaximumDepth, a number that neither a 64-bit
/// integer nor a finite double can hold. The error text names the fault and never quotes the input.
ZOPLATFORM_EXPORT JSONValue JSONParse(const shared_ptr<RecycledMemory const>& inBytes);
ZOPLATFORM_EXPORT JSONValue JSONParse(std::string_view inText);

/// The value under a key, null when absent. A null object has no keys. Throws boost::bad_any_cast when
/// inObject is neither object nor null.
ZOPLATFORM_EXPORT JSONValue GetVariantInObject(const JSONValue& inObject, std::string_view inKey);
/// True when the key is there, with whatever value, null included. False for what is no object.
ZOPLATFORM_EXPORT bool ObjectHasProperty(const JSONValue& inObject, std::string_view inKey);

/// Puts a value under a key: in place of the former value, else behind the last key. A null ioObject becomes
/// an object. All other members stay as they were read, known or not. Throws boost::bad_any_cast when
/// ioObject is neither object nor null. The cost grows with the number of members.
ZOPLATFORM_EXPORT void AddToObject(JSONValue& ioObject, std::string_view inKey, JSONValue inValue);
/// Takes a key out of an object; nothing happens when it is not there.
ZOPLATFORM_EXPORT void RemoveFromObject(JSONValue& ioObject, std::string_view inKey);
/// Adds an element at the end. A null ioArray becomes an array; otherwise as AddToObject.
ZOPLATFORM_EXPORT void AppendToArray(JSONValue& ioArray, JSONValue inValue);

/// JSON text without white space, keys in their order. Integers are exact, doubles are the shortest text
/// that reads back as the same double; invalid UTF-8 becomes U+FFFD. Throws std::runtime_error when the
/// nesting exceeds kJSONMaximumDepth.
ZOPLATFORM_EXPORT std::string GetJSONUTF8String(const JSONValue& inValue);
ZOPLATFORM_EXPORT UString GetJSONString(const JSONValue& inValue);

/// The value inside the envelope of the serialiser: the one under "SerializerWrappedObject" when the root is
/// an object that has this key, else the root itself. One envelope is taken off, not more.
ZOPLATFORM_EXPORT JSONValue UnwrapSerializerObject(const JSONValue& inRoot);

// ---- What follows is inlined for speed. --------------------------------------------------------------

struct JSONValue::StringNode : JSONShared {
    std::string text;
};
struct JSONValue::ArrayNode : JSONShared {
    std::vector<JSONValue> elements;
};
struct JSONValue::ObjectNode : JSONShared {
    std::vector<Member> members;
};

inline std::string_view JSONValue::TreeString(const JSONValue& inValue) noexcept {
    return static_cast<const StringNode&>(*inValue.mHolder).text;
}
inline const std::vector<JSONValue>& JSONValue::TreeElements(const JSONValue& inValue) noexcept {
    return static_cast<const ArrayNode&>(*inValue.mHolder).elements;
}
inline const std::vector<JSONValue::Member>& JSONValue::TreeMembers(const JSONValue& inValue) noexcept {
    return static_cast<const ObjectNode&>(*inValue.mHolder).members;
}

inline JSONView::JSONView(const JSONValue& inValue) noexcept {
    if (inValue.mKind == JSONValue::Kind::Parsed) {
        mDocument = &inValue.Document();
        mIndex = static_cast<std::size_t>(inValue.mBits);
    } else {
        mValue = &inValue;
    }
}

inline JSONType JSONView::Type() const noexcept {
    if (!mDocument) {
        return mValue ? static_cast<JSONType>(mValue->mKind) : JSONType::Null;
    }
    switch (static_cast<char>(Word() >> 56)) {
        case '"':
            return JSONType::String;
        case '{':
            return JSONType::Object;
        case '[':
            return JSONType::Array;
        case 'l':
            return JSONType::Integer;
        case 'u':
            return JSONType::Unsigned;
        case 'd':
            return JSONType::Double;
        case 't':
        case 'f':
            return JSONType::Boolean;
        default:
            return JSONType::Null;
    }
}

inline std::string_view JSONView::StringAt(const JSONDocument& inDocument, std::uint64_t inWord) noexcept {
    const std::uint8_t* start = inDocument.Strings() + (inWord & 0x00FFFFFFFFFFFFFFull);
    std::uint32_t size;
    std::memcpy(&size, start, sizeof size);
    return {reinterpret_cast<const char*>(start) + sizeof size, size};
}

inline std::size_t JSONView::NextIndex(const std::uint64_t* inTape, std::size_t inIndex) noexcept {
    const std::uint64_t word = inTape[inIndex];
    switch (static_cast<char>(word >> 56)) {
        case '{':
        case '[':
            return static_cast<std::uint32_t>(word);
        case 'l':
        case 'u':
        case 'd':
            return inIndex + 2;
        default:
            return inIndex + 1;
    }
}

inline std::string_view JSONView::AsString() const {
    if (mDocument) {
        const std::uint64_t word = Word();
        if (static_cast<char>(word >> 56) == '"') {
            return StringAt(*mDocument, word);
        }
    } else if (mValue && mValue->mKind == JSONValue::Kind::String) {
        return JSONValue::TreeString(*mValue);
    }
    ThrowWrongJSONType();
}

inline bool JSONView::AsBool() const {
    if (mDocument) {
        const char kind = static_cast<char>(Word() >> 56);
        if (kind == 't' || kind == 'f') {
            return kind == 't';
        }
    } else if (mValue && mValue->mKind == JSONValue::Kind::Boolean) {
        return mValue->mBits != 0;
    }
    ThrowWrongJSONType();
}

template <class F>
void JSONView::ForEachMember(F&& inFunction) const {
    const JSONType type = Type();
    if (type == JSONType::Null) {
        return;
    }
    if (type != JSONType::Object) {
        ThrowWrongJSONType();
    }
    if (!mDocument) {
        for (const JSONValue::Member& member : JSONValue::TreeMembers(*mValue)) {
            inFunction(std::string_view(member.first), JSONView(member.second));
        }
        return;
    }
    const std::uint64_t* tape = mDocument->Tape();
    const std::size_t end = ContainerEnd();
    for (std::size_t index = mIndex + 1; index < end; index = NextIndex(tape, index + 1)) {
        inFunction(StringAt(*mDocument, tape[index]), JSONView(*mDocument, index + 1));
    }
}

template <class F>
void JSONView::ForEachElement(F&& inFunction) const {
    const JSONType type = Type();
    if (type == JSONType::Null) {
        return;
    }
    if (type != JSONType::Array) {
        ThrowWrongJSONType();
    }
    if (!mDocument) {
        for (const JSONValue& element : JSONValue::TreeElements(*mValue)) {
            inFunction(JSONView(element));
        }
        return;
    }
    const std::uint64_t* tape = mDocument->Tape();
    const std::size_t end = ContainerEnd();
    for (std::size_t index = mIndex + 1; index < end; index = NextIndex(tape, index)) {
        inFunction(JSONView(*mDocument, index));
    }
}

inline JSONView JSONView::Find(std::string_view inKey) const {
    JSONView found;
    ForEachMember([&](std::string_view inName, JSONView inValue) {
        if (inName.size() == inKey.size() && std::memcmp(inName.data(), inKey.data(), inKey.size()) == 0) {
            found = inValue;
        }
    });
    return found;
}

}  // namespace serialization
}  // namespace ostcore
