// What each element and attribute of RDF/XML makes of the tree.
#include "OrvaneXMP/detail/RdfBuilder.h"

#include <algorithm>

#include "OrvaneXMP/detail/NodeFactory.h"
#include "OrvaneXMP/Namespaces.h"

namespace OrvaneXMP {

namespace {

constexpr std::size_t kMostAttributes = 10000;
constexpr std::size_t kLongestURI = 4096;
constexpr std::size_t kMostNamespaces = 4096;
/// A property and its value are two elements; the wrappers take three.
constexpr std::size_t kMostFrames = 2 * kMaximumDepth + 3;

std::string Quoted(const Name& inName) {
    constexpr std::size_t kLongestQuote = 120;
    const std::string_view text = inName.Text();
    std::string quoted(text.substr(text.size() > kLongestQuote ? text.size() - kLongestQuote : 0));
    // A cut may have gone through a character.
    while (!quoted.empty() && (static_cast<unsigned char>(quoted.front()) & 0xC0) == 0x80) {
        quoted.erase(0, 1);
    }
    return "\"" + quoted + "\"";
}

[[noreturn]] void RefuseName(const char* inWhat, const Name& inName) {
    throw Refusal{inWhat + (" " + Quoted(inName))};
}

bool IsSpace(std::string_view inText) noexcept {
    return std::all_of(inText.begin(), inText.end(), [](char inByte) {
        return inByte == ' ' || inByte == '\n' || inByte == '\t' || inByte == '\r';
    });
}

Node MakeText(std::string_view inText) {
    return NodeFactory::MakeSimple(Kind::Text, inText, nullptr, 0);
}

Node MakeURI(std::string_view inURI) {
    return NodeFactory::MakeSimple(Kind::URI, inURI, nullptr, 0);
}

/// Of the names in RDF that get into a tree, the one besides TypeName().
const Name& ValueName() {
    static const Name name(kNamespace_RDF, "value");
    return name;
}

bool HasLanguage(const Node& inNode) {
    return inNode.QualifierNamed(LanguageName()).IsPresent();
}

/// The one qualifier that most nodes have, or none.
class LanguageQualifier {
public:
    explicit LanguageQualifier(const Node& inLanguage) : mField{LanguageName(), inLanguage} {}
    Field* Fields() { return &mField; }
    std::size_t Count() const { return mField.node.IsPresent() ? 1 : 0; }

private:
    Field mField;
};

}  // namespace

RdfBuilder::RdfBuilder(Terms& inTerms) : mTerms(inTerms) {
    constexpr std::size_t kUsual = 32;
    mFrames.reserve(kUsual);
    mFields.reserve(kUsual);
    mItems.reserve(kUsual);
}

RdfBuilder::Frame& RdfBuilder::Push(Role inRole) {
    Frame& frame = mFrames.emplace_back();
    frame.role = inRole;
    frame.firstField = mFields.size();
    frame.firstItem = mItems.size();
    frame.textStart = mText.size();
    return frame;
}

void RdfBuilder::StartElement(const KnownName& inName, AttributeList inAttributes) {
    if (inName.term == Term::NoNamespace) {
        RefuseName("an element without a namespace:", inName.name);
    }
    if (inAttributes.size() > kMostAttributes) {
        throw Refusal{"too many attributes in one element"};
    }
    if (mFrames.size() >= kMostFrames) {
        throw Refusal{"the elements are nested too deep"};
    }
    if (mFrames.empty()) {
        return StartRoot(inName, inAttributes);
    }
    switch (mFrames.back().role) {
        case Role::Meta:
            return StartWrapper(inName, inAttributes);
        case Role::RDF:
            return StartSubject(inName, inAttributes);
        case Role::Subject:
        case Role::Structure:
            return StartField(inName, inAttributes);
        case Role::Container:
            return StartItem(inName, inAttributes);
        case Role::Property:
            return mFrames.back().form == Form::FieldsInside ? StartField(inName, inAttributes)
                                                             : StartValue(inName, inAttributes);
    }
}

void RdfBuilder::StartRoot(const KnownName& inName, AttributeList inAttributes) {
    if (inName.term != Term::Meta) {
        return StartWrapper(inName, inAttributes);
    }
    Frame& frame = Push(Role::Meta);
    // The attributes of x:xmpmeta tell who wrote the packet, and nothing of what it describes.
    for (const Attribute& attribute : inAttributes) {
        if (mTerms.Of(attribute).term == Term::Language) {
            frame.language = MakeText(attribute.value);
        }
    }
}

void RdfBuilder::StartWrapper(const KnownName& inName, AttributeList inAttributes) {
    if (inName.term != Term::RDF || mHasRDF) {
        RefuseName("where one rdf:RDF is expected, there is", inName.name);
    }
    mHasRDF = true;
    Frame& frame = Push(Role::RDF);
    const Attributes attributes = ReadAttributes(inAttributes, frame);
    if (mFields.size() != frame.firstField || attributes.about) {
        throw Refusal{"rdf:RDF has attributes"};
    }
    if (!frame.language.IsPresent() && mFrames.size() > 1) {
        frame.language = Parent().language;
    }
}

void RdfBuilder::StartSubject(const KnownName& inName, AttributeList inAttributes) {
    if (inName.term != Term::Description && inName.term != Term::Property && inName.term != Term::Meta) {
        RefuseName("where a resource is expected, there is", inName.name);
    }
    Frame& frame = Push(Role::Subject);
    AddType(inName);
    SetAbout(ReadAttributes(inAttributes, frame));
    if (!frame.language.IsPresent()) {
        frame.language = Parent().language;
    }
    InheritLanguage(frame.firstField, frame.language);
}

void RdfBuilder::SetAbout(const Attributes& inAttributes) {
    const std::string_view about = inAttributes.about ? inAttributes.about : "";
    if (!about.empty() && !mPacket.about.empty() && mPacket.about != about) {
        throw Refusal{"the packet describes two resources: rdf:about differs"};
    }
    if (!about.empty()) {
        mPacket.about = about;
    }
}

void RdfBuilder::StartField(const KnownName& inName, AttributeList inAttributes) {
    const bool isInSubject = mFrames.back().role == Role::Subject;
    const bool isProperty = inName.term == Term::Property || inName.term == Term::Meta ||
                            inName.term == Term::Type || (inName.term == Term::Value && !isInSubject);
    if (!isProperty) {
        RefuseName("where a property is expected, there is", inName.name);
    }
    Frame& frame = Push(Role::Property);
    frame.name = inName.name;
    StartProperty(frame, inAttributes);
}

void RdfBuilder::StartItem(const KnownName& inName, AttributeList inAttributes) {
    if (inName.term != Term::Item && inName.term != Term::NumberedItem) {
        RefuseName("where an item of an array is expected, there is", inName.name);
    }
    Frame& frame = Push(Role::Property);
    frame.number = inName.term == Term::Item ? ++Parent().counted : inName.number;
    StartProperty(frame, inAttributes);
}

void RdfBuilder::StartProperty(Frame& ioFrame, AttributeList inAttributes) {
    const Attributes attributes = ReadAttributes(inAttributes, ioFrame);
    ioFrame.form = FormOf(attributes, ioFrame);
    if (ioFrame.form == Form::Reference) {
        ioFrame.value = MakeURI(attributes.resource);
    }
    const Frame& parent = Parent();
    const bool inherits = parent.role == Role::Subject && !ioFrame.language.IsPresent() &&
                          !parent.language.Value().empty() && ioFrame.form != Form::Reference;
    if (inherits) {
        ioFrame.language = parent.language;
    }
}

RdfBuilder::Form RdfBuilder::FormOf(const Attributes& inAttributes, const Frame& inFrame) const {
    const bool hasFields = mFields.size() != inFrame.firstField;
    const bool hasDatatype = inFrame.datatype.IsPresent();
    if (inAttributes.hasNodeID) {
        throw Refusal{"a reference to another node by rdf:nodeID is no part of XMP"};
    }
    if (inAttributes.parseType) {
        if (std::string_view(inAttributes.parseType) != "Resource") {
            throw Refusal{"an rdf:parseType other than Resource is no part of XMP"};
        }
        if (hasFields || hasDatatype || inAttributes.resource) {
            throw Refusal{"rdf:parseType does not go with other attributes"};
        }
        return Form::FieldsInside;
    }
    if (hasDatatype && (hasFields || inAttributes.resource)) {
        throw Refusal{"rdf:datatype is for texts only"};
    }
    if (inAttributes.resource) {
        return Form::Reference;
    }
    return hasFields ? Form::FieldsInTag : Form::Text;
}

void RdfBuilder::StartValue(const KnownName& inName, AttributeList inAttributes) {
    Frame& property = mFrames.back();
    if (property.form != Form::Text || property.datatype.IsPresent()) {
        RefuseName("a property has one value, and behind it there is", inName.name);
    }
    RequireOnlySpaceSince(property.textStart);
    property.form = Form::Element;
    const bool isArray = inName.term == Term::Bag || inName.term == Term::Seq || inName.term == Term::Alt;
    if (!isArray && inName.term != Term::Description && inName.term != Term::Property &&
        inName.term != Term::Meta) {
        RefuseName("where a value is expected, there is", inName.name);
    }
    Frame& frame = Push(isArray ? Role::Container : Role::Structure);
    if (isArray) {
        frame.arrayKind = inName.term == Term::Bag   ? Kind::Unordered
                          : inName.term == Term::Seq ? Kind::Ordered
                                                     : Kind::Alternative;
    } else {
        AddType(inName);
    }
    const Attributes attributes = ReadAttributes(inAttributes, frame);
    if (attributes.about) {
        throw Refusal{"a resource within a resource: rdf:about inside of a value"};
    }
    if (!frame.language.IsPresent()) {
        frame.language = Parent().language;
    }
}

void RdfBuilder::AddType(const KnownName& inName) {
    if (inName.term == Term::Description) {
        return;
    }
    Count();
    const std::string uri = std::string(inName.name.NamespaceURI()) + std::string(inName.name.LocalName());
    mFields.push_back({TypeName(), MakeURI(uri)});
}

RdfBuilder::Attributes RdfBuilder::ReadAttributes(AttributeList inAttributes, Frame& ioFrame) {
    Attributes attributes;
    const bool isProperty = ioFrame.role == Role::Property;
    for (const Attribute& attribute : inAttributes) {
        const KnownName& name = mTerms.Of(attribute);
        switch (name.term) {
            case Term::Language:
                ioFrame.language = MakeText(attribute.value);
                break;
            case Term::OtherOfXML:
                break;
            case Term::NodeID:
                attributes.hasNodeID = true;
                break;
            case Term::About:
                attributes.about = attribute.value;
                break;
            case Term::Resource:
                attributes.resource = attribute.value;
                break;
            case Term::ParseType:
                attributes.parseType = attribute.value;
                break;
            case Term::Datatype:
                ioFrame.datatype = MakeText(attribute.value);
                break;
            default:
                ReadPropertyAttribute(name, attribute.value, ioFrame);
        }
    }
    const bool hasOfProperty = attributes.resource || attributes.parseType || ioFrame.datatype.IsPresent();
    if ((hasOfProperty && !isProperty) || (attributes.about && isProperty)) {
        throw Refusal{"an attribute of RDF in an element that cannot have it"};
    }
    return attributes;
}

void RdfBuilder::ReadPropertyAttribute(const KnownName& inName, const char* inValue, const Frame& inFrame) {
    const bool isContainer = inFrame.role == Role::Container;
    Count();
    if (isContainer && inName.term == Term::NumberedItem) {
        mItems.push_back({inName.number, MakeText(inValue)});
        return;
    }
    const bool isValue = inName.term == Term::Value && inFrame.role != Role::Subject;
    const bool isProperty = inName.term == Term::Property || inName.term == Term::Meta || isValue;
    if (isContainer || (!isProperty && inName.term != Term::Type)) {
        RefuseName("an attribute that is no part of XMP here:", inName.name);
    }
    mFields.push_back({inName.name, inName.term == Term::Type ? MakeURI(inValue) : MakeText(inValue)});
}

void RdfBuilder::Characters(std::string_view inText) {
    const bool isText =
        !mFrames.empty() && mFrames.back().role == Role::Property && mFrames.back().form == Form::Text;
    if (isText) {
        mText.append(inText);
    } else if (!IsSpace(inText)) {
        throw Refusal{"text outside of a value"};
    }
}

void RdfBuilder::EndElement() {
    Frame& frame = mFrames.back();
    switch (frame.role) {
        case Role::Meta:
            if (!mHasRDF) {
                throw Refusal{"there is no rdf:RDF in x:xmpmeta"};
            }
            break;
        case Role::RDF:
            EndRDF();
            break;
        case Role::Subject:
            break;
        case Role::Property:
            return EndProperty();
        case Role::Structure:
            mFrames[mFrames.size() - 2].value = TakeStructure(frame.firstField, frame.language);
            break;
        case Role::Container:
            mFrames[mFrames.size() - 2].value = TakeArray(frame);
            break;
    }
    mFrames.pop_back();
}

void RdfBuilder::EndProperty() {
    Frame& frame = mFrames.back();
    Count();
    Node node = TakeProperty(frame);
    if (frame.number > 0) {
        mItems.push_back({frame.number, std::move(node)});
    } else {
        mFields.push_back({std::move(frame.name), std::move(node)});
    }
    mFrames.pop_back();
}

Node RdfBuilder::TakeProperty(Frame& ioFrame) {
    switch (ioFrame.form) {
        case Form::Text:
            return TakeText(ioFrame);
        case Form::Element:
            return std::move(ioFrame.value);
        case Form::Reference:
            return TakeReference(ioFrame);
        case Form::FieldsInside:
        case Form::FieldsInTag:
            break;
    }
    return TakeStructure(ioFrame.firstField, ioFrame.language);
}

Node RdfBuilder::TakeText(Frame& ioFrame) {
    Field qualifiers[2];
    std::size_t count = 0;
    // In the order of their names.
    if (ioFrame.language.IsPresent()) {
        qualifiers[count++] = {LanguageName(), std::move(ioFrame.language)};
    }
    if (ioFrame.datatype.IsPresent()) {
        qualifiers[count++] = {DatatypeName(), std::move(ioFrame.datatype)};
    }
    if (count == 2 && qualifiers[1].name < qualifiers[0].name) {
        std::swap(qualifiers[0], qualifiers[1]);
    }
    const std::string_view text = std::string_view(mText).substr(ioFrame.textStart);
    Node node = NodeFactory::MakeSimple(Kind::Text, text, qualifiers, count);
    mText.resize(ioFrame.textStart);
    return node;
}

Node RdfBuilder::TakeReference(Frame& ioFrame) {
    if (std::any_of(mFields.begin() + static_cast<std::ptrdiff_t>(ioFrame.firstField), mFields.end(),
                    [](const Field& inField) { return inField.name == ValueName(); })) {
        throw Refusal{"rdf:resource and rdf:value in one element"};
    }
    InheritLanguage(ioFrame.firstField, ioFrame.language);
    if (ioFrame.language.IsPresent()) {
        mFields.push_back({LanguageName(), std::move(ioFrame.language)});
    }
    const std::size_t count = SortedFields(ioFrame.firstField);
    Node node =
        NodeFactory::MakeSimple(Kind::URI, ioFrame.value.Value(), mFields.data() + ioFrame.firstField, count);
    mFields.resize(ioFrame.firstField);
    return node;
}

Node RdfBuilder::TakeStructure(std::size_t inFirstField, const Node& inLanguage) {
    const auto isValue = [](const Field& inField) { return inField.name == ValueName(); };
    const std::size_t count = SortedFields(inFirstField);
    const auto first = mFields.begin() + static_cast<std::ptrdiff_t>(inFirstField);
    const auto value = std::find_if(first, first + static_cast<std::ptrdiff_t>(count), isValue);
    if (value != first + static_cast<std::ptrdiff_t>(count)) {
        return TakeQualified(inFirstField, static_cast<std::size_t>(value - mFields.begin()), inLanguage);
    }
    LanguageQualifier language(inLanguage);
    Node node =
        NodeFactory::MakeStructure(mFields.data() + inFirstField, count, language.Fields(), language.Count());
    mFields.resize(inFirstField);
    return node;
}

/// The form with rdf:value: the other fields are its qualifiers. A language of the outer element holds for
/// the value and, as RDF has it, for each of them.
Node RdfBuilder::TakeQualified(std::size_t inFirstField, std::size_t inValueAt, const Node& inLanguage) {
    Node value = std::move(mFields[inValueAt].node);
    mFields.erase(mFields.begin() + static_cast<std::ptrdiff_t>(inValueAt));
    InheritLanguage(inFirstField, inLanguage);
    for (const Field& qualifier : value.Qualifiers()) {
        mFields.push_back(qualifier);
    }
    if (inLanguage.IsPresent() && !HasLanguage(value)) {
        mFields.push_back({LanguageName(), inLanguage});
    }
    const std::size_t count = SortedFields(inFirstField);
    const auto first = mFields.begin() + static_cast<std::ptrdiff_t>(inFirstField);
    Node node = value.WithQualifiers(std::vector<Field>(first, first + static_cast<std::ptrdiff_t>(count)));
    mFields.resize(inFirstField);
    return node;
}

Node RdfBuilder::TakeArray(Frame& ioFrame) {
    const auto isBefore = [](const Item& inLeft, const Item& inRight) {
        return inLeft.number < inRight.number;
    };
    const auto isSame = [](const Item& inLeft, const Item& inRight) {
        return inLeft.number == inRight.number;
    };
    const auto first = mItems.begin() + static_cast<std::ptrdiff_t>(ioFrame.firstItem);
    if (!std::is_sorted(first, mItems.end(), isBefore)) {
        std::sort(first, mItems.end(), isBefore);
    }
    if (std::adjacent_find(first, mItems.end(), isSame) != mItems.end()) {
        throw Refusal{"two items of an array have the same number"};
    }
    std::vector<Node> items;
    items.reserve(static_cast<std::size_t>(mItems.end() - first));
    std::transform(first, mItems.end(), std::back_inserter(items),
                   [](Item& ioItem) { return std::move(ioItem.node); });
    mItems.resize(ioFrame.firstItem);
    LanguageQualifier language(ioFrame.language);
    return NodeFactory::MakeArray(ioFrame.arrayKind, items.data(), items.size(), language.Fields(),
                                  language.Count());
}

void RdfBuilder::EndRDF() {
    const std::size_t count = SortedFields(0);
    mPacket.properties = NodeFactory::MakeStructure(mFields.data(), count, nullptr, 0);
    mFields.clear();
}

std::size_t RdfBuilder::SortedFields(std::size_t inFirst) {
    Name twice;
    const std::size_t count = NodeFactory::Sort(mFields.data() + inFirst, mFields.size() - inFirst, twice);
    if (!twice.empty()) {
        RefuseName("given twice, with different values:", twice);
    }
    mFields.resize(inFirst + count);
    return count;
}

void RdfBuilder::InheritLanguage(std::size_t inFirstField, const Node& inLanguage) {
    if (inLanguage.Value().empty()) {
        return;
    }
    for (std::size_t at = inFirstField; at < mFields.size(); ++at) {
        Node& node = mFields[at].node;
        if (node.GetKind() != Kind::URI && !HasLanguage(node)) {
            std::vector<Field> qualifiers(node.Qualifiers().begin(), node.Qualifiers().end());
            qualifiers.push_back({LanguageName(), inLanguage});
            node = node.WithQualifiers(std::move(qualifiers));
        }
    }
}

void RdfBuilder::RequireOnlySpaceSince(std::size_t inStart) {
    if (!IsSpace(std::string_view(mText).substr(inStart))) {
        throw Refusal{"text and an element in one value"};
    }
    mText.resize(inStart);
}

void RdfBuilder::DeclarePrefix(std::string_view inPrefix, std::string_view inURI) {
    if (inURI.size() > kLongestURI) {
        throw Refusal{"the URI of a namespace is too long"};
    }
    if (inPrefix.empty() || inURI.empty() || !mKnownURIs.emplace(inURI).second) {
        return;
    }
    if (mKnownURIs.size() > kMostNamespaces) {
        throw Refusal{"too many namespaces"};
    }
    mPacket.prefixes.push_back({std::string(inURI), std::string(inPrefix)});
}

void RdfBuilder::Count() {
    if (++mNodeCount > kMaximumNodeCount) {
        throw Refusal{"too many nodes"};
    }
}

}  // namespace OrvaneXMP
