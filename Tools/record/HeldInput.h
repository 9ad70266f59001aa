#pragma once

// Keys and clicks wait here before they are written: until it is known whether a key may be recorded, and whether one
// of them ended the recording.

#include "Tools/record/Instant.h"
#include "Tools/record/Journal.h"
#include "Tools/record/PrivacyFilter.h"

#include <cstdint>
#include <deque>
#include <variant>

namespace Recorder {

class HeldInput {
public:
    HeldInput(Journal& journal, PrivacyFilter& privacy) : journal_(journal), privacy_(privacy) {}

    void addKey(Instant instant, const ZULMetaData::KeyStroke& key);
    void addButton(Instant instant, std::int32_t action, bool isPress);

    bool hasKeys() const { return !keys_.empty(); }

    /// Writes what has waited long enough.
    void release();

    /// Leaves out the click or key that ended the recording at `instant`, which is the last one pressed before.
    void dropTrigger(Instant instant);

    /// Leaves out the key by which the terminal interrupted the recording at `instant`: the last one with Ctrl.
    void dropInterruptKey(Instant instant);

    /// Writes everything that may be written without waiting longer, because the recording ends at `instant`.
    void releaseAll(Instant end);

private:
    struct Button {
        std::int32_t action;
        bool isPress;
    };
    struct Entry {
        Instant instant;
        std::variant<ZULMetaData::KeyStroke, Button> what;

        bool isKey() const { return what.index() == 0; }
        bool isPress() const { return isKey() || std::get<Button>(what).isPress; }
    };

    void write(const Entry& entry);

    Journal& journal_;
    PrivacyFilter& privacy_;
    std::deque<Entry> keys_;
    std::deque<Entry> buttons_;
};

} // namespace Recorder
