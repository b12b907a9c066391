// Counts what the parsers of a thread hold.
#include "OrvaneXMP/detail/ParserMemory.h"

#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <new>

namespace OrvaneXMP {

namespace {

constexpr std::size_t kMostBytes = 24u << 20;
constexpr std::size_t kHead = alignof(std::max_align_t);
static_assert(kHead >= sizeof(std::size_t), "the size stands before each block");

thread_local std::size_t gBytesHeld = 0;

std::size_t& SizeOf(void* inHead) noexcept {
    return *static_cast<std::size_t*>(inHead);
}

char* HeadOf(void* inBlock) noexcept {
    return static_cast<char*>(inBlock) - kHead;
}

template <std::size_t Most>
void* Allocate(std::size_t inSize) {
    if (gBytesHeld > Most || inSize > Most - gBytesHeld) {
        return nullptr;
    }
    auto* head = static_cast<char*>(std::malloc(inSize + kHead));
    if (!head) {
        return nullptr;
    }
    new (head) std::size_t(inSize);
    gBytesHeld += inSize;
    return head + kHead;
}

void Free(void* inBlock) {
    if (inBlock) {
        gBytesHeld -= SizeOf(HeadOf(inBlock));
        std::free(HeadOf(inBlock));
    }
}

template <std::size_t Most>
void* Reallocate(void* inBlock, std::size_t inSize) {
    if (!inBlock) {
        return Allocate<Most>(inSize);
    }
    const std::size_t former = SizeOf(HeadOf(inBlock));
    const std::size_t others = gBytesHeld - former;
    if (others > Most || inSize > Most - others) {
        return nullptr;
    }
    auto* head = static_cast<char*>(std::realloc(HeadOf(inBlock), inSize + kHead));
    if (!head) {
        return nullptr;
    }
    new (head) std::size_t(inSize);
    gBytesHeld = others + inSize;
    return head + kHead;
}

}  // namespace

const XML_Memory_Handling_Suite& BoundedParserMemory() noexcept {
    static const XML_Memory_Handling_Suite suite{&Allocate<kMostBytes>, &Reallocate<kMostBytes>, &Free};
    return suite;
}

const XML_Memory_Handling_Suite& HalfOfParserMemory() noexcept {
    static const XML_Memory_Handling_Suite suite{&Allocate<kMostBytes / 2>, &Reallocate<kMostBytes / 2>,
                                                 &Free};
    return suite;
}

}  // namespace OrvaneXMP
