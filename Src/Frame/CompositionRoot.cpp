// The one place where what is set high is found low.
#include "ResourceFactory.h"

namespace ZOCL {

CompositionRoot& GetCompositionRoot() {
    static CompositionRoot root;
    return root;
}

}  // namespace ZOCL
