// The addresses behind the link relations, for scripts that name a relation rather than a path.
#include <utility>

#include "Base/Text.h"
#include "Faults/FaultScript.h"

namespace zohub {

namespace {

struct Row {
    char const* relation;
    char const* method;  ///< empty for any
    char const* pattern;
};

// As Docs/hub-protocol.md has them.
constexpr Row kRows[] = {
    {"/discovery/v1", "", "/zo/1/links"},
    {"/system/login", "", "/zo/1/system/login"},
    {"/system/logout", "", "/zo/1/system/logout"},
    {"/users/user#current", "", "/zo/1/users/current"},
    {"/productions", "", "/zo/1/p"},
    {"/productions/templates", "", "/zo/1/templates"},
    {"/productions/production#byIdAndCommitId", "", "/zo/1/p/*/at/*"},
    {"/productions/production#copy", "", "/zo/1/p/*/copy"},
    {"/productions/production#create-production", "", "/zo/1/p/*/copy"},
    {"/productions/production#history", "", "/zo/1/p/*/history"},
    {"/productions/production#differenceByCommit", "", "/zo/1/p/*/diff"},
    {"/assets", "", "/zo/1/p/*/a"},
    {"/assets", "", "/zo/1/p/*/at/*/a"},
    {"/assets#full", "", "/zo/1/p/*/full"},
    {"/assets#full", "", "/zo/1/p/*/at/*/full"},
    {"/assets/asset#create", "POST", "/zo/1/p/*/a"},
    {"/assets/asset#byId", "", "/zo/1/p/*/at/*/a/*"},
    {"/assets#restore", "", "/zo/1/p/*/restore/*"},
    {"/enclosures", "", "/zo/1/p/*/e"},
    {"/enclosures", "", "/zo/1/p/*/at/*/e"},
    {"/enclosures", "", "/zo/1/p/*/a/*/e"},
    {"/enclosures", "", "/zo/1/p/*/at/*/a/*/e"},
    {"/enclosures/enclosure#create", "POST", "/zo/1/p/*/e"},
    {"/enclosures/enclosure#create", "POST", "/zo/1/p/*/a/*/e"},
    {"/enclosures/enclosure", "", "/zo/1/p/*/pe/*"},
    {"/enclosures/enclosure#byContentId", "", "/zo/1/p/*/ce/*"},
    {"/renditions", "", "/zo/1/p/*/a/*/r"},
    {"/renditions", "", "/zo/1/p/*/at/*/a/*/r"},
    {"/renditions/rendition#create", "POST", "/zo/1/p/*/a/*/r"},
    {"/renditions/rendition", "", "/zo/1/p/*/pr/*"},
    {"/medialocators", "", "/zo/1/l"},
    {"/medialocator#byMediaLocatorId", "", "/zo/1/l/*"},
    {"/sessions", "", "/zo/1/p/*/sessions"},
    {"/sessions/session#push", "", "/zo/1/p/*/push"},
    {"/sessions/session#pull", "", "/zo/1/p/*/pull"},
    {"/sessions/session#copy", "", "/zo/1/p/*/copy"},
    {"/sessions/session#outgoingChanges", "", "/zo/1/p/*/outgoing"},
    {"/sessions/session#incomingChanges", "", "/zo/1/p/*/incoming"},
    {"/transactions", "", "/zo/1/p/*/transactions"},
    {"/transactions/transaction#commit", "", "/zo/1/p/*/commit"},
    {"/transactions/transaction#rollback", "", "/zo/1/p/*/rollback"},
    {"/bulk#create", "", "/zo/1/p/*/bulk/create"},
    {"/bulk#edit", "", "/zo/1/p/*/bulk/edit"},
    {"/bulk#delete", "", "/zo/1/p/*/bulk/delete"},
    {"accept-theirs", "", "/zo/1/p/*/accept-theirs"},
    {"accept-yours", "", "/zo/1/p/*/accept-yours"},
};

}  // namespace

std::vector<std::string> SplitPattern(std::string const& inPattern) {
    std::vector<std::string> segments;
    for (auto segment : Split(std::string_view(inPattern).substr(1), '/'))
        segments.emplace_back(segment);
    return segments;
}

std::vector<FaultTarget> TargetsOfRelation(std::string const& inRelation) {
    std::vector<FaultTarget> targets;
    for (Row const& row : kRows)
        if (inRelation == row.relation)
            targets.push_back({row.method, SplitPattern(row.pattern)});
    return targets;
}

}  // namespace zohub
