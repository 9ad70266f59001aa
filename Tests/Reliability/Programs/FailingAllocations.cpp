#include "Tests/Reliability/Programs/FailingAllocations.h"

#include <atomic>
#include <cerrno>
#include <cstddef>
#include <limits>

extern "C" {
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* block, std::size_t size);
void __libc_free(void* block);
}

namespace Reliability {

namespace {

std::atomic<long> s_first = std::numeric_limits<long>::max(); // that fails
std::atomic<bool> s_allBehind = false;
std::atomic<long> s_asked = 0;
std::atomic<long> s_held = 0;

bool fails() {
    const long number = ++s_asked;
    if (number != s_first && !(s_allBehind && number > s_first))
        return false;
    errno = ENOMEM;
    return true;
}

void* held(void* block) {
    if (block)
        ++s_held;
    return block;
}

} // namespace

void failAllocation(long number, bool andAllBehind) {
    s_asked = 0;
    s_allBehind = andAllBehind;
    s_first = number > 0 ? number : std::numeric_limits<long>::max();
}

long stopFailing() {
    s_first = std::numeric_limits<long>::max();
    return s_asked;
}

long blocksHeld() {
    return s_held;
}

extern "C" {

void* malloc(std::size_t size) noexcept {
    return fails() ? nullptr : held(__libc_malloc(size));
}

void* calloc(std::size_t count, std::size_t size) noexcept {
    return fails() ? nullptr : held(__libc_calloc(count, size));
}

void* realloc(void* block, std::size_t size) noexcept {
    if (fails())
        return nullptr;
    return block ? __libc_realloc(block, size) : held(__libc_realloc(block, size));
}

void free(void* block) noexcept {
    if (block)
        --s_held;
    __libc_free(block);
}

} // extern "C"

} // namespace Reliability
