// Checks a whole body against a table of keys and types in one pass, so that transfer structures can be thin
// handles on the parsed document whose fields are read when they are asked for.
//
// How a transfer structure is written with it:
//
//     struct Enclosure : BoundObject {
//         static const BindingTable& Table() {
//             static const BindingTable table{{"zo:etag", BindingKind::OptionalString},
//                                             {"name", BindingKind::MandatoryString},
//                                             {"links", BindingKind::ObjectList, &Link::Table}};
//             return table;
//         }
//         Enclosure() = default;
//         explicit Enclosure(const JSONValue& inBody) : BoundObject(inBody, Table()) {}
//         Enclosure(const JSONValue& inBody, AlreadyChecked inTag) : BoundObject(inBody, inTag) {}
//
//         ImmutableString Name() const { return String("name"); }
//     };
//     struct ContainedEnclosures : BoundObject {
//         ... {"enclosures", BindingKind::ObjectList, &Enclosure::Table} ...
//         BoundList<Enclosure> Enclosures() const { return List<Enclosure>("enclosures"); }
//     };
//
// The public constructor checks the structure and everything below it and throws at the first wrong type;
// what lies below is then handed out as AlreadyChecked and never looked at twice. Keys that the table does
// not name are passed over, whatever they hold, and stay in the body.
#pragma once

#include <cstdint>
#include <initializer_list>
#include <mutex>
#include <string_view>
#include <utility>
#include <vector>

#include "ostcore/serialization/JSON.h"
#include "ostcore/serialization/JSONReaders.h"

namespace ostcore {
namespace serialization {

/// What a key may hold. Null passes for every kind but MandatoryString.
enum class BindingKind : std::uint8_t {
    MandatoryString,
    OptionalString,
    Boolean,
    /// An integer that fits in 64 bits with sign; every other number is refused.
    Integer,
    /// As Integer, for fields of 32 bits.
    Integer32,
    /// Any number.
    Number,
    /// A string that ParseDate takes; a malformed one throws std::runtime_error.
    Date,
    StringList,
    /// {"ticks": integer}
    TickTime,
    /// An object; checked by the nested table when there is one.
    Object,
    /// An array of objects, each checked by the nested table when there is one.
    ObjectList,
    /// Passed over: what a structure keeps without reading it.
    Any
};

class BindingTable;

/// One key of a table. The nested table is named by function, so that tables may refer to each other and to
/// themselves.
struct BindingField {
    BindingField(std::string_view inKey, BindingKind inKind,
                 const BindingTable& (*inNested)() = nullptr) noexcept
        : key(inKey), kind(inKind), nested(inNested) {}
    /// A literal; at most 255 bytes.
    std::string_view key;
    BindingKind kind;
    const BindingTable& (*nested)();
};

/// The keys of one transfer structure, made once and kept for the run of the process.
/// Threads: any.
class ZOPLATFORM_EXPORT BindingTable {
public:
    /// Throws std::logic_error for a key that is given twice or more than 64 keys.
    BindingTable(std::initializer_list<BindingField> inFields);

    /// Checks an object and all that the nested tables reach. An absent or null object passes.
    /// Throws boost::bad_any_cast for a value of the wrong type, std::runtime_error for a malformed date.
    /// Records nothing and allocates nothing.
    void Check(JSONView inObject) const;

private:
    static constexpr std::size_t kSlots = 128;
    static std::size_t Slot(std::string_view inKey) noexcept {
        // Length, first, last and middle byte tell the keys of one structure apart nearly always.
        const std::size_t size = inKey.size();
        const auto byte = [&](std::size_t inAt) {
            return static_cast<std::size_t>(static_cast<unsigned char>(inKey[inAt]));
        };
        return size == 0 ? 0 : (size + byte(0) * 7 + byte(size - 1) * 31 + byte(size / 2) * 13) % kSlots;
    }
    const BindingField* FindField(std::string_view inKey, std::size_t& ioHint) const noexcept;
    static void CheckValue(const BindingField& inField, JSONView inValue);

    std::vector<BindingField> mFields;
    /// For each slot the position plus one of a field, 0 when none; collisions go on in the next slots.
    std::uint8_t mSlots[kSlots] = {};
};

/// Tells a constructor that the body was checked with a structure around it.
struct AlreadyChecked {};

template <class T>
class BoundList;

/// The base of transfer structures: a handle on a checked object. Copies are cheap and share the document.
/// The default one has no keys, so every field reads as its default.
///
/// Readers cost one walk over the keys of the object; who needs a field in a loop keeps it. They do not
/// throw, since the table has seen every value, unless a key is read as another kind than the table says.
/// Threads: as JSONValue.
class BoundObject {
public:
    BoundObject() = default;
    BoundObject(const JSONValue& inBody, const BindingTable& inTable) : mBody(inBody) {
        inTable.Check(mBody);
    }
    BoundObject(const JSONValue& inBody, AlreadyChecked) noexcept : mBody(inBody) {}

