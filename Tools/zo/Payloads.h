// Bytes on their way to the hub: read from files, and written as enclosures.
#pragma once

#include <string>

#include "Assets.h"
#include "Writing.h"

namespace zo {

using Payload = boost::shared_ptr<ostcore::utility::RecycledMemory const>;

/// The bytes of a regular file; throws a Failure that names it.
Payload ReadPayload(const std::string& inPath);
/// "photo.jpg" of "a/b/photo.jpg".
std::string FileNameOf(const std::string& inPath);

/// Writes an enclosure of an asset of a transaction: over the one of this name, or as a new one. Waits.
void WriteAssetEnclosure(Context& ioContext, const NamedAsset& inAsset, const std::string& inName,
                         const Payload& inPayload);
/// The same for an enclosure of the production itself.
void WriteProductionEnclosure(Context& ioContext, const OpenTransaction& inTransaction,
                              const std::string& inName, const Payload& inPayload);

/// Runs one request of a verb and throws a Failure that begins with what was tried.
Outcome RunRequest(Context& ioContext, const std::string& inWhat, const StartFunction& inStart);

}  // namespace zo
