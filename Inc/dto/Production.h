// A production, session or transaction as the server tells of it, and a list of any of them.
#pragma once

#include "dto/TransferStructure.h"

namespace ZOCL {
namespace dto {

/// The object under "properties"; kept as it was read, so that unknown keys go back unchanged.
class ProductionBaseProperties : public TransferStructure<ProductionBaseProperties> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::ProductionBaseProperties";
    static const BindingTable& Table();

    std::string_view Name() const { return Text("name"); }
    std::string_view Description() const { return Text("description"); }
    std::vector<ImmutableString> Tags() const { return Strings("tags"); }

    void Set(std::string_view inKey, const JSONValue& inValue);
};

/// Who wrote a production: the host application and its machine.
class ClientMetadata : public TransferStructure<ClientMetadata> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::ClientMetadata";
    static const BindingTable& Table();

    ImmutableString TransactionType() const { return String("transactionType"); }
    /// In the title of a commit alone: the request that made it.
    std::string_view RequestID() const { return Text(kRequestID); }
    static constexpr const char* kRequestID = "requestID";
};

class Production : public TransferStructure<Production> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::Production";
    static const BindingTable& Table();

    /// The transaction's identifier, else the session's, else the production's.
    ImmutableString Identifier() const;
    ImmutableString ParentIdentifier() const { return String("zo:parentProductionId"); }
    ImmutableString CommitID() const { return String("zo:commitId", "commitId"); }
    ImmutableString BaseCommitID() const { return String("zo:baseCommitId"); }
    ImmutableString Owner() const { return String("zo:owner", "owner"); }
    ptime Created() const { return Date("created"); }
    ptime Modified() const { return Date("modified"); }
    ProductionBaseProperties Properties() const { return Structure<ProductionBaseProperties>("properties"); }
    ClientMetadata Metadata() const { return Structure<ClientMetadata>("metadata"); }

    void SetProperties(const ProductionBaseProperties& inProperties);
};

/// An item of a list.
class ProductionListItem : public TransferStructure<ProductionListItem> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::ProductionListItem";
    static const BindingTable& Table();

    ImmutableString Identifier() const;
    ImmutableString SessionIdentifier() const { return String("zo:sessionId"); }
    ImmutableString Owner() const { return String("zo:owner", "owner"); }
    ImmutableString BaseCommitID() const { return String("zo:baseCommitId"); }
    ptime Created() const { return Date("created"); }
    ptime Modified() const { return Date("modified"); }
    ptime LastModified() const { return Date("zo:lastModified"); }
    ptime LastModifiedOfAllSessions() const { return Date("zo:lastModifiedOfAllSessions"); }
    ProductionBaseProperties Properties() const { return Structure<ProductionBaseProperties>("properties"); }
    ClientMetadata Metadata() const { return Structure<ClientMetadata>("metadata"); }
};

/// A list of productions, sessions or transactions alike.
class Productions : public TransferStructure<Productions> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::Productions";
    static const BindingTable& Table();

    /// Productions, then sessions, then transactions.
    std::vector<ProductionListItem> Items() const;
};

}  // namespace dto
}  // namespace ZOCL
