#pragma once

// Validates one stream: its header, then its entries by the layout of its kind.

#include "Platform/Image.h"
#include "ZULMetaData/CursorImageSchema.h"
#include "ZULMetaDataBridge/Source/Validation/FindingLog.h"
#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"
#include "ZULMetaDataBridge/Source/Validation/UntrustedInput.h"

#include <cstdint>
#include <functional>
#include <limits>
#include <optional>
#include <set>
#include <string>
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

    /// The stream stands at the position of `input` and ends at `end`, which is in the file. `duration` is the movie's
    /// in seconds, if it is known.
    StreamWalk(UntrustedInput& input, FindingLog& log, StreamReport& report, std::uint64_t end,
               std::optional<double> duration, IsNextStream isNextStream)
        : input_(input), log_(log), report_(report), end_(end), duration_(duration),
          isNextStream_(std::move(isNextStream)) {}

    Outcome run();

private:
    struct Entry {
        std::uint64_t start;
        std::uint64_t end;
    };

    template <class... Parts>
    void add(FindingCode code, std::uint64_t offset, const Parts&... parts) {
        log_.add(report_.findings, code, place_, offset, parts...);
    }

    bool readHeader();
    bool isVersionKnown();
    bool hasEntriesOf(std::uint32_t expected);

    template <class Kind>
    void walkKind();
    void walkUnknown();
    void walkFixed(std::uint64_t entrySize);

    /// Entries that begin with the number of bytes behind it, of which there must be `minimum`. `check` stands behind
    /// that number and gives whether the entry fits its own sizes.
    template <class Check>
    void walkSized(std::uint32_t minimum, Check check);
    void reportFrame(const Entry& entry, std::uint32_t size, std::uint32_t minimum);
    bool isTailLeftOut();

    bool checkString(const Entry& entry);
    bool checkList(const Entry& entry, std::uint32_t neededTexts);
    bool checkListText(const Entry& entry, std::uint32_t index);
    bool checkCursorImage(const Entry& entry);
    bool checkCursorData(const Entry& entry, const CursorImageSchema& schema, Record& record);
    void checkImage(std::uint32_t size);
    void reportImage(std::uint64_t offset, std::uint32_t size, const EncodedImageCheck& check);
    void checkText(std::uint64_t size);
    void noteTime(std::uint64_t entryStart, double time);
    void noteCursor(std::uint64_t entryStart, std::uint64_t identifier, bool hasImage);
    void reportBeyondDuration();

    UntrustedInput& input_;
    FindingLog& log_;
    StreamReport& report_;
    std::uint64_t end_;
    std::optional<double> duration_;
    IsNextStream isNextStream_;
    Outcome outcome_{};
    std::string place_ = "stream";
    double latestTime_ = -std::numeric_limits<double>::infinity();
    std::uint64_t beyondDuration_ = 0; ///< entries
    std::uint64_t firstBeyond_ = 0;    ///< its offset in the file
    double firstTimeBeyond_ = 0;
    std::set<std::uint64_t> cursors_; ///< identifiers that had an image or were reported
};

} // namespace ZULMetaData::detail
