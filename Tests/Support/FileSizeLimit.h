#pragma once

// Makes writes fail: a file cannot grow beyond a limit, as on a disk that is full.

#include <csignal>
#include <cstdint>
#include <sys/resource.h>

namespace ZULMetaData::Test {

/// Holds for the whole process as long as it lives.
class FileSizeLimit {
public:
    explicit FileSizeLimit(std::uint64_t bytes) : oldHandler_(std::signal(SIGXFSZ, SIG_IGN)) {
        getrlimit(RLIMIT_FSIZE, &oldLimit_);
        const rlimit limit{bytes, oldLimit_.rlim_max};
        setrlimit(RLIMIT_FSIZE, &limit);
    }
    ~FileSizeLimit() {
        setrlimit(RLIMIT_FSIZE, &oldLimit_);
        std::signal(SIGXFSZ, oldHandler_);
    }
    FileSizeLimit(const FileSizeLimit&) = delete;
    FileSizeLimit& operator=(const FileSizeLimit&) = delete;

private:
    void (*oldHandler_)(int);
    rlimit oldLimit_{};
};

} // namespace ZULMetaData::Test
