// Puts a recording of one hour into a movie: RATE cursor positions a second, 200 cursor images, 20,000 keys.
// Usage: long_recording MOVIE FOLDER RATE; the stream files are left in FOLDER.

#include "Tools/demo/Cursors.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <vector>

namespace {

using namespace ZULMetaData;

constexpr int s_duration = 3600;
constexpr std::int32_t s_timescale = 6000;
constexpr int s_images = 200;
constexpr int s_keys = 20000;

MediaTime at(double seconds) {
    return {std::llround(seconds * s_timescale), s_timescale};
}

/// Rests for a third of every 15 seconds.
ScreenPoint cursorAt(double seconds) {
    const double part = std::fmod(seconds, 15);
    const double moving = seconds - part + std::min(part, 10.0);
    return {960 + 900 * std::sin(0.7 * moving + std::sin(0.13 * moving)), 540 + 480 * std::sin(1.1 * moving)};
}

void recordPositions(const FileLocation& locations, int rate) {
    CursorLocationMetaDataWriter writer(locations);
    for (int i = 0; i < rate * s_duration; ++i) {
        const double time = static_cast<double>(i) / rate;
        writer.write(cursorAt(time), at(time));
    }
    writer.finish();
}

void recordCursor(const FileLocation& actions, const FileLocation& images) {
    CursorActionMetaDataWriter actionWriter(actions);
    for (double time = 2; time < s_duration - 1; time += 3.7) {
        actionWriter.write(std::fmod(time, 5) < 1 ? 4 : 1, at(time));
        actionWriter.write(std::fmod(time, 5) < 1 ? 8 : 2, at(time + 0.1));
    }
    actionWriter.finish();
    CursorImageMetaDataWriter imageWriter(images);
    const auto cursors = Demo::drawnCursors(1);
    for (int i = 0; i < s_duration / 3; ++i) {
        const Demo::Cursor& cursor = cursors[static_cast<std::size_t>(i) % cursors.size()];
        if (i < s_images)
            imageWriter.writeCursorImage(*cursor.image, i, cursor.typeId, 3, cursor.hotSpot, at(3.0 * i));
        else
            imageWriter.writeCursorWithExistingUID(i * 7 % s_images, at(3.0 * i));
    }
    imageWriter.finish();
}

void recordKeys(const FileLocation& file) {
    KeyboardActionMetaDataWriter writer(file);
    for (std::uint32_t i = 0; i < s_keys; ++i) {
        const double burst = i / 100 * 18.0; // a hundred keys, then a rest
        writer.writeCharacterCode(i % 6 == 5 ? 32 : 'A' + i * 7 % 26, 0x40000000, at(1 + burst + i % 100 * 0.11));
    }
    writer.finish();
}

void recordScrolling(const FileLocation& scrolls, const FileLocation& hovers) {
    ScrollActionMetaDataWriter scrollWriter(scrolls);
    HoverRectMetaDataWriter hoverWriter(hovers);
    for (int i = 0; i < 10 * s_duration; ++i) {
        const double time = i / 10.0;
        const ScreenPoint cursor = cursorAt(time);
        hoverWriter.write({std::floor(cursor.x / 160) * 160, std::floor(cursor.y / 90) * 90, 160, 90}, at(time));
        if (std::fmod(time, 20) > 17)
            scrollWriter.write({0, -20 * (20 - std::fmod(time, 20))}, at(time));
    }
    scrollWriter.finish();
    hoverWriter.finish();
}

void recordWindows(const FileLocation& windows, const FileLocation& names, const FileLocation& titles) {
    TopmostWindowMetaDataWriter windowWriter(windows);
    TopmostAppNameMetaDataWriter nameWriter(names);
    TopmostWindowTitleMetaDataWriter titleWriter(titles);
    const std::vector<const char*> applications{"Editor", "Terminal", "Browser", "Mail"};
    for (int i = 0; i < s_duration / 24; ++i) {
        const MediaTime time = at(24.0 * i);
        windowWriter.write({80.0 + i % 4 * 60, 60.0 + i % 3 * 50, 1300, 860}, time);
        nameWriter.write(applications[static_cast<std::size_t>(i * 3) % applications.size()], time);
        titleWriter.write(("Window " + std::to_string(i % 9)).c_str(), time);
    }
    windowWriter.finish();
    nameWriter.finish();
    titleWriter.finish();
}

void recordMachine(const FileLocation& usages, const FileLocation& opacities, const FileLocation& slides) {
    CPUUsageMetaDataWriter usageWriter(usages);
    for (int i = 0; i < 2 * s_duration; ++i)
        usageWriter.write(static_cast<float>(35 + 20 * std::sin(i * 0.02) + 12 * std::sin(i * 1.7)), at(i / 2.0));
    usageWriter.finish();
    CursorOpacityMetaDataWriter opacityWriter(opacities);
    for (int i = 0; i < s_duration / 300; ++i) {
        opacityWriter.write(1, at(300.0 * i));
        opacityWriter.write(0.4, at(300.0 * i + 280));
    }
    opacityWriter.finish();
    SlideInfoTitleMetaDataWriter slideWriter(slides);
    for (int i = 0; i < s_duration / 150; ++i)
        slideWriter.write(("Slide " + std::to_string(i + 1)).c_str(), at(150.0 * i));
    slideWriter.finish();
}

void record(const FileLocation& movie, const FileLocation& folder, int rate) {
    std::vector<FileLocation> files;
    const auto file = [&](const char* name) { return files.emplace_back(folder / (std::string(name) + ".dat")); };
    recordPositions(file("cursorLocation"), rate);
    recordCursor(file("cursorAction"), file("cursorImage"));
    recordKeys(file("keyboardAction"));
    recordScrolling(file("scrollAction"), file("hoverRect"));
    recordWindows(file("topmostWindow"), file("topmostAppName"), file("topmostWindowTitle"));
    recordMachine(file("cpuUsage"), file("cursorOpacity"), file("slideTitles"));
    RecordingRegionMetaDataWriter(file("recordingRegion")).writeAndFinalize(ScreenRect(0, 0, 1920, 1080));
    ScaleFactorMetaDataWriter(file("recordingScaleFactor")).writeAndFinalize(1);
    ZULMAtomWriter().writeMetaDataFiles(files, movie);
}

} // namespace

int main(int count, char** arguments) {
    const int rate = count == 4 ? std::atoi(arguments[3]) : 0;
    if (rate <= 0) {
        std::cerr << "usage: long_recording MOVIE FOLDER RATE\n";
        return 1;
    }
    std::filesystem::create_directories(arguments[2]);
    record(arguments[1], arguments[2], rate);
    return 0;
}
