#pragma once

// The values that metadata streams carry, and the identifier that names each kind of stream.
// The fixed-size values are stored as they lie in memory: the order and width of their fields is a file format.

#include "../SharedDependencies/EndianFile.h"
#include "../SharedDependencies/Export.h"

#include <bit>
#include <compare>
#include <concepts>
#include <cstdint>
#include <iosfwd>
#include <list>
#include <string>
#include <type_traits>

namespace ZULMetaData {

static_assert(std::endian::native == std::endian::little, "streams hold the host's bytes and are little-endian");

/// A position or a delta, in pixels.
struct Point {
    std::int32_t x = 0; ///< horizontal; a position counts from the left edge of the display
    std::int32_t y = 0; ///< vertical; a position counts from the upper edge of the display

    constexpr Point() = default;
    constexpr Point(std::int32_t xValue, std::int32_t yValue) : x(xValue), y(yValue) {} ///< in stored order
    friend constexpr bool operator==(const Point&, const Point&) = default;             ///< by both fields
};

/// Origin and size, in pixels.
struct Rect {
    std::int32_t x = 0;      ///< from the left edge of the display
    std::int32_t y = 0;      ///< from its upper edge
    std::int32_t width = 0;  ///< to the right
    std::int32_t height = 0; ///< downward

    constexpr Rect() = default;

    /// In stored order.
    constexpr Rect(std::int32_t xValue, std::int32_t yValue, std::int32_t widthValue, std::int32_t heightValue)
        : x(xValue), y(yValue), width(widthValue), height(heightValue) {}
    friend constexpr bool operator==(const Rect&, const Rect&) = default; ///< by all four fields
};

/// A key (its character or key code) and the modifier flags of the key event.
struct KeyStroke {
    std::uint32_t characterCode = 0;  ///< a virtual-key code, or a character
    std::uint32_t eventFlagsCode = 0; ///< a bit for each modifier that is held down, perhaps others

    constexpr KeyStroke() = default;

    /// In stored order.
    constexpr KeyStroke(std::uint32_t character, std::uint32_t eventFlags)
        : characterCode(character), eventFlagsCode(eventFlags) {}
    friend constexpr bool operator==(const KeyStroke&, const KeyStroke&) = default; ///< by both fields
};

/// Which system cursor an image shows. The recorder passes its own numbers through; only "unknown" has a name.
enum CursorTypeID : std::int32_t { CursorTypeUnknown = -1 };

/// One appearance of the cursor: its image, or only the identifier of an image that came earlier.
/// Owns `imageData`, which is allocated by `malloc`.
class ZULMETADATA_API CursorImage {
public:
    /// The recorder's own bits, passed through; a plain image has the two lowest set.
    enum CursorImageFlags : std::uint32_t { DefaultFlags = 3 };

    std::uint64_t uniqueId = 0;         ///< identifies the image within a recording
    std::int32_t hotspotOffsetX = 0;    ///< pixels from the image's left edge to the place that the cursor points at
    std::int32_t hotspotOffsetY = 0;    ///< the same from its upper edge, downward
    std::uint32_t imageDataSize = 0;    ///< bytes in `imageData`
    unsigned char* imageData = nullptr; ///< an encoded image
    CursorTypeID cursorTypeId = CursorTypeUnknown; ///< stored beside an image only
    CursorImageFlags flags = DefaultFlags;         ///< stored in every entry of version 2

    CursorImage() = default;

    /// Adopts `data`: it is freed with this object unless `freeImageData(false)` gives it back first.
    CursorImage(std::uint64_t id, std::int32_t hotspotX, std::int32_t hotspotY, unsigned char* data,
                std::uint32_t dataSize, CursorTypeID typeId, CursorImageFlags imageFlags);

    /// Copies the bytes where there are both a size and a buffer, else the copy has neither. Where memory runs
    /// out, the copy has the size but no buffer.
    CursorImage(const CursorImage& other);
    CursorImage& operator=(const CursorImage& other); ///< frees the bytes that it replaces

    CursorImage(CursorImage&& other) noexcept;            ///< takes the bytes; all else stays in `other`, too
    CursorImage& operator=(CursorImage&& other) noexcept; ///< frees the bytes that it replaces

    virtual ~CursorImage();

    /// Lets go of the image: size 0 and no buffer. With `false` the caller keeps the bytes and must free them.
    void freeImageData(bool freeBytes);

    /// The bytes take part only where both images have them.
    friend ZULMETADATA_API bool operator==(const CursorImage& left, const CursorImage& right);

private:
    void copyAllButImage(const CursorImage& other);
};

/// 16 bytes in the order in which they are printed; no byte is ever swapped.
struct ZULMETADATA_API uuid {
    std::uint8_t data[16]; ///< the first one is printed first

    /// The value of the next two characters, read as `hexCharsToUint8` reads them.
    static std::uint8_t readUint8FromHexChars(std::istream& stream);

    /// The low byte of what `strtol` makes of the first two characters in base 16: the valid leading part counts,
    /// white space and a sign are let through, and nothing valid gives 0.
    static std::uint8_t hexCharsToUint8(const char* chars);

    friend constexpr auto operator<=>(const uuid&, const uuid&) = default; ///< byte by byte, the first one first
};

/// 8-4-4-4-12 lower-case digits. Leaves the stream printing numbers in hexadecimal, filled with zeros.
ZULMETADATA_API std::ostream& operator<<(std::ostream& stream, const uuid& id);

/// Takes exactly 36 characters and checks none of them, the four separators included.
ZULMETADATA_API std::istream& operator>>(std::istream& stream, uuid& id);

ZULMETADATA_API std::ostream& operator<<(std::ostream& stream, const Point& point);         ///< such as "(10,-4)"
ZULMETADATA_API std::ostream& operator<<(std::ostream& stream, const Rect& rect);           ///< "(x,y,width,height)"
ZULMETADATA_API std::ostream& operator<<(std::ostream& stream, const KeyStroke& keyStroke); ///< both as numbers

/// Shows the address of the image bytes, as a signed number, instead of the bytes.
ZULMETADATA_API std::ostream& operator<<(std::ostream& stream, const CursorImage& image);

/// Exactly one of these types.
template <class T, class... Types>
concept OneOf = (std::same_as<T, Types> || ...);

/// A value whose entries all have one size: the time, then the value as it lies in memory.
template <class T>
concept FixedSizeValue = OneOf<T, Point, Rect, KeyStroke, int, float, double> && std::is_trivially_copyable_v<T>;

/// What an entry of a metadata stream can hold.
template <class T>
concept StreamValue = FixedSizeValue<T> || OneOf<T, CursorImage, std::string, std::list<std::string>>;

static_assert(sizeof(Point) == 8 && sizeof(Rect) == 16 && sizeof(KeyStroke) == 8);
static_assert(sizeof(int) == 4 && sizeof(float) == 4 && sizeof(double) == 8);

} // namespace ZULMetaData
