#include "Tools/record/RecorderLoop.h"

#include "Tools/record/Failure.h"
#include "Tools/record/FragmentedMovie.h"
#include "Tools/record/Report.h"

#include <fcntl.h>
#include <fmt/core.h>
#include <poll.h>
#include <unistd.h>

#include <csignal>
#include <exception>
#include <system_error>
#include <vector>

namespace Recorder {

using namespace ZULMetaData;

namespace {

constexpr Instant s_longestWait = 20 * s_millisecond;
constexpr Instant s_busDeadline = 2 * s_second;

bool isFullDisk(std::error_code code) {
    return code == std::errc::no_space_on_device || code.value() == EDQUOT;
}

VideoSettings withSize(VideoSettings settings, const Area& area) {
    settings.width = area.width;
    settings.height = area.height;
    return settings;
}

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

struct RecorderLoop::Observers {
    CursorObserver cursor;
    PointerObserver pointer;
    KeyObserver keys;
    MachineObserver machine;
    WindowObserver windows;
    TrafficObserver traffic;
};

RecorderLoop::RecorderLoop(const Options& options)
    : options_(options), connection_(options.display), target_(captureTargetOf(connection_, options)),
      grabber_(options.display, target_.area, target_.window), clock_(options.display),
      privacy_(options.keys, options.deniedApps, options.deniedTitles),
      focus_(options.display, privacy_, [this](const std::string& sentence) { warn(sentence); }),
      control_(options.socket), folder_(options.output) {
    try {
        reachAccessibility();
        open();
    } catch (...) {
        sound_.reset();
        camera_.reset();
        folder_.remove();
        throw;
    }
}

RecorderLoop::~RecorderLoop() = default;

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
    if (privacy_.judgesWindows())
        freeKeys_.emplace(options_.display);
}

void RecorderLoop::lostEntry(const Error& loss) {
    if (isFullDisk(loss.code()))
        isDiskFull_ = true;
    else
        fail(loss.what());
}

void RecorderLoop::open() {
    if (options_.sound)
        sound_ = std::make_unique<SoundSource>(*options_.sound);
    const VideoSettings settings = withSize(options_.video, target_.area);
    const auto makeRoom = [this] {
        isDiskFull_ = true;
        return folder_.releaseReserve();
    };
    writer_ = std::make_unique<VideoWriter>(folder_.movie(), settings, makeRoom);
    journal_ = std::make_unique<Journal>(folder_.folder(), [this](const Error& loss) { lostEntry(loss); });
    input_ = std::make_unique<HeldInput>(*journal_, privacy_);
    const auto changed = [this](Instant instant, std::uint32_t process) {
        focus_.windowChanged(instant, process);
        if (observers_)
            observers_->keys.windowChanged();
    };
    XConnection& x = connection_;
    const TrafficObserver::Events traffic{
        [this](std::uint32_t time, std::uint8_t key) { observers_->keys.repeated(key, time); },
        [this](std::uint32_t time, bool isHidden) { observers_->cursor.hidden(time, isHidden); }};
    observers_ = std::unique_ptr<Observers>(new Observers{{x, clock_, *journal_},
                                                          {x, clock_, *journal_, *input_},
                                                          {x, clock_, *input_, privacy_},
                                                          {x, *journal_},
                                                          {x, clock_, *journal_, privacy_, changed},
                                                          {options_.display, traffic}});
    const Area& area = target_.area;
    journal_->note<RecordingRegionKind>(now(), Rect(area.x, area.y, area.width, area.height));
    selectInput();
    focus_.follow(observers_->windows, observers_->pointer);
    const CameraEvents events{
        [this](Instant zero) { mailbox_.post([zero](Mailbox::Mail& mail) { mail.started = zero; }); },
        [this](Instant instant, Position pointer) {
            mailbox_.post([&](Mailbox::Mail& mail) { mail.sights.push_back({instant, pointer}); });
        },
        [this](const std::string& why) { mailbox_.post([&](Mailbox::Mail& mail) { mail.failure = why; }); }};
    camera_ = std::make_unique<Camera>(grabber_, *writer_, settings, events);
}

/// Raw events also come while another program takes the keys and clicks.
void RecorderLoop::selectInput() {
    if (!connection_.has(xcb_input_id))
        throw Refusal("the X display has no XInput extension, without which clicks and keys cannot be recorded");
    const auto cookie = xcb_input_xi_query_version(connection_.get(), 2, 1);
    const Reply<xcb_input_xi_query_version_reply_t> version(
        xcb_input_xi_query_version_reply(connection_.get(), cookie, nullptr));
    struct {
        xcb_input_event_mask_t head;
        std::uint32_t events;
    } mask{{XCB_INPUT_DEVICE_ALL_MASTER, 1},
           XCB_INPUT_XI_EVENT_MASK_RAW_KEY_PRESS | XCB_INPUT_XI_EVENT_MASK_RAW_BUTTON_PRESS |
               XCB_INPUT_XI_EVENT_MASK_RAW_BUTTON_RELEASE | XCB_INPUT_XI_EVENT_MASK_RAW_MOTION |
               XCB_INPUT_XI_EVENT_MASK_DEVICE_CHANGED};
    xcb_input_xi_select_events(connection_.get(), connection_.root(), 1, &mask.head);
    inputOpcode_ = xcb_get_extension_data(connection_.get(), &xcb_input_id)->major_opcode;
    if (target_.watched != XCB_NONE) {
        const std::uint32_t events = XCB_EVENT_MASK_STRUCTURE_NOTIFY | XCB_EVENT_MASK_PROPERTY_CHANGE;
        xcb_change_window_attributes(connection_.get(), target_.watched, XCB_CW_EVENT_MASK, &events);
    }
    connection_.flush();
}

int RecorderLoop::run() {
    camera_->start();
    if (sound_)
        sound_->start(*camera_, *writer_, [this](const std::string& why) {
            mailbox_.post([&](Mailbox::Mail& mail) { mail.failure = why; });
        });
    try {
        while (!end_)
            observe();
    } catch (const std::exception& error) {
        fail(error.what());
    }
    signals_.endAtNext(folder_.folder());
    const Outcome outcome = save();
    tellEnd(outcome);
    if (options_.json)
        report(outcome);
    control_.tellEnd(outcome == Outcome::Saved ? "saved" : "kept");
    if (outcome == Outcome::Kept)
        say(folder_.folder().string());
    const bool isWell = outcome == Outcome::Saved && *end_ != End::Disk && *end_ != End::Error && error_.empty();
    return isWell ? ExitFine : ExitLoss;
}

void RecorderLoop::tellEnd(Outcome outcome) {
    status_.end();
    if (!error_.empty())
        warn(error_);
    if (*end_ == End::Disk)
        warn(fmt::format("the file system is full: the recording was ended{}",
                         outcome == Outcome::Saved ? ", and what there was is saved" : ""));
    if (camera_->dropped() > 0)
        warn(fmt::format("{} of {} frames were dropped; record fewer of them with --fps, or a smaller part with "
                         "--region",
                         camera_->dropped(), camera_->dropped() + camera_->frames()));
}

void RecorderLoop::observe() {
    waitForSomething();
    takeEvents();
    observers_->traffic.serve();
    takeMail();
    focus_.serve(input_->hasKeys());
    takeSignals();
    control_.serve([this](Command command) { return obey(command); });
    if (end_)
        return;
    observers_->windows.poll();
    observers_->machine.poll();
    input_->release();
    journal_->flushIfDue();
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
    wait(observers_->traffic.descriptor()); // poll ignores a negative one
    wait(focus_.descriptor());
    for (const int descriptor : control_.descriptors())
        wait(descriptor);
    connection_.flush();
    poll(waits.data(), waits.size(), static_cast<int>(s_longestWait / s_millisecond));
}

void RecorderLoop::takeEvents() {
    while (const Reply<xcb_generic_event_t> event{xcb_poll_for_event(connection_.get())})
        takeEvent(*event);
    observers_->keys.refresh();
    observers_->pointer.followMotions();
    if (!connection_.isAlive())
        fail("the X display is gone");
}

void RecorderLoop::takeEvent(const xcb_generic_event_t& event) {
    const std::uint8_t type = event.response_type & s_eventTypeBits;
    if (type == observers_->keys.firstEvent()) {
        observers_->keys.keyboardChanged(event);
    } else if (type == observers_->cursor.firstEvent() + XCB_XFIXES_CURSOR_NOTIFY) {
        observers_->cursor.changed(reinterpret_cast<const xcb_xfixes_cursor_notify_event_t&>(event));
    } else if (type == XCB_GE_GENERIC) {
        const auto& input = reinterpret_cast<const xcb_ge_generic_event_t&>(event);
        if (input.extension == inputOpcode_)
            takeInput(input);
    } else if (type == XCB_PROPERTY_NOTIFY) {
        observers_->windows.propertyChanged(reinterpret_cast<const xcb_property_notify_event_t&>(event));
    } else if (type == XCB_CONFIGURE_NOTIFY) {
        observers_->windows.configured(reinterpret_cast<const xcb_configure_notify_event_t&>(event));
    } else if (type == XCB_FOCUS_IN || type == XCB_FOCUS_OUT) {
        observers_->windows.focusChanged(reinterpret_cast<const xcb_focus_in_event_t&>(event));
    } else if (type == XCB_MAPPING_NOTIFY) {
        if (reinterpret_cast<const xcb_mapping_notify_event_t&>(event).request == XCB_MAPPING_POINTER)
            observers_->pointer.buttonsRemapped();
    } else if (type == XCB_DESTROY_NOTIFY) {
        const xcb_window_t window = reinterpret_cast<const xcb_destroy_notify_event_t&>(event).window;
        observers_->windows.destroyed(window);
        if (options_.stopsOnClose && window == target_.watched)
            end(End::Window, now());
    }
}

void RecorderLoop::takeInput(const xcb_ge_generic_event_t& event) {
    PointerObserver& pointer = observers_->pointer;
    switch (event.event_type) {
    case XCB_INPUT_RAW_MOTION: pointer.moved(reinterpret_cast<const xcb_input_raw_motion_event_t&>(event)); break;
    case XCB_INPUT_RAW_BUTTON_PRESS:
    case XCB_INPUT_RAW_BUTTON_RELEASE:
        pointer.followMotions(); // the click is where the pointer has come to
        pointer.button(reinterpret_cast<const xcb_input_raw_button_press_event_t&>(event),
                       event.event_type == XCB_INPUT_RAW_BUTTON_PRESS, buttonModifiers());
        break;
    case XCB_INPUT_RAW_KEY_PRESS: takeKey(reinterpret_cast<const xcb_input_raw_key_press_event_t&>(event)); break;
    case XCB_INPUT_DEVICE_CHANGED:
        pointer.devicesChanged();
        pointer.buttonsRemapped();
        break;
    default: break;
    }
}

void RecorderLoop::takeKey(const xcb_input_raw_key_press_event_t& event) {
    constexpr std::uint32_t highestCode = 255;
    if (event.detail > highestCode)
        return;
    const auto key = static_cast<std::uint8_t>(event.detail);
    observers_->keys.pressed(key, event.time, isHidden(key, event.time));
}

/// A window manager that has grabbed one key has all of them until that one is released, such as those after Super.
bool RecorderLoop::isHidden(std::uint8_t key, std::uint32_t serverTime) {
    if (!freeKeys_)
        return false;
    const bool isGrabbed = !freeKeys_->has(key, serverTime); // has to be asked for every key, in their order
    return (isGrabbed && !observers_->keys.isForManager(key)) || !observers_->windows.getsKeys();
}

/// Clicks call the key Command that keys call Windows.
Modifiers RecorderLoop::buttonModifiers() const {
    Modifiers modifiers = observers_->keys.modifiers();
    if (modifiers.contains(Modifier::Windows))
        modifiers.insert(Modifier::Command);
    return modifiers;
}

void RecorderLoop::takeMail() {
    const Mailbox::Mail mail = mailbox_.take();
    if (mail.started)
        began(*mail.started);
    for (const Mailbox::Sight& sight : mail.sights)
        observers_->pointer.saw(sight.instant, sight.pointer);
    if (!mail.sights.empty())
        focus_.hover();
    if (!mail.failure.empty())
        fail(mail.failure);
}

void RecorderLoop::began(Instant zero) {
    zero_ = zero;
    journal_->start(zero);
    sync_ = std::make_unique<DiskSync>(folder_.folder());
    journal_->note<CursorActionKind>(zero, s_noButtonYet);
    journal_->session().flush(); // a recorder that is killed now has every stream that a recording begins with
    limitDuration();
    say("recording " + options_.output.string());
}

/// Only while the recording is not paused.
Instant RecorderLoop::endOfDuration() const {
    return *zero_ + paused_ + static_cast<Instant>(*options_.duration * static_cast<double>(s_second));
}

void RecorderLoop::limitDuration() {
    if (!options_.duration || end_)
        return;
    camera_->stopAt(endOfDuration());
    journal_->endAt(endOfDuration());
}

void RecorderLoop::takeSignals() {
    while (const auto signal = signals_.next()) {
        if (signal->number == SIGUSR1) {
            obey(pausedAt_ ? Command::Resume : Command::Pause);
        } else {
            if (end_ == End::Signal)
                StopSignals::endAtOnce(signal->number, folder_.folder());
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
        input_->dropInterruptKey(instant);
    else
        input_->dropTrigger(instant);
}

std::string RecorderLoop::obey(Command command) {
    const Instant instant = now();
    if (end_)
        return command == Command::Stop ? s_stopping : s_tooLate;
    switch (command) {
    case Command::Pause:
        if (!zero_)
            return s_tooEarly;
        if (!pausedAt_)
            pause(instant);
        return "paused";
    case Command::Resume:
        if (pausedAt_)
            resume(instant);
        return "resumed";
    case Command::Stop: break;
    }
    dropTrigger(instant, false);
    end(End::Stop, instant);
    return s_stopping;
}

void RecorderLoop::pause(Instant instant) {
    takeEvents(); // those before the pause are in the recording
    pausedAt_ = instant;
    camera_->pause(instant);
    journal_->pause(instant);
    journal_->endAt(std::nullopt);
}

void RecorderLoop::resume(Instant instant) {
    paused_ += instant - *pausedAt_;
    pausedAt_.reset();
    camera_->resume(instant);
    journal_->resume(instant);
    limitDuration();
}

void RecorderLoop::end(End why, Instant instant) {
    if (end_)
        return;
    end_ = why;
    endInstant_ = pausedAt_.value_or(instant);
    journal_->endAt(endInstant_);
}

void RecorderLoop::fail(const std::string& why) {
    if (end_)
        return;
    error_ = why;
    end(isDiskFull_ ? End::Disk : End::Error, now());
}

void RecorderLoop::lookAfterTime() {
    if (options_.duration && zero_ && !pausedAt_ && now() >= endOfDuration())
        end(End::Duration, endOfDuration());
}

/// Ends the recording while it can still be saved.
void RecorderLoop::lookAfterDisk() {
    if (isDiskFull_ || !disk_.hasRoom({writer_->bytes(), journal_->bytes(), camera_->frames()}))
        end(End::Disk, now());
}

void RecorderLoop::showStatus() {
    if (zero_ && status_.isDue())
        status_.show({pausedAt_.has_value(), journal_->timeOf(now()), camera_->frames(), camera_->dropped(),
                      journal_->entries(), writer_->bytes(), journal_->bytes()});
}

/// The accessibility bus has a little time to answer for keys that wait.
void RecorderLoop::waitForHeldKeys() {
    constexpr Instant longest = 600 * s_millisecond;
    const Instant deadline = now() + longest;
    while (privacy_.needsFocus() && focus_.descriptor() >= 0 && input_->hasKeys() && now() < deadline) {
        waitForSomething();
        focus_.serve(input_->hasKeys());
        input_->release();
    }
}

/// Does one step of the ending. A step that fails keeps no other from being done.
template <class Step>
bool RecorderLoop::attempt(Step step) {
    try {
        step();
        return true;
    } catch (const std::exception& error) {
        addError(error.what());
        return false;
    }
}

void RecorderLoop::addError(const std::string& sentence) {
    if (error_.find(sentence) == std::string::npos)
        error_ += (error_.empty() ? "" : "; ") + sentence;
}

RecorderLoop::Outcome RecorderLoop::save() {
    camera_->stopAt(endInstant_);
    folder_.releaseReserve(); // what is in memory needs space, too
    attempt([this] {
        takeEvents();
        waitForHeldKeys();
    });
    sound_.reset();
    sync_.reset();
    attempt([this] { camera_->finish(endInstant_); });
    attempt([this] { finishStreams(); });
    if (!zero_) {
        addError("the recording ended before its first frame, so there is no movie");
        folder_.remove();
        return Outcome::Nothing;
    }
    return attempt([this] { makeMovie(); }) ? Outcome::Saved : Outcome::Kept;
}

void RecorderLoop::finishStreams() {
    takeMail();
    input_->releaseAll(endInstant_);
    journal_->session().finish();
    if (const Error* loss = journal_->session().loss(); loss && *end_ != End::Disk)
        addError(loss->what());
}

void RecorderLoop::makeMovie() {
    const FileHandle movie(::open(folder_.movie().c_str(), O_RDWR | O_CLOEXEC));
    FragmentedMovie(movie.get(), folder_.movie().string()).makeOrdinary(movie.get());
    journal_->session().saveInto(folder_.movie(), "zulm record", ZULM_VERSION);
    folder_.publish();
    folder_.remove();
}

void RecorderLoop::report(Outcome outcome) const {
    Report report;
    report.movie = outcome == Outcome::Saved ? options_.output.string() : "";
    report.folder = outcome == Outcome::Kept ? folder_.folder().string() : "";
    report.frames = writer_->frames();
    report.duration = journal_->timeOf(endInstant_);
    report.dropped = camera_->dropped();
    report.entries = journal_->entriesByKind();
    report.stoppedBy = nameOf(*end_);
    printReport(report);
}

} // namespace Recorder
