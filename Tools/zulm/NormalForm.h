#pragma once

// One text can be spelled in several ways in Unicode: "é" is one character, or an "e" followed by an accent.

#include <string>

namespace Zulm {

/// The text in the normal form NFC, with accents joined to their letters. Returns bytes that are not UTF-8 unchanged.
std::string composed(const std::string& text);

/// The text in the normal form NFD, with accents apart from their letters. Returns bytes that are not UTF-8 unchanged.
std::string decomposed(const std::string& text);

} // namespace Zulm
