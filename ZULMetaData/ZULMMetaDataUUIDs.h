#pragma once

// The header in front of every metadata stream, and the registry of the kinds of streams.

#include "../SharedDependencies/Export.h"
#include "ZULMMetaDataCommon.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace ZULMetaData {

/// The first 24 bytes of a stream, stored as they lie in memory. Its entries follow at once.
struct MetaDataHeader {
    ZULMetaData::uuid uuid{};         ///< the kind of the stream
    std::int32_t version = -1;        ///< the format of its entries
    std::uint32_t fixedEntrySize = 0; ///< bytes of every entry, time included; 0 where each entry carries its size
};

inline constexpr std::size_t s_metaDataHeaderSize = 24; ///< in bytes; the first entry begins there

static_assert(sizeof(MetaDataHeader) == s_metaDataHeaderSize && std::is_trivially_copyable_v<MetaDataHeader>);
static_assert(offsetof(MetaDataHeader, version) == 16 && offsetof(MetaDataHeader, fixedEntrySize) == 20);

namespace detail {

/// Every kind's identifier is `firstGroup` followed by 7a1f-11e2-83d0-0017f200be7f.
constexpr uuid kindUUID(std::uint32_t firstGroup) {
    const auto byte = [firstGroup](int shift) { return static_cast<std::uint8_t>(firstGroup >> shift & 0xff); };
    return {
        {byte(24), byte(16), byte(8), byte(0), 0x7a, 0x1f, 0x11, 0xe2, 0x83, 0xd0, 0x00, 0x17, 0xf2, 0x00, 0xbe, 0x7f}};
}

} // namespace detail

/// What the header of a stream names its kind by.
///@{
// 2b7b6af4 is nobody's, and behind 2b7b6afc the numbering goes on at 2b7b6a00.
inline constexpr uuid s_caretPositionUUID = detail::kindUUID(0x2b7b6aef);
inline constexpr uuid s_cursorActionUUID = detail::kindUUID(0x2b7b6af0);
inline constexpr uuid s_cursorImageUUID = detail::kindUUID(0x2b7b6af1);
inline constexpr uuid s_cursorLocationUUID = detail::kindUUID(0x2b7b6af2);
inline constexpr uuid s_cursorOpacityUUID = detail::kindUUID(0x2b7b6af3);
inline constexpr uuid s_keyboardActionUUID = detail::kindUUID(0x2b7b6af5);
inline constexpr uuid s_recordingRegionUUID = detail::kindUUID(0x2b7b6af6);
inline constexpr uuid s_topmostWindowUUID = detail::kindUUID(0x2b7b6af7);
inline constexpr uuid s_slideTitlesUUID = detail::kindUUID(0x2b7b6af8);
inline constexpr uuid s_slideTextUUID = detail::kindUUID(0x2b7b6af9);
inline constexpr uuid s_slideCommentUUID = detail::kindUUID(0x2b7b6afa);
inline constexpr uuid s_recordingScaleFactorUUID = detail::kindUUID(0x2b7b6afb);
inline constexpr uuid s_systemDataUUID = detail::kindUUID(0x2b7b6afc);
inline constexpr uuid s_miscellanyUUID = detail::kindUUID(0x2b7b6a00);
inline constexpr uuid s_recordingCutTimesUUID = detail::kindUUID(0x2b7b6a01);
inline constexpr uuid s_deviceFrameCoordinatesUUID = detail::kindUUID(0x2b7b6a02);
inline constexpr uuid s_deviceFrameAspectRatioUUID = detail::kindUUID(0x2b7b6a03);
inline constexpr uuid s_deviceFrameDisplayNamesUUID = detail::kindUUID(0x2b7b6a04);
inline constexpr uuid s_scrollActionUUID = detail::kindUUID(0x2b7b6a05);
inline constexpr uuid s_topmostAppNameUUID = detail::kindUUID(0x2b7b6a06);
inline constexpr uuid s_topmostWindowTitleUUID = detail::kindUUID(0x2b7b6a07);
inline constexpr uuid s_cpuUsageUUID = detail::kindUUID(0x2b7b6a08);
inline constexpr uuid s_hoverRectUUID = detail::kindUUID(0x2b7b6a09);
///@}

/// As `s_cursorImageUUID` is printed.
inline constexpr const char* s_cursorImageUUIDAsString = "2b7b6af1-7a1f-11e2-83d0-0017f200be7f";

/// One kind of stream: what it is called, how its header names it, and the version that is written today.
struct MetaDataKind {
    std::string_view name;  ///< such as "cursorLocation", everywhere that people meet it
    ZULMetaData::uuid type; ///< in the headers of its streams
    int currentVersion;     ///< readers know it and all before it, from 1 on
};

/// The registry, with the six kinds that nothing here writes.
inline constexpr std::array<MetaDataKind, 23> s_metaDataKinds{{
    {"caretPosition", s_caretPositionUUID, 1},
    {"cursorAction", s_cursorActionUUID, 1},
    {"cursorImage", s_cursorImageUUID, 2},
    {"cursorLocation", s_cursorLocationUUID, 1},
    {"cursorOpacity", s_cursorOpacityUUID, 1},
    {"keyboardAction", s_keyboardActionUUID, 1},
    {"recordingRegion", s_recordingRegionUUID, 1},
    {"topmostWindow", s_topmostWindowUUID, 1},
    {"slideTitles", s_slideTitlesUUID, 1},
    {"slideText", s_slideTextUUID, 1},
    {"slideComment", s_slideCommentUUID, 1},
    {"recordingScaleFactor", s_recordingScaleFactorUUID, 1},
    {"systemData", s_systemDataUUID, 1},
    {"miscellany", s_miscellanyUUID, 1},
    {"recordingCutTimes", s_recordingCutTimesUUID, 1},
    {"deviceFrameCoordinates", s_deviceFrameCoordinatesUUID, 1},
    {"deviceFrameAspectRatio", s_deviceFrameAspectRatioUUID, 1},
    {"deviceFrameDisplayNames", s_deviceFrameDisplayNamesUUID, 1},
    {"scrollAction", s_scrollActionUUID, 1},
    {"topmostAppName", s_topmostAppNameUUID, 1},
    {"topmostWindowTitle", s_topmostWindowTitleUUID, 1},
    {"cpuUsage", s_cpuUsageUUID, 1},
    {"hoverRect", s_hoverRectUUID, 1},
}};

/// The registered kind of a stream, or null. Silent, unlike `currentVersionForUUID`.
ZULMETADATA_API const MetaDataKind* findMetaDataKind(const uuid& type);

/// Its 36 characters, as `operator<<` writes them.
ZULMETADATA_API std::string uuidText(const uuid& type);

/// The name of a registered kind; of any other its identifier, as `uuidText` gives it.
ZULMETADATA_API std::string metaDataKindName(const uuid& type);

/// Versions by kind.
struct ZULMETADATA_API MetaDataUUID {
    /// The version that is written today; -1 for an unknown kind, with one line on standard output.
    static int currentVersionForUUID(const uuid& type);
};

} // namespace ZULMetaData
