// XMP packets in files: merging and comparing them, without a hub.
#pragma once

namespace zo {

class Context;

/// zo xmp merge BASE THEIRS MINE
void MergePacketFiles(Context& ioContext);
/// zo xmp diff OLD NEW
void ComparePacketFiles(Context& ioContext);

}  // namespace zo
