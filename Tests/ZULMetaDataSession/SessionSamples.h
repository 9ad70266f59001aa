#pragma once

// What a track holds of the streams in KindSamples.h, as text, and recordings in memory.

#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "ZULMetaDataSession/Recording.h"

#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

// ---- Values as text -------------------------------------------------------------------------------------------

inline std::string shown(Modifiers modifiers) {
    std::string text;
    for (const Modifier modifier : s_modifiers)
        if (modifiers.contains(modifier))
            text += '+' + std::string(nameOf(modifier));
    return text;
}

inline std::string shown(const ButtonAction& action) {
    if (!action.button)
        return "none " + std::to_string(action.stored);
    return std::string(nameOf(*action.button)) + (action.isPress ? " down" : " up") + shown(action.modifiers);
}

inline std::string shown(const KeyInput& key) {
    return (key.isVirtualKey ? "key " : "character ") + std::to_string(key.code) + shown(key.modifiers);
}

inline std::string shown(const CursorAppearance& cursor) {
    std::ostringstream text;
    text << cursor.id << " flags " << cursor.flags << (cursor.hasOwnPicture ? " own" : "");
    if (cursor.picture)
        text << " picture of " << cursor.picture->bytes.size() << " bytes " << cursor.picture->hotSpot << ' '
             << cursor.picture->systemCursor;
    return text.str();
}

inline std::string shown(const SystemData& machine) {
    return machine.processorCount + '|' + machine.activeProcessorCount + '|' + machine.osVersion + '|' + machine.ram;
}

template <class Value>
std::string shown(const Value& value) {
    std::ostringstream text;
    text << value;
    return text.str();
}

inline std::string shown(double time, const std::string& value) {
    return shown(time) + ": " + value;
}

template <class Kind>
std::vector<std::string> shown(const Track<Kind>& track) {
    std::vector<std::string> entries;
    for (std::size_t i = 0; i < track.size(); ++i)
        entries.push_back(shown(track.times()[i], shown(track.values()[i])));
    return entries;
}

// ---- What the samples are in a track --------------------------------------------------------------------------

/// The entries of `goldenStream<S>()`.
template <class S>
struct InTrack;

template <>
struct InTrack<CursorActionSamples> {
    static constexpr auto entries = {"0.25: left down+shift+cmd", "1.5: none 256", "2.5: none -256"};
};
template <>
struct InTrack<CursorImageSamples> {
    static constexpr auto entries = {"0.25: 7 flags 1 own picture of 77 bytes (3,-2) 5",
                                     "1.5: 7 flags 3 picture of 77 bytes (3,-2) 5"};
};
template <>
struct InTrack<CursorLocationSamples> {
    static constexpr auto entries = {"0.25: (10,-3)", "0.5: (1279,719)", "0.5: (1279,719)"};
};
template <>
struct InTrack<CursorOpacitySamples> {
    static constexpr auto entries = {"0.25: 0.1", "1.5: 1"};
};
template <>
struct InTrack<KeyboardActionSamples> {
    static constexpr auto entries = {"0.25: character 65+shift+cmd", "0.5: character 13+win",
                                     "1.5: character 4294967268"};
};
template <>
struct InTrack<RecordingRegionSamples> {
    static constexpr auto entries = {"0: (-1280,0,2560,1440)"};
};
template <>
struct InTrack<TopmostWindowSamples> {
    static constexpr auto entries = {"0.0333667: (-1,0,1920,1080)", "0.25: (10,-3,100,50)"}; // ordered by time
};
template <>
struct InTrack<SlideInfoTitleSamples> {
    static constexpr auto entries = {"0.25: Intro", "0.5: ", "1.5: Q&A"};
};
template <>
struct InTrack<SlideInfoTextSamples> {
    static constexpr auto entries = {"0.25: a\nb", "0.5: Goals"};
};
template <>
struct InTrack<SlideInfoCommentSamples> {
    static constexpr auto entries = {"0.25: slow down", "1.5: ok"};
};
template <>
struct InTrack<ScaleFactorSamples> {
    static constexpr auto entries = {"0: 2"};
};
template <>
struct InTrack<SystemDataSamples> {
    static constexpr auto entries = {"0: ProcessorCount:8|ActiveProcessorCount:6|OSVersion:Version 14.2|RAM:16384MB"};
};
template <>
struct InTrack<ScrollActionSamples> {
    static constexpr auto entries = {"1.5: (0,-12)", "2.5: (2147483647,-2147483648)"};
};
template <>
struct InTrack<TopmostAppNameSamples> {
    static constexpr auto entries = {"0.25: Editor", "1.5: Game"};
};
template <>
struct InTrack<TopmostWindowTitleSamples> {
    static constexpr auto entries = {"0.25: Inbox (3)", "1.5: x"};
};
template <>
struct InTrack<CPUUsageSamples> {
    static constexpr auto entries = {"0.25: 0.1", "1.5: 99.5"};
};
template <>
struct InTrack<HoverRectSamples> {
    static constexpr auto entries = {"0.25: (5,6,7,8)", "1.5: (-5,-6,0,0)"};
};

template <class S>
std::vector<std::string> entriesInTrack() {
    return {InTrack<S>::entries.begin(), InTrack<S>::entries.end()};
}

/// Every kind as the types of a typed suite.
template <class Tuple>
struct TestedTypes;
template <class... Samples>
struct TestedTypes<std::tuple<Samples...>> {
    using Type = testing::Types<Samples...>;
};
using TestedKinds = TestedTypes<EveryKind>::Type;

// ---- Recordings -----------------------------------------------------------------------------------------------

/// A movie of these streams, each of which may be damaged.
inline std::string movieOf(const std::vector<std::string>& streams) {
    return media() + zulmAtom(streams);
}

/// A movie with a stream of every kind.
inline std::string movieOfEveryKind() {
    std::vector<std::string> streams;
    std::apply([&streams]<class... S>(S...) { (streams.push_back(goldenStream<S>()), ...); }, EveryKind());
    return movieOf(streams);
}

/// A recording of bytes in memory, which it keeps.
class MemoryRecording {
public:
    explicit MemoryRecording(std::string bytes, const std::string& name = "Recording.mp4")
        : bytes_(std::make_unique<std::string>(std::move(bytes))), recording_(ByteSource::memory(*bytes_), name) {}

    const Recording& operator*() const { return recording_; }
    const Recording* operator->() const { return &recording_; }

private:
    std::unique_ptr<std::string> bytes_;
    Recording recording_;
};

} // namespace ZULMetaData::Test
