// A library for LD_PRELOAD that lets allocations of a program fail, from its main function on.
//
//     ALLOCATION_FAILS=N             the Nth one; 0 is none
//     ALLOCATION_FAILS_BEHIND=1      and all behind it
//     ALLOCATION_COUNT=FILE          gets, as a text, how many there have been when the program ends

#include "Tests/Reliability/Programs/FailingAllocations.h"

#include <array>
#include <charconv>
#include <cstdlib>
#include <dlfcn.h>
#include <fcntl.h>
#include <unistd.h>

namespace {

using Main = int (*)(int, char**, char**);

Main s_main = nullptr;

long number(const char* name) {
    const char* value = std::getenv(name);
    return value ? std::atol(value) : 0;
}

void tellCount() {
    const long count = Reliability::stopFailing();
    const int file = open(std::getenv("ALLOCATION_COUNT"), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    std::array<char, 24> digits;
    const char* end = std::to_chars(digits.data(), digits.data() + digits.size(), count).ptr;
    if (write(file, digits.data(), static_cast<std::size_t>(end - digits.data())) < 0)
        std::abort();
    close(file);
}

int failingMain(int argc, char** argv, char** environment) {
    if (std::getenv("ALLOCATION_COUNT"))
        std::atexit(tellCount);
    Reliability::failAllocation(number("ALLOCATION_FAILS"), number("ALLOCATION_FAILS_BEHIND") != 0);
    return s_main(argc, argv, environment);
}

} // namespace

extern "C" {

using Start = int (*)(Main, int, char**, void (*)(), void (*)(), void (*)(), void*);

int __libc_start_main(Main main, int argc, char** argv, void (*init)(), void (*fini)(), void (*loaderFini)(),
                      void* stackEnd);

/// What every program begins with: hands on another main function.
int __libc_start_main(Main main, int argc, char** argv, void (*init)(), void (*fini)(), void (*loaderFini)(),
                      void* stackEnd) {
    s_main = main;
    const auto start = reinterpret_cast<Start>(dlsym(RTLD_NEXT, "__libc_start_main"));
    return start(failingMain, argc, argv, init, fini, loaderFini, stackEnd);
}

} // extern "C"
