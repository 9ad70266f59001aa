#pragma once

// Runs ffmpeg.

#include "ZULMetaDataSession/Rational.h"

#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Zulm {

using Words = std::vector<std::string>; ///< of a command line

/// How ffmpeg and ffprobe are told the path of a file: a name never looks like an address or an option.
std::string mediaAddress(const std::string& path);

/// A number of seconds for an option or a filter of ffmpeg, which reads microseconds.
std::string secondsFor(const ZULMetaData::Rational& time);

/// A number in an expression, which ffmpeg computes with doubles.
std::string numberFor(const ZULMetaData::Rational& value);

/// Throws `Failure` unless a program of ffmpeg ended well. `what` completes "ffmpeg cannot ...".
void requireDone(const std::string& program, int exitCode, const std::string& errors, const std::string& what);

/// The ffmpeg in PATH.
class FFmpeg {
public:
    FFmpeg(); ///< throws `Failure` if there is none

    /// Returns the option that tells how frames are dropped and repeated, which was renamed in version 5.1.
    std::string frameRateOption() const;

    /// Throws `Failure` if it was built without this encoder.
    void requireEncoder(const std::string& encoder) const;

    /// Runs it with these options, and calls `take` with what it writes on standard output. `what` completes "ffmpeg
    /// cannot ...". Throws `Failure`, also if it ends with an error, and `Interruption`.
    void run(
        const Words& options, const std::string& what,
        const std::function<void(std::string_view bytes)>& take = [](std::string_view) {}) const;

private:
    double version_ = 0; ///< 0 if it is not a number
};

/// A movie that is cut, and its options for ffmpeg.
struct CutSource {
    std::string path;
    std::string name;            ///< for messages
    ZULMetaData::Rational start; ///< what the times that ffmpeg is told begin at

    /// Returns the options that open it at a time or a little before. Times stay those of the source.
    Words openedAt(const std::optional<ZULMetaData::Rational>& time) const;
};

} // namespace Zulm
