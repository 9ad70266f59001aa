#pragma once

#include "../../../Platform/Image.h"
#include "../../../SharedDependencies/Export.h"
#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// Writes what the cursor looks like. Images repeat, so the application gives each image a number, writes the image
/// once and afterwards only its number. The first entry and every 15th entry after it are flushed.
class ZULMETADATA_API CursorImageMetaDataWriter final : public KindMetaDataWriter<CursorImageKind> {
public:
    CursorImageMetaDataWriter() = default;
    explicit CursorImageMetaDataWriter(const FileLocation& file) { initWithMetaDataFile(file); } ///< creates the file

    /// Writes `image` as PNG. If it cannot be encoded, the entry has no image, hot spot or type.
    void writeCursorImage(const Image& image, std::int64_t uid, std::int32_t cursorTypeId,
                          std::uint32_t cursorImageFlags, const ScreenPoint& hotSpot, const MediaTime& time);

    /// Writes an image that is already encoded, at a time in seconds. Afterwards `cursor` has no image data. The bytes
    /// are not freed; the caller must have kept their address and frees them.
    void writeCursorImage(CursorImage& cursor, double atTimStamp);

    /// Writes that the cursor is again the one that was written as `uid` before.
    void writeCursorWithExistingUID(std::int64_t uid, const MediaTime& time);

    void finish() { closeStream(); } ///< closes the file; later entries are lost

    bool shouldFlush() const {
        return cursorsWritten_ % s_flushInterval == 0;
    } ///< returns whether the next entry is flushed

    /// Returns the number of entries in all files of this writer.
    std::uint32_t cursorsWritten() const { return cursorsWritten_; }
    void setCursorsWritten(std::uint32_t count) { cursorsWritten_ = count; } ///< 0 makes the next entry flush

    /// Returns a number that the application may keep here, for example the last one that it used. The writer ignores
    /// it.
    std::int64_t currentUniqueID() const { return currentUniqueID_; }
    void setCurrentUniqueID(std::int64_t uid) { currentUniqueID_ = uid; } ///< has no effect on the file

private:
    std::uint32_t cursorsWritten_ = 0;
    std::int64_t currentUniqueID_ = 0;
};

} // namespace ZULMetaData
