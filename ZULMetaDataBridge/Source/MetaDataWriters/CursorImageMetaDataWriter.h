#pragma once

#include "../../../Platform/Image.h"
#include "../../../SharedDependencies/Export.h"
#include "KindMetaDataWriter.h"

#include <cstdint>

namespace ZULMetaData {

/// What the cursor looked like. Images repeat: the application numbers its cursors, writes each image once, and
/// afterwards only its number. The first entry and every 15th after it are flushed.
class ZULMETADATA_API CursorImageMetaDataWriter final : public KindMetaDataWriter<CursorImageKind> {
public:
    CursorImageMetaDataWriter() = default;
    explicit CursorImageMetaDataWriter(const FileLocation& file) { initWithMetaDataFile(file); } ///< creates the file

    /// Stores `image` as PNG. One that cannot be encoded leaves an entry without image, hot spot and type.
    void writeCursorImage(const Image& image, std::int64_t uid, std::int32_t cursorTypeId,
                          std::uint32_t cursorImageFlags, const ScreenPoint& hotSpot, const MediaTime& time);

    /// Writes an image that is encoded already, at a time in seconds. Afterwards `cursor` has no image data any
    /// more: the bytes, which are not freed, are the caller's.
    void writeCursorImage(CursorImage& cursor, double atTimStamp);

    /// The cursor is again the one that was written as `uid` before.
    void writeCursorWithExistingUID(std::int64_t uid, const MediaTime& time);

    void finish() { closeStream(); } ///< closes the file: what is written afterwards is lost

    bool shouldFlush() const { return cursorsWritten_ % s_flushInterval == 0; } ///< whether the next entry is flushed

    /// Images and repetitions, over all files of this writer.
    std::uint32_t cursorsWritten() const { return cursorsWritten_; }
    void setCursorsWritten(std::uint32_t count) { cursorsWritten_ = count; } ///< 0 makes the next entry a flushed one

    /// For the application to keep the last number that it gave; never looked at here.
    std::int64_t currentUniqueID() const { return currentUniqueID_; }
    void setCurrentUniqueID(std::int64_t uid) { currentUniqueID_ = uid; } ///< changes nothing that is written

private:
    std::uint32_t cursorsWritten_ = 0;
    std::int64_t currentUniqueID_ = 0;
};

} // namespace ZULMetaData
