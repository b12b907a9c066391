// Sized blocks of bytes that carry every payload from the socket to the host without a copy.
#pragma once

#include <cstddef>
#include <string_view>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace utility {

/// A sized block of bytes. Filled by one writer, then shared as `shared_ptr<RecycledMemory const>`.
///
/// Behind the last byte always stand kPadding readable zero bytes, so that vectorised parsers can read
/// the block in place. Large blocks are kept for reuse when they are released, up to a bound.
///
/// Threads: one writer; once shared as const, any number of readers.
class ZOPLATFORM_EXPORT RecycledMemory {
public:
    static constexpr std::size_t kPadding = 64;

    RecycledMemory() noexcept = default;
    explicit RecycledMemory(std::size_t inSize);
    ~RecycledMemory();
    RecycledMemory(const RecycledMemory&) = delete;
    RecycledMemory& operator=(const RecycledMemory&) = delete;

    static shared_ptr<RecycledMemory> Create(std::size_t inSize);
    static shared_ptr<RecycledMemory> CreateFromBytes(std::string_view inBytes);

    const char* data() const noexcept { return mData; }
    char* data() noexcept { return mData; }
    std::size_t size() const noexcept { return mSize; }
    bool empty() const noexcept { return mSize == 0; }
    std::string_view view() const noexcept { return {mData ? mData : "", mSize}; }

    /// Makes room for inCapacity bytes without changing the size. Throws std::bad_alloc.
    void Reserve(std::size_t inCapacity);
    /// Adds bytes at the end; room grows geometrically. Throws std::bad_alloc.
    void Append(const void* inBytes, std::size_t inSize);
    /// Changes the size; new bytes are undefined, the padding behind them is zero.
    void Resize(std::size_t inSize);

private:
    char* mData = nullptr;
    std::size_t mSize = 0;
    std::size_t mCapacity = 0;
};

using SharedMemory = shared_ptr<RecycledMemory const>;

}  // namespace utility
}  // namespace ostcore
