#pragma once

// Recorded keys as captions, such as "Hello [returnKey]".
//
//     for (const KeyCaption& caption : keyCaptions(keys, false)) // bullets in place of what was typed
//         show(caption.text, caption.start, caption.end);

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ZULMMetaDataCommon.h"

#include <string>
#include <vector>

namespace ZULMetaData {

/// A key that was pressed.
struct KeyEvent {
    double time = 0; ///< in seconds
    KeyStroke key;   ///< the key and its modifiers
};

/// A key as a caption shows it.
struct CaptionKey {
    double time = 0;      ///< in seconds
    std::string label;    ///< UTF-8: what the key types, or [name] of a special key, after the signs of its modifiers
    bool isTyped = false; ///< true for a character without modifiers, which makes words with its neighbours
};

/// Keys that are shown together, in one line.
struct KeyCaption {
    double start = 0; ///< when the first key was pressed, in seconds
    double end = 0;   ///< some time after the last key was pressed, in seconds
    std::string text; ///< UTF-8: the labels of the keys; a space separates any two of which one is not typed
    std::vector<CaptionKey> keys; ///< at least one, in the order of their times
};

inline constexpr double s_captionPause = 1; ///< the usual pause that ends a caption, in seconds

/// Joins keys that follow one another in less than `pause` seconds, up to the end of a line. Orders the keys by their
/// times, and leaves out those whose time is not finite. If `showsKeys` is false, every key that types a character
/// shows as a bullet, and so does a number without a name: only virtual keys that type nothing, and control characters,
/// show by their names.
ZULMETADATA_API std::vector<KeyCaption> keyCaptions(std::vector<KeyEvent> keys, bool showsKeys,
                                                    double pause = s_captionPause);

} // namespace ZULMetaData
