// Keeps the forms that go out in bulk, as they reach the network, so that they can be posted again.
#pragma once

#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "ostnet/http/RequestProcessor.h"

namespace bench {

struct RecordedForm {
    std::string url;
    std::vector<std::pair<std::string, std::string>> headers;
    boost::shared_ptr<ostcore::utility::RecycledMemory const> body;

    /// Before it was packed; 0 when it cannot be unpacked.
    std::size_t UnpackedSize() const;
};

/// Sits over the network and passes everything on.
class FormRecorder : public ostnet::http::ForwardingProcessor {
public:
    using ForwardingProcessor::ForwardingProcessor;
    using ForwardingProcessor::POST;

    bool POST(const ostnet::Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
              const ostnet::ImmutableString& inURL, ostnet::Headers inHeaders,
              const boost::shared_ptr<ostcore::utility::RecycledMemory const>& inPayload,
              const ostnet::http::RequestOptions& inOptions) override;

    /// The forms since the last call.
    std::vector<RecordedForm> Take();

private:
    std::mutex mMutex;
    std::vector<RecordedForm> mForms;
};

/// Posts a form as a bare libcurl program does: one handle, the recorded headers with this cookie in the
/// place of theirs. Returns the status.
class BarePoster {
public:
    BarePoster();
    ~BarePoster();
    BarePoster(const BarePoster&) = delete;
    BarePoster& operator=(const BarePoster&) = delete;

    long Post(const std::string& inURL, const RecordedForm& inForm, const std::string& inCookie);

private:
    void* mHandle;
};

}  // namespace bench
