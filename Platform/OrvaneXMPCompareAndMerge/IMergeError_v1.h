// An exception that a strategy threw, handed back as an object.
#pragma once

#include <string>

#include "OrvaneXMPCompareAndMerge/Types.h"
#include "RFL/RFLUnknown.h"

namespace OrvaneXMPCompareAndMerge {

/// Immutable. Threads: any.
class ZOPLATFORM_EXPORT IMergeError_v1 : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x6f586d704d657267ull, 0x654572726f720001ull};

    /// The name of the strategy.
    virtual const std::string& GetStrategyName() const noexcept = 0;
    /// What the exception said. It may quote values of the packet.
    virtual const std::string& GetText() const noexcept = 0;

protected:
    ~IMergeError_v1() override;
};

}  // namespace OrvaneXMPCompareAndMerge
