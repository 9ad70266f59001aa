#pragma once

// Small recordings and edit lists made at random, and what the library makes of them beside the oracle. Few different
// times are used, so that entries lie on edges, at equal times, and in joins.

#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "Tests/ZULMetaDataSession/RetimingOracle.h"
#include "ZULMetaDataSession/Retiming.h"

#include <array>
#include <cstdint>
#include <limits>
#include <random>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

inline std::string cursorEntry(const OracleEntry& entry, int version) {
    std::string data;
    if (version > 1)
        data += le32(entry.picture ? static_cast<std::uint32_t>(entry.picture->bytes.size()) : 0);
    if (entry.picture)
        data += raw(entry.picture->x) + raw(entry.picture->y) + entry.picture->bytes;
    if (entry.picture && version > 1)
        data += raw(entry.picture->systemCursor);
    if (version > 1)
        data += le32(entry.flags);
    const std::string record = f64(entry.time) + le64(entry.id) + le32(static_cast<std::uint32_t>(data.size())) + data;
    return le32(static_cast<std::uint32_t>(record.size())) + record;
}

/// One stream of a random recording.
struct RandomStream {
    std::string group; ///< of the kind's identifier
    RetimingOracle::Rule rule = RetimingOracle::Rule::State;
    std::int32_t version = 1;
    std::uint32_t entrySize = 0; ///< 0 if it varies
    std::vector<OracleEntry> entries;

    std::string bytesOf(const std::vector<OracleEntry>& written) const {
        std::string bytes = streamHeader(group, version, entrySize);
        for (const OracleEntry& entry : written)
            if (rule == RetimingOracle::Rule::Cursor)
                bytes += cursorEntry(entry, version);
            else
                bytes += entrySize != 0 ? f64(entry.time) + entry.value : textEntry(entry.time, entry.value);
        return bytes;
    }
};

class RandomEdits {
public:
    explicit RandomEdits(std::uint64_t seed) : random_(seed) {
        makeStreams();
        makeEdits();
    }

    const EditList& edits() const { return edits_; }

    /// Returns what differs between the library and the oracle; nothing if all is alike.
    std::string difference() const {
        std::vector<std::string> streams;
        for (const RandomStream& stream : streams_)
            streams.push_back(stream.bytesOf(stream.entries));
        const std::string movie = media() + zulmAtom(streams);
        const EditedRecording edited = retimed(Recording(ByteSource::memory(movie), "Random.mp4"), edits_);
        for (const RandomStream& stream : streams_)
            for (const EditedStream& made : edited.streams)
                if (made.source.type == kind(stream.group))
                    if (const std::string what = differenceOf(stream, made); !what.empty())
                        return made.source.name() + ": " + what;
        return edited.streams.size() == streams_.size() ? "" : "streams are missing";
    }

private:
    using Rule = RetimingOracle::Rule;

    std::string differenceOf(const RandomStream& stream, const EditedStream& made) const {
        const OracleResult expected = RetimingOracle(stream.rule, stream.entries, edits_.pieces()).run();
        std::string bytes(static_cast<std::size_t>(made.bytes.size()), '\0');
        made.bytes.read(0, bytes);
        if (made.counts.moved != expected.moved || made.counts.carried != expected.carried ||
            made.counts.added != expected.added || made.counts.leftOut != expected.leftOut)
            return "other counts";
        return bytes == stream.bytesOf(expected.entries) ? "" : "other bytes";
    }

    std::size_t below(std::size_t limit) { return static_cast<std::size_t>(random_() % limit); }

    /// A time that edges have too, or is not far from one.
    double time() {
        const Rational edge = someEdge();
        switch (below(12)) {
        case 0: return -0.5 * static_cast<double>(below(4));
        case 1: return std::nextafter(edge.nearest(), below(2) == 0 ? -1 : 100);
        case 2: return static_cast<double>(random_() >> 11) * 0x1p-53 * 8;
        case 3:
            return std::array{std::numeric_limits<double>::quiet_NaN(), std::numeric_limits<double>::infinity(),
                              -std::numeric_limits<double>::infinity(), 1e300}[below(4)];
        default: return edge.nearest();
        }
    }

    Rational someEdge() {
        const auto number = static_cast<std::int64_t>(below(13));
        return Rational(number, std::array{2, 3, 10, 7}[below(4)]);
    }

    Rational someSpeed() {
        constexpr std::array<std::array<std::int64_t, 2>, 9> speeds{
            {{1, 1}, {1, 1}, {1, 1}, {2, 1}, {1, 2}, {3, 2}, {10, 3}, {1, 7}, {1001, 1000}}};
        const auto& [numerator, denominator] = speeds[below(speeds.size())];
        return {numerator, denominator};
    }

    void makeStreams() {
        streams_ = {{"2b7b6af2", Rule::State, 1, 16, {}},
                    {"2b7b6a06", Rule::State, 1, 0, {}},
                    {"2b7b6af1", Rule::Cursor, static_cast<std::int32_t>(1 + below(2)), 0, {}},
                    {"2b7b6a05", Rule::Event, 1, 16, {}},
                    {"2b7b6af0", Rule::Buttons, 1, 12, {}}};
        for (RandomStream& stream : streams_)
            makeEntries(stream);
    }

    void makeEntries(RandomStream& stream) {
        const bool isSorted = below(4) != 0;
        for (std::size_t count = below(10); count > 0; --count)
            stream.entries.push_back(entryFor(stream));
        if (isSorted)
            std::stable_sort(stream.entries.begin(), stream.entries.end(),
                             [](const OracleEntry& left, const OracleEntry& right) { return left.time < right.time; });
    }

    OracleEntry entryFor(const RandomStream& stream) {
        constexpr std::array actions{256, 1, 2, 4, 8, 16, 32, 17, 34, 3, 257, 0, 64, -1, 48};
        OracleEntry entry{time(), {}, 0, 3, {}};
        if (stream.rule == Rule::Cursor) {
            entry.id = below(3);
            entry.flags = stream.version == 1 ? 3 : static_cast<std::uint32_t>(below(3));
            if (below(2) == 0)
                entry.picture = {std::string(1 + below(2), 'p'), static_cast<std::int32_t>(below(2)), 0,
                                 stream.version == 1 ? -1 : static_cast<std::int32_t>(below(2))};
        } else if (stream.rule == Rule::Buttons) {
            entry.value = raw(actions[below(actions.size())]);
        } else if (stream.entrySize == 0) {
            entry.value = std::string(below(3), 't');
        } else {
            entry.value = raw(static_cast<std::int32_t>(below(3))) + le32(0);
        }
        return entry;
    }

    void makeEdits() {
        Rational last;
        for (std::size_t count = below(6); count > 0; --count) {
            const Rational start = below(5) < 2 ? last : someEdge();
            if (below(4) == 0) {
                edits_.hold(start, someEdge() + Rational(1, 3));
                continue;
            }
            last = start + someEdge() + Rational(1, below(2) == 0 ? 5 : 1000);
            edits_.keep(start, last, someSpeed());
        }
    }

    std::mt19937_64 random_;
    std::vector<RandomStream> streams_;
    EditList edits_;
};

} // namespace ZULMetaData::Test
