// Pages of commits, and the commits on them.
#pragma once

#include "dto/ProductionHistory.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCProductionHistory.h"

namespace ZOCL {

class HistoryVersion final
    : public Implements<JSONServerResource<dto::VersionsBlock>, Readable<IZOCHistoryVersion>> {
public:
    ImmutableString GetRevision() override;
    ImmutableString GetUserID() override;
    void GetInfo(UString& outDate, UString& outUserName, UString& outTitle, UString& outMessage,
                 UString& outShortRevision) override;
    UString GetToolTipString(const UString& inProductionName) override;
    ptime GetTime() override;
};

class ProductionHistory final
    : public Implements<JSONServerResource<dto::ProductionHistory>, Readable<IZOCProductionHistory>> {
public:
    int GetHistoryVersionCount() override;
    InterfaceRef<IZOCHistoryVersion> GetHistoryVersion(int inIndex) override;
    InterfaceRef<IZOCProductionHistory> GetNextPage() override;
    ImmutableString GetRevision() override;
    ImmutableString GetMostRecentRevision() override;
};

}  // namespace ZOCL
