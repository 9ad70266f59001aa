#include "Tools/record/VideoWriter.h"

#include "Tools/record/Failure.h"
#include "Tools/record/Releaser.h"

#include <fmt/core.h>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/imgutils.h>
#include <libavutil/opt.h>
}

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>

namespace Recorder {

namespace {

void freeEncoder(AVCodecContext* encoder) {
    avcodec_free_context(&encoder);
}

void freePacket(AVPacket* packet) {
    av_packet_free(&packet);
}

using Encoder = std::unique_ptr<AVCodecContext, Releaser<freeEncoder>>;
using Packet = std::unique_ptr<AVPacket, Releaser<freePacket>>;

std::string textOf(int error) {
    std::array<char, AV_ERROR_MAX_STRING_SIZE> text{};
    av_strerror(error, text.data(), text.size());
    return text.data();
}

/// Prefers the encoder of H.264 that the options are made for.
const AVCodec* encoderOf(const std::string& name) {
    if (name == "h264")
        if (const AVCodec* codec = avcodec_find_encoder_by_name("libx264"))
            return codec;
    if (const AVCodec* codec = avcodec_find_encoder_by_name(name.c_str()))
        return codec->type == AVMEDIA_TYPE_VIDEO ? codec : nullptr;
    const AVCodecDescriptor* descriptor = avcodec_descriptor_get_by_name(name.c_str());
    const bool isVideo = descriptor && descriptor->type == AVMEDIA_TYPE_VIDEO;
    return isVideo ? avcodec_find_encoder(descriptor->id) : nullptr;
}

bool takesPictures(const AVCodec& codec) {
    for (const AVPixelFormat* format = codec.pix_fmts; format && *format != AV_PIX_FMT_NONE; ++format)
        if (*format == AV_PIX_FMT_YUV420P)
            return true;
    return codec.pix_fmts == nullptr;
}

} // namespace

void FrameDeleter::operator()(AVFrame* frame) const {
    av_frame_free(&frame);
}

struct VideoWriter::Output {
    AVFormatContext* format = nullptr;
    AVIOContext* io = nullptr;
    Encoder pictures;
    Encoder sound;
    AVStream* pictureStream = nullptr;
    AVStream* soundStream = nullptr;
    Packet pending; ///< the last picture, whose end is not known

