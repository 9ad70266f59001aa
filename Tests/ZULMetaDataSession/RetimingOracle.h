#pragma once

// What becomes of a stream when the movie is cut, computed in the slowest and most obvious way: every rule is applied
// to every entry, one piece after the other, with exact fractions.

#include "Tests/Support/Bytes.h"
#include "ZULMetaDataSession/EditList.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

/// A picture of the cursor with what belongs to it.
struct OraclePicture {
    std::string bytes;
    std::int32_t x = 0;
    std::int32_t y = 0;
    std::int32_t systemCursor = -1;

    friend bool operator==(const OraclePicture&, const OraclePicture&) = default;
};

/// An entry of any kind.
struct OracleEntry {
    double time = 0;
    std::string value;                    ///< the stored bytes without the time; not for cursors
    std::uint64_t id = 0;                 ///< of a cursor
    std::uint32_t flags = 3;              ///< of a cursor
    std::optional<OraclePicture> picture; ///< of a cursor
};

struct OracleResult {
    std::vector<OracleEntry> entries;
    std::uint64_t moved = 0;
    std::uint64_t carried = 0;
    std::uint64_t added = 0;
    std::uint64_t leftOut = 0;
};

/// Works on the entries of one stream.
class RetimingOracle {
public:
    enum class Rule { State, Cursor, Event, Buttons };

    RetimingOracle(Rule rule, const std::vector<OracleEntry>& stream, const std::vector<EditPiece>& pieces)
        : rule_(rule), pieces_(pieces) {
        for (const OracleEntry& entry : stream)
            if (std::isfinite(entry.time))
                insertInOrder(entry);
            else
                ++result_.leftOut;
        if (rule == Rule::Cursor)
            resolvePictures();
    }

    OracleResult run() {
        Rational base;
        for (std::size_t i = 0; i < pieces_.size(); ++i) {
            if (rule_ == Rule::State || rule_ == Rule::Cursor)
                takeStates(pieces_[i], base);
            else if (!pieces_[i].isHeld())
                takeEvents(i, base);
            base = base + pieces_[i].duration;
        }
        if (rule_ == Rule::Cursor)
            leaveOutKnownPictures();
        return result_;
    }

private:
    void insertInOrder(const OracleEntry& entry) {
        std::size_t place = 0;
        while (place < entries_.size() && entries_[place].time <= entry.time)
            ++place;
        entries_.insert(entries_.begin() + static_cast<std::ptrdiff_t>(place), entry);
    }

    void resolvePictures() {
        const std::vector<OracleEntry> stored = entries_;
        for (std::size_t i = 0; i < stored.size(); ++i) {
            std::optional<OraclePicture> found = stored[i].picture;
            for (std::size_t earlier = i; !found && earlier > 0; --earlier)
                if (stored[earlier - 1].id == stored[i].id)
                    found = stored[earlier - 1].picture;
            for (std::size_t later = i + 1; !found && later < stored.size(); ++later)
                if (stored[later].id == stored[i].id)
                    found = stored[later].picture;
            entries_[i].picture = found;
        }
    }

    static bool haveSameValue(const OracleEntry& left, const OracleEntry& right) {
        return left.value == right.value && left.id == right.id && left.picture == right.picture;
    }

    static bool isIn(const OracleEntry& entry, const EditPiece& piece) {
        return entry.time >= piece.start.nearest() && entry.time < piece.end.nearest();
    }

    void move(const OracleEntry& entry, const EditPiece& piece, const Rational& base) {
        const double first = base.nearest();
        const double last = (base + piece.duration).nearest();
        const double time = (base + (Rational::of(entry.time) - piece.start) / piece.speed).nearest();
        write(entry, std::min(std::max(time, first), last));
        ++result_.moved;
    }

    void write(OracleEntry entry, double time) {
        entry.time = time;
        result_.entries.push_back(entry);
    }

