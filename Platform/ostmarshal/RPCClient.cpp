// The home of the interface's type information.
#include "ostmarshal/RPCClient.h"

namespace ostmarshal {

RPCClient::~RPCClient() = default;

}  // namespace ostmarshal
