#pragma once

// The pictures of a movie by the times at which they are shown.
//
//     PictureReader pictures("Recording.mp4", "Recording.mp4");
//     const YuvPicture& picture = pictures.at(12.5);

#include "Tools/render/Upright.h"
#include "Tools/render/YuvPicture.h"

#include <cstdint>
#include <optional>
#include <string>

namespace Render {

/// Works for constant and variable frame rates, and any order of times. Times that follow one another are decoded once.
class PictureReader {
public:
    /// Errors call the movie `name`. Throws `Zulm::Failure` if it has no pictures that can be decoded.
    PictureReader(const std::string& path, const std::string& name);

    /// Returns the picture that is shown at a time: the last one that begins at or before it, or the first of all. It
    /// stands upright and has 8 bits. Equal numbers of `pictureNumber` tell that it is the same as before. Throws
    /// `Zulm::Failure` if no picture can be decoded.
    const YuvPicture& at(double time);

    std::uint64_t pictureNumber() const { return number_; } ///< grows with every other picture that `at` returns

    /// Returns when the picture that `at` returned last begins: after the time if the movie has no earlier picture.
    double pictureTime() const { return current_ ? current_->time : 0; }

    /// Returns whether a picture after the last one was asked for although the stream should go on, or reading failed.
    bool endedEarly() const { return endedEarly_; }

    /// Returns whether the movie could not be sought in. What is earlier then shows a later picture.
    bool cannotSeek() const { return cannotSeek_; }

    int width() const { return width_; }   ///< of its pictures, which stand upright
    int height() const { return height_; } ///< the same

    /// Returns how many times wider than high the pixels of its pictures are.
    double pixelAspect() const { return pixelAspect_; }

    /// Returns the length of the movie in seconds, as its container says it.
    std::optional<double> duration() const;

private:
    struct Decoded {
        FramePointer frame;
        double time = 0;
    };

    std::optional<Decoded> next();
    bool send();
    void seek(double time);
    void noteEnd(double time);
    void advance(double time);
    double secondsOf(const AVFrame& frame) const;
    YuvPicture prepared(const AVFrame& frame);

    OpenMovie movie_;
    int stream_ = -1;
    CodecPointer decoder_;
    Turn turn_;
    int width_ = 0;
    int height_ = 0;
    double pixelAspect_ = 1;
    std::optional<Decoded> current_;
    std::optional<Decoded> following_;
    bool isAtEnd_ = false;
    bool isFlushing_ = false;
    bool isUnreadable_ = false; ///< reading ended by an error
    bool endedEarly_ = false;
    bool cannotSeek_ = false;
    double lastTime_ = 0; ///< when the picture begins that was decoded last, in seconds
    double lastEnd_ = 0;  ///< when it ends
    YuvPicture picture_;
    bool isPrepared_ = false;
    std::uint64_t number_ = 0;
    ScalerPointer scaler_;
};

} // namespace Render
