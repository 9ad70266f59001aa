#include "Tools/render/FilmWriter.h"

#include "Tools/zulm/Command.h"
#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

extern "C" {
#include <libavutil/channel_layout.h>
#include <libavutil/opt.h>
}

#include <algorithm>
#include <cmath>
#include <cstring>
#include <vector>

namespace Render {

using Zulm::Failure;

namespace {

constexpr int s_soundBits = 192'000;
constexpr int s_channels = 2;

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

struct FilmWriter::Output {
    AVFormatContext* format = nullptr;
    CodecPointer pictures;
    CodecPointer sound;
    AVStream* pictureStream = nullptr;
    AVStream* soundStream = nullptr;
    std::vector<float> samples; ///< less than a frame of the encoder
    std::int64_t soundTime = 0;
    std::int64_t pictureTime = 0;
    bool isBegun = false;

    Output() = default;
    Output(const Output&) = delete;
    Output& operator=(const Output&) = delete;
    ~Output() {
        if (format && format->pb)
            avio_closep(&format->pb);
        avformat_free_context(format);
    }
};

void FilmWriter::requireCodec(const std::string& name) {
    const AVCodec* codec = encoderOf(name);
    if (!codec)
        throw Failure(fmt::format("--codec {}: libavcodec has no such encoder; 'h264' is the default", name));
    const AVOutputFormat* format = av_guess_format("mp4", nullptr, nullptr);
    if (!takesPictures(*codec) || !format || avformat_query_codec(format, codec->id, FF_COMPLIANCE_NORMAL) != 1)
        throw Failure(fmt::format("--codec {}: cannot be put into an MP4 movie; 'h264' is the default", name));
}

void FilmWriter::fail(const char* what, int error) const {
    throw Failure(fmt::format("{}: {}: {}; nothing was written", name_, what, textOf(error)));
}

FilmWriter::FilmWriter(const std::string& path, const std::string& name, const FilmSettings& settings, int width,
                       int height, ColourMatrix matrix)
    : name_(name), settings_(settings), output_(std::make_unique<Output>()) {
    if (const int error = avformat_alloc_output_context2(&output_->format, nullptr, "mp4", nullptr); error < 0)
        fail("the film cannot be begun", error);
    openPictures(width, height, matrix);
    if (settings.soundRate > 0)
        openSound();
    const std::string address = "file:" + path;
    if (const int error = avio_open(&output_->format->pb, address.c_str(), AVIO_FLAG_WRITE); error < 0)
        fail("the film cannot be written", error);
    AVDictionary* options = nullptr;
    av_dict_set(&options, "video_track_timescale", "90000", 0);
    const int error = avformat_write_header(output_->format, &options);
    av_dict_free(&options);
    if (error < 0)
        fail("the film cannot be begun", error);
}

FilmWriter::~FilmWriter() = default;

void FilmWriter::openPictures(int width, int height, ColourMatrix matrix) {
    const AVCodec* codec = encoderOf(settings_.codec);
    output_->pictures.reset(avcodec_alloc_context3(codec));
    AVCodecContext& encoder = *output_->pictures;
    encoder.width = width;
    encoder.height = height;
    encoder.pix_fmt = AV_PIX_FMT_YUV420P;
    encoder.framerate = av_d2q(settings_.fps, 100'000);
    encoder.time_base = av_inv_q(encoder.framerate);
    encoder.gop_size = std::max(1, static_cast<int>(std::lround(settings_.fps * 4)));
    const bool isBT709 = matrix == ColourMatrix::BT709;
    encoder.colorspace = isBT709 ? AVCOL_SPC_BT709 : AVCOL_SPC_SMPTE170M;
    encoder.color_primaries = isBT709 ? AVCOL_PRI_BT709 : AVCOL_PRI_SMPTE170M;
    encoder.color_trc = isBT709 ? AVCOL_TRC_BT709 : AVCOL_TRC_SMPTE170M;
    encoder.color_range = AVCOL_RANGE_MPEG;
    encoder.chroma_sample_location = AVCHROMA_LOC_LEFT;
    if (output_->format->oformat->flags & AVFMT_GLOBALHEADER)
        encoder.flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
    encoder.thread_count = 0;
    av_opt_set(encoder.priv_data, "preset", "veryfast", 0); // not all have it
    setQuality(encoder);
    if (const int error = avcodec_open2(&encoder, codec, nullptr); error < 0)
        fail("the encoder of pictures cannot be started", error);
    output_->pictureStream = avformat_new_stream(output_->format, codec);
    output_->pictureStream->time_base = encoder.time_base;
    output_->pictureStream->avg_frame_rate = encoder.framerate;
    avcodec_parameters_from_context(output_->pictureStream->codecpar, &encoder);
}

void FilmWriter::setQuality(AVCodecContext& encoder) const {
    encoder.bit_rate = 0;
    if (av_opt_set(encoder.priv_data, "crf", std::to_string(settings_.quality).c_str(), 0) >= 0)
        return;
    constexpr int worst = 51;
    constexpr int steps = 30; // other encoders count from 1 to 31
    encoder.flags |= AV_CODEC_FLAG_QSCALE;
    encoder.global_quality = FF_QP2LAMBDA * (1 + settings_.quality * steps / worst);
    if (settings_.isQualityAsked)
        Zulm::warn(
            fmt::format("--quality: the encoder {} has no constant rate factor; its own scale of quality is used",
                        settings_.codec));
}

void FilmWriter::openSound() {
    const AVCodec* codec = avcodec_find_encoder(AV_CODEC_ID_AAC);
    if (!codec)
        throw Failure("libavcodec has no encoder for AAC sound; render with --no-sound");
    output_->sound.reset(avcodec_alloc_context3(codec));
    AVCodecContext& encoder = *output_->sound;
    encoder.sample_rate = settings_.soundRate;
    encoder.sample_fmt = AV_SAMPLE_FMT_FLTP;
    encoder.bit_rate = s_soundBits;
    encoder.time_base = {1, settings_.soundRate};
    encoder.flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
    av_channel_layout_default(&encoder.ch_layout, s_channels);
    if (const int error = avcodec_open2(&encoder, codec, nullptr); error < 0)
        fail("the encoder of sound cannot be started", error);
    output_->soundStream = avformat_new_stream(output_->format, codec);
    output_->soundStream->time_base = encoder.time_base;
    avcodec_parameters_from_context(output_->soundStream->codecpar, &encoder);
}

void FilmWriter::encode(AVCodecContext& encoder, AVStream& stream, const AVFrame* frame) {
    if (const int error = avcodec_send_frame(&encoder, frame); error < 0)
        fail("encoding failed", error);
    for (;;) {
        const PacketPointer packet = newPacket();
        const int error = avcodec_receive_packet(&encoder, packet.get());
        if (error == AVERROR(EAGAIN) || error == AVERROR_EOF)
            return;
        if (error < 0)
            fail("encoding failed", error);
        if (&stream == output_->pictureStream && packet->duration == 0)
            packet->duration = 1;
        av_packet_rescale_ts(packet.get(), encoder.time_base, stream.time_base);
        packet->stream_index = stream.index;
        if (const int written = av_interleaved_write_frame(output_->format, packet.get()); written < 0)
            fail("the film cannot be written", written);
    }
}

void FilmWriter::writePicture(const YuvPicture& picture) {
    const FramePointer frame(av_frame_clone(&picture.frame()));
    if (!frame)
        throw std::bad_alloc();
    frame->pts = output_->pictureTime++;
    frame->pict_type = AV_PICTURE_TYPE_NONE;
    frame->quality = output_->pictures->global_quality; // of encoders without a constant rate factor
    encode(*output_->pictures, *output_->pictureStream, frame.get());
}

void FilmWriter::writeSound(std::span<const float> samples) {
    std::vector<float>& waiting = output_->samples;
    waiting.insert(waiting.end(), samples.begin(), samples.end());
    const auto frameSize = static_cast<std::size_t>(output_->sound->frame_size);
    std::size_t taken = 0;
    for (; waiting.size() - taken >= frameSize * s_channels; taken += frameSize * s_channels) {
        const FramePointer frame = newFrame();
        frame->format = AV_SAMPLE_FMT_FLTP;
        frame->nb_samples = output_->sound->frame_size;
        frame->sample_rate = settings_.soundRate;
        av_channel_layout_default(&frame->ch_layout, s_channels);
        if (av_frame_get_buffer(frame.get(), 0) < 0)
            throw std::bad_alloc();
        for (std::size_t channel = 0; channel < s_channels; ++channel)
            for (std::size_t i = 0; i < frameSize; ++i)
                std::memcpy(frame->data[channel] + i * sizeof(float), &waiting[taken + i * s_channels + channel],
                            sizeof(float));
        frame->pts = output_->soundTime;
        output_->soundTime += output_->sound->frame_size;
        encode(*output_->sound, *output_->soundStream, frame.get());
    }
    waiting.erase(waiting.begin(), waiting.begin() + static_cast<std::ptrdiff_t>(taken));
}

void FilmWriter::finish() {
    if (output_->sound) {
        const std::size_t whole = static_cast<std::size_t>(output_->sound->frame_size) * s_channels;
        if (!output_->samples.empty())
            writeSound(std::vector<float>(whole - output_->samples.size()));
        encode(*output_->sound, *output_->soundStream, nullptr);
    }
    encode(*output_->pictures, *output_->pictureStream, nullptr);
    if (const int error = av_write_trailer(output_->format); error < 0)
        fail("the film cannot be ended", error);
    const int error = avio_closep(&output_->format->pb);
    if (error < 0)
        fail("the film cannot be written", error);
}

} // namespace Render
