// Lists of productions, sessions or transactions, page by page.
#pragma once

#include "dto/Production.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCProduction.h"

namespace ZOCL {

class ProductionList final
    : public Implements<JSONServerResource<dto::Productions>, Readable<IZOCProductionList>> {
public:
    std::vector<Entry> GetAllItems() override;
    InterfaceRef<IZOCProduction> GetProduction(const Entry& inEntry) override;
    bool Load(const Guid& inRequestID, const RequestCompletion& inCompletion, bool inReportErrors) override;
    bool Load(bool inReportErrors) override;
    bool GetNewProduction(const Guid& inRequestID, const UString& inName, const UString& inDescription,
                          bool inIsTemporary, const RequestCompletion& inCompletion) override;
    InterfaceRef<IZOCProductionList> GetNextPage() override;
};

/// Where an item of a list leads: the first of "self", "edit" and "latest-version" that has a target.
ImmutableString FindItemURL(const Links& inLinks);

}  // namespace ZOCL
