#include "ZULMetaDataSession/Retiming.h"

#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"
#include "ZULMetaDataSession/Retiming/ButtonHistory.h"
#include "ZULMetaDataSession/Retiming/CursorEntries.h"
#include "ZULMetaDataSession/Retiming/EntryIndex.h"
#include "ZULMetaDataSession/Retiming/PieceClock.h"

#include <array>
#include <cstring>
#include <memory>
#include <optional>
#include <span>
#include <utility>

namespace ZULMetaData {

namespace {

using detail::ButtonHistory;
using detail::CursorEntries;
using detail::EntryIndex;
using detail::PieceClock;
using Clocks = std::vector<PieceClock>;
using Sink = Callback<void(std::string_view bytes)>;

Clocks clocksOf(const EditList& edits) {
    Clocks clocks;
    clocks.reserve(edits.pieces().size());
    const std::vector<Rational> bases = edits.bases();
    for (std::size_t i = 0; i < bases.size(); ++i)
        clocks.emplace_back(edits.pieces()[i], bases[i]);
    return clocks;
}

/// Collects the bytes of a stream and hands them on in large pieces.
class StreamOutput {
public:
    StreamOutput(const MetaDataHeader& header, const Sink& sink)
        : sink_(sink), timeOffset_(detail::timeOffsetIn(header)) {
        buffer_.reserve(s_bufferSize);
        append({reinterpret_cast<const char*>(&header), sizeof header});
    }

    void append(std::string_view bytes) {
        if (buffer_.size() + bytes.size() > s_bufferSize)
            flush();
        buffer_.append(bytes);
    }

    /// Appends an entry with another time.
    void append(std::string_view entry, double time) {
        append(entry);
        std::memcpy(buffer_.data() + buffer_.size() - entry.size() + timeOffset_, &time, sizeof time);
    }

    void flush() {
        sink_(buffer_);
        size_ += buffer_.size();
        buffer_.clear();
    }

    std::uint64_t size() const { return size_ + buffer_.size(); }

private:
    static constexpr std::size_t s_bufferSize = std::size_t{256} * 1024;

    const Sink& sink_;
    std::size_t timeOffset_;
    std::string buffer_;
    std::uint64_t size_ = 0;
};

/// Entries that are written as they are stored, with another time.
class StoredEntries {
public:
    StoredEntries(EntryIndex& index, StreamOutput& output) : index_(index), output_(output) {}

    void write(std::size_t entry, double time) { output_.append(index_.bytesOf(entry), time); }
    bool areSame(std::size_t left, std::size_t right) {
        const std::string value(index_.valueOf(left));
        return index_.valueOf(right) == value;
    }

private:
    EntryIndex& index_;
    StreamOutput& output_;
};

/// Entries of cursors, which are written with or without their pictures.
class WrittenCursors {
public:
    WrittenCursors(EntryIndex& index, StreamOutput& output) : cursors_(index), output_(output) {}

    void write(std::size_t entry, double time) { output_.append(cursors_.written(entry), time); }
    bool areSame(std::size_t left, std::size_t right) const { return cursors_.areSame(left, right); }

private:
    CursorEntries cursors_;
    StreamOutput& output_;
};

/// Entries that lie in a piece.
struct EntryRange {
    EntryRange(const EntryIndex& index, const PieceClock& clock)
        : begin(index.countBefore(clock.start())), end(index.countBefore(clock.end())) {}

    std::size_t begin;
    std::size_t end;
};

template <class Entries>
void move(const EntryIndex& index, const EntryRange& range, const PieceClock& clock, Entries& entries,
          RetimedCounts& counts) {
    for (std::size_t entry = range.begin; entry < range.end; ++entry)
        entries.write(entry, clock.timeOf(index.times()[entry]));
    counts.moved += range.end - range.begin;
}

/// Moves states, and carries those that hold at the beginning of a piece.
template <class Entries>
class StateRetimer {
public:
    StateRetimer(const EntryIndex& index, Entries entries, RetimedCounts& counts)
        : index_(index), entries_(std::move(entries)), counts_(counts) {}

    void take(const PieceClock& clock) {
        const std::size_t until = index_.countUntil(clock.start());
        if (clock.isHeld()) {
            carry(until, clock.first());
            return;
        }
        const EntryRange range(index_, clock);
        if (until == range.begin) // no entry at the very start
            carry(until, clock.first());
        move(index_, range, clock, entries_, counts_);
        if (range.begin < range.end)
            lastWritten_ = range.end - 1;
    }

private:
    /// Writes the last of the first `count` entries.
    void carry(std::size_t count, double time) {
        if (count == 0 || (lastWritten_ && isLastWritten(count - 1)))
            return;
        entries_.write(count - 1, time);
        lastWritten_ = count - 1;
        ++counts_.carried;
    }

