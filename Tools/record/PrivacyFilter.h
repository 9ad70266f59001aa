#pragma once

// Decides which keys, titles and rectangles may be recorded.

#include "Tools/record/Instant.h"

#include <algorithm>
#include <cstdint>
#include <deque>
#include <optional>
#include <regex>
#include <string>
#include <vector>

namespace Recorder {

/// An application that answers no question for so long is not trusted.
inline constexpr Instant s_longestAnswer = 2 * s_second;

enum class KeyMode { Nothing, Shortcuts, Everything };

/// What is known of the field that keys go to.
enum class Focus {
    Unknown,  ///< nothing, so that no key is recorded
    Ordinary, ///< it shows what is typed
    Password, ///< it does not
};

/// A value that changes, with the instants of its changes.
template <class Value>
class History {
public:
    explicit History(Value value) { changes_.push_back({0, value}); }

    void set(Instant instant, Value value) {
        if (changes_.back().value != value)
            changes_.push_back({std::max(instant, changes_.back().since), value});
        while (changes_.size() > 1 && changes_[1].since < instant - 20 * s_second)
            changes_.pop_front();
    }

    Value last() const { return changes_.back().value; }

    /// Returns what held at an instant.
    Value at(Instant instant) const {
        for (std::size_t i = changes_.size(); i-- > 1;)
            if (changes_[i].since <= instant)
                return changes_[i].value;
        return changes_.front().value;
    }

    /// Returns whether it had a value at any instant from `from` to `to`.
    bool had(Value value, Instant from, Instant to) const {
        for (std::size_t i = 0; i < changes_.size(); ++i) {
            const bool isOver = i + 1 < changes_.size() && changes_[i + 1].since <= from;
            if (!isOver && changes_[i].since <= to && changes_[i].value == value)
                return true;
        }
        return false;
    }

private:
    struct Change {
        Instant since;
        Value value;
    };
    std::deque<Change> changes_;
};

class PrivacyFilter {
public:
    enum class Verdict { Record, LeaveOut, Wait };

    /// The patterns are regular expressions, searched for without regard to case. Throws `Refusal` for one that is
    /// none.
    PrivacyFilter(KeyMode mode, const std::vector<std::string>& deniedApps,
                  const std::vector<std::string>& deniedTitles);

    KeyMode mode() const { return mode_; }

    /// Returns whether a key may come into the queue at all.
    bool takesKey(bool typesCharacter) const {
        return mode_ == KeyMode::Everything || (mode_ == KeyMode::Shortcuts && !typesCharacter);
    }

    bool denies(const std::string& app, const std::string& title) const;
    bool isDenied() const { return denied_.last(); }

    /// The window on top has changed.
    void setWindow(Instant instant, bool isDenied) { denied_.set(instant, isDenied); }

    /// Says whether the focus has to be known.
    void requireFocus(bool isNeeded) { needsFocus_ = isNeeded; }
    bool needsFocus() const { return needsFocus_; }

    /// Returns whether it matters which window a key goes to.
    bool judgesWindows() const { return needsFocus_ || !deniedApps_.empty() || !deniedTitles_.empty(); }

    /// The focus is known since an instant.
    void setFocus(Instant instant, Focus focus) { focus_.set(instant, focus); }

    bool isFocusUnknown() const { return focus_.last() == Focus::Unknown; }

    /// The focus was confirmed by an answer to a question that was asked at an instant.
    void confirm(Instant asked) { confirmedUntil_ = std::max(confirmedUntil_, asked); }

    /// Decides on a key that was pressed at an instant.
    Verdict judge(Instant pressed) const;

private:
    KeyMode mode_;
    std::vector<std::regex> deniedApps_;
    std::vector<std::regex> deniedTitles_;
    History<bool> denied_{false};
    bool needsFocus_ = false;
    History<Focus> focus_{Focus::Unknown};
    Instant confirmedUntil_ = 0;
};

} // namespace Recorder
