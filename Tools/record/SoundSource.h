#pragma once

// Records sound from PulseAudio, or from PipeWire's interface for it, on a thread of its own.

#include "Tools/record/Camera.h"
#include "Tools/record/VideoWriter.h"

#include <atomic>
#include <functional>
#include <memory>
#include <string>
#include <thread>
#include <vector>

struct pa_simple;

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

    /// Ends the thread.
    void stop();

private:
    struct Closer {
        void operator()(pa_simple* stream) const;
    };

    void record(const Camera& camera, VideoWriter& writer);
    void write(VideoWriter& writer, Instant inMovie);

    std::unique_ptr<pa_simple, Closer> stream_;
    std::vector<float> block_;
    std::int64_t written_ = 0; ///< samples of each channel
    std::atomic<bool> isOver_ = false;
    std::thread thread_;
};

} // namespace Recorder
