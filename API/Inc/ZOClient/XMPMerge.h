// Merging XMP metadata: of packets at hand, without a server, and of the conflicts of an editing session.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "ZOClient/Export.h"
#include "ZOClient/ResultCodes.h"

namespace ZOCL {

/// Which packet could not be read, where and why. Line and column count from 1, 0 when there is no place. The
/// reason quotes names of the packet, never values.
struct XMPFailure {
    /// "base", "theirs" or "mine" of a merge, "old" or "new" of a comparison; "merged" when what came out is
    /// larger than a packet may be.
    std::string packet;
    std::string reason;
    std::size_t line = 0;
    std::size_t column = 0;
};

/// Something that both sides changed and that no rule settles.
struct XMPMergeConflict {
    /// As people write it: dc:title[?xml:lang="de"].
    std::string path;
    /// "changed-on-both-sides", "of-different-kinds", "removed-by-mine" or "removed-by-theirs".
    std::string reason;
};

struct XMPMergeOutcome {
    /// A whole packet in UTF-8. Where there is a conflict it holds what mine has.
    std::string packet;
    /// Empty: everything is merged.
    std::vector<XMPMergeConflict> conflicts;
    /// Every decision of the merge with its side and cause, and the values of each conflict: one JSON object
    /// in UTF-8 by the schema "xmp-merge" of Docs/xmp-merge.md.
    std::string report;
    XMPFailure failure;
};

/// Merges what two sides made of a common packet, by the rules by which AutoResolveXMPConflicts merges:
/// theirs are the others, mine is the user. The three are packets in any encoding and form that XMP allows.
///
/// kResultSuccess: there is a packet, with or without conflicts. kResultFailure: only the failure is set.
/// Needs neither Initialize nor a server. Threads: any.
ZOCL_EXPORT int MergeXMPPackets(const std::string& inBase, const std::string& inTheirs,
                                const std::string& inMine, XMPMergeOutcome& outOutcome);

struct XMPDifference {
    std::string path;
    /// "added", "removed" or "changed".
    std::string change;
    /// The values as people read them, on one line, each of at most a few hundred characters; empty when
    /// there is none on that side.
    std::string oldValue;
    std::string newValue;
};

struct XMPComparison {
    /// Sorted by name; empty for packets that say the same, in whatever form.
    std::vector<XMPDifference> differences;
    /// The same with the whole values, by the schema "xmp-diff" of Docs/xmp-merge.md.
    std::string report;
    XMPFailure failure;
};

/// Compares what two packets say. Results and threads as MergeXMPPackets.
ZOCL_EXPORT int CompareXMPPackets(const std::string& inOld, const std::string& inNew,
                                  XMPComparison& outComparison);

/// Merges the XMP metadata that a get-latest left in conflict, under a progress window that can be cancelled:
/// loads the common ancestor, the shared and the session's packet of each such enclosure, merges them, and
/// commits what is merged as one transaction of the session. The conflicts of what was merged end with that;
/// an enclosure that cannot be loaded or merged stays in conflict, as does one that a side does not have.
///
/// inCommitID is the session's commit that the get-latest ended with. Returns whether conflicts of any kind
/// remain: true also when nothing could be found out, after a cancel, and off the main thread, where nothing
/// is done. Main thread only; its queue is pumped meanwhile; hold no lock.
ZOCL_EXPORT bool AutoResolveXMPConflicts(const ImmutableString& inSessionURL,
                                         const ImmutableString& inCommitID);

}  // namespace ZOCL
