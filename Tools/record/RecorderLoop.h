#pragma once

// A recording from its start to its end.

#include "Tools/record/Camera.h"
#include "Tools/record/CaptureTarget.h"
#include "Tools/record/ControlSocket.h"
#include "Tools/record/CursorObserver.h"
#include "Tools/record/DiskSync.h"
#include "Tools/record/DiskWatch.h"
#include "Tools/record/FocusWatch.h"
#include "Tools/record/FreeKeys.h"
#include "Tools/record/HeldInput.h"
#include "Tools/record/Journal.h"
#include "Tools/record/KeyObserver.h"
#include "Tools/record/MachineObserver.h"
#include "Tools/record/Mailbox.h"
#include "Tools/record/Options.h"
#include "Tools/record/PointerObserver.h"
#include "Tools/record/RecordingFolder.h"
#include "Tools/record/SoundSource.h"
#include "Tools/record/StatusLine.h"
#include "Tools/record/StopSignals.h"
#include "Tools/record/TrafficObserver.h"
#include "Tools/record/WindowObserver.h"
#include "ZULMetaDataSession/Error.h"

#include <atomic>
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
    ~RecorderLoop();

    /// Records until something ends it, and makes the movie. Returns how the program ends.
    int run();

private:
    /// Observers of the display, which live as long as something is recorded.
    struct Observers;

    /// What has become of the recording.
    enum class Outcome {
        Saved,
        Kept,    ///< in the folder
        Nothing, ///< there is nothing to keep
    };

    void reachAccessibility();
    void open();
    void lostEntry(const ZULMetaData::Error& loss);
    void selectInput();
    void observe();
    void waitForSomething();
    void takeEvents();
    void takeEvent(const xcb_generic_event_t& event);
    void takeInput(const xcb_ge_generic_event_t& event);
    void takeKey(const xcb_input_raw_key_press_event_t& event);
    bool isHidden(std::uint8_t key, std::uint32_t serverTime);
    ZULMetaData::Modifiers buttonModifiers() const;
    void takeMail();
    void takeSignals();
    void began(Instant zero);
    void lookAfterDisk();
    void lookAfterTime();
    void showStatus();
    void pause(Instant instant);
    void resume(Instant instant);
    std::string obey(Command command);
    void dropTrigger(Instant instant, bool isFromTerminal);
    Instant endOfDuration() const;
    void limitDuration();

    void fail(const std::string& why);
    void end(End why, Instant instant);
    void waitForHeldKeys();
    template <class Step>
    bool attempt(Step step);
    void addError(const std::string& sentence);
    Outcome save();
    void finishStreams();
    void makeMovie();
    void tellEnd(Outcome outcome);
    void report(Outcome outcome) const;
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
    std::optional<FreeKeys> freeKeys_; ///< if it matters which window a key goes to
    ControlSocket control_;
    RecordingFolder folder_;
    DiskWatch disk_{folder_};
    std::atomic<bool> isDiskFull_ = false;
    Mailbox mailbox_;
    std::unique_ptr<VideoWriter> writer_;
    std::unique_ptr<Journal> journal_;
    std::unique_ptr<HeldInput> input_;
    std::unique_ptr<Observers> observers_;
    std::unique_ptr<Camera> camera_;
    std::unique_ptr<DiskSync> sync_;
    std::unique_ptr<SoundSource> sound_; ///< only with --audio

    std::optional<End> end_;
    Instant endInstant_ = 0;
    std::string error_;
    std::optional<Instant> zero_;
    Instant paused_ = 0;
    std::optional<Instant> pausedAt_;
    std::uint8_t inputOpcode_ = 0;
};

} // namespace Recorder