    bool isLastWritten(std::size_t entry) { return *lastWritten_ == entry || entries_.areSame(*lastWritten_, entry); }

    const EntryIndex& index_;
    Entries entries_;
    RetimedCounts& counts_;
    std::optional<std::size_t> lastWritten_;
};

/// Where the source goes on from one piece to the next. Held frames between two pieces do not count.
struct Joins {
    explicit Joins(std::span<const PieceClock> clocks) : isAtStart(clocks.size()), isAtEnd(clocks.size()) {
        std::optional<std::size_t> last;
        for (std::size_t i = 0; i < clocks.size(); ++i) {
            if (clocks[i].isHeld())
                continue;
            if (last && clocks[*last].end() == clocks[i].start())
                isAtEnd[*last] = isAtStart[i] = true;
            last = i;
        }
    }

    std::vector<bool> isAtStart; ///< whether the piece goes on where the one before it ended
    std::vector<bool> isAtEnd;   ///< whether the next piece goes on where this one ends
};

/// Moves the actions of the mouse, and releases and presses buttons that are down at an edge.
class ActionRetimer {
public:
    ActionRetimer(EntryIndex& index, StreamOutput& output, RetimedCounts& counts)
        : index_(index), output_(output), entries_(index, output), counts_(counts) {
        for (std::size_t entry = 0; entry < index.size(); ++entry)
            history_.add(entry, detail::numberIn<std::int32_t>(index.valueOf(entry), 0));
    }

    void take(std::span<const PieceClock> clocks) {
        const Joins joins(clocks);
        for (std::size_t i = 0; i < clocks.size(); ++i) {
            const PieceClock& clock = clocks[i];
            if (clock.isHeld())
                continue;
            const EntryRange range(index_, clock);
            if (!joins.isAtStart[i])
                press(range, clock);
            move(index_, range, clock, entries_, counts_);
            if (!joins.isAtEnd[i])
                release(range, clock);
        }
    }

private:
    void press(const EntryRange& range, const PieceClock& clock) {
        for (const MouseButton button : detail::s_buttons) {
            const ButtonHistory::Action* last = history_.lastBefore(button, range.begin);
            const ButtonHistory::Action* next = history_.firstFrom(button, range.begin);
            const bool isReleasedHere = next && !next->isPress && index_.times()[next->entry] == clock.start();
            if (last && last->isPress && !isReleasedHere)
                add(last->stored, clock.first());
        }
    }

    void release(const EntryRange& range, const PieceClock& clock) {
        for (const MouseButton button : detail::s_buttons)
            if (const ButtonHistory::Action* last = history_.lastBefore(button, range.end); last && last->isPress)
                add(storedButtonAction(button, false), clock.last());
    }

    void add(std::int32_t action, double time) {
        std::array<char, sizeof time + sizeof action> entry;
        detail::packFixedEntry(time, action, entry.data());
        output_.append({entry.data(), entry.size()});
        ++counts_.added;
    }

    EntryIndex& index_;
    StreamOutput& output_;
    StoredEntries entries_;
    RetimedCounts& counts_;
    ButtonHistory history_;
};

template <class Entries>
void retimeStates(const EntryIndex& index, Entries entries, const Clocks& clocks, RetimedCounts& counts) {
    StateRetimer retimer(index, std::move(entries), counts);
    for (const PieceClock& clock : clocks)
        retimer.take(clock);
}

void retimeEvents(EntryIndex& index, StreamOutput& output, const Clocks& clocks, RetimedCounts& counts) {
    StoredEntries entries(index, output);
    for (const PieceClock& clock : clocks)
        if (!clock.isHeld())
            move(index, EntryRange(index, clock), clock, entries, counts);
}

template <class Kind>
void retimeEntries(EntryIndex& index, StreamOutput& output, const Clocks& clocks, RetimedCounts& counts) {
    if constexpr (std::is_same_v<Kind, CursorActionKind>)
        ActionRetimer(index, output, counts).take(clocks);
    else if constexpr (Kind::role == StreamRole::Event)
        retimeEvents(index, output, clocks, counts);
    else if constexpr (std::is_same_v<Kind, CursorImageKind>)
        retimeStates(index, WrittenCursors(index, output), clocks, counts);
    else if constexpr (Kind::role == StreamRole::State)
        retimeStates(index, StoredEntries(index, output), clocks, counts);
}

bool isValidAtAllTimes(const uuid& type) {
    bool isOnce = false;
    RecordedKinds::visit(type, [&isOnce]<class Kind>() { isOnce = Kind::role == StreamRole::Once; });
    return isOnce;
}

/// Returns why a stream cannot be decoded.
std::string reasonFor(const MetaDataHeader& header) {
    const MetaDataKind* kind = findMetaDataKind(header.uuid);
    if (kind && (header.version < 1 || header.version > kind->currentVersion))
        return "its version " + std::to_string(header.version) + " is not known here";
    if (header.fixedEntrySize != entrySizeOf(header))
        return "its header states entries of " + std::to_string(header.fixedEntrySize) + " bytes instead of " +
               std::to_string(entrySizeOf(header));
    return "the entries of its kind are not known here";
}

/// Makes all streams for one edit list.
class Retimer {
public:
    Retimer(const Recording& recording, const EditList& edits, const Sink& sink)
        : recording_(recording), clocks_(clocksOf(edits)), sink_(sink) {}

