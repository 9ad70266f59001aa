#pragma once

// The texts in which an operating system states its name and release, taken apart.

#include "Platform/ProcessInfo.h"

#include <string>
#include <string_view>

namespace ZULMetaData {

using ReleaseNumbers = decltype(ProcessInfo::operatingSystemVersion);

/// The leading numbers of a release like "6.1.0-13-amd64" or "14.2". A part that is missing, or too large for its
/// field, is 0, and so are the parts after it.
ReleaseNumbers parseReleaseNumbers(std::string_view release) noexcept;

/// The value of PRETTY_NAME in the text of an os-release file, with the shell's quotes and escapes resolved; the last
/// assignment counts. Empty if there is none, or if its quotes are not closed on their line.
std::string prettyNameOfOSRelease(std::string_view text);

} // namespace ZULMetaData
