#pragma once

// The bytes of movie atoms and RIFF chunks, in one place.
//
//     atom   [size: 4][type: 4][extended size: 8, where size is below 8][payload]     big-endian, size counts it all
//     chunk  [type: 4][size: 4][data][one byte where size is odd]                     little-endian, size counts data

#include "SharedDependencies/EndianFile.h"

#include <array>
#include <cstdint>
#include <cstring>

namespace ZULMetaData::detail {

/// A four-character code as a movie's 32-bit number.
constexpr std::uint32_t fourCC(const char (&code)[5]) {
    std::uint32_t value = 0;
    for (int i = 0; i < 4; ++i)
        value = value << 8 | static_cast<unsigned char>(code[i]);
    return value;
}

inline constexpr std::uint32_t s_metaDataAtom = fourCC("ZULM");
inline constexpr std::uint32_t s_streamAtom = fourCC("DATA");
inline constexpr std::uint32_t s_recordingInfoAtom = fourCC("ZULR");
inline constexpr std::uint32_t s_spareAtom = fourCC("wide");
inline constexpr std::uint32_t s_freeAtom = fourCC("free");
inline constexpr std::uint32_t s_fragmentIndexAtom = fourCC("mfra");

/// A chunk whose data nobody reads.
inline constexpr std::uint32_t s_junkChunk = fourCC("JUNK");

/// Chunk types are compared as they are stored.
constexpr std::uint32_t chunkType(std::uint32_t code) {
    return swapInt(code);
}

inline constexpr std::uint64_t s_atomHeaderSize = 8;
inline constexpr std::uint64_t s_extendedAtomHeaderSize = 16;
inline constexpr std::uint64_t s_extendedSizeOffset = 8;
inline constexpr std::uint64_t s_chunkHeaderSize = 8;

/// In place of the size: it follows the type, in 64 bits.
inline constexpr std::uint32_t s_extendedSizeMarker = 1;

template <class Integer>
std::array<char, sizeof(Integer)> bigEndianBytes(Integer value) {
    const Integer swapped = swapInt(value);
    std::array<char, sizeof(Integer)> bytes;
    std::memcpy(bytes.data(), &swapped, sizeof swapped);
    return bytes;
}

/// The header in extended form.
inline std::array<char, s_extendedAtomHeaderSize> extendedAtomHeader(std::uint32_t type, std::uint64_t size) {
    const std::array<std::uint32_t, 2> sizeAndType{swapInt(s_extendedSizeMarker), swapInt(type)};
    const std::uint64_t extendedSize = swapInt(size);
    std::array<char, s_extendedAtomHeaderSize> bytes;
    std::memcpy(bytes.data(), sizeAndType.data(), sizeof sizeAndType);
    std::memcpy(bytes.data() + s_extendedSizeOffset, &extendedSize, sizeof extendedSize);
    return bytes;
}

/// The header in its short form.
inline std::array<char, s_atomHeaderSize> atomHeader(std::uint32_t type, std::uint32_t size) {
    const std::array<std::uint32_t, 2> sizeAndType{swapInt(size), swapInt(type)};
    std::array<char, s_atomHeaderSize> bytes;
    std::memcpy(bytes.data(), sizeAndType.data(), sizeof sizeAndType);
    return bytes;
}

/// `size` counts the data alone.
inline std::array<char, s_chunkHeaderSize> chunkHeader(std::uint32_t type, std::uint32_t size) {
    const std::array<std::uint32_t, 2> typeAndSize{chunkType(type), size};
    std::array<char, s_chunkHeaderSize> bytes;
    std::memcpy(bytes.data(), typeAndSize.data(), sizeof typeAndSize);
    return bytes;
}

} // namespace ZULMetaData::detail
