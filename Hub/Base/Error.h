// The one exception that a request or a command ends with when it cannot be answered as asked.
#pragma once

#include <memory>
#include <stdexcept>
#include <string>

namespace zohub {

/// Carries the HTTP status, a stable short code and a text that says what was tried and what to do next.
/// Copies share the code, so that copying one in flight cannot throw.
class Failure : public std::runtime_error {
public:
    Failure(int inStatus, std::string inCode, std::string const& inMessage)
        : std::runtime_error(inMessage),
          mStatus(inStatus),
          mCode(std::make_shared<std::string const>(std::move(inCode))) {}

    int Status() const { return mStatus; }
    std::string const& Code() const { return *mCode; }

private:
    int mStatus;
    std::shared_ptr<std::string const> mCode;
};

}  // namespace zohub
