#include "Tools/demo/Session.h"

#include "Tools/demo/Cursors.h"

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <iterator>

namespace ZULMetaData::Demo {

namespace {

const ScreenRect s_region(160, 90, 1280, 720);

using Values = std::initializer_list<std::pair<std::string, EntryValue>>;

void expect(Track& track, Values values, const MediaTime& time) {
    track.expected.emplace_back(values);
    track.expected.back().emplace_back("timestamp", static_cast<float>(time.seconds()));
}

template <class Parser>
Track newTrack(const std::string& kind, const FileLocation& folder) {
    return {kind, folder / (kind + ".dat"), {}, [](const FileLocation& movie) { return Parser(movie).read(); }};
}

MediaTime at(double seconds) {
    return {std::llround(seconds * s_timescale), s_timescale};
}

/// The session's times, `rate` to a second.
std::vector<MediaTime> every(int rate) {
    std::vector<MediaTime> times;
    times.reserve(static_cast<std::size_t>(rate) * s_duration);
    for (int i = 0; i < rate * s_duration; ++i)
        times.push_back(at(static_cast<double>(i) / rate));
    return times;
}

struct ButtonChange {
    double time;
    std::int32_t action;
    const char* text;
};

/// Each press is followed by its release. With shift something is dragged.
constexpr ButtonChange s_buttonChanges[]{{0, 256, "mouse init"},
                                         {1.5, 1, "left down"},
                                         {1.6, 2, "left up"},
                                         {4.2, 1 + 16, "left down + shift"},
                                         {4.9, 2 + 16, "left up + shift"},
                                         {8, 4, "right down"},
                                         {8.15, 8, "right up"},
                                         {11, 1 + 128, "left down + cmd"},
                                         {11.1, 2 + 128, "left up + cmd"},
                                         {14.4, 16, "middle down"},
                                         {14.5, 32, "middle up"},
                                         {18.3, 1, "left down"},
                                         {18.4, 2, "left up"}};

/// The hand stands still from shortly before a press until shortly after its release. It hurries before and afterwards,
/// so that it is late for nothing else.
double timeOfHand(double seconds) {
    constexpr double least = 0.5; // of what is dragged
    constexpr double still = 0.05;
    constexpr double hurry = 0.3;
    for (std::size_t i = 1; i + 1 < std::size(s_buttonChanges); i += 2) {
        const double press = s_buttonChanges[i].time;
        const double release = s_buttonChanges[i + 1].time;
        const double from = press - still - hurry;
        const double to = release + still + hurry;
        if (release - press > least || seconds <= from || seconds >= to)
            continue;
        if (seconds < press - still)
            return from + (seconds - from) * (press - from) / hurry;
        return seconds <= release + still ? press : to - (to - seconds) * (to - press) / hurry;
    }
    return seconds;
}

/// Wanders over the recorded region, and rests now and then.
ScreenPoint cursorAt(double seconds) {
    const double hand = timeOfHand(seconds);
    const double moving = hand - 0.35 * std::sin(2 * hand);
    return {s_region.x + s_region.width * (0.5 + 0.42 * std::sin(0.9 * moving)),
            s_region.y + s_region.height * (0.5 + 0.4 * std::sin(1.3 * moving + 0.6))};
}

std::int32_t whole(double coordinate) {
    return static_cast<std::int32_t>(coordinate);
}

void expectPoint(Track& track, const ScreenPoint& point, const MediaTime& time) {
    expect(track, {{"x", whole(point.x)}, {"y", whole(point.y)}}, time);
}

void expectRect(Track& track, const ScreenRect& rect, const MediaTime& time) {
    expect(track,
           {{"x", whole(rect.x)}, {"y", whole(rect.y)}, {"width", whole(rect.width)}, {"height", whole(rect.height)}},
           time);
}

Track recordCursorLocation(const FileLocation& folder) {
    Track track = newTrack<CursorLocationMetaDataParser>("cursorLocation", folder);
    CursorLocationMetaDataWriter writer(track.file);
    for (const MediaTime& time : every(60)) {
        const ScreenPoint location = cursorAt(time.seconds());
        writer.write(location, time);
        expectPoint(track, location, time);
    }
    writer.finish();
    return track;
}

Track recordHoverRect(const FileLocation& folder) {
    Track track = newTrack<HoverRectMetaDataParser>("hoverRect", folder);
    HoverRectMetaDataWriter writer(track.file);
    for (const MediaTime& time : every(15)) {
        const ScreenPoint cursor = cursorAt(time.seconds());
        const ScreenRect hovered(std::floor(cursor.x / 160) * 160 + 0.5, std::floor(cursor.y / 90) * 90, 160, 90);
        writer.write(hovered, time);
        expectRect(track, hovered, time);
    }
    writer.finish();
    return track;
}

Track recordScrollAction(const FileLocation& folder) {
    Track track = newTrack<ScrollActionMetaDataParser>("scrollAction", folder);
    ScrollActionMetaDataWriter writer(track.file);
    for (const MediaTime& time : every(8)) {
        const double phase = std::fmod(time.seconds(), 5);
        if (phase < 3.5)
            continue; // scrolling comes in bursts
        const ScreenPoint delta(0, -40 * (5 - phase));
        writer.write(delta, time);
        expectPoint(track, delta, time);
    }
    writer.finish();
    return track;
}

Track recordCPUUsage(const FileLocation& folder) {
    Track track = newTrack<CPUUsageMetaDataParser>("cpuUsage", folder);
    CPUUsageMetaDataWriter writer(track.file);
    for (const MediaTime& time : every(2)) {
        const auto usage = static_cast<float>(32 + 18 * std::sin(time.seconds() * 0.8));
        writer.write(usage, time);
        expect(track, {{"cpuUsage", usage}}, time);
    }
    writer.finish();
    return track;
}

Track recordCursorOpacity(const FileLocation& folder) {
    Track track = newTrack<CursorOpacityMetaDataParser>("cursorOpacity", folder);
    CursorOpacityMetaDataWriter writer(track.file);
    for (const auto& [seconds, opacity] : {std::pair(0.0, 1.0), {13.0, 0.6}, {13.2, 0.3}, {15.0, 0.7}, {15.2, 1.0}}) {
        writer.write(opacity, at(seconds));
        expect(track, {{"opacity", static_cast<float>(opacity)}}, at(seconds));
    }
    writer.finish();
    return track;
}

struct Scene {
    double from;
    const char* application;
    const char* windowTitle;
    ScreenRect window;
};

const std::vector<Scene> s_scenes{
    {0, "Editor", "main.cpp — Bérénice", {200, 120, 900, 600}},
    {6.5, "Terminal", "make test — 80×24", {520, 300, 760, 460}},
    {12, "Slides", "Rückblick 2026", {160, 90, 1280, 720}},
    {17.25, "Editor", "README.md", {200, 120, 900, 600}},
};

Track recordTopmostWindow(const FileLocation& folder) {
    Track track = newTrack<TopmostWindowMetaDataParser>("topmostWindow", folder);
    TopmostWindowMetaDataWriter writer(track.file);
    for (const Scene& scene : s_scenes) {
        writer.write(scene.window, at(scene.from));
        expectRect(track, scene.window, at(scene.from));
    }
    writer.finish();
    return track;
}

struct TimedText {
    double time;
    const char* text;
};

template <class Writer, class Parser>
Track recordTexts(const std::string& kind, const std::string& key, const std::vector<TimedText>& texts,
                  const FileLocation& folder) {
    Track track = newTrack<Parser>(kind, folder);
    Writer writer(track.file);
    for (const TimedText& text : texts) {
        writer.write(text.text, at(text.time));
        expect(track, {{key, text.text}}, at(text.time));
    }
    writer.finish();
    return track;
}

std::vector<TimedText> sceneTexts(const char* Scene::*text) {
    std::vector<TimedText> texts;
    texts.reserve(s_scenes.size());
    for (const Scene& scene : s_scenes)
        texts.push_back({scene.from, scene.*text});
    return texts;
}

const std::vector<TimedText> s_slideTitles{{12, "Rückblick"}, {13.5, "Zahlen"}, {15.5, "Ausblick: 展望"}};
const std::vector<TimedText> s_slideTexts{{12, "Was war"}, {13.5, "41 % mehr, 12 % schneller"}, {15.5, "Was kommt"}};
const std::vector<TimedText> s_slideComments{{12, ""}, {13.5, "Quelle nennen!"}, {15.5, "Fragen sammeln 🙂"}};

Track recordRecordingRegion(const FileLocation& folder) {
    Track track = newTrack<RecordingRegionMetaDataParser>("recordingRegion", folder);
    RecordingRegionMetaDataWriter(track.file).writeAndFinalize(s_region);
    expectRect(track, s_region, at(0));
    return track;
}

Track recordScaleFactor(const FileLocation& folder) {
    Track track = newTrack<ScaleFactorMetaDataParser>("recordingScaleFactor", folder);
    ScaleFactorMetaDataWriter(track.file).writeAndFinalize(1);
    expect(track, {{"scaleFactor", 1}}, at(0));
    return track;
}

Track recordSystemData(const FileLocation& folder) {
    Track track = newTrack<SystemDataMetaDataParser>("systemData", folder);
    SystemDataMetaDataWriter(track.file).write();
    const ProcessInfo machine = ProcessInfo::current();
    expect(track,
           {{"processorCount", "ProcessorCount:" + std::to_string(machine.processorCount)},
            {"activeProcessorCount", "ActiveProcessorCount:" + std::to_string(machine.activeProcessorCount)},
            {"osVersion", "OSVersion:" + machine.operatingSystemVersionString},
            {"ram", "RAM:" + std::to_string(machine.physicalMemory >> 20) + "MB"}},
           at(0));
    return track;
}

Track recordCursorAction(const FileLocation& folder) {
    Track track = newTrack<CursorActionMetaDataParser>("cursorAction", folder);
    CursorActionMetaDataWriter writer(track.file);
    for (const ButtonChange& click : s_buttonChanges) {
        writer.write(click.action, at(click.time));
        expect(track, {{"action", click.text}, {"rawActionValue", click.action}}, at(click.time));
    }
    writer.finish();
    return track;
}

struct Key {
    double time;
    std::uint32_t code;
    std::uint32_t flags;
    const char* text;
    const char* modifiers;
};

Track recordKeyboardAction(const FileLocation& folder) {
    static constexpr Key keys[]{{2.0, 'H', 0x20000, "H", "<Shift>"},
                                {2.2, 'A', 0, "A", "NONE"},
                                {2.4, 'L', 0, "L", "NONE"},
                                {2.6, 'L', 0, "L", "NONE"},
                                {2.8, 'O', 0, "O", "NONE"},
                                {3.0, 13, 0, "returnKey", "NONE"},
                                {5.5, 'S', 0x100000, "S", "<Cmd>"},
                                {7.0, 38, 0x40000000, "up", "(IsVK)"},
                                {7.3, 13, 0, "returnKey", "NONE"},
                                {12.8, 39, 0x40000000, "right", "(IsVK)"},
                                {15.2, 39, 0x40000000, "right", "(IsVK)"},
                                {19.0, 'Q', 0x120000, "Q", "<Shift><Cmd>"}};
    Track track = newTrack<KeyboardActionMetaDataParser>("keyboardAction", folder);
    KeyboardActionMetaDataWriter writer(track.file);
    for (const Key& key : keys) {
        writer.writeCharacterCode(key.code, key.flags, at(key.time));
        expect(track,
               {{"characterCode", static_cast<std::int32_t>(key.code)},
                {"characterString", key.text},
                {"eventFlagsCode", static_cast<std::int32_t>(key.flags)},
                {"eventFlagsString", key.modifiers}},
               at(key.time));
    }
    writer.finish();
    return track;
}

void expectCursor(Track& track, EntryValue image, std::int64_t uid, Point hotSpot, const MediaTime& time) {
    expect(track,
           {{"image", std::move(image)}, {"id", uid}, {"hotspotOffsetX", hotSpot.x}, {"hotspotOffsetY", hotSpot.y}},
           time);
}

/// Every cursor with its image first, then by its number alone.
Track recordCursorImage(const FileLocation& folder) {
    Track track = newTrack<CursorImageMetaDataParser>("cursorImage", folder);
    CursorImageMetaDataWriter writer(track.file);
    double time = 0;
    for (const int scale : {1, 2})
        for (const Cursor& cursor : drawnCursors(scale)) {
            writer.writeCursorImage(*cursor.image, cursor.uid, cursor.typeId, 3, cursor.hotSpot, at(time));
            expectCursor(track, cursor.image, cursor.uid, {whole(cursor.hotSpot.x), whole(cursor.hotSpot.y)}, at(time));
            time += 1.5;
        }
    for (const std::int64_t uid : {11, 12, 11, 13, 21, 22, 23, 11}) {
        writer.writeCursorWithExistingUID(uid, at(time));
        expectCursor(track, "nil", uid, {0, 0}, at(time));
        time += 1.25;
    }
    writer.finish();
    return track;
}

} // namespace

std::vector<Track> recordSession(const FileLocation& folder) {
    return {
        recordCursorAction(folder),
        recordCursorImage(folder),
        recordCursorLocation(folder),
        recordCursorOpacity(folder),
        recordKeyboardAction(folder),
        recordRecordingRegion(folder),
        recordTopmostWindow(folder),
        recordTexts<SlideInfoTitleMetaDataWriter, SlideInfoTitleMetaDataParser>("slideTitles", "title", s_slideTitles,
                                                                                folder),
        recordTexts<SlideInfoTextMetaDataWriter, SlideInfoTextMetaDataParser>("slideText", "text", s_slideTexts,
                                                                              folder),
        recordTexts<SlideInfoCommentMetaDataWriter, SlideInfoCommentMetaDataParser>("slideComment", "comment",
                                                                                    s_slideComments, folder),
        recordScaleFactor(folder),
        recordSystemData(folder),
        recordScrollAction(folder),
        recordTexts<TopmostAppNameMetaDataWriter, TopmostAppNameMetaDataParser>(
            "topmostAppName", "name", sceneTexts(&Scene::application), folder),
        recordTexts<TopmostWindowTitleMetaDataWriter, TopmostWindowTitleMetaDataParser>(
            "topmostWindowTitle", "title", sceneTexts(&Scene::windowTitle), folder),
        recordCPUUsage(folder),
        recordHoverRect(folder),
    };
}

} // namespace ZULMetaData::Demo
