// Reading the titles of commits.
#include "ZOClient/CommitMetadata.h"

#include "dto/ProductionHistory.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/IZOCProductionHistory.h"

namespace ZOCL {

using ostcore::utility::ToUTF16;
using ostcore::utility::ToUTF8;

namespace {

std::string_view TrimBlanksAndTabs(std::string_view inText) {
    constexpr std::string_view blanks = " \t";
    const std::size_t first = inText.find_first_not_of(blanks);
    return first == std::string_view::npos
               ? std::string_view()
               : inText.substr(first, inText.find_last_not_of(blanks) - first + 1);
}

bool LooksLikeAnObject(std::string_view inText) {
    return inText.size() >= 2 && inText.front() == '{' && inText.back() == '}';
}

ClientMetadata ReadClientMetadata(const dto::ClientMetadata& inMetadata) {
    ClientMetadata result;
    result.applicationName = inMetadata.String("applicationName");
    result.applicationBuildNumber = inMetadata.String("applicationBuildNumber");
    Guid::Parse(inMetadata.Text("applicationInstanceID"), result.applicationInstanceID);
    result.machineID = inMetadata.String("machineID");
    result.machineName = inMetadata.String("machineName");
    result.machineIP = inMetadata.String("machineIP");
    result.transactionType = inMetadata.String("transactionType");
    return result;
}

}  // namespace

bool GetCommitMetadataFromTitle(const UString& inTitle, CommitMetadata& outMetadata) {
    const std::string title = ToUTF8(inTitle);
    const std::string_view text = TrimBlanksAndTabs(title);
    if (!LooksLikeAnObject(text)) {
        return false;
    }
    try {
        const auto content = dto::CommitTitle::FromJSON(text);
        if (!content.HasContent()) {
            return false;
        }
        outMetadata.commitMessage = ToUTF16(content.CommitMessage());
        outMetadata.metadata = ReadClientMetadata(content.Metadata());
        return true;
    } catch (const std::exception&) {
        return false;
    }
}

bool GetCommitMetadataFromHistoryVersion(const InterfaceRef<IZOCHistoryVersion>& inVersion,
                                         CommitMetadata& outMetadata) {
    if (!inVersion) {
        return false;
    }
    UString date, userName, title, message, revision;
    inVersion->GetInfo(date, userName, title, message, revision);
    return GetCommitMetadataFromTitle(title, outMetadata);
}

}  // namespace ZOCL
