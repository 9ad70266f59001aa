#include "Tools/record/StopSignals.h"

#include <poll.h>
#include <sys/eventfd.h>
#include <sys/signalfd.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <cstdint>
#include <string>

namespace Recorder {

namespace {

/// A terminal that closes may send its signal twice, as programs do that signal a process and then its group.
constexpr Instant s_oneEvent = 200 * s_millisecond;

sigset_t stopSet() {
    sigset_t set;
    sigemptyset(&set);
    for (const int number : {SIGINT, SIGTERM, SIGHUP, SIGUSR1})
        sigaddset(&set, number);
    return set;
}

FileHandle newEvent() {
    return FileHandle(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK));
}

void raiseEvent(const FileHandle& event) {
    const std::uint64_t one = 1;
    [[maybe_unused]] const auto written = write(event.get(), &one, sizeof(one));
}

} // namespace

StopSignals::StopSignals() : arrived_(newEvent()), over_(newEvent()) {
    const sigset_t set = stopSet();
    pthread_sigmask(SIG_BLOCK, &set, nullptr);
    std::signal(SIGPIPE, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN); // a write then fails instead
    signals_ = FileHandle(signalfd(-1, &set, SFD_CLOEXEC | SFD_NONBLOCK));
    thread_ = std::thread([this] { watch(); });
}

StopSignals::~StopSignals() {
    raiseEvent(over_);
    thread_.join();
}

void StopSignals::watch() {
    std::array<pollfd, 2> waits{pollfd{signals_.get(), POLLIN, 0}, pollfd{over_.get(), POLLIN, 0}};
    while (waits[1].revents == 0) {
        signalfd_siginfo info{};
        while (read(signals_.get(), &info, sizeof(info)) == sizeof(info))
            take({static_cast<int>(info.ssi_signo), info.ssi_code == SI_KERNEL});
        poll(waits.data(), waits.size(), -1);
    }
}

void StopSignals::take(const Signal& signal) {
    const std::lock_guard lock(mutex_);
    if (signal.number != SIGUSR1) {
        const Instant instant = now();
        if (signal.number == lastEnd_ && instant < lastEndAt_ + s_oneEvent)
            return;
        lastEnd_ = signal.number;
        lastEndAt_ = instant;
        if (endsAtNext_)
            endProcess(signal.number);
        endsAtNext_ = true;
    }
    queue_.push_back(signal);
    raiseEvent(arrived_);
}

std::optional<StopSignals::Signal> StopSignals::next() {
    const std::lock_guard lock(mutex_);
    if (queue_.empty()) {
        std::uint64_t count = 0;
        [[maybe_unused]] const auto taken = read(arrived_.get(), &count, sizeof(count));
        return std::nullopt;
    }
    const Signal signal = queue_.front();
    queue_.pop_front();
    return signal;
}

void StopSignals::nameFolder(const std::filesystem::path& folder) {
    const std::lock_guard lock(mutex_);
    folder_ = folder;
}

void StopSignals::endAtNext() {
    const std::lock_guard lock(mutex_);
    endsAtNext_ = true;
}

/// Other threads go on meanwhile, so nothing of theirs may be destroyed.
void StopSignals::endProcess(int number) const {
    constexpr int signalled = 128;
    const std::string lastWords = folder_.empty() ? "" : folder_.string() + "\n";
    pollfd wait{STDERR_FILENO, POLLOUT, 0};
    if (poll(&wait, 1, 0) == 1) // a pipe that nobody reads may be full
        [[maybe_unused]]
        const auto written = write(STDERR_FILENO, lastWords.data(), lastWords.size());
    _exit(signalled + number);
}

} // namespace Recorder
