// Sorts the names of a packet by what RDF makes of them.
#include "OrvaneXMP/detail/Terms.h"

#include <algorithm>
#include <array>

#include "OrvaneXMP/detail/NodeFactory.h"
#include "OrvaneXMP/Namespaces.h"

namespace OrvaneXMP {

namespace {

constexpr std::size_t kMostNames = 16384;

struct Entry {
    std::string_view local;
    Term term;
};

constexpr std::array<Entry, 14> kTermsOfRDF{{{"RDF", Term::RDF},
                                             {"Description", Term::Description},
                                             {"Bag", Term::Bag},
                                             {"Seq", Term::Seq},
                                             {"Alt", Term::Alt},
                                             {"li", Term::Item},
                                             {"value", Term::Value},
                                             {"type", Term::Type},
                                             {"about", Term::About},
                                             {"ID", Term::ID},
                                             {"nodeID", Term::NodeID},
                                             {"resource", Term::Resource},
                                             {"parseType", Term::ParseType},
                                             {"datatype", Term::Datatype}}};

/// rdf:_1, rdf:_2...; 0 for anything else.
std::uint32_t NumberOf(std::string_view inLocal) {
    constexpr std::size_t kMostDigits = 9;
    if (inLocal.size() < 2 || inLocal.size() > kMostDigits + 1 || inLocal[0] != '_' || inLocal[1] == '0') {
        return 0;
    }
    std::uint32_t number = 0;
    for (const char digit : inLocal.substr(1)) {
        if (digit < '0' || digit > '9') {
            return 0;
        }
        number = number * 10 + static_cast<std::uint32_t>(digit - '0');
    }
    return number;
}

KnownName OfRDF(std::string_view inLocal) {
    KnownName known;
    const auto entry = std::find_if(kTermsOfRDF.begin(), kTermsOfRDF.end(),
                                    [&](const Entry& inEntry) { return inEntry.local == inLocal; });
    known.number = NumberOf(inLocal);
    known.term = known.number > 0             ? Term::NumberedItem
                 : entry != kTermsOfRDF.end() ? entry->term
                                              : Term::ForbiddenInRDF;
    return known;
}

KnownName OfXML(std::string_view inLocal) {
    KnownName known;
    known.term = inLocal == "lang" ? Term::Language : inLocal == "base" ? Term::Base : Term::OtherOfXML;
    return known;
}

/// The forms of before RDF had its attributes in its own namespace.
KnownName WithoutNamespace(std::string_view inLocal, bool inIsAttribute) {
    const KnownName known = OfRDF(inLocal);
    const bool isOldForm = known.term == Term::About || known.term == Term::ID ||
                           known.term == Term::Resource || known.term == Term::ParseType ||
                           known.term == Term::Type;
    KnownName none;
    none.term = Term::NoNamespace;
    return inIsAttribute && isOldForm ? known : none;
}

KnownName Classify(std::string_view inName, bool inIsAttribute) {
    const std::size_t space = inName.rfind(' ');
    if (space == std::string_view::npos) {
        return WithoutNamespace(inName, inIsAttribute);
    }
    const std::string_view uri = inName.substr(0, space);
    const std::string_view local = inName.substr(space + 1);
    if (uri == kNamespace_RDF) {
        return OfRDF(local);
    }
    if (uri == kNamespace_XML) {
        return OfXML(local);
    }
    KnownName known;
    known.term =
        uri == kNamespace_Meta && (local == "xmpmeta" || local == "xapmeta") ? Term::Meta : Term::Property;
    return known;
}

}  // namespace

Terms::Terms() : mElements(kMostNames), mAttributes(kMostNames) {}

KnownName& Terms::Look(std::string_view inName, NameTable<KnownName>& ioTable) {
    KnownName* const known = ioTable.Find(inName);
    if (!known) {
        throw Refusal{"too many different names"};
    }
    if (known->name.empty()) {
        *known = New(inName, &ioTable == &mAttributes);
    }
    return *known;
}

KnownName Terms::New(std::string_view inName, bool inIsAttribute) {
    KnownName known = Classify(inName, inIsAttribute);
    known.name = known.term == Term::Type ? TypeName() : NodeFactory::MakeName(inName);
    return known;
}

}  // namespace OrvaneXMP
