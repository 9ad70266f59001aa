#include "Platform/PNGCodec.h"

#include "Platform/ImageLimits.h"
#include "Platform/PNGChunks.h"

#include <png.h>

#include <algorithm>
#include <csetjmp>
#include <limits>
#include <new>
#include <type_traits>
#include <utility>

namespace ZULMetaData {

namespace {

/// How much compressed data after the last pixel is looked into. It can unpack to a thousand times as much.
constexpr std::size_t s_mostSurplusRead = std::size_t{4} << 10;

[[noreturn]] void jumpOut(png_structp png, png_const_charp) {
    png_longjmp(png, 1);
}

void ignoreWarning(png_structp, png_const_charp) {}

// libpng leaves a failed call by a jump, which runs no destructor: between here and libpng nothing may need one.
// What has to be released belongs to a PNGReader or PNGWriter of the caller.
template <class Steps>
bool unlessLibraryJumps(png_structp png, Steps steps) {
    static_assert(std::is_trivially_destructible_v<Steps>);
    if (setjmp(png_jmpbuf(png)) != 0) {
        return false;
    }
    steps();
    return true;
}

class PNGReader {
public:
    explicit PNGReader(std::span<const std::uint8_t> encoded)
        : encoded_(encoded), remaining_(encoded),
          png_(png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, jumpOut, ignoreWarning)),
          info_(png_ != nullptr ? png_create_info_struct(png_) : nullptr) {}
    PNGReader(const PNGReader&) = delete;
    PNGReader& operator=(const PNGReader&) = delete;
    ~PNGReader() { png_destroy_read_struct(&png_, &info_, nullptr); }

    std::uint32_t width() const { return width_; }
    std::uint32_t height() const { return height_; }

    enum class Pixels { RGBA, AsStored };

    bool readHeader(Pixels pixels) {
        return info_ != nullptr && unlessLibraryJumps(png_, [this, pixels] {
                   beStrict();
                   png_read_info(png_, info_);
                   noteLayout();
                   if (pixels == Pixels::RGBA)
                       convertToRGBA();
                   passes_ = png_set_interlace_handling(png_);
                   png_read_update_info(png_, info_);
               });
    }

    bool isPlausible() const {
        return isImageSizeAllowed(width_, height_) && png_get_rowbytes(png_, info_) == rgbaSize(width_, 1) &&
               storedSize_ / s_maximumDeflateRatio <= encoded_.size();
    }

    bool readPixels(std::uint8_t* rgba) {
        return unlessLibraryJumps(png_, [this, rgba] {
            for (int pass = 0; pass < passes_; ++pass) {
                for (std::uint32_t row = 0; row < height_; ++row) {
                    png_read_row(png_, rgba + rgbaSize(width_, row), nullptr);
                }
            }
            png_read_end(png_, nullptr);
        });
    }

    /// The same without keeping a pixel. `pixelsEnd` is the offset after the last chunk of pixels.
    bool skipPixels(std::size_t pixelsEnd) {
        return unlessLibraryJumps(png_, [this, pixelsEnd] {
            for (int pass = 0; pass < passes_; ++pass) {
                for (std::uint32_t row = 0; row < height_; ++row) {
                    if (pass + 1 == passes_ && row + 1 == height_)
                        limitSurplus(pixelsEnd);
                    png_read_row(png_, nullptr, nullptr);
                }
            }
            png_read_end(png_, nullptr);
        });
    }

    /// Compressed bytes after the last pixel, if they were too many to be unpacked.
    std::size_t surplus() const { return surplus_; }

private:
    void beStrict() {
        png_set_read_fn(png_, this, takeBytes);
        png_set_user_limits(png_, s_maximumImageSide, s_maximumImageSide);
        png_set_benign_errors(png_, 0);
        png_set_crc_action(png_, PNG_CRC_ERROR_QUIT, PNG_CRC_ERROR_QUIT);
        // Texts, profiles and the like are not used, and unpacking them would cost memory.
        png_set_keep_unknown_chunks(png_, PNG_HANDLE_CHUNK_NEVER, nullptr, -1);
    }

