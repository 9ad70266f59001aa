#include "Tools/record/StopSignals.h"

#include <sys/signalfd.h>

#include <csignal>
#include <cstring>
#include <string>

namespace Recorder {

namespace {

std::string s_lastWords; // of a process that a signal ends

sigset_t stopSet() {
    sigset_t set;
    sigemptyset(&set);
    for (const int number : {SIGINT, SIGTERM, SIGHUP, SIGUSR1})
        sigaddset(&set, number);
    return set;
}

/// Called while the process is interrupted, so nothing may be allocated.
[[noreturn]] void endNow(int number) {
    constexpr int signalled = 128;
    [[maybe_unused]] const auto written = ::write(STDERR_FILENO, s_lastWords.data(), s_lastWords.size());
    _exit(signalled + number);
}

} // namespace

StopSignals::StopSignals() {
    const sigset_t set = stopSet();
    pthread_sigmask(SIG_BLOCK, &set, nullptr);
    std::signal(SIGPIPE, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN); // a write then fails instead
    handle_ = FileHandle(signalfd(-1, &set, SFD_CLOEXEC | SFD_NONBLOCK));
}

std::optional<StopSignals::Signal> StopSignals::next() {
    signalfd_siginfo info{};
    if (read(handle_.get(), &info, sizeof(info)) != sizeof(info))
        return std::nullopt;
    return Signal{static_cast<int>(info.ssi_signo), info.ssi_code == SI_KERNEL};
}

void StopSignals::endAtOnce(int number, const std::filesystem::path& folder) {
    s_lastWords = folder.string() + "\n";
    endNow(number);
}

void StopSignals::endAtNext(const std::filesystem::path& folder) {
    s_lastWords = folder.string() + "\n";
    struct sigaction action {};
    action.sa_handler = endNow;
    for (const int number : {SIGINT, SIGTERM, SIGHUP})
        sigaction(number, &action, nullptr);
    std::signal(SIGUSR1, SIG_IGN);
    const sigset_t set = stopSet();
    pthread_sigmask(SIG_UNBLOCK, &set, nullptr);
}

} // namespace Recorder
