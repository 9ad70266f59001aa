#pragma once

// Tracks that a test makes by hand.

#include "ZULMetaDataSession/Track.h"

#include <cstdint>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

template <class Kind>
using TrackEntries = std::vector<std::pair<double, typename Track<Kind>::Value>>;

template <class Kind>
Track<Kind> trackOf(const TrackEntries<Kind>& entries) {
    std::vector<double> times;
    std::vector<typename Track<Kind>::Value> values;
    for (const auto& [time, value] : entries) {
        times.push_back(time);
        values.push_back(value);
    }
    return Track<Kind>(std::move(times), std::move(values));
}

inline Track<CursorLocationKind> positions(const TrackEntries<CursorLocationKind>& entries) {
    return trackOf<CursorLocationKind>(entries);
}

/// Numbers as they are stored.
inline Track<CursorActionKind> actions(const std::vector<std::pair<double, std::int32_t>>& entries) {
    std::vector<double> times;
    std::vector<ButtonAction> values;
    for (const auto& [time, stored] : entries) {
        times.push_back(time);
        values.push_back(buttonActionOf(stored));
    }
    return {std::move(times), std::move(values)};
}

/// Keys as they are stored.
inline Track<KeyboardActionKind> keys(const std::vector<std::pair<double, KeyStroke>>& entries) {
    std::vector<double> times;
    std::vector<KeyInput> values;
    for (const auto& [time, stored] : entries) {
        times.push_back(time);
        values.push_back(keyInputOf(stored));
    }
    return {std::move(times), std::move(values)};
}

/// Numbers that look random and are the same everywhere.
class Numbers {
public:
    explicit Numbers(std::uint64_t seed) : state_(seed) {}

    std::uint32_t next() {
        state_ = state_ * 6364136223846793005ULL + 1442695040888963407ULL;
        return static_cast<std::uint32_t>(state_ >> 33);
    }
    int below(int limit) { return static_cast<int>(next() % static_cast<std::uint32_t>(limit)); }

private:
    std::uint64_t state_;
};

} // namespace ZULMetaData::Test
