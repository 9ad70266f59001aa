#include "Tests/Support/MemoryWatch.h"

#include <algorithm>
#include <limits>
#include <malloc.h>
#include <new>

// Where the linker wraps a function, its callers get __wrap_, and __real_ is the function itself.
extern "C" {
void* __real_malloc(std::size_t size);
void* __real_calloc(std::size_t count, std::size_t size);
void __real_free(void* block);
void* __wrap_malloc(std::size_t size);
void* __wrap_calloc(std::size_t count, std::size_t size);
void __wrap_free(void* block);
}

namespace {

constexpr std::size_t s_unlimited = std::numeric_limits<std::size_t>::max();

std::size_t s_limit = s_unlimited;
std::size_t s_largestRequest = 0;
int s_blocks = 0;
std::ptrdiff_t s_held = 0; // below 0 where blocks are freed that were there before
std::ptrdiff_t s_peak = 0;

bool isRefused(std::size_t size) {
    s_largestRequest = std::max(s_largestRequest, size);
    return size > s_limit;
}

void* held(void* block) {
    if (block)
        s_held += static_cast<std::ptrdiff_t>(malloc_usable_size(block));
    s_peak = std::max(s_peak, s_held);
    return block;
}

void release(void* block) {
    if (block)
        s_held -= static_cast<std::ptrdiff_t>(malloc_usable_size(block));
    __real_free(block);
}

void* counted(void* block) {
    if (block)
        ++s_blocks;
    return held(block);
}

} // namespace

void* __wrap_malloc(std::size_t size) {
    return isRefused(size) ? nullptr : counted(__real_malloc(size));
}

void* __wrap_calloc(std::size_t count, std::size_t size) {
    return isRefused(count * size) ? nullptr : counted(__real_calloc(count, size));
}

void __wrap_free(void* block) {
    if (block)
        --s_blocks;
    release(block);
}

void* operator new(std::size_t size) {
    void* const block = isRefused(size) ? nullptr : held(__real_malloc(std::max<std::size_t>(size, 1)));
    if (!block)
        throw std::bad_alloc();
    return block;
}

void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    return isRefused(size) ? nullptr : held(__real_malloc(std::max<std::size_t>(size, 1)));
}

void operator delete(void* block) noexcept {
    release(block);
}

void operator delete(void* block, std::size_t) noexcept {
    release(block);
}

namespace ZULMetaData::Test {

MemoryWatch::MemoryWatch() {
    s_largestRequest = 0;
    s_blocks = 0;
    s_held = 0;
    s_peak = 0;
}

MemoryWatch::~MemoryWatch() {
    s_limit = s_unlimited;
}

void MemoryWatch::refuseAbove(std::size_t bytes) {
    s_limit = bytes;
}

std::size_t MemoryWatch::largestRequest() const {
    return s_largestRequest;
}

int MemoryWatch::blocks() const {
    return s_blocks;
}

std::size_t MemoryWatch::peak() const {
    return static_cast<std::size_t>(s_peak);
}

} // namespace ZULMetaData::Test
