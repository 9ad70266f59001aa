#pragma once

// The types of the values in a track. Most kinds keep the value of their stream; clicks, keys, cursors and the machine
// have one that says more.

#include "../SharedDependencies/Export.h"
#include "../ZULMetaDataBridge/Source/InputVocabulary.h"
#include "../ZULMetaDataBridge/Source/MetaDataKinds.h"

#include <cstdint>
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
    /// The picture of the entry itself, else the last earlier one with its identifier, else the first later one. Null
    /// if the recording has none.
    std::shared_ptr<const CursorPicture> picture;
    bool hasOwnPicture = false; ///< true if the picture is stored in this entry
    std::uint32_t flags = 3;    ///< bits of the recorder's own
};

/// The machine on which a recording was made, as texts of its recorder.
struct SystemData {
    std::string processorCount;       ///< how many processors it had
    std::string activeProcessorCount; ///< how many of them were in use
    std::string osVersion;            ///< its operating system
    std::string ram;                  ///< its memory in bytes

    friend bool operator==(const SystemData&, const SystemData&) = default; ///< compares all fields
};

/// The type of the values in the track of a kind.
template <class Kind>
struct TrackValue {
    using Type = typename Kind::Value; ///< the value of the stream
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

/// The type of the values in the track of a kind.
template <class Kind>
using TrackValueOf = typename TrackValue<Kind>::Type;

} // namespace ZULMetaData
