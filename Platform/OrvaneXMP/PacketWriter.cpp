// Writes a tree as RDF/XML: one rdf:Description, elements for what has parts, attributes in the compact form.
#include "OrvaneXMP/PacketWriter.h"

#include <algorithm>
#include <array>
#include <stdexcept>

#include "OrvaneXMP/detail/NodeFactory.h"
#include "OrvaneXMP/detail/PrefixTable.h"
#include "OrvaneXMP/Namespaces.h"

namespace OrvaneXMP {

namespace {

using Layout = WriteOptions::Layout;

constexpr std::string_view kBegin = "<?xpacket begin=\"\xEF\xBB\xBF\" id=\"W5M0MpCehiHzreSzNTczkc9d\"?>\n";
constexpr std::string_view kEndWritable = "<?xpacket end=\"w\"?>";
constexpr std::string_view kEndReadOnly = "<?xpacket end=\"r\"?>";
constexpr std::string_view kItemTag = "rdf:li";
constexpr std::string_view kValueTag = "rdf:value";
/// What stands in the attributes of one tag stays far below the largest tag that is read.
constexpr std::size_t kLongestAttribute = 1024;
constexpr std::size_t kMostInAttributes = 64u << 10;

using ByteSet = std::array<bool, 256>;

constexpr ByteSet MakeSet(std::string_view inBytes) {
    ByteSet set{};
    for (const char byte : inBytes) {
        set[static_cast<unsigned char>(byte)] = true;
    }
    return set;
}

constexpr ByteSet kSpecialInElement = MakeSet("&<>\r");
constexpr ByteSet kSpecialInAttribute = MakeSet("&<>\r\n\t\"");

std::string_view TagOfArray(Kind inKind) {
    return inKind == Kind::Unordered ? "rdf:Bag" : inKind == Kind::Ordered ? "rdf:Seq" : "rdf:Alt";
}

bool IsWrittenInTag(const Field& inQualifier) {
    return inQualifier.name == LanguageName() || inQualifier.name == DatatypeName();
}

bool FitsAttribute(const Field& inField) {
    return inField.node.GetKind() == Kind::Text && inField.node.Qualifiers().empty() &&
           inField.name != TypeName() && inField.node.Value().size() <= kLongestAttribute;
}

class Writer {
public:
    Writer(const Packet& inPacket, Layout inLayout) : mPrefixes(inPacket), mLayout(inLayout) {
        WriteDocument(inPacket);
    }
    std::string Take() { return std::move(mText); }

private:
    void WriteDocument(const Packet& inPacket) {
        Put("<x:xmpmeta xmlns:x=\"").Put(kNamespace_Meta).Put("\">");
        Break(1);
        Put("<rdf:RDF xmlns:rdf=\"").Put(kNamespace_RDF).Put("\">");
        Break(2);
        Put("<rdf:Description rdf:about=\"").PutInAttribute(inPacket.about).Put("\"");
        for (const auto& [uri, prefix] : mPrefixes.Declarations()) {
            Break(5, ' ');
            Put("xmlns:").Put(prefix).Put("=\"").PutInAttribute(uri).Put("\"");
        }
        WriteFields("rdf:Description", inPacket.properties.Fields(),
                    mLayout == Layout::Compact ? kMostInAttributes : 0, 2);
        Break(1);
        Put("</rdf:RDF>");
        Break(0);
        Put("</x:xmpmeta>");
        Break(0);
    }

    /// Ends an open tag with fields, as attributes where that is short, and closes the element.
    void WriteFields(std::string_view inTag, Range<Field> inFields, std::size_t inMostInAttributes,
                     std::size_t inDepth) {
        const std::size_t before = mText.size();
        std::vector<const Field*> elements;
        for (const Field& field : inFields) {
            if (mText.size() - before < inMostInAttributes && FitsAttribute(field)) {
                WriteAttribute(field);
            } else {
                elements.push_back(&field);
            }
        }
        if (elements.empty()) {
            Put("/>");
            return;
        }
        Put(">");
        for (const Field* field : elements) {
            Break(inDepth + 1);
            WriteProperty(mPrefixes.Qualified(field->name), field->node, inDepth + 1);
        }
        Close(inTag, inDepth);
    }

    void WriteAttribute(const Field& inField) {
        Put(" ").Put(mPrefixes.Qualified(inField.name)).Put("=\"");
        PutInAttribute(inField.node.Value()).Put("\"");
    }

    void WriteProperty(std::string_view inTag, const Node& inNode, std::size_t inDepth) {
        const Range<Field> qualifiers = inNode.Qualifiers();
        if (std::all_of(qualifiers.begin(), qualifiers.end(), IsWrittenInTag)) {
            WriteValue(inTag, inNode, inDepth);
            return;
        }
        Put("<").Put(inTag).Put(" rdf:parseType=\"Resource\">");
        Break(inDepth + 1);
        WriteValue(kValueTag, inNode, inDepth + 1);
        for (const Field& qualifier : qualifiers) {
            if (!IsWrittenInTag(qualifier)) {
                Break(inDepth + 1);
                WriteProperty(mPrefixes.Qualified(qualifier.name), qualifier.node, inDepth + 1);
            }
        }
        Close(inTag, inDepth);
    }

