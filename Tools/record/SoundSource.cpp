#include "Tools/record/SoundSource.h"

#include "Tools/record/Failure.h"

#include <fmt/core.h>
#include <pulse/error.h>
#include <pulse/simple.h>

#include <cstdint>
#include <exception>
#include <optional>
#include <utility>

namespace Recorder {

namespace {

constexpr std::size_t s_blockSamples = 480; ///< 10 ms
/// Sound that is further from its time is moved there.
constexpr std::int64_t s_tolerance = s_soundRate / 20;

} // namespace

void SoundSource::Closer::operator()(pa_simple* stream) const {
    pa_simple_free(stream);
}

SoundSource::SoundSource(const std::string& source) : block_(s_blockSamples * s_soundChannels) {
    const pa_sample_spec spec{PA_SAMPLE_FLOAT32LE, s_soundRate, s_soundChannels};
    constexpr auto fragment = static_cast<std::uint32_t>(s_blockSamples * s_soundChannels * sizeof(float));
    constexpr std::uint32_t any = static_cast<std::uint32_t>(-1);
    const pa_buffer_attr attributes{any, any, any, any, fragment};
    int error = 0;
    stream_.reset(pa_simple_new(nullptr, "zulm record", PA_STREAM_RECORD, source.empty() ? nullptr : source.c_str(),
                                "screen recording", &spec, nullptr, &attributes, &error));
    if (!stream_)
        throw Refusal(fmt::format("--audio: the source of sound cannot be opened: {}; 'pactl list short sources' shows "
                                  "what there is",
                                  pa_strerror(error)));
}

SoundSource::~SoundSource() {
    stop();
}

void SoundSource::start(const Camera& camera, VideoWriter& writer, std::function<void(const std::string&)> failed) {
    thread_ = std::thread([this, &camera, &writer, failed = std::move(failed)] {
        try {
            record(camera, writer);
        } catch (const std::exception& error) {
            failed(error.what());
        }
    });
}

void SoundSource::stop() {
    isOver_ = true;
    if (thread_.joinable())
        thread_.join();
}

void SoundSource::record(const Camera& camera, VideoWriter& writer) {
    while (!isOver_) {
        int error = 0;
        if (pa_simple_read(stream_.get(), block_.data(), block_.size() * sizeof(float), &error) < 0)
            throw Failure(fmt::format("the sound has ended: {}", pa_strerror(error)), ExitLoss);
        const pa_usec_t late = pa_simple_get_latency(stream_.get(), &error);
        constexpr Instant microsecond = 1000;
        constexpr Instant length = s_second * static_cast<Instant>(s_blockSamples) / s_soundRate;
        const Instant began = now() - static_cast<Instant>(late) * microsecond - length;
        if (const std::optional<Instant> inMovie = camera.movieLength(began))
            write(writer, *inMovie);
    }
}

/// Fills gaps with silence and leaves out what comes twice, so that sound and picture never drift apart.
void SoundSource::write(VideoWriter& writer, Instant inMovie) {
    const std::int64_t target = inUnits(inMovie, s_soundRate);
    if (written_ > target + s_tolerance)
        return;
    if (written_ == 0 || written_ < target - s_tolerance) {
        const std::vector<float> silence(static_cast<std::size_t>(target - written_) * s_soundChannels);
        writer.writeSound(silence);
        written_ = target;
    }
    writer.writeSound(block_);
    written_ += static_cast<std::int64_t>(s_blockSamples);
}

} // namespace Recorder
