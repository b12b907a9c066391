// The keys of the transfer structures of history and differences.
#include "dto/Differences.h"
#include "dto/ProductionHistory.h"

namespace ZOCL {
namespace dto {

using Kind = BindingKind;

const BindingTable& Difference::Table() {
    static const BindingTable table{
        {"zo:assetId", Kind::OptionalString},
        {"zo:name", Kind::OptionalString},
        {"zo:differenceType", Kind::OptionalString},
        {"zo:conflictsWithContentId", Kind::OptionalString},
        {"zo:baseCommitId", Kind::OptionalString},
        {"zo:committer", Kind::OptionalString},
        {"zo:committed", Kind::Date},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

const BindingTable& DifferenceLists::Table() {
    static const BindingTable table{
        {"assets", Kind::ObjectList, &Difference::Table},
        {"enclosures", Kind::ObjectList, &Difference::Table},
        {"properties", Kind::Object, &Difference::Table},
    };
    return table;
}

const BindingTable& DifferenceInfo::Table() {
    static const BindingTable table{
        {"leftSideCommitId", Kind::OptionalString},
        {"rightSideCommitId", Kind::OptionalString},
    };
    return table;
}

const BindingTable& Differences::Table() {
    static const BindingTable table{
        {"info", Kind::Object, &DifferenceInfo::Table},
        {"differences", Kind::Object, &DifferenceLists::Table},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

const BindingTable& Committer::Table() {
    static const BindingTable table{
        {"name", Kind::OptionalString},
        {"displayName", Kind::OptionalString},
    };
    return table;
}

const BindingTable& VersionsBlock::Table() {
    static const BindingTable table{
        {"commitId", Kind::OptionalString},      {"timestamp", Kind::Date},
        {"title", Kind::OptionalString},         {"committer", Kind::Object, &Committer::Table},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

const BindingTable& ProductionHistory::Table() {
    static const BindingTable table{
        {"versions", Kind::ObjectList, &VersionsBlock::Table},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

const BindingTable& CommitTitle::Table() {
    static const BindingTable table{
        {"commitMessage", Kind::OptionalString},
        {"metadata", Kind::Object, &ClientMetadata::Table},
    };
    return table;
}

}  // namespace dto
}  // namespace ZOCL
