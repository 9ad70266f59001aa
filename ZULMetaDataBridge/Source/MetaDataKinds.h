#pragma once

// The kinds of metadata that applications record and read. Each kind has the type of its values, the identifier and the
// version of its stream, and the keys of its entries.

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ZULMMetaDataCommon.h"
#include "../../ZULMetaData/ZULMMetaDataUUIDs.h"
#include "EntryDictionary.h"
#include "EntryTexts.h"
#include "HumanReadableActions.h"

#include <cstdint>
#include <iterator>
#include <list>
#include <stdexcept>
#include <string>
#include <tuple>
#include <type_traits>

namespace ZULMetaData {

/// One key of an entry, and how its value is computed from the value in the stream.
template <class Projection>
struct Field {
    const char* key;    ///< the key in entries
    Projection valueOf; ///< a member of the kind's value, or a function of it, whose result `entryValue` accepts

    /// Creates the field and deduces the type of its projection.
    constexpr Field(const char* fieldKey, Projection projection) : key(fieldKey), valueOf(projection) {}
};

/// Returns the value of a field: a member of `value`, or the result of a function of it.
template <class Projection, class Value>
constexpr decltype(auto) valueOfField(const Field<Projection>& field, const Value& value) {
    if constexpr (std::is_member_object_pointer_v<Projection>)
        return (value.*field.valueOf);
    else
        return field.valueOf(value);
}

/// The projection for a kind whose value is a single number.
inline constexpr auto wholeValue = [](const auto& value) { return value; };

inline constexpr std::tuple s_pointFields{Field{"x", &Point::x},
                                          Field{"y", &Point::y}}; ///< the fields of all kinds of points

/// The fields of all kinds of rectangles.
inline constexpr std::tuple s_rectFields{Field{"x", &Rect::x}, Field{"y", &Rect::y}, Field{"width", &Rect::width},
                                         Field{"height", &Rect::height}};

/// What becomes of an entry when the movie is cut.
enum class StreamRole {
    State, ///< holds until the next entry, so it is carried over a cut
    Event, ///< happens at its time, and is never repeated
    Once,  ///< is valid for the whole recording, whatever its time
};

/// What all kinds have. A kind adds `fields`.
template <StreamValue T, const uuid& identifier, StreamRole streamRole = StreamRole::State>
struct StreamKind {
    using Value = T;                                        ///< the type of the values in the stream
    static constexpr StreamRole role = streamRole;          ///< what becomes of its entries when the movie is cut
    static constexpr uuid type = identifier;                ///< the identifier in the header of the stream
    static constexpr int version = detail::versionOf(type); ///< the version that is written; earlier ones are read too
};

/// Where the window on top was.
struct TopmostWindowKind : StreamKind<Rect, s_topmostWindowUUID> {
    static constexpr auto fields = s_rectFields; ///< the keys of its entries, which "timestamp" follows
};

/// What the cursor hovered over.
struct HoverRectKind : StreamKind<Rect, s_hoverRectUUID> {
    static constexpr auto fields = s_rectFields;
};

/// The recorded region.
struct RecordingRegionKind : StreamKind<Rect, s_recordingRegionUUID, StreamRole::Once> {
    static constexpr auto fields = s_rectFields;
};

/// Scroll deltas.
struct ScrollActionKind : StreamKind<Point, s_scrollActionUUID, StreamRole::Event> {
    static constexpr auto fields = s_pointFields;
};

/// Where the cursor was.
struct CursorLocationKind : StreamKind<Point, s_cursorLocationUUID> {
    static constexpr auto fields = s_pointFields;
};

/// How busy the machine was.
struct CPUUsageKind : StreamKind<float, s_cpuUsageUUID> {
    static constexpr std::tuple fields{Field{"cpuUsage", wholeValue}};
};

/// How opaque the cursor was drawn.
struct CursorOpacityKind : StreamKind<double, s_cursorOpacityUUID> {
    static constexpr std::tuple fields{Field{"opacity", wholeValue}};
};

/// The display's scale factor.
struct ScaleFactorKind : StreamKind<std::int32_t, s_recordingScaleFactorUUID, StreamRole::Once> {
    static constexpr std::tuple fields{Field{"scaleFactor", wholeValue}};
};

/// Titles of slides.
struct SlideInfoTitleKind : StreamKind<std::string, s_slideTitlesUUID> {
    static constexpr std::tuple fields{Field{"title", textFromUTF8}};
};

/// Texts of slides.
struct SlideInfoTextKind : StreamKind<std::string, s_slideTextUUID> {
    static constexpr std::tuple fields{Field{"text", textFromUTF8}};
};

/// Comments to slides.
struct SlideInfoCommentKind : StreamKind<std::string, s_slideCommentUUID> {
    static constexpr std::tuple fields{Field{"comment", textFromUTF8}};
};

/// The title of the window on top.
struct TopmostWindowTitleKind : StreamKind<std::string, s_topmostWindowTitleUUID> {
    static constexpr std::tuple fields{Field{"title", textFromUTF8}};
};

/// The application in front.
struct TopmostAppNameKind : StreamKind<std::string, s_topmostAppNameUUID> {
    static constexpr std::tuple fields{Field{"name", textFromUTF8}};
};

/// Returns the image of an entry, or the text "nil" if the entry has no image or one that cannot be decoded.
ZULMETADATA_API EntryValue entryImage(const CursorImage& cursor);

/// What the cursor looked like.
struct CursorImageKind : StreamKind<CursorImage, s_cursorImageUUID> {
    static constexpr std::tuple fields{Field{"image", entryImage}, Field{"id", &CursorImage::uniqueId},
                                       Field{"hotspotOffsetX", &CursorImage::hotspotOffsetX},
                                       Field{"hotspotOffsetY", &CursorImage::hotspotOffsetY}};
};

/// Buttons and modifiers.
struct CursorActionKind : StreamKind<std::int32_t, s_cursorActionUUID, StreamRole::Event> {
    static constexpr std::tuple fields{Field{"action", HumanReadableActions::CursorActionToString},
                                       Field{"rawActionValue", wholeValue}};
};

/// Returns the "characterString" of an entry, from `HumanReadableActions::KeyboardActionCodeToString`.
inline std::string keyText(const KeyStroke& key) {
    return HumanReadableActions::KeyboardActionCodeToString(static_cast<std::int32_t>(key.characterCode));
}

/// Returns the "eventFlagsString" of an entry, from `HumanReadableActions::KeyboardModifiersToString`.
inline std::string keyModifiersText(const KeyStroke& key) {
    return HumanReadableActions::KeyboardModifiersToString(static_cast<std::int32_t>(key.eventFlagsCode));
}

/// Keys and modifiers.
struct KeyboardActionKind : StreamKind<KeyStroke, s_keyboardActionUUID, StreamRole::Event> {
    static constexpr std::tuple fields{
        Field{"characterCode", &KeyStroke::characterCode}, Field{"characterString", keyText},
        Field{"eventFlagsCode", &KeyStroke::eventFlagsCode}, Field{"eventFlagsString", keyModifiersText}};
};

/// Returns one of the texts of an entry. Throws `std::out_of_range` if the entry has fewer texts.
template <std::size_t Position>
std::string systemText(const std::list<std::string>& texts) {
    if (texts.size() <= Position)
        throw std::out_of_range("system data entry with fewer than four texts");
    return textFromLatin1(*std::next(texts.begin(), Position));
}

/// The machine.
struct SystemDataKind : StreamKind<std::list<std::string>, s_systemDataUUID, StreamRole::Once> {
    static constexpr std::tuple fields{Field{"processorCount", systemText<0>},
                                       Field{"activeProcessorCount", systemText<1>}, Field{"osVersion", systemText<2>},
                                       Field{"ram", systemText<3>}};
};

/// A list of kinds as a type, for code that is generated for each kind.
template <class... Kinds>
struct KindList {
    static constexpr std::size_t size = sizeof...(Kinds); ///< the number of kinds

    /// Whether the list has this kind.
    template <class Kind>
    static constexpr bool contains = (std::is_same_v<Kind, Kinds> || ...);

    /// Calls `visit.template operator()<Kind>()` for every kind.
    template <class Visit>
    static constexpr void forEach(Visit&& visit) {
        (visit.template operator()<Kinds>(), ...);
    }

    /// Calls `visitor.template operator()<Kind>()` for the kind with the identifier `type`. Returns false if the list
    /// does not have it.
    template <class Visit>
    static constexpr bool visit(const uuid& type, Visit&& visitor) {
        return ((Kinds::type == type ? (visitor.template operator()<Kinds>(), true) : false) || ...);
    }
};

/// All kinds that have a writer and a parser, in the order of the registry.
using RecordedKinds =
    KindList<CursorActionKind, CursorImageKind, CursorLocationKind, CursorOpacityKind, KeyboardActionKind,
             RecordingRegionKind, TopmostWindowKind, SlideInfoTitleKind, SlideInfoTextKind, SlideInfoCommentKind,
             ScaleFactorKind, SystemDataKind, ScrollActionKind, TopmostAppNameKind, TopmostWindowTitleKind,
             CPUUsageKind, HoverRectKind>;

} // namespace ZULMetaData
