// Who works in a transaction, as it is written into transactions and commits and read back.
#pragma once

#include "dto/Production.h"
#include "ZOClient/IZOCEditingSession.h"

namespace ZOCL {

/// What this process writes into a transaction of a type. What is the same for the whole process is found out
/// once. Threads: any; the first call may read a file.
ClientMetadata MakeClientMetadata(const ImmutableString& inTransactionType);
/// The object under "metadata". Of the extra texts those are added whose names are not the library's own.
ostcore::serialization::JSONValue MakeClientMetadataBody(const ClientMetadata& inMetadata,
                                                         const ExtraTransactionMetadata& inExtra);
ClientMetadata ReadClientMetadata(const dto::ClientMetadata& inBody);

/// The title of the commit that a transaction becomes: the text of an object that holds the message and who
/// made the transaction. The request that commits is named in it, so that its commit can be told from others.
std::string MakeCommitTitle(const UString& inMessage, const ostcore::serialization::JSONValue& inMetadata,
                            const Guid& inRequestID);

}  // namespace ZOCL
