// Puts the layers onto each other: the order stands here and nowhere else.
#include "RequestChain/RequestChain.h"

namespace ZOCL {

RequestChain BuildRequestChain(const ChainCallbacks& inCallbacks, const ImmutableString& inToken) {
    RequestChain chain;
    chain.global = ostnet::http::GetGlobalRequestProcessor();
    chain.recoverableError = boost::make_shared<RecoverableErrorProcessor>(chain.global);
    chain.authorization =
        boost::make_shared<AuthorizationProcessor>(chain.recoverableError, inCallbacks.tokenNotification);
    chain.authorization->SetAuthToken(inToken);
    chain.common = chain.authorization;
    chain.upload = chain.common;
    return chain;
}

}  // namespace ZOCL
