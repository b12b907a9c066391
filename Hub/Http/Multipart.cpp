// Reading of forms.
#include "Http/Multipart.h"

#include "Base/Error.h"
#include "Base/Text.h"

namespace zohub {

namespace {

constexpr std::size_t kMaxPartHead = 8 * 1024;

[[noreturn]] void FailMalformed(std::string const& inWhy) {
    throw Failure(400, "form-malformed", "The form in the body cannot be read: " + inWhy + ".");
}

// A parameter of a header value such as: form-data; name="x"; filename="y".
std::string ParameterOf(std::string_view inValue, std::string_view inName) {
    std::size_t at = inValue.find(';');
    while (at != std::string_view::npos) {
        std::string_view rest = Trim(inValue.substr(at + 1));
        std::size_t const equals = rest.find('=');
        if (equals == std::string_view::npos)
            return {};
        std::string_view const name = Trim(rest.substr(0, equals));
        rest.remove_prefix(equals + 1);
        std::string value;
        std::size_t used = 0;
        if (!rest.empty() && rest.front() == '"') {
            for (used = 1; used < rest.size() && rest[used] != '"'; ++used) {
                if (rest[used] == '\\' && used + 1 < rest.size())
                    ++used;
                value += rest[used];
            }
            if (used >= rest.size())
                FailMalformed("a quoted parameter has no end");
            ++used;
        } else {
            used = std::min(rest.find(';'), rest.size());
            value = std::string(Trim(rest.substr(0, used)));
        }
        if (EqualIgnoringCase(name, inName))
            return value;
        inValue = rest.substr(used);
        at = inValue.find(';');
    }
    return {};
}

}  // namespace

Form::Form(Request const& inRequest, std::size_t inMaxParts) : mMaxParts(inMaxParts) {
    std::string_view const type = inRequest.Header("Content-Type");
    std::string const plainType = ToLower(Trim(Split(type, ';')[0]));
    if (plainType == "application/x-www-form-urlencoded") {
        ReadUrlEncoded(inRequest.body);
        return;
    }
    if (plainType != "multipart/form-data")
        throw Failure(415, "form-expected", "This address takes a form: send multipart/form-data.");
    std::string const boundary = ParameterOf(type, "boundary");
    if (boundary.empty() || boundary.size() > 70)
        FailMalformed("the boundary is missing or longer than 70 characters");
    ReadMultipart(inRequest.body, boundary);
}

void Form::ReadMultipart(std::string_view inBody, std::string const& inBoundary) {
    std::string const delimiter = "--" + inBoundary;
    std::string const lineAndDelimiter = "\r\n" + delimiter;
    std::size_t at = 0;
    if (inBody.substr(0, delimiter.size()) != delimiter) {
        at = inBody.find(lineAndDelimiter);
        if (at == std::string_view::npos)
            FailMalformed("the boundary does not occur in the body");
        at += 2;
    }
    while (true) {
        at += delimiter.size();
        if (inBody.substr(at, 2) == "--")
            return;
        std::size_t const lineEnd = inBody.find("\r\n", at);
        if (lineEnd == std::string_view::npos || !Trim(inBody.substr(at, lineEnd - at)).empty())
            FailMalformed("a boundary line has more than the boundary");
        std::size_t const begin = lineEnd + 2;
        // An empty part head may share its line end with the boundary before it.
        std::size_t const end = inBody.find(lineAndDelimiter, begin);
        if (end == std::string_view::npos)
            FailMalformed("the closing boundary is missing");
        RequireRoomForPart();
        ReadPart(inBody.substr(begin, end - begin));
        at = end + 2;
    }
}

void Form::RequireRoomForPart() const {
    if (mParts.size() >= mMaxParts)
        throw Failure(413, "form-too-many-parts",
                      "The form has more parts than the " + std::to_string(mMaxParts) +
                          " that this server accepts here.");
}

void Form::ReadPart(std::string_view inPart) {
    std::size_t const headEnd = inPart.find("\r\n\r\n");
    if (headEnd == std::string_view::npos || headEnd > kMaxPartHead)
        FailMalformed("the head of a part has no end or is too long");
    FormPart part;
    std::string_view head = inPart.substr(0, headEnd);
    part.bytes = inPart.substr(headEnd + 4);
    while (!head.empty()) {
        std::size_t const end = std::min(head.find("\r\n"), head.size());
        std::string_view const line = head.substr(0, end);
        head.remove_prefix(std::min(end + 2, head.size()));
        std::size_t const colon = line.find(':');
        if (colon == std::string_view::npos)
            FailMalformed("a header of a part has no colon");
        std::string_view const name = Trim(line.substr(0, colon));
        std::string_view const value = Trim(line.substr(colon + 1));
        if (EqualIgnoringCase(name, "Content-Disposition"))
            part.name = ParameterOf(value, "name");
        else if (EqualIgnoringCase(name, "Content-Type"))
            part.contentType = value;
    }
    if (part.name.empty() || HasControlCharacter(part.name))
        FailMalformed("a part has no usable name");
    if (!part.contentType.empty() && !IsMediaType(part.contentType))
        FailMalformed("the content type of a part is not valid");
    mParts.push_back(std::move(part));
}

void Form::ReadUrlEncoded(std::string_view inBody) {
    for (auto pair : Split(inBody, '&')) {
        if (pair.empty())
            continue;
        RequireRoomForPart();
        std::string text(pair);
        for (char& c : text)
            if (c == '+')
                c = ' ';
        std::size_t const equals = std::min(text.find('='), text.size());
        auto name = PercentDecode(std::string_view(text).substr(0, equals));
        auto value = PercentDecode(std::string_view(text).substr(std::min(equals + 1, text.size())));
        if (!name || !value || name->empty())
            FailMalformed("a field is not percent-coded as it should be");
        mDecoded.push_back(std::make_unique<std::string>(std::move(*value)));
        mParts.push_back({std::move(*name), "", *mDecoded.back()});
    }
}

FormPart const* Form::Find(std::string_view inName) const {
    for (auto const& part : mParts)
        if (part.name == inName)
            return &part;
    return nullptr;
}

FormPart const& Form::Get(std::string_view inName) const {
    FormPart const* const part = Find(inName);
    if (!part)
        throw Failure(400, "form-field-missing", "The form has no field \"" + std::string(inName) + "\".");
    return *part;
}

}  // namespace zohub
