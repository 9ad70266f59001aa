#pragma once

// Recorded keys as captions, such as "Hello [returnKey]".
//
//     for (const KeyCaption& caption : keyCaptions(keys)) // bullets in place of what was typed
//         show(caption.text, caption.start, caption.end);

#include "../../SharedDependencies/Export.h"
#include "../Track.h"

#include <cstddef>
#include <limits>
#include <string>
#include <vector>

namespace ZULMetaData {

/// How keys are joined into captions.
struct KeyCaptionOptions {
    /// If false, every key that types a character shows as a bullet, and so does a number without a name: only virtual
    /// keys that type nothing, and control characters, show by their names.
    bool showsKeys = false;
    /// If true, a character with Control, Windows or Command shows although `showsKeys` is false. With Alt alone, and
    /// with Control and Alt, it stays a bullet: keyboards type letters of passwords with these modifiers.
    bool showsShortcuts = false;
    double pause = 1;            ///< seconds between two keys that end a caption
    double hold = 1.5;           ///< seconds that a caption stays after its last key
    std::size_t lineLength = 42; ///< characters in a caption, at most, unless a single key has more
};

/// A key as a caption shows it.
struct CaptionKey {
    double time = 0;      ///< in seconds
    std::string label;    ///< UTF-8: what the key types, or [name] of a special key, after the signs of its modifiers
    bool isTyped = false; ///< true for a character without modifiers, which makes words with its neighbours

    friend bool operator==(const CaptionKey&, const CaptionKey&) = default; ///< compares all fields
};

/// Keys that are shown together, in one line.
struct KeyCaption {
    double start = 0; ///< when the first key was pressed, in seconds
    double end = 0;   ///< some time after the last key was pressed, in seconds
    std::string text; ///< UTF-8: the labels of the keys; a space separates any two of which one is not typed
    std::vector<CaptionKey> keys; ///< at least one, in the order of their times

    friend bool operator==(const KeyCaption&, const KeyCaption&) = default; ///< compares all fields
};

/// Joins keys that follow one another without a pause, up to the Return key or the end of a line. A caption ends at the
/// latest when the recording of `duration` seconds does, unless its last key was not pressed before that.
ZULMETADATA_API std::vector<KeyCaption> keyCaptions(const Track<KeyboardActionKind>& keys,
                                                    const KeyCaptionOptions& options = {},
                                                    double duration = std::numeric_limits<double>::infinity());

/// Returns whether a key types a character, as `CaptionKey::isTyped` tells it: special keys and shortcuts do not.
ZULMETADATA_API bool typesCharacter(const KeyInput& key);

} // namespace ZULMetaData
