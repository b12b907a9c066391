// The storage of nodes: one allocation each, with all parts behind the head.
#include "OrvaneXMP/Tree.h"

#include <expat.h>

#include <algorithm>
#include <new>
#include <stdexcept>

#include "OrvaneXMP/detail/NodeFactory.h"
#include "OrvaneXMP/Namespaces.h"
#include "ostcore/utility/StringConversion.h"

namespace OrvaneXMP {

namespace {

bool IsPlainLocalName(std::string_view inName) noexcept {
    const auto isLetter = [](char inByte) {
        return (inByte >= 'a' && inByte <= 'z') || (inByte >= 'A' && inByte <= 'Z') || inByte == '_';
    };
    const auto isFurther = [&](char inByte) {
        return isLetter(inByte) || (inByte >= '0' && inByte <= '9') || inByte == '-' || inByte == '.';
    };
    return !inName.empty() && isLetter(inName.front()) &&
           std::all_of(inName.begin(), inName.end(), isFurther);
}

/// Asks the parser itself, so that no name is written that it would not read.
bool IsForeignLocalName(std::string_view inName) {
    if (inName.find_first_of(" \t\r\n/<>=&:'\"") != std::string_view::npos) {
        return false;
    }
    const std::string element = "<" + std::string(inName) + "/>";
    const XML_Parser parser = XML_ParserCreate("UTF-8");
    if (!parser) {
        throw std::bad_alloc();
    }
    const bool isName = XML_Parse(parser, element.data(), static_cast<int>(element.size()), XML_TRUE) != 0;
    XML_ParserFree(parser);
    return isName;
}

std::string Expand(std::string_view inNamespaceURI, std::string_view inLocalName) {
    constexpr std::size_t kLongest = 4096;
    constexpr std::string_view kNamespaceOfDeclarations = "http://www.w3.org/2000/xmlns/";
    const bool isURI = !inNamespaceURI.empty() && inNamespaceURI != kNamespaceOfDeclarations &&
                       inNamespaceURI.size() <= kLongest && IsXMLText(inNamespaceURI) &&
                       std::none_of(inNamespaceURI.begin(), inNamespaceURI.end(),
                                    [](char inByte) { return static_cast<unsigned char>(inByte) <= ' '; });
    if (!isURI) {
        throw std::invalid_argument(
            "The URI of an XMP namespace is empty, reserved, too long or has white space in it");
    }
    if (inLocalName.size() > kLongest ||
        !(IsPlainLocalName(inLocalName) || IsForeignLocalName(inLocalName))) {
        throw std::invalid_argument("The local name of an XMP property is no name of XML");
    }
    return std::string(inNamespaceURI) + " " + std::string(inLocalName);
}

const Node& FindIn(Range<Field> inFields, const Name& inName) noexcept {
    static const Node absent;
    for (const Field& field : inFields) {
        if (field.name == inName) {
            return field.node;
        }
    }
    return absent;
}

void CheckText(std::string_view inText) {
    if (inText.size() > kMaximumPacketSize) {
        throw std::length_error("A text is too long for an XMP packet");
    }
    if (!IsXMLText(inText)) {
        throw std::invalid_argument("A text of XMP is not UTF-8, or has characters that XML refuses");
    }
}

void CheckName(const Name& inName, bool inIsAllowedOfRDFAndXML) {
    const std::string_view uri = inName.NamespaceURI();
    if (inName.empty() || ((uri == kNamespace_RDF || uri == kNamespace_XML) && !inIsAllowedOfRDFAndXML)) {
        throw std::invalid_argument("A property of XMP has no name, or one that RDF keeps for itself");
    }
}

void CheckPresent(const Node& inNode) {
    if (!inNode.IsPresent()) {
        throw std::invalid_argument("A field or item of XMP is absent");
    }
}

bool IsTextWithoutQualifiers(const Node& inNode) {
    return inNode.IsPresent() && inNode.GetKind() == Kind::Text && inNode.Qualifiers().empty();
}

void CheckQualifier(const Field& inQualifier, Kind inKind) {
    const bool isLanguage = inQualifier.name == LanguageName();
    const bool isDatatype = inQualifier.name == DatatypeName() && inKind == Kind::Text;
    CheckName(inQualifier.name, isLanguage || isDatatype || inQualifier.name == TypeName());
    CheckPresent(inQualifier.node);
    if ((isLanguage || isDatatype) && !IsTextWithoutQualifiers(inQualifier.node)) {
        throw std::invalid_argument("The language or data type of an XMP value is no plain text");
    }
}

void SortEachOnce(std::vector<Field>& ioFields) {
    const auto isBefore = [](const Field& inLeft, const Field& inRight) {
        return inLeft.name < inRight.name;
    };
    const auto isSame = [](const Field& inLeft, const Field& inRight) { return inLeft.name == inRight.name; };
    std::sort(ioFields.begin(), ioFields.end(), isBefore);
    if (std::adjacent_find(ioFields.begin(), ioFields.end(), isSame) != ioFields.end()) {
        throw std::invalid_argument("A property of XMP is given twice");
    }
}

std::vector<Field> Changed(Range<Field> inFields, const Name& inName, const Node& inNode) {
    std::vector<Field> fields;
    fields.reserve(inFields.size() + 1);
    std::copy_if(inFields.begin(), inFields.end(), std::back_inserter(fields),
                 [&](const Field& inField) { return inField.name != inName; });
    if (inNode.IsPresent()) {
        fields.push_back({inName, inNode});
    }
    return fields;
}

std::size_t HeightOf(const Field* inFields, std::size_t inSize) noexcept {
    std::size_t height = 0;
    for (std::size_t at = 0; at < inSize; ++at) {
        height = std::max(height, inFields[at].node.Height());
    }
    return height;
}

template <class T>
void MoveInto(void* outPlace, T* inParts, std::size_t inSize) noexcept {
    T* place = static_cast<T*>(outPlace);
    for (std::size_t at = 0; at < inSize; ++at) {
        new (place + at) T(std::move(inParts[at]));
    }
}

}  // namespace

bool IsXMLText(std::string_view inText) noexcept {
    for (std::size_t at = 0; at < inText.size(); ++at) {
        const auto byte = static_cast<unsigned char>(inText[at]);
        if (byte < ' ' && byte != '\t' && byte != '\n' && byte != '\r') {
            return false;
        }
        // U+FFFE and U+FFFF
        if (byte == 0xEF && inText.size() - at > 2 && static_cast<unsigned char>(inText[at + 1]) == 0xBF &&
            static_cast<unsigned char>(inText[at + 2]) >= 0xBE) {
            return false;
        }
    }
    return ostcore::utility::IsValidUTF8(inText);
}

Name::Name(std::string_view inNamespaceURI, std::string_view inLocalName)
    : mText(Expand(inNamespaceURI, inLocalName)) {}

std::string_view Name::NamespaceURI() const noexcept {
    const std::string_view text = Text();
    return text.substr(0, text.rfind(' '));
}

std::string_view Name::LocalName() const noexcept {
    const std::string_view text = Text();
    return text.substr(text.rfind(' ') + 1);
}

const Name& LanguageName() {
    static const Name name(kNamespace_XML, "lang");
    return name;
}

const Name& TypeName() {
    static const Name name(kNamespace_RDF, "type");
    return name;
}

const Name& DatatypeName() {
    static const Name name(kNamespace_RDF, "datatype");
    return name;
}

Node::Data* NodeFactory::Allocate(Kind inKind, std::size_t inContentBytes, Field* inQualifiers,
                                  std::size_t inCount, std::size_t inBelow) {
    const std::size_t height = 1 + std::max(inBelow, HeightOf(inQualifiers, inCount));
    if (height > kMaximumDepth) {
        throw std::length_error("The nodes of an XMP tree are nested too deep");
    }
    void* bytes = ::operator new(sizeof(Node::Data) + inCount * sizeof(Field) + inContentBytes);
    auto* data = new (bytes)
        Node::Data{{1}, inKind, static_cast<std::uint16_t>(height), 0, static_cast<std::uint32_t>(inCount)};
    MoveInto(data + 1, inQualifiers, inCount);
    return data;
}

Node NodeFactory::MakeSimple(Kind inKind, std::string_view inText, Field* inQualifiers, std::size_t inCount) {
    Node::Data* data = Allocate(inKind, inText.size(), inQualifiers, inCount, 0);
    data->size = static_cast<std::uint32_t>(inText.size());
    void* content = reinterpret_cast<Field*>(data + 1) + inCount;
    std::copy(inText.begin(), inText.end(), static_cast<char*>(content));
    return Adopt(data);
}

Node NodeFactory::MakeStructure(Field* inFields, std::size_t inSize, Field* inQualifiers,
                                std::size_t inCount) {
    Node::Data* data =
        Allocate(Kind::Structure, inSize * sizeof(Field), inQualifiers, inCount, HeightOf(inFields, inSize));
    data->size = static_cast<std::uint32_t>(inSize);
    MoveInto(reinterpret_cast<Field*>(data + 1) + inCount, inFields, inSize);
    return Adopt(data);
}

Node NodeFactory::MakeArray(Kind inKind, Node* inItems, std::size_t inSize, Field* inQualifiers,
                            std::size_t inCount) {
    std::size_t below = 0;
    for (std::size_t at = 0; at < inSize; ++at) {
        below = std::max(below, inItems[at].Height());
    }
    Node::Data* data = Allocate(inKind, inSize * sizeof(Node), inQualifiers, inCount, below);
    data->size = static_cast<std::uint32_t>(inSize);
    MoveInto(reinterpret_cast<Field*>(data + 1) + inCount, inItems, inSize);
    return Adopt(data);
}

std::size_t NodeFactory::Sort(Field* ioFields, std::size_t inSize, Name& outTwice) {
    const auto isBefore = [](const Field& inLeft, const Field& inRight) {
        return inLeft.name < inRight.name;
    };
    if (!std::is_sorted(ioFields, ioFields + inSize, isBefore)) {
        std::stable_sort(ioFields, ioFields + inSize, isBefore);
    }
    std::size_t kept = 0;
    for (std::size_t at = 0; at < inSize; ++at) {
        if (kept > 0 && ioFields[kept - 1].name == ioFields[at].name) {
            if (ioFields[kept - 1].node != ioFields[at].node) {
                outTwice = ioFields[at].name;
            }
            continue;
        }
        if (kept != at) {
            ioFields[kept] = std::move(ioFields[at]);
        }
        ++kept;
    }
    return kept;
}

void Node::Destroy(const Data* inData) noexcept {
    auto* data = const_cast<Data*>(inData);
    auto* qualifiers = reinterpret_cast<Field*>(data + 1);
    void* content = qualifiers + data->qualifierCount;
    if (data->kind == Kind::Structure) {
        std::destroy_n(static_cast<Field*>(content), data->size);
    } else if (data->kind >= Kind::Unordered) {
        std::destroy_n(static_cast<Node*>(content), data->size);
    }
    std::destroy_n(qualifiers, data->qualifierCount);
    data->~Data();
    ::operator delete(data);
}

Node Node::Text(std::string_view inText) {
    CheckText(inText);
    return NodeFactory::MakeSimple(Kind::Text, inText, nullptr, 0);
}

Node Node::URI(std::string_view inURI) {
    CheckText(inURI);
    return NodeFactory::MakeSimple(Kind::URI, inURI, nullptr, 0);
}

Node Node::Structure(std::vector<Field> inFields) {
    for (const Field& field : inFields) {
        CheckName(field.name, field.name == TypeName());
        CheckPresent(field.node);
    }
    SortEachOnce(inFields);
    return NodeFactory::MakeStructure(inFields.data(), inFields.size(), nullptr, 0);
}

Node Node::Array(Kind inKind, std::vector<Node> inItems) {
    if (inKind < Kind::Unordered) {
        throw std::invalid_argument("An array of XMP is unordered, ordered or alternative");
    }
    std::for_each(inItems.begin(), inItems.end(), CheckPresent);
    return NodeFactory::MakeArray(inKind, inItems.data(), inItems.size(), nullptr, 0);
}

Node Node::WithQualifiers(std::vector<Field> inQualifiers) const {
    CheckPresent(*this);
    for (const Field& qualifier : inQualifiers) {
        CheckQualifier(qualifier, GetKind());
    }
    SortEachOnce(inQualifiers);
    if (IsStructure()) {
        std::vector<Field> fields(Fields().begin(), Fields().end());
        return NodeFactory::MakeStructure(fields.data(), fields.size(), inQualifiers.data(),
                                          inQualifiers.size());
    }
    if (IsArray()) {
        std::vector<Node> items(Items().begin(), Items().end());
        return NodeFactory::MakeArray(GetKind(), items.data(), items.size(), inQualifiers.data(),
                                      inQualifiers.size());
    }
    return NodeFactory::MakeSimple(GetKind(), Value(), inQualifiers.data(), inQualifiers.size());
}

Node Node::WithField(const Name& inName, const Node& inNode) const {
    if (!IsStructure()) {
        throw std::invalid_argument("Only a structure of XMP has fields");
    }
    const Node changed = Structure(Changed(Fields(), inName, inNode));
    return Qualifiers().empty()
               ? changed
               : changed.WithQualifiers(std::vector<Field>(Qualifiers().begin(), Qualifiers().end()));
}

Node Node::WithQualifier(const Name& inName, const Node& inNode) const {
    return WithQualifiers(Changed(Qualifiers(), inName, inNode));
}

const Node& Node::FieldNamed(const Name& inName) const noexcept {
    return FindIn(Fields(), inName);
}

const Node& Node::QualifierNamed(const Name& inName) const noexcept {
    return FindIn(Qualifiers(), inName);
}

}  // namespace OrvaneXMP
