// The anchors of the foundation's classes.
#include "RFL/RFLUnknown.h"

namespace RFL {

RFLUnknown::~RFLUnknown() = default;

Exception::~Exception() = default;

NullInterfaceException::NullInterfaceException()
    : Exception("A NULL interface pointer has been dereferenced.") {}

NullInterfaceException::~NullInterfaceException() = default;

void ThrowNullInterface() {
    throw NullInterfaceException();
}

}  // namespace RFL
