// Remote procedure calls to another process, as the client library asks for them.
#pragma once

#include <cstdint>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostmarshal {
ZO_USE_BOUNDARY_TYPES

/// Sends requests to a peer. Implemented by hosts. Threads: any.
class ZOPLATFORM_EXPORT RPCClient {
public:
    using RequestNumber = std::uint64_t;
    static constexpr RequestNumber kNoRequest = 0;
    using SuccessFunction = function<void(const shared_ptr<any>& inAnswer, RequestNumber inNumber)>;
    using FailureFunction = function<void(long inError, const UString& inMessage, RequestNumber inNumber)>;

    virtual ~RPCClient();
    /// Starts a request and returns its number; exactly one of the functions is called for it, once, perhaps
    /// before this call returns, with no lock held. kNoRequest: nothing started, neither will be called.
    virtual RequestNumber SendRequest(const shared_ptr<any>& inRequest, const SuccessFunction& inSuccess,
                                      const FailureFunction& inFailure) = 0;
    /// Best effort: the request still ends through one of its functions. An unknown number has no effect.
    virtual void CancelRequest(RequestNumber inNumber) = 0;
};

}  // namespace ostmarshal
