// A library for LD_PRELOAD that counts the calls of a program which reach files, and lets one of them fail.
//
//     FAULT=kill|tear|enospc|full|eio|eintr|short  what happens at a call that it can happen to; only those are counted
//     FAULT_AT=N                                   at which one, from 1 on; 0 is none
//     FAULT_AGAIN=N                                and at every Nth one after it; 0 is never again
//     FAULT_REPORT=FILE                            gets the count when the program ends
//
// `kill` ends the program in front of the call, `tear` in the middle of a write of more than 8 bytes; `short` transfers
// half of what was asked for, `full` too, and the write behind it finds no room. A file that cannot be closed is closed
// all the same.

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <dlfcn.h>
#include <fcntl.h>
#include <string>
#include <string_view>
#include <sys/file.h>
#include <sys/sendfile.h>
#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

namespace {

enum class Operation { Open, Create, Make, Examine, Read, Write, Seek, Sync, Change, Close, Output };

enum class Fault { None, Kill, Tear, NoSpace, Full, InputOutput, Interrupted, Short };

std::string_view setting(const char* name) {
    const char* value = std::getenv(name);
    return value ? value : "";
}

long number(const char* name) {
    return std::atol(std::string(setting(name)).c_str());
}

Fault faultNamed(std::string_view name) {
    return name == "kill"     ? Fault::Kill
           : name == "tear"   ? Fault::Tear
           : name == "enospc" ? Fault::NoSpace
           : name == "full"   ? Fault::Full
           : name == "eio"    ? Fault::InputOutput
           : name == "eintr"  ? Fault::Interrupted
           : name == "short"  ? Fault::Short
                              : Fault::None;
}

struct Plan {
    Fault fault = faultNamed(setting("FAULT"));
    long at = number("FAULT_AT");
    long again = number("FAULT_AGAIN");
    std::string report{setting("FAULT_REPORT")};
    std::atomic<long> count = 0;
};

/// Made at the first call, which may come before any constructor of this file; never destroyed.
Plan& plan() {
    static Plan& made = *new Plan;
    return made;
}

bool canHappenTo(Fault fault, Operation operation) {
    switch (fault) {
    case Fault::None: return false;
    case Fault::Kill: return true;
    case Fault::Tear:
    case Fault::Full: return operation == Operation::Write;
    case Fault::NoSpace:
        return operation == Operation::Create || operation == Operation::Make || operation == Operation::Write ||
               operation == Operation::Sync || operation == Operation::Change || operation == Operation::Close ||
               operation == Operation::Output;
    case Fault::InputOutput: return true;
    case Fault::Interrupted:
        return operation == Operation::Open || operation == Operation::Create || operation == Operation::Read ||
               operation == Operation::Write || operation == Operation::Sync;
    case Fault::Short: return operation == Operation::Read || operation == Operation::Write;
    }
    return false;
}

[[noreturn]] void die() {
    kill(getpid(), SIGKILL);
    for (;;)
        pause();
}

/// Counts a call. Whether it is one that fails.
bool strikes(Operation operation) {
    Plan& p = plan();
    if (!canHappenTo(p.fault, operation))
        return false;
    const long count = ++p.count;
    const bool isStruck = p.at > 0 && (count == p.at || (p.fault == Fault::Full && count == p.at + 1) ||
                                       (p.again > 0 && count > p.at && (count - p.at) % p.again == 0));
    if (isStruck && p.fault == Fault::Kill)
        die();
    return isStruck;
}

int errorOfPlan() {
    const Fault fault = plan().fault;
    return fault == Fault::NoSpace || fault == Fault::Full ? ENOSPC : fault == Fault::Interrupted ? EINTR : EIO;
}

template <class Result, class Call>
Result attempt(Operation operation, Result failure, Call call) {
    if (!strikes(operation))
        return call();
    errno = errorOfPlan();
    return failure;
}

template <class Result, class Call>
Result attemptToClose(Result failure, Call call) {
    if (!strikes(Operation::Close))
        return call();
    call();
    errno = errorOfPlan();
    return failure;
}

/// `call` transfers as many bytes as it is told.
template <class Call>
ssize_t transfer(Operation operation, std::size_t size, Call call) {
    if (!strikes(operation))
        return call(size);
    const Fault fault = plan().fault;
    if (fault == Fault::Short || (fault == Fault::Full && plan().count == plan().at))
        return call(std::max<std::size_t>(size / 2, std::min<std::size_t>(size, 1)));
    if (fault == Fault::Tear) {
        call(size > 8 ? size / 2 : 0);
        die();
    }
    errno = errorOfPlan();
    return -1;
}

template <class Function>
Function* next(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

Operation openingBy(int flags) {
    return (flags & O_CREAT) != 0 ? Operation::Create : Operation::Open;
}

Operation openingBy(const char* mode) {
    return std::strpbrk(mode, "wa") ? Operation::Create : Operation::Open;
}

mode_t modeIn(int flags, va_list arguments) {
    return (flags & O_CREAT) != 0 ? va_arg(arguments, mode_t) : 0;
}

std::size_t sizeOf(const iovec* pieces, int count) {
    std::size_t size = 0;
    for (int i = 0; i < count; ++i)
        size += pieces[i].iov_len;
    return size;
}

[[gnu::destructor]] void report() {
    if (plan().report.empty())
        return;
    const std::string text = std::to_string(plan().count);
    const int file = next<decltype(open)>("open")(plan().report.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
    if (next<decltype(write)>("write")(file, text.data(), text.size()) < 0)
        std::abort();
}

} // namespace

// Calls `function` of the C library, which has the same name.
#define NEXT(function) next<decltype(function)>(#function)

extern "C" {

#define OPEN(function)                                                                                                 \
    int function(const char* path, int flags, ...) {                                                                   \
        va_list arguments;                                                                                             \
        va_start(arguments, flags);                                                                                    \
        const mode_t mode = modeIn(flags, arguments);                                                                  \
        va_end(arguments);                                                                                             \
        return attempt(openingBy(flags), -1, [=] { return NEXT(function)(path, flags, mode); });                       \
    }
OPEN(open)
OPEN(open64)

#define OPENAT(function)                                                                                               \
    int function(int folder, const char* path, int flags, ...) {                                                       \
        va_list arguments;                                                                                             \
        va_start(arguments, flags);                                                                                    \
        const mode_t mode = modeIn(flags, arguments);                                                                  \
        va_end(arguments);                                                                                             \
        return attempt(openingBy(flags), -1, [=] { return NEXT(function)(folder, path, flags, mode); });               \
    }
OPENAT(openat)
OPENAT(openat64)

#define FOPEN(function)                                                                                                \
    FILE* function(const char* path, const char* mode) {                                                               \
        return attempt<FILE*>(openingBy(mode), nullptr, [=] { return NEXT(function)(path, mode); });                   \
    }
FOPEN(fopen)
FOPEN(fopen64)

#define MAKE_TEMPORARY(function)                                                                                       \
    int function(char* path, int suffix) {                                                                             \
        return attempt(Operation::Make, -1, [=] { return NEXT(function)(path, suffix); });                             \
    }
MAKE_TEMPORARY(mkstemps)
MAKE_TEMPORARY(mkstemps64)
MAKE_TEMPORARY(mkostemp)
MAKE_TEMPORARY(mkostemp64)

int mkdir(const char* path, mode_t mode) {
    return attempt(Operation::Make, -1, [=] { return NEXT(mkdir)(path, mode); });
}

#define EXAMINE(function, Status)                                                                                      \
    int function(const char* path, struct Status* status) {                                                            \
        return attempt(Operation::Examine, -1, [=] { return NEXT(function)(path, status); });                          \
    }
EXAMINE(stat, stat)
EXAMINE(stat64, stat64)
EXAMINE(lstat, stat)
EXAMINE(lstat64, stat64)

#define EXAMINE_OPEN(function, Status)                                                                                 \
    int function(int file, struct Status* status) {                                                                    \
        return attempt(Operation::Examine, -1, [=] { return NEXT(function)(file, status); });                          \
    }
EXAMINE_OPEN(fstat, stat)
EXAMINE_OPEN(fstat64, stat64)

ssize_t read(int file, void* bytes, std::size_t size) {
    return transfer(Operation::Read, size, [=](std::size_t n) { return NEXT(read)(file, bytes, n); });
}

ssize_t write(int file, const void* bytes, std::size_t size) {
    return transfer(Operation::Write, size, [=](std::size_t n) { return NEXT(write)(file, bytes, n); });
}

#define TRANSFER_AT(function, operation, Bytes, Offset)                                                                \
    ssize_t function(int file, Bytes bytes, std::size_t size, Offset offset) {                                         \
        return transfer(operation, size, [=](std::size_t n) { return NEXT(function)(file, bytes, n, offset); });       \
    }
TRANSFER_AT(pread, Operation::Read, void*, off_t)
TRANSFER_AT(pread64, Operation::Read, void*, off64_t)
TRANSFER_AT(pwrite, Operation::Write, const void*, off_t)
TRANSFER_AT(pwrite64, Operation::Write, const void*, off64_t)

ssize_t readv(int file, const iovec* pieces, int count) {
    return transfer(Operation::Read, sizeOf(pieces, count), [=](std::size_t n) {
        const bool isWhole = n == sizeOf(pieces, count);
        return isWhole ? NEXT(readv)(file, pieces, count)
                       : NEXT(read)(file, pieces->iov_base, std::min(n, pieces->iov_len));
    });
}

ssize_t writev(int file, const iovec* pieces, int count) {
    return transfer(Operation::Write, sizeOf(pieces, count), [=](std::size_t n) {
        if (n == sizeOf(pieces, count))
            return NEXT(writev)(file, pieces, count);
        const iovec* piece = std::find_if(pieces, pieces + count, [](const iovec& p) { return p.iov_len > 0; });
        return NEXT(write)(file, piece->iov_base, std::min(n, piece->iov_len));
    });
}

ssize_t copy_file_range(int from, off64_t* fromOffset, int to, off64_t* toOffset, std::size_t size, unsigned flags) {
    return transfer(Operation::Write, size,
                    [=](std::size_t n) { return NEXT(copy_file_range)(from, fromOffset, to, toOffset, n, flags); });
}

ssize_t sendfile(int to, int from, off_t* offset, std::size_t size) {
    return transfer(Operation::Write, size, [=](std::size_t n) { return NEXT(sendfile)(to, from, offset, n); });
}

#define SEEK(function, Offset)                                                                                         \
    Offset function(int file, Offset offset, int whence) noexcept {                                                    \
        return attempt<Offset>(Operation::Seek, -1, [=] { return NEXT(function)(file, offset, whence); });             \
    }
SEEK(lseek, off_t)
SEEK(lseek64, off64_t)

int fsync(int file) {
    return attempt(Operation::Sync, -1, [=] { return NEXT(fsync)(file); });
}

int fdatasync(int file) {
    return attempt(Operation::Sync, -1, [=] { return NEXT(fdatasync)(file); });
}

#define CUT_OPEN(function, Offset)                                                                                     \
    int function(int file, Offset size) noexcept {                                                                     \
        return attempt(Operation::Sync, -1, [=] { return NEXT(function)(file, size); });                               \
    }
CUT_OPEN(ftruncate, off_t)
CUT_OPEN(ftruncate64, off64_t)

#define CUT(function, Offset)                                                                                          \
    int function(const char* path, Offset size) noexcept {                                                             \
        return attempt(Operation::Change, -1, [=] { return NEXT(function)(path, size); });                             \
    }
CUT(truncate, off_t)
CUT(truncate64, off64_t)

int posix_fallocate(int file, off_t offset, off_t size) {
    return strikes(Operation::Change) ? errorOfPlan() : NEXT(posix_fallocate)(file, offset, size);
}

int fallocate(int file, int mode, off_t offset, off_t size) {
    return attempt(Operation::Change, -1, [=] { return NEXT(fallocate)(file, mode, offset, size); });
}

int posix_fadvise(int file, off_t offset, off_t size, int advice) noexcept {
    return strikes(Operation::Examine) ? errorOfPlan() : NEXT(posix_fadvise)(file, offset, size, advice);
}

int flock(int file, int operation) noexcept {
    return attempt(Operation::Examine, -1, [=] { return NEXT(flock)(file, operation); });
}

#define CHANGE_NAMES(function)                                                                                         \
    int function(const char* from, const char* to) noexcept {                                                          \
        return attempt(Operation::Change, -1, [=] { return NEXT(function)(from, to); });                               \
    }
CHANGE_NAMES(rename)
CHANGE_NAMES(link)
CHANGE_NAMES(symlink)

int renameat2(int fromFolder, const char* from, int toFolder, const char* to, unsigned flags) noexcept {
    return attempt(Operation::Change, -1, [=] { return NEXT(renameat2)(fromFolder, from, toFolder, to, flags); });
}

#define REMOVE(function)                                                                                               \
    int function(const char* path) noexcept {                                                                          \
        return attempt(Operation::Change, -1, [=] { return NEXT(function)(path); });                                   \
    }
REMOVE(unlink)
REMOVE(remove)

int fchmod(int file, mode_t mode) noexcept {
    return attempt(Operation::Change, -1, [=] { return NEXT(fchmod)(file, mode); });
}

int close(int file) {
    return attemptToClose(-1, [=] { return NEXT(close)(file); });
}

int fclose(FILE* file) {
    return attemptToClose(EOF, [=] { return NEXT(fclose)(file); });
}

std::size_t fwrite(const void* bytes, std::size_t size, std::size_t count, FILE* file) {
    const auto call = [=] { return NEXT(fwrite)(bytes, size, count, file); };
    return file == stdout ? attempt<std::size_t>(Operation::Output, 0, call) : call();
}

int fflush(FILE* file) {
    const auto call = [=] { return NEXT(fflush)(file); };
    return file == stdout ? attempt(Operation::Output, EOF, call) : call();
}

} // extern "C"
