// The data model of XMP (ISO 16684-1): expanded names, immutable nodes that trees share, and the packet.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/utility/ImmutableString.h"

namespace OrvaneXMP {

using ostcore::utility::ImmutableString;

/// Nodes are nested no deeper than this, the root and the qualifiers counted, so that a walk may recurse.
constexpr std::size_t kMaximumDepth = 256;
/// No packet that is read or written is larger, in bytes of UTF-8.
constexpr std::size_t kMaximumPacketSize = 16u << 20;
/// No packet that is read or written has more nodes.
constexpr std::size_t kMaximumNodeCount = 250000;

class NodeFactory;
struct Field;

/// An expanded name: the URI of a namespace and a name in it. Interned, so a copy and a comparison cost one
/// word. The default name is the empty one.
class ZOPLATFORM_EXPORT Name {
public:
    Name() noexcept = default;
    /// Throws std::invalid_argument unless the URI is not empty and free of white space and control
    /// characters, and the local name is one of XML without a colon.
    Name(std::string_view inNamespaceURI, std::string_view inLocalName);

    bool empty() const noexcept { return mText.empty(); }
    /// The URI, a space, the local name; valid as long as any equal name lives.
    std::string_view Text() const noexcept { return mText.view(); }
    std::string_view NamespaceURI() const noexcept;
    std::string_view LocalName() const noexcept;
    std::size_t Hash() const noexcept { return mText.Hash(); }

    friend bool operator==(const Name& inLeft, const Name& inRight) noexcept {
        return inLeft.mText == inRight.mText;
    }
    friend bool operator!=(const Name& inLeft, const Name& inRight) noexcept {
        return inLeft.mText != inRight.mText;
    }
    /// By URI, then by local name, byte for byte: the order of fields in a node and in what is written.
    friend bool operator<(const Name& inLeft, const Name& inRight) noexcept {
        return inLeft.mText != inRight.mText && inLeft.Text() < inRight.Text();
    }

private:
    friend class NodeFactory;
    explicit Name(ImmutableString inText) noexcept : mText(std::move(inText)) {}

    ImmutableString mText;
};

struct NameHash {
    std::size_t operator()(const Name& inName) const noexcept { return inName.Hash(); }
};

/// A row of fields or items, looked at in place; valid as long as the node that gave it.
template <class T>
class Range {
public:
    Range() noexcept = default;
    Range(const T* inFirst, std::size_t inSize) noexcept : mFirst(inFirst), mSize(inSize) {}
    const T* begin() const noexcept { return mFirst; }
    inline const T* end() const noexcept;
    std::size_t size() const noexcept { return mSize; }
    bool empty() const noexcept { return mSize == 0; }
    /// inIndex is below size().
    inline const T& operator[](std::size_t inIndex) const noexcept;

private:
    const T* mFirst = nullptr;
    std::size_t mSize = 0;
};

/// Text and URI are simple values; the last three are arrays.
enum class Kind : std::uint8_t { Text, URI, Structure, Unordered, Ordered, Alternative };

/// A value of the data model with its qualifiers. Immutable: a copy shares storage and costs a counted
/// reference, and a changed tree shares with the former one whatever was not changed. The default node is
/// absent; it stands for a property that is not there.
///
/// Fields and qualifiers are kept sorted by name, each name once. A language is the qualifier xml:lang, which
/// is a text without qualifiers.
///
/// Threads: as a shared_ptr to a constant.
class ZOPLATFORM_EXPORT Node {
public:
    Node() noexcept = default;
    Node(const Node& inOther) noexcept : mData(inOther.mData) { Retain(); }
    Node(Node&& inOther) noexcept : mData(inOther.mData) { inOther.mData = nullptr; }
    Node& operator=(Node inOther) noexcept {
        std::swap(mData, inOther.mData);
        return *this;
    }
    ~Node() { Release(); }

    /// The factories throw std::invalid_argument for what no packet can hold (text that is not UTF-8 or has
    /// characters that XML refuses, an absent item or field, a name given twice, a name that RDF keeps for
    /// itself; rdf:type is allowed), and std::length_error beyond the limits above.
    static Node Text(std::string_view inText);
    static Node URI(std::string_view inURI);
    static Node Structure(std::vector<Field> inFields);
    /// inKind is one of the three kinds of arrays.
    static Node Array(Kind inKind, std::vector<Node> inItems);
    /// The same value with exactly these qualifiers. As the factories; rdf:datatype is allowed on texts, and
    /// like xml:lang it is a text without qualifiers.
    Node WithQualifiers(std::vector<Field> inQualifiers) const;
    /// The node with one field or qualifier set or, if inNode is absent, taken out. WithField throws
    /// std::invalid_argument for what is no structure.
    Node WithField(const Name& inName, const Node& inNode) const;
    Node WithQualifier(const Name& inName, const Node& inNode) const;

