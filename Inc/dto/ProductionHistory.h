// The history of a production as the server tells of it, its versions, and what their titles carry.
#pragma once

#include "dto/Production.h"
#include "dto/TransferStructure.h"

namespace ZOCL {
namespace dto {

class Committer : public TransferStructure<Committer> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::Committer";
    static const BindingTable& Table();

    /// The user's identifier.
    ImmutableString Name() const { return String("name"); }
    ImmutableString DisplayName() const { return String("displayName"); }
};

/// One version.
class VersionsBlock : public TransferStructure<VersionsBlock> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::VersionsBlock";
    static const BindingTable& Table();

    ImmutableString CommitID() const { return String("commitId"); }
    ptime Timestamp() const { return Date("timestamp"); }
    std::string_view Title() const { return Text("title"); }
    dto::Committer Committer() const { return Structure<dto::Committer>("committer"); }
};

/// One page, newest first.
class ProductionHistory : public TransferStructure<ProductionHistory> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::ProductionHistory";
    static const BindingTable& Table();

    BoundList<VersionsBlock> Versions() const { return List<VersionsBlock>("versions"); }
};

/// The title of a commit that a client of this library wrote; it travels as text.
class CommitTitle : public TransferStructure<CommitTitle> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::CommitTitle";
    static const BindingTable& Table();

    bool HasContent() const { return Has("commitMessage") || Has("metadata"); }
    std::string_view CommitMessage() const { return Text("commitMessage"); }
    ClientMetadata Metadata() const { return Structure<ClientMetadata>("metadata"); }
};

}  // namespace dto
}  // namespace ZOCL