    void noteLayout() {
        width_ = png_get_image_width(png_, info_);
        height_ = png_get_image_height(png_, info_);
        storedSize_ = std::uint64_t{png_get_rowbytes(png_, info_)} * height_;
    }

    void convertToRGBA() {
        png_set_scale_16(png_);
        png_set_expand(png_);
        png_set_gray_to_rgb(png_);
        png_set_add_alpha(png_, 0xFF, PNG_FILLER_AFTER);
    }

    /// With the last row, libpng unpacks all that follows it, only to refuse it in the end.
    void limitSurplus(std::size_t pixelsEnd) {
        const std::size_t lastRow = png_get_rowbytes(png_, info_);
        const std::size_t limit = offset() + lastRow + s_mostSurplusRead;
        if (limit < pixelsEnd) {
            limit_ = limit;
            pixelsEnd_ = pixelsEnd;
        }
    }

    std::size_t offset() const { return encoded_.size() - remaining_.size(); }

    static void takeBytes(png_structp png, png_bytep target, png_size_t count) {
        auto& reader = *static_cast<PNGReader*>(png_get_io_ptr(png));
        auto& remaining = reader.remaining_;
        if (count > remaining.size()) {
            png_error(png, "file is cut short");
        }
        if (reader.offset() + count > reader.limit_) {
            reader.surplus_ = reader.pixelsEnd_ - reader.offset();
            png_error(png, "too much image data");
        }
        std::copy_n(remaining.begin(), count, target);
        remaining = remaining.subspan(count);
    }

    std::span<const std::uint8_t> encoded_;
    std::span<const std::uint8_t> remaining_;
    png_structp png_;
    png_infop info_;
    std::uint32_t width_ = 0;
    std::uint32_t height_ = 0;
    std::uint64_t storedSize_ = 0; // bytes of all rows before compression, in the file's own pixel format
    int passes_ = 0;
    std::size_t limit_ = std::numeric_limits<std::size_t>::max(); // an offset that is not read beyond
    std::size_t pixelsEnd_ = 0;
    std::size_t surplus_ = 0;
};

// A recording encodes its cursors while it runs. Nearly all are small pictures of flat colours and repeated rows, on
// which a fast compression without filters takes a third of the time and loses a few per cent of size. What does not
// shrink like a cursor, a ramp or a photograph, is worth libpng's own defaults, which take longer.
enum class PNGEffort { Quick, Thorough };

constexpr std::size_t s_cursorRatio = 8; // a cursor shrinks to less than an eighth of its pixels

class PNGWriter {
public:
    PNGWriter()
        : png_(png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, jumpOut, ignoreWarning)),
          info_(png_ != nullptr ? png_create_info_struct(png_) : nullptr) {}
    PNGWriter(const PNGWriter&) = delete;
    PNGWriter& operator=(const PNGWriter&) = delete;
    ~PNGWriter() { png_destroy_write_struct(&png_, &info_); }

