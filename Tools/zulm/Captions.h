#pragma once

// What a recording has to say in words, on its time line: keystrokes as captions, titles as chapters.

#include "ZULMetaData/ZULMMetaDataCommon.h"

#include <cstdint>
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

/// Whether a caption can begin at this time: from 0 on, and not after the end of all media.
bool isShowable(double seconds);

/// How a keystroke is shown: what it types, or [name] of a special key, with the signs of its modifiers in front.
struct KeyLabel {
    std::string text;
    bool isTyped = false;  ///< a character without modifiers, which makes words with its neighbours
    bool endsLine = false; ///< the return key
};

/// Where `showsKeys` is false, every key that types a character shows as a bullet, and so does one of which that cannot
/// be told: only what is marked as a virtual key, and control characters, show by their names.
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
/// one. The last one that nothing follows ends at `duration` where that is later, or after a few seconds.
std::vector<PlacedCaption> placed(std::vector<Caption> captions, double unitsPerSecond, double duration);

} // namespace Zulm
