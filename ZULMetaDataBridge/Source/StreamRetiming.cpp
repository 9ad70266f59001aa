#include "ZULMetaDataBridge/Source/StreamRetiming.h"

#include "ZULMetaDataBridge/Source/KindEntries.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <string>
#include <string_view>
#include <utility>

namespace ZULMetaData {

namespace {

/// What happens once. All other kinds tell a state, which is in force until their next entry.
bool isEvent(const uuid& type) {
    const std::array events{s_cursorActionUUID, s_keyboardActionUUID, s_scrollActionUUID, s_cpuUsageUUID};
    return std::find(events.begin(), events.end(), type) != events.end();
}

/// Returns the offset of the time in every entry. Empty for a stream whose entries nobody here knows.
std::optional<std::size_t> timeOffsetIn(const MetaDataHeader& header) {
    const std::uint32_t entrySize = entrySizeOf(header);
    if (entrySize >= sizeof(double))
        return 0;
    return isDecodable(header) ? std::optional<std::size_t>(sizeof entrySize) : std::nullopt;
}

class Retimer {
public:
    Retimer(const Retiming& retiming, std::size_t timeOffset, RetimedStream& result, std::ostream& out)
        : retiming_(retiming), timeOffset_(timeOffset), result_(result), out_(out) {}

    /// Returns false for an entry without room for its time.
    bool take(std::string_view bytes) {
        if (bytes.size() < timeOffset_ + sizeof(double))
            return false;
        const double time = timeIn(bytes) + retiming_.shift;
        if (!retiming_.trimmedTo || (time >= 0 && time <= *retiming_.trimmedTo)) {
            writeHeld();
            writeBytes(bytes, time);
        } else if (time < 0) {
            takeEarly(bytes);
        } else {
            ++result_.entriesRemoved;
        }
        return true;
    }

    /// Writes the entry that is held, because it is in force at 0. Call after the last entry.
    void writeHeld() {
        if (!held_.empty())
            writeBytes(std::exchange(held_, {}), 0);
    }

private:
    double timeIn(std::string_view bytes) const {
        double time = 0;
        std::memcpy(&time, bytes.data() + timeOffset_, sizeof time);
        return time;
    }

    /// Of a state the last entry before 0 is in force there. Of cursors, whose later entries leave the picture out,
    /// every entry with a picture is needed.
    void takeEarly(std::string_view bytes) {
        if (isEvent(result_.header.uuid)) {
            ++result_.entriesRemoved;
            return;
        }
        if (!held_.empty() && hasPicture(held_))
            writeHeld();
        else if (!held_.empty())
            ++result_.entriesRemoved;
        held_ = bytes;
    }

    bool hasPicture(std::string_view bytes) const {
        const auto cursor = result_.header.uuid == s_cursorImageUUID
                                ? decodeEntry<CursorImage>(bytes, result_.header.version)
                                : std::nullopt;
        return cursor && cursor->value.imageDataSize > 0;
    }

    void writeBytes(std::string_view bytes, double time) {
        std::string copy(bytes);
        if (retiming_.shift != 0 || timeIn(bytes) < 0)
            std::memcpy(copy.data() + timeOffset_, &time, sizeof time);
        out_.write(copy.data(), static_cast<std::streamsize>(copy.size()));
        ++result_.entries;
        if (!std::isfinite(time))
            return;
        result_.firstTime = std::min(result_.firstTime.value_or(time), time);
        result_.lastTime = std::max(result_.lastTime.value_or(time), time);
    }

    const Retiming& retiming_;
    std::size_t timeOffset_;
    RetimedStream& result_;
    std::ostream& out_;
    std::string held_; ///< the last entry before 0, until one after it shows that it is in force at 0
};

} // namespace

RetimedStream retimeStream(const ByteSource& stream, const Retiming& retiming, std::ostream& out) {
    RetimedStream result;
    StreamEntries entries(stream);
    if (!entries.header()) {
        result.isReadable = false;
        return result;
    }
    result.header = *entries.header();
    const auto timeOffset = timeOffsetIn(result.header);
    // The description of the machine stands at 0, whenever the recording began.
    const bool hasTimes = result.header.uuid != s_systemDataUUID;
    result.isReadable = !hasTimes || timeOffset.has_value();
    if (!result.isReadable)
        return result;
    out.write(reinterpret_cast<const char*>(&result.header), sizeof result.header);
    Retimer retimer(retiming, timeOffset.value_or(0), result, out);
    const std::uint64_t end = walkEntries(entries, [&](const StreamEntry&, std::string_view bytes) {
        if (hasTimes)
            return retimer.take(bytes);
        out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        ++result.entries;
        return true;
    });
    retimer.writeHeld();
    result.bytesLeftOut = stream.size() - end;
    return result;
}

TimeSpan timeSpanOf(const ByteSource& stream, double end) {
    TimeSpan span;
    StreamEntries entries(stream);
    if (!entries.header() || !isDecodable(*entries.header()))
        return span;
    while (const auto entry = entries.next()) {
        const auto time = timeOfEntry(*entries.header(), entries.bytesOf(*entry));
        if (!time || !std::isfinite(*time))
            continue;
        span.first = std::min(span.first.value_or(*time), *time);
        span.last = std::max(span.last.value_or(*time), *time);
        span.entriesAfter += *time > end ? 1U : 0U;
    }
    return span;
}

} // namespace ZULMetaData
