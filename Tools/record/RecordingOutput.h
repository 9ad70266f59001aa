#pragma once

// Everything that is written while something is recorded, and how it becomes a movie.

#include "Tools/record/Camera.h"
#include "Tools/record/DiskSync.h"
#include "Tools/record/DiskWatch.h"
#include "Tools/record/Geometry.h"
#include "Tools/record/HeldInput.h"
#include "Tools/record/Instant.h"
#include "Tools/record/Journal.h"
#include "Tools/record/Losses.h"
#include "Tools/record/Mailbox.h"
#include "Tools/record/Options.h"
#include "Tools/record/PrivacyFilter.h"
#include "Tools/record/RecordingFolder.h"
#include "Tools/record/Report.h"
#include "Tools/record/ScreenGrabber.h"
#include "Tools/record/SoundSource.h"
#include "Tools/record/StatusLine.h"
#include "Tools/record/VideoWriter.h"
#include "ZULMetaDataSession/Error.h"

#include <atomic>
#include <filesystem>
#include <functional>
#include <memory>
#include <optional>
#include <string>

namespace Recorder {

class RecordingOutput {
public:
    /// What has become of the recording.
    enum class Outcome {
        Saved,
        Kept,    ///< in the folder
        Nothing, ///< there is nothing to keep
    };

    /// Records the part `area` of what `grabber` sees. The threads report to `mailbox`, which outlives them, as do the
    /// others. Throws `Failure`; nothing is created then.
    RecordingOutput(const Options& options, const Area& area, ScreenGrabber& grabber, PrivacyFilter& privacy,
                    Mailbox& mailbox);

    Journal& journal() { return *journal_; }
    HeldInput& input() { return *input_; }
    const std::filesystem::path& folder() const { return folder_.folder(); }

    /// Starts the threads. The mailbox says when there is a first frame.
    void start();

    /// The first frame is there.
    void begin(Instant zero);

    bool hasBegun() const { return zero_.has_value(); }
    bool isPaused() const { return pausedAt_.has_value(); }
    void pause(Instant instant);
    void resume(Instant instant);

    /// Returns when the recording ends by its duration, unless it has none, or is paused.
    std::optional<Instant> endOfDuration() const;

    /// Nothing from `instant` on is recorded.
    void endAt(Instant instant);

    /// Returns false if what is left of the file system is needed to save the recording.
    bool hasRoom();

    /// Returns whether a write has failed because the file system is full.
    bool isDiskFull() const { return isDiskFull_; }

    Progress progress() const;

    /// Makes room for saving.
    void releaseReserve() { folder_.releaseReserve(); }

    /// Ends what `endAt` has ended, and makes the movie. `takeMail` takes what the threads have reported until then.
    Outcome save(Losses& losses, const std::function<void()>& takeMail);

    /// Returns why the streams are not whole, if so.
    std::optional<std::string> lossOfStreams() const;

    /// Ends the threads and leaves nothing.
    void discard();

    Report report(Outcome outcome) const;

private:
    void lostEntry(const ZULMetaData::Error& loss);
    bool makeRoom();
    void limitDuration();
    void finishStreams(const std::function<void()>& takeMail);
    void makeMovie();

    std::filesystem::path output_;
    std::optional<double> duration_;
    RecordingFolder folder_;
    DiskWatch disk_{folder_};
    std::atomic<bool> isDiskFull_ = false;
    std::unique_ptr<VideoWriter> writer_;
    std::unique_ptr<Journal> journal_;
    std::unique_ptr<HeldInput> input_;
    std::unique_ptr<Camera> camera_;
    std::unique_ptr<DiskSync> sync_;
    std::unique_ptr<SoundSource> sound_; ///< only with --audio
    Mailbox& mailbox_;

    std::optional<Instant> zero_;
    Instant paused_ = 0; ///< of all pauses
    std::optional<Instant> pausedAt_;
    std::optional<Instant> end_;
};

} // namespace Recorder
