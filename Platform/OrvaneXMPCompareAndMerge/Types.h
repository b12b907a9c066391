// The words of the three-way merge: what conflicts, why, and from where a value came.
#pragma once

#include <cstddef>
#include <cstdint>

#include "OrvaneXMP/Path.h"
#include "OrvaneXMP/Tree.h"
#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace OrvaneXMPCompareAndMerge {

using OrvaneXMP::Node;
using OrvaneXMP::Packet;
using OrvaneXMP::Path;

/// What a node is, roughly. Where the sides differ in it, it is the user's, or that of latest when the user
/// has none.
enum class NodeType : std::int32_t { Simple = 0, Array = 1, Structure = 2 };

enum class ConflictReason : std::int32_t {
    /// Changed, or added, by both in different ways.
    ChangedOnBothSides = 1,
    /// Changed by both into different kinds of nodes.
    OfDifferentKinds = 2,
    /// Changed by others, removed by the user.
    RemovedByUser = 3,
    /// Removed by others, changed by the user.
    RemovedFromLatest = 4
};

/// From where a value of the result came. New is a value that none of the three has as a whole.
enum class ResolvedSource : std::int32_t { Base = 1, Latest = 2, User = 3, New = 4 };

/// What ResolveConflict of a strategy returns when it resolved.
constexpr std::int32_t kResolved = 0;
/// The status of a conflict that a strategy resolved.
constexpr std::int32_t kResolvedStatus_ByStrategy = 0x7FFFFFFE;

/// A path that shares its beginning with others, so that many paths into one deep tree stay small. It is used
/// as a Path. Immutable; the default one has no step. Threads: as a shared_ptr to a constant.
class ZOPLATFORM_EXPORT SharedPath {
public:
    SharedPath() noexcept = default;
    /// The path with one step more.
    SharedPath Below(const OrvaneXMP::PathStep& inStep) const;
    /// The number of steps.
    std::size_t size() const noexcept;
    operator Path() const;

private:
    struct Link;
    ostcore::shared_ptr<const Link> mLast;
};

/// One side's node of a conflict, and the whole packet that it is part of. The node is absent when the
/// property does not exist on that side. Valid as long as the call that was given it.
struct SideNode {
    const Node& node;
    const Packet& packet;

    explicit operator bool() const noexcept { return node.IsPresent(); }
};

}  // namespace OrvaneXMPCompareAndMerge
