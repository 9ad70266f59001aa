#pragma once

// Validates one stream: its header, then its entries by the layout of its kind.

#include "Platform/Image.h"
#include "ZULMetaData/CursorImageSchema.h"
#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaDataBridge/Source/Validation/FindingLog.h"
#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <functional>
#include <limits>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <utility>

namespace ZULMetaData::detail {

class StreamWalk {
public:
    /// Whether the next stream begins at a position that should still belong to this one.
    using IsNextStream = std::function<bool(std::uint64_t)>;

    struct Outcome {
        std::uint64_t wholeEnd; ///< of the last whole entry; the stream's end where it has no whole header
        bool isTailLeftOut;     ///< whether the next stream begins there, so that a torn entry was never copied
    };

    /// `report` tells where the stream begins in the file, which has `fileSize` bytes. `duration` is the movie's in
    /// seconds, if it is known.
    StreamWalk(const ByteSource& stream, std::uint64_t fileSize, FindingLog& log, StreamReport& report,
               std::optional<double> duration, IsNextStream isNextStream)
        : entries_(stream), fileSize_(fileSize), size_(stream.size()), log_(log), report_(report), duration_(duration),
          isNextStream_(std::move(isNextStream)) {}

    Outcome run();

private:
    /// The fields of one entry, read one after the other. Throws `std::system_error` if bytes that must be there do not
    /// come.
    class Fields {
    public:
        Fields(ByteReader& reader, const StreamEntry& entry)
            : reader_(reader), position_(entry.offset), end_(entry.end()) {}

        std::uint64_t position() const { return position_; }
        std::uint64_t left() const { return end_ - position_; }
        std::string_view peek(std::uint64_t size) const;
        void skip(std::uint64_t bytes) { position_ += bytes; }
        void read(void* field, std::size_t size) {
            std::memcpy(field, peek(size).data(), size);
            skip(size);
        }

        template <class Number>
        Number next() {
            Number number;
            read(&number, sizeof number);
            return number;
        }

    private:
        ByteReader& reader_;
        std::uint64_t position_; ///< in the stream
        std::uint64_t end_;
    };

    template <class... Parts>
    void add(FindingCode code, std::uint64_t position, const Parts&... parts) {
        log_.add(report_.findings, code, place_, report_.offset + position, parts...);
    }

    void noteHeader();
    void checkVersion();
    void walkEntries();

    template <class Kind>
    void walkKind();
    void walkUnknown();
    void walkFixed();

    /// Walks over entries that begin with the number of bytes that follow, of which there must be `minimum`. `check`
    /// gets the fields after that number and returns whether the entry fits its own sizes.
    template <class Check>
    void walkSized(std::uint32_t minimum, Check check);
    void reportFrame(std::uint64_t position, std::uint32_t minimum);
    void noteEnd();

    bool checkString(const StreamEntry& entry, Fields& fields);
    bool checkList(const StreamEntry& entry, Fields& fields, std::uint32_t neededTexts);
    bool checkListText(const StreamEntry& entry, Fields& fields, std::uint32_t index);
    bool checkCursorImage(const StreamEntry& entry, Fields& fields);
    bool checkCursorData(const StreamEntry& entry, Fields& fields, const CursorImageSchema& schema, Record& record);
    void checkImage(Fields& fields, std::uint32_t size);
    void reportImage(std::uint64_t offset, std::uint32_t size, const EncodedImageCheck& check);
    void checkText(Fields& fields);
    void noteTime(std::uint64_t entryStart, double time);
    void noteCursor(std::uint64_t entryStart, std::uint64_t identifier, bool hasImage);
    void reportBeyondDuration();

    StreamEntries entries_;
    std::uint64_t fileSize_;
    std::uint64_t size_;
    FindingLog& log_;
    StreamReport& report_;
    std::optional<double> duration_;
    IsNextStream isNextStream_;
    std::uint64_t wholeEnd_ = 0; ///< in the stream: the end of the last whole entry
    bool isTailLeftOut_ = false;
    std::string place_ = "stream";
    double latestTime_ = -std::numeric_limits<double>::infinity();
    std::uint64_t beyondDuration_ = 0; ///< entries
    std::uint64_t firstBeyond_ = 0;    ///< its offset in the file
    double firstTimeBeyond_ = 0;
    std::set<std::uint64_t> cursors_; ///< identifiers that had an image or were reported
};

} // namespace ZULMetaData::detail
