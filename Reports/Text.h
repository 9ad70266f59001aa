#pragma once

// Stored bytes as they can be shown: nothing is invisible, and no two texts look alike.
//
// Characters that cannot be seen are control characters, format characters such as those that turn the direction of
// writing, separators of lines, fillers, and numbers that no character ever has.

#include <string>
#include <string_view>

namespace Zulm {

/// Returns printable ASCII as it is, and all else, and the backslash, as \xNN.
std::string printable(std::string_view bytes);

/// Returns the text with an escape for everything that cannot be seen: \xNN for an ASCII control character and for a
/// byte that is not UTF-8, \u{N} for any other character, and \\ for a backslash.
std::string shown(std::string_view bytes);

/// Returns the same with the ends of lines as they are.
std::string shownLines(std::string_view bytes);

/// Returns a whole message with the same escapes. Its backslashes are doubled only if they would look like an escape
/// otherwise, so that the commands in it (see `shellWord`) can be pasted into a shell.
std::string shownMessage(std::string_view message);

/// Returns a JSON document with \uNNNN for every character in its texts that cannot be seen.
std::string shownJSON(const std::string& document);

/// Returns a text for people to read in one line: white space as spaces, [U+NNNN] for what cannot be seen.
std::string readableLine(const std::string& text);

/// Returns `bytes` as they are if they are UTF-8, and otherwise with U+FFFD in place of what is not.
std::string validText(const std::string& bytes);

/// Returns one word of a command that can be pasted into a shell: as it is, or quoted. `shownMessage` leaves it alone.
std::string shellWord(const std::string& word);

std::string base64(std::string_view bytes);
std::string bytesOfBase64(std::string_view text); ///< the inverse of `base64`

} // namespace Zulm
