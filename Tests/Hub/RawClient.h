// A blocking HTTP client of the tests' own, over a bare socket: sends exactly the bytes it is told to.
#pragma once

#include <chrono>
#include <cstdint>
#include <map>
#include <string>
#include <string_view>

namespace zohub::test {

struct Answer {
    int status = 0;
    std::string head;
    std::multimap<std::string, std::string> headers;  ///< names in lower case
    std::string body;

    std::string Header(std::string const& inLowerName) const;
};

/// One connection. Throws std::runtime_error when the other side closes early or is silent too long.
class RawConnection {
public:
    explicit RawConnection(std::uint16_t inPort);
    ~RawConnection();
    RawConnection(RawConnection const&) = delete;
    RawConnection& operator=(RawConnection const&) = delete;

    void Send(std::string_view inBytes);
    /// As Send, but the other side may have closed meanwhile.
    bool TrySend(std::string_view inBytes);
    Answer Receive(bool inIsHeadRequest = false);
    /// Reads until the end; true when it comes within the time.
    bool IsClosedWithin(std::chrono::milliseconds inLimit);

private:
    bool Fill(std::chrono::milliseconds inLimit);

    int mSocket = -1;
    std::string mBuffer;
};

struct Form {
    /// A multipart/form-data body with these parts.
    Form& Add(std::string const& inName, std::string const& inBytes, std::string const& inType = {});
    std::string Body() const;
    static std::string Type();

private:
    std::string mParts;
};

/// A user with his token: one request per connection, JSON or bytes.
class Client {
public:
    explicit Client(std::uint16_t inPort, std::string inToken = {})
        : mPort(inPort), mToken(std::move(inToken)) {}

    using Headers = std::map<std::string, std::string>;
    /// The target is a path or an absolute URL of this server.
    Answer Request(std::string const& inMethod, std::string const& inTarget, std::string const& inBody = {},
                   Headers const& inHeaders = {}) const;
    Answer Get(std::string const& inTarget, Headers const& inHeaders = {}) const;
    Answer PostJson(std::string const& inTarget, std::string const& inBody, Headers inHeaders = {}) const;
    Answer PutJson(std::string const& inTarget, std::string const& inBody, Headers inHeaders = {}) const;
    Answer SendForm(std::string const& inMethod, std::string const& inTarget, Form const& inForm,
                    Headers inHeaders = {}) const;
    /// Signs in and keeps the token.
    Answer SignIn(std::string const& inUser, std::string const& inPassword);

    std::string const& Token() const { return mToken; }
    std::uint16_t Port() const { return mPort; }

private:
    std::uint16_t mPort;
    std::string mToken;
};

}  // namespace zohub::test
