#include "Tools/render/SoundReader.h"

#include "Tools/zulm/Failure.h"
#include "Tools/zulm/SoundTempo.h"

#include <fmt/core.h>

extern "C" {
#include <libavutil/channel_layout.h>
}

#include <algorithm>
#include <cmath>

namespace Render {

using Zulm::Failure;

namespace {

constexpr double s_latest = 1e7;       ///< seconds; a later time in a movie is damage
constexpr double s_longestFilling = 1; ///< seconds of a pause that are held as samples

/// Returns whether one converter takes both frames.
bool areAlike(const AVFrame& left, const AVFrame& right) {
    return left.format == right.format && left.sample_rate == right.sample_rate &&
           av_channel_layout_compare(&left.ch_layout, &right.ch_layout) == 0;
}

} // namespace

SoundReader::SoundReader(const std::string& path, const std::string& name)
    : movie_(path, name), stream_(movie_.bestStream(AVMEDIA_TYPE_AUDIO)) {
    if (!hasSound())
        return;
    for (unsigned i = 0; i < movie_.input->nb_streams; ++i)
        if (static_cast<int>(i) != stream_)
            movie_.input->streams[i]->discard = AVDISCARD_ALL;
    decoder_ = movie_.decoderOf(stream_);
    rate_ = Zulm::soundRateFor(decoder_->sample_rate);
}

SoundReader::~SoundReader() = default;

std::int64_t SoundReader::bufferedEnd() const {
    return bufferStart_ + static_cast<std::int64_t>(buffer_.size() / s_soundChannels);
}

void SoundReader::seek(std::int64_t sample) {
    const double warmUp = 0.5; // seconds: the first sound after a seek may be wrong
    const AVStream& stream = *movie_.input->streams[stream_];
    const double time = static_cast<double>(sample) / rate_ - warmUp;
    const auto target = static_cast<std::int64_t>(std::floor(std::max(0.0, time) / av_q2d(stream.time_base)));
    if (av_seek_frame(movie_.input.get(), stream_, target, AVSEEK_FLAG_BACKWARD) < 0)
        av_seek_frame(movie_.input.get(), stream_, 0, AVSEEK_FLAG_BACKWARD);
    avcodec_flush_buffers(decoder_.get());
    converter_.reset();
    buffer_.clear();
    seekPlace_ = std::max<std::int64_t>(0, std::llround(time * rate_));
    isPlaced_ = false;
    isAtEnd_ = false;
}

void SoundReader::convert(const AVFrame* frame) {
    const int room = swr_get_out_samples(converter_.get(), frame ? frame->nb_samples : 0);
    const std::size_t before = buffer_.size();
    buffer_.resize(before + static_cast<std::size_t>(std::max(0, room)) * s_soundChannels);
    void* samples = buffer_.data() + before;
    auto* target = static_cast<std::uint8_t*>(samples);
    const int made = swr_convert(converter_.get(), &target, room,
                                 frame ? const_cast<const std::uint8_t**>(frame->extended_data) : nullptr,
                                 frame ? frame->nb_samples : 0);
    buffer_.resize(before + static_cast<std::size_t>(std::max(0, made)) * s_soundChannels);
}

void SoundReader::prepareConverter(const AVFrame& frame) {
    if (converter_ && areAlike(*converted_, frame))
        return;
    if (converter_)
        convert(nullptr); // a movie may change its format at any frame
    converted_.reset(av_frame_clone(&frame));
    if (!converted_)
        throw std::bad_alloc();
    AVChannelLayout stereo;
    av_channel_layout_default(&stereo, static_cast<int>(s_soundChannels));
    SwrContext* made = nullptr;
    swr_alloc_set_opts2(&made, &stereo, AV_SAMPLE_FMT_FLT, rate_, &converted_->ch_layout,
                        static_cast<AVSampleFormat>(frame.format), frame.sample_rate, 0, nullptr);
    converter_.reset(made);
    if (!made || swr_init(made) < 0)
        throw Failure(fmt::format("{}: its sound is of a format that cannot be converted; --no-sound leaves it out",
                                  movie_.name));
}

void SoundReader::place(const AVFrame& frame) {
    const std::int64_t stamp = frame.best_effort_timestamp != AV_NOPTS_VALUE ? frame.best_effort_timestamp : frame.pts;
    const double time = static_cast<double>(stamp) * av_q2d(movie_.input->streams[stream_]->time_base);
    const bool hasTime = stamp != AV_NOPTS_VALUE && std::abs(time) <= s_latest;
    if (!hasTime && isPlaced_)
        return;
    const double delay = static_cast<double>(swr_get_delay(converter_.get(), rate_));
    const std::int64_t place = hasTime ? std::llround(time * rate_ - delay) : seekPlace_;
    const std::int64_t off = place - bufferedEnd();
    const std::int64_t rounding = rate_ / 500; // movies round times by less
    if (!isPlaced_) {
        bufferStart_ = place;
        knownFrom_ = place;
        isPlaced_ = true;
    } else if (static_cast<double>(off) > s_longestFilling * rate_) {
        buffer_.clear(); // what was asked for has been copied
        bufferStart_ = place;
    } else if (off > rounding) {
        buffer_.resize(buffer_.size() + static_cast<std::size_t>(off) * s_soundChannels);
    } else if (off < -rounding) {
        const auto known = static_cast<std::int64_t>(buffer_.size() / s_soundChannels);
        buffer_.resize(static_cast<std::size_t>(std::max<std::int64_t>(0, known + off)) * s_soundChannels);
        bufferStart_ = std::min(bufferStart_, place);
        knownFrom_ = std::min(knownFrom_, bufferStart_);
    }
}

void SoundReader::take(const AVFrame& frame) {
    if (frame.sample_rate <= 0 || frame.nb_samples <= 0)
        return;
    prepareConverter(frame);
    place(frame);
    convert(&frame);
}

bool SoundReader::decode() {
    const FramePointer frame = newFrame();
    const PacketPointer packet = newPacket();
    for (;;) {
        const int error = avcodec_receive_frame(decoder_.get(), frame.get());
        if (error >= 0) {
            take(*frame);
            return true;
        }
        if (error == AVERROR_EOF || isAtEnd_) {
            if (!converter_)
                return false;
            convert(nullptr); // the last samples
            converter_.reset();
            return true;
        }
        for (;;) {
            if (av_read_frame(movie_.input.get(), packet.get()) < 0) {
                isAtEnd_ = true;
                avcodec_send_packet(decoder_.get(), nullptr);
                break;
            }
            const bool isOurs = packet->stream_index == stream_;
            if (isOurs)
                avcodec_send_packet(decoder_.get(), packet.get()); // what is damaged is silent
            av_packet_unref(packet.get());
            if (isOurs)
                break;
        }
    }
}

void SoundReader::read(std::int64_t first, std::span<float> samples) {
    std::fill(samples.begin(), samples.end(), 0.0F);
    if (!hasSound())
        return;
    const std::int64_t end = first + static_cast<std::int64_t>(samples.size() / s_soundChannels);
    const std::int64_t farAhead = rate_ * 5LL;
    if (!isPlaced_ || first < knownFrom_ || first > bufferedEnd() + farAhead)
        seek(first);
    copyTo(first, samples);
    while ((!isPlaced_ || bufferedEnd() < end) && decode()) {
        copyTo(first, samples);
        const std::int64_t past = std::min(bufferedEnd(), first) - bufferStart_;
        if (isPlaced_ && past > 0) { // nobody asks for it any more, but a little may be asked for again
            buffer_.erase(buffer_.begin(), buffer_.begin() + static_cast<std::ptrdiff_t>(past * 2));
            bufferStart_ += past;
            knownFrom_ = bufferStart_;
        }
    }
}

void SoundReader::copyTo(std::int64_t first, std::span<float> samples) const {
    const std::int64_t end = first + static_cast<std::int64_t>(samples.size() / s_soundChannels);
    const std::int64_t from = std::max(first, bufferStart_);
    const std::int64_t to = std::min(end, bufferedEnd());
    if (isPlaced_ && from < to)
        std::copy(buffer_.begin() + static_cast<std::ptrdiff_t>((from - bufferStart_) * 2),
                  buffer_.begin() + static_cast<std::ptrdiff_t>((to - bufferStart_) * 2),
                  samples.begin() + static_cast<std::ptrdiff_t>((from - first) * 2));
}

} // namespace Render
