// The body with which productions, copies and sessions are made.
#pragma once

#include <string>

#include "Base/Json.h"

namespace zohub {

struct Creation {
    std::string name;
    std::string description;
    bool isTemporary = false;
};

/// Throws Failure 400 for a body of another form.
Creation ReadCreation(Json const& inBody);

}  // namespace zohub
