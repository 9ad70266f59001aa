#pragma once

// The sound of a movie by its times, left and right in turn.

#include "Tools/render/Libav.h"

#include <cstdint>
#include <span>
#include <string>
#include <vector>

struct SwrContext;
extern "C" void swr_free(SwrContext** context);

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
    void convert(const AVFrame* frame);
    std::int64_t bufferedEnd() const;

    OpenMovie movie_;
    int stream_ = -1;
    int rate_ = 0;
    CodecPointer decoder_;
    std::unique_ptr<SwrContext, Releaser<swr_free>> converter_;
    std::vector<float> buffer_;
    std::int64_t bufferStart_ = 0; ///< the number of the first sample in the buffer
    bool isPlaced_ = false;        ///< whether that is known
    bool isAtEnd_ = false;
};

} // namespace Render
