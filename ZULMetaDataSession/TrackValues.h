#pragma once

// The types of the values in a track. Most kinds keep the value of their stream; clicks, keys, cursors and the machine
// have one that says more.

#include "../SharedDependencies/Export.h"
#include "../ZULMetaDataBridge/Source/InputVocabulary.h"
#include "../ZULMetaDataBridge/Source/MetaDataKinds.h"

#include <cstdint>
#include <list>
#include <memory>
#include <span>
#include <string>
#include <vector>

namespace ZULMetaData {

/// A picture of the cursor as it is stored.
struct CursorPicture {
    std::vector<std::uint8_t> bytes;               ///< PNG or TIFF, never decoded here
    Point hotSpot;                                 ///< pixels from the upper left corner of the picture
    CursorTypeID systemCursor = CursorTypeUnknown; ///< which system cursor it shows

    friend bool operator==(const CursorPicture&, const CursorPicture&) = default; ///< compares all fields
};

/// What the cursor looked like.
struct CursorAppearance {
    std::uint64_t id = 0; ///< identifies the picture within its recording
    /// The picture of the entry itself. If it has none, a track fills in the last earlier one with the same identifier,
    /// or else the first later one. Null if the recording has none. Appearances share pictures.
    std::shared_ptr<const CursorPicture> picture;
    bool hasOwnPicture = false; ///< true if the picture is stored in this entry
    std::uint32_t flags = 3;    ///< bits of the recorder's own
};

/// The machine on which a recording was made: the whole texts of its recorder as UTF-8. A text that is missing is
/// empty.
struct SystemData {
    std::string processorCount;       ///< how many processors it had, such as "ProcessorCount:8"
    std::string activeProcessorCount; ///< how many of them were in use, such as "ActiveProcessorCount:8"
    std::string osVersion;            ///< its operating system, such as "OSVersion:Version 14.2"
    std::string ram;                  ///< its memory, such as "RAM:16384MB"

    friend bool operator==(const SystemData&, const SystemData&) = default; ///< compares all fields
};

namespace detail {

template <class Kind>
struct TrackValue {
    using Type = typename Kind::Value;
};
template <>
struct TrackValue<CursorActionKind> {
    using Type = ButtonAction;
};
template <>
struct TrackValue<KeyboardActionKind> {
    using Type = KeyInput;
};
template <>
struct TrackValue<CursorImageKind> {
    using Type = CursorAppearance;
};
template <>
struct TrackValue<SystemDataKind> {
    using Type = SystemData;
};

} // namespace detail

/// The type of the values in the track of a kind: that of its stream, or one that says more.
template <class Kind>
using TrackValueOf = typename detail::TrackValue<Kind>::Type;

/// Return the value in a track for the value in a stream. An appearance has the picture of its own entry alone.
///@{
inline ButtonAction trackValue(std::int32_t stored) {
    return buttonActionOf(stored);
}
inline KeyInput trackValue(const KeyStroke& stored) {
    return keyInputOf(stored);
}
ZULMETADATA_API CursorAppearance trackValue(const CursorImage& stored);
ZULMETADATA_API SystemData trackValue(const std::list<std::string>& stored);
///@}

namespace detail {

/// Fills in the pictures of appearances without one of their own, from the others in this order.
ZULMETADATA_API void sharePictures(std::span<CursorAppearance> appearances);

} // namespace detail

} // namespace ZULMetaData
