#include "Tools/record/RecorderLoop.h"

#include "Tools/record/Failure.h"
#include "Tools/record/FragmentedMovie.h"
#include "Tools/record/Report.h"

#include <fcntl.h>
#include <fmt/core.h>
#include <poll.h>
#include <unistd.h>
#include <xcb/composite.h>

#include <algorithm>
#include <csignal>
#include <cstdio>
#include <exception>
#include <vector>

namespace Recorder {

using namespace ZULMetaData;

namespace {

constexpr Instant s_longestWait = 20 * s_millisecond;
constexpr Instant s_diskInterval = 100 * s_millisecond;
constexpr Instant s_askInterval = 50 * s_millisecond;     ///< for the focus, as long as keys wait to be told about
constexpr Instant s_searchInterval = 200 * s_millisecond; ///< as long as the focus is not known
constexpr Instant s_statusInterval = s_second / 2;
constexpr Instant s_busDeadline = 2 * s_second;
constexpr std::uint64_t s_mebibyte = std::uint64_t{1} << 20;
constexpr std::uint8_t s_typeBits = 0x7f; ///< of an event's type; the other one says that a client sent it

void say(const std::string& line) {
    const std::string text = line + "\n";
    std::fwrite(text.data(), 1, text.size(), stderr);
    std::fflush(stderr);
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
      privacy_(options.keys, options.deniedApps, options.deniedTitles), control_(options.socket),
      folder_(options.output) {
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

void RecorderLoop::reachAccessibility() {
    if (options_.withoutAccessibility)
        return;
    accessibility_ = std::make_unique<AccessibilityProcess>(options_.display);
    if (accessibility_->waitUntilReady(now() + s_busDeadline)) {
        privacy_.requireFocus();
        return;
    }
    accessibility_.reset();
    if (options_.keys == KeyMode::Everything)
        throw Refusal("--keys all: the accessibility bus does not answer, so passwords could not be told from other "
                      "texts; start it, or add --without-accessibility to record passwords as well");
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
    journal_ = std::make_unique<Journal>(folder_.folder(), [this] { isDiskFull_ = true; });
    input_ = std::make_unique<HeldInput>(*journal_, privacy_);
    const auto changed = [this](Instant instant, std::uint32_t process) { windowChanged(instant, process); };
    XConnection& x = connection_;
    const TrafficObserver::Events traffic{
        [this](std::uint32_t time, std::uint8_t key) { observers_->keys.pressed(key, time); },
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
    hover();
    const CameraEvents events{
        [this](Instant zero) { mailbox_.post([zero](Mailbox::Mail& mail) { mail.started = zero; }); },
        [this](Instant instant, Position pointer) {
            mailbox_.post([&](Mailbox::Mail& mail) { mail.sights.push_back({instant, pointer}); });
        },
        [this](const std::string& why) { mailbox_.post([&](Mailbox::Mail& mail) { mail.failure = why; }); }};
    camera_ = std::make_unique<Camera>(grabber_, *writer_, settings, events);
}

/// Raw events come whoever else takes the keys and clicks.
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
    while (!end_)
        observe();
    signals_.endAtNext(folder_.folder());
    const bool isSaved = save();
    if (hasStatus_)
        say("");
    if (!error_.empty())
        say("zulm record: " + error_);
    if (*end_ == End::Disk)
        say(fmt::format("zulm record: the file system is full: the recording was ended{}",
                        isSaved ? ", and what there was is saved" : ""));
    if (camera_->dropped() > 0)
        say(fmt::format("zulm record: {} of {} frames were dropped; record fewer of them with --fps, or a smaller part "
                        "with --region",
                        camera_->dropped(), camera_->dropped() + camera_->frames()));
    if (options_.json)
        report(isSaved);
    control_.tellEnd(isSaved ? "saved" : "kept");
    if (!isSaved)
        say(folder_.folder().string());
    const bool isWell = isSaved && *end_ != End::Disk && *end_ != End::Error && error_.empty();
    return isWell ? ExitFine : ExitLoss;
}

void RecorderLoop::observe() {
    waitForSomething();
    takeEvents();
    observers_->traffic.serve();
    takeMail();
    takeFocus();
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
    for (const int descriptor : control_.descriptors())
        wait(descriptor);
    if (accessibility_)
        wait(accessibility_->descriptor());
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
    const std::uint8_t type = event.response_type & s_typeBits;
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
    } else if (type == XCB_MAPPING_NOTIFY) {
        if (reinterpret_cast<const xcb_mapping_notify_event_t&>(event).request == XCB_MAPPING_POINTER)
            observers_->pointer.buttonsRemapped();
    } else if (type == XCB_DESTROY_NOTIFY || type == XCB_UNMAP_NOTIFY) {
        const xcb_window_t window = reinterpret_cast<const xcb_destroy_notify_event_t&>(event).window;
        if (type == XCB_DESTROY_NOTIFY)
            observers_->windows.destroyed(window);
        if (options_.stopsOnClose && window == target_.watched && type == XCB_DESTROY_NOTIFY)
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
    case XCB_INPUT_DEVICE_CHANGED: pointer.devicesChanged(); break;
    default: break;
    }
}

void RecorderLoop::takeKey(const xcb_input_raw_key_press_event_t& event) {
    constexpr std::uint32_t highestCode = 255;
    if (event.detail <= highestCode)
        observers_->keys.pressed(static_cast<std::uint8_t>(event.detail), event.time);
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
        hover();
    if (!mail.failure.empty())
        fail(mail.failure);
}

void RecorderLoop::began(Instant zero) {
    zero_ = zero;
    journal_->start(zero);
    disk_ = std::make_unique<DiskSync>(folder_.folder());
    journal_->note<CursorActionKind>(zero, s_noButtonYet);
    if (options_.duration)
        camera_->stopAt(endOfDuration());
    say("recording " + options_.output.string());
}

/// Only while the recording is not paused.
Instant RecorderLoop::endOfDuration() const {
    return *zero_ + paused_ + static_cast<Instant>(*options_.duration * static_cast<double>(s_second));
}

void RecorderLoop::hover() {
    const std::optional<Position> pointer = observers_->pointer.position();
    if (!pointer || pointer == hovered_)
        return;
    const bool asks = accessibility_ && observers_->windows.process() != 0;
    if (asks && !accessibility_->askHover(*pointer))
        return; // until the earlier question is answered, even if the pointer rests from now on
    hovered_ = pointer;
    if (!asks)
        observers_->windows.hover(now(), *pointer);
}

void RecorderLoop::windowChanged(Instant instant, std::uint32_t process) {
    privacy_.setFocus(instant, Focus::Unknown);
    hovered_.reset();
    if (!accessibility_)
        return;
    accessibility_->windowChanged(process);
    accessibility_->ask(0);
}

void RecorderLoop::takeFocus() {
    if (!accessibility_)
        return;
    const AccessibilityEvents events{[this](std::uint32_t process, Focus focus) {
                                         if (process == observers_->windows.process())
                                             privacy_.setFocus(now(), focus);
                                     },
                                     [this](Instant asked, Focus focus) {
                                         privacy_.setFocus(now(), focus);
                                         if (focus != Focus::Unknown)
                                             privacy_.confirm(asked);
                                     },
                                     [this](const std::optional<Area>& area) {
                                         if (area)
                                             observers_->windows.noteHover(now(), *area);
                                         else if (const auto pointer = observers_->pointer.position())
                                             observers_->windows.hover(now(), *pointer);
                                     },
                                     [this] { privacy_.setFocus(now(), Focus::Unknown); }};
    accessibility_->serve(events);
    if (!accessibility_->isAlive()) { // the focus stays unknown; what the pointer is over is asked of the server
        accessibility_.reset();
        return;
    }
    if (input_->hasKeys())
        accessibility_->ask(s_askInterval);
    else if (privacy_.isFocusUnknown())
        accessibility_->ask(s_searchInterval);
}

void RecorderLoop::takeSignals() {
    while (const auto signal = signals_.next()) {
        if (signal->number == SIGUSR1) {
            obey(pausedAt_ ? Command::Resume : Command::Pause);
        } else {
            if (end_ == End::Signal)
                StopSignals::endAtOnce(signal->number, folder_.folder());
            const Instant instant = now();
            if (signal->isFromTerminal)
                input_->dropInterruptKey();
            else
                input_->dropTrigger(instant);
            end(End::Signal, instant);
        }
    }
}

std::string RecorderLoop::obey(Command command) {
    const Instant instant = now();
    switch (command) {
    case Command::Pause:
        if (!pausedAt_ && zero_) {
            pausedAt_ = instant;
            camera_->pause(instant);
            journal_->pause(instant);
        }
        return "paused";
    case Command::Resume:
        if (pausedAt_) {
            paused_ += instant - *pausedAt_;
            pausedAt_.reset();
            camera_->resume(instant);
            if (options_.duration)
                camera_->stopAt(endOfDuration());
            journal_->resume(instant);
        }
        return "resumed";
    case Command::Stop: break;
    }
    takeEvents(); // the click or key that led to this may have arrived since
    input_->dropTrigger(instant);
    end(End::Stop, instant);
    return "stopping";
}

void RecorderLoop::end(End why, Instant instant) {
    if (end_)
        return;
    end_ = why;
    endInstant_ = pausedAt_.value_or(instant);
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

/// Ends the recording while it can still be saved: streams are copied into the movie, and its index grows.
void RecorderLoop::lookAfterDisk() {
    const Instant instant = now();
    if (isDiskFull_) {
        end(End::Disk, instant);
        return;
    }
    if (instant < nextDiskCheck_)
        return;
    nextDiskCheck_ = instant + s_diskInterval;
    constexpr std::uint64_t bytesOfFrame = 40;
    if (instant >= nextRate_) {
        nextRate_ = instant + s_second;
        fastest_ = std::max(writer_->bytes() - ratedBytes_, fastest_ / 2);
        ratedBytes_ = writer_->bytes();
    }
    // The reserve also holds what is on its way to the disk when another program takes all that was free.
    const std::uint64_t needed =
        2 * s_mebibyte + 2 * fastest_ + journal_->bytes() * 2 + camera_->frames() * bytesOfFrame;
    if (!folder_.reserve(needed) || folder_.freeBytes() < s_mebibyte + fastest_)
        end(End::Disk, instant);
}

void RecorderLoop::showStatus() {
    const Instant instant = now();
    if (!zero_ || instant < nextStatus_ || isatty(STDERR_FILENO) == 0)
        return;
    nextStatus_ = instant + s_statusInterval;
    hasStatus_ = true;
    const auto seconds = static_cast<int>(journal_->timeOf(instant));
    const auto inMebibytes = [](std::uint64_t bytes) {
        return static_cast<double>(bytes) / static_cast<double>(s_mebibyte);
    };
    const std::string text = fmt::format(
        "\r{} {:02}:{:02}:{:02}  {} frames, {} dropped  {} entries  movie {:.1f} MiB, streams {:.1f} MiB  ",
        pausedAt_ ? "paused" : "recording", seconds / 3600, seconds / 60 % 60, seconds % 60, camera_->frames(),
        camera_->dropped(), journal_->entries(), inMebibytes(writer_->bytes()), inMebibytes(journal_->bytes()));
    std::fwrite(text.data(), 1, text.size(), stderr);
    std::fflush(stderr);
}

/// Keys that wait for the accessibility bus have a little time to be told about.
void RecorderLoop::waitForHeldKeys() {
    constexpr Instant longest = 600 * s_millisecond;
    const Instant deadline = now() + longest;
    while (privacy_.needsFocus() && accessibility_ && input_->hasKeys() && now() < deadline) {
        waitForSomething();
        takeFocus();
        input_->release();
    }
}

bool RecorderLoop::save() {
    camera_->stopAt(endInstant_);
    takeEvents();
    if (isDiskFull_ || *end_ == End::Disk)
        folder_.releaseReserve();
    waitForHeldKeys();
    const auto attempt = [this](auto work) {
        try {
            work();
            return true;
        } catch (const std::exception& error) {
            error_ += (error_.empty() ? "" : "; ") + std::string(error.what());
            return false;
        }
    };
    sound_.reset();
    disk_.reset();
    attempt([this] { camera_->finish(endInstant_); });
    takeMail();
    input_->releaseAll(endInstant_);
    journal_->session().finish();
    if (!zero_) {
        if (error_.empty())
            error_ = "the recording ended before its first frame";
        folder_.remove();
        return false;
    }
    return attempt([this] {
        folder_.releaseReserve();
        const FileHandle movie(::open(folder_.movie().c_str(), O_RDWR | O_CLOEXEC));
        FragmentedMovie(movie.get(), folder_.movie().string()).makeOrdinary(movie.get());
        journal_->session().saveInto(folder_.movie(), "zulm record", ZULM_VERSION);
        folder_.publish();
        folder_.remove();
    });
}

void RecorderLoop::report(bool isSaved) const {
    Report report;
    report.movie = isSaved ? options_.output.string() : "";
    report.folder = isSaved ? "" : folder_.folder().string();
    report.frames = writer_->frames();
    report.duration = journal_->timeOf(endInstant_);
    report.dropped = camera_->dropped();
    report.entries = journal_->entriesByKind();
    report.stoppedBy = nameOf(*end_);
    printReport(report);
}

} // namespace Recorder
