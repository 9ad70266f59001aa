#pragma once

// What a recording has to say in words, on its time line: keystrokes as captions, titles as chapters.

#include "ZULMetaData/ZULMMetaDataCommon.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace Zulm {

/// Shown from `start` to `end`, in seconds.
struct Caption {
    double start = 0;
    double end = 0; ///< infinite where it is shown until the next one comes
    std::string text;
};

struct KeyEvent {
    double time = 0;
    ZULMetaData::KeyStroke key;
};

/// Returns the time before which every caption begins, in seconds: the end of the movie, or of what files can hold.
double endOfCaptions(std::optional<double> duration);

/// How a keystroke is shown: what it types, or [name] of a special key, with the signs of its modifiers in front.
struct KeyLabel {
    std::string text;
    bool isTyped = false;  ///< a character without modifiers, which makes words with its neighbours
    bool endsLine = false; ///< the return key
};

/// If `showsKeys` is false, every key that types a character shows as a bullet, and so does a number without a name:
/// only virtual keys that type nothing, and control characters, show by their names.
KeyLabel labelOf(const ZULMetaData::KeyStroke& key, bool showsKeys);

/// Keys that follow one another within `pause` seconds make one caption, up to the end of a line.
std::vector<Caption> keyCaptions(std::vector<KeyEvent> keys, double pause, bool showsKeys);

/// A caption in units of a time scale, as it stands in a file.
struct PlacedCaption {
    std::int64_t start = 0;
    std::int64_t end = 0;
    std::string text;
};

/// Captions in the order of their times, none overlapping the next and none empty. Those that begin together become
/// one. All of them must begin before `endOfCaptions(duration)`, and end there at the latest. A title that nothing
/// follows ends with the movie, or after a few seconds if the length of the movie is not known.
std::vector<PlacedCaption> placed(std::vector<Caption> captions, double unitsPerSecond, std::optional<double> duration);

} // namespace Zulm
