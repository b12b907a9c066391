// What the title of a commit tells of its origin, and how times are shown.
#pragma once

#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

class IZOCHistoryVersion;
class IZOCProduction;

/// Who wrote a transaction: the host application and its machine. A text that is not known is null.
struct ClientMetadata {
    ImmutableString applicationName;
    ImmutableString applicationBuildNumber;
    /// Of one run of the application; the null Guid when it is not known.
    Guid applicationInstanceID;
    /// Stable over the runs of all applications of one machine and user.
    ImmutableString machineID;
    ImmutableString machineName;
    ImmutableString machineIP;
    /// kTransactionType_*.
    ImmutableString transactionType;
};

/// The content of a commit title that a client of this library wrote.
struct CommitMetadata {
    UString commitMessage;
    ClientMetadata metadata;
};

/// Reads a title; blanks and tabs around it do not matter. False, and outMetadata unchanged, for a title that
/// is no such object: one that a user or an older client wrote is no error. Threads: any.
ZOCL_EXPORT bool GetCommitMetadataFromTitle(const UString& inTitle, CommitMetadata& outMetadata);
/// The same for the title of a version; false for a null one. Threads: any.
ZOCL_EXPORT bool GetCommitMetadataFromHistoryVersion(const InterfaceRef<IZOCHistoryVersion>& inVersion,
                                                     CommitMetadata& outMetadata);

/// Looks in the history of a production, newest first, for a commit whose title carries metadata and that
/// came after inCommitId.
///
/// The completion gets 0 and the version; kResultAlreadyThere with the version of inCommitId when nothing
/// lies after it; kResultHTTPNotFound when the history ended first; or the failure of the load. It runs
/// once, on a worker, when the result is true. False: nothing started, and it will not run.
ZOCL_EXPORT bool FindRecentRevisionWithCommitMetadata(
    const InterfaceRef<IZOCProduction>& inProduction, const ImmutableString& inCommitId,
    const function<void(int inResult, const InterfaceRef<IZOCHistoryVersion>& inVersion)>& inCompletion);

/// The form in which the library shows times to its users.
constexpr const char* kDisplayDateTimeFormat = "%m/%d/%y, %I:%M:%S %p";
/// A time in UTC as local time, in the form of a boost::posix_time time facet; empty for not-a-date-time.
/// The texts are English, whatever the locale. Threads: any.
ZOCL_EXPORT UString FormatDateTime(const ptime& inTime, const char* inFormat);

}  // namespace ZOCL