    EditedRecording run() {
        for (const StreamInfo& stream : recording_.streams())
            take(stream);
        for (const StreamReport& hidden : recording_.hiddenStreams())
            noteHidden(hidden);
        if (result_.losses.empty() && recording_.hidesStreams())
            lose("the metadata is damaged, so that streams may be missing");
        return std::move(result_);
    }

private:
    void take(const StreamInfo& stream) {
        const std::string name = stream.name();
        const ByteSource bytes = stream.hasRoom() ? recording_.bytesOf(stream) : ByteSource::memory({});
        const std::optional<MetaDataHeader> header = StreamEntries(bytes).header();
        if (!header) {
            lose(name + " at offset " + std::to_string(stream.offset) + " is shorter than its header; it was left out");
            return;
        }
        if (stream.isCutShort())
            lose(name + " declares " + std::to_string(stream.declaredBytes) + " bytes, and the file has only " +
                 std::to_string(stream.presentBytes) + " of them");
        if (!isDecodable(*header))
            result_.warnings.push_back(name + " was copied with its old times: " + reasonFor(*header));
        if (!isDecodable(*header) || isValidAtAllTimes(header->uuid))
            result_.streams.push_back({stream, true, {}, bytes, 0, bytes.size()});
        else
            retime(stream, *header, bytes);
    }

    void retime(const StreamInfo& stream, const MetaDataHeader& header, const ByteSource& bytes) {
        EditedStream edited{stream, false, {}, ByteSource::memory({}), sunk_, 0};
        EntryIndex index(bytes, recording_.name());
        StreamOutput output(header, sink_);
        RecordedKinds::visit(header.uuid,
                             [&]<class Kind>() { retimeEntries<Kind>(index, output, clocks_, edited.counts); });
        output.flush();
        edited.size = output.size();
        edited.counts.leftOut = index.timeless();
        sunk_ += edited.size;
        if (index.timeless() > 0)
            lose(stream.name() + " has " + std::to_string(index.timeless()) +
                 (index.timeless() == 1 ? " entry" : " entries") + " without a finite time, which were left out");
        if (index.end() < bytes.size())
            lose(stream.name() + " is damaged at offset " + std::to_string(index.end()) + " of the stream; the " +
                 std::to_string(bytes.size() - index.end()) + " bytes from there on were left out");
        result_.streams.push_back(std::move(edited));
    }

    void noteHidden(const StreamReport& hidden) {
        const std::string text = hidden.name() + " at offset " + std::to_string(hidden.offset);
        if (hidden.isReachable)
            result_.warnings.push_back("readers take a later stream instead of " + text + "; it was left out");
        else
            lose("no reader finds " + text + ", because of damage before it; it was left out");
    }

    void lose(std::string sentence) { result_.losses.push_back(std::move(sentence)); }

    const Recording& recording_;
    Clocks clocks_;
    const Sink& sink_;
    std::uint64_t sunk_ = 0; ///< bytes
    EditedRecording result_;
};

} // namespace

EditedRecording retimed(const Recording& recording, const EditList& edits, const Sink& sink) {
    return Retimer(recording, edits, sink).run();
}

EditedRecording retimed(const Recording& recording, const EditList& edits) {
    const auto all = std::make_shared<std::string>();
    EditedRecording result = retimed(recording, edits, Sink([&all](std::string_view bytes) { all->append(bytes); }));
    for (EditedStream& stream : result.streams)
        if (!stream.isCopied)
            stream.bytes =
                ByteSource(stream.size, [all, offset = stream.offset](std::uint64_t position, std::span<char> to) {
                    return all->copy(to.data(), to.size(), static_cast<std::size_t>(offset + position));
                });
    return result;
}

} // namespace ZULMetaData
