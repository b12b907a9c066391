// Keeps what each prefix stands for, and the names that were resolved with it.
#include "OrvaneXMP/detail/QualifiedNames.h"

#include "OrvaneXMP/Namespaces.h"

namespace OrvaneXMP {

namespace {

constexpr std::size_t kMostQualifiedNames = 16384;
constexpr std::size_t kMostPrefixes = 1024;
constexpr std::size_t kMostDeclarationsInForce = 1024;
constexpr std::size_t kLongestName = 1024;
/// Of the attributes of one element, with their URIs.
constexpr std::size_t kMostExpanded = 1u << 20;
constexpr std::string_view kNamespaceOfDeclarations = "http://www.w3.org/2000/xmlns/";

[[noreturn]] void LeaveIt() {
    throw Refusal{"a name or a namespace is not as usual"};
}

/// Of the characters that begin a name only those of ASCII; the parser has seen to all others being of a
/// name.
bool BeginsPlainly(std::string_view inLocal) noexcept {
    const char first = inLocal.empty() ? '\0' : inLocal.front();
    return (first >= 'a' && first <= 'z') || (first >= 'A' && first <= 'Z') || first == '_';
}

}  // namespace

QualifiedNames::QualifiedNames(Terms& inTerms)
    : mTerms(inTerms),
      mPrefixes(kMostPrefixes),
      mElements(kMostQualifiedNames),
      mAttributes(kMostQualifiedNames),
      mDefault(PrefixNamed("")) {
    Prefix& ofXML = PrefixNamed("xml");
    ofXML.uri = kNamespace_XML;
    ofXML.declaration = ++mDeclarations;
}

QualifiedNames::Prefix& QualifiedNames::PrefixNamed(std::string_view inPrefix) {
    Prefix* const prefix = mPrefixes.Find(inPrefix);
    if (!prefix) {
        LeaveIt();
    }
    return *prefix;
}

void QualifiedNames::Open() noexcept {
    ++mDepth;
    ++mElement;
    mExpandedSize = 0;
}

void QualifiedNames::Close() noexcept {
    for (; !mUndos.empty() && mUndos.back().depth == mDepth; mUndos.pop_back()) {
        std::swap(*mUndos.back().prefix, mUndos.back().former);
    }
    --mDepth;
}

std::string_view QualifiedNames::Declare(std::string_view inName, std::string_view inURI) {
    const bool isDefault = inName == kHead;
    const std::string_view prefixText = isDefault ? std::string_view("") : inName.substr(kHead.size() + 1);
    const bool isReserved = prefixText == "xml" || prefixText == "xmlns" || inURI == kNamespace_XML ||
                            inURI == kNamespaceOfDeclarations;
    const bool isPlain = isDefault || (BeginsPlainly(prefixText) && !inURI.empty() &&
                                       prefixText.find(':') == std::string_view::npos);
    if (isReserved || !isPlain || prefixText.size() > kLongestName ||
        inURI.find(' ') != std::string_view::npos || mUndos.size() >= kMostDeclarationsInForce) {
        LeaveIt();
    }
    Prefix& prefix = PrefixNamed(prefixText);
    Prefix declared{std::string(inURI), inURI.empty() ? 0 : ++mDeclarations};
    mUndos.push_back({&prefix, std::move(prefix), mDepth});
    prefix = std::move(declared);
    return prefixText;
}

const KnownName& QualifiedNames::OfElement(const char* inName) {
    return *Resolve(inName, mElements, mDefault).known;
}

const KnownName& QualifiedNames::OfAttribute(const char* inName) {
    Resolved& resolved = Resolve(inName, mAttributes, mNoNamespace);
    mExpandedSize += resolved.expandedSize;
    // Two prefixes of one namespace can give one element the same attribute twice.
    if (resolved.known->seenIn == mElement || mExpandedSize > kMostExpanded) {
        LeaveIt();
    }
    resolved.known->seenIn = mElement;
    return *resolved.known;
}

QualifiedNames::Resolved& QualifiedNames::Resolve(const char* inName, NameTable<Resolved>& ioTable,
                                                  const Prefix& inUnprefixed) {
    Resolved* const resolved = ioTable.FindInTurn(inName);
    if (!resolved) {
        LeaveIt();
    }
    if (!resolved->known || resolved->declaration != resolved->prefix->declaration) {
        ResolveAnew(inName, inUnprefixed, *resolved);
    }
    return *resolved;
}

void QualifiedNames::ResolveAnew(std::string_view inName, const Prefix& inUnprefixed, Resolved& outResolved) {
    const std::size_t colon = inName.find(':');
    const bool isPrefixed = colon != std::string_view::npos;
    const std::string_view local = inName.substr(isPrefixed ? colon + 1 : 0);
    const bool isPlain =
        !isPrefixed || (colon > 0 && BeginsPlainly(local) && local.find(':') == std::string_view::npos);
    if (!isPlain || inName.size() > kLongestName) {
        LeaveIt();
    }
    const Prefix& prefix = isPrefixed ? PrefixNamed(inName.substr(0, colon)) : inUnprefixed;
    if (isPrefixed && prefix.declaration == 0) {
        LeaveIt();
    }
    mExpanded.clear();
    if (prefix.declaration != 0) {
        mExpanded.append(prefix.uri).append(1, ' ');
    }
    mExpanded.append(local);
    const bool isAttribute = &inUnprefixed == &mNoNamespace;
    if (isAttribute) {
        outResolved.known = &mTerms.OfAttribute(mExpanded);
    } else {
        if (++mElementNames > kMostQualifiedNames) {
            LeaveIt();
        }
        outResolved.ofElement = Terms::New(mExpanded, false);
        outResolved.known = &outResolved.ofElement;
    }
    outResolved.prefix = &prefix;
    outResolved.declaration = prefix.declaration;
    outResolved.expandedSize = mExpanded.size();
}

}  // namespace OrvaneXMP
