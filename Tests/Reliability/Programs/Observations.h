#pragma once

// What the programs of this folder record: of every kind, an observation that its number determines, so that whoever
// reads it back knows what it must be.

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <list>
#include <stdexcept>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

namespace ZULMetaData::Reliability {

template <class K, class W>
struct Recorded {
    using Kind = K;
    using Writer = W;
};

/// The classes that record, in the order of `RecordedKinds`.
using AllRecorded = std::tuple<
    Recorded<CursorActionKind, CursorActionMetaDataWriter>, Recorded<CursorImageKind, CursorImageMetaDataWriter>,
    Recorded<CursorLocationKind, CursorLocationMetaDataWriter>,
    Recorded<CursorOpacityKind, CursorOpacityMetaDataWriter>,
    Recorded<KeyboardActionKind, KeyboardActionMetaDataWriter>,
    Recorded<RecordingRegionKind, RecordingRegionMetaDataWriter>,
    Recorded<TopmostWindowKind, TopmostWindowMetaDataWriter>,
    Recorded<SlideInfoTitleKind, SlideInfoTitleMetaDataWriter>,
    Recorded<SlideInfoTextKind, SlideInfoTextMetaDataWriter>,
    Recorded<SlideInfoCommentKind, SlideInfoCommentMetaDataWriter>,
    Recorded<ScaleFactorKind, ScaleFactorMetaDataWriter>, Recorded<SystemDataKind, SystemDataMetaDataWriter>,
    Recorded<ScrollActionKind, ScrollActionMetaDataWriter>, Recorded<TopmostAppNameKind, TopmostAppNameMetaDataWriter>,
    Recorded<TopmostWindowTitleKind, TopmostWindowTitleMetaDataWriter>, Recorded<CPUUsageKind, CPUUsageMetaDataWriter>,
    Recorded<HoverRectKind, HoverRectMetaDataWriter>>;
static_assert(std::tuple_size_v<AllRecorded> == RecordedKinds::size);

/// Calls `visit.template operator()<Recorded<Kind, Writer>>()` for every kind.
template <class Visit>
void forEachRecorded(Visit visit) {
    [&]<class... R>(std::tuple<R...>*) { (visit.template operator()<R>(), ...); }(static_cast<AllRecorded*>(nullptr));
}

/// What the stream of a kind is called: its name in the registry, with ".dat".
template <class R>
std::string fileName() {
    return std::string(findMetaDataKind(R::Kind::type)->name) + ".dat";
}

inline MediaTime timeOf(std::uint32_t number) {
    return {number, 600};
}

inline std::string textOf(std::uint32_t number) {
    return std::string(number * 37 % 300, static_cast<char>('a' + number % 26)) + std::to_string(number);
}

/// Images from one pixel to some 12 KiB, which do not compress.
inline const std::vector<std::vector<std::uint8_t>>& encodedImages() {
    static const auto images = [] {
        std::vector<std::vector<std::uint8_t>> encoded;
        std::uint32_t noise = 1;
        for (const std::uint32_t side : {1U, 9U, 24U, 40U, 56U}) {
            std::vector<std::uint8_t> pixels(std::size_t(4) * side * side);
            for (std::uint8_t& byte : pixels)
                byte = static_cast<std::uint8_t>((noise = noise * 1664525 + 1013904223) >> 24);
            const Image image(side, side, std::move(pixels));
            encoded.push_back(BitmapImageRep::fromTIFF(image.tiffRepresentation())->pngRepresentation());
        }
        return encoded;
    }();
    return images;
}

/// Every third one brings an image along.
inline CursorImage cursorOf(std::uint32_t number) {
    CursorImage cursor;
    cursor.uniqueId = number;
    if (number % 3 == 0) {
        const auto& image = encodedImages()[number / 3 % encodedImages().size()];
        cursor.imageDataSize = static_cast<std::uint32_t>(image.size());
        cursor.imageData = static_cast<unsigned char*>(std::malloc(image.size()));
        std::memcpy(cursor.imageData, image.data(), image.size());
        cursor.hotspotOffsetX = static_cast<std::int32_t>(number);
    }
    return cursor;
}

template <class Kind>
typename Kind::Value valueOf(std::uint32_t number) {
    using Value = typename Kind::Value;
    const auto n = static_cast<std::int32_t>(number);
    if constexpr (std::same_as<Value, Point>)
        return {n, -n};
    else if constexpr (std::same_as<Value, Rect>)
        return {n, -n, n + 1, n + 2};
    else if constexpr (std::same_as<Value, KeyStroke>)
        return {number, ~number};
    else if constexpr (std::same_as<Value, std::string>)
        return textOf(number);
    else if constexpr (std::same_as<Value, CursorImage>)
        return cursorOf(number);
    else if constexpr (std::same_as<Value, std::list<std::string>>)
        return SystemDataMetaDataWriter::systemTexts(ProcessInfo::current());
    else
        return static_cast<Value>(n);
}

/// Records observation `number` through the interface that an application uses.
template <class R>
void record(typename R::Writer& writer, std::uint32_t number) {
    using Value = typename R::Kind::Value;
    auto value = valueOf<typename R::Kind>(number);
    const MediaTime time = timeOf(number);
    if constexpr (std::same_as<Value, Point>)
        writer.write(ScreenPoint(value.x, value.y), time);
    else if constexpr (std::same_as<Value, KeyStroke>)
        writer.writeCharacterCode(value.characterCode, value.eventFlagsCode, time);
    else if constexpr (std::same_as<Value, std::string>)
        writer.write(value.c_str(), time);
    else if constexpr (std::same_as<Value, std::list<std::string>>)
        writer.write();
    else if constexpr (std::same_as<Value, Rect>) {
        const ScreenRect rect(value.x, value.y, value.width, value.height);
        if constexpr (requires { writer.writeAndFinalize(rect); })
            writer.writeAndFinalize(rect);
        else
            writer.write(rect, time);
    } else if constexpr (std::same_as<Value, CursorImage>) {
        unsigned char* image = value.imageData;
        writer.writeCursorImage(value, time.seconds()); // gives the image bytes back
        std::free(image);
    } else if constexpr (requires { writer.writeAndFinalize(value); })
        writer.writeAndFinalize(value);
    else
        writer.write(value, time);
}

/// Whether a writer closes its file with its first entry.
template <class R>
constexpr bool isOneShot() {
    return requires(typename R::Writer & writer) {
        writer.hasWritten();
    };
}

/// How many entries from the first on are what was recorded, in the stream file `path` or in a movie.
template <class R>
std::uint32_t rightEntries(const std::string& path) {
    MetaDataObserver<typename R::Kind::Value> read;
    try {
        if (const auto parser = MetaDataParser::create(path))
            parser->loadDataType(R::Kind::type, read, R::Kind::version);
    } catch (const std::runtime_error&) { // the last entry is torn
    }
    std::uint32_t number = 0;
    const auto isRight = [&](std::uint32_t n) {
        const bool hasTime = !std::same_as<typename R::Kind::Value, std::list<std::string>> && !isOneShot<R>();
        return read.values[n] == valueOf<typename R::Kind>(n) && read.times[n] == (hasTime ? timeOf(n).seconds() : 0);
    };
    while (number < read.values.size() && isRight(number))
        ++number;
    return number;
}

} // namespace ZULMetaData::Reliability
