#include "Tools/record/HeldInput.h"

#include <algorithm>

namespace Recorder {

using namespace ZULMetaData;

namespace {

constexpr Instant s_wait = 250 * s_millisecond; ///< longer than it takes from a click or key to what it leads to
constexpr std::uint32_t s_controlFlag = 0x40000;

bool isJustBefore(Instant instant, Instant earlier) {
    return earlier <= instant && earlier > instant - s_wait;
}

} // namespace

void HeldInput::addKey(Instant instant, const KeyStroke& key) {
    const auto isLater = [instant](const Entry& entry) { return entry.instant > instant; };
    keys_.insert(std::find_if(keys_.begin(), keys_.end(), isLater), {instant, key}); // repetitions come by another way
}

void HeldInput::addButton(Instant instant, std::int32_t action, bool isPress) {
    buttons_.push_back({instant, Button{action, isPress}});
}

void HeldInput::write(const Entry& entry) {
    if (entry.isKey())
        journal_.note<KeyboardActionKind>(entry.instant, std::get<KeyStroke>(entry.what));
    else
        journal_.note<CursorActionKind>(entry.instant, std::get<Button>(entry.what).action);
}

void HeldInput::release() {
    const Instant until = now() - s_wait;
    for (; !buttons_.empty() && buttons_.front().instant <= until; buttons_.pop_front())
        write(buttons_.front());
    for (; !keys_.empty() && keys_.front().instant <= until; keys_.pop_front()) {
        const PrivacyFilter::Verdict verdict = privacy_.judge(keys_.front().instant);
        if (verdict == PrivacyFilter::Verdict::Wait)
            break;
        if (verdict == PrivacyFilter::Verdict::Record)
            write(keys_.front());
    }
}

void HeldInput::dropTrigger(Instant instant) {
    const auto isTrigger = [instant](const Entry& entry) {
        return entry.isPress() && isJustBefore(instant, entry.instant);
    };
    const auto key = std::find_if(keys_.rbegin(), keys_.rend(), isTrigger);
    const auto button = std::find_if(buttons_.rbegin(), buttons_.rend(), isTrigger);
    const bool isButton = button != buttons_.rend() && (key == keys_.rend() || button->instant > key->instant);
    if (isButton)
        buttons_.erase(std::prev(button.base()), buttons_.end());
    else if (key != keys_.rend())
        keys_.erase(std::prev(key.base()));
}

void HeldInput::dropInterruptKey(Instant instant) {
    const auto isInterrupt = [instant](const Entry& entry) {
        return isJustBefore(instant, entry.instant) &&
               (std::get<KeyStroke>(entry.what).eventFlagsCode & s_controlFlag) != 0;
    };
    const auto key = std::find_if(keys_.rbegin(), keys_.rend(), isInterrupt);
    if (key != keys_.rend())
        keys_.erase(std::prev(key.base()));
}

void HeldInput::releaseAll(Instant end) {
    for (const Entry& entry : buttons_)
        if (entry.instant < end)
            write(entry);
    for (const Entry& entry : keys_)
        if (entry.instant < end && privacy_.judge(entry.instant) == PrivacyFilter::Verdict::Record)
            write(entry);
    buttons_.clear();
    keys_.clear();
}

} // namespace Recorder
