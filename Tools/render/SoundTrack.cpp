#include "Tools/render/SoundTrack.h"

#include "Tools/zulm/Failure.h"
#include "Tools/zulm/SoundTempo.h"

#include <fmt/core.h>

extern "C" {
#include <libavfilter/buffersink.h>
#include <libavfilter/buffersrc.h>
#include <libavutil/channel_layout.h>
}

#include <algorithm>
#include <cmath>
#include <cstring>

namespace Render {

using namespace ZULMetaData;
using Zulm::Failure;

namespace {

/// The filter puts what it hears up to 30 ms too early, 16 ms on average: it looks for the place where two pieces fit
/// together best. Its sound begins so many seconds later.
constexpr double s_earliness = 0.016;

} // namespace

Tempo::Tempo(double speed, int rate) : graph_(avfilter_graph_alloc()), rate_(rate) {
    const std::string input = fmt::format("time_base=1/{}:sample_rate={}:sample_fmt={}:channel_layout=stereo", rate,
                                          rate, static_cast<int>(AV_SAMPLE_FMT_FLT));
    AVFilterInOut* outputs = avfilter_inout_alloc();
    AVFilterInOut* inputs = avfilter_inout_alloc();
    const bool isMade = outputs && inputs &&
                        avfilter_graph_create_filter(&source_, avfilter_get_by_name("abuffer"), "in", input.c_str(),
                                                     nullptr, graph_.get()) >= 0 &&
                        avfilter_graph_create_filter(&sink_, avfilter_get_by_name("abuffersink"), "out", nullptr,
                                                     nullptr, graph_.get()) >= 0;
    if (isMade) {
        *outputs = {av_strdup("in"), source_, 0, nullptr};
        *inputs = {av_strdup("out"), sink_, 0, nullptr};
    }
    const std::string filters = Zulm::tempoFilters(speed) + ",aformat=sample_fmts=flt:channel_layouts=stereo";
    const bool isReady = isMade &&
                         avfilter_graph_parse_ptr(graph_.get(), filters.c_str(), &inputs, &outputs, nullptr) >= 0 &&
                         avfilter_graph_config(graph_.get(), nullptr) >= 0;
    avfilter_inout_free(&inputs);
    avfilter_inout_free(&outputs);
    if (!isReady)
        throw Failure(fmt::format("the sound cannot be played {} times as fast; --no-sound leaves it out", speed));
}

void Tempo::add(std::span<const float> samples) {
    const FramePointer frame = newFrame();
    frame->format = AV_SAMPLE_FMT_FLT;
    frame->sample_rate = rate_;
    frame->nb_samples = static_cast<int>(samples.size() / s_soundChannels);
    av_channel_layout_default(&frame->ch_layout, static_cast<int>(s_soundChannels));
    if (av_frame_get_buffer(frame.get(), 0) < 0)
        throw std::bad_alloc();
    std::memcpy(frame->data[0], samples.data(), samples.size_bytes());
    frame->pts = added_;
    added_ += frame->nb_samples;
    feed(frame.get());
}

void Tempo::end() {
    feed(nullptr);
}

void Tempo::feed(AVFrame* frame) {
    if (const int error = av_buffersrc_add_frame(source_, frame); error < 0)
        throw Failure(
            fmt::format("the tempo of the sound cannot be changed: {}; --no-sound leaves it out", textOf(error)));
}

bool Tempo::take(std::vector<float>& samples) {
    const FramePointer frame = newFrame();
    if (av_buffersink_get_frame(sink_, frame.get()) < 0)
        return false;
    const auto count = static_cast<std::size_t>(frame->nb_samples) * s_soundChannels;
    const std::size_t before = samples.size();
    samples.resize(before + count);
    std::memcpy(samples.data() + before, frame->data[0], count * sizeof(float));
    return true;
}

SoundTrack::SoundTrack(const std::string& path, const std::string& name, const EditList& edits)
    : reader_(path, name), edits_(edits) {}

std::int64_t SoundTrack::endOf(std::size_t piece) const {
    const bool isLast = piece + 1 >= edits_.bases().size();
    const double end = isLast ? edits_.duration().nearest() : edits_.bases()[piece + 1].nearest();
    return std::llround(end * rate());
}

std::vector<float> SoundTrack::readUntil(double film) {
    const std::int64_t last = std::llround(film * rate());
    const auto count = static_cast<std::size_t>(std::max<std::int64_t>(0, last - written_));
    std::vector<float> samples(count * s_soundChannels);
    std::span<float> left(samples);
    while (!left.empty() && piece_ < edits_.pieces().size()) {
        const std::int64_t room = endOf(piece_) - written_;
        const auto now = static_cast<std::size_t>(
            std::clamp<std::int64_t>(room, 0, static_cast<std::int64_t>(left.size() / s_soundChannels)));
        readPiece(left.first(now * s_soundChannels));
        left = left.subspan(now * s_soundChannels);
        written_ += static_cast<std::int64_t>(now);
        if (written_ < endOf(piece_))
            continue;
        begin_ = written_;
        ++piece_;
        tempo_.reset();
        sped_.clear();
    }
    written_ += static_cast<std::int64_t>(left.size() / s_soundChannels); // silence after the last piece
    return samples;
}

void SoundTrack::readPiece(std::span<float> samples) {
    const EditPiece& piece = edits_.pieces()[piece_];
    if (piece.isHeld() || samples.empty() || !Zulm::isHeardAt(piece.speed.nearest()))
        return;
    if (piece.speed == Rational(1))
        reader_.read(std::llround(piece.start.nearest() * rate()) + written_ - begin_, samples);
    else
        readSped(piece, samples);
}

void SoundTrack::readSped(const EditPiece& piece, std::span<float> samples) {
    constexpr std::int64_t block = 1024;
    const std::int64_t first = std::llround(piece.start.nearest() * rate());
    const std::int64_t end = std::llround(piece.end.nearest() * rate());
    if (!tempo_) {
        tempo_ = std::make_unique<Tempo>(piece.speed.nearest(), rate());
        fed_ = first;
        sped_.assign(static_cast<std::size_t>(std::lround(s_earliness * rate())) * s_soundChannels, 0.0F);
    }
    std::vector<float> more;
    while (sped_.size() < samples.size()) {
        if (tempo_->take(sped_))
            continue;
        if (fed_ > end)
            break;
        const std::int64_t count = std::min(block, end - fed_);
        if (count > 0) {
            more.resize(static_cast<std::size_t>(count) * s_soundChannels);
            reader_.read(fed_, more);
            tempo_->add(more);
            fed_ += count;
        } else {
            tempo_->end();
            ++fed_; // the end is told once
        }
    }
    const std::size_t taken = std::min(samples.size(), sped_.size());
    std::copy_n(sped_.begin(), taken, samples.begin());
    sped_.erase(sped_.begin(), sped_.begin() + static_cast<std::ptrdiff_t>(taken));
}

} // namespace Render
