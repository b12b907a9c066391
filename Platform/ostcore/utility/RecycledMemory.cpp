// Blocks of bytes with zeroed padding; all but the smallest go through bounded free lists.
#include "ostcore/utility/RecycledMemory.h"

#include <array>
#include <bit>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <new>
#include <utility>

#include "ostcore/threads/Mutex.h"

namespace ostcore {
namespace utility {
namespace {

using threads::Mutex;
using threads::MutexLock;

constexpr std::size_t kPageSize = 4096;
constexpr std::size_t kMediumBlock = 1024;
constexpr std::size_t kMediumKeptInAll = 2 * 1024 * 1024;
constexpr std::size_t kLargeBlock = 64 * 1024;
constexpr std::size_t kLargestKept = 16 * 1024 * 1024;
constexpr std::size_t kKeptInAll = 64 * 1024 * 1024;

/// Large blocks that wait for their next use, by size; the bound is on their sum.
class FreeList {
public:
    // The smallest kept block that fits and is not more than twice too large.
    char* Take(std::size_t inBytes, std::size_t& outBytes) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        const auto found = mBlocks.lower_bound(inBytes);
        if (found == mBlocks.end() || found->first / 2 > inBytes) {
            return nullptr;
        }
        char* const block = found->second;
        outBytes = found->first;
        mKept -= found->first;
        mBlocks.erase(found);
        return block;
    }

    bool Keep(char* inBlock, std::size_t inBytes) noexcept ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        if (inBytes > kLargestKept || mKept + inBytes > kKeptInAll) {
            return false;
        }
        try {
            mBlocks.emplace(inBytes, inBlock);
        } catch (const std::bad_alloc&) {
            return false;
        }
        mKept += inBytes;
        return true;
    }

private:
    Mutex mMutex;
    std::multimap<std::size_t, char*> mBlocks ZO_GUARDED_BY(mMutex);
    std::size_t mKept ZO_GUARDED_BY(mMutex) = 0;
};

// Never destroyed: payloads of static lifetime may go after everything else.
FreeList& LargeBlocks() {
    static FreeList* const list = new FreeList;
    return *list;
}

// Sizes of medium blocks: four steps to each power of two.
constexpr std::size_t kStepsPerDoubling = 4;

std::size_t RoundMedium(std::size_t inBytes) {
    const std::size_t step = std::bit_floor(inBytes - 1) / kStepsPerDoubling;
    return (inBytes + step - 1) / step * step;
}

// The number of a rounded size, from 0 for the smallest.
std::size_t MediumClass(std::size_t inRounded) {
    const auto doublings = static_cast<std::size_t>(std::bit_width((inRounded - 1) / kMediumBlock)) - 1;
    const std::size_t step = (kMediumBlock << doublings) / kStepsPerDoubling;
    return doublings * kStepsPerDoubling + (inRounded - (kMediumBlock << doublings)) / step - 1;
}

/// Medium blocks that wait for their next use. Payloads are filled on one thread and let go on another, which
/// the allocator pays for with its arena's lock and with tidying up; a list for each size costs neither.
class MediumBlocks {
public:
    char* Take(std::size_t inRounded) ZO_EXCLUDES(mMutex) {
        Block*& first = mFirst[MediumClass(inRounded)];
        MutexLock lock(mMutex);
        if (!first) {
            return nullptr;
        }
        mKept -= inRounded;
        Block* const block = std::exchange(first, first->next);
        return static_cast<char*>(static_cast<void*>(block));
    }
    bool Keep(char* inBlock, std::size_t inRounded) noexcept ZO_EXCLUDES(mMutex) {
        Block*& first = mFirst[MediumClass(inRounded)];
        MutexLock lock(mMutex);
        if (mKept + inRounded > kMediumKeptInAll) {
            return false;
        }
        mKept += inRounded;
        first = ::new (static_cast<void*>(inBlock)) Block{first};
        return true;
    }

private:
    struct Block {
        Block* next;
    };
    static constexpr std::size_t kClasses =
        kStepsPerDoubling * (std::bit_width(kLargeBlock / kMediumBlock) - 1);