    bool IsPresent() const noexcept { return mData != nullptr; }
    /// Of a present node.
    Kind GetKind() const noexcept { return mData->kind; }
    bool IsSimple() const noexcept { return IsPresent() && GetKind() <= Kind::URI; }
    bool IsStructure() const noexcept { return IsPresent() && GetKind() == Kind::Structure; }
    bool IsArray() const noexcept { return IsPresent() && GetKind() >= Kind::Unordered; }
    /// An alternative array of texts in distinct languages, one of them x-default. The order of its items
    /// says nothing.
    bool IsLanguageAlternative() const;
    /// How many nodes stand above each other, this one counted; 0 of an absent node.
    std::size_t Height() const noexcept { return mData ? mData->height : 0; }

    /// Of a simple node, empty for others. UTF-8; valid as long as any node that shares the storage.
    inline std::string_view Value() const noexcept;
    /// Empty for whatever has none.
    inline Range<Field> Fields() const noexcept;
    inline Range<Node> Items() const noexcept;
    inline Range<Field> Qualifiers() const noexcept;
    /// The field or qualifier of a name, an absent node when there is none.
    const Node& FieldNamed(const Name& inName) const noexcept;
    const Node& QualifierNamed(const Name& inName) const noexcept;

    /// True when both are one storage, or both are absent.
    bool IsSameAs(const Node& inOther) const noexcept { return mData == inOther.mData; }
    /// Equal in kind, value and qualifiers; unordered arrays and language alternatives in any order, each
    /// item as often. Texts are compared byte for byte. Near linear in the smaller tree.
    friend bool operator==(const Node& inLeft, const Node& inRight) {
        return inLeft.mData == inRight.mData || AreEqual(inLeft, inRight);
    }
    friend bool operator!=(const Node& inLeft, const Node& inRight) { return !(inLeft == inRight); }
    /// Equal nodes have equal hashes, within one run of the process.
    std::size_t Hash() const;

private:
    friend class NodeFactory;
    /// Behind it in one allocation: the qualifiers, then the fields, the items or the bytes of the value.
    struct Data {
        mutable std::atomic<std::uint32_t> count;
        Kind kind;
        std::uint16_t height;
        std::uint32_t size;
        std::uint32_t qualifierCount;
    };

    static bool AreEqual(const Node& inLeft, const Node& inRight);
    static void Destroy(const Data* inData) noexcept;
    inline const Field* FirstQualifier() const noexcept;
    inline const void* Content() const noexcept;
    void Retain() const noexcept {
        if (mData) {
            mData->count.fetch_add(1, std::memory_order_relaxed);
        }
    }
    void Release() const noexcept {
        // Who holds the only reference need not take it back in one step: nobody else can copy it.
        if (mData && (mData->count.load(std::memory_order_acquire) == 1 ||
                      mData->count.fetch_sub(1, std::memory_order_acq_rel) == 1)) {
            Destroy(mData);
        }
    }

    const Data* mData = nullptr;
};

/// A named node: a property, a field of a structure, or a qualifier.
struct Field {
    Name name;
    Node node;
};

/// A prefix that a packet used for a namespace. It means nothing, and is kept for people who read packets.
struct Prefix {
    std::string uri;
    std::string prefix;
};

/// What a packet says about one resource.
struct Packet {
    /// The properties: the fields of a structure without qualifiers.
    Node properties = Node::Structure({});
    /// The URI of what is described, most often empty.
    std::string about;
    /// In the order in which they were met.
    std::vector<Prefix> prefixes;

    const Node& Property(const Name& inName) const noexcept { return properties.FieldNamed(inName); }
};

/// Equal properties of the same resource; prefixes do not count.
inline bool operator==(const Packet& inLeft, const Packet& inRight) {
    return inLeft.about == inRight.about && inLeft.properties == inRight.properties;
}
inline bool operator!=(const Packet& inLeft, const Packet& inRight) {
    return !(inLeft == inRight);
}

// ---- What follows is inlined for speed. --------------------------------------------------------------

template <class T>
inline const T* Range<T>::end() const noexcept {
    return mFirst + mSize;
}

template <class T>
inline const T& Range<T>::operator[](std::size_t inIndex) const noexcept {
    return mFirst[inIndex];
}

inline const Field* Node::FirstQualifier() const noexcept {
    return reinterpret_cast<const Field*>(mData + 1);
}

inline const void* Node::Content() const noexcept {
    return FirstQualifier() + mData->qualifierCount;
}

inline std::string_view Node::Value() const noexcept {
    return IsSimple() ? std::string_view(static_cast<const char*>(Content()), mData->size)
                      : std::string_view();
}

inline Range<Field> Node::Fields() const noexcept {
    return IsStructure() ? Range<Field>(static_cast<const Field*>(Content()), mData->size) : Range<Field>();
}

inline Range<Node> Node::Items() const noexcept {
    return IsArray() ? Range<Node>(static_cast<const Node*>(Content()), mData->size) : Range<Node>();
}

inline Range<Field> Node::Qualifiers() const noexcept {
    return mData ? Range<Field>(FirstQualifier(), mData->qualifierCount) : Range<Field>();
}

}  // namespace OrvaneXMP
