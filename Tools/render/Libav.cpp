#include "Tools/render/Libav.h"

#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

#include <array>
#include <new>

namespace Render {

using Zulm::Failure;

namespace {

constexpr std::int64_t s_mostPixels = 16384LL * 8640;

template <class Pointer>
Pointer required(Pointer pointer) {
    if (!pointer)
        throw std::bad_alloc();
    return pointer;
}

} // namespace

std::string textOf(int error) {
    std::array<char, AV_ERROR_MAX_STRING_SIZE> text{};
    av_strerror(error, text.data(), text.size());
    return text.data();
}

FramePointer newFrame() {
    return required(FramePointer(av_frame_alloc()));
}

PacketPointer newPacket() {
    return required(PacketPointer(av_packet_alloc()));
}

OpenMovie::OpenMovie(const std::string& path, std::string movieName) : name(std::move(movieName)) {
    AVFormatContext* opened = nullptr;
    const std::string address = "file:" + path; // a name with a colon is no protocol
    if (const int error = avformat_open_input(&opened, address.c_str(), nullptr, nullptr); error < 0)
        throw Failure(fmt::format("{}: its pictures cannot be read: {}", name, textOf(error)));
    input.reset(opened);
    if (const int error = avformat_find_stream_info(opened, nullptr); error < 0)
        throw Failure(fmt::format("{}: its pictures cannot be read: {}", name, textOf(error)));
}

int OpenMovie::bestStream(AVMediaType type) const {
    return av_find_best_stream(input.get(), type, -1, -1, nullptr, 0);
}

CodecPointer OpenMovie::decoderOf(int stream) const {
    const AVStream& source = *input->streams[stream];
    const AVCodec* codec = avcodec_find_decoder(source.codecpar->codec_id);
    if (!codec)
        throw Failure(
            fmt::format("{}: libavcodec cannot decode {}", name, avcodec_get_name(source.codecpar->codec_id)));
    CodecPointer decoder = required(CodecPointer(avcodec_alloc_context3(codec)));
    avcodec_parameters_to_context(decoder.get(), source.codecpar);
    decoder->pkt_timebase = source.time_base;
    decoder->thread_count = 2;
    decoder->max_pixels = s_mostPixels;
    if (const int error = avcodec_open2(decoder.get(), codec, nullptr); error < 0)
        throw Failure(fmt::format("{}: its {} cannot be decoded: {}", name, codec->name, textOf(error)));
    return decoder;
}

} // namespace Render
