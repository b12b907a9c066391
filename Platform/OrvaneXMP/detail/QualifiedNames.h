// Resolves the prefixes of a packet whose parser leaves them alone.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "OrvaneXMP/detail/NameTable.h"
#include "OrvaneXMP/detail/Terms.h"

namespace OrvaneXMP {

/// Meant for what packets are made of, and quick with it: Refusal is thrown for all that is against the rules
/// of namespaces, and as well for what is merely rare. A parser that knows namespaces has the last word on
/// those. What is not refused here it would take, and within its bounds of memory.
class QualifiedNames {
public:
    /// inTerms outlives this.
    explicit QualifiedNames(Terms& inTerms);

    /// For each element: Open, its declarations, its name, its attributes, and in the end Close.
    void Open() noexcept;
    /// inName is that of the attribute. Returns the prefix, empty for the default namespace.
    std::string_view Declare(std::string_view inName, std::string_view inURI);
    const KnownName& OfElement(const char* inName);
    const KnownName& OfAttribute(const char* inName);
    void Close() noexcept;

    /// "xmlns", or what begins with "xmlns:".
    static bool IsDeclaration(std::string_view inName) noexcept {
        return inName.substr(0, kHead.size()) == kHead &&
               (inName.size() == kHead.size() || inName[kHead.size()] == ':');
    }

private:
    static constexpr std::string_view kHead = "xmlns";

    /// What a prefix stands for now. Each declaration has a number of its own, 0 is for none.
    struct Prefix {
        std::string uri;
        std::uint64_t declaration = 0;
    };
    /// A name is resolved anew when the declaration of its prefix is not the one it was resolved with.
    struct Resolved {
        const Prefix* prefix = nullptr;
        std::uint64_t declaration = 0;
        KnownName* known = nullptr;
        std::size_t expandedSize = 0;
        /// Of an element. The same attribute has to be known as one whatever its prefix is.
        KnownName ofElement;
    };
    struct Undo {
        Prefix* prefix;
        Prefix former;
        std::size_t depth;
    };

    Prefix& PrefixNamed(std::string_view inPrefix);
    /// inUnprefixed is what a name without a prefix belongs to.
    Resolved& Resolve(const char* inName, NameTable<Resolved>& ioTable, const Prefix& inUnprefixed);
    void ResolveAnew(std::string_view inName, const Prefix& inUnprefixed, Resolved& outResolved);

    Terms& mTerms;
    NameTable<Prefix> mPrefixes;
    NameTable<Resolved> mElements;
    NameTable<Resolved> mAttributes;
    Prefix& mDefault;
    Prefix mNoNamespace;
    std::vector<Undo> mUndos;
    std::string mExpanded;
    std::uint64_t mDeclarations = 0;
    std::size_t mDepth = 0;
    std::size_t mExpandedSize = 0;
    std::size_t mElementNames = 0;
    std::uint32_t mElement = 0;
};

}  // namespace OrvaneXMP
