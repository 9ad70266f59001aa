#pragma once

// What the code around system calls shares: a file descriptor that is closed when its scope ends, and calls that
// signals do not cut short. Every failure is a `std::system_error` that says what could not be done, but not to which
// file.

#include "SharedDependencies/Export.h"

#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <unistd.h>

namespace ZULMetaData {

/// Repeats a system call that a signal interrupted.
template <class Call>
auto uninterrupted(Call call) {
    auto result = call();
    while (result < 0 && errno == EINTR)
        result = call();
    return result;
}

[[noreturn]] void throwSystemError(int error, const std::string& what);

/// The end of a message about a place in a file.
inline std::string atOffset(std::uint64_t position) {
    return " at offset " + std::to_string(position);
}

class ZULMETADATA_API Descriptor {
public:
    explicit Descriptor(int number) : number_(number) {}
    ~Descriptor() {
        if (number_ >= 0)
            ::close(number_);
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    int number() const { return number_; }
    bool isOpen() const { return number_ >= 0; }

    /// Closes the file before its scope ends. Throws if the system reports that bytes were lost.
    void close();

    /// Reads bytes and returns their number, which is smaller than asked for only at the end of the file.
    std::size_t readAt(std::uint64_t position, std::span<char> bytes) const;

    /// Writes all of `bytes`, or throws with some of them written.
    void writeAt(std::uint64_t position, std::span<const char> bytes);

    /// Cuts the file off, or fills it up with zeros.
    void truncate(std::uint64_t size);

private:
    int number_;
};

} // namespace ZULMetaData
