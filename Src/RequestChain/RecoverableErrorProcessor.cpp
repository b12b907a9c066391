// The layer next to the network.
#include "RequestChain/RecoverableErrorProcessor.h"

namespace ZOCL {

RecoverableErrorProcessor::RecoverableErrorProcessor(
    ostnet::shared_ptr<ostnet::http::RequestProcessor> inNext)
    : ForwardingProcessor(std::move(inNext)) {}

}  // namespace ZOCL
