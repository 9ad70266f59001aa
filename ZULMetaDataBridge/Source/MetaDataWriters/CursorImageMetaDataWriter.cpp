#include "ZULMetaDataBridge/Source/MetaDataWriters/CursorImageMetaDataWriter.h"

#include <optional>
#include <vector>

namespace ZULMetaData {

namespace {

std::vector<std::uint8_t> encodedAsPNG(const Image& image) {
    const std::optional<BitmapImageRep> bitmap = BitmapImageRep::fromTIFF(image.tiffRepresentation());
    return bitmap ? bitmap->pngRepresentation() : std::vector<std::uint8_t>();
}

/// Takes the image data off a cursor again, also when writing it throws.
struct ImageDataDetacher {
    CursorImage& cursor;
    ~ImageDataDetacher() { cursor.freeImageData(false); }
};

} // namespace

void CursorImageMetaDataWriter::writeCursorImage(const Image& image, std::int64_t uid, std::int32_t cursorTypeId,
                                                 std::uint32_t cursorImageFlags, const ScreenPoint& hotSpot,
                                                 const MediaTime& time) {
    std::vector<std::uint8_t> png = encodedAsPNG(image);
    const Point hotspot = truncated(hotSpot);
    CursorImage cursor(static_cast<std::uint64_t>(uid), hotspot.x, hotspot.y, png.empty() ? nullptr : png.data(),
                       static_cast<std::uint32_t>(png.size()), static_cast<CursorTypeID>(cursorTypeId),
                       static_cast<CursorImage::CursorImageFlags>(cursorImageFlags));
    writeCursorImage(cursor, time.seconds());
}

void CursorImageMetaDataWriter::writeCursorImage(CursorImage& cursor, double atTimStamp) {
    const ImageDataDetacher detacher{cursor};
    append(cursor, atTimStamp, shouldFlush());
    ++cursorsWritten_;
}

void CursorImageMetaDataWriter::writeCursorWithExistingUID(std::int64_t uid, const MediaTime& time) {
    CursorImage cursor;
    cursor.uniqueId = static_cast<std::uint64_t>(uid);
    writeCursorImage(cursor, time.seconds());
}

} // namespace ZULMetaData
