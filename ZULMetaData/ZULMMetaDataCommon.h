#pragma once

// The values in metadata streams, and the identifier that names each kind of stream.
//
// Values of a fixed size are stored as they lie in memory. The order and the width of their fields are part of the file
// format and must not change.

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

static_assert(std::endian::native == std::endian::little,
              "streams are little-endian and hold values as they lie in memory");

/// A position or a delta, in pixels.
struct Point {
    std::int32_t x = 0; ///< horizontal; a position counts from the left edge of the display
    std::int32_t y = 0; ///< vertical; a position counts from the upper edge of the display

    constexpr Point() = default;
    constexpr Point(std::int32_t xValue, std::int32_t yValue)
        : x(xValue), y(yValue) {}                                           ///< takes the fields in stored order
    friend constexpr bool operator==(const Point&, const Point&) = default; ///< compares both fields
};

/// A rectangle, in pixels.
struct Rect {
    std::int32_t x = 0;      ///< the left edge, counted from the left edge of the display
    std::int32_t y = 0;      ///< the upper edge, counted from the upper edge of the display
    std::int32_t width = 0;  ///< the extent to the right
    std::int32_t height = 0; ///< the extent downward

    constexpr Rect() = default;

    /// Takes the fields in stored order.
    constexpr Rect(std::int32_t xValue, std::int32_t yValue, std::int32_t widthValue, std::int32_t heightValue)
        : x(xValue), y(yValue), width(widthValue), height(heightValue) {}
    friend constexpr bool operator==(const Rect&, const Rect&) = default; ///< compares all fields
};

/// A key and the modifiers that were held down with it.
struct KeyStroke {
    std::uint32_t characterCode = 0;  ///< a virtual-key code, or a character
    std::uint32_t eventFlagsCode = 0; ///< one bit for each modifier that is held down; other bits may be set too

    constexpr KeyStroke() = default;

    /// Takes the fields in stored order.
    constexpr KeyStroke(std::uint32_t character, std::uint32_t eventFlags)
        : characterCode(character), eventFlagsCode(eventFlags) {}
    friend constexpr bool operator==(const KeyStroke&, const KeyStroke&) = default; ///< compares both fields
};

/// Tells which system cursor an image shows. Recorders store numbers of their own; only "unknown" has a name here.
enum CursorTypeID : std::int32_t { CursorTypeUnknown = -1 };

/// One appearance of the cursor: an image, or only the identifier of an image that was stored earlier. Owns
/// `imageData`, which is allocated with `malloc`.
class ZULMETADATA_API CursorImage {
public:
    /// Bits that the recorder defines and that are stored unchanged. A plain image has the two lowest bits set.
    enum CursorImageFlags : std::uint32_t { DefaultFlags = 3 };

    std::uint64_t uniqueId = 0;         ///< identifies the image within a recording
    std::int32_t hotspotOffsetX = 0;    ///< pixels from the left edge of the image to the point that the cursor marks
    std::int32_t hotspotOffsetY = 0;    ///< pixels from the upper edge of the image to that point, downward
    std::uint32_t imageDataSize = 0;    ///< the number of bytes in `imageData`
    unsigned char* imageData = nullptr; ///< the encoded image, or null
    CursorTypeID cursorTypeId = CursorTypeUnknown; ///< stored only together with an image
    CursorImageFlags flags = DefaultFlags;         ///< stored in every entry of version 2

    CursorImage() = default;

    /// Takes ownership of `data`. It is freed with this object unless `freeImageData(false)` hands it back first.
    CursorImage(std::uint64_t id, std::int32_t hotspotX, std::int32_t hotspotY, unsigned char* data,
                std::uint32_t dataSize, CursorTypeID typeId, CursorImageFlags imageFlags);

    /// Copies the image bytes if `other` has both a size and a buffer; otherwise the copy has neither. If memory runs
    /// out, the copy has the size but no buffer.
    CursorImage(const CursorImage& other);
    CursorImage& operator=(const CursorImage& other); ///< frees the previous image bytes

    CursorImage(CursorImage&& other) noexcept; ///< takes the image bytes; the other fields stay in `other` too
    CursorImage& operator=(CursorImage&& other) noexcept; ///< frees the previous image bytes

    virtual ~CursorImage();

    /// Removes the image: afterwards the size is 0 and the buffer null. If `freeBytes` is false, the bytes are not
    /// freed; the caller must have kept their address and frees them.
    void freeImageData(bool freeBytes);

    /// Compares all fields, and the image bytes only if both images have them.
    friend ZULMETADATA_API bool operator==(const CursorImage& left, const CursorImage& right);

private:
    void copyAllButImage(const CursorImage& other);
};

/// An identifier of 16 bytes, stored in the order in which they are printed. No bytes are ever swapped.
struct ZULMETADATA_API uuid {
    std::uint8_t data[16]; ///< the byte at index 0 is printed first

    /// Reads two characters and returns their value, as `hexCharsToUint8` does.
    static std::uint8_t readUint8FromHexChars(std::istream& stream);

    /// Returns the low byte of the result of `strtol` for the first two characters in base 16. Only the valid part at
    /// the beginning counts; white space and a sign are accepted there. Returns 0 if no character is valid.
    static std::uint8_t hexCharsToUint8(const char* chars);

    friend constexpr auto operator<=>(const uuid&, const uuid&) = default; ///< compares byte by byte
};

/// Writes 8-4-4-4-12 lower-case digits. Afterwards the stream still prints numbers in hexadecimal, filled with zeros.
ZULMETADATA_API std::ostream& operator<<(std::ostream& stream, const uuid& id);

/// Reads exactly 36 characters. None of them is checked, not even the four separators.
ZULMETADATA_API std::istream& operator>>(std::istream& stream, uuid& id);

ZULMETADATA_API std::ostream& operator<<(std::ostream& stream, const Point& point);         ///< writes "(x,y)"
ZULMETADATA_API std::ostream& operator<<(std::ostream& stream, const Rect& rect);           ///< "(x,y,width,height)"
ZULMETADATA_API std::ostream& operator<<(std::ostream& stream, const KeyStroke& keyStroke); ///< writes both numbers

/// Writes the address of the image bytes, as a signed number, instead of the bytes.
ZULMETADATA_API std::ostream& operator<<(std::ostream& stream, const CursorImage& image);

/// `T` is exactly one of these types.
template <class T, class... Types>
concept OneOf = (std::same_as<T, Types> || ...);

/// A value whose entries all have the same size. An entry is the time, then the value as it lies in memory.
template <class T>
concept FixedSizeValue = OneOf<T, Point, Rect, KeyStroke, int, float, double> && std::is_trivially_copyable_v<T>;

/// A value that an entry of a metadata stream can hold.
template <class T>
concept StreamValue = FixedSizeValue<T> || OneOf<T, CursorImage, std::string, std::list<std::string>>;

static_assert(sizeof(Point) == 8 && sizeof(Rect) == 16 && sizeof(KeyStroke) == 8);
static_assert(sizeof(int) == 4 && sizeof(float) == 4 && sizeof(double) == 8);

} // namespace ZULMetaData
