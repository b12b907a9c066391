// The addresses of differences and of the answers to conflicts, below the address of a line.
#pragma once

namespace zohub {

inline constexpr char kOutgoingTail[] = "/outgoing";
inline constexpr char kIncomingTail[] = "/incoming";
inline constexpr char kAcceptTheirsTail[] = "/accept-theirs";
inline constexpr char kAcceptYoursTail[] = "/accept-yours";

/// Below the API's address; for the service document.
inline constexpr char kDifferenceByCommitTemplate[] =
    "/p/{productionId}/diff?base={baseCommitId}&commit={commitId}";

}  // namespace zohub
