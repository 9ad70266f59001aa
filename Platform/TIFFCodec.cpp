#include "Platform/ImageCodecs.h"

#include <tiffio.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <limits>
#include <memory>
#include <new>
#include <utility>

#if TIFFLIB_VERSION < 20221213
#error "libtiff 4.5 or newer is needed: only it reports errors to the handle that they belong to"
#endif

namespace ZULMetaData {

namespace {

constexpr const char* s_handleName = "image";

// ---- what libtiff reads from and writes to ----

struct Input {
    std::span<const std::uint8_t> bytes;
    std::uint64_t position = 0;
    bool cutShort = false; ///< whether bytes after the end were asked for
};

/// Never grows beyond its reserved capacity, so that no exception can arise inside libtiff.
struct Output {
    std::vector<std::uint8_t> bytes;
    std::uint64_t position = 0;
};

tmsize_t readBytes(thandle_t handle, void* target, tmsize_t size) {
    auto& input = *static_cast<Input*>(handle);
    const auto wanted = static_cast<std::uint64_t>(std::max<tmsize_t>(size, 0));
    const auto left = input.bytes.size() - std::min<std::uint64_t>(input.position, input.bytes.size());
    const auto count = std::min<std::uint64_t>(wanted, left);
    input.cutShort = input.cutShort || count < wanted;
    std::copy_n(input.bytes.last(left).begin(), count, static_cast<std::uint8_t*>(target));
    input.position += count;
    return static_cast<tmsize_t>(count);
}

tmsize_t writeBytes(thandle_t handle, void* source, tmsize_t size) {
    auto& output = *static_cast<Output*>(handle);
    const auto capacity = output.bytes.capacity();
    if (size <= 0 || output.position > capacity || static_cast<std::uint64_t>(size) > capacity - output.position)
        return 0;
    const auto end = output.position + static_cast<std::uint64_t>(size);
    output.bytes.resize(std::max<std::size_t>(output.bytes.size(), end));
    std::memcpy(output.bytes.data() + output.position, source, static_cast<std::size_t>(size));
    output.position = end;
    return size;
}

tmsize_t refuse(thandle_t, void*, tmsize_t) {
    return 0;
}

template <class Stream>
toff_t seek(thandle_t handle, toff_t offset, int origin) {
    auto& stream = *static_cast<Stream*>(handle);
    const std::uint64_t base = origin == SEEK_CUR ? stream.position : origin == SEEK_END ? stream.bytes.size() : 0;
    const std::uint64_t target = base + offset;
    if (target > static_cast<std::uint64_t>(std::numeric_limits<std::int64_t>::max()))
        return static_cast<toff_t>(-1);
    return stream.position = target;
}

template <class Stream>
toff_t sizeOf(thandle_t handle) {
    return static_cast<Stream*>(handle)->bytes.size();
}

int leaveOpen(thandle_t) {
    return 0;
}

// ---- handles that keep their troubles to themselves ----

struct Troubles {
    bool error = false;
    bool warning = false;
};

/// The result 1 keeps libtiff from calling the handlers of the whole process.
int noteError(TIFF*, void* troubles, const char*, const char*, va_list) {
    static_cast<Troubles*>(troubles)->error = true;
    return 1;
}

int noteWarning(TIFF*, void* troubles, const char*, const char*, va_list) {
    static_cast<Troubles*>(troubles)->warning = true;
    return 1;
}

struct Deleter {
    void operator()(TIFF* tiff) const { TIFFClose(tiff); }
    void operator()(TIFFOpenOptions* options) const { TIFFOpenOptionsFree(options); }
};

using Handle = std::unique_ptr<TIFF, Deleter>;

std::unique_ptr<TIFFOpenOptions, Deleter> quietOptions(Troubles& troubles) {
    std::unique_ptr<TIFFOpenOptions, Deleter> options(TIFFOpenOptionsAlloc());
    if (!options)
        throw std::bad_alloc();
    TIFFOpenOptionsSetErrorHandlerExtR(options.get(), noteError, &troubles);
    TIFFOpenOptionsSetWarningHandlerExtR(options.get(), noteWarning, &troubles);
    return options;
}

// ---- decoding ----

/// A string as long as the whole table, 4096 bytes, from a code of 12 bits. No other ratio here is better.
constexpr std::uint64_t s_maximumLZWRatio = 2800;

/// How many bytes of pixels one byte of the file can stand for at best; 0 for a compression that is not read. Those
/// left out hide damage (fax), are hardly met in small pictures, or have no useful bound.
std::uint64_t maximumRatio(std::uint16_t compression) {
    switch (compression) {
    case COMPRESSION_NONE: return 1;
    case COMPRESSION_PACKBITS: return 64; // 128 bytes from 2
    case COMPRESSION_LZW: return s_maximumLZWRatio;
    case COMPRESSION_JPEG: return 1600; // a block of 64 pixels, three bytes each, from one bit
    case COMPRESSION_DEFLATE:
    case COMPRESSION_ADOBE_DEFLATE: return s_maximumDeflateRatio;
    default: return 0;
    }
}

/// No block that libtiff may ask for is larger: neither a 16-bit RGBA picture of the largest size nor what the best
/// ratio makes of this file. The constant leaves room for tables.
tmsize_t allocationLimit(std::size_t encodedSize) {
    constexpr std::uint64_t largest = std::uint64_t{8} * s_maximumImageSide * s_maximumImageSide;
    constexpr std::uint64_t tables = std::uint64_t{1} << 20;
    const auto plausible = std::min<std::uint64_t>(encodedSize, largest) * s_maximumLZWRatio + tables;
    return static_cast<tmsize_t>(std::min(plausible, largest));
}

Handle openForReading(Input& input, Troubles& troubles) {
    const auto options = quietOptions(troubles);
    TIFFOpenOptionsSetMaxSingleMemAlloc(options.get(), allocationLimit(input.bytes.size()));
    return Handle(TIFFClientOpenExt(s_handleName, "rm", &input, readBytes, refuse, seek<Input>, leaveOpen,
                                    sizeOf<Input>, nullptr, nullptr, options.get()));
}

/// One number of a directory, or its default; 0 if it has neither.
template <class Number>
Number field(TIFF* tiff, std::uint32_t tag) {
    Number value = 0;
    return TIFFGetFieldDefaulted(tiff, tag, &value) == 1 ? value : Number{0};
}

struct Extent {
    std::uint32_t width;
    std::uint32_t height;
};

Extent extentOf(TIFF* tiff) {
    return {field<std::uint32_t>(tiff, TIFFTAG_IMAGEWIDTH), field<std::uint32_t>(tiff, TIFFTAG_IMAGELENGTH)};
}

/// The bytes of all rows or tiles, in every plane, before compression; 0 if there are none.
std::uint64_t unpackedSize(TIFF* tiff, Extent extent) {
    const auto planes = field<std::uint16_t>(tiff, TIFFTAG_PLANARCONFIG) == PLANARCONFIG_SEPARATE
                            ? field<std::uint16_t>(tiff, TIFFTAG_SAMPLESPERPIXEL)
                            : std::uint16_t{1};
    const bool tiled = TIFFIsTiled(tiff) != 0;
    const std::uint64_t pieceSize = tiled ? TIFFTileSize64(tiff) : TIFFScanlineSize64(tiff);
    const std::uint64_t pieces = tiled ? TIFFNumberOfTiles(tiff) : std::uint64_t{extent.height} * planes;
    return pieces > 0 && pieceSize > std::numeric_limits<std::uint64_t>::max() / pieces
               ? std::numeric_limits<std::uint64_t>::max()
               : pieceSize * pieces;
}

/// All strips or tiles together may not unpack to more than the file can hold, also if they share their bytes.
bool canHold(TIFF* tiff, Extent extent, std::size_t encodedSize) {
    if (!isImageSizeAllowed(extent.width, extent.height))
        return false;
    const std::uint64_t unpacked = unpackedSize(tiff, extent);
    return unpacked > 0 && unpacked <= maximumRatio(field<std::uint16_t>(tiff, TIFFTAG_COMPRESSION)) * encodedSize;
}

/// Whether the picture is stored with its columns in place of its rows.
bool isTurned(TIFF* tiff) {
    return field<std::uint16_t>(tiff, TIFFTAG_ORIENTATION) > ORIENTATION_BOTLEFT;
}

/// The bytes of all strips or tiles as they are stored, which may share them.
struct StoredPieces {
    std::uint32_t count = 0;
    std::uint64_t largest = 0;
    std::uint64_t all = 0;
};

StoredPieces storedPieces(TIFF* tiff) {
    StoredPieces pieces;
    pieces.count = TIFFIsTiled(tiff) != 0 ? TIFFNumberOfTiles(tiff) : TIFFNumberOfStrips(tiff);
    for (std::uint32_t piece = 0; piece < pieces.count; ++piece) {
        const std::uint64_t size = TIFFGetStrileByteCount(tiff, piece);
        pieces.largest = std::max(pieces.largest, size);
        pieces.all += std::min<std::uint64_t>(size, std::numeric_limits<std::uint32_t>::max());
    }
    return pieces;
}

/// What decoding may hold at a time: the pixels, twice if they are turned, a strip or tile of each plane that is shown,
/// and its bytes as they are stored, which libtiff asks for in growing steps until they turn out to be missing.
std::uint64_t memoryToDecode(TIFF* tiff, Extent extent, std::size_t encodedSize) {
    constexpr std::uint64_t firstStep = std::uint64_t{1} << 20;
    constexpr std::uint64_t largestGrowth = 11;
    constexpr std::uint64_t planes = 4;
    const std::uint64_t pieceSize = TIFFIsTiled(tiff) != 0 ? TIFFTileSize64(tiff) : TIFFStripSize64(tiff);
    const StoredPieces stored = storedPieces(tiff);
    const std::uint64_t read = std::min<std::uint64_t>(stored.largest, largestGrowth * encodedSize + firstStep);
    const std::uint64_t copies = isTurned(tiff) ? 2 : 1;
    return copies * rgbaSize(extent.width, extent.height) + planes * pieceSize + read +
           2 * sizeof(std::uint64_t) * stored.count;
}

/// Whether decoding takes too long for a check. A JPEG file may go over all of its pixels a hundred times.
bool isTooMuchWork(TIFF* tiff, std::uint64_t unpacked) {
    constexpr std::uint64_t costOfJPEG = 32;
    const bool isJPEG = field<std::uint16_t>(tiff, TIFFTAG_COMPRESSION) == COMPRESSION_JPEG;
    return unpacked * (isJPEG ? costOfJPEG : 1) > s_mostUnpackedToCheck ||
           storedPieces(tiff).all > s_mostUnpackedToCheck;
}

/// The kinds of the channels after the colours. If there was no memory for them, libtiff keeps their number alone, and
/// stumbles over it later or leaves them out of the file.
std::span<const std::uint16_t> extraSamples(TIFF* tiff) {
    std::uint16_t count = 0;
    std::uint16_t* kinds = nullptr;
    if (TIFFGetField(tiff, TIFFTAG_EXTRASAMPLES, &count, &kinds) != 1 || count == 0)
        return {};
    if (!kinds)
        throw std::bad_alloc();
    return {kinds, count};
}

/// libtiff multiplies colours by a straight alpha, which loses them where alpha is small. It leaves them alone if alpha
/// is marked as premultiplied, so the handle (not the file) is told that it is. Returns whether it really is.
bool markAlphaAsPremultiplied(TIFF* tiff) {
    const auto kinds = extraSamples(tiff);
    if (kinds.empty())
        return false;
    const bool premultiplied = kinds[0] == EXTRASAMPLE_ASSOCALPHA;
    std::vector<std::uint16_t> marked(kinds.begin(), kinds.end());
    marked[0] = EXTRASAMPLE_ASSOCALPHA;
    TIFFSetField(tiff, TIFFTAG_EXTRASAMPLES, static_cast<int>(marked.size()), marked.data());
    extraSamples(tiff);
    return premultiplied;
}

/// libtiff knows how to mirror but not how to turn by a quarter. A turned picture is mirrored so that its transpose is
/// upright. Returns whether it has to be transposed.
bool mirrorInsteadOfTurning(TIFF* tiff) {
    constexpr std::array<int, 4> mirrors{ORIENTATION_TOPLEFT, ORIENTATION_BOTLEFT, ORIENTATION_BOTRIGHT,
                                         ORIENTATION_TOPRIGHT}; // instead of LEFTTOP, RIGHTTOP, RIGHTBOT and LEFTBOT
    const std::size_t orientation = field<std::uint16_t>(tiff, TIFFTAG_ORIENTATION);
    if (orientation < ORIENTATION_LEFTTOP || orientation - ORIENTATION_LEFTTOP >= mirrors.size())
        return false;
    TIFFSetField(tiff, TIFFTAG_ORIENTATION, mirrors[orientation - ORIENTATION_LEFTTOP]);
    return true;
}

/// Whether libtiff hands the samples over as what they are: colours that need no conversion by guesswork, together
/// with their alpha.
bool isReadInFull(const TIFFRGBAImage& image, TIFF* tiff) {
    const auto format = field<std::uint16_t>(tiff, TIFFTAG_SAMPLEFORMAT);
    if (format != SAMPLEFORMAT_UINT && format != SAMPLEFORMAT_VOID)
        return false;
    const bool alphaStored = field<std::uint16_t>(tiff, TIFFTAG_SAMPLESPERPIXEL) > 1;
    switch (image.photometric) {
    case PHOTOMETRIC_RGB: return true;
    case PHOTOMETRIC_PALETTE: return !alphaStored;
    case PHOTOMETRIC_MINISWHITE:
    case PHOTOMETRIC_MINISBLACK:
        return !alphaStored || (image.isContig != 0 && image.bitspersample == 8 && image.samplesperpixel == 2);
    default: return false;
    }
}

/// Fills `rgba` with one pixel per 32-bit word, red in the lowest byte. Such words are the bytes that are wanted.
static_assert(std::endian::native == std::endian::little);
bool readPixels(TIFF* tiff, std::uint32_t width, std::uint32_t height, std::vector<std::uint8_t>& rgba) {
    TIFFRGBAImage image{};
    char reason[1024] = {};
    constexpr int stopOnError = 1;
    if (TIFFRGBAImageOK(tiff, reason) != 1 || TIFFRGBAImageBegin(&image, tiff, stopOnError, reason) != 1)
        return false;
    image.req_orientation = ORIENTATION_TOPLEFT;
    const bool read = isReadInFull(image, tiff) &&
                      TIFFRGBAImageGet(&image, reinterpret_cast<std::uint32_t*>(rgba.data()), width, height) == 1;
    TIFFRGBAImageEnd(&image);
    return read;
}

void undoPremultiplication(std::vector<std::uint8_t>& rgba) {
    for (std::size_t i = 0; i < rgba.size(); i += 4) {
        const unsigned alpha = rgba[i + 3];
        for (std::size_t channel = i; channel < i + 3; ++channel) {
            const unsigned straight = alpha == 0 ? 0 : (rgba[channel] * 255U + alpha / 2) / alpha;
            rgba[channel] = static_cast<std::uint8_t>(std::min(straight, 255U));
        }
    }
}

Image transposed(std::uint32_t width, std::uint32_t height, const std::vector<std::uint8_t>& rgba) {
    std::vector<std::uint8_t> turned(rgba.size());
    for (std::uint32_t y = 0; y < height; ++y)
        for (std::uint32_t x = 0; x < width; ++x)
            std::memcpy(&turned[rgbaSize(height, x) + 4 * std::size_t{y}],
                        &rgba[rgbaSize(width, y) + 4 * std::size_t{x}], 4);
    return {height, width, std::move(turned)};
}

/// The first picture of a file. Only its directory is read.
struct OpenPicture {
    explicit OpenPicture(std::span<const std::uint8_t> encoded)
        : input{encoded}, tiff(openForReading(input, troubles)), extent(tiff ? extentOf(tiff.get()) : Extent{}),
          isPlausible(tiff && canHold(tiff.get(), extent, encoded.size())) {}
    OpenPicture(const OpenPicture&) = delete;
    OpenPicture& operator=(const OpenPicture&) = delete;

