#include "Tools/record/RecordingOutput.h"

#include "Tools/record/FileHandle.h"
#include "Tools/record/FragmentedMovie.h"

#include <fcntl.h>

#include <cerrno>
#include <system_error>

namespace Recorder {

using namespace ZULMetaData;

namespace {

bool isFullDisk(std::error_code code) {
    return code == std::errc::no_space_on_device || code.value() == EDQUOT;
}

VideoSettings withSize(VideoSettings settings, const Area& area) {
    settings.width = area.width;
    settings.height = area.height;
    return settings;
}

CameraEvents eventsTo(Mailbox& mailbox) {
    return {[&mailbox](Instant zero) { mailbox.post([zero](Mailbox::Mail& mail) { mail.started = zero; }); },
            [&mailbox](Instant instant, Position pointer) {
                mailbox.post([&](Mailbox::Mail& mail) { mail.sights.push_back({instant, pointer}); });
            },
            [&mailbox](const std::string& why) { mailbox.post([&](Mailbox::Mail& mail) { mail.failure = why; }); }};
}

} // namespace

RecordingOutput::RecordingOutput(const Options& options, const Area& area, ScreenGrabber& grabber,
                                 PrivacyFilter& privacy, Mailbox& mailbox)
    : output_(options.output), duration_(options.duration), folder_(options.output), mailbox_(mailbox) {
    try {
        if (options.sound)
            sound_ = std::make_unique<SoundSource>(*options.sound);
        const VideoSettings settings = withSize(options.video, area);
        writer_ = std::make_unique<VideoWriter>(folder_.movie(), settings, [this] { return makeRoom(); });
        journal_ = std::make_unique<Journal>(folder_.folder(), [this](const Error& loss) { lostEntry(loss); });
        journal_->note<RecordingRegionKind>(now(), Rect(area.x, area.y, area.width, area.height));
        input_ = std::make_unique<HeldInput>(*journal_, privacy);
        camera_ = std::make_unique<Camera>(grabber, *writer_, settings, eventsTo(mailbox));
    } catch (...) {
        discard();
        throw;
    }
}

void RecordingOutput::discard() {
    sound_.reset();
    camera_.reset();
    folder_.remove();
}

bool RecordingOutput::makeRoom() {
    isDiskFull_ = true;
    return folder_.releaseReserve();
}

void RecordingOutput::lostEntry(const Error& loss) {
    if (isFullDisk(loss.code()))
        isDiskFull_ = true;
    else
        mailbox_.post([&](Mailbox::Mail& mail) { mail.failure = loss.what(); });
}

void RecordingOutput::start() {
    camera_->start();
    if (sound_)
        sound_->start(*camera_, *writer_, [this](const std::string& why) {
            mailbox_.post([&](Mailbox::Mail& mail) { mail.failure = why; });
        });
}

void RecordingOutput::begin(Instant zero) {
    zero_ = zero;
    journal_->start(zero);
    sync_ = std::make_unique<DiskSync>(folder_.folder());
    journal_->note<CursorActionKind>(zero, s_noButtonYet);
    journal_->session().flush(); // a recorder that is killed now has every stream that a recording begins with
    limitDuration();
}

std::optional<Instant> RecordingOutput::endOfDuration() const {
    if (!duration_ || !zero_ || pausedAt_)
        return std::nullopt;
    return *zero_ + paused_ + static_cast<Instant>(*duration_ * static_cast<double>(s_second));
}

void RecordingOutput::limitDuration() {
    const std::optional<Instant> end = endOfDuration();
    if (!end || end_)
        return;
    camera_->stopAt(*end);
    journal_->endAt(*end);
}

void RecordingOutput::pause(Instant instant) {
    pausedAt_ = instant;
    camera_->pause(instant);
    journal_->pause(instant);
    journal_->endAt(std::nullopt);
}

void RecordingOutput::resume(Instant instant) {
    paused_ += instant - *pausedAt_;
    pausedAt_.reset();
    camera_->resume(instant);
    journal_->resume(instant);
    limitDuration();
}

void RecordingOutput::endAt(Instant instant) {
    end_ = pausedAt_.value_or(instant);
    journal_->endAt(end_);
    camera_->stopAt(*end_);
}

bool RecordingOutput::hasRoom() {
    return disk_.hasRoom({writer_->bytes(), journal_->bytes(), camera_->frames()});
}

Progress RecordingOutput::progress() const {
    return {isPaused(),          journal_->timeOf(now()), camera_->frames(), camera_->dropped(),
            journal_->entries(), writer_->bytes(),        journal_->bytes()};
}

RecordingOutput::Outcome RecordingOutput::save(Losses& losses, const std::function<void()>& takeMail) {
    if (sound_)
        sound_->stop(*end_);
    sync_.reset();
    losses.attempt([this] { camera_->finish(*end_); });
    losses.attempt([&] { finishStreams(takeMail); });
    if (!zero_) {
        losses.add("the recording ended before its first frame, so there is no movie");
        folder_.remove();
        return Outcome::Nothing;
    }
    return losses.attempt([this] { makeMovie(); }) ? Outcome::Saved : Outcome::Kept;
}

void RecordingOutput::finishStreams(const std::function<void()>& takeMail) {
    takeMail();
    input_->releaseAll(*end_);
    journal_->session().finish();
}

std::optional<std::string> RecordingOutput::lossOfStreams() const {
    const Error* loss = journal_->session().loss();
    return loss ? std::optional<std::string>(loss->what()) : std::nullopt;
}

void RecordingOutput::makeMovie() {
    const FileHandle movie(::open(folder_.movie().c_str(), O_RDWR | O_CLOEXEC));
    FragmentedMovie(movie.get(), folder_.movie().string()).makeOrdinary(movie.get());
    journal_->session().saveInto(folder_.movie(), "zulm record", ZULM_VERSION);
    folder_.publish();
    folder_.remove();
}

Report RecordingOutput::report(Outcome outcome) const {
    Report report;
    report.movie = outcome == Outcome::Saved ? output_.string() : "";
    report.folder = outcome == Outcome::Kept ? folder_.folder().string() : "";
    report.frames = writer_->frames();
    report.duration = journal_->timeOf(*end_);
    report.dropped = camera_->dropped();
    report.entries = journal_->entriesByKind();
    return report;
}

} // namespace Recorder