    void takeStates(const EditPiece& piece, const Rational& base) {
        const OracleEntry* before = nullptr;
        bool isAtStart = false;
        for (const OracleEntry& entry : entries_) {
            if (entry.time < piece.start.nearest() || (piece.isHeld() && entry.time == piece.start.nearest()))
                before = &entry;
            isAtStart = isAtStart || entry.time == piece.start.nearest();
        }
        const bool isKnown = before && !result_.entries.empty() && haveSameValue(result_.entries.back(), *before);
        if (before && !isKnown && (piece.isHeld() || !isAtStart)) {
            write(*before, base.nearest());
            ++result_.carried;
        }
        for (const OracleEntry& entry : entries_)
            if (!piece.isHeld() && isIn(entry, piece))
                move(entry, piece, base);
    }

    void leaveOutKnownPictures() {
        const std::vector<OracleEntry> whole = result_.entries;
        for (std::size_t i = 0; i < whole.size(); ++i) {
            std::optional<OraclePicture> known;
            for (std::size_t earlier = 0; earlier < i; ++earlier)
                if (whole[earlier].id == whole[i].id)
                    known = whole[earlier].picture;
            if (known == whole[i].picture)
                result_.entries[i].picture.reset();
        }
    }

    /// 0 to 2 for left, right, middle; nothing for an entry that says nothing about a button.
    static std::optional<int> buttonOf(std::int32_t action) {
        if (action == 256)
            return std::nullopt;
        for (const int bit : {1, 2, 4, 8, 16, 32})
            if ((action & bit) != 0)
                return bit <= 2 ? 0 : bit <= 8 ? 1 : 2;
        return std::nullopt;
    }

    static bool isPress(std::int32_t action) {
        for (const int bit : {1, 2, 4, 8, 16, 32})
            if ((action & bit) != 0)
                return bit == 1 || bit == 4 || bit == 16;
        return false;
    }

    static std::int32_t actionOf(const OracleEntry& entry) {
        std::int32_t action = 0;
        std::memcpy(&action, entry.value.data(), sizeof action);
        return action;
    }

    /// Returns the press with which a button is down at an edge.
    std::optional<OracleEntry> pressAt(int button, const Rational& edge) const {
        std::optional<OracleEntry> press;
        for (const OracleEntry& entry : entries_)
            if (entry.time < edge.nearest() && buttonOf(actionOf(entry)) == button)
                press = isPress(actionOf(entry)) ? std::optional(entry) : std::nullopt;
        return press;
    }

    bool isReleasedExactlyAt(int button, const Rational& edge) const {
        for (const OracleEntry& entry : entries_)
            if (entry.time == edge.nearest() && buttonOf(actionOf(entry)) == button)
                return !isPress(actionOf(entry));
        return false;
    }

    bool goesOnAfter(std::size_t number) const {
        std::size_t next = number + 1;
        while (next < pieces_.size() && pieces_[next].isHeld())
            ++next;
        return next < pieces_.size() && pieces_[next].start.nearest() == pieces_[number].end.nearest();
    }

    bool goesOnFromBefore(std::size_t number) const {
        for (std::size_t before = number; before > 0; --before)
            if (!pieces_[before - 1].isHeld())
                return goesOnAfter(before - 1);
        return false;
    }

    void takeEvents(std::size_t number, const Rational& base) {
        const EditPiece& piece = pieces_[number];
        const Rational end = base + (piece.end - piece.start) / piece.speed;
        const bool hasButtons = rule_ == Rule::Buttons;
        for (int button = 0; hasButtons && button < 3; ++button) {
            const auto press = pressAt(button, piece.start);
            if (!press || goesOnFromBefore(number) || isReleasedExactlyAt(button, piece.start))
                continue;
            write(*press, base.nearest());
            ++result_.added;
        }
        for (const OracleEntry& entry : entries_)
            if (isIn(entry, piece))
                move(entry, piece, base);
        for (int button = 0; hasButtons && button < 3; ++button) {
            if (!pressAt(button, piece.end) || goesOnAfter(number))
                continue;
            const std::int32_t release = button == 0 ? 2 : button == 1 ? 8 : 32;
            write({0, raw(release), 0, 3, {}}, end.nearest());
            ++result_.added;
        }
    }

    Rule rule_;
    const std::vector<EditPiece>& pieces_;
    std::vector<OracleEntry> entries_; ///< finite times, ascending
    OracleResult result_;
};

} // namespace ZULMetaData::Test
