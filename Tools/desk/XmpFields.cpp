// Finds the form of each property and writes values in it.
#include "XmpFields.h"

#include <algorithm>

#include <QtCore/QStringList>

#include "OrvaneXMP/Namespaces.h"
#include "OrvaneXMP/Path.h"
#include "Text.h"

namespace Desk {
namespace {

using OrvaneXMP::Kind;
using OrvaneXMP::Name;
using OrvaneXMP::Node;
using Form = XmpField::Form;

constexpr std::string_view kDefaultLanguage = "x-default";
const QString kSeparator = QStringLiteral("; ");

std::vector<XmpField> UsualFields() {
    using namespace OrvaneXMP;
    return {
        {Name(kNamespace_DC, "title"), Text("$$$/ZODesk/Metadata/Title=Title"), Form::kLanguages, false, {}},
        {Name(kNamespace_DC, "description"),
         Text("$$$/ZODesk/Metadata/Description=Description"),
         Form::kLanguages,
         true,
         {}},
        {Name(kNamespace_DC, "creator"),
         Text("$$$/ZODesk/Metadata/Creator=Creators"),
         Form::kOrderedList,
         false,
         {}},
        {Name(kNamespace_DC, "subject"),
         Text("$$$/ZODesk/Metadata/Keywords=Keywords"),
         Form::kUnorderedList,
         false,
         {}},
        {Name(kNamespace_DC, "rights"),
         Text("$$$/ZODesk/Metadata/Rights=Rights"),
         Form::kLanguages,
         false,
         {}},
        {Name(kNamespace_XMPDM, "scene"), Text("$$$/ZODesk/Metadata/Scene=Scene"), Form::kText, false, {}},
        {Name(kNamespace_XMPDM, "shotName"), Text("$$$/ZODesk/Metadata/Shot=Shot"), Form::kText, false, {}},
        {Name(kNamespace_XMPDM, "logComment"),
         Text("$$$/ZODesk/Metadata/LogComment=Log comment"),
         Form::kText,
         true,
         {}}};
}

bool IsListOfTexts(const Node& inNode) {
    return inNode.IsArray() && std::all_of(inNode.Items().begin(), inNode.Items().end(),
                                           [](const Node& inItem) { return inItem.IsSimple(); });
}

/// The form of what is there; false for what cannot be edited as a line of text.
bool FindForm(const Node& inNode, Form& ioForm) {
    if (!inNode.IsPresent()) {
        return true;
    }
    if (inNode.IsSimple()) {
        ioForm = Form::kText;
        return inNode.GetKind() == Kind::Text;
    }
    ioForm = inNode.IsLanguageAlternative()        ? Form::kLanguages
             : inNode.GetKind() == Kind::Unordered ? Form::kUnorderedList
                                                   : Form::kOrderedList;
    return IsListOfTexts(inNode) && (ioForm == Form::kLanguages || inNode.GetKind() != Kind::Alternative);
}

QString FromNode(const Node& inNode) {
    const std::string_view value = inNode.Value();
    return QString::fromUtf8(value.data(), static_cast<qsizetype>(value.size()));
}

/// The text in the default language, else the first one.
Node DefaultItem(const Node& inAlternative) {
    const Node found = OrvaneXMP::Find(inAlternative, {OrvaneXMP::PathStep::ToLanguage(kDefaultLanguage)});
    return found.IsPresent() || inAlternative.Items().empty() ? found : inAlternative.Items()[0];
}

QString ValueOf(const Node& inNode, Form inForm) {
    if (inForm == Form::kText) {
        return FromNode(inNode);
    }
    if (inForm == Form::kLanguages) {
        return FromNode(DefaultItem(inNode));
    }
    QStringList texts;
    for (const Node& item : inNode.Items()) {
        texts << FromNode(item);
    }
    return texts.join(kSeparator);
}

Node MakeText(const QString& inText) {
    return Node::Text(inText.toStdString());
}

/// The default text, and with it the languages that say the same.
Node WithLanguages(const Node& inFormer, const QString& inValue) {
    const Node text = MakeText(inValue);
    const Node former = inFormer.IsArray() ? DefaultItem(inFormer) : Node();
    std::vector<Node> items;
    for (const Node& item : inFormer.Items()) {
        const bool isSame = item.Value() == former.Value();
        std::vector<OrvaneXMP::Field> qualifiers(item.Qualifiers().begin(), item.Qualifiers().end());
        items.push_back(isSame ? text.WithQualifiers(std::move(qualifiers)) : item);
    }
    if (items.empty()) {
        items.push_back(text.WithQualifier(OrvaneXMP::LanguageName(), Node::Text(kDefaultLanguage)));
    }
    return Node::Array(Kind::Alternative, std::move(items));
}

/// An entry that stays keeps what hangs on it.
Node WithList(const Node& inFormer, const QString& inValue, Kind inKind) {
    std::vector<Node> items;
    for (const QString& part : inValue.split(QLatin1Char(';'), Qt::SkipEmptyParts)) {
        if (const QString text = part.trimmed(); !text.isEmpty()) {
            const auto former = inFormer.Items();
            const auto* const kept = std::find_if(
                former.begin(), former.end(), [&](const Node& inItem) { return FromNode(inItem) == text; });
            items.push_back(kept != former.end() ? *kept : MakeText(text));
        }
    }
    return items.empty() ? Node()
                         : Node::Array(inFormer.IsArray() ? inFormer.GetKind() : inKind, std::move(items));
}

Node MakeValue(const Node& inFormer, const XmpField& inField) {
    if (inField.value.trimmed().isEmpty()) {
        return Node();
    }
    switch (inField.form) {
        case Form::kLanguages:
            return WithLanguages(inFormer, inField.value);
        case Form::kOrderedList:
            return WithList(inFormer, inField.value, Kind::Ordered);
        case Form::kUnorderedList:
            return WithList(inFormer, inField.value, Kind::Unordered);
        default:
            std::vector<OrvaneXMP::Field> qualifiers(inFormer.Qualifiers().begin(),
                                                     inFormer.Qualifiers().end());
            return MakeText(inField.value).WithQualifiers(std::move(qualifiers));
    }
}

}  // namespace

std::vector<XmpField> ReadXmpFields(const OrvaneXMP::Packet& inPacket) {
    std::vector<XmpField> fields;
    const std::vector<XmpField> usual = UsualFields();
    for (XmpField field : usual) {
        const Node& node = inPacket.Property(field.name);
        if (FindForm(node, field.form)) {
            field.value = ValueOf(node, field.form);
            fields.push_back(field);
        }
    }
    for (const OrvaneXMP::Field& property : inPacket.properties.Fields()) {
        const bool isUsual = std::any_of(usual.begin(), usual.end(), [&](const XmpField& inField) {
            return inField.name == property.name;
        });
        XmpField field{property.name, {}, Form::kText, false, {}};
        if (!isUsual && property.node.IsSimple() && FindForm(property.node, field.form)) {
            field.label = QString::fromStdString(
                OrvaneXMP::PathText({OrvaneXMP::PathStep::ToField(property.name)}, inPacket));
            field.value = FromNode(property.node);
            fields.push_back(field);
        }
    }
    return fields;
}

OrvaneXMP::Packet WithXmpField(const OrvaneXMP::Packet& inPacket, const XmpField& inField) {
    OrvaneXMP::Packet packet = inPacket;
    packet.properties =
        packet.properties.WithField(inField.name, MakeValue(packet.Property(inField.name), inField));
    return packet;
}

}  // namespace Desk
