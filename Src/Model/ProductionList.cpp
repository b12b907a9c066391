// Reading and walking lists of productions.
#include "Model/ProductionList.h"

#include "Model/DataServerCaches.h"
#include "Model/Production.h"
#include "Model/ResourceCreation.h"
#include "ostcore/utility/StringConversion.h"
#include "Relations.h"

namespace ZOCL {

using ostcore::utility::ToUTF16;

ImmutableString FindItemURL(const Links& inLinks) {
    for (const ImmutableString& relation : {kRelation_Self, kRelation_Edit, kRelation_LatestVersion}) {
        const ImmutableString href = FindLink(inLinks, relation, ImmutableString()).href;
        if (!href.empty()) {
            return href;
        }
    }
    return ImmutableString();
}

std::vector<IZOCProductionList::Entry> ProductionList::GetAllItems() {
    const dto::Productions body = GetBody("ProductionList::GetAllItems");
    std::vector<Entry> entries;
    for (const dto::ProductionListItem& item : body.Items()) {
        const dto::ProductionBaseProperties properties = item.Properties();
        Entry entry;
        entry.name = ToUTF16(properties.Name());
        entry.description = ToUTF16(properties.Description());
        entry.identifier = item.Identifier();
        entry.owner = item.Owner();
        entry.lastModified = item.LastModified();
        entry.lastModifiedOfAllSessions = item.LastModifiedOfAllSessions();
        entry.url = FindItemURL(item.GetLinks());
        entries.push_back(std::move(entry));
    }
    return entries;
}

InterfaceRef<IZOCProduction> ProductionList::GetProduction(const Entry& inEntry) {
    const InterfaceRef<IZOCDataServer> server = GetServer();
    if (const auto cached = FindOrMakeProduction(server, inEntry.url)) {
        return cached;
    }
    return MakeAtURL<Production>(inEntry.url, server, GetWritability());
}

bool ProductionList::Load(const Guid& inRequestID, const RequestCompletion& inCompletion,
                          bool inReportErrors) {
    return ServerResource::Load(inRequestID, inCompletion, inReportErrors);
}

bool ProductionList::Load(bool inReportErrors) {
    return ServerResource::Load(inReportErrors);
}

bool ProductionList::GetNewProduction(const Guid& inRequestID, const UString& inName,
                                      const UString& inDescription, bool inIsTemporary,
                                      const RequestCompletion& inCompletion) {
    const ImmutableString create = GetLinkHref(kRelation_Create);
    return PostJSONForNew<Production>(inRequestID, create.empty() ? GetHTTPURL() : create, GetServer(),
                                      MakeProductionCreationBody(inName, inDescription, inIsTemporary),
                                      inCompletion);
}

InterfaceRef<IZOCProductionList> ProductionList::GetNextPage() {
    return MakeAtURL<ProductionList>(GetLinkHref(kRelation_Next), GetServer(), GetWritability());
}

}  // namespace ZOCL
