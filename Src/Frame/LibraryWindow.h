// A window whose layout is one of the library's own.
#pragma once

#include "Frame/LibraryModule.h"
#include "ostcore/config/ZString.h"
#include "ostlyra/UI_Lyra.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// Its dialog is there once it is made: the layouts are part of the library. Main thread.
class LibraryWindow : public ostlyra::UI_Lyra {
public:
    explicit LibraryWindow(const char* inLayoutName) : UI_Lyra(inLayoutName, GetLibraryModule()) {
        Initialize();
    }
};

/// A text for the user, in his language.
inline U8String UserText(const char* inKey, const std::vector<U8String>& inArguments = {}) {
    return ostcore::ZString(inKey, inArguments).AsUTF8();
}

}  // namespace ZOCL
