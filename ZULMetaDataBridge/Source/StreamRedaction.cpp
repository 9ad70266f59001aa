#include "ZULMetaDataBridge/Source/StreamRedaction.h"

#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"
#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <map>
#include <utility>

namespace ZULMetaData {

namespace {

/// What an entry says about the times around it.
enum class TimeRole {
    Event,  ///< it happened at its time
    State,  ///< its value holds until the next entry
    Text,   ///< likewise, and the value may be a secret
    Always, ///< it describes the whole recording
};

template <class Kind>
constexpr TimeRole roleOf() {
    if (OneOf<Kind, RecordingRegionKind, ScaleFactorKind, SystemDataKind>)
        return TimeRole::Always;
    if (OneOf<Kind, KeyboardActionKind, ScrollActionKind>)
        return TimeRole::Event;
    return std::same_as<typename Kind::Value, std::string> ? TimeRole::Text : TimeRole::State;
}

double directlyAfter(double time) {
    return std::nextafter(time, std::numeric_limits<double>::infinity());
}

/// The times that a redaction removes, as ranges with a time between each two.
class RemovedTimes {
public:
    explicit RemovedTimes(std::vector<TimeRange> ranges) {
        std::erase_if(ranges, [](const TimeRange& range) { return !(range.from <= range.to); });
        std::sort(ranges.begin(), ranges.end(),
                  [](const auto& left, const auto& right) { return left.from < right.from; });
        for (const TimeRange& range : ranges) {
            if (!ranges_.empty() && range.from <= directlyAfter(ranges_.back().to))
                ranges_.back().to = std::max(ranges_.back().to, range.to);
            else
                ranges_.push_back(range);
        }
    }

    /// Returns whether an entry of this time goes. An entry whose time is not a number may be of any time.
    bool isRemoved(double time) const { return !ranges_.empty() && (std::isnan(time) || rangeAt(time)); }

    /// Returns the range that holds the time, or null.
    const TimeRange* rangeAt(double time) const {
        const auto found = std::find_if(ranges_.begin(), ranges_.end(),
                                        [time](const auto& range) { return range.from <= time && time <= range.to; });
        return found == ranges_.end() ? nullptr : &*found;
    }

    /// Returns whether a removed time is at or after `begin` and before `end`.
    bool meets(double begin, double end) const {
        return std::any_of(ranges_.begin(), ranges_.end(),
                           [=](const auto& range) { return begin <= range.to && range.from < end; });
    }

private:
    std::vector<TimeRange> ranges_;
};

bool isSecret(const std::string& text) {
    return !text.empty() && text != s_hiddenText;
}

/// Finds the texts that were in force inside a removed range.
class HeldTexts {
public:
    HeldTexts(const RemovedTimes& times, std::set<std::string>& texts) : times_(times), texts_(texts) {}

    void add(const TimedValue<std::string>& entry) {
        endAt(entry.time);
        last_ = entry;
    }

    void endAt(double time) {
        if (last_ && isSecret(last_->value) && wasRemoved(time))
            texts_.insert(last_->value);
    }

private:
    /// An entry that goes back in time, or nowhere, does not tell when the text before it ended.
    bool wasRemoved(double end) const {
        if (!(end >= last_->time))
            end = std::numeric_limits<double>::infinity();
        return times_.isRemoved(last_->time) || times_.meets(last_->time, end);
    }

    const RemovedTimes& times_;
    std::set<std::string>& texts_;
    std::optional<TimedValue<std::string>> last_;
};

/// The pictures of cursors whose entries were removed, until a later entry takes them.
class RemovedPictures {
public:
    explicit RemovedPictures(ByteSource stream) : stream_(std::move(stream)) {}

    void remember(const CursorImage& cursor, const StreamEntry& entry) {
        if (cursor.imageDataSize > 0)
            entries_[cursor.uniqueId] = entry;
    }

    bool has(std::uint64_t cursor) const { return entries_.contains(cursor); }

    /// Completes a cursor that is written: with its own picture, if it has one, or with the one that was removed.
    CursorImage complete(const CursorImage& cursor, int version) {
        const auto found = entries_.find(cursor.uniqueId);
        if (found == entries_.end())
            return cursor;
        const StreamEntry entry = found->second;
        entries_.erase(found);
        if (cursor.imageDataSize > 0)
            return cursor;
        auto pictured = decodeEntry<CursorImage>(detail::readAll(stream_.part(entry.offset, entry.size)), version);
        if (!pictured)
            return cursor;
        pictured->value.flags = cursor.flags;
        return std::move(pictured->value);
    }

private:
    ByteSource stream_;
    std::map<std::uint64_t, StreamEntry> entries_;
};

/// Decides over the entries of one kind.
template <class Kind>
class EntryRedactor {
public:
    using Value = typename Kind::Value;
    static constexpr TimeRole s_role = roleOf<Kind>();

