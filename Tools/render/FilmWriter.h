#pragma once

// Encodes pictures and sound into a movie.

#include "Tools/render/YuvPicture.h"

#include <memory>
#include <span>
#include <string>

namespace Render {

struct FilmSettings {
    double fps = 30;
    std::string codec = "h264"; ///< of libavcodec
    int quality = 20;           ///< constant rate factor: lower is better
    bool isQualityAsked = false;
    int soundRate = 0; ///< 0 if there is no sound
};

class FilmWriter {
public:
    /// Writes to `path`; errors call it `name`. Throws `Zulm::Failure`.
    FilmWriter(const std::string& path, const std::string& name, const FilmSettings& settings, int width, int height,
               ColourMatrix matrix);
    ~FilmWriter();
    FilmWriter(const FilmWriter&) = delete;
    FilmWriter& operator=(const FilmWriter&) = delete;

    /// Throws `Zulm::Failure` if there is no such encoder, or if it is not for movies.
    static void requireCodec(const std::string& codec);

    void writePicture(const YuvPicture& picture);    ///< of the next frame
    void writeSound(std::span<const float> samples); ///< left and right in turn
    void finish();                                   ///< makes the file whole

private:
    struct Output;

    void openPictures(int width, int height, ColourMatrix matrix);
    void setQuality(AVCodecContext& encoder) const;
    void openSound();
    void encode(AVCodecContext& encoder, AVStream& stream, const AVFrame* frame);
    [[noreturn]] void fail(const char* what, int error) const;

    std::string name_;
    FilmSettings settings_;
    std::unique_ptr<Output> output_;
};

} // namespace Render
