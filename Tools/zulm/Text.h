#pragma once

// Stored bytes as they can be shown.

#include <string>
#include <string_view>

namespace Zulm {

/// Printable ASCII as it is, all else, and the backslash, as \xNN.
std::string printable(std::string_view bytes);

/// As it is, but for control characters, which could do something to a terminal: those as \xNN. For names of files,
/// which need not be UTF-8.
std::string withoutControls(const std::string& bytes);

/// The same for text: with U+FFFD in place of what is not UTF-8.
std::string shown(const std::string& text);

/// `bytes` as they are where they are UTF-8, else with U+FFFD in place of what is not.
std::string validText(const std::string& bytes);

/// As one word of a command that can be pasted into a shell: as it is, or quoted.
std::string shellWord(const std::string& word);

std::string base64(std::string_view bytes);

} // namespace Zulm