    /// The values of other kinds stay what they are. They may be no numbers, which equal nothing.
    static constexpr bool s_canChange = OneOf<Value, KeyStroke, std::string, CursorImage>;

    EntryRedactor(const Redaction& redaction, const std::set<std::string>& heldTexts, const ByteSource& stream,
                  RedactedStream& result, std::ostream& out)
        : redaction_(redaction), times_(redaction.removedTimes), heldTexts_(heldTexts), pictures_(stream),
          result_(result), out_(out) {}

    /// Returns false if the entry does not fit its kind.
    bool copy(const StreamEntry& entry, std::string_view bytes) {
        const auto decoded = decodeEntry<Value>(bytes, result_.header.version);
        if (!decoded)
            return false;
        if (s_role != TimeRole::Always && times_.isRemoved(decoded->time)) {
            remove(*decoded, entry, bytes);
        } else {
            carryTo(decoded->time);
            keep(*decoded, bytes);
        }
        return true;
    }

    /// Call after the last entry.
    void finish() { carryTo(std::numeric_limits<double>::infinity()); }

private:
    void remove(const TimedValue<Value>& decoded, const StreamEntry& entry, std::string_view bytes) {
        const TimeRange* range = times_.rangeAt(decoded.time);
        if constexpr (s_role == TimeRole::Text) {
            if (showsText_ && range)
                add(std::isfinite(range->from) ? range->from : decoded.time, s_hiddenText);
            showsText_ = showsText_ && !range;
        }
        if constexpr (std::same_as<Value, CursorImage>)
            pictures_.remember(decoded.value, entry);
        if (s_role == TimeRole::State && range && std::isfinite(range->to))
            carryFrom(directlyAfter(range->to), decoded);
        ++result_.entriesRemoved;
        report(RedactedEntry::Removed, decoded.time, bytes);
    }

    /// Notes the value that holds when a removed range is over. That of an earlier range has held until this one.
    void carryFrom(double time, const TimedValue<Value>& decoded) {
        if (carried_ && carried_->time < time)
            carryTo(decoded.time);
        carried_ = {time, decoded.value};
    }

    /// Adds the value that the removed entries left behind, unless the entry at `time` takes its place.
    void carryTo(double time) {
        if (!carried_ || time < carried_->time)
            return;
        const TimedValue<Value> carried = *std::exchange(carried_, std::nullopt);
        if (time > carried.time && !isShown(carried.value))
            add(carried.time, carried.value);
    }

    void keep(const TimedValue<Value>& decoded, std::string_view bytes) {
        const Value value = redacted(decoded.value);
        ++result_.entries;
        shownNow(value);
        if (!s_canChange || value == decoded.value) {
            out_.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
            return;
        }
        ++result_.entriesChanged;
        metaDataWrite<Value>(decoded.time, value, out_, result_.header.version);
        report(RedactedEntry::Changed, decoded.time, bytes);
    }

    void add(double time, const Value& value) {
        const Value whole = redacted(value);
        ++result_.entries;
        ++result_.entriesAdded;
        shownNow(whole);
        metaDataWrite<Value>(time, whole, out_, result_.header.version);
        report(RedactedEntry::Added, time, {});
    }

    Value redacted(const Value& value) {
        if constexpr (std::same_as<Kind, KeyboardActionKind>)
            return redaction_.clearsKeys ? KeyStroke() : value;
        else if constexpr (s_role == TimeRole::Text)
            return heldTexts_.contains(value) || (redaction_.hidesText && redaction_.hidesText(value)) ? s_hiddenText
                                                                                                       : value;
        else if constexpr (std::same_as<Value, CursorImage>)
            return pictures_.complete(value, result_.header.version);
        else
            return value;
    }

    /// Whether the copy shows the value already, by its last entry.
    bool isShown(const Value& value) const {
        if constexpr (std::same_as<Value, CursorImage>)
            return shown_ && shown_->uniqueId == value.uniqueId && !pictures_.has(value.uniqueId);
        else
            return shown_ && *shown_ == value;
    }

    void shownNow(const Value& value) {
        if constexpr (s_role == TimeRole::Text)
            showsText_ = value != s_hiddenText;
        else if constexpr (std::same_as<Value, CursorImage>)
            shown_.emplace().uniqueId = value.uniqueId; // without the picture, which may be large
        else if constexpr (s_role == TimeRole::State)
            shown_ = value;
    }

    void report(RedactedEntry::Action action, double time, std::string_view original) const {
        if (redaction_.onEntry)
            redaction_.onEntry({action, result_.header, time, original});
    }

