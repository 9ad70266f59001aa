#pragma once

// Objects of libavformat, libavcodec and their sisters, which release themselves.

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavfilter/avfilter.h>
#include <libavformat/avformat.h>
#include <libavutil/frame.h>
#include <libswscale/swscale.h>
}

#include <cstdint>
#include <memory>
#include <string>

namespace Render {

template <auto release>
struct Releaser {
    template <class T>
    void operator()(T* object) const {
        if constexpr (requires { release(&object); })
            release(&object);
        else
            release(object);
    }
};

using FramePointer = std::unique_ptr<AVFrame, Releaser<av_frame_free>>;
using PacketPointer = std::unique_ptr<AVPacket, Releaser<av_packet_free>>;
using CodecPointer = std::unique_ptr<AVCodecContext, Releaser<avcodec_free_context>>;
using InputPointer = std::unique_ptr<AVFormatContext, Releaser<avformat_close_input>>;
using ScalerPointer = std::unique_ptr<SwsContext, Releaser<sws_freeContext>>;
using GraphPointer = std::unique_ptr<AVFilterGraph, Releaser<avfilter_graph_free>>;

/// Returns what an error of these libraries is called.
std::string textOf(int error);

/// Returns how long a picture is shown, in units of its stream.
std::int64_t durationOf(const AVFrame& frame);

/// Return new objects. Throw `std::bad_alloc`.
///@{
FramePointer newFrame();
PacketPointer newPacket();
///@}

/// A movie that is read, without its streams.
struct OpenMovie {
    InputPointer input;
    std::string name; ///< what messages call it

    /// Throws `Zulm::Failure`.
    OpenMovie(const std::string& path, std::string name);

    /// Returns the place of the best stream of a type, or a negative number.
    int bestStream(AVMediaType type) const;

    /// Returns a decoder for a stream. Throws `Zulm::Failure`.
    CodecPointer decoderOf(int stream) const;
};

} // namespace Render