    /// The value with those qualifiers that are attributes.
    void WriteValue(std::string_view inTag, const Node& inNode, std::size_t inDepth) {
        Put("<").Put(inTag);
        for (const Field& qualifier : inNode.Qualifiers()) {
            if (IsWrittenInTag(qualifier)) {
                WriteAttribute(qualifier);
            }
        }
        switch (inNode.GetKind()) {
            case Kind::Text:
                WriteText(inTag, inNode.Value());
                break;
            case Kind::URI:
                Put(" rdf:resource=\"").PutInAttribute(inNode.Value()).Put("\"/>");
                break;
            case Kind::Structure:
                WriteStructure(inTag, inNode.Fields(), inDepth);
                break;
            default:
                WriteArray(inTag, inNode, inDepth);
        }
    }

    void WriteText(std::string_view inTag, std::string_view inText) {
        if (inText.empty()) {
            Put("/>");
        } else {
            Put(">").PutInElement(inText).Put("</").Put(inTag).Put(">");
        }
    }

    void WriteStructure(std::string_view inTag, Range<Field> inFields, std::size_t inDepth) {
        const bool areAttributes = mLayout == Layout::Compact && !inFields.empty() &&
                                   inFields.size() * kLongestAttribute <= kMostInAttributes &&
                                   std::all_of(inFields.begin(), inFields.end(), FitsAttribute);
        if (!areAttributes) {
            Put(" rdf:parseType=\"Resource\"");
        }
        WriteFields(inTag, inFields, areAttributes ? kMostInAttributes : 0, inDepth);
    }

    void WriteArray(std::string_view inTag, const Node& inNode, std::size_t inDepth) {
        const std::string_view tag = TagOfArray(inNode.GetKind());
        Put(">");
        Break(inDepth + 1);
        Put("<").Put(tag);
        if (inNode.Items().empty()) {
            Put("/>");
        } else {
            Put(">");
            for (const Node& item : inNode.Items()) {
                Break(inDepth + 2);
                WriteProperty(kItemTag, item, inDepth + 2);
            }
            Close(tag, inDepth + 1);
        }
        Close(inTag, inDepth);
    }

    void Close(std::string_view inTag, std::size_t inDepth) {
        Break(inDepth);
        Put("</").Put(inTag).Put(">");
    }

    /// A new line in the readable form; in the compact one nothing, or what must stand there at least.
    void Break(std::size_t inDepth, char inCompact = 0) {
        if (mLayout == Layout::Readable) {
            mText += '\n';
            mText.append(inDepth, ' ');
        } else if (inCompact != 0) {
            mText += inCompact;
        }
        if (mText.size() > kMaximumPacketSize) {
            throw std::length_error("An XMP packet would be too large");
        }
    }

    Writer& Put(std::string_view inText) {
        mText.append(inText);
        return *this;
    }
    Writer& PutInElement(std::string_view inText) { return PutEscaped(inText, kSpecialInElement); }
    Writer& PutInAttribute(std::string_view inText) { return PutEscaped(inText, kSpecialInAttribute); }
    Writer& PutEscaped(std::string_view inText, const ByteSet& inSpecial) {
        std::size_t start = 0;
        for (std::size_t at = 0; at < inText.size(); ++at) {
            if (inSpecial[static_cast<unsigned char>(inText[at])]) {
                mText.append(inText, start, at - start).append(Escape(inText[at]));
                start = at + 1;
            }
        }
        mText.append(inText, start);
        return *this;
    }
    static std::string_view Escape(char inByte) {
        switch (inByte) {
            case '&':
                return "&amp;";
            case '<':
                return "&lt;";
            case '>':
                return "&gt;";
            case '"':
                return "&quot;";
            case '\t':
                return "&#x9;";
            case '\n':
                return "&#xA;";
            default:
                return "&#xD;";
        }
    }

    PrefixTable mPrefixes;
    Layout mLayout;
    std::string mText;
};

/// Lines of a hundred bytes.
std::string Padding(std::size_t inSize) {
    std::string padding(inSize, ' ');
    constexpr std::size_t kLine = 100;
    for (std::size_t end = kLine; end <= inSize; end += kLine) {
        padding[end - 1] = '\n';
    }
    return padding;
}

}  // namespace

std::string WritePacket(const Packet& inPacket, const WriteOptions& inOptions) {
    if (!inPacket.properties.IsStructure() || !inPacket.properties.Qualifiers().empty() ||
        !IsXMLText(inPacket.about)) {
        throw std::invalid_argument("An XMP packet is a structure of properties about one resource");
    }
    const bool isWrapped = inOptions.wrapper != WriteOptions::Wrapper::None;
    const bool isWritable = inOptions.wrapper == WriteOptions::Wrapper::Writable;
    if (inOptions.padding > kMaximumPacketSize) {
        throw std::length_error("The padding of an XMP packet is too large");
    }
    std::string text = isWrapped ? std::string(kBegin) : std::string();
    text += Writer(inPacket, inOptions.layout).Take();
    if (isWrapped) {
        text += Padding(inOptions.padding);
        text += isWritable ? kEndWritable : kEndReadOnly;
    }
    if (text.size() > kMaximumPacketSize) {
        throw std::length_error("An XMP packet would be too large");
    }
    return text;
}

}  // namespace OrvaneXMP
