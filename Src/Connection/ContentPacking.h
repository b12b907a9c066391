// Packs and stores the payloads that the library itself has written, without standing in anybody's way.
#pragma once

#include <deque>
#include <utility>

#include "ostcore/threads/Mutex.h"
#include "ostcore/utility/ImmutableString.h"
#include "ostcore/utility/RecycledMemory.h"
#include "ostnet/http/RequestProcessor.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// What a bulk request leaves for the content cache are thousands of payloads at once. One worker at most
/// packs them, a few a turn, so that requests and completions find their turns between. Lives as long as a
/// turn is outstanding. Threads: any.
class ContentPacking : public boost::enable_shared_from_this<ContentPacking> {
public:
    explicit ContentPacking(const shared_ptr<ostnet::http::RequestProcessor>& inWorkers)
        : mWorkers(inWorkers) {}

    /// Stores the payload under the identifier later, unless it is there by then. What is empty is not kept.
    void Add(const ImmutableString& inContentID, const shared_ptr<RecycledMemory const>& inPayload);

private:
    using Item = std::pair<ImmutableString, shared_ptr<RecycledMemory const>>;

    void PostTurn();
    void RunTurn();
    bool Take(Item& outItem);

    const shared_ptr<ostnet::http::RequestProcessor> mWorkers;
    ostcore::threads::Mutex mMutex;
    std::deque<Item> mItems ZO_GUARDED_BY(mMutex);
    bool mHasTurn ZO_GUARDED_BY(mMutex) = false;
};

}  // namespace ZOCL
