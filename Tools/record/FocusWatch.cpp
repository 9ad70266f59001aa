#include "Tools/record/FocusWatch.h"

#include <algorithm>
#include <utility>

namespace Recorder {

namespace {

constexpr Instant s_askInterval = 50 * s_millisecond;     ///< while keys wait for an answer
constexpr Instant s_searchInterval = 200 * s_millisecond; ///< while the focus is not known, at least
constexpr Instant s_longestSearchInterval = s_second;
constexpr Instant s_promptAnswer = 250 * s_millisecond;
constexpr Instant s_catchUp = 250 * s_millisecond; ///< in which an application takes the input that waited for it
constexpr Instant s_firstPause = s_second;
constexpr Instant s_laterPause = 5 * s_second;

} // namespace

FocusWatch::FocusWatch(std::string display, PrivacyFilter& privacy, std::function<void(const std::string&)> tell)
    : display_(std::move(display)), privacy_(privacy), tell_(std::move(tell)), pause_(s_firstPause) {}

FocusWatch::Bus FocusWatch::reach(Instant until) {
    process_ = std::make_unique<AccessibilityProcess>(display_);
    process_->waitUntilReady(until);
    if (!process_->isAlive()) {
        process_.reset();
        return Bus::Absent;
    }
    privacy_.requireFocus(true);
    wasReady_ = process_->isReady();
    return wasReady_ ? Bus::Ready : Bus::Late;
}

void FocusWatch::follow(WindowObserver& windows, const PointerObserver& pointer) {
    windows_ = &windows;
    pointer_ = &pointer;
    hover();
}

void FocusWatch::start() {
    startAt_.reset();
    process_ = std::make_unique<AccessibilityProcess>(display_);
    process_->windowChanged(windows_->process());
}

void FocusWatch::lost() {
    privacy_.setFocus(now(), Focus::Unknown);
    hovered_.reset();
    const bool isAbsent = process_->isAbsent();
    process_.reset();
    if (isAbsent && !wasReady_) { // it was only slow to say that there is no bus
        privacy_.requireFocus(false);
        return;
    }
    if (pause_ == s_firstPause)
        tell_("the accessibility bus does not answer: keys are left out until it does");
    startAt_ = now() + pause_;
    pause_ = s_laterPause;
}

void FocusWatch::windowChanged(Instant instant, std::uint32_t process) {
    privacy_.setFocus(instant, Focus::Unknown);
    hovered_.reset();
    if (!process_)
        return;
    process_->windowChanged(process);
    process_->ask(0);
}

void FocusWatch::hover() {
    const std::optional<Position> pointer = pointer_->position();
    if (std::exchange(wasDenied_, privacy_.isDenied()) != privacy_.isDenied())
        hovered_.reset();
    if (!pointer || pointer == hovered_ || privacy_.isDenied())
        return;
    const bool asks = process_ && process_->isReady() && windows_->process() != 0;
    if (asks && !process_->askHover(*pointer))
        return; // until the earlier question is answered, even if the pointer rests from now on
    hovered_ = pointer;
    if (!asks)
        windows_->hover(now(), *pointer);
}

void FocusWatch::noteHover(const std::optional<Area>& area) {
    if (area)
        windows_->noteHover(now(), *area);
    else if (const auto pointer = pointer_->position())
        windows_->hover(now(), *pointer);
}

/// An application that was busy may answer before it takes the click that moves the focus to a password field. Its
/// answers count again when it has had the time for that.
void FocusWatch::answered(Instant asked, std::optional<Focus> focus) {
    const Instant instant = now();
    pause_ = s_firstPause; // the next outage is another one
    searchTook_ = instant - asked;
    const bool wasBusy = std::exchange(isBusy_, !focus || searchTook_ > s_promptAnswer);
    if (wasBusy && !isBusy_)
        answersSince_ = instant;
    if (!focus)
        return;
    privacy_.setFocus(instant, *focus);
    if (*focus != Focus::Unknown && !isBusy_ && asked >= answersSince_ + s_catchUp)
        privacy_.confirm(asked);
}

void FocusWatch::serve(bool hasWaitingKeys) {
    if (startAt_ && now() >= *startAt_)
        start();
    if (!process_)
        return;
    const AccessibilityEvents events{[this](std::uint32_t process, Focus focus) {
                                         if (process == windows_->process())
                                             privacy_.setFocus(now(), focus);
                                     },
                                     [this](Instant asked, std::optional<Focus> focus) { answered(asked, focus); },
                                     [this](const std::optional<Area>& area) { noteHover(area); }};
    process_->serve(events);
    wasReady_ = wasReady_ || process_->isReady();
    if (!process_->isAlive())
        lost();
    else if (hasWaitingKeys)
        process_->ask(s_askInterval);
    else if (privacy_.isFocusUnknown())
        process_->ask(
            std::clamp(3 * searchTook_, s_searchInterval, s_longestSearchInterval)); // takes time of the application
}

} // namespace Recorder
