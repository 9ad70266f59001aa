// A library for LD_PRELOAD that lets allocations of a program fail, from its main function on. It starts once and
// forks in front of that: most of a start's time is not the program's own.
//
//     ALLOCATION_COUNT=FILE          nothing fails; FILE gets, as a text, how many allocations there were
//
//     ALLOCATION_FIRST=N             the first one that fails
//     ALLOCATION_STEP=N              how far behind it the one is that fails in the next process, and so on
//     ALLOCATION_LAST=N
//     ALLOCATIONS_BEHIND=1           and all behind it
//
// The process whose Nth allocation fails runs in the folder N/files, its output and errors go to N/output and N/errors.
// On standard output there is a line for each, N and how it ended, as waitpid tells it.

#include "Tests/Reliability/Programs/FailingAllocations.h"

#include <array>
#include <charconv>
#include <cstdio>
#include <cstdlib>
#include <dlfcn.h>
#include <fcntl.h>
#include <string>
#include <sys/wait.h>
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

void lead(int descriptor, const char* path) {
    const int file = open(path, O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    if (dup2(file, descriptor) != descriptor)
        std::abort();
    close(file);
}

void enter(const std::string& folder) {
    if (chdir(folder.c_str()) != 0)
        std::abort();
    lead(STDOUT_FILENO, "output");
    lead(STDERR_FILENO, "errors");
    if (chdir("files") != 0)
        std::abort();
}

int failEach(int argc, char** argv, char** environment) {
    const long step = number("ALLOCATION_STEP");
    const long last = number("ALLOCATION_LAST");
    const bool andAllBehind = number("ALLOCATIONS_BEHIND") != 0;
    constexpr unsigned longest = 20; // seconds
    for (long failing = number("ALLOCATION_FIRST"); failing <= last; failing += step) {
        const pid_t child = fork();
        if (child == 0) {
            enter(std::to_string(failing));
            alarm(longest);
            Reliability::failAllocation(failing, andAllBehind);
            return s_main(argc, argv, environment);
        }
        int status = 0;
        if (child < 0 || waitpid(child, &status, 0) != child)
            std::abort();
        dprintf(STDOUT_FILENO, "%ld %d\n", failing, status);
    }
    return 0;
}

int failingMain(int argc, char** argv, char** environment) {
    if (std::getenv("ALLOCATION_STEP"))
        return failEach(argc, argv, environment);
    std::atexit(tellCount);
    Reliability::failAllocation(0, false);
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
