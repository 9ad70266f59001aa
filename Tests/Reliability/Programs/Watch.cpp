#include "Tests/Reliability/Programs/Watch.h"

#include <algorithm>
#include <array>
#include <csignal>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <limits>
#include <malloc.h>
#include <new>
#include <unistd.h>

extern "C" {
void* __real_malloc(std::size_t size);
void __real_free(void* block);
void* __wrap_malloc(std::size_t size);
void* __wrap_calloc(std::size_t count, std::size_t size);
void __wrap_free(void* block);
void __sanitizer_set_death_callback(void (*callback)()) __attribute__((weak));
void __sanitizer_set_report_fd(void* file) __attribute__((weak));
}

/// Small blocks are used again soon: to keep them all for a while costs more than the cases themselves.
extern "C" const char* __asan_default_options();
const char* __asan_default_options() {
    return "quarantine_size_mb=4";
}

namespace Reliability {

namespace {

constexpr unsigned s_secondsPerCase = 10;

constexpr std::ptrdiff_t s_noLimit = std::numeric_limits<std::ptrdiff_t>::max();

/// Signed: what others allocated and the library frees is counted when it goes only.
std::ptrdiff_t s_held = 0;
std::ptrdiff_t s_limit = s_noLimit;
bool s_hasRefused = false;
int s_errors = STDERR_FILENO;
std::array<char, 200> s_case{};

void* allocate(std::size_t size) {
    if (s_limit != s_noLimit && size > static_cast<std::size_t>(std::max<std::ptrdiff_t>(s_limit - s_held, 0))) {
        s_hasRefused = true;
        return nullptr;
    }
    void* block = __real_malloc(std::max<std::size_t>(size, 1));
    if (block)
        s_held += static_cast<std::ptrdiff_t>(malloc_usable_size(block));
    return block;
}

void release(void* block) {
    if (block)
        s_held -= static_cast<std::ptrdiff_t>(malloc_usable_size(block));
    __real_free(block);
}

/// Only what a signal handler may do.
void tellCase(const char* what) {
    for (const char* part : {what, static_cast<const char*>(s_case.data()), "\n"})
        if (write(s_errors, part, std::strlen(part)) < 0)
            return;
}

void tellCrash() {
    tellCase("crashed: ");
}

extern "C" void endCase(int signal) {
    tellCase(signal == SIGALRM ? "hangs: " : "crashed: ");
    std::signal(signal, SIG_DFL);
    std::raise(signal);
}

} // namespace

void limitMemory(std::size_t bytes) {
    s_limit = s_held + static_cast<std::ptrdiff_t>(bytes);
    s_hasRefused = false;
}

void liftMemoryLimit() {
    s_limit = s_noLimit;
}

bool hasRefusedMemory() {
    return s_hasRefused;
}

void beginCase(const std::string& name) {
    const std::size_t size = std::min(name.size(), s_case.size() - 1);
    std::memcpy(s_case.data(), name.data(), size);
    s_case[size] = '\0';
    alarm(s_secondsPerCase);
}

void silence() {
    s_errors = dup(STDERR_FILENO);
    const int nowhere = open("/dev/null", O_WRONLY | O_CLOEXEC);
    dup2(nowhere, STDOUT_FILENO);
    dup2(nowhere, STDERR_FILENO);
    for (const int signal : {SIGALRM, SIGABRT})
        std::signal(signal, endCase);
    if (__sanitizer_set_death_callback && __sanitizer_set_report_fd) {
        __sanitizer_set_death_callback(tellCrash);
        __sanitizer_set_report_fd(reinterpret_cast<void*>(static_cast<std::intptr_t>(s_errors)));
    } else {
        std::signal(SIGSEGV, endCase);
    }
}

void tell(const std::string& line) {
    const std::string text = line + '\n';
    if (write(s_errors, text.data(), text.size()) < 0)
        std::abort();
}

} // namespace Reliability

void* __wrap_malloc(std::size_t size) {
    return Reliability::allocate(size);
}

void* __wrap_calloc(std::size_t count, std::size_t size) {
    std::size_t bytes = 0;
    void* block = __builtin_mul_overflow(count, size, &bytes) ? nullptr : Reliability::allocate(bytes);
    return block ? std::memset(block, 0, bytes) : nullptr;
}

void __wrap_free(void* block) {
    Reliability::release(block);
}

void* operator new(std::size_t size) {
    void* block = Reliability::allocate(size);
    if (!block)
        throw std::bad_alloc();
    return block;
}

void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    return Reliability::allocate(size);
}

void operator delete(void* block) noexcept {
    Reliability::release(block);
}

void operator delete(void* block, std::size_t) noexcept {
    Reliability::release(block);
}
