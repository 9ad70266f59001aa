#include "Platform/ImageCodecs.h"

#include <png.h>

#include <algorithm>
#include <array>
#include <csetjmp>
#include <cstdlib>
#include <limits>
#include <new>
#include <string_view>
#include <type_traits>
#include <utility>

namespace ZULMetaData {

namespace {

using Bytes = std::span<const std::uint8_t>;

// ---- libpng ----

/// libpng leaves a failed call by a jump, which runs no destructor: between here and libpng nothing may need one. What
/// has to be released belongs to a PNGReader or PNGWriter of the caller.
template <class Steps>
bool unlessLibraryJumps(png_structp png, Steps steps) {
    static_assert(std::is_trivially_destructible_v<Steps>);
    if (setjmp(png_jmpbuf(png)) != 0)
        return false;
    steps();
    return true;
}

/// What reading and writing have in common. libpng gets its memory here, since it reports a lack of memory like any
/// other failure.
class PNGWork {
public:
    PNGWork(const PNGWork&) = delete;
    PNGWork& operator=(const PNGWork&) = delete;

protected:
    PNGWork() = default;
    ~PNGWork() = default;

    /// Returns false if libpng fails. Throws `std::bad_alloc` if it fails because there is no memory.
    template <class Steps>
    bool succeeds(Steps steps) {
        const bool isDone = info_ && unlessLibraryJumps(png_, steps);
        if (isOutOfMemory_)
            throw std::bad_alloc();
        return isDone;
    }

    [[noreturn]] static void jumpOut(png_structp png, png_const_charp) { png_longjmp(png, 1); }
    static void ignoreWarning(png_structp, png_const_charp) {}

    static png_voidp allocate(png_structp png, png_alloc_size_t size) {
        void* const block = std::malloc(size);
        if (!block)
            static_cast<PNGWork*>(png_get_mem_ptr(png))->isOutOfMemory_ = true;
        return block;
    }
    static void release(png_structp, png_voidp block) { std::free(block); }

    bool isOutOfMemory_ = false;
    png_structp png_ = nullptr;
    png_infop info_ = nullptr;
};

// ---- decoding ----

/// How much compressed data after the last pixel is looked into. It can unpack to a thousand times as much.
constexpr std::size_t s_mostSurplusRead = std::size_t{4} << 10;

class PNGReader : PNGWork {
public:
    explicit PNGReader(Bytes encoded) : encodedSize_(encoded.size()), remaining_(encoded) {
        png_ = png_create_read_struct_2(PNG_LIBPNG_VER_STRING, nullptr, jumpOut, ignoreWarning,
                                        static_cast<PNGWork*>(this), allocate, release);
        info_ = png_ ? png_create_info_struct(png_) : nullptr;
    }
    ~PNGReader() { png_destroy_read_struct(&png_, &info_, nullptr); }

    std::uint32_t width() const { return width_; }
    std::uint32_t height() const { return height_; }

    /// Returns the number of bytes in all rows before compression, in the file's own pixel format.
    std::uint64_t storedSize() const { return std::uint64_t{storedRowSize_} * height_; }

    /// Returns the number of bytes after the end chunk, or after the last pixel if they were too many to be unpacked.
    std::size_t surplus() const { return surplus_; }

    enum class Pixels { RGBA, AsStored };

    /// Returns false if the header is damaged or claims more pixels than the file can hold.
    bool readHeader(Pixels pixels) {
        const bool isRead = succeeds([this, pixels] {
            beStrict();
            png_read_info(png_, info_);
            noteLayout();
            if (pixels == Pixels::RGBA)
                convertToRGBA();
            passes_ = png_set_interlace_handling(png_);
            png_read_update_info(png_, info_);
        });
        return isRead && isImageSizeAllowed(width_, height_) && storedSize() / s_maximumDeflateRatio <= encodedSize_ &&
               (pixels == Pixels::AsStored || png_get_rowbytes(png_, info_) == rgbaSize(width_, 1));
    }

    /// Keeps no pixel if `rgba` is null.
    bool readPixels(std::uint8_t* rgba) {
        return succeeds([this, rgba] {
            for (int pass = 0; pass < passes_; ++pass)
                for (std::uint32_t row = 0; row < height_; ++row) {
                    // With the last row, libpng unpacks all that follows it, only to refuse it in the end.
                    if (pass + 1 == passes_ && row + 1 == height_)
                        pixelBytesLeft_ = storedRowSize_ + s_mostSurplusRead;
                    png_read_row(png_, rgba ? rgba + rgbaSize(width_, row) : nullptr, nullptr);
                }
            png_read_end(png_, nullptr);
            surplus_ = remaining_.size();
        });
    }

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
        storedRowSize_ = png_get_rowbytes(png_, info_);
    }

