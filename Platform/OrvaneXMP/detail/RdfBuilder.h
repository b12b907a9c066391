// Builds the tree of a packet from the events of an XML parser.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <unordered_set>
#include <vector>

#include "OrvaneXMP/detail/Terms.h"
#include "OrvaneXMP/Tree.h"

namespace OrvaneXMP {

/// Nothing here recurses: open elements are frames on a stack, and the fields, items and texts of all open
/// elements lie on three more, each frame knowing where its own begin. Every operation throws Refusal for
/// what the data model cannot hold.
class RdfBuilder {
public:
    using AttributeList = const std::vector<Attribute>&;

    /// inTerms outlives this.
    explicit RdfBuilder(Terms& inTerms);

    void StartElement(const KnownName& inName, AttributeList inAttributes);
    void EndElement();
    void Characters(std::string_view inText);
    void DeclarePrefix(std::string_view inPrefix, std::string_view inURI);
    bool IsInside() const noexcept { return !mFrames.empty(); }
    /// After the end of the document.
    Packet Take() { return std::move(mPacket); }

private:
    /// Meta and RDF wrap; a subject is what the packet describes; a property holds one value, which is text,
    /// or lies in a structure or container of its own.
    enum class Role : std::uint8_t { Meta, RDF, Subject, Property, Structure, Container };
    /// How the value of a property is given. It is text until something else shows.
    enum class Form : std::uint8_t { Text, Element, FieldsInside, FieldsInTag, Reference };

    struct Item {
        std::uint32_t number;
        Node node;
    };

    struct Frame {
        Role role = Role::Meta;
        Form form = Form::Text;
        Kind arrayKind = Kind::Unordered;
        bool hasChild = false;
        /// Of a property: its name, or as an item its number, which is 0 for a field.
        std::uint32_t number = 0;
        /// Of a container: the number of the last rdf:li.
        std::uint32_t counted = 0;
        Name name;
        Node language;
        Node datatype;
        Node value;
        std::size_t firstField = 0;
        std::size_t firstItem = 0;
        std::size_t textStart = 0;
    };

    struct Attributes {
        const char* about = nullptr;
        const char* resource = nullptr;
        const char* parseType = nullptr;
        bool hasNodeID = false;
    };

    Frame& Push(Role inRole);
    Frame& Parent() noexcept { return mFrames[mFrames.size() - 2]; }
    void StartRoot(const KnownName& inName, AttributeList inAttributes);
    void StartWrapper(const KnownName& inName, AttributeList inAttributes);
    void StartSubject(const KnownName& inName, AttributeList inAttributes);
    void StartField(const KnownName& inName, AttributeList inAttributes);
    void StartItem(const KnownName& inName, AttributeList inAttributes);
    void StartProperty(Frame& ioFrame, AttributeList inAttributes);
    void StartValue(const KnownName& inName, AttributeList inAttributes);
    void AddType(const KnownName& inName);

    Attributes ReadAttributes(AttributeList inAttributes, Frame& ioFrame);
    void ReadPropertyAttribute(const KnownName& inName, const char* inValue, const Frame& inFrame);
    Form FormOf(const Attributes& inAttributes, const Frame& inFrame) const;
    void SetAbout(const Attributes& inAttributes);

    void EndProperty();
    Node TakeProperty(Frame& ioFrame);
    Node TakeText(Frame& ioFrame);
    Node TakeReference(Frame& ioFrame);
    Node TakeStructure(std::size_t inFirstField, const Node& inLanguage);
    Node TakeQualified(std::size_t inFirstField, std::size_t inValueAt, const Node& inLanguage);
    Node TakeArray(Frame& ioFrame);
    void EndRDF();

    /// Sorts all fields from a place on, and returns how many these are.
    std::size_t SortedFields(std::size_t inFirst);
    void InheritLanguage(std::size_t inFirstField, const Node& inLanguage);
    void RequireOnlySpaceSince(std::size_t inStart);
    void Count();

    Terms& mTerms;
    std::vector<Frame> mFrames;
    std::vector<Field> mFields;
    std::vector<Item> mItems;
    std::string mText;
    std::size_t mNodeCount = 0;
    bool mHasRDF = false;
    std::unordered_set<std::string> mKnownURIs;
    Packet mPacket;
};

}  // namespace OrvaneXMP
