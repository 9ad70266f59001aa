#include "Tools/render/PictureReader.h"

#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

extern "C" {
#include <libavutil/pixdesc.h>
}

#include <algorithm>
#include <cmath>
#include <utility>

namespace Render {

using Zulm::Failure;

namespace {

/// Movies round their times by less.
constexpr double s_rounding = 0.0005;

/// A time that is farther ahead is looked for by a seek, in seconds.
constexpr double s_farAhead = 4;

/// A picture that begins later is damage, in seconds.
constexpr double s_latest = 1e7;

/// Returns what the numbers of a frame mean, as players guess it if the frame does not say it.
ColourMatrix matrixOf(const AVFrame& frame) {
    switch (frame.colorspace) {
    case AVCOL_SPC_BT470BG:
    case AVCOL_SPC_SMPTE170M:
    case AVCOL_SPC_FCC: return ColourMatrix::BT601;
    case AVCOL_SPC_UNSPECIFIED: return frame.height > 576 ? ColourMatrix::BT709 : ColourMatrix::BT601;
    default: return ColourMatrix::BT709;
    }
}

bool isFullRange(const AVFrame& frame) {
    return frame.color_range == AVCOL_RANGE_JPEG || frame.format == AV_PIX_FMT_YUVJ420P ||
           frame.format == AV_PIX_FMT_YUVJ422P || frame.format == AV_PIX_FMT_YUVJ444P;
}

/// Whether a frame needs no conversion.
bool isPlain(const AVFrame& frame) {
    return frame.format == AV_PIX_FMT_YUV420P && !isFullRange(frame) && frame.colorspace != AVCOL_SPC_BT2020_NCL &&
           frame.colorspace != AVCOL_SPC_BT2020_CL;
}

const int* tableOf(const AVFrame& frame) {
    if (frame.colorspace == AVCOL_SPC_BT2020_NCL || frame.colorspace == AVCOL_SPC_BT2020_CL)
        return sws_getCoefficients(SWS_CS_BT2020);
    return sws_getCoefficients(matrixOf(frame) == ColourMatrix::BT709 ? SWS_CS_ITU709 : SWS_CS_ITU601);
}

} // namespace

PictureReader::PictureReader(const std::string& path, const std::string& name)
    : movie_(path, name), stream_(movie_.bestStream(AVMEDIA_TYPE_VIDEO)) {
    if (stream_ < 0)
        throw Failure(fmt::format("{}: has no pictures; there is nothing to draw on", name));
    for (unsigned i = 0; i < movie_.input->nb_streams; ++i)
        if (static_cast<int>(i) != stream_)
            movie_.input->streams[i]->discard = AVDISCARD_ALL;
    const AVStream& stream = *movie_.input->streams[stream_];
    decoder_ = movie_.decoderOf(stream_);
    turn_ = turnOf(stream);
    width_ = stream.codecpar->width;
    height_ = stream.codecpar->height;
    constexpr int most = 16384;
    if (width_ < 1 || height_ < 1 || width_ > most || height_ > most)
        throw Failure(fmt::format("{}: its pictures of {} x {} pixels cannot be drawn on; the most is {} a side", name,
                                  width_, height_, most));
    const AVRational aspect = av_guess_sample_aspect_ratio(movie_.input.get(), movie_.input->streams[stream_], nullptr);
    if (aspect.num > 0 && aspect.den > 0)
        pixelAspect_ = std::clamp(av_q2d(aspect), 0.1, 10.0);
    if (turn_.swapsSides()) {
        std::swap(width_, height_);
        pixelAspect_ = 1 / pixelAspect_;
    }
}

std::optional<double> PictureReader::duration() const {
    if (movie_.input->duration <= 0)
        return std::nullopt;
    return static_cast<double>(movie_.input->duration) / AV_TIME_BASE;
}

double PictureReader::secondsOf(const AVFrame& frame) const {
    const std::int64_t time = frame.best_effort_timestamp != AV_NOPTS_VALUE ? frame.best_effort_timestamp : frame.pts;
    const double seconds = static_cast<double>(time) * av_q2d(movie_.input->streams[stream_]->time_base);
    return time == AV_NOPTS_VALUE || std::abs(seconds) > s_latest ? lastTime_ : seconds;
}

bool PictureReader::send() {
    const PacketPointer packet = newPacket();
    for (;;) {
        const int error = av_read_frame(movie_.input.get(), packet.get());
        if (error < 0) {
            isFlushing_ = true;
            isUnreadable_ = error != AVERROR_EOF;
            return avcodec_send_packet(decoder_.get(), nullptr) >= 0;
        }
        if (packet->stream_index == stream_) {
            avcodec_send_packet(decoder_.get(), packet.get()); // what is damaged shows as a picture that is missing
            return true;
        }
        av_packet_unref(packet.get());
    }
}

std::optional<PictureReader::Decoded> PictureReader::next() {
    Decoded decoded{newFrame(), 0};
    for (;;) {
        const int error = avcodec_receive_frame(decoder_.get(), decoded.frame.get());
        if (error >= 0) {
            decoded.time = secondsOf(*decoded.frame);
            lastTime_ = decoded.time;
            lastEnd_ = lastTime_ + static_cast<double>(durationOf(*decoded.frame)) *
                                       av_q2d(movie_.input->streams[stream_]->time_base);
            return decoded;
        }
        if (error == AVERROR_EOF || isFlushing_ || (!send() && isFlushing_))
            return std::nullopt;
    }
}

void PictureReader::seek(double time) {
    const AVStream& stream = *movie_.input->streams[stream_];
    const auto target = static_cast<std::int64_t>(std::floor(time / av_q2d(stream.time_base)));
    if (av_seek_frame(movie_.input.get(), stream_, target, AVSEEK_FLAG_BACKWARD) < 0 &&
        av_seek_frame(movie_.input.get(), stream_, 0, AVSEEK_FLAG_BACKWARD) < 0) {
        cannotSeek_ = true;
        return;
    }
    avcodec_flush_buffers(decoder_.get());
    current_.reset();
    following_.reset();
    isAtEnd_ = false;
    isFlushing_ = false;
}

void PictureReader::noteEnd(double time) {
    constexpr double least = 0.5; // seconds; many movies tell a little more than they have
    const AVStream& stream = *movie_.input->streams[stream_];
    double end = 0;
    if (stream.duration > 0) {
        const std::int64_t start = stream.start_time == AV_NOPTS_VALUE ? 0 : stream.start_time;
        end = static_cast<double>(start) * av_q2d(stream.time_base) +
              static_cast<double>(stream.duration) * av_q2d(stream.time_base);
    }
    const bool shouldGoOn = isUnreadable_ || lastEnd_ + least < end;
    if (shouldGoOn && time > lastEnd_ + least)
        endedEarly_ = true;
}

void PictureReader::advance(double time) {
    for (;;) {
        if (!following_ && !isAtEnd_) {
            following_ = next();
            isAtEnd_ = !following_;
        }
        if (!following_)
            noteEnd(time);
        if (!following_ || (current_ && following_->time > time + s_rounding))
            return;
        current_ = std::move(following_);
        following_.reset();
        isPrepared_ = false;
    }
}

const YuvPicture& PictureReader::at(double time) {
    const bool isEarlier = current_ && current_->time > time + s_rounding;
    const bool isFar = following_ && time - following_->time > s_farAhead;
    if (isEarlier || isFar)
        seek(time);
    advance(time);
    for (double earlier = 1;
         !cannotSeek_ && current_ && current_->time > time + s_rounding && time > 0 && earlier < 1e6; earlier *= 8) {
        const double found = current_->time; // some containers seek to a place after the time
        seek(std::max(0.0, time - earlier));
        advance(time);
        if (time - earlier <= 0 || !current_ || current_->time > found)
            break;
    }
    if (!current_ && number_ == 0)
        throw Failure(fmt::format("{}: none of its pictures can be decoded; does a player show it?", movie_.name));
    if (!current_) { // the rest is damaged, and the last picture stays
        endedEarly_ = true;
        return picture_;
    }
    if (!isPrepared_) {
        picture_ = prepared(*current_->frame);
        isPrepared_ = true;
        ++number_;
    }
    return picture_;
}

YuvPicture PictureReader::prepared(const AVFrame& frame) {
    const bool isTurned = turn_.swapsSides();
    const int width = isTurned ? height_ : width_;
    const int height = isTurned ? width_ : height_;
    YuvPicture picture;
    if (isPlain(frame) && frame.width == width && frame.height == height) {
        FramePointer shared(av_frame_clone(&frame));
        if (!shared)
            throw std::bad_alloc();
        picture = YuvPicture(std::move(shared), matrixOf(frame));
    } else {
        const ColourMatrix matrix = matrixOf(frame);
        picture = YuvPicture(width, height, matrix);
        scaler_.reset(sws_getCachedContext(scaler_.release(), frame.width, frame.height,
                                           static_cast<AVPixelFormat>(frame.format), width, height, AV_PIX_FMT_YUV420P,
                                           SWS_BICUBIC | SWS_ACCURATE_RND, nullptr, nullptr, nullptr));
        if (!scaler_)
            throw Failure(fmt::format("{}: its pictures are of a format that cannot be converted: {}", movie_.name,
                                      av_get_pix_fmt_name(static_cast<AVPixelFormat>(frame.format))));
        sws_setColorspaceDetails(scaler_.get(), tableOf(frame), isFullRange(frame) ? 1 : 0,
                                 sws_getCoefficients(matrix == ColourMatrix::BT709 ? SWS_CS_ITU709 : SWS_CS_ITU601), 0,
                                 0, 1 << 16, 1 << 16);
        const AVFrame& target = picture.frame();
        sws_scale(scaler_.get(), frame.data, frame.linesize, 0, frame.height, target.data, target.linesize);
    }
    return turn_.quarters == 0 && !turn_.isMirrored ? picture : turned(picture, turn_);
}

} // namespace Render
