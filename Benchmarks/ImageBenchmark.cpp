// Cursor images on their way into a stream and back.

#include "Benchmarks/Runner.h"
#include "Platform/Image.h"
#include "Tools/demo/Cursors.h"

#include <png.h>

#include <cstdint>
#include <cstring>
#include <optional>
#include <random>
#include <vector>

namespace ZULMetaData::Bench {

namespace {

using Bytes = std::vector<std::uint8_t>;

void append(png_structp png, png_bytep bytes, std::size_t size) {
    Bytes& encoded = *static_cast<Bytes*>(png_get_io_ptr(png));
    encoded.insert(encoded.end(), bytes, bytes + size);
}

struct Compression {
    int level;
    int filters;
};

constexpr Compression s_default{-1, 0};
constexpr Compression s_fast{1, PNG_FILTER_NONE};

/// Straight from the pixels.
Bytes encodedByLibpng(const Image& image, const Compression& compression) {
    Bytes encoded;
    png_structp png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    if (setjmp(png_jmpbuf(png)))
        return {};
    png_set_write_fn(png, &encoded, append, nullptr);
    if (compression.level >= 0) {
        png_set_compression_level(png, compression.level);
        png_set_filter(png, PNG_FILTER_TYPE_BASE, compression.filters);
    }
    png_set_IHDR(png, info, image.width(), image.height(), 8, PNG_COLOR_TYPE_RGB_ALPHA, PNG_INTERLACE_NONE,
                 PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
    png_write_info(png, info);
    for (std::uint32_t y = 0; y < image.height(); ++y)
        png_write_row(png, image.rgba().data() + std::size_t{4} * image.width() * y);
    png_write_end(png, info);
    png_destroy_write_struct(&png, &info);
    return encoded;
}

struct Input {
    const Bytes* bytes;
    std::size_t position;
};

void take(png_structp png, png_bytep bytes, std::size_t size) {
    Input& input = *static_cast<Input*>(png_get_io_ptr(png));
    std::memcpy(bytes, input.bytes->data() + input.position, size);
    input.position += size;
}

Bytes decodedByLibpng(const Bytes& encoded) {
    Input input{&encoded, 0};
    png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    if (setjmp(png_jmpbuf(png)))
        return {};
    png_set_read_fn(png, &input, take);
    png_read_info(png, info);
    const std::size_t rowSize = png_get_rowbytes(png, info);
    Bytes pixels(rowSize * png_get_image_height(png, info));
    for (std::size_t row = 0; row < pixels.size(); row += rowSize)
        png_read_row(png, pixels.data() + row, nullptr);
    png_read_end(png, nullptr);
    png_destroy_read_struct(&png, &info, nullptr);
    return pixels;
}

/// As the writer of cursor images encodes them.
Bytes encoded(const Image& image) {
    return BitmapImageRep::fromTIFF(image.tiffRepresentation())->pngRepresentation();
}

/// Ten kinds of cursor of 64 x 64 pixels: drawn ones, flat and noisy ones, a ramp, a photograph's look.
std::vector<Image> cursors() {
    std::vector<Image> images;
    for (const auto& cursor : Demo::drawnCursors(2))
        images.push_back(*cursor.image);
    std::mt19937 random(7);
    const auto add = [&](auto pixel) {
        Bytes rgba;
        for (int i = 0; i < 64 * 64; ++i) {
            const std::uint32_t colour = pixel(i % 64, i / 64);
            for (int shift = 0; shift < 32; shift += 8)
                rgba.push_back(static_cast<std::uint8_t>(colour >> shift));
        }
        images.emplace_back(64, 64, std::move(rgba));
    };
    add([](int, int) { return 0U; });
    add([](int, int) { return 0xff0000ffU; });
    add([](int x, int y) { return (x / 8 + y / 8) % 2 ? 0xffffffffU : 0xff000000U; });
    add([](int x, int y) { return 0xff000000U | static_cast<std::uint32_t>(x * 4 | (y * 4) << 8); });
    add([](int x, int y) {
        const int distance = (x - 32) * (x - 32) + (y - 32) * (y - 32);
        return distance < 900 ? 0xff2080e0U : distance < 1000 ? 0x80808080U : 0U;
    });
    add([&](int, int) { return std::uint32_t{0xff} << 24 | static_cast<std::uint32_t>(random() & 0xffffff); });
    add([&](int x, int y) {
        return 0xff000000U | static_cast<std::uint32_t>(x * 2 + y + static_cast<int>(random() % 4)) * 0x010101U;
    });
    return images;
}

void compareImages() {
    const std::vector<Image> images = cursors();
    const Image& arrow = images.front();
    constexpr int times = 500;
    const auto repeat = [](auto work) {
        return [work] {
            for (int i = 0; i < times; ++i)
                work();
        };
    };
    Bytes raw;
    Bytes ours;
    compare({"encode a cursor of 64 x 64, by way of TIFF", "libpng at level 1, no filter, from the pixels", 1.3},
            {repeat([&] { raw = encodedByLibpng(arrow, s_fast); })}, {repeat([&] { ours = encoded(arrow); })}, times,
            [&] { return decodedByLibpng(ours) == decodedByLibpng(raw); });

    Bytes rawPixels;
    std::optional<Image> image;
    compare({"decode a cursor of 64 x 64", "libpng", 1.1}, {repeat([&] { rawPixels = decodedByLibpng(ours); })},
            {repeat([&] { image = Image::fromEncodedBytes(ours); })}, times,
            [&] { return image && Bytes(image->rgba().begin(), image->rgba().end()) == rawPixels; });

    const Measure sizes{"bytes of ten kinds of cursor", "libpng with its defaults", 1.05};
    if (!isSelected(sizes))
        return;
    std::size_t most = 0;
    std::size_t least = 0;
    for (const Image& cursor : images) {
        most += encoded(cursor).size();
        least += encodedByLibpng(cursor, s_default).size();
    }
    reportFigure(sizes, double(most) / double(least), "x");
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, compareImages);
}
