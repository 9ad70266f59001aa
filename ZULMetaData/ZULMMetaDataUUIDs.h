#pragma once

// The header at the beginning of every metadata stream, and the registry of the kinds of streams.

#include "../SharedDependencies/Export.h"
#include "ZULMMetaDataCommon.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace ZULMetaData {

/// The first 24 bytes of a stream, stored as they lie in memory. The entries follow directly.
struct MetaDataHeader {
    ZULMetaData::uuid uuid{};         ///< the kind of the stream
    std::int32_t version = -1;        ///< the version of the format of its entries
    std::uint32_t fixedEntrySize = 0; ///< bytes of every entry, time included; 0 if each entry has its own size
};

inline constexpr std::size_t s_metaDataHeaderSize = 24; ///< in bytes; the first entry begins at this offset

static_assert(sizeof(MetaDataHeader) == s_metaDataHeaderSize && std::is_trivially_copyable_v<MetaDataHeader>);
static_assert(offsetof(MetaDataHeader, version) == 16 && offsetof(MetaDataHeader, fixedEntrySize) == 20);

namespace detail {

/// Returns the identifier of a kind: `firstGroup` followed by 7a1f-11e2-83d0-0017f200be7f.
constexpr uuid kindUUID(std::uint32_t firstGroup) {
    const auto byte = [firstGroup](int shift) { return static_cast<std::uint8_t>(firstGroup >> shift & 0xff); };
    return {
        {byte(24), byte(16), byte(8), byte(0), 0x7a, 0x1f, 0x11, 0xe2, 0x83, 0xd0, 0x00, 0x17, 0xf2, 0x00, 0xbe, 0x7f}};
}

} // namespace detail

/// The identifiers of the kinds, as they are stored in the headers of streams.
///@{
// 2b7b6af4 is not used, and after 2b7b6afc the numbers continue at 2b7b6a00.
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

/// The text of `s_cursorImageUUID`.
inline constexpr const char* s_cursorImageUUIDAsString = "2b7b6af1-7a1f-11e2-83d0-0017f200be7f";

/// One kind of stream: its name, its identifier, and the version that is written today.
struct MetaDataKind {
    std::string_view name;  ///< such as "cursorLocation"; used in reports and on the command line
    ZULMetaData::uuid type; ///< the identifier in the headers of its streams
    int currentVersion;     ///< readers accept the versions from 1 to this one
};

/// The registry of all kinds. The library has writers and parsers for all but six of them.
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

namespace detail {

/// Returns the version of a registered kind, for constants: another identifier does not compile there.
constexpr int versionOf(const uuid& type) {
    for (const MetaDataKind& kind : s_metaDataKinds)
        if (kind.type == type)
            return kind.currentVersion;
    throw "this kind is not registered";
}

} // namespace detail

/// Return the registered kind with this identifier or with this name, or null. Print nothing, unlike
/// `currentVersionForUUID`.
///@{
ZULMETADATA_API const MetaDataKind* findMetaDataKind(const uuid& type);
ZULMETADATA_API const MetaDataKind* findMetaDataKind(std::string_view name);
///@}

/// Returns the 36 characters that `operator<<` writes.
ZULMETADATA_API std::string uuidText(const uuid& type);

/// Returns the name of the kind, or the text of the identifier if the kind is not registered.
ZULMETADATA_API std::string metaDataKindName(const uuid& type);

/// Looks up versions of kinds.
struct ZULMETADATA_API MetaDataUUID {
    /// Returns the version that is written today. For an unknown kind it returns -1 and prints a line on standard
    /// output.
    static int currentVersionForUUID(const uuid& type);
};

} // namespace ZULMetaData
