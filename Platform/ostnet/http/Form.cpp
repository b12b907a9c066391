// The writing of multipart/form-data bodies (RFC 7578).
#include "ostnet/HeaderConstants.h"
#include "ostnet/http/detail/HeaderRules.h"
#include "ostnet/http/RequestProcessor.h"

namespace ostnet {
namespace http {
namespace {

bool IsSafePartName(std::string_view inName) noexcept {
    return !inName.empty() && IsSafeHeaderValue(inName) && inName.find('"') == std::string_view::npos;
}

/// More than what stands around one part, or behind the last, beside its name and type.
constexpr std::size_t kFrameSize = 192;

void AppendText(RecycledMemory& ioBody, std::string_view inText) {
    ioBody.Append(inText.data(), inText.size());
}

}  // namespace

// The boundary is 122 random bits, so that no field value can contain it but by chance.
FormBuilder::FormBuilder()
    : mBoundary("zo-" + Guid::CreateUnique().ToString()), mBody(RecycledMemory::Create(0)) {}

bool AppendFormPart(FormBuilder& ioForm, const ImmutableString& inName, const ImmutableString& inContentType,
                    std::string_view inBytes) {
    if (!IsSafePartName(inName) || !IsSafeHeaderValue(inContentType) || !ioForm.Body()) {
        return false;
    }
    std::string head = "--" + ioForm.Boundary() + "\r\nContent-Disposition: form-data; name=\"";
    head.append(inName.view()).append("\"\r\n");
    if (!inContentType.empty()) {
        head.append(kHEADER_CONTENT_TYPE.view()).append(": ").append(inContentType.view()).append("\r\n");
    }
    head.append("\r\n");
    // A part that is larger than all before it gets its room, and that of the end, at once: the growth by
    // steps would hold it twice and keep half as much again. As the body doubles each time, this stays
    // linear.
    if (inBytes.size() > ioForm.Body()->size()) {
        ioForm.Body()->Reserve(ioForm.Body()->size() + head.size() + inBytes.size() + kFrameSize);
    }
    AppendText(*ioForm.Body(), head);
    AppendText(*ioForm.Body(), inBytes);
    AppendText(*ioForm.Body(), "\r\n");
    return true;
}

void SetFormContentTypeHeader(const FormBuilder& inForm, Headers& ioHeaders) {
    ioHeaders.erase(kHEADER_CONTENT_TYPE);
    ioHeaders.emplace(kHEADER_CONTENT_TYPE,
                      ImmutableString("multipart/form-data; boundary=" + inForm.Boundary()));
}

shared_ptr<RecycledMemory const> CompleteForm(FormBuilder& ioForm) {
    AppendText(*ioForm.Body(), "--" + ioForm.Boundary() + "--\r\n");
    return ioForm.Body();
}

shared_ptr<RecycledMemory const> ConvertFormToPayload(const Form& inForm, Headers& ioHeaders) {
    FormBuilder builder;
    std::size_t size = kFrameSize;
    for (const auto& [name, value] : inForm) {
        size += kFrameSize + name.view().size() + value.size();
    }
    builder.Body()->Reserve(size);
    for (const auto& [name, value] : inForm) {
        if (!AppendFormPart(builder, name, ImmutableString(), value)) {
            return {};
        }
    }
    SetFormContentTypeHeader(builder, ioHeaders);
    return CompleteForm(builder);
}

}  // namespace http
}  // namespace ostnet