    Mutex mMutex;
    std::array<Block*, kClasses> mFirst{};
    std::size_t mKept ZO_GUARDED_BY(mMutex) = 0;
};

MediumBlocks& Mediums() {
    static MediumBlocks* const blocks = new MediumBlocks;
    return *blocks;
}

std::size_t WithPadding(std::size_t inCapacity) {
    if (inCapacity > std::numeric_limits<std::size_t>::max() / 2) {
        throw std::bad_alloc();
    }
    return inCapacity + RecycledMemory::kPadding;
}

// Large blocks are whole pages in steps of an eighth of their power of two, so that they are of use again.
std::size_t RoundLarge(std::size_t inBytes) {
    std::size_t step = kPageSize;
    while (step * 16 < inBytes) {
        step *= 2;
    }
    return (inBytes + step - 1) / step * step;
}

// Returns a block of outBytes, at least what was asked for.
char* AllocateBlock(std::size_t inBytes, std::size_t& outBytes) {
    if (inBytes <= kMediumBlock) {
        outBytes = inBytes;
        return static_cast<char*>(::operator new(inBytes));
    }
    if (inBytes <= kLargeBlock) {
        outBytes = RoundMedium(inBytes);
        char* const kept = Mediums().Take(outBytes);
        return kept ? kept : static_cast<char*>(::operator new(outBytes));
    }
    const std::size_t rounded = RoundLarge(inBytes);
    if (char* kept = LargeBlocks().Take(rounded, outBytes)) {
        return kept;
    }
    outBytes = rounded;
    void* const block = std::aligned_alloc(kPageSize, rounded);
    if (!block) {
        throw std::bad_alloc();
    }
    return static_cast<char*>(block);
}

void FreeBlock(char* inBlock, std::size_t inBytes) noexcept {
    if (inBytes <= kLargeBlock) {
        if (inBytes <= kMediumBlock || !Mediums().Keep(inBlock, inBytes)) {
            ::operator delete(inBlock);
        }
    } else if (!LargeBlocks().Keep(inBlock, inBytes)) {
        std::free(inBlock);
    }
}

}  // namespace

RecycledMemory::RecycledMemory(std::size_t inSize) {
    Resize(inSize);
}

RecycledMemory::~RecycledMemory() {
    if (mData) {
        FreeBlock(mData, mCapacity + kPadding);
    }
}

shared_ptr<RecycledMemory> RecycledMemory::Create(std::size_t inSize) {
    return boost::make_shared<RecycledMemory>(inSize);
}

shared_ptr<RecycledMemory> RecycledMemory::CreateFromBytes(std::string_view inBytes) {
    auto memory = boost::make_shared<RecycledMemory>();
    memory->Append(inBytes.data(), inBytes.size());
    return memory;
}

void RecycledMemory::Reserve(std::size_t inCapacity) {
    if (mData && inCapacity <= mCapacity) {
        return;
    }
    std::size_t bytes = 0;
    char* const block = AllocateBlock(WithPadding(inCapacity), bytes);
    if (mSize > 0) {
        std::memcpy(block, mData, mSize);
    }
    std::memset(block + mSize, 0, kPadding);
    if (mData) {
        FreeBlock(mData, mCapacity + kPadding);
    }
    mData = block;
    mCapacity = bytes - kPadding;
}

void RecycledMemory::Append(const void* inBytes, std::size_t inSize) {
    if (inSize == 0) {
        return;
    }
    if (inSize > std::numeric_limits<std::size_t>::max() / 2 - mSize) {
        throw std::bad_alloc();
    }
    const std::size_t size = mSize + inSize;
    if (size > mCapacity) {
        const char* const source = static_cast<const char*>(inBytes);
        const bool isOwn = mData && source >= mData && source < mData + mSize;
        const std::size_t offset = isOwn ? static_cast<std::size_t>(source - mData) : 0;
        Reserve(std::max(size, mCapacity + mCapacity / 2));
        inBytes = isOwn ? mData + offset : inBytes;
    }
    std::memmove(mData + mSize, inBytes, inSize);
    mSize = size;
    std::memset(mData + mSize, 0, kPadding);
}

void RecycledMemory::Resize(std::size_t inSize) {
    if (inSize > mCapacity) {
        Reserve(inSize);
    }
    mSize = inSize;
    if (mData) {
        std::memset(mData + mSize, 0, kPadding);
    }
}

}  // namespace utility
}  // namespace ostcore
