// Reading pages of commits, and how a commit is shown to a user.
#include "Collaboration/ProductionHistory.h"

#include <algorithm>
#include <limits>

#include "Model/ResourceCreation.h"
#include "ostcore/config/ZString.h"
#include "ostcore/utility/StringConversion.h"
#include "Relations.h"

namespace ZOCL {

using ostcore::ZString;
using ostcore::utility::ToUTF16;
using ostcore::utility::ToUTF8;

namespace {

/// Enough of a commit's identifier to tell it from its neighbours.
UString ShortRevision(const ImmutableString& inRevision) {
    constexpr std::size_t kLength = 8;
    constexpr char16_t kFirstHighSurrogate = 0xD800, kLastHighSurrogate = 0xDBFF;
    UString text = ToUTF16(inRevision.view());
    if (text.size() > kLength) {
        const char16_t last = text[kLength - 1];
        text.resize(last >= kFirstHighSurrogate && last <= kLastHighSurrogate ? kLength - 1 : kLength);
    }
    return text;
}

UString UserName(const dto::Committer& inCommitter) {
    const ImmutableString displayName = inCommitter.DisplayName();
    return ToUTF16(displayName.empty() ? inCommitter.Name().view() : displayName.view());
}

UString MessageOf(const UString& inTitle) {
    CommitMetadata metadata;
    return GetCommitMetadataFromTitle(inTitle, metadata) ? metadata.commitMessage : inTitle;
}

}  // namespace

ImmutableString HistoryVersion::GetRevision() {
    return GetBody("HistoryVersion::GetRevision").CommitID();
}

ImmutableString HistoryVersion::GetUserID() {
    return GetBody("HistoryVersion::GetUserID").Committer().Name();
}

ptime HistoryVersion::GetTime() {
    return GetBody("HistoryVersion::GetTime").Timestamp();
}

void HistoryVersion::GetInfo(UString& outDate, UString& outUserName, UString& outTitle, UString& outMessage,
                             UString& outShortRevision) {
    const dto::VersionsBlock body = GetBody("HistoryVersion::GetInfo");
    outDate = FormatDateTime(body.Timestamp(), kDisplayDateTimeFormat);
    outUserName = UserName(body.Committer());
    outTitle = ToUTF16(body.Title());
    outMessage = MessageOf(outTitle);
    outShortRevision = ShortRevision(body.CommitID());
}

UString HistoryVersion::GetToolTipString(const UString& inProductionName) {
    const dto::VersionsBlock body = GetBody("HistoryVersion::GetToolTipString");
    const dto::Committer committer = body.Committer();
    U8String production;
    if (!inProductionName.empty()) {
        production = ZString("$$$/Cadenzo/ZOCL/ZOHistoryVersion_Production=Production: @0\n",
                             {ToUTF8(inProductionName)})
                         .AsUTF8();
    }
    return ZString("$$$/Cadenzo/ZOCL/ZOHistoryVersion_ToolTip=@0Version: @1\nUser: @2 (@3)\nComment: @4",
                   {production, ToUTF8(ShortRevision(body.CommitID())), ToUTF8(UserName(committer)),
                    committer.Name().str(), ToUTF8(MessageOf(ToUTF16(body.Title())))})
        .AsString();
}

int ProductionHistory::GetHistoryVersionCount() {
    const std::size_t count = GetBody("ProductionHistory::GetHistoryVersionCount").Versions().size();
    return static_cast<int>(std::min<std::size_t>(count, std::numeric_limits<int>::max()));
}

InterfaceRef<IZOCHistoryVersion> ProductionHistory::GetHistoryVersion(int inIndex) {
    const auto versions = GetBody("ProductionHistory::GetHistoryVersion").Versions();
    if (versions.empty()) {
        return nullptr;
    }
    const std::size_t index = std::min(static_cast<std::size_t>(std::max(inIndex, 0)), versions.size() - 1);
    return MakeFromBody<HistoryVersion>(versions[index], ImmutableString(), GetServer(),
                                        ResourceWritability::kReadOnly);
}

InterfaceRef<IZOCProductionHistory> ProductionHistory::GetNextPage() {
    return MakeAtURL<ProductionHistory>(GetLinkHref(kRelation_Next), GetServer(),
                                        ResourceWritability::kReadOnly);
}

ImmutableString ProductionHistory::GetRevision() {
    const auto versions = GetBody("ProductionHistory::GetRevision").Versions();
    return versions.empty() ? ImmutableString() : versions[0].CommitID();
}

ImmutableString ProductionHistory::GetMostRecentRevision() {
    return GetRevision();
}

}  // namespace ZOCL
