#pragma once

// Numbers and texts in the parts of a container that are read whole.

#include "ZULMetaData/ByteSource.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaDataBridge/Source/Redaction/MediaPlaces.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData::detail {

constexpr int s_deepestLevel = 16;               ///< of atoms or lists inside each other
constexpr std::uint64_t s_longestRead = 1 << 20; ///< bytes of an atom or chunk that is read as text

template <std::size_t size>
bool isOneOf(FourCC type, const std::array<FourCC, size>& types) {
    return std::find(types.begin(), types.end(), type) != types.end();
}

/// Returns whether all bytes are zero; there must be at least one.
bool isZero(std::string_view bytes);

/// Returns all bytes that the source has, which must be few.
std::string readAll(const ByteSource& source);

/// Returns fewer bytes at the end of the file, and at most `limit`.
std::string readBytes(const ByteSource& file, std::uint64_t offset, std::uint64_t size,
                      std::uint64_t limit = s_longestRead);

/// Returns 0 if the bytes do not reach that far.
///@{
std::uint64_t bigEndianAt(std::string_view bytes, std::size_t offset, std::size_t size);
std::uint32_t littleEndianAt(std::string_view bytes, std::size_t offset);
///@}

/// Returns the bytes from `offset` on, at most `size` of them.
std::string_view part(std::string_view bytes, std::size_t offset, std::size_t size = std::string_view::npos);

/// Returns UTF-8 for a stored text that is UTF-8, UTF-16 with a byte-order mark, or else Latin-1, up to its zero byte.
std::string decodedText(std::string_view bytes);

/// Returns the runs of at least four characters in bytes of an unknown layout.
std::vector<std::string> textRuns(std::string_view bytes);

/// Returns an item's type as it can be shown: its characters, or a number if they are none.
std::string shownType(const ContainerItem& item);

/// What the walks over movies and over RIFF files have in common.
class PlaceWalk {
protected:
    PlaceWalk(const ByteSource& file, Container::Type type) : file_(file), items_(file, type) {}

    std::string payloadOf(const ContainerItem& item) const;

    /// Returns the place that an item takes; an atom becomes `free`, a chunk `JUNK`, and every byte after its header
    /// zero.
    MediaPlace blanked(MediaPlace::Use use, const ContainerItem& item, const std::string& path) const;
    void addPlace(MediaPlace::Use use, const ContainerItem& item, const std::string& path);
    void addUnused(const ContainerItem& item, const std::string& path); ///< unless it is blank already

    /// Leaves out empty texts.
    void addTexts(MediaText::Role role, const ContainerItem& item, const std::string& path,
                  std::vector<std::string> texts);

    const ByteSource& file_;
    ItemWalk items_;
    MediaPlaces places_;
};

} // namespace ZULMetaData::detail
