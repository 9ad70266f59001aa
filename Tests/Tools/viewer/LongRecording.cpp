// Puts a recording into a movie: RATE cursor positions a second, 200 cursor images, KEYS keys, TITLES titles of
// windows. Usage: long_recording MOVIE FOLDER RATE [HOURS KEYS TITLES]; without them it is an hour with 20,000 keys and
// a title every 24 seconds. The stream files are left in FOLDER.

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

constexpr int s_hour = 3600;
constexpr std::int32_t s_timescale = 6000;
constexpr int s_images = 200;

struct Amounts {
    int rate = 0; // positions a second
    int hours = 1;
    int keys = 20000;
    int titles = s_hour / 24;

    int duration() const { return hours * s_hour; }
};

MediaTime at(double seconds) {
    return {std::llround(seconds * s_timescale), s_timescale};
}

/// Rests for a third of every 15 seconds.
ScreenPoint cursorAt(double seconds) {
    const double part = std::fmod(seconds, 15);
    const double moving = seconds - part + std::min(part, 10.0);
    return {960 + 900 * std::sin(0.7 * moving + std::sin(0.13 * moving)), 540 + 480 * std::sin(1.1 * moving)};
}

void recordPositions(const FileLocation& locations, const Amounts& amounts) {
    CursorLocationMetaDataWriter writer(locations);
    for (int i = 0; i < amounts.rate * amounts.duration(); ++i) {
        const double time = static_cast<double>(i) / amounts.rate;
        writer.write(cursorAt(time), at(time));
    }
    writer.finish();
}

void recordCursor(const FileLocation& actions, const FileLocation& images, int duration) {
    CursorActionMetaDataWriter actionWriter(actions);
    for (double time = 2; time < duration - 1; time += 3.7) {
        actionWriter.write(std::fmod(time, 5) < 1 ? 4 : 1, at(time));
        actionWriter.write(std::fmod(time, 5) < 1 ? 8 : 2, at(time + 0.1));
    }
    actionWriter.finish();
    CursorImageMetaDataWriter imageWriter(images);
    const auto cursors = Demo::drawnCursors(1);
    for (int i = 0; i < duration / 3; ++i) {
        const Demo::Cursor& cursor = cursors[static_cast<std::size_t>(i) % cursors.size()];
        if (i < s_images)
            imageWriter.writeCursorImage(*cursor.image, i, cursor.typeId, 3, cursor.hotSpot, at(3.0 * i));
        else
            imageWriter.writeCursorWithExistingUID(i * 7 % s_images, at(3.0 * i));
    }
    imageWriter.finish();
}

void recordKeys(const FileLocation& file, int keys) {
    KeyboardActionMetaDataWriter writer(file);
    for (std::uint32_t i = 0; i < static_cast<std::uint32_t>(keys); ++i) {
        const double burst = i / 100 * 18.0; // a hundred keys, then a rest
        writer.writeCharacterCode(i % 6 == 5 ? 32 : 'A' + i * 7 % 26, 0x40000000, at(1 + burst + i % 100 * 0.11));
    }
    writer.finish();
}

void recordScrolling(const FileLocation& scrolls, const FileLocation& hovers, int duration) {
    ScrollActionMetaDataWriter scrollWriter(scrolls);
    HoverRectMetaDataWriter hoverWriter(hovers);
    for (int i = 0; i < 10 * duration; ++i) {
        const double time = i / 10.0;
        const ScreenPoint cursor = cursorAt(time);
        hoverWriter.write({std::floor(cursor.x / 160) * 160, std::floor(cursor.y / 90) * 90, 160, 90}, at(time));
        if (std::fmod(time, 20) > 17)
            scrollWriter.write({0, -20 * (20 - std::fmod(time, 20))}, at(time));
    }
    scrollWriter.finish();
    hoverWriter.finish();
}

void recordWindows(const FileLocation& windows, const FileLocation& names, const FileLocation& titles,
                   const Amounts& amounts) {
    TopmostWindowMetaDataWriter windowWriter(windows);
    TopmostAppNameMetaDataWriter nameWriter(names);
    TopmostWindowTitleMetaDataWriter titleWriter(titles);
    const std::vector<const char*> applications{"Editor", "Terminal", "Browser", "Mail"};
    for (int i = 0; i < amounts.titles; ++i) {
        const MediaTime time = at(static_cast<double>(amounts.duration()) / amounts.titles * i);
        windowWriter.write({80.0 + i % 4 * 60, 60.0 + i % 3 * 50, 1300, 860}, time);
        nameWriter.write(applications[static_cast<std::size_t>(i * 3) % applications.size()], time);
        titleWriter.write(("Window " + std::to_string(i % 9)).c_str(), time);
    }
    windowWriter.finish();
    nameWriter.finish();
    titleWriter.finish();
}

void recordMachine(const FileLocation& usages, const FileLocation& opacities, const FileLocation& slides,
                   int duration) {
    CPUUsageMetaDataWriter usageWriter(usages);
    for (int i = 0; i < 2 * duration; ++i)
        usageWriter.write(static_cast<float>(35 + 20 * std::sin(i * 0.02) + 12 * std::sin(i * 1.7)), at(i / 2.0));
    usageWriter.finish();
    CursorOpacityMetaDataWriter opacityWriter(opacities);
    for (int i = 0; i < duration / 300; ++i) {
        opacityWriter.write(1, at(300.0 * i));
        opacityWriter.write(0.4, at(300.0 * i + 280));
    }
    opacityWriter.finish();
    SlideInfoTitleMetaDataWriter slideWriter(slides);
    for (int i = 0; i < duration / 150; ++i)
        slideWriter.write(("Slide " + std::to_string(i + 1)).c_str(), at(150.0 * i));
    slideWriter.finish();
}

void record(const FileLocation& movie, const FileLocation& folder, const Amounts& amounts) {
    std::vector<FileLocation> files;
    const auto file = [&](const char* name) { return files.emplace_back(folder / (std::string(name) + ".dat")); };
    recordPositions(file("cursorLocation"), amounts);
    recordCursor(file("cursorAction"), file("cursorImage"), amounts.duration());
    recordKeys(file("keyboardAction"), amounts.keys);
    recordScrolling(file("scrollAction"), file("hoverRect"), amounts.duration());
    recordWindows(file("topmostWindow"), file("topmostAppName"), file("topmostWindowTitle"), amounts);
    recordMachine(file("cpuUsage"), file("cursorOpacity"), file("slideTitles"), amounts.duration());
    RecordingRegionMetaDataWriter(file("recordingRegion")).writeAndFinalize(ScreenRect(0, 0, 1920, 1080));
    ScaleFactorMetaDataWriter(file("recordingScaleFactor")).writeAndFinalize(1);
    ZULMAtomWriter().writeMetaDataFiles(files, movie);
}

} // namespace

int main(int count, char** arguments) {
    Amounts amounts;
    if (count == 4 || count == 7)
        amounts.rate = std::atoi(arguments[3]);
    if (count == 7) {
        amounts.hours = std::atoi(arguments[4]);
        amounts.keys = std::atoi(arguments[5]);
        amounts.titles = std::atoi(arguments[6]);
    }
    if (amounts.rate <= 0 || amounts.hours <= 0 || amounts.titles <= 0) {
        std::cerr << "usage: long_recording MOVIE FOLDER RATE [HOURS KEYS TITLES]\n";
        return 1;
    }
    std::filesystem::create_directories(arguments[2]);
    record(arguments[1], arguments[2], amounts);
    return 0;
}
