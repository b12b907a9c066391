// The one cache of payloads of the process: in memory, with files behind it that outlive the process.
#pragma once

#include "QM/DataCache.h"
#include "ZOClient/ContentCache.h"

namespace ZOCL {

/// The cache, built at first use over the directory that the environment names then; null when there is no
/// base directory. Threads: any.
shared_ptr<QM::DataCache> GetContentCache();

/// Lets it go: what was accepted is written, for some seconds at most. Data servers that live on use what the
/// next GetContentCache builds. Not from a completion.
void ReleaseContentCache();

/// Puts another in its place, null for none, for tests.
void ReplaceContentCache(const shared_ptr<QM::DataCache>& inCache);

/// The name under which payloads are stored, as gzip.
const ImmutableString& ContentName();

}  // namespace ZOCL
