#pragma once

#include <cstdint>
#include <string_view>

namespace Zulm {

/// A hash of bytes that come piece by piece (FNV-1a, 64 bits). It tells copies of a recording apart from changed ones;
/// nobody is kept from making two recordings with the same one.
class Checksum {
public:
    void add(std::string_view bytes) {
        constexpr std::uint64_t prime = 0x100000001b3;
        for (const char byte : bytes)
            value_ = (value_ ^ static_cast<unsigned char>(byte)) * prime;
    }
    std::uint64_t value() const { return value_; }

private:
    std::uint64_t value_ = 0xcbf29ce484222325;
};

} // namespace Zulm
