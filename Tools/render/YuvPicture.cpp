#include "Tools/render/YuvPicture.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <new>

namespace Render {

namespace {

constexpr int s_fractionBits = 16;
constexpr int s_half = 1 << (s_fractionBits - 1);

/// How much red, green and blue contribute, as whole numbers.
struct Coefficients {
    std::array<int, 3> y{};
    std::array<int, 3> u{};
    std::array<int, 3> v{};
};

Coefficients coefficientsOf(ColourMatrix matrix) {
    const double red = matrix == ColourMatrix::BT709 ? 0.2126 : 0.299;
    const double blue = matrix == ColourMatrix::BT709 ? 0.0722 : 0.114;
    const double green = 1 - red - blue;
    const auto whole = [](double value) { return static_cast<int>(std::lround(value * (1 << s_fractionBits))); };
    const double luma = 219.0 / 255;
    const double chroma = 224.0 / 255 / 2;
    return {{whole(luma * red), whole(luma * green), whole(luma * blue)},
            {whole(-chroma * red / (1 - blue)), whole(-chroma * green / (1 - blue)), whole(chroma)},
            {whole(chroma), whole(-chroma * green / (1 - red)), whole(-chroma * blue / (1 - red))}};
}

int channel(std::uint32_t pixel, int shift) {
    return static_cast<int>((pixel >> static_cast<unsigned>(shift)) & 0xffU);
}

/// The sum of some premultiplied pixels.
struct Sum {
    int alpha = 0;
    int red = 0;
    int green = 0;
    int blue = 0;

