// Media time in ticks.
#pragma once

#include <cstdint>
#include <limits>

namespace ostmediatypes {

/// A time or a span of media in ticks, the finest unit that hosts count in. A plain value.
class TickTime {
public:
    constexpr TickTime() noexcept = default;
    explicit constexpr TickTime(std::int64_t inTicks) noexcept : mTicks(inTicks) {}

    constexpr std::int64_t Ticks() const noexcept { return mTicks; }
    constexpr bool IsValid() const noexcept { return mTicks != kInvalidTicks; }

    friend constexpr bool operator==(TickTime inLeft, TickTime inRight) noexcept {
        return inLeft.mTicks == inRight.mTicks;
    }
    friend constexpr bool operator!=(TickTime inLeft, TickTime inRight) noexcept {
        return !(inLeft == inRight);
    }
    /// The invalid time comes before every other.
    friend constexpr bool operator<(TickTime inLeft, TickTime inRight) noexcept {
        return inLeft.mTicks < inRight.mTicks;
    }
    friend constexpr bool operator>(TickTime inLeft, TickTime inRight) noexcept { return inRight < inLeft; }
    friend constexpr bool operator<=(TickTime inLeft, TickTime inRight) noexcept {
        return !(inRight < inLeft);
    }
    friend constexpr bool operator>=(TickTime inLeft, TickTime inRight) noexcept {
        return !(inLeft < inRight);
    }

    /// The mark of no time at all: the lowest signed 64-bit number.
    static constexpr std::int64_t kInvalidTicks = (std::numeric_limits<std::int64_t>::min)();

private:
    std::int64_t mTicks = 0;
};

inline constexpr TickTime kTime_Zero{0};
inline constexpr TickTime kTime_Invalid{TickTime::kInvalidTicks};

}  // namespace ostmediatypes