    Output() = default;
    Output(const Output&) = delete;
    Output& operator=(const Output&) = delete;
    ~Output() {
        if (io) {
            av_freep(&io->buffer);
            avio_context_free(&io);
        }
        avformat_free_context(format);
    }
};

void VideoWriter::requireCodec(const std::string& name) {
    const AVCodec* codec = encoderOf(name);
    if (!codec)
        throw Refusal(fmt::format("--codec {}: libavcodec has no such encoder; 'h264' is the default", name));
    const AVOutputFormat* format = av_guess_format("mp4", nullptr, nullptr);
    if (!takesPictures(*codec) || !format || avformat_query_codec(format, codec->id, FF_COMPLIANCE_NORMAL) != 1)
        throw Refusal(fmt::format("--codec {}: cannot be put into an MP4 movie; 'h264' is the default", name));
}

VideoWriter::VideoWriter(const std::filesystem::path& file, const VideoSettings& settings, std::function<bool()> onFull)
    : path_(file), settings_(settings), onFull_(std::move(onFull)),
      file_(open(file.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600)), output_(std::make_unique<Output>()) {
    if (!file_)
        throw Failure(fmt::format("{}: cannot be created: {}", file.string(), std::strerror(errno)));
    openFile();
}

VideoWriter::~VideoWriter() = default;

void VideoWriter::fail(const char* what, int error) const {
    throw Failure(fmt::format("{}: {}: {}", path_.string(), what, textOf(error)), ExitLoss);
}

void VideoWriter::openPictures() {
    const AVCodec* codec = encoderOf(settings_.codec);
    output_->pictures.reset(avcodec_alloc_context3(codec));
    AVCodecContext& encoder = *output_->pictures;
    encoder.width = settings_.width;
    encoder.height = settings_.height;
    encoder.pix_fmt = AV_PIX_FMT_YUV420P;
    encoder.time_base = {1, s_pictureTimescale};
    encoder.framerate = {settings_.fps, 1};
    encoder.gop_size = settings_.fps * 2;
    encoder.max_b_frames = 0; // pictures are written in the order in which they are shown
    encoder.colorspace = AVCOL_SPC_BT709;
    encoder.color_primaries = AVCOL_PRI_BT709;
    encoder.color_trc = AVCOL_TRC_BT709;
    encoder.color_range = AVCOL_RANGE_MPEG;
    encoder.flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
    // Encoders without these options do not know them, which is no error.
    av_opt_set(encoder.priv_data, "preset", "veryfast", 0);
    av_opt_set(encoder.priv_data, "tune", "zerolatency", 0);
    av_opt_set(encoder.priv_data, "crf", std::to_string(settings_.quality).c_str(), 0);
    if (const int error = avcodec_open2(&encoder, codec, nullptr); error < 0)
        throw Refusal(
            fmt::format("--codec {}: the encoder cannot be started with pictures of {}x{} pixels and times of "
                        "1/{} s: {}; 'h264' is the default",
                        settings_.codec, settings_.width, settings_.height, s_pictureTimescale, textOf(error)));
    output_->pictureStream = avformat_new_stream(output_->format, codec);
    output_->pictureStream->time_base = encoder.time_base;
    output_->pictureStream->avg_frame_rate = encoder.framerate;
    avcodec_parameters_from_context(output_->pictureStream->codecpar, &encoder);
}

void VideoWriter::openSound() {
    const AVCodec* codec = avcodec_find_encoder(AV_CODEC_ID_AAC);
    if (!codec)
        throw Failure("libavcodec has no encoder for AAC sound; record without --audio");
    output_->sound.reset(avcodec_alloc_context3(codec));
    AVCodecContext& encoder = *output_->sound;
    encoder.sample_rate = s_soundRate;
    encoder.sample_fmt = AV_SAMPLE_FMT_FLTP;
    encoder.bit_rate = 160'000;
    encoder.time_base = {1, s_soundRate};
    encoder.flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
    av_channel_layout_default(&encoder.ch_layout, s_soundChannels);
    if (const int error = avcodec_open2(&encoder, codec, nullptr); error < 0)
        fail("the encoder of sound cannot be started", error);
    soundTime_ = encoder.initial_padding; // the encoder puts this many samples before them
    output_->soundStream = avformat_new_stream(output_->format, codec);
    output_->soundStream->time_base = encoder.time_base;
    avcodec_parameters_from_context(output_->soundStream->codecpar, &encoder);
}

void VideoWriter::openFile() {
    constexpr int bufferSize = 1 << 16;
    if (const int error = avformat_alloc_output_context2(&output_->format, nullptr, "mp4", nullptr); error < 0)
        fail("the movie cannot be begun", error);
    openPictures();
    if (settings_.hasSound)
        openSound();
    const auto write = [](void* self, std::uint8_t* bytes, int size) {
        return static_cast<VideoWriter*>(self)->writeBytes(bytes, size);
    };
    auto* buffer = static_cast<unsigned char*>(av_malloc(bufferSize));
    output_->io = avio_alloc_context(buffer, bufferSize, 1, this, nullptr, write, nullptr);
    output_->format->pb = output_->io;
    output_->format->flags |= AVFMT_FLAG_CUSTOM_IO;
    output_->format->avoid_negative_ts = 0; // nothing is moved in time
    AVDictionary* options = nullptr;
    av_dict_set(&options, "movflags", "empty_moov+default_base_moof+frag_custom+skip_trailer", 0);
    av_dict_set(&options, "video_track_timescale", std::to_string(s_pictureTimescale).c_str(), 0);
    av_dict_set(&options, "movie_timescale", std::to_string(s_pictureTimescale).c_str(), 0);
    const int error = avformat_write_header(output_->format, &options);
    av_dict_free(&options);
    if (error < 0)
        fail("the movie cannot be begun", error);
    avio_flush(output_->io);
}

FramePointer VideoWriter::emptyPicture() const {
    FramePointer picture(av_frame_alloc());
    picture->format = AV_PIX_FMT_YUV420P;
    picture->width = settings_.width;
    picture->height = settings_.height;
    picture->color_range = AVCOL_RANGE_MPEG;
    picture->colorspace = AVCOL_SPC_BT709;
    if (const int error = av_frame_get_buffer(picture.get(), 0); error < 0)
        fail("there is no memory for a picture", error);
    return picture;
}

void VideoWriter::writePicture(AVFrame& picture, std::int64_t time) {
    picture.pts = time;
    encode(*output_->pictures, *output_->pictureStream, &picture);
}

void VideoWriter::writeSound(std::span<const float> samples) {
    sound_.insert(sound_.end(), samples.begin(), samples.end());
    const auto frameSize = static_cast<std::size_t>(output_->sound->frame_size);
    std::size_t taken = 0;
    for (; sound_.size() - taken >= frameSize * s_soundChannels; taken += frameSize * s_soundChannels) {
        FramePointer frame(av_frame_alloc());
        frame->format = AV_SAMPLE_FMT_FLTP;
        frame->nb_samples = output_->sound->frame_size;
        frame->sample_rate = s_soundRate;
        av_channel_layout_default(&frame->ch_layout, s_soundChannels);
        if (const int error = av_frame_get_buffer(frame.get(), 0); error < 0)
            fail("there is no memory for sound", error);
        for (std::size_t channel = 0; channel < s_soundChannels; ++channel) {
            std::uint8_t* plane = frame->data[channel];
            for (std::size_t i = 0; i < frameSize; ++i)
                std::memcpy(plane + i * sizeof(float), &sound_[taken + i * s_soundChannels + channel], sizeof(float));
        }
        frame->pts = soundTime_;
        soundTime_ += output_->sound->frame_size;
        encode(*output_->sound, *output_->soundStream, frame.get());
    }
    sound_.erase(sound_.begin(), sound_.begin() + static_cast<std::ptrdiff_t>(taken));
}

void VideoWriter::encode(AVCodecContext& encoder, AVStream& stream, const AVFrame* frame) {
    if (const int error = avcodec_send_frame(&encoder, frame); error < 0)
        fail("encoding failed", error);
    for (;;) {
        Packet packet(av_packet_alloc());
        const int error = avcodec_receive_packet(&encoder, packet.get());
        if (error == AVERROR(EAGAIN) || error == AVERROR_EOF)
            return;
        if (error < 0)
            fail("encoding failed", error);
        av_packet_rescale_ts(packet.get(), encoder.time_base, stream.time_base);
        packet->stream_index = stream.index;
        const std::lock_guard lock(mutex_);
        if (&stream != output_->pictureStream) {
            writePacket(*packet);
            continue;
        }
        writePendingPicture(packet->pts);
        output_->pending = std::move(packet);
    }
}

void VideoWriter::writePendingPicture(std::int64_t nextTime) {
    if (!output_->pending)
        return;
    const Packet packet = std::move(output_->pending);
    packet->duration = nextTime - packet->pts;
    writePacket(*packet);
    ++frames_;
    const bool isFirst = frames_ == 1; // there is something to save from the beginning
    if (isFirst || static_cast<double>(nextTime - fragmentStart_) >= s_fragmentSeconds * s_pictureTimescale) {
        endFragment();
        fragmentStart_ = nextTime;
    }
}

void VideoWriter::writePacket(AVPacket& packet) {
    if (const int error = av_write_frame(output_->format, &packet); error < 0)
        fail("the movie cannot be written", error);
}

void VideoWriter::endFragment() {
    if (const int error = av_write_frame(output_->format, nullptr); error < 0)
        fail("the movie cannot be written", error);
    avio_flush(output_->io);
    if (output_->io->error < 0)
        fail("the movie cannot be written", output_->io->error);
}

void VideoWriter::finish(std::int64_t end) {
    if (output_->sound) {
        const std::size_t whole = static_cast<std::size_t>(output_->sound->frame_size) * s_soundChannels;
        if (!sound_.empty())
            writeSound(std::vector<float>(whole - sound_.size()));
        encode(*output_->sound, *output_->soundStream, nullptr);
    }
    encode(*output_->pictures, *output_->pictureStream, nullptr);
    const std::lock_guard lock(mutex_);
    if (output_->pending)
        writePendingPicture(std::max(end, output_->pending->pts + 1));
    endFragment();
    if (const int error = av_write_trailer(output_->format); error < 0)
        fail("the movie cannot be ended", error);
}

int VideoWriter::writeBytes(const std::uint8_t* bytes, int size) {
    int done = 0;
    while (done < size) {
        const ssize_t count = ::write(file_.get(), bytes + done, static_cast<std::size_t>(size - done));
        const int error = errno;
        if (count >= 0)
            done += static_cast<int>(count);
        else if (error != EINTR && !((error == ENOSPC || error == EDQUOT) && onFull_ && onFull_()))
            return AVERROR(error);
    }
    bytes_ += static_cast<std::uint64_t>(size);
    return size;
}

} // namespace Recorder
