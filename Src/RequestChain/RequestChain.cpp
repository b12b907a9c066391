// Puts the layers onto each other: the order stands here and nowhere else.
#include "RequestChain/RequestChain.h"

#include "ostnet/http/UploadDeflatingProcessor.h"

namespace ZOCL {

RequestChain BuildRequestChain(const ChainCallbacks& inCallbacks, const ImmutableString& inToken) {
    RequestChain chain;
    chain.global = ostnet::http::GetGlobalRequestProcessor();
    chain.recoverableError =
        boost::make_shared<RecoverableErrorProcessor>(chain.global, inCallbacks.recoverableErrors);
    chain.authorization =
        boost::make_shared<AuthorizationProcessor>(chain.recoverableError, inCallbacks.tokenNotification);
    chain.authorization->SetAuthToken(inToken);
    chain.readThrottle = boost::make_shared<ThrottlingReadProcessor>(chain.authorization);
    chain.cache = boost::make_shared<ostnet::http::CachingProcessor>(chain.readThrottle);
    chain.writeThrottle = boost::make_shared<ThrottlingWriteProcessor>(chain.cache);
    chain.common = chain.writeThrottle;
    chain.upload = boost::make_shared<ostnet::http::UploadDeflatingProcessor>(chain.common);
    return chain;
}

}  // namespace ZOCL
