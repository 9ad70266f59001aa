#pragma once

// Pictures as encoders of movies take them: a plane of brightness, and two planes of colour of half its size.

#include "Tools/render/Libav.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace Render {

/// What the numbers of colours mean. The brightness is 16 to 235, and colours are 16 to 240.
enum class ColourMatrix : std::uint8_t { BT601, BT709 };

struct Colour {
    double red = 0; ///< each of them from 0 to 1
    double green = 0;
    double blue = 0;
    double alpha = 1;
};

/// A part of a picture in whole pixels.
struct PixelRect {
    int x = 0;
    int y = 0;
    int width = 0;
    int height = 0;

    bool empty() const { return width <= 0 || height <= 0; }
    int right() const { return x + width; }
    int bottom() const { return y + height; }
};

/// Returns what two rectangles have in common.
PixelRect commonPart(const PixelRect& left, const PixelRect& right);

/// One plane of a picture.
struct Plane {
    std::uint8_t* bytes = nullptr;
    int stride = 0;
    int width = 0;
    int height = 0;

    std::uint8_t* row(int y) const { return bytes + static_cast<std::ptrdiff_t>(y) * stride; }
};

/// An 8-bit picture in the format YUV420P. Its bytes are shared with copies until one of them is made its own.
class YuvPicture {
public:
    YuvPicture() = default;
    YuvPicture(int width, int height, ColourMatrix matrix); ///< its contents are not set
    YuvPicture(FramePointer frame, ColourMatrix matrix);    ///< takes a frame of this format

    bool empty() const { return !frame_; }
    int width() const { return frame_ ? frame_->width : 0; }
    int height() const { return frame_ ? frame_->height : 0; }
    ColourMatrix matrix() const { return matrix_; }
    const AVFrame& frame() const { return *frame_; }

    Plane plane(int index) const;

    YuvPicture copy() const; ///< returns one with bytes of its own

    /// Fills a part with a colour. Pixels of which only a part is covered are covered.
    void fill(const PixelRect& part, const Colour& colour);

private:
    std::shared_ptr<AVFrame> frame_;
    ColourMatrix matrix_ = ColourMatrix::BT709;
};

/// A picture of Cairo: premultiplied, 32 bits for each pixel, at an even place of a YUV picture and of even size.
struct Tile {
    PixelRect place;
    std::vector<std::uint32_t> pixels; ///< rows without padding

    Tile() = default;
    explicit Tile(const PixelRect& covered); ///< transparent; its place is the least even one that covers this
};

/// Draws a tile over a picture, in a part of it that begins and ends at even places.
void blend(const Tile& tile, double opacity, const PixelRect& clip, const YuvPicture& picture);

/// Returns a picture for Cairo, without transparency.
std::vector<std::uint32_t> rgbOf(const YuvPicture& picture);

/// Returns a YUV picture of opaque pixels.
YuvPicture yuvOf(std::span<const std::uint32_t> pixels, int width, int height, ColourMatrix matrix);

} // namespace Render
