// Paths as chains of links.
#include "OrvaneXMPCompareAndMerge/Types.h"

namespace OrvaneXMPCompareAndMerge {

struct SharedPath::Link {
    OrvaneXMP::PathStep step;
    ostcore::shared_ptr<const Link> above;
    std::size_t length;
};

SharedPath SharedPath::Below(const OrvaneXMP::PathStep& inStep) const {
    SharedPath below;
    below.mLast = ostcore::make_shared<const Link>(Link{inStep, mLast, size() + 1});
    return below;
}

std::size_t SharedPath::size() const noexcept {
    return mLast ? mLast->length : 0;
}

SharedPath::operator Path() const {
    Path path;
    path.reserve(size());
    for (const Link* link = mLast.get(); link; link = link->above.get()) {
        path.push_back(link->step);
    }
    return Path(path.rbegin(), path.rend());
}

}  // namespace OrvaneXMPCompareAndMerge