    void convertToRGBA() {
        png_set_scale_16(png_);
        png_set_expand(png_);
        png_set_gray_to_rgb(png_);
        png_set_add_alpha(png_, 0xFF, PNG_FILLER_AFTER);
    }

    static bool isInsidePixels(png_structp png) {
        constexpr png_uint_32 pixels = 0x49444154; // IDAT
        return (png_get_io_state(png) & PNG_IO_CHUNK_DATA) != 0 && png_get_io_chunk_type(png) == pixels;
    }

    static void takeBytes(png_structp png, png_bytep target, png_size_t count) {
        auto& reader = *static_cast<PNGReader*>(png_get_io_ptr(png));
        auto& remaining = reader.remaining_;
        if (count > remaining.size())
            png_error(png, "file is cut short");
        if (isInsidePixels(png)) {
            if (count > reader.pixelBytesLeft_) {
                reader.surplus_ = remaining.size();
                png_error(png, "too much image data");
            }
            reader.pixelBytesLeft_ -= count;
        }
        std::copy_n(remaining.begin(), count, target);
        remaining = remaining.subspan(count);
    }

    std::size_t encodedSize_;
    Bytes remaining_;
    std::uint32_t width_ = 0;
    std::uint32_t height_ = 0;
    std::size_t storedRowSize_ = 0;
    int passes_ = 0;
    std::size_t pixelBytesLeft_ = std::numeric_limits<std::size_t>::max(); ///< compressed bytes that are still read
    std::size_t surplus_ = 0;
};

// ---- check sums ----

std::uint32_t bigEndian(Bytes bytes) {
    return std::uint32_t{bytes[0]} << 24 | std::uint32_t{bytes[1]} << 16 | std::uint32_t{bytes[2]} << 8 | bytes[3];
}

std::uint32_t checkSum(Bytes bytes) {
    static const auto table = [] {
        std::array<std::uint32_t, 256> sums{};
        for (std::uint32_t byte = 0; byte < sums.size(); ++byte) {
            sums[byte] = byte;
            for (int bit = 0; bit < 8; ++bit)
                sums[byte] = sums[byte] >> 1 ^ ((sums[byte] & 1) != 0 ? 0xedb88320U : 0U);
        }
        return sums;
    }();
    std::uint32_t sum = 0xffffffff;
    for (const std::uint8_t byte : bytes)
        sum = table[(sum ^ byte) & 0xff] ^ sum >> 8;
    return ~sum;
}

/// Returns the number of bytes after the end chunk. Empty if a check sum is wrong or the end chunk is missing.
std::optional<std::size_t> surplusAfterChunks(Bytes encoded) {
    constexpr std::size_t signature = 8;
    constexpr std::size_t around = 12; // length, type and check sum
    for (Bytes rest = encoded.subspan(signature); rest.size() >= around;) {
        const std::uint32_t length = bigEndian(rest);
        if (length > rest.size() - around)
            return std::nullopt;
        const Bytes summed = rest.subspan(4, 4 + std::size_t{length});
        if (checkSum(summed) != bigEndian(rest.subspan(4 + summed.size())))
            return std::nullopt;
        rest = rest.subspan(around + length);
        if (std::string_view(reinterpret_cast<const char*>(summed.data()), 4) == "IEND")
            return rest.size();
    }
    return std::nullopt;
}

// ---- encoding ----

/// A recording encodes its cursors while it runs. Nearly all are small pictures of flat colours and repeated rows, on
/// which a fast compression without filters takes a third of the time and loses a few per cent of size. What does not
/// shrink like a cursor, a ramp or a photograph, is worth libpng's own defaults, which take longer.
enum class PNGEffort { Quick, Thorough };

constexpr std::size_t s_cursorRatio = 8; // a cursor shrinks to less than an eighth of its pixels

class PNGWriter : PNGWork {
public:
    PNGWriter() {
        png_ = png_create_write_struct_2(PNG_LIBPNG_VER_STRING, nullptr, jumpOut, ignoreWarning,
                                         static_cast<PNGWork*>(this), allocate, release);
        info_ = png_ ? png_create_info_struct(png_) : nullptr;
    }
    ~PNGWriter() { png_destroy_write_struct(&png_, &info_); }

