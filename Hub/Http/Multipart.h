// Reading of forms: multipart/form-data (RFC 7578) and application/x-www-form-urlencoded.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "Http/Message.h"

namespace zohub {

struct FormPart {
    std::string name;
    std::string contentType;
    std::string_view bytes;  ///< inside the form's own memory
};

inline constexpr std::size_t kMaxFormParts = 20000;

/// The fields of a form in the order in which they came.
class Form {
public:
    /// Throws Failure 400 for a damaged form, 413 for too many parts and 415 for a body that is no form. The
    /// request must outlive it.
    explicit Form(Request const& inRequest, std::size_t inMaxParts = kMaxFormParts);
    Form(Form const&) = delete;
    Form& operator=(Form const&) = delete;

    std::vector<FormPart> const& Parts() const { return mParts; }
    FormPart const* Find(std::string_view inName) const;
    /// Throws Failure 400 when the field is missing.
    FormPart const& Get(std::string_view inName) const;

private:
    void ReadMultipart(std::string_view inBody, std::string const& inBoundary);
    void ReadPart(std::string_view inPart);
    void ReadUrlEncoded(std::string_view inBody);
    void RequireRoomForPart() const;

    std::size_t const mMaxParts;
    std::vector<FormPart> mParts;
    std::vector<std::unique_ptr<std::string>> mDecoded;
};

}  // namespace zohub
