#pragma once

// Stored bytes as they can be shown.

#include <string>
#include <string_view>

namespace Zulm {

/// Printable ASCII as it is, all else, and the backslash, as \xNN.
std::string printable(std::string_view bytes);

/// The same for text: what is UTF-8 stays, but for control characters, which could do something to a terminal.
std::string shown(const std::string& text);

/// `bytes` as they are where they are UTF-8, else with U+FFFD in place of what is not.
std::string validText(const std::string& bytes);

/// As one word of a command that can be pasted into a shell: as it is, or quoted.
std::string shellWord(const std::string& word);

/// Line by line as `shown`.
std::string shownLines(const std::string& text);

std::string base64(std::string_view bytes);

} // namespace Zulm