    void add(std::uint32_t pixel) {
        alpha += channel(pixel, 24);
        red += channel(pixel, 16);
        green += channel(pixel, 8);
        blue += channel(pixel, 0);
    }
    int times(const std::array<int, 3>& weights) const {
        return weights[0] * red + weights[1] * green + weights[2] * blue;
    }
};

std::uint8_t byteOf(int value) {
    return static_cast<std::uint8_t>(std::clamp(value, 0, 255));
}

/// Returns what a byte becomes below pixels of this sum. `zero` is what no colour is stored as, and `opacity` counts
/// 256ths of one pixel.
std::uint8_t blended(std::uint8_t below, int contribution, int alpha, int zero, int count, int opacity) {
    const std::int64_t colour = contribution + static_cast<std::int64_t>(zero) * alpha * (1 << s_fractionBits) / 255;
    const std::int64_t whole = static_cast<std::int64_t>(count) * 255 * 256;
    const std::int64_t kept = below * (whole - static_cast<std::int64_t>(alpha) * opacity);
    const std::int64_t drawn = colour * opacity;
    const std::int64_t value = (kept * (1 << s_fractionBits) / (static_cast<std::int64_t>(count) * 255 * 256)) +
                               drawn / (static_cast<std::int64_t>(count) * 256) + s_half;
    return byteOf(static_cast<int>(value >> s_fractionBits));
}

std::uint32_t colourPixel(const Colour& colour) {
    const auto byte = [](double value) {
        return static_cast<std::uint32_t>(std::lround(std::clamp(value, 0.0, 1.0) * 255));
    };
    return 0xff000000U | byte(colour.red) << 16U | byte(colour.green) << 8U | byte(colour.blue);
}

/// Converts between the formats of pictures.
void convert(const AVFrame& from, const AVFrame& to, ColourMatrix matrix) {
    const ScalerPointer scaler(sws_getContext(from.width, from.height, static_cast<AVPixelFormat>(from.format),
                                              to.width, to.height, static_cast<AVPixelFormat>(to.format),
                                              SWS_BILINEAR | SWS_ACCURATE_RND | SWS_FULL_CHR_H_INT, nullptr, nullptr,
                                              nullptr));
    if (!scaler)
        throw std::bad_alloc();
    const int* table = sws_getCoefficients(matrix == ColourMatrix::BT709 ? SWS_CS_ITU709 : SWS_CS_ITU601);
    const bool isRgbSource = from.format == AV_PIX_FMT_BGRA;
    sws_setColorspaceDetails(scaler.get(), table, isRgbSource ? 1 : 0, table, isRgbSource ? 0 : 1, 0, 1 << 16, 1 << 16);
    sws_scale(scaler.get(), from.data, from.linesize, 0, from.height, to.data, to.linesize);
}

FramePointer pixelsFrame(std::uint32_t* pixels, int width, int height) {
    FramePointer frame = newFrame();
    frame->format = AV_PIX_FMT_BGRA;
    frame->width = width;
    frame->height = height;
    void* bytes = pixels;
    frame->data[0] = static_cast<std::uint8_t*>(bytes);
    frame->linesize[0] = width * 4;
    return frame;
}

} // namespace

PixelRect commonPart(const PixelRect& left, const PixelRect& right) {
    const int x = std::max(left.x, right.x);
    const int y = std::max(left.y, right.y);
    return {x, y, std::min(left.right(), right.right()) - x, std::min(left.bottom(), right.bottom()) - y};
}

YuvPicture::YuvPicture(int width, int height, ColourMatrix matrix) : matrix_(matrix) {
    FramePointer frame = newFrame();
    frame->format = AV_PIX_FMT_YUV420P;
    frame->width = width;
    frame->height = height;
    if (av_frame_get_buffer(frame.get(), 0) < 0)
        throw std::bad_alloc();
    frame_ = std::shared_ptr<AVFrame>(frame.release(), Releaser<av_frame_free>());
}

YuvPicture::YuvPicture(FramePointer frame, ColourMatrix matrix)
    : frame_(frame.release(), Releaser<av_frame_free>()), matrix_(matrix) {}

Plane YuvPicture::plane(int index) const {
    const int shift = index == 0 ? 0 : 1;
    return {frame_->data[index], frame_->linesize[index], (frame_->width + shift) >> shift,
            (frame_->height + shift) >> shift};
}

YuvPicture YuvPicture::copy() const {
    YuvPicture result(width(), height(), matrix_);
    av_frame_copy(result.frame_.get(), frame_.get());
    return result;
}

void YuvPicture::fill(const PixelRect& part, const Colour& colour) {
    const Coefficients weights = coefficientsOf(matrix_);
    Sum sum;
    sum.add(colourPixel(colour));
    for (int index = 0; index < 3; ++index) {
        const Plane target = plane(index);
        const int shift = index == 0 ? 0 : 1;
        const auto& weight = index == 0 ? weights.y : index == 1 ? weights.u : weights.v;
        const int left = std::max(0, part.x >> shift);
        const int right = std::min(target.width, (part.right() + shift) >> shift);
        const std::uint8_t value = byteOf((index == 0 ? 16 : 128) + ((sum.times(weight) + s_half) >> s_fractionBits));
        for (int y = std::max(0, part.y >> shift); y < std::min(target.height, (part.bottom() + shift) >> shift); ++y)
            if (right > left)
                std::memset(target.row(y) + left, value, static_cast<std::size_t>(right - left));
    }
}

Tile::Tile(const PixelRect& covered) {
    place.x = covered.x & ~1;
    place.y = covered.y & ~1;
    place.width = std::max(0, ((covered.right() + 1) & ~1) - place.x);
    place.height = std::max(0, ((covered.bottom() + 1) & ~1) - place.y);
    pixels.resize(static_cast<std::size_t>(place.width) * static_cast<std::size_t>(place.height));
}

void blend(const Tile& tile, double opacity, const PixelRect& clip, const YuvPicture& picture) {
    const PixelRect part = commonPart(commonPart(tile.place, clip), {0, 0, picture.width(), picture.height()});
    const Coefficients weights = coefficientsOf(picture.matrix());
    const int strength = static_cast<int>(std::lround(std::clamp(opacity, 0.0, 1.0) * 256));
    const Plane luma = picture.plane(0);
    const std::array chroma{picture.plane(1), picture.plane(2)};
    for (int y = part.y; y < part.bottom(); y += 2)
        for (int x = part.x; x < part.right(); x += 2) {
            Sum sum;
            int count = 0;
            for (int dy = 0; dy < std::min(2, part.bottom() - y); ++dy)
                for (int dx = 0; dx < std::min(2, part.right() - x); ++dx, ++count) {
                    const std::uint32_t pixel = tile.pixels[static_cast<std::size_t>(y + dy - tile.place.y) *
                                                                static_cast<std::size_t>(tile.place.width) +
                                                            static_cast<std::size_t>(x + dx - tile.place.x)];
                    if (pixel == 0)
                        continue;
                    sum.add(pixel);
                    Sum one;
                    one.add(pixel);
                    std::uint8_t& below = luma.row(y + dy)[x + dx];
                    below = blended(below, one.times(weights.y), one.alpha, 16, 1, strength);
                }
            if (sum.alpha == 0)
                continue;
            std::uint8_t& u = chroma[0].row(y / 2)[x / 2];
            std::uint8_t& v = chroma[1].row(y / 2)[x / 2];
            u = blended(u, sum.times(weights.u), sum.alpha, 128, count, strength);
            v = blended(v, sum.times(weights.v), sum.alpha, 128, count, strength);
        }
}

std::vector<std::uint32_t> rgbOf(const YuvPicture& picture) {
    std::vector<std::uint32_t> pixels(static_cast<std::size_t>(picture.width()) *
                                      static_cast<std::size_t>(picture.height()));
    const FramePointer target = pixelsFrame(pixels.data(), picture.width(), picture.height());
    convert(picture.frame(), *target, picture.matrix());
    for (std::uint32_t& pixel : pixels)
        pixel |= 0xff000000U;
    return pixels;
}

YuvPicture yuvOf(std::span<const std::uint32_t> pixels, int width, int height, ColourMatrix matrix) {
    std::vector<std::uint32_t> own(pixels.begin(), pixels.end());
    const FramePointer source = pixelsFrame(own.data(), width, height);
    FramePointer frame = newFrame();
    frame->format = AV_PIX_FMT_YUV420P;
    frame->width = width;
    frame->height = height;
    if (av_frame_get_buffer(frame.get(), 0) < 0)
        throw std::bad_alloc();
    convert(*source, *frame, matrix);
    return {std::move(frame), matrix};
}

} // namespace Render