    EncodedImageInfo info() const {
        const std::uint64_t memory = memoryToDecode(tiff.get(), extent, input.bytes.size());
        return isTurned(tiff.get()) ? EncodedImageInfo{extent.height, extent.width, memory}
                                    : EncodedImageInfo{extent.width, extent.height, memory};
    }

    Troubles troubles;
    Input input;
    Handle tiff;
    Extent extent;    ///< as it is stored
    bool isPlausible; ///< false if the file cannot be opened, or cannot hold the picture that it claims
};

// ---- encoding ----

bool describe(TIFF* tiff, const Image& image) {
    constexpr std::uint16_t alphaKind = EXTRASAMPLE_UNASSALPHA;
    return TIFFSetField(tiff, TIFFTAG_IMAGEWIDTH, image.width()) == 1 &&
           TIFFSetField(tiff, TIFFTAG_IMAGELENGTH, image.height()) == 1 &&
           TIFFSetField(tiff, TIFFTAG_SAMPLESPERPIXEL, 4) == 1 && TIFFSetField(tiff, TIFFTAG_BITSPERSAMPLE, 8) == 1 &&
           TIFFSetField(tiff, TIFFTAG_EXTRASAMPLES, 1, &alphaKind) == 1 && !extraSamples(tiff).empty() &&
           TIFFSetField(tiff, TIFFTAG_PHOTOMETRIC, PHOTOMETRIC_RGB) == 1 &&
           TIFFSetField(tiff, TIFFTAG_COMPRESSION, COMPRESSION_NONE) == 1 &&
           TIFFSetField(tiff, TIFFTAG_PLANARCONFIG, PLANARCONFIG_CONTIG) == 1 &&
           TIFFSetField(tiff, TIFFTAG_ORIENTATION, ORIENTATION_TOPLEFT) == 1 &&
           TIFFSetField(tiff, TIFFTAG_ROWSPERSTRIP, image.height()) == 1;
}

bool writePixels(TIFF* tiff, const Image& image) {
    const auto size = static_cast<tmsize_t>(image.rgba().size());
    // Uncompressed samples of one byte are only read, whatever the parameter's type says.
    auto* rgba = const_cast<std::uint8_t*>(image.rgba().data());
    return TIFFWriteEncodedStrip(tiff, 0, rgba, size) == size;
}

} // namespace

std::optional<EncodedImageInfo> readTIFFInfo(std::span<const std::uint8_t> encoded) {
    const OpenPicture picture(encoded);
    return picture.isPlausible ? std::optional(picture.info()) : std::nullopt;
}

EncodedImageCheck checkTIFF(std::span<const std::uint8_t> encoded, std::uint64_t memory) {
    const OpenPicture picture(encoded);
    if (!picture.isPlausible)
        return {};
    const auto [width, height, decodingMemory] = picture.info();
    const std::uint64_t unpacked = unpackedSize(picture.tiff.get(), picture.extent);
    EncodedImageCheck check{EncodedImageCheck::NotUnpacked, width, height, unpacked, 0};
    if (decodingMemory <= memory && !isTooMuchWork(picture.tiff.get(), unpacked))
        check.state = decodeTIFF(encoded) ? EncodedImageCheck::Decodable : EncodedImageCheck::Undecodable;
    return check;
}

std::optional<Image> decodeTIFF(std::span<const std::uint8_t> encoded) {
    OpenPicture picture(encoded);
    if (!picture.isPlausible)
        return std::nullopt;
    TIFF* const tiff = picture.tiff.get();
    const auto [width, height] = picture.extent;
    const bool premultiplied = markAlphaAsPremultiplied(tiff);
    const bool sideways = mirrorInsteadOfTurning(tiff);
    std::vector<std::uint8_t> rgba(rgbaSize(width, height));
    // A directory may hold tags that libtiff only warns about. A warning about the pixels means that some are lost.
    picture.troubles.warning = false;
    const bool read = readPixels(tiff, width, height, rgba);
    if (!read || picture.troubles.error || picture.troubles.warning || picture.input.cutShort)
        return std::nullopt;
    if (premultiplied)
        undoPremultiplication(rgba);
    return sideways ? transposed(width, height, rgba) : Image(width, height, std::move(rgba));
}

std::vector<std::uint8_t> encodeTIFF(const Image& image) {
    if (!isEncodable(image))
        return {};
    constexpr std::size_t roomForDirectory = 4096;
    Troubles troubles;
    Output output;
    output.bytes.reserve(image.rgba().size() + roomForDirectory);
    Handle tiff(TIFFClientOpenExt(s_handleName, "wlm", &output, refuse, writeBytes, seek<Output>, leaveOpen,
                                  sizeOf<Output>, nullptr, nullptr, quietOptions(troubles).get()));
    const bool written =
        tiff && describe(tiff.get(), image) && writePixels(tiff.get(), image) && TIFFWriteDirectory(tiff.get()) == 1;
    tiff.reset();
    if (!written || troubles.error) // the image can be encoded, and there is room for it
        throw std::bad_alloc();
    return std::move(output.bytes);
}

} // namespace ZULMetaData
