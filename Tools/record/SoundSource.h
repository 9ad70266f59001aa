#pragma once

// Records sound from PulseAudio, or from PipeWire's interface for it, on a thread of its own.

#include "Tools/record/Camera.h"
#include "Tools/record/VideoWriter.h"

#include <atomic>
#include <cstdint>
#include <functional>
#include <limits>
#include <memory>
#include <span>
#include <string>
#include <thread>

namespace Recorder {

class SoundSource {
public:
    /// An empty name stands for the default source. Throws `Refusal` if it cannot be opened.
    explicit SoundSource(const std::string& source);
    ~SoundSource();
    SoundSource(const SoundSource&) = delete;
    SoundSource& operator=(const SoundSource&) = delete;

    /// Writes what is heard from the first frame on. `failed` is called on the thread if that ends early.
    void start(const Camera& camera, VideoWriter& writer, std::function<void(const std::string& why)> failed);

    /// Writes what is heard before `end`, and ends the thread.
    void stop(Instant end);

private:
    struct Stream; ///< from the sound server

    void record(const Camera& camera, VideoWriter& writer);
    void write(VideoWriter& writer, std::span<const float> block, Instant inMovie);
    void writeSilence(VideoWriter& writer, std::int64_t samples);

    std::unique_ptr<Stream> stream_;
    std::int64_t written_ = 0; ///< samples of each channel
    double missing_ = 0;       ///< samples that are missing at the present time, smoothed; fewer than 0 are too many
    std::atomic<Instant> end_ = std::numeric_limits<Instant>::max();
    std::thread thread_;
};

} // namespace Recorder
