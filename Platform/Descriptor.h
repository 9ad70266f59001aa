#pragma once

// What the code around system calls shares: a file descriptor that is closed when its scope ends, calls that signals do
// not cut short, and words for messages.

#include <cerrno>
#include <cstdint>
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

/// The end of a message about a place in a file.
inline std::string atOffset(std::uint64_t position) {
    return " at offset " + std::to_string(position);
}

class Descriptor {
public:
    explicit Descriptor(int number) : number_(number) {}
    ~Descriptor() {
        if (number_ >= 0)
            close(number_);
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    int number() const { return number_; }
    bool isOpen() const { return number_ >= 0; }

private:
    int number_;
};

} // namespace ZULMetaData
