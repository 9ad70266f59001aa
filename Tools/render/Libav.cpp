#include "Tools/render/Libav.h"

#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

#include <array>
#include <new>

namespace Render {

using Zulm::Failure;

namespace {

constexpr std::int64_t s_mostPixels = 16384LL * 8640;

/// The containers of recordings. A playlist that is called a movie would read files of other people into the film.
constexpr auto s_containers = "mov,mp4,m4a,3gp,3g2,mj2,avi,wav";

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

std::int64_t durationOf(const AVFrame& frame) {
#if LIBAVUTIL_VERSION_INT >= AV_VERSION_INT(57, 30, 100)
    return frame.duration;
#else
    return frame.pkt_duration;
#endif
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
    AVDictionary* options = nullptr;
    av_dict_set(&options, "format_whitelist", s_containers, 0);
    av_dict_set(&options, "protocol_whitelist", "file", 0);
    const int error = avformat_open_input(&opened, address.c_str(), nullptr, &options);
    av_dict_free(&options);
    if (error < 0)
        throw Failure(fmt::format("{}: its pictures cannot be read: {}", name, textOf(error)));
    input.reset(opened);
    if (const int unknown = avformat_find_stream_info(opened, nullptr); unknown < 0)
        throw Failure(fmt::format("{}: its pictures cannot be read: {}", name, textOf(unknown)));
}

int OpenMovie::bestStream(AVMediaType type) const {
    return av_find_best_stream(input.get(), type, -1, -1, nullptr, 0);
}

CodecPointer OpenMovie::decoderOf(int stream) const {
    const AVStream& source = *input->streams[stream];
    const char* remedy = source.codecpar->codec_type == AVMEDIA_TYPE_AUDIO ? "; --no-sound leaves it out" : "";
    const AVCodec* codec = avcodec_find_decoder(source.codecpar->codec_id);
    if (!codec)
        throw Failure(fmt::format("{}: libavcodec cannot decode {}{}", name,
                                  avcodec_get_name(source.codecpar->codec_id), remedy));
    CodecPointer decoder = required(CodecPointer(avcodec_alloc_context3(codec)));
    avcodec_parameters_to_context(decoder.get(), source.codecpar);
    decoder->pkt_timebase = source.time_base;
    decoder->thread_count = 2;
    decoder->max_pixels = s_mostPixels;
    if (const int error = avcodec_open2(decoder.get(), codec, nullptr); error < 0)
        throw Failure(fmt::format("{}: its {} cannot be decoded: {}{}", name, codec->name, textOf(error), remedy));
    return decoder;
}

} // namespace Render
