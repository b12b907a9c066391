// Values: conversions of numbers, and the tree with its copy on write.
#include "ostcore/serialization/JSON.h"

#include <limits>
#include <unordered_map>

#include "ostcore/utility/StringConversion.h"

namespace ostcore {
namespace serialization {

/// Reaches into a value to change its tree.
class JSONTreeAccess {
public:
    using Kind = JSONValue::Kind;
    using ObjectNode = JSONValue::ObjectNode;
    using ArrayNode = JSONValue::ArrayNode;
    using StringNode = JSONValue::StringNode;

    static JSONValue Make(Kind inKind, intrusive_ptr<const JSONShared> inHolder) noexcept {
        JSONValue result;
        result.mKind = inKind;
        result.mHolder = std::move(inHolder);
        return result;
    }

    static std::vector<JSONValue::Member>& MutableMembers(JSONValue& ioObject) {
        if (ioObject.mKind != Kind::Object || !ioObject.mHolder->IsUnique()) {
            ioObject = Make(Kind::Object, CopyObject(ioObject));
        }
        return const_cast<ObjectNode&>(static_cast<const ObjectNode&>(*ioObject.mHolder)).members;
    }

    static std::vector<JSONValue>& MutableElements(JSONValue& ioArray) {
        if (ioArray.mKind != Kind::Array || !ioArray.mHolder->IsUnique()) {
            intrusive_ptr<ArrayNode> copy(new ArrayNode);
            JSONView(ioArray).ForEachElement(
                [&](JSONView inElement) { copy->elements.push_back(ioArray.Own(inElement)); });
            ioArray = Make(Kind::Array, std::move(copy));
        }
        return const_cast<ArrayNode&>(static_cast<const ArrayNode&>(*ioArray.mHolder)).elements;
    }

private:
    static intrusive_ptr<ObjectNode> CopyObject(const JSONValue& inObject) {
        intrusive_ptr<ObjectNode> copy(new ObjectNode);
        std::unordered_map<std::string_view, std::size_t> positions;
        JSONView(inObject).ForEachMember([&](std::string_view inKey, JSONView inValue) {
            const auto [place, isNew] = positions.emplace(inKey, copy->members.size());
            if (isNew) {
                copy->members.emplace_back(std::string(inKey), inObject.Own(inValue));
            } else {
                copy->members[place->second].second = inObject.Own(inValue);
            }
        });
        return copy;
    }
};

namespace {

std::vector<JSONValue::Member>::iterator FindMember(std::vector<JSONValue::Member>& ioMembers,
                                                    std::string_view inKey) {
    return std::find_if(ioMembers.begin(), ioMembers.end(),
                        [&](const JSONValue::Member& inMember) { return inMember.first == inKey; });
}

}  // namespace

void ThrowWrongJSONType() {
    boost::throw_exception(bad_any_cast());
}

JSONShared::~JSONShared() = default;

JSONValue::JSONValue(std::string_view inText) : mKind(Kind::String) {
    intrusive_ptr<StringNode> node(new StringNode);
    node->text = inText;
    mHolder = std::move(node);
}

JSONValue::JSONValue(const UString& inText) : JSONValue(utility::ToUTF8(inText)) {}

JSONValue JSONValue::EmptyObject() {
    return JSONTreeAccess::Make(Kind::Object, intrusive_ptr<const JSONShared>(new ObjectNode));
}

JSONValue JSONValue::EmptyArray() {
    return JSONTreeAccess::Make(Kind::Array, intrusive_ptr<const JSONShared>(new ArrayNode));
}

JSONValue JSONValue::FromDocument(intrusive_ptr<const JSONDocument> inDocument) noexcept {
    JSONValue result = JSONTreeAccess::Make(Kind::Parsed, std::move(inDocument));
    result.mBits = 1;
    return result;
}

JSONValue JSONValue::Own(JSONView inPart) const {
    if (!inPart.IsPresent()) {
        return JSONValue();
    }
    if (!inPart.mDocument) {
        return *inPart.mValue;
    }
    // The part of a tree can lie in a document of its own.
    JSONValue result = JSONTreeAccess::Make(Kind::Parsed, intrusive_ptr<const JSONShared>(inPart.mDocument));
    result.mBits = inPart.mIndex;
    return result;
}

JSONValue JSONValue::AtTapeIndex(std::size_t inIndex) const noexcept {
    JSONValue result(*this);
    result.mBits = inIndex;
    return result;
}

std::int64_t JSONView::AsInt64() const {
    const JSONType type = Type();
    if (type != JSONType::Integer && type != JSONType::Unsigned) {
        ThrowWrongJSONType();
    }
    const std::uint64_t bits = mDocument ? mDocument->Tape()[mIndex + 1] : mValue->mBits;
    if (type == JSONType::Unsigned &&
        bits > static_cast<std::uint64_t>(std::numeric_limits<std::int64_t>::max())) {
        ThrowWrongJSONType();
    }
    return static_cast<std::int64_t>(bits);
}

std::uint64_t JSONView::AsUInt64() const {
    if (Type() == JSONType::Unsigned) {
        return mDocument ? mDocument->Tape()[mIndex + 1] : mValue->mBits;
    }
    const std::int64_t value = AsInt64();
    if (value < 0) {
        ThrowWrongJSONType();
    }
    return static_cast<std::uint64_t>(value);
}

std::int32_t JSONView::AsInt32() const {
    const std::int64_t value = AsInt64();
    if (value < std::numeric_limits<std::int32_t>::min() ||
        value > std::numeric_limits<std::int32_t>::max()) {
        ThrowWrongJSONType();
    }
    return static_cast<std::int32_t>(value);
}

std::uint32_t JSONView::AsUInt32() const {
    const std::uint64_t value = AsUInt64();
    if (value > std::numeric_limits<std::uint32_t>::max()) {
        ThrowWrongJSONType();
    }
    return static_cast<std::uint32_t>(value);
}

double JSONView::AsDouble() const {
    switch (Type()) {
        case JSONType::Integer:
            return static_cast<double>(AsInt64());
        case JSONType::Unsigned:
            return static_cast<double>(AsUInt64());
        case JSONType::Double: {
            const std::uint64_t bits = mDocument ? mDocument->Tape()[mIndex + 1] : mValue->mBits;
            double value;
            std::memcpy(&value, &bits, sizeof value);
            return value;
        }
        default:
            ThrowWrongJSONType();
    }
}

std::size_t JSONView::Size() const {
    std::size_t size = 0;
    if (Type() == JSONType::Object) {
        ForEachMember([&](std::string_view, JSONView) { ++size; });
    } else {
        ForEachElement([&](JSONView) { ++size; });
    }
    return size;
}

JSONValue GetVariantInObject(const JSONValue& inObject, std::string_view inKey) {
    return inObject.Own(JSONView(inObject).Find(inKey));
}

bool ObjectHasProperty(const JSONValue& inObject, std::string_view inKey) {
    return inObject.IsObject() && JSONView(inObject).Find(inKey).IsPresent();
}

void AddToObject(JSONValue& ioObject, std::string_view inKey, JSONValue inValue) {
    auto& members = JSONTreeAccess::MutableMembers(ioObject);
    const auto found = FindMember(members, inKey);
    if (found != members.end()) {
        found->second = std::move(inValue);
    } else {
        members.emplace_back(std::string(inKey), std::move(inValue));
    }
}

void RemoveFromObject(JSONValue& ioObject, std::string_view inKey) {
    if (!JSONView(ioObject).Find(inKey).IsPresent()) {
        return;
    }
    auto& members = JSONTreeAccess::MutableMembers(ioObject);
    members.erase(FindMember(members, inKey));
}

void AppendToArray(JSONValue& ioArray, JSONValue inValue) {
    JSONTreeAccess::MutableElements(ioArray).push_back(std::move(inValue));
}

JSONValue UnwrapSerializerObject(const JSONValue& inRoot) {
    constexpr std::string_view kWrapperKey = "SerializerWrappedObject";
    return ObjectHasProperty(inRoot, kWrapperKey) ? GetVariantInObject(inRoot, kWrapperKey) : inRoot;
}

}  // namespace serialization
}  // namespace ostcore
