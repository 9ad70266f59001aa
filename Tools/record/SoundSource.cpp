#include "Tools/record/SoundSource.h"

#include "Tools/record/Failure.h"
#include "Tools/record/Releaser.h"

#include <fmt/core.h>
#include <pulse/context.h>
#include <pulse/error.h>
#include <pulse/mainloop.h>
#include <pulse/stream.h>

#include <algorithm>
#include <cmath>
#include <exception>
#include <optional>
#include <utility>
#include <vector>

namespace Recorder {

namespace {

constexpr std::size_t s_blockSamples = 480; ///< 10 ms
/// Sound that is further from its time is moved there at once.
constexpr std::int64_t s_farAway = s_soundRate / 20;
/// Sound that stays further from its time is moved there. The times of single blocks are less exact.
constexpr double s_tolerance = s_soundRate / 100.0;
constexpr double s_smoothing = 64; ///< blocks
constexpr Instant s_longestOpening = 5 * s_second;
constexpr Instant s_longestTurn = 50 * s_millisecond;
constexpr Instant s_longestTail = 500 * s_millisecond; ///< for sound that is on its way when the recording ends
constexpr Instant s_microsecond = 1000;

} // namespace

/// The server's own simple interface does not say when sound is heard that is recorded before, such as all sound that
/// other programs play.
struct SoundSource::Stream {
    std::unique_ptr<pa_mainloop, Releaser<pa_mainloop_free>> loop{pa_mainloop_new()};
    std::unique_ptr<pa_context, Releaser<pa_context_unref>> context{
        pa_context_new(pa_mainloop_get_api(loop.get()), "zulm record")};
    std::unique_ptr<pa_stream, Releaser<pa_stream_unref>> stream;

    ~Stream() {
        if (stream)
            pa_stream_disconnect(stream.get());
        pa_context_disconnect(context.get());
    }

    bool connect(const std::string& source);
    bool turn();

    /// Returns when the first sample was heard that was not taken yet, or nothing if the server has not said so.
    std::optional<Instant> heard() const;
    std::string error() const { return pa_strerror(pa_context_errno(context.get())); }

private:
    template <class IsReady>
    bool waitFor(IsReady isReady);
};

/// Lets the connection work, for a while at most. Returns false if it is broken.
bool SoundSource::Stream::turn() {
    return pa_mainloop_prepare(loop.get(), static_cast<int>(s_longestTurn / s_microsecond)) >= 0 &&
           pa_mainloop_poll(loop.get()) >= 0 && pa_mainloop_dispatch(loop.get()) >= 0 &&
           PA_CONTEXT_IS_GOOD(pa_context_get_state(context.get())) &&
           (!stream || PA_STREAM_IS_GOOD(pa_stream_get_state(stream.get())));
}

template <class IsReady>
bool SoundSource::Stream::waitFor(IsReady isReady) {
    const Instant deadline = now() + s_longestOpening;
    while (!isReady())
        if (!turn() || now() > deadline)
            return false;
    return true;
}

bool SoundSource::Stream::connect(const std::string& source) {
    const auto isContextReady = [this] { return pa_context_get_state(context.get()) == PA_CONTEXT_READY; };
    if (pa_context_connect(context.get(), nullptr, PA_CONTEXT_NOAUTOSPAWN, nullptr) < 0 || !waitFor(isContextReady))
        return false;
    const pa_sample_spec spec{PA_SAMPLE_FLOAT32LE, s_soundRate, s_soundChannels};
    constexpr auto fragment = static_cast<std::uint32_t>(s_blockSamples * s_soundChannels * sizeof(float));
    constexpr auto any = static_cast<std::uint32_t>(-1);
    const pa_buffer_attr attributes{any, any, any, any, fragment};
    constexpr auto flags = static_cast<pa_stream_flags_t>(PA_STREAM_INTERPOLATE_TIMING | PA_STREAM_ADJUST_LATENCY |
                                                          PA_STREAM_AUTO_TIMING_UPDATE);
    stream.reset(pa_stream_new(context.get(), "screen recording", &spec, nullptr));
    const auto isStreamReady = [this] { return pa_stream_get_state(stream.get()) == PA_STREAM_READY; };
    return stream &&
           pa_stream_connect_record(stream.get(), source.empty() ? nullptr : source.c_str(), &attributes, flags) >= 0 &&
           waitFor(isStreamReady);
}

std::optional<Instant> SoundSource::Stream::heard() const {
    pa_usec_t late = 0;
    int isNegative = 0;
    if (pa_stream_get_latency(stream.get(), &late, &isNegative) < 0)
        return std::nullopt;
    const Instant distance = static_cast<Instant>(late) * s_microsecond;
    return isNegative != 0 ? now() + distance : now() - distance;
}

SoundSource::SoundSource(const std::string& source) : stream_(std::make_unique<Stream>()) {
    if (!stream_->connect(source))
        throw Refusal(fmt::format("--audio: the source of sound cannot be opened: {}; 'pactl list short sources' shows "
                                  "what there is",
                                  stream_->error()));
}

SoundSource::~SoundSource() {
    stop(0);
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

void SoundSource::stop(Instant end) {
    end_ = end;
    if (thread_.joinable())
        thread_.join();
}

void SoundSource::record(const Camera& camera, VideoWriter& writer) {
    std::vector<float> block;
    Instant last = 0;
    while (last < end_ && now() - s_longestTail < end_) {
        if (!stream_->turn())
            throw Failure(fmt::format("the sound has ended: {}", stream_->error()), ExitLoss);
        const void* bytes = nullptr;
        std::size_t size = 0;
        while (pa_stream_readable_size(stream_->stream.get()) > 0 &&
               pa_stream_peek(stream_->stream.get(), &bytes, &size) >= 0 && size > 0) {
            const std::optional<Instant> heard = stream_->heard();
            last = heard.value_or(last);
            if (bytes) { // otherwise the server has left something out
                const auto* samples = static_cast<const float*>(bytes);
                block.assign(samples, samples + size / sizeof(float));
            }
            pa_stream_drop(stream_->stream.get());
            const std::optional<Instant> inMovie = heard && bytes ? camera.movieLength(*heard) : std::nullopt;
            if (inMovie)
                write(writer, block, *inMovie);
        }
    }
}

void SoundSource::writeSilence(VideoWriter& writer, std::int64_t samples) {
    writer.writeSound(std::vector<float>(static_cast<std::size_t>(samples) * s_soundChannels));
    written_ += samples;
}

/// Fills gaps with silence and leaves out what comes twice, so that sound and picture never drift apart.
void SoundSource::write(VideoWriter& writer, std::span<const float> block, Instant inMovie) {
    const std::int64_t gap = inUnits(inMovie, s_soundRate) - written_;
    const bool isFar = written_ == 0 || gap > s_farAway || gap < -s_farAway;
    missing_ = isFar ? static_cast<double>(gap) : missing_ + (static_cast<double>(gap) - missing_) / s_smoothing;
    if (isFar || std::abs(missing_) > s_tolerance) {
        const auto missing = static_cast<std::int64_t>(std::exchange(missing_, 0));
        if (missing > 0)
            writeSilence(writer, missing);
        else
            block = block.subspan(std::min(block.size(), static_cast<std::size_t>(-missing) * s_soundChannels));
    }
    writer.writeSound(block);
    written_ += static_cast<std::int64_t>(block.size() / s_soundChannels);
}

} // namespace Recorder
