// The stack of layers between a data server and the network: which there are, in which order, and where
// requests enter.
#pragma once

#include "RequestChain/AuthorizationProcessor.h"
#include "RequestChain/RecoverableErrorProcessor.h"

namespace ZOCL {

/// The layers of one data server, from the network up.
///
/// | Zone              | Layer                     | Sees |
/// |-------------------|---------------------------|---------------------------------------------------------|
/// | network           | global                    | every request; login and discovery enter here directly |
/// | recovery          | recoverableError          | every request of the verbs | | identity          |
/// authorization             | the same; what is above it has no token yet             | | entry of verbs |
/// common                    | GET, HEAD, DELETE                                       | | entry of payloads
/// | upload                    | PUT, POST                                               |
struct RequestChain {
    shared_ptr<ostnet::http::RequestProcessor> global;
    shared_ptr<RecoverableErrorProcessor> recoverableError;
    shared_ptr<AuthorizationProcessor> authorization;
    shared_ptr<ostnet::http::RequestProcessor> common;
    shared_ptr<ostnet::http::RequestProcessor> upload;
};

/// Builds the layers over the global processor of this moment.
RequestChain BuildRequestChain(const function<void()>& inTokenNotification, const ImmutableString& inToken);

}  // namespace ZOCL
