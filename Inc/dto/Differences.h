// The differences between two commits as the server tells of them.
#pragma once

#include "dto/TransferStructure.h"

namespace ZOCL {
namespace dto {

/// One item that differs: an asset, an enclosure, or the properties of the production.
class Difference : public TransferStructure<Difference> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::Difference";
    static const BindingTable& Table();

    ImmutableString AssetID() const { return String("zo:assetId"); }
    ImmutableString Name() const { return String("zo:name"); }
    ImmutableString DifferenceType() const { return String("zo:differenceType"); }
    ImmutableString ConflictsWithContentID() const { return String("zo:conflictsWithContentId"); }
    ImmutableString BaseCommitID() const { return String("zo:baseCommitId"); }
    ImmutableString Committer() const { return String("zo:committer"); }
    ptime Committed() const { return Date("zo:committed"); }
    bool IsInConflict() const { return !Text("zo:conflictsWithContentId").empty(); }
};

/// The object under "differences".
class DifferenceLists : public TransferStructure<DifferenceLists> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::DifferenceLists";
    static const BindingTable& Table();

    BoundList<Difference> Assets() const { return List<Difference>("assets"); }
    BoundList<Difference> Enclosures() const { return List<Difference>("enclosures"); }
    bool HasProperties() const { return !Object("properties").IsNull(); }
    Difference Properties() const { return Structure<Difference>("properties"); }
};

/// The object under "info".
class DifferenceInfo : public TransferStructure<DifferenceInfo> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::DifferenceInfo";
    static const BindingTable& Table();

    ImmutableString LeftSideCommitID() const { return String("leftSideCommitId"); }
    ImmutableString RightSideCommitID() const { return String("rightSideCommitId"); }
};

class Differences : public TransferStructure<Differences> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::Differences";
    static const BindingTable& Table();

    DifferenceInfo Info() const { return Structure<DifferenceInfo>("info"); }
    DifferenceLists Lists() const { return Structure<DifferenceLists>("differences"); }
};

}  // namespace dto
}  // namespace ZOCL
