#include "Tools/render/Gif.h"

#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

extern "C" {
#include <libavfilter/buffersink.h>
#include <libavfilter/buffersrc.h>
#include <libavutil/opt.h>
}

#include <cmath>
#include <cstring>
#include <utility>

namespace Render {

using Zulm::Failure;

namespace {

constexpr int s_ticks = 100; ///< in a second, as GIF counts

FramePointer rgbFrame(const YuvPicture& picture, std::int64_t time) {
    const std::vector<std::uint32_t> pixels = rgbOf(picture);
    FramePointer frame = newFrame();
    frame->format = AV_PIX_FMT_BGRA;
    frame->width = picture.width();
    frame->height = picture.height();
    frame->pts = time;
    if (av_frame_get_buffer(frame.get(), 0) < 0)
        throw std::bad_alloc();
    const auto row = static_cast<std::size_t>(picture.width());
    for (int y = 0; y < picture.height(); ++y)
        std::memcpy(frame->data[0] + static_cast<std::ptrdiff_t>(y) * frame->linesize[0],
                    pixels.data() + static_cast<std::size_t>(y) * row, row * sizeof(std::uint32_t));
    return frame;
}

/// A graph with up to two inputs of pictures and one output.
class PictureGraph {
public:
    PictureGraph() : graph_(avfilter_graph_alloc()) {}

    void parse(const std::string& filters) {
        AVFilterInOut* inputs = nullptr;
        AVFilterInOut* outputs = nullptr;
        const bool isFine = avfilter_graph_parse2(graph_.get(), filters.c_str(), &inputs, &outputs) >= 0 &&
                            avfilter_graph_config(graph_.get(), nullptr) >= 0;
        avfilter_inout_free(&inputs);
        avfilter_inout_free(&outputs);
        if (!isFine)
            throw Failure("libavfilter cannot make a palette, because it lacks palettegen or paletteuse; render an MP4 "
                          "movie instead");
    }

    AVFilterContext* filter(const char* name) const { return avfilter_graph_get_filter(graph_.get(), name); }

private:
    GraphPointer graph_;
};

/// Hands a frame to an input of a graph; null ends the input.
void feed(AVFilterContext* input, AVFrame* frame) {
    if (const int error = av_buffersrc_add_frame(input, frame); error < 0)
        throw Failure(
            fmt::format("the colours of the film cannot be reduced: {}; render an MP4 movie instead", textOf(error)));
}

std::string bufferFilter(const char* name, int width, int height) {
    return fmt::format("buffer@{}=video_size={}x{}:pix_fmt=bgra:time_base=1/{}:pixel_aspect=1/1", name, width, height,
                       s_ticks);
}

} // namespace

struct GifPalette::Graph : PictureGraph {
    std::int64_t count = 0;
};

GifPalette::GifPalette(int width, int height) : graph_(std::make_unique<Graph>()) {
    graph_->parse(bufferFilter("in", width, height) +
                  ",palettegen=stats_mode=full:reserve_transparent=1,buffersink@out");
}

GifPalette::~GifPalette() = default;

void GifPalette::add(const YuvPicture& picture) {
    const FramePointer frame = rgbFrame(picture, graph_->count++);
    feed(graph_->filter("buffer@in"), frame.get());
    const FramePointer none = newFrame();
    av_buffersink_get_frame(graph_->filter("buffersink@out"), none.get()); // lets the graph work
}

FramePointer GifPalette::take() {
    feed(graph_->filter("buffer@in"), nullptr);
    FramePointer palette = newFrame();
    if (const int error = av_buffersink_get_frame(graph_->filter("buffersink@out"), palette.get()); error < 0)
        throw Failure(fmt::format("libavfilter has made no palette: {}; render an MP4 movie instead", textOf(error)));
    return palette;
}

struct GifWriter::Output {
    PictureGraph graph;
    CodecPointer encoder;
    AVFormatContext* format = nullptr;
    AVStream* stream = nullptr;
    std::int64_t count = 0;

