// An account of the hub as a resource.
#pragma once

#include "dto/User.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCUser.h"

namespace ZOCL {

class User final : public Implements<JSONServerResource<dto::UserBlock>, Readable<IZOCUser>> {
public:
    ImmutableString GetUserID() override;
    UString GetFirstName() override;
    UString GetLastName() override;
    ImmutableString GetEmail() override;
    std::vector<Login> GetCurrentLogins() override;
};

}  // namespace ZOCL
