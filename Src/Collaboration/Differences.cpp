// Reading differences, and finding those of any two commits.
#include "Collaboration/Differences.h"

#include "Model/ResourceCreation.h"
#include "Relations.h"

namespace ZOCL {

const ImmutableString kDifferenceType_Added("ADDED");
const ImmutableString kDifferenceType_Updated("UPDATED");
const ImmutableString kDifferenceType_Removed("REMOVED");

namespace {

ImmutableString FindHRef(const Links& inLinks, const ImmutableString& inRelation) {
    return FindLink(inLinks, inRelation, ImmutableString()).href;
}

IZOCDifferences::Entry MakeEntry(const dto::Difference& inDifference) {
    const Links links = inDifference.GetLinks();
    IZOCDifferences::Entry entry;
    entry.identifier = inDifference.AssetID();
    entry.name = inDifference.Name();
    entry.differenceType = inDifference.DifferenceType();
    entry.conflictsWithContentID = inDifference.ConflictsWithContentID();
    entry.baseCommitID = inDifference.BaseCommitID();
    entry.committer = inDifference.Committer();
    entry.committed = inDifference.Committed();
    entry.itemURL = FindHRef(links, kRelation_Self);
    const ImmutableString parent = FindHRef(links, kRelation_Up);
    entry.assetURL = parent.empty() ? entry.itemURL : parent;
    entry.acceptTheirsURL = FindHRef(links, kRelation_AcceptTheirs);
    entry.acceptYoursURL = FindHRef(links, kRelation_AcceptYours);
    return entry;
}

std::vector<IZOCDifferences::Entry> MakeEntries(const dto::BoundList<dto::Difference>& inList) {
    std::vector<IZOCDifferences::Entry> entries;
    entries.reserve(inList.size());
    for (const dto::Difference& difference : inList) {
        entries.push_back(MakeEntry(difference));
    }
    return entries;
}

bool AnyInConflict(const dto::BoundList<dto::Difference>& inList) {
    for (const dto::Difference& difference : inList) {
        if (difference.IsInConflict()) {
            return true;
        }
    }
    return false;
}

bool AreAssetsInConflict(const dto::DifferenceLists& inLists) {
    return AnyInConflict(inLists.Assets());
}
bool AreEnclosuresInConflict(const dto::DifferenceLists& inLists) {
    return AnyInConflict(inLists.Enclosures());
}
bool ArePropertiesInConflict(const dto::DifferenceLists& inLists) {
    return inLists.HasProperties() && inLists.Properties().IsInConflict();
}

}  // namespace

std::vector<IZOCDifferences::Entry> Differences::GetEnclosureDifferences() {
    return MakeEntries(GetBody("ZODifference::GetEnclosureDifferences()").Lists().Enclosures());
}

std::vector<IZOCDifferences::Entry> Differences::GetAssetDifferences() {
    return MakeEntries(GetBody("ZODifference::GetAssetDifferences()").Lists().Assets());
}

std::vector<IZOCDifferences::Entry> Differences::GetPropertiesDifferences() {
    static const ImmutableString name("com.orvane.meridane.properties.difference");
    const dto::DifferenceLists lists = GetBody("ZODifference::GetPropertiesDifferences()").Lists();
    std::vector<Entry> entries;
    if (lists.HasProperties()) {
        entries.push_back(MakeEntry(lists.Properties()));
        entries.back().name = name;
    }
    return entries;
}

bool Differences::HasDifferences() {
    const dto::DifferenceLists lists = GetBody("ZODifference::HasDifferences()").Lists();
    return !lists.Assets().empty() || !lists.Enclosures().empty() || lists.HasProperties();
}

bool Differences::HasConflicts() {
    // One body for all three questions, which a reload between them could not answer differently.
    const dto::DifferenceLists lists = GetBody("ZODifference::HasConflicts()").Lists();
    return ArePropertiesInConflict(lists) || AreAssetsInConflict(lists) || AreEnclosuresInConflict(lists);
}

bool Differences::HasAssetConflicts() {
    return AreAssetsInConflict(GetBody("ZODifference::HasAssetConflicts()").Lists());
}

bool Differences::HasEnclosureConflicts() {
    return AreEnclosuresInConflict(GetBody("ZODifference::HasEnclosureConflicts()").Lists());
}

bool Differences::HasPropertiesConflicts() {
    return ArePropertiesInConflict(GetBody("ZODifference::HasPropertiesConflicts()").Lists());
}

ImmutableString Differences::GetCommitID() {
    return GetBody("ZOCL::Differences::GetCommitID").Info().RightSideCommitID();
}

ImmutableString Differences::GetBaseCommitID() {
    return GetBody("ZOCL::Differences::GetBaseCommitID").Info().LeftSideCommitID();
}

InterfaceRef<IZOCDifferences> GetDifferencesByCommit(const InterfaceRef<IZOCDataServer>& inServer,
                                                     const ImmutableString& inProductionID,
                                                     const ImmutableString& inBaseCommitID,
                                                     const ImmutableString& inCommitID) {
    static const ImmutableString head("HEAD");
    const ImmutableString href =
        inServer ? inServer->GetLink(kRelation_Productions_Production_DifferenceByCommit) : ImmutableString();
    const ImmutableString url = ExpandTemplate(
        href, {{"{productionId}", inProductionID},
               {"{baseCommitId}", inBaseCommitID.IsNull() ? ImmutableString("") : inBaseCommitID},
               {"{commitId}", inCommitID.empty() ? head : inCommitID}});
    return MakeAtURL<Differences>(url, inServer, ResourceWritability::kReadOnly);
}

}  // namespace ZOCL