    Output() = default;
    Output(const Output&) = delete;
    Output& operator=(const Output&) = delete;
    ~Output() {
        if (format && format->pb)
            avio_closep(&format->pb);
        avformat_free_context(format);
    }
};

void GifWriter::fail(const char* what, int error) const {
    throw Failure(fmt::format("{}: {}: {}; nothing was written", name_, what, textOf(error)));
}

GifWriter::GifWriter(const std::string& path, std::string name, int width, int height, double fps, FramePointer palette)
    : name_(std::move(name)), fps_(fps), output_(std::make_unique<Output>()) {
    output_->graph.parse(bufferFilter("in", width, height) + "[pictures];" +
                         bufferFilter("colours", palette->width, palette->height) +
                         "[palette];[pictures][palette]paletteuse=dither=bayer:bayer_scale=4:diff_mode=rectangle,"
                         "buffersink@out");
    palette->pts = 0;
    feed(output_->graph.filter("buffer@colours"), palette.get());
    feed(output_->graph.filter("buffer@colours"), nullptr);
    const AVCodec* codec = avcodec_find_encoder(AV_CODEC_ID_GIF);
    if (!codec || avformat_alloc_output_context2(&output_->format, nullptr, "gif", nullptr) < 0)
        throw Failure("libavcodec has no encoder for GIF; render an MP4 movie instead");
    output_->encoder.reset(avcodec_alloc_context3(codec));
    AVCodecContext& encoder = *output_->encoder;
    encoder.width = width;
    encoder.height = height;
    encoder.pix_fmt = AV_PIX_FMT_PAL8;
    encoder.time_base = {1, s_ticks};
    if (const int error = avcodec_open2(&encoder, codec, nullptr); error < 0)
        fail("the encoder cannot be started", error);
    output_->stream = avformat_new_stream(output_->format, codec);
    output_->stream->time_base = encoder.time_base;
    avcodec_parameters_from_context(output_->stream->codecpar, &encoder);
    const std::string address = "file:" + path;
    int error = avio_open(&output_->format->pb, address.c_str(), AVIO_FLAG_WRITE);
    if (error >= 0)
        error = avformat_write_header(output_->format, nullptr);
    if (error < 0)
        fail("the film cannot be written", error);
}

GifWriter::~GifWriter() = default;

void GifWriter::writePicture(const YuvPicture& picture) {
    const auto time = std::llround(static_cast<double>(output_->count++) * s_ticks / fps_);
    const FramePointer frame = rgbFrame(picture, time);
    feed(output_->graph.filter("buffer@in"), frame.get());
    drain();
}

void GifWriter::drain() {
    for (;;) {
        const FramePointer frame = newFrame();
        if (av_buffersink_get_frame(output_->graph.filter("buffersink@out"), frame.get()) < 0)
            return;
        encode(frame.get());
    }
}

void GifWriter::encode(const AVFrame* frame) {
    if (const int error = avcodec_send_frame(output_->encoder.get(), frame); error < 0)
        fail("encoding failed", error);
    for (;;) {
        const PacketPointer packet = newPacket();
        const int error = avcodec_receive_packet(output_->encoder.get(), packet.get());
        if (error < 0)
            return;
        av_packet_rescale_ts(packet.get(), output_->encoder->time_base, output_->stream->time_base);
        if (const int written = av_interleaved_write_frame(output_->format, packet.get()); written < 0)
            fail("the film cannot be written", written);
    }
}

void GifWriter::finish() {
    feed(output_->graph.filter("buffer@in"), nullptr);
    drain();
    encode(nullptr);
    int error = av_write_trailer(output_->format);
    if (error >= 0)
        error = avio_closep(&output_->format->pb);
    if (error < 0)
        fail("the film cannot be ended", error);
}

} // namespace Render
