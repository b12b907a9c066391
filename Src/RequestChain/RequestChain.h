// The stack of layers between a data server and the network: which there are, in which order, and where
// requests enter.
#pragma once

#include "ostnet/http/CachingProcessor.h"
#include "RequestChain/AuthorizationProcessor.h"
#include "RequestChain/RecoverableErrorProcessor.h"
#include "RequestChain/ThrottlingReadProcessor.h"
#include "RequestChain/ThrottlingWriteProcessor.h"

namespace ZOCL {

/// What the layers tell their data server. Each is called with no lock held; an empty one is not called.
struct ChainCallbacks {
    /// A token was refused, and a new one is wanted. Runs on a worker of the base processor.
    function<void()> tokenNotification;
    /// True: the network looks down. False: it is back. Runs on a CPU-bound executor.
    function<void(bool)> recoverableErrors;
};

/// The layers of one data server, in their order from the network up:
///
///  - `global`: every request; login and discovery enter here directly.
///  - `recoverableError`: every request of the verbs.
///  - `authorization`: the same; what is above it has no token yet.
///  - `readThrottle`: counts GET and HEAD, across replays and retries below it.
///  - `cache`: joins equal reads and answers from memory; above the read throttle, as that needs no slot.
///  - `writeThrottle`: counts PUT, POST and DELETE.
///  - `common`: where GET, HEAD and DELETE enter; the write throttle.
///  - `upload`: where PUT and POST enter when the server takes packed bodies; it packs the large ones.
struct RequestChain {
    shared_ptr<ostnet::http::RequestProcessor> global;
    shared_ptr<RecoverableErrorProcessor> recoverableError;
    shared_ptr<AuthorizationProcessor> authorization;
    shared_ptr<ThrottlingReadProcessor> readThrottle;
    shared_ptr<ostnet::http::CachingProcessor> cache;
    shared_ptr<ThrottlingWriteProcessor> writeThrottle;
    shared_ptr<ostnet::http::RequestProcessor> common;
    shared_ptr<ostnet::http::RequestProcessor> upload;
};

/// Builds the layers over the global processor of this moment.
RequestChain BuildRequestChain(const ChainCallbacks& inCallbacks, const ImmutableString& inToken);

}  // namespace ZOCL
