#pragma once

// What ffprobe says about the pictures and the sound of a movie.

#include "ZULMetaDataSession/Rational.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace Zulm {

/// A frame of a movie as it is stored.
struct MediaPacket {
    std::int64_t time = 0;     ///< when it is shown, in units of its stream
    std::int64_t duration = 0; ///< how long it is shown, in the same units; 0 if nobody knows
    bool isKey = false;        ///< whether decoding can begin with it
};

struct PictureStream {
    int index = 0;
    ZULMetaData::Rational unit;       ///< of its times, in seconds
    std::vector<MediaPacket> packets; ///< in the order in which they are stored
    std::vector<std::int64_t> frames; ///< the times of all packets, ascending

    ZULMetaData::Rational secondsOf(std::int64_t time) const { return ZULMetaData::Rational(time) * unit; }

    /// Returns when the last frame ends, in seconds.
    ZULMetaData::Rational end() const;

    /// Returns the place in `frames` of the frame that is shown at a time: the last one that is not later, or the first
    /// one of all.
    std::size_t shownAt(const ZULMetaData::Rational& time) const;

    /// Returns the place in `frames` of the first frame at or after a time.
    std::size_t firstFrom(const ZULMetaData::Rational& time) const;
};

struct SoundStream {
    int index = 0;
    int sampleRate = 0; ///< in Hz
    int channels = 0;
};

struct Media {
    ZULMetaData::Rational start; ///< what the times that ffmpeg is told begin at
    std::optional<PictureStream> picture;
    std::vector<SoundStream> sounds;
    std::size_t otherStreams = 0; ///< subtitles, further pictures and so on
};

/// Asks ffprobe. Errors call the file `name`. Throws `Failure`.
Media mediaIn(const std::string& path, const std::string& name);

/// How ffmpeg and ffprobe are told the path of a file: a name never looks like an address or an option.
std::string mediaAddress(const std::string& path);

/// Throws `Failure` unless a program of ffmpeg ended well. `what` completes "ffmpeg cannot ...".
void requireDone(const std::string& program, int exitCode, const std::string& errors, const std::string& what);

} // namespace Zulm
