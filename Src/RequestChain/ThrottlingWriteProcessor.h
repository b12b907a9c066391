// Bounds the writes in flight.
#pragma once

#include "RequestChain/ThrottlingProcessor.h"

namespace ZOCL {

/// Counts PUT, POST and DELETE; all else passes.
class ThrottlingWriteProcessor : public ThrottlingProcessor {
public:
    using Form = ostnet::http::Form;
    using Payload = shared_ptr<RecycledMemory const>;

    static constexpr std::int32_t kLimit = 10;

    explicit ThrottlingWriteProcessor(shared_ptr<ostnet::http::RequestProcessor> inNext,
                                      std::int32_t inLimit = kLimit);

    bool PUT(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Payload&,
             const RequestOptions&) override;
    bool PUT(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Form&,
             const RequestOptions&) override;
    bool POST(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Payload&,
              const RequestOptions&) override;
    bool POST(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Form&,
              const RequestOptions&) override;
    bool DELETE(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
                const RequestOptions&) override;
};

}  // namespace ZOCL
