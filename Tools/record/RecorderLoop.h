#pragma once

// A recording from its start to its end.

#include "Tools/record/CaptureTarget.h"
#include "Tools/record/ControlSocket.h"
#include "Tools/record/DisplayObservers.h"
#include "Tools/record/FocusWatch.h"
#include "Tools/record/Instant.h"
#include "Tools/record/Losses.h"
#include "Tools/record/Mailbox.h"
#include "Tools/record/Options.h"
#include "Tools/record/PrivacyFilter.h"
#include "Tools/record/RecordingOutput.h"
#include "Tools/record/ScreenGrabber.h"
#include "Tools/record/ServerClock.h"
#include "Tools/record/StatusLine.h"
#include "Tools/record/StopSignals.h"
#include "Tools/record/XConnection.h"

#include <memory>
#include <optional>
#include <string>

namespace Recorder {

/// Why a recording ended.
enum class End { Duration, Signal, Stop, Window, Disk, Error };

class RecorderLoop {
public:
    /// Opens everything that a recording needs. Throws `Failure`; nothing is created then.
    explicit RecorderLoop(const Options& options);

    /// Records until something ends it, and makes the movie. Returns how the program ends.
    int run();

private:
    using Outcome = RecordingOutput::Outcome;

    void reachAccessibility();
    void observe();
    void waitForSomething();
    void takeEvents();
    void takeMail();
    void takeSignals();
    void began(Instant zero);
    void lookAfterTime();
    void lookAfterDisk();
    void showStatus();
    void pause(Instant instant);
    std::string obey(Command command);
    void dropTrigger(Instant instant, bool isFromTerminal);

    void fail(const std::string& why);
    void end(End why, Instant instant);
    void waitForHeldKeys();
    Outcome save();
    void tellEnd(Outcome outcome);
    void warn(const std::string& sentence);

    Options options_;
    XConnection connection_;
    CaptureTarget target_;
    StopSignals signals_; ///< before any thread is started
    ScreenGrabber grabber_;
    ServerClock clock_;
    PrivacyFilter privacy_;
    StatusLine status_;
    FocusWatch focus_;
    ControlSocket control_;
    Mailbox mailbox_;
    std::unique_ptr<RecordingOutput> output_;
    std::unique_ptr<DisplayObservers> observers_;

    std::optional<End> end_;
    Losses losses_;
};

} // namespace Recorder