    /// Returns nothing if libpng refuses the image.
    std::vector<std::uint8_t> encode(const Image& image, PNGEffort effort) {
        const bool isWritten = succeeds([this, &image, effort] {
            png_set_write_fn(png_, this, appendBytes, nullptr);
            png_set_IHDR(png_, info_, image.width(), image.height(), 8, PNG_COLOR_TYPE_RGB_ALPHA, PNG_INTERLACE_NONE,
                         PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
            if (effort == PNGEffort::Quick)
                preferSpeed();
            png_write_info(png_, info_);
            for (std::uint32_t row = 0; row < image.height(); ++row)
                png_write_row(png_, image.rgba().data() + rgbaSize(image.width(), row));
            png_write_end(png_, nullptr);
        });
        return isWritten ? std::move(encoded_) : std::vector<std::uint8_t>();
    }

private:
    /// With its usual 262 KiB the compressor spends most of its time getting and clearing memory. 70 KiB hold the last
    /// 8 KiB of pixels, more than a cursor's rows repeat over.
    void preferSpeed() {
        png_set_compression_level(png_, 3);
        png_set_compression_window_bits(png_, 13);
        png_set_compression_mem_level(png_, 6);
        png_set_filter(png_, PNG_FILTER_TYPE_BASE, PNG_FILTER_NONE);
    }

    static void appendBytes(png_structp png, png_bytep bytes, png_size_t count) {
        if (!static_cast<PNGWriter*>(png_get_io_ptr(png))->append({bytes, count}))
            png_error(png, "out of memory");
    }

    /// An exception must not travel through libpng either.
    bool append(Bytes bytes) noexcept {
        try {
            encoded_.insert(encoded_.end(), bytes.begin(), bytes.end());
        } catch (const std::bad_alloc&) {
            isOutOfMemory_ = true;
        }
        return !isOutOfMemory_;
    }

    std::vector<std::uint8_t> encoded_;
};

} // namespace

std::optional<Image> decodePNG(Bytes encoded) {
    PNGReader reader(encoded);
    if (!reader.readHeader(PNGReader::Pixels::RGBA))
        return std::nullopt;
    std::vector<std::uint8_t> rgba(rgbaSize(reader.width(), reader.height()));
    if (!reader.readPixels(rgba.data()))
        return std::nullopt;
    return Image(reader.width(), reader.height(), std::move(rgba));
}

std::optional<EncodedImageInfo> readPNGInfo(Bytes encoded) {
    PNGReader reader(encoded);
    if (!reader.readHeader(PNGReader::Pixels::RGBA))
        return std::nullopt;
    constexpr std::uint32_t rowBuffers = 8; // a few rows of up to 16 bits a channel
    constexpr std::uint64_t tables = std::uint64_t{128} << 10;
    return EncodedImageInfo{reader.width(), reader.height(),
                            rgbaSize(reader.width(), reader.height() + rowBuffers) + tables};
}

EncodedImageCheck checkPNG(Bytes encoded) {
    PNGReader reader(encoded);
    if (!reader.readHeader(PNGReader::Pixels::AsStored))
        return {};
    EncodedImageCheck check{EncodedImageCheck::Undecodable, reader.width(), reader.height(), reader.storedSize(), 0};
    if (std::max<std::uint64_t>(reader.storedSize(), encoded.size()) <= s_mostUnpackedToCheck) {
        if (reader.readPixels(nullptr))
            check.state = EncodedImageCheck::Decodable;
        check.surplusBytes = reader.surplus();
    } else if (const auto surplus = surplusAfterChunks(encoded)) {
        check.state = EncodedImageCheck::NotUnpacked;
        check.surplusBytes = *surplus;
    }
    return check;
}

std::vector<std::uint8_t> encodePNG(const Image& image) {
    if (!isEncodable(image))
        return {};
    std::vector<std::uint8_t> encoded = PNGWriter().encode(image, PNGEffort::Quick);
    if (encoded.size() <= image.rgba().size() / s_cursorRatio)
        return encoded;
    std::vector<std::uint8_t> smaller = PNGWriter().encode(image, PNGEffort::Thorough);
    return smaller.empty() || encoded.size() <= smaller.size() ? encoded : smaller;
}

} // namespace ZULMetaData
