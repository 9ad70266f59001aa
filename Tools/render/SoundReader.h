#pragma once

// The sound of a movie by its times, left and right in turn.

#include "Tools/render/Libav.h"

#include <cstdint>
#include <span>
#include <string>
#include <vector>

extern "C" {
#include <libswresample/swresample.h>
}

namespace Render {

inline constexpr std::size_t s_soundChannels = 2;

class SoundReader {
public:
    /// Errors call the movie `name`. Throws `Zulm::Failure` if the movie or its sound cannot be opened.
    SoundReader(const std::string& path, const std::string& name);
    ~SoundReader();
    SoundReader(const SoundReader&) = delete;
    SoundReader& operator=(const SoundReader&) = delete;

    bool hasSound() const { return stream_ >= 0; }
    int rate() const { return rate_; } ///< samples a second, of what is returned

    /// Fills in the samples from this one on, counted from the start of the movie. What the movie does not hold is
    /// silent.
    void read(std::int64_t first, std::span<float> samples);

private:
    void seek(std::int64_t sample);
    bool decode();
    void take(const AVFrame& frame);
    void prepareConverter(const AVFrame& frame);
    void place(const AVFrame& frame);
    void convert(const AVFrame* frame); ///< null takes what the converter still holds
    void copyTo(std::int64_t first, std::span<float> samples) const;
    std::int64_t bufferedEnd() const;

    OpenMovie movie_;
    int stream_ = -1;
    int rate_ = 0;
    CodecPointer decoder_;
    std::unique_ptr<SwrContext, Releaser<swr_free>> converter_;
    FramePointer converted_; ///< a frame of the format that the converter takes
    std::vector<float> buffer_;
    std::int64_t bufferStart_ = 0; ///< the number of the first sample in the buffer
    std::int64_t knownFrom_ = 0;   ///< what is between this sample and the buffer is silent
    std::int64_t seekPlace_ = 0;   ///< the sample to which the last seek went
    bool isPlaced_ = false;        ///< whether that is known
    bool isAtEnd_ = false;
};

} // namespace Render
