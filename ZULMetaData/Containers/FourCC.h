#pragma once

#include <cstdint>
#include <string>

namespace ZULMetaData {

/// The type of an atom or a chunk: four characters, in the order in which a file stores them.
struct FourCC {
    std::uint32_t value = 0; ///< the first character is the highest byte

    constexpr FourCC() = default;                                      ///< four zero bytes
    constexpr explicit FourCC(std::uint32_t number) : value(number) {} ///< the first character is the highest byte
    constexpr FourCC(const char (&characters)[5]) {                    ///< allows `item.type == "moov"`
        for (int i = 0; i < 4; ++i)
            value = value << 8 | static_cast<unsigned char>(characters[i]);
    }

    friend constexpr bool operator==(FourCC, FourCC) = default; ///< compares all four characters

    /// Returns whether all four are printable characters of ASCII.
    constexpr bool isPrintable() const {
        for (int shift = 0; shift < 32; shift += 8)
            if ((value >> shift & 0xff) < 0x20 || (value >> shift & 0xff) > 0x7e)
                return false;
        return true;
    }

    /// Returns the characters, whatever bytes they are.
    std::string text() const {
        return {static_cast<char>(value >> 24), static_cast<char>(value >> 16), static_cast<char>(value >> 8),
                static_cast<char>(value)};
    }
};

} // namespace ZULMetaData
