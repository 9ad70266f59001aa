// Computes from the clicks where an editor should zoom in: from when to when, and into which area.
// auto_zoom RECORDING

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <algorithm>
#include <iostream>
#include <vector>

using namespace ZULMetaData;

namespace {

constexpr float s_before = 0.3F; // a zoom begins this many seconds before its click
constexpr float s_after = 1.0F;  // and ends this many seconds after it
constexpr int s_factor = 2;

struct Zoom {
    float from;
    float to;
    Rect area;
};

Rect regionOf(const FileLocation& recording) {
    const auto entries = RecordingRegionMetaDataParser(recording).read();
    if (entries->empty())
        return {0, 0, 1920, 1080};
    const EntryDictionary& entry = entries->back();
    return {entry.get<std::int32_t>("x"), entry.get<std::int32_t>("y"), entry.get<std::int32_t>("width"),
            entry.get<std::int32_t>("height")};
}

/// Returns the last position at or before `time`.
Point positionAt(float time, const EntryList& locations) {
    const auto after =
        std::upper_bound(locations.begin(), locations.end(), time, [](float asked, const EntryDictionary& entry) {
            return asked < entry.get<float>("timestamp");
        });
    if (after == locations.begin())
        return {};
    return {(after - 1)->get<std::int32_t>("x"), (after - 1)->get<std::int32_t>("y")};
}

/// Returns an area around `center` that lies inside the region.
Rect areaAround(const Point& center, const Rect& region) {
    const int width = region.width / s_factor;
    const int height = region.height / s_factor;
    return {std::clamp(center.x - width / 2, region.x, region.x + region.width - width),
            std::clamp(center.y - height / 2, region.y, region.y + region.height - height), width, height};
}

std::vector<Zoom> zoomsOf(const FileLocation& recording) {
    const Rect region = regionOf(recording);
    const auto locations = CursorLocationMetaDataParser(recording).read();
    const auto actions = CursorActionMetaDataParser(recording).read();
    std::vector<Zoom> zooms;
    for (const EntryDictionary& action : *actions) {
        if (!action.get<std::string>("action").starts_with("left down"))
            continue;
        const float time = action.get<float>("timestamp");
        const Rect area = areaAround(positionAt(time, *locations), region);
        if (!zooms.empty() && time - s_before <= zooms.back().to)
            zooms.back().to = time + s_after; // clicks that follow each other share one zoom
        else
            zooms.push_back({std::max(0.0F, time - s_before), time + s_after, area});
    }
    return zooms;
}

} // namespace

int main(int count, char** arguments) {
    if (count != 2) {
        std::cerr << "usage: auto_zoom RECORDING\n";
        return 2;
    }
    for (const Zoom& zoom : zoomsOf(arguments[1]))
        std::cout << zoom.from << " s to " << zoom.to << " s: " << zoom.area << '\n';
}
