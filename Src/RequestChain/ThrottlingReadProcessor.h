// Bounds the reads in flight.
#pragma once

#include "RequestChain/ThrottlingProcessor.h"

namespace ZOCL {

/// Counts GET and HEAD; all else passes.
class ThrottlingReadProcessor : public ThrottlingProcessor {
public:
    static constexpr std::int32_t kLimit = 50;

    explicit ThrottlingReadProcessor(shared_ptr<ostnet::http::RequestProcessor> inNext,
                                     std::int32_t inLimit = kLimit);

    bool GET(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
             const RequestOptions&) override;
    bool HEAD(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
              const RequestOptions&) override;
};

}  // namespace ZOCL
