#include "FormRecorder.h"

#include <curl/curl.h>

#include <utility>

#include "HubClient.h"
#include "ostcore/utility/StringConversion.h"
#include "ostnet/http/Compression.h"

namespace bench {

using ostcore::utility::EqualsIgnoreCaseASCII;

namespace {

bool IsOfBulk(const std::string& inURL) {
    return inURL.find("/bulk/") != std::string::npos;
}

std::size_t DropAnswer(char*, std::size_t inSize, std::size_t inCount, void*) {
    return inSize * inCount;
}

}  // namespace

std::size_t RecordedForm::UnpackedSize() const {
    for (const auto& [name, value] : headers) {
        if (EqualsIgnoreCaseASCII(name, "Content-Encoding")) {
            const auto unpacked = ostnet::http::DecompressPayload(body);
            return unpacked ? unpacked->size() : 0;
        }
    }
    return body->size();
}

bool FormRecorder::POST(const ostnet::Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
                        const ostnet::ImmutableString& inURL, ostnet::Headers inHeaders,
                        const boost::shared_ptr<ostcore::utility::RecycledMemory const>& inPayload,
                        const ostnet::http::RequestOptions& inOptions) {
    if (IsOfBulk(inURL.str())) {
        RecordedForm form;
        form.url = inURL.str();
        for (const auto& [name, value] : inHeaders) {
            form.headers.emplace_back(name.str(), value.str());
        }
        form.body = inPayload;
        const std::lock_guard<std::mutex> lock(mMutex);
        mForms.push_back(std::move(form));
    }
    return ForwardingProcessor::POST(inRequestID, inCompletion, inURL, std::move(inHeaders), inPayload,
                                     inOptions);
}

std::vector<RecordedForm> FormRecorder::Take() {
    const std::lock_guard<std::mutex> lock(mMutex);
    return std::exchange(mForms, {});
}

BarePoster::BarePoster() : mHandle(curl_easy_init()) {
    Demand(mHandle != nullptr, "libcurl gives no handle");
}

BarePoster::~BarePoster() {
    curl_easy_cleanup(mHandle);
}

long BarePoster::Post(const std::string& inURL, const RecordedForm& inForm, const std::string& inCookie) {
    curl_slist* headers = curl_slist_append(nullptr, ("Cookie: " + inCookie).c_str());
    headers = curl_slist_append(headers, "Expect:");
    for (const auto& [name, value] : inForm.headers) {
        const bool isOwn = EqualsIgnoreCaseASCII(name, "Cookie") || EqualsIgnoreCaseASCII(name, "Expect") ||
                           EqualsIgnoreCaseASCII(name, "Idempotency-Key");
        if (!isOwn) {
            headers = curl_slist_append(headers, (name + ": " + value).c_str());
        }
    }
    curl_easy_setopt(mHandle, CURLOPT_URL, inURL.c_str());
    curl_easy_setopt(mHandle, CURLOPT_NOPROXY, "*");
    curl_easy_setopt(mHandle, CURLOPT_POST, 1L);
    curl_easy_setopt(mHandle, CURLOPT_HTTPHEADER, headers);
    curl_easy_setopt(mHandle, CURLOPT_POSTFIELDS, inForm.body->data());
    curl_easy_setopt(mHandle, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(inForm.body->size()));
    curl_easy_setopt(mHandle, CURLOPT_ACCEPT_ENCODING, "gzip");
    curl_easy_setopt(mHandle, CURLOPT_WRITEFUNCTION, DropAnswer);
    const bool isDone = curl_easy_perform(mHandle) == CURLE_OK;
    curl_slist_free_all(headers);
    long status = 0;
    curl_easy_getinfo(mHandle, CURLINFO_RESPONSE_CODE, &status);
    return isDone ? status : 0;
}

}  // namespace bench