    bool write(const Image& image, PNGEffort effort) {
        return info_ != nullptr && unlessLibraryJumps(png_, [this, &image, effort] {
                   png_set_write_fn(png_, this, appendBytes, nullptr);
                   png_set_IHDR(png_, info_, image.width(), image.height(), 8, PNG_COLOR_TYPE_RGB_ALPHA,
                                PNG_INTERLACE_NONE, PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
                   if (effort == PNGEffort::Quick)
                       preferSpeed();
                   png_write_info(png_, info_);
                   const std::uint8_t* rgba = image.rgba().data();
                   for (std::uint32_t row = 0; row < image.height(); ++row) {
                       png_write_row(png_, rgba + rgbaSize(image.width(), row));
                   }
                   png_write_end(png_, nullptr);
               });
    }

    bool isOutOfMemory() const { return outOfMemory_; }
    std::vector<std::uint8_t> takeEncoded() { return std::move(encoded_); }

private:
    // With its usual 262 KiB the compressor spends most of its time getting and clearing memory. 70 KiB hold the last
    // 8 KiB of pixels, more than a cursor's rows repeat over.
    void preferSpeed() {
        png_set_compression_level(png_, 3);
        png_set_compression_window_bits(png_, 13);
        png_set_compression_mem_level(png_, 6);
        png_set_filter(png_, PNG_FILTER_TYPE_BASE, PNG_FILTER_NONE);
    }

    static void appendBytes(png_structp png, png_bytep bytes, png_size_t count) {
        auto& writer = *static_cast<PNGWriter*>(png_get_io_ptr(png));
        if (!writer.append(bytes, count)) {
            png_error(png, "out of memory");
        }
    }

    // An exception must not travel through libpng either; the caller raises it again behind the jump.
    bool append(const std::uint8_t* bytes, std::size_t count) noexcept {
        try {
            encoded_.insert(encoded_.end(), bytes, bytes + count);
        } catch (const std::bad_alloc&) {
            outOfMemory_ = true;
        }
        return !outOfMemory_;
    }

    std::vector<std::uint8_t> encoded_;
    bool outOfMemory_ = false;
    png_structp png_;
    png_infop info_;
};

std::vector<std::uint8_t> encodedWith(PNGEffort effort, const Image& image) {
    PNGWriter writer;
    if (writer.write(image, effort)) {
        return writer.takeEncoded();
    }
    if (writer.isOutOfMemory()) {
        throw std::bad_alloc();
    }
    return {};
}

} // namespace

std::optional<Image> decodePNG(std::span<const std::uint8_t> encoded) {
    PNGReader reader(encoded);
    if (!reader.readHeader(PNGReader::Pixels::RGBA) || !reader.isPlausible()) {
        return std::nullopt;
    }
    std::vector<std::uint8_t> rgba(rgbaSize(reader.width(), reader.height()));
    if (!reader.readPixels(rgba.data())) {
        return std::nullopt;
    }
    return Image(reader.width(), reader.height(), std::move(rgba));
}

std::optional<EncodedImageInfo> readPNGInfo(std::span<const std::uint8_t> encoded) {
    PNGReader reader(encoded);
    if (!reader.readHeader(PNGReader::Pixels::RGBA) || !reader.isPlausible()) {
        return std::nullopt;
    }
    return EncodedImageInfo{reader.width(), reader.height(), memoryToDecodePNG(reader.width(), reader.height())};
}

EncodedImageCheck checkPNG(std::span<const std::uint8_t> encoded) {
    const auto chunks = walkPNGChunks(encoded);
    PNGReader reader(encoded);
    if (!chunks || !reader.readHeader(PNGReader::Pixels::AsStored)) {
        return {};
    }
    EncodedImageCheck check{EncodedImageCheck::NotUnpacked, chunks->width, chunks->height, chunks->unpackedBytes,
                            encoded.size() - chunks->end};
    if (std::max<std::uint64_t>(chunks->unpackedBytes, encoded.size()) <= s_mostUnpackedToCheck) {
        const bool isWhole = reader.skipPixels(chunks->pixelsEnd);
        check.state = isWhole ? EncodedImageCheck::Decodable : EncodedImageCheck::Undecodable;
        check.surplusBytes += reader.surplus();
    }
    return check;
}

std::vector<std::uint8_t> encodePNG(const Image& image) {
    if (!isEncodable(image)) {
        return {};
    }
    std::vector<std::uint8_t> encoded = encodedWith(PNGEffort::Quick, image);
    if (encoded.size() <= image.rgba().size() / s_cursorRatio) {
        return encoded;
    }
    std::vector<std::uint8_t> smaller = encodedWith(PNGEffort::Thorough, image);
    return smaller.empty() || encoded.size() <= smaller.size() ? encoded : smaller;
}

} // namespace ZULMetaData
