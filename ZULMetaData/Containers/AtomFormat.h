#pragma once

// The bytes of movie atoms and RIFF chunks, in one place.
//
//     atom   [size: 4][type: 4][extended size: 8, if size is below 8][payload]        big-endian, size counts it all
//     chunk  [type: 4][size: 4][data][one byte if size is odd]                        little-endian, size counts data

#include "SharedDependencies/EndianFile.h"
#include "ZULMetaData/Containers/ContainerLayout.h"

#include <array>
#include <cstdint>
#include <cstring>

namespace ZULMetaData::detail {

inline constexpr FourCC s_spareAtom = "wide";
inline constexpr FourCC s_freeAtom = "free";
inline constexpr FourCC s_fragmentIndexAtom = "mfra";
inline constexpr FourCC s_junkChunk = "JUNK"; // a chunk whose data no program reads

inline constexpr std::uint64_t s_atomHeaderSize = 8;
inline constexpr std::uint64_t s_extendedAtomHeaderSize = 16;
inline constexpr std::uint64_t s_extendedSizeOffset = 8;
inline constexpr std::uint64_t s_chunkHeaderSize = 8;

/// Replaces the size if the size follows the type in 64 bits.
inline constexpr std::uint32_t s_extendedSizeMarker = 1;

/// Which 32-bit sizes announce a size of 64 bits. The search for metadata and the repair disagree about 0 and 2 to 7.
enum class ExtendedSizes {
    BelowHeader, ///< every size below 8
    Marked,      ///< 1 alone; the others are taken literally
};

/// Reads the header of an atom at the position of `input`. Returns false if its bytes do not exist; for the size 0,
/// which may be an open end, the 64-bit size need not exist. This is the only function that reads a header of an atom.
template <class Input>
bool readAtomHeader(Input& input, ExtendedSizes sizes, ContainerItem& atom) {
    atom.offset = input.position();
    atom.headerSize = s_atomHeaderSize;
    if (!input.enoughBytesLeft(s_atomHeaderSize) || !input.readBigEndian(atom.sizeField) ||
        !input.readBigEndian(atom.type.value))
        return false;
    atom.size = atom.sizeField;
    const bool isExtended =
        sizes == ExtendedSizes::Marked ? atom.sizeField == s_extendedSizeMarker : atom.sizeField < s_atomHeaderSize;
    if (!isExtended)
        return true;
    std::uint64_t size = 0;
    if (!input.readBigEndian(size))
        return atom.sizeField == 0;
    atom.size = size;
    atom.headerSize = s_extendedAtomHeaderSize;
    return true;
}

/// Reads the header of a chunk at the position of `input`.
template <class Input>
bool readChunkHeader(Input& input, ContainerItem& chunk) {
    chunk.offset = input.position();
    chunk.headerSize = s_chunkHeaderSize;
    if (!input.readBigEndian(chunk.type.value) || !input.readBigEndian(chunk.sizeField))
        return false;
    chunk.sizeField = swapInt(chunk.sizeField);
    chunk.size = s_chunkHeaderSize + chunk.sizeField;
    return true;
}

/// Returns the bytes of all values, one after the other.
template <class... Integers>
std::array<char, (sizeof(Integers) + ...)> bigEndianBytes(Integers... values) {
    std::array<char, (sizeof(Integers) + ...)> bytes;
    char* place = bytes.data();
    const auto append = [&place](auto value) {
        value = swapInt(value);
        std::memcpy(place, &value, sizeof value);
        place += sizeof value;
    };
    (append(values), ...);
    return bytes;
}

/// Returns the header in extended form.
inline auto extendedAtomHeader(FourCC type, std::uint64_t size) {
    return bigEndianBytes(s_extendedSizeMarker, type.value, size);
}

/// Returns the header in its short form.
inline auto atomHeader(FourCC type, std::uint32_t size) {
    return bigEndianBytes(size, type.value);
}

/// Returns the header of a chunk. `size` counts the data alone.
inline auto chunkHeader(FourCC type, std::uint32_t size) {
    return bigEndianBytes(type.value, swapInt(size));
}

} // namespace ZULMetaData::detail
