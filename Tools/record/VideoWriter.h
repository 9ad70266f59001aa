#pragma once

// Encodes pictures and sound and writes them as a movie of short fragments, so that what was written can be played
// whatever happens next.

#include "Tools/record/FileHandle.h"

#include <atomic>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <memory>
#include <mutex>
#include <span>
#include <string>
#include <vector>

struct AVCodecContext;
struct AVFormatContext;
struct AVFrame;
struct AVIOContext;
struct AVPacket;
struct AVStream;

namespace Recorder {

struct VideoSettings {
    int width = 0;
    int height = 0;
    int fps = 30;
    std::string codec = "h264";
    int quality = 20; ///< constant rate factor: lower is better
    bool hasSound = false;
};

/// Frees a picture of libavutil.
struct FrameDeleter {
    void operator()(AVFrame* frame) const;
};
using FramePointer = std::unique_ptr<AVFrame, FrameDeleter>;

/// Pictures per second of the movie's time, in which frames are placed.
inline constexpr int s_pictureTimescale = 90'000;
inline constexpr int s_soundRate = 48'000; ///< samples a second
inline constexpr int s_soundChannels = 2;  ///< left and right
inline constexpr double s_fragmentSeconds = 0.1;

/// Writes the movie. One thread writes pictures, another one may write sound.
class VideoWriter {
public:
    /// `onFull` is called if the file system is full, on the thread that writes. If it returns true there is room
    /// again, and the write is repeated. Throws `Failure` if the codec cannot be used or the file cannot be made.
    VideoWriter(const std::filesystem::path& file, const VideoSettings& settings, std::function<bool()> onFull);
    ~VideoWriter();

    VideoWriter(const VideoWriter&) = delete;
    VideoWriter& operator=(const VideoWriter&) = delete;

    /// Throws `Refusal` if there is no such encoder.
    static void requireCodec(const std::string& codec);

    /// Returns an empty picture of the encoder's format.
    FramePointer emptyPicture() const;

    /// Encodes a picture at a time in units of 1/90000 s, later than the one before. Throws `Failure`.
    void writePicture(AVFrame& picture, std::int64_t time);

    /// Encodes sound that follows the sound before it: left and right in turn. Throws `Failure`.
    void writeSound(std::span<const float> samples);

    /// Writes what is still in the encoders; the last picture lasts until `end`. Throws `Failure`.
    void finish(std::int64_t end);

    std::uint64_t frames() const { return frames_; }
    std::uint64_t bytes() const { return bytes_; }

private:
    struct Output;

    void openPictures();
    void openSound();
    void openFile();
    void encode(AVCodecContext& encoder, AVStream& stream, const AVFrame* frame);
    void writePacket(AVPacket& packet);
    void writePendingPicture(std::int64_t nextTime);
    void endFragment();
    int writeBytes(const std::uint8_t* bytes, int size);
    [[noreturn]] void fail(const char* what, int error) const;

    std::filesystem::path path_;
    VideoSettings settings_;
    std::function<bool()> onFull_;
    FileHandle file_;
    std::unique_ptr<Output> output_;
    std::mutex mutex_; ///< of the muxer
    std::int64_t fragmentStart_ = 0;
    std::vector<float> sound_; ///< less than a frame of the encoder
    std::int64_t soundTime_ = 0;
    std::atomic<std::uint64_t> frames_ = 0;
    std::atomic<std::uint64_t> bytes_ = 0;
};

} // namespace Recorder
