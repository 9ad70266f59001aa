#include "Tests/Support/AllocationPeak.h"

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <malloc.h>
#include <new>

namespace {

std::atomic<std::size_t> s_held{0};
std::atomic<std::size_t> s_peak{0};

void* counted(void* block) {
    if (!block)
        throw std::bad_alloc();
    const std::size_t held = s_held += malloc_usable_size(block);
    std::size_t peak = s_peak;
    while (peak < held && !s_peak.compare_exchange_weak(peak, held)) {
    }
    return block;
}

void release(void* block) {
    if (block)
        s_held -= malloc_usable_size(block);
    std::free(block);
}

} // namespace

void* operator new(std::size_t size) {
    return counted(std::malloc(std::max<std::size_t>(size, 1)));
}

void* operator new[](std::size_t size) {
    return counted(std::malloc(std::max<std::size_t>(size, 1)));
}

void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    try {
        return operator new(size);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

void operator delete(void* block) noexcept {
    release(block);
}

void operator delete[](void* block) noexcept {
    release(block);
}

void operator delete(void* block, std::size_t) noexcept {
    release(block);
}

void operator delete[](void* block, std::size_t) noexcept {
    release(block);
}

void operator delete(void* block, const std::nothrow_t&) noexcept {
    release(block);
}

namespace ZULMetaData::Test {

AllocationPeak::AllocationPeak() : start_(s_held) {
    s_peak = s_held.load();
}

std::size_t AllocationPeak::bytes() const {
    return s_peak - std::min(s_peak.load(), start_);
}

} // namespace ZULMetaData::Test
