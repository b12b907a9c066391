// An account of the hub.
#pragma once

#include <vector>

#include "ZOClient/IZOCServerResource.h"

namespace ZOCL {

class ZOCL_EXPORT IZOCUser : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f635573657200ull, 0x0000000000000001ull};

    struct Login {
        ImmutableString ip;
        ImmutableString hostName;
        ImmutableString userAgent;
    };

    virtual ImmutableString GetUserID() = 0;
    virtual UString GetFirstName() = 0;
    virtual UString GetLastName() = 0;
    virtual ImmutableString GetEmail() = 0;
    virtual std::vector<Login> GetCurrentLogins() = 0;
};

}  // namespace ZOCL