    /// The object as it was read, unknown keys included.
    const JSONValue& Body() const noexcept { return mBody; }
    bool Has(std::string_view inKey) const { return JSONView(mBody).Find(inKey).IsPresent(); }

    /// The null string when the key is absent or null.
    ImmutableString String(std::string_view inKey) const {
        ImmutableString result;
        ReadOptionalString(mBody, inKey, result);
        return result;
    }
    /// Two spellings of one field: the second wins when both are there.
    ImmutableString String(std::string_view inFirstKey, std::string_view inSecondKey) const {
        ImmutableString result;
        ReadOptionalString(mBody, inFirstKey, result);
        ReadOptionalString(mBody, inSecondKey, result);
        return result;
    }
    /// The text itself, without interning; valid while this structure or a copy of it lives unchanged.
    std::string_view Text(std::string_view inKey) const {
        const JSONView value = JSONView(mBody).Find(inKey);
        return value.IsNull() ? std::string_view() : value.AsString();
    }
    bool Boolean(std::string_view inKey, bool inDefault) const {
        ReadOptionalBoolean(mBody, inKey, inDefault);
        return inDefault;
    }
    optional<bool> OptionalBoolean(std::string_view inKey) const {
        optional<bool> result;
        ReadOptionalBoolean(mBody, inKey, result);
        return result;
    }
    std::int64_t Integer(std::string_view inKey, std::int64_t inDefault = 0) const {
        ReadOptionalInt64(mBody, inKey, inDefault);
        return inDefault;
    }
    double Number(std::string_view inKey, double inDefault = 0) const {
        ReadOptionalDouble(mBody, inKey, inDefault);
        return inDefault;
    }
    ptime Date(std::string_view inKey) const {
        ptime result;
        ReadOptionalDate(mBody, inKey, result);
        return result;
    }
    std::int64_t Ticks(std::string_view inKey, std::int64_t inDefault = 0) const {
        return ReadTicks(mBody, inKey, inDefault);
    }
    std::vector<ImmutableString> Strings(std::string_view inKey) const {
        std::vector<ImmutableString> result;
        ReadOptionalStringList(mBody, inKey, result);
        return result;
    }
    /// The object under a key, null when there is none.
    JSONValue Object(std::string_view inKey) const { return mBody.Own(ReadObject(mBody, inKey)); }
    /// The object under a key as a transfer structure, the default one when there is none.
    template <class T>
    T Structure(std::string_view inKey) const {
        return T(Object(inKey), AlreadyChecked());
    }
    template <class T>
    BoundList<T> List(std::string_view inKey) const {
        return BoundList<T>(mBody.Own(ReadList(mBody, inKey)));
    }

protected:
    /// For structures that are written to: AddToObject on it changes this structure and no copy of it.
    JSONValue& MutableBody() noexcept { return mBody; }

private:
    JSONValue mBody;
};

/// A list of checked objects. It finds its elements when it is first asked for one, and makes a structure
/// each time one is asked for. Copies share what was found.
/// Threads: any; the first look is serialised.
template <class T>
class BoundList {
public:
    BoundList() = default;
    /// inList is a checked array, or null for the empty list.
    explicit BoundList(const JSONValue& inList)
        : mState(inList.IsNull() ? nullptr : boost::make_shared<State>(inList)) {}

    std::size_t size() const { return mState ? mState->Find().size() : 0; }
    bool empty() const { return size() == 0; }
    /// inPosition is below size().
    T operator[](std::size_t inPosition) const {
        return T(mState->list.Own(mState->Find()[inPosition]), AlreadyChecked());
    }
    const JSONValue& Body() const {
        static const JSONValue none;
        return mState ? mState->list : none;
    }

    class Iterator {
    public:
        Iterator(const BoundList& inList, std::size_t inPosition) : mList(&inList), mPosition(inPosition) {}
        T operator*() const { return (*mList)[mPosition]; }
        Iterator& operator++() {
            ++mPosition;
            return *this;
        }
        friend bool operator!=(const Iterator& inLeft, const Iterator& inRight) {
            return inLeft.mPosition != inRight.mPosition;
        }
        friend bool operator==(const Iterator& inLeft, const Iterator& inRight) {
            return !(inLeft != inRight);
        }

    private:
        const BoundList* mList;
        std::size_t mPosition;
    };
    Iterator begin() const { return Iterator(*this, 0); }
    Iterator end() const { return Iterator(*this, size()); }

private:
    struct State {
        explicit State(const JSONValue& inList) : list(inList) {}
        const std::vector<JSONView>& Find() const {
            std::call_once(once, [this] {
                JSONView(list).ForEachElement([this](JSONView inElement) { elements.push_back(inElement); });
            });
            return elements;
        }
        const JSONValue list;
        mutable std::once_flag once;
        mutable std::vector<JSONView> elements;
    };
    shared_ptr<State> mState;
};

}  // namespace serialization
}  // namespace ostcore
