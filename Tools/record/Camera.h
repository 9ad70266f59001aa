#pragma once

// Takes pictures at the frame rate on a thread of its own, and encodes them on another one.

#include "Tools/record/Instant.h"
#include "Tools/record/ScreenGrabber.h"
#include "Tools/record/VideoWriter.h"

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <functional>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <vector>

struct SwsContext;

namespace Recorder {

/// What the camera reports, on its own threads.
struct CameraEvents {
    std::function<void(Instant)> started;               ///< the instant of the first frame
    std::function<void(Instant, Position)> sawPointer;  ///< at each tick
    std::function<void(const std::string& why)> failed; ///< the movie cannot go on
};

/// A tick of the frame rate either has a frame or counts as dropped.
class Camera {
public:
    Camera(ScreenGrabber& grabber, VideoWriter& writer, const VideoSettings& settings, CameraEvents events);
    ~Camera();
    Camera(const Camera&) = delete;
    Camera& operator=(const Camera&) = delete;

    void start();

    /// No frame is taken from `instant` on.
    void pause(Instant instant);

    /// The next frame is taken at once. The movie's time goes on from where it stood.
    void resume(Instant instant);

    /// No frame is taken from `instant` on, which may lie ahead. Ticks before it are still served. A pause takes it
    /// back.
    void stopAt(Instant instant);

    /// Ends both threads when everything that was taken is encoded, and ends the movie.
    void finish(Instant end);

    std::uint64_t frames() const { return taken_; }
    std::uint64_t dropped() const { return dropped_; }

    /// Returns how much of the movie lies before an instant; nothing for one before the first frame or in a pause.
    std::optional<Instant> movieLength(Instant instant) const;

private:
    struct Picture {
        FramePointer frame;
        std::int64_t time = 0; ///< in the movie
        Instant instant = 0;   ///< when it was taken
    };

    void takePictures();
    void encodePictures();
    Instant serveTick();
    bool isBehind() const;
    void countDropped(Instant due);
    bool waitForTick();
    void skipMissedTicks(Instant served);
    void dropTicksBefore(Instant instant);
    void countTicksFrom(Instant instant);
    Instant tick(std::int64_t number) const;
    FramePointer emptyPicture();
    FramePointer converted(const GrabbedPicture& grabbed);
    std::optional<std::int64_t> movieTime(Instant instant);
    void giveUp(const std::string& why);

    ScreenGrabber& grabber_;
    VideoWriter& writer_;
    VideoSettings settings_;
    CameraEvents events_;
    SwsContext* scaler_ = nullptr;

    mutable std::mutex mutex_;
    std::condition_variable changed_;
    std::deque<Picture> queue_;
    std::vector<FramePointer> used_; ///< pictures that are encoded, whose memory is used again
    std::optional<Instant> zero_;
    std::optional<Instant> pausedAt_;
    Instant resumedAt_ = 0;
    Instant paused_ = 0; ///< of all pauses
    std::optional<Instant> stopAt_;
    Instant firstTick_ = 0;
    std::int64_t ticks_ = 0; ///< after the first one
    Instant nextTick_ = 0;
    std::optional<Instant> serving_; ///< the tick that has no frame yet and is not counted
    std::int64_t lastTime_ = -1;
    bool isOver_ = false; ///< no picture comes any more
    std::string error_;

    std::atomic<std::uint64_t> taken_ = 0;
    std::atomic<std::uint64_t> dropped_ = 0;
    std::thread taking_;
    std::thread encoding_;
};

} // namespace Recorder
