#include "Tools/record/Camera.h"

#include "Tools/record/Failure.h"

extern "C" {
#include <libavutil/frame.h>
#include <libswscale/swscale.h>
}

#include <algorithm>
#include <array>
#include <chrono>
#include <exception>
#include <utility>

namespace Recorder {

namespace {

constexpr std::size_t s_queuedPictures = 8;
constexpr Instant s_longestInQueue = 150 * s_millisecond;

AVPixelFormat formatOf(PixelLayout layout) {
    switch (layout) {
    case PixelLayout::BGRX32: return AV_PIX_FMT_BGR0;
    case PixelLayout::RGBX32: return AV_PIX_FMT_RGB0;
    case PixelLayout::BGR24: return AV_PIX_FMT_BGR24;
    case PixelLayout::RGB565: return AV_PIX_FMT_RGB565LE;
    }
    return AV_PIX_FMT_BGR0;
}

std::chrono::steady_clock::time_point pointOf(Instant instant) {
    return std::chrono::steady_clock::time_point(std::chrono::nanoseconds(instant));
}

} // namespace

Camera::Camera(ScreenGrabber& grabber, VideoWriter& writer, const VideoSettings& settings, CameraEvents events)
    : grabber_(grabber), writer_(writer), settings_(settings), events_(std::move(events)) {
    scaler_ = sws_getContext(settings.width, settings.height, formatOf(grabber.layout()), settings.width,
                             settings.height, AV_PIX_FMT_YUV420P, SWS_BILINEAR, nullptr, nullptr, nullptr);
    if (!scaler_)
        throw Failure("pictures of this size cannot be converted; record a smaller part with --region");
    const int* coefficients = sws_getCoefficients(SWS_CS_ITU709);
    constexpr int unity = 1 << 16;
    sws_setColorspaceDetails(scaler_, coefficients, 1, coefficients, 0, 0, unity, unity);
}

Camera::~Camera() {
    {
        const std::lock_guard lock(mutex_);
        stopAt_ = 0;
    }
    changed_.notify_all();
    if (taking_.joinable())
        taking_.join();
    if (encoding_.joinable())
        encoding_.join();
    sws_freeContext(scaler_);
}

void Camera::start() {
    nextTick_ = now();
    taking_ = std::thread([this] { takePictures(); });
    encoding_ = std::thread([this] { encodePictures(); });
}

void Camera::pause(Instant instant) {
    const std::lock_guard lock(mutex_);
    if (!pausedAt_)
        pausedAt_ = instant;
    stopAt_.reset();
    changed_.notify_all();
}

void Camera::resume(Instant instant) {
    const std::lock_guard lock(mutex_);
    if (!pausedAt_)
        return;
    dropTicksBefore(*pausedAt_);
    paused_ += instant - *pausedAt_;
    pausedAt_.reset();
    resumedAt_ = instant;
    countTicksFrom(instant);
    nextTick_ = instant;
    changed_.notify_all();
}

void Camera::stopAt(Instant instant) {
    const std::lock_guard lock(mutex_);
    if (!stopAt_ || instant < *stopAt_)
        stopAt_ = instant;
    changed_.notify_all();
}

void Camera::finish(Instant end) {
    stopAt(end);
    taking_.join();
    encoding_.join();
    const Instant length = std::min(end, pausedAt_.value_or(end)) - zero_.value_or(end) - paused_;
    if (error_.empty())
        writer_.finish(inUnits(length, s_pictureTimescale));
}

std::optional<Instant> Camera::movieLength(Instant instant) const {
    const std::lock_guard lock(mutex_);
    const bool isBefore = !zero_ || instant < *zero_ || instant < resumedAt_;
    const bool isAfter = (pausedAt_ && instant >= *pausedAt_) || (stopAt_ && instant >= *stopAt_);
    return isBefore || isAfter ? std::nullopt : std::optional(instant - *zero_ - paused_);
}

void Camera::giveUp(const std::string& why) {
    {
        const std::lock_guard lock(mutex_);
        if (error_.empty())
            error_ = why;
    }
    changed_.notify_all();
    events_.failed(why);
}

void Camera::takePictures() {
    try {
        while (waitForTick())
            skipMissedTicks(serveTick());
    } catch (const std::exception& error) {
        giveUp(error.what());
    }
    const std::lock_guard lock(mutex_);
    isOver_ = true;
    changed_.notify_all();
}

/// Returns false when there is no further tick.
bool Camera::waitForTick() {
    std::unique_lock lock(mutex_);
    for (;;) {
        if (!error_.empty() || (stopAt_ && nextTick_ >= *stopAt_))
            return false;
        if (pausedAt_ && nextTick_ >= *pausedAt_)
            changed_.wait(lock);
        else if (now() < nextTick_)
            changed_.wait_until(lock, pointOf(nextTick_));
        else
            return true;
    }
}

/// Pictures that wait long would be lost with a recorder that is killed, so a slow encoder gets fewer of them.
bool Camera::isBehind() const {
    return queue_.size() >= s_queuedPictures || (!queue_.empty() && now() - queue_.front().instant > s_longestInQueue);
}

/// Returns when the tick was due.
Instant Camera::serveTick() {
    bool isFull = false;
    Instant due = 0;
    {
        const std::lock_guard lock(mutex_);
        due = nextTick_;
        serving_ = due;
        isFull = isBehind();
    }
    const std::optional<GrabbedPicture> grabbed = isFull ? grabber_.askPointer() : grabber_.grab();
    if (!grabber_.isAlive())
        throw Failure("the X display is gone", ExitLoss);
    const std::optional<std::int64_t> time = grabbed && grabbed->pixels ? movieTime(grabbed->instant) : std::nullopt;
    if (grabbed && grabbed->hasPointer)
        events_.sawPointer(grabbed->pointerInstant, grabbed->pointer);
    if (!time) {
        countDropped(due); // even if the end has come before its pixels
        return due;
    }
    Picture picture{converted(*grabbed), *time, grabbed->instant};
    const std::lock_guard lock(mutex_);
    queue_.push_back(std::move(picture));
    ++taken_;
    changed_.notify_all();
    return due;
}

/// Counts a tick without a frame, if it is one of the recording.
void Camera::countDropped(Instant due) {
    const std::lock_guard lock(mutex_);
    const bool isAfter = (stopAt_ && due >= *stopAt_) || (pausedAt_ && due >= *pausedAt_);
    if (zero_ && !isAfter)
        ++dropped_;
}

/// Returns the time of a frame, which is later than that of the one before; nothing if it is not to be recorded.
std::optional<std::int64_t> Camera::movieTime(Instant instant) {
    bool isFirst = false;
    std::int64_t time = 0;
    {
        const std::lock_guard lock(mutex_);
        if (instant < resumedAt_ || (stopAt_ && instant >= *stopAt_) || (pausedAt_ && instant >= *pausedAt_))
            return std::nullopt;
        isFirst = !zero_;
        if (isFirst) {
            zero_ = instant;
            countTicksFrom(instant);
        }
        time = std::max(lastTime_ + 1, inUnits(instant - *zero_ - paused_, s_pictureTimescale));
        lastTime_ = time;
    }
    if (isFirst)
        events_.started(instant);
    return time;
}

void Camera::skipMissedTicks(Instant served) {
    const std::lock_guard lock(mutex_);
    serving_.reset();
    if (served < resumedAt_) // a pause has begun and ended meanwhile, so the next tick is the first one after it
        return;
    nextTick_ = tick(++ticks_);
    if (!zero_)
        return;
    const Instant present = now();
    const Instant end = std::min({present, pausedAt_.value_or(present), stopAt_.value_or(present)});
    for (; tick(ticks_ + 1) <= end; nextTick_ = tick(++ticks_)) // the one before has passed whole
        ++dropped_;
}

/// Counts the ticks before a pause that were not served when it ends.
void Camera::dropTicksBefore(Instant instant) {
    if (serving_ == nextTick_) // this one is counted when it is served
        nextTick_ = tick(++ticks_);
    for (; nextTick_ < instant; nextTick_ = tick(++ticks_))
        ++dropped_;
}

void Camera::countTicksFrom(Instant instant) {
    firstTick_ = instant;
    ticks_ = 0;
    nextTick_ = instant;
}

/// Returns when a tick is. Nothing is rounded twice.
Instant Camera::tick(std::int64_t number) const {
    return firstTick_ + number * s_second / settings_.fps;
}

FramePointer Camera::emptyPicture() {
    FramePointer frame;
    {
        const std::lock_guard lock(mutex_);
        if (!used_.empty()) {
            frame = std::move(used_.back());
            used_.pop_back();
        }
    }
    const bool isFree = frame && av_frame_is_writable(frame.get()) > 0; // an encoder may keep it
    return isFree ? std::move(frame) : writer_.emptyPicture();
}

FramePointer Camera::converted(const GrabbedPicture& grabbed) {
    FramePointer frame = emptyPicture();
    const std::array<const std::uint8_t*, 4> source{grabbed.pixels, nullptr, nullptr, nullptr};
    const std::array<int, 4> lines{grabbed.bytesPerLine, 0, 0, 0};
    sws_scale(scaler_, source.data(), lines.data(), 0, settings_.height, frame->data, frame->linesize);
    return frame;
}

void Camera::encodePictures() {
    for (;;) {
        Picture picture;
        {
            std::unique_lock lock(mutex_);
            changed_.wait(lock, [this] { return !queue_.empty() || isOver_; });
            if (queue_.empty())
                return;
            picture = std::move(queue_.front());
            queue_.pop_front();
        }
        try {
            writer_.writePicture(*picture.frame, picture.time);
        } catch (const std::exception& error) {
            giveUp(error.what());
            return;
        }
        const std::lock_guard lock(mutex_);
        used_.push_back(std::move(picture.frame));
    }
}

} // namespace Recorder
