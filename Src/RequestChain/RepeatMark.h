// How the layers above learn that a change was sent more than once.
#pragma once

#include "ostnet/Response.h"

namespace ZOCL {

/// On an answer of 409 or 412 to a request that was sent before and got no answer: what is refused may be the
/// repetition of a change that went through. The name holds a colon, so that no server can send it.
inline const ostnet::ImmutableString& RepeatMark() {
    static const ostnet::ImmutableString mark("zo:repeated");
    return mark;
}

inline bool IsRefusedRepetition(const ostnet::shared_ptr<ostnet::Response>& inResponse) {
    return inResponse && inResponse->headers.find(RepeatMark()) != inResponse->headers.end();
}

/// The response as the answer to a repetition; the given one when no mark is needed.
inline ostnet::shared_ptr<ostnet::Response> MarkAsRepetition(
    const ostnet::shared_ptr<ostnet::Response>& inResponse) {
    if (!inResponse || (inResponse->status != 409 && inResponse->status != 412)) {
        return inResponse;
    }
    const auto marked = boost::make_shared<ostnet::Response>(*inResponse);
    marked->headers.emplace(RepeatMark(), ostnet::ImmutableString("1"));
    return marked;
}

}  // namespace ZOCL