    const Redaction& redaction_;
    RemovedTimes times_;
    const std::set<std::string>& heldTexts_;
    RemovedPictures pictures_;
    RedactedStream& result_;
    std::ostream& out_;
    std::optional<TimedValue<Value>> carried_;
    std::optional<Value> shown_;
    bool showsText_ = false;
};

/// Whether an entry of any kind might have to go or to change.
bool mustLookInto(const Redaction& redaction, const uuid& type) {
    return redaction.hidesText || !redaction.removedTimes.empty() ||
           (redaction.clearsKeys && type == s_keyboardActionUUID);
}

bool isAskedFor(const Redaction& redaction, const uuid& type) {
    return redaction.removedKinds.contains(type) ||
           (!redaction.keptKinds.empty() && !redaction.keptKinds.contains(type));
}

RedactedStream::Removal removalOf(const std::optional<MetaDataHeader>& header, const Redaction& redaction) {
    if (!header)
        return RedactedStream::Headless;
    if (isAskedFor(redaction, header->uuid))
        return RedactedStream::Asked;
    const bool isLegible = isDecodable(*header) || !mustLookInto(redaction, header->uuid);
    return isLegible ? RedactedStream::Kept : RedactedStream::Undecodable;
}

/// Calls `visit` with each decoded entry of a stream of texts or of lists of texts.
template <class Visit>
void visitTexts(StreamEntries& entries, Visit visit) {
    if (!entries.header() || !isDecodable(*entries.header()))
        return;
    RecordedKinds::visit(entries.header()->uuid, [&]<class Kind>() {
        using Value = typename Kind::Value;
        if constexpr (OneOf<Value, std::string, std::list<std::string>>)
            walkEntries(entries, [&](const StreamEntry&, std::string_view bytes) {
                const auto decoded = decodeEntry<Value>(bytes, entries.header()->version);
                if (decoded)
                    visit(*decoded);
                return decoded.has_value();
            });
    });
}

std::set<std::string> textsHeldInside(const ByteSource& stream, const Redaction& redaction) {
    std::set<std::string> texts;
    if (redaction.removedTimes.empty())
        return texts;
    const RemovedTimes times(redaction.removedTimes);
    HeldTexts held(times, texts);
    StreamEntries entries(stream);
    visitTexts(entries, [&]<class Value>(const TimedValue<Value>& decoded) {
        if constexpr (std::same_as<Value, std::string>)
            held.add(decoded);
    });
    held.endAt(std::numeric_limits<double>::infinity());
    return texts;
}

void reportRemovedStream(StreamEntries& entries, const Redaction& redaction) {
    if (!redaction.onEntry || !entries.header() || !isDecodable(*entries.header()))
        return;
    walkEntries(entries, [&](const StreamEntry&, std::string_view bytes) {
        const auto time = timeOfEntry(*entries.header(), bytes);
        if (time)
            redaction.onEntry({RedactedEntry::Removed, *entries.header(), *time, bytes});
        return time.has_value();
    });
}

} // namespace

void collectRedactedTexts(const ByteSource& stream, const Redaction& redaction, RedactedTexts& texts) {
    StreamEntries entries(stream);
    const RedactedStream::Removal removal = removalOf(entries.header(), redaction);
    const auto collect = [&](const std::string& text) {
        if (!isSecret(text))
            return;
        if (removal != RedactedStream::Kept)
            texts.removed.insert(text);
        else if (redaction.hidesText && redaction.hidesText(text))
            texts.hidden.insert(text);
    };
    visitTexts(entries, [&]<class Value>(const TimedValue<Value>& decoded) {
        if constexpr (std::same_as<Value, std::string>)
            collect(decoded.value);
        else if (removal != RedactedStream::Kept)
            for (const std::string& text : decoded.value)
                collect(text);
    });
    if (removal == RedactedStream::Kept)
        texts.hidden.merge(textsHeldInside(stream, redaction));
}

RedactedStream redactStream(const ByteSource& stream, const Redaction& redaction, std::ostream& out) {
    RedactedStream result;
    StreamEntries entries(stream);
    result.header = entries.header().value_or(MetaDataHeader());
    result.removal = removalOf(entries.header(), redaction);
    if (result.removal != RedactedStream::Kept) {
        reportRemovedStream(entries, redaction);
        return result;
    }
    out.write(reinterpret_cast<const char*>(&result.header), sizeof result.header);
    const std::set<std::string> heldTexts = textsHeldInside(stream, redaction);
    std::uint64_t end = s_metaDataHeaderSize;
    const bool isWalked = isDecodable(result.header) && RecordedKinds::visit(result.header.uuid, [&]<class Kind>() {
                              EntryRedactor<Kind> redactor(redaction, heldTexts, stream, result, out);
                              end = walkEntries(entries, [&](const StreamEntry& entry, std::string_view bytes) {
                                  return redactor.copy(entry, bytes);
                              });
                              redactor.finish();
                          });
    if (!isWalked)
        end = walkEntries(entries, [&](const StreamEntry&, std::string_view bytes) {
            out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
            ++result.entries;
            return true;
        });
    result.bytesLeftOut = stream.size() - end;
    return result;
}

} // namespace ZULMetaData
