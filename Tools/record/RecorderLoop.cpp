#include "Tools/record/RecorderLoop.h"

#include "Tools/record/Failure.h"
#include "Tools/record/Report.h"

#include <fmt/core.h>
#include <poll.h>

#include <csignal>
#include <exception>
#include <vector>

namespace Recorder {

namespace {

constexpr Instant s_longestWait = 20 * s_millisecond;
constexpr Instant s_busDeadline = 2 * s_second;

const char* nameOf(End end) {
    switch (end) {
    case End::Duration: return "duration";
    case End::Signal: return "signal";
    case End::Stop: return "stop";
    case End::Window: return "window";
    case End::Disk: return "disk";
    case End::Error: return "error";
    }
    return "error";
}

} // namespace

RecorderLoop::RecorderLoop(const Options& options)
    : options_(options), connection_(options.display), target_(captureTargetOf(connection_, options)),
      grabber_(options.display, target_.area, target_.window), clock_(options.display),
      privacy_(options.keys, options.deniedApps, options.deniedTitles),
      focus_(options.display, privacy_, [this](const std::string& sentence) { warn(sentence); }),
      control_(options.socket) {
    reachAccessibility();
    output_ = std::make_unique<RecordingOutput>(options_, target_.area, grabber_, privacy_, mailbox_);
    signals_.nameFolder(output_->folder());
    try {
        const DisplayObservers::Tools tools{connection_,        clock_,          privacy_, focus_,
                                            output_->journal(), output_->input()};
        observers_ = std::make_unique<DisplayObservers>(tools, options_.display, target_.watched);
    } catch (...) {
        output_->discard();
        throw;
    }
}

void RecorderLoop::warn(const std::string& sentence) {
    status_.say("zulm record: " + sentence);
}

void RecorderLoop::reachAccessibility() {
    if (!options_.withoutAccessibility) {
        const FocusWatch::Bus bus = focus_.reach(now() + s_busDeadline);
        if (options_.keys == KeyMode::Everything && bus != FocusWatch::Bus::Ready)
            throw Refusal(
                "--keys all: the accessibility bus does not answer, so passwords could not be told from other "
                "texts; start it, or add --without-accessibility to record passwords as well");
        if (bus == FocusWatch::Bus::Late)
            warn("the accessibility bus does not answer yet: keys are left out until it does");
    }
}

int RecorderLoop::run() {
    output_->start();
    try {
        while (!end_)
            observe();
    } catch (const std::exception& error) {
        fail(error.what());
    }
    signals_.endAtNext();
    const Outcome outcome = save();
    if (outcome != Outcome::Kept)
        signals_.nameFolder({});
    tellEnd(outcome);
    control_.tellEnd(outcome == Outcome::Saved ? "saved" : "kept");
    if (outcome == Outcome::Kept)
        say(output_->folder().string());
    const bool isWell = outcome == Outcome::Saved && *end_ != End::Disk && *end_ != End::Error && losses_.isEmpty();
    return isWell ? ExitFine : ExitLoss;
}

void RecorderLoop::tellEnd(Outcome outcome) {
    status_.end();
    if (!losses_.isEmpty())
        warn(losses_.text());
    if (*end_ == End::Disk)
        warn(fmt::format("the file system is full: the recording was ended{}",
                         outcome == Outcome::Saved ? ", and what there was is saved" : ""));
    Report report = output_->report(outcome);
    report.stoppedBy = nameOf(*end_);
    if (report.dropped > 0)
        warn(fmt::format("{} of {} frames were dropped; record fewer of them with --fps, or a smaller part with "
                         "--region",
                         report.dropped, report.dropped + report.frames));
    if (options_.json)
        printReport(report);
}

void RecorderLoop::observe() {
    waitForSomething();
    takeEvents();
    observers_->takeTraffic();
    takeMail();
    focus_.serve(output_->input().hasKeys());
    takeSignals();
    control_.serve([this](Command command) { return obey(command); });
    if (end_)
        return;
    observers_->poll();
    output_->input().release();
    output_->journal().flushIfDue();
    clock_.keepUp();
    lookAfterTime();
    lookAfterDisk();
    showStatus();
}

void RecorderLoop::waitForSomething() {
    std::vector<pollfd> waits;
    const auto wait = [&waits](int descriptor) { waits.push_back({descriptor, POLLIN, 0}); };
    wait(connection_.descriptor());
    wait(mailbox_.descriptor());
    wait(signals_.descriptor());
    wait(observers_->descriptor()); // poll ignores a negative one
    wait(focus_.descriptor());
    for (const int descriptor : control_.descriptors())
        wait(descriptor);
    connection_.flush();
    poll(waits.data(), waits.size(), static_cast<int>(s_longestWait / s_millisecond));
}

void RecorderLoop::takeEvents() {
    observers_->takeEvents();
    if (options_.stopsOnClose && observers_->isWatchedGone())
        end(End::Window, now());
    if (!connection_.isAlive())
        fail("the X display is gone");
}

void RecorderLoop::takeMail() {
    const Mailbox::Mail mail = mailbox_.take();
    if (mail.started)
        began(*mail.started);
    for (const Mailbox::Sight& sight : mail.sights)
        observers_->saw(sight);
    if (!mail.sights.empty())
        focus_.hover();
    if (!mail.failure.empty())
        fail(mail.failure);
}

void RecorderLoop::began(Instant zero) {
    output_->begin(zero);
    say("recording " + options_.output.string());
}

void RecorderLoop::takeSignals() {
    while (const auto signal = signals_.next()) {
        if (signal->number == SIGUSR1) {
            obey(output_->isPaused() ? Command::Resume : Command::Pause);
        } else {
            const Instant instant = now();
            dropTrigger(instant, signal->isFromTerminal);
            end(End::Signal, instant);
        }
    }
}

/// The click or key that led to this may have arrived since the last look.
void RecorderLoop::dropTrigger(Instant instant, bool isFromTerminal) {
    takeEvents();
    if (isFromTerminal)
        output_->input().dropInterruptKey(instant);
    else
        output_->input().dropTrigger(instant);
}

std::string RecorderLoop::obey(Command command) {
    const Instant instant = now();
    if (end_)
        return command == Command::Stop ? s_stopping : s_tooLate;
    switch (command) {
    case Command::Pause:
        if (!output_->hasBegun())
            return s_tooEarly;
        if (!output_->isPaused())
            pause(instant);
        return "paused";
    case Command::Resume:
        if (output_->isPaused())
            output_->resume(instant);
        return "resumed";
    case Command::Stop: break;
    }
    dropTrigger(instant, false);
    end(End::Stop, instant);
    return s_stopping;
}

void RecorderLoop::pause(Instant instant) {
    takeEvents(); // those before the pause are in the recording
    output_->pause(instant);
}

void RecorderLoop::end(End why, Instant instant) {
    if (end_)
        return;
    end_ = why;
    output_->endAt(instant);
}

void RecorderLoop::fail(const std::string& why) {
    if (end_)
        return;
    losses_.add(why);
    end(output_->isDiskFull() ? End::Disk : End::Error, now());
}

void RecorderLoop::lookAfterTime() {
    if (const auto instant = output_->endOfDuration(); instant && now() >= *instant)
        end(End::Duration, *instant);
}

/// Ends the recording while it can still be saved.
void RecorderLoop::lookAfterDisk() {
    if (output_->isDiskFull() || !output_->hasRoom())
        end(End::Disk, now());
}

void RecorderLoop::showStatus() {
    if (output_->hasBegun() && status_.isDue())
        status_.show(output_->progress());
}

/// The accessibility bus has a little time to answer for keys that wait.
void RecorderLoop::waitForHeldKeys() {
    constexpr Instant longest = 600 * s_millisecond;
    const Instant deadline = now() + longest;
    HeldInput& input = output_->input();
    while (privacy_.needsFocus() && focus_.descriptor() >= 0 && input.hasKeys() && now() < deadline) {
        waitForSomething();
        focus_.serve(input.hasKeys());
        input.release();
    }
}

RecorderLoop::Outcome RecorderLoop::save() {
    output_->releaseReserve(); // what is in memory needs space, too
    losses_.attempt([this] {
        takeEvents();
        waitForHeldKeys();
    });
    const Outcome outcome = output_->save(losses_, [this] { takeMail(); });
    if (const auto loss = output_->lossOfStreams(); loss && *end_ != End::Disk)
        losses_.add(*loss);
    return outcome;
}

} // namespace Recorder
