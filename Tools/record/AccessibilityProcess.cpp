#include "Tools/record/AccessibilityProcess.h"

#include "Tools/record/Failure.h"

#include <fcntl.h>
#include <fmt/core.h>
#include <poll.h>
#include <sys/wait.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <sstream>
#include <utility>

namespace Recorder {

namespace {

Focus focusOf(const std::string& word) {
    return word == "ordinary" ? Focus::Ordinary : word == "password" ? Focus::Password : Focus::Unknown;
}

/// What runs in the child until it becomes the program again.
[[noreturn]] void becomeWatcher(int input, int output, const std::string& display) {
    // If the recorder was started without standard input, these numbers may be those that they replace.
    dup2(fcntl(input, F_DUPFD_CLOEXEC, STDERR_FILENO + 1), STDIN_FILENO);
    dup2(fcntl(output, F_DUPFD_CLOEXEC, STDERR_FILENO + 1), STDOUT_FILENO);
    const FileHandle nowhere(open("/dev/null", O_WRONLY | O_CLOEXEC)); // the libraries complain of buses
    dup2(nowhere.get(), STDERR_FILENO);
    sigset_t none;
    sigemptyset(&none);
    sigprocmask(SIG_SETMASK, &none, nullptr);
    for (const int number : {SIGINT, SIGUSR1, SIGHUP}) // the keys of the terminal are for the recorder
        std::signal(number, SIG_IGN);
    if (!display.empty())
        setenv("DISPLAY", display.c_str(), 1);
    execl("/proc/self/exe", "zulm-record", "--watch-accessibility", nullptr);
    constexpr int notFound = 127;
    _exit(notFound);
}

} // namespace

AccessibilityProcess::AccessibilityProcess(const std::string& display) {
    std::array<int, 2> toChild{};
    std::array<int, 2> fromChild{};
    if (pipe2(toChild.data(), O_CLOEXEC) != 0)
        return;
    const FileHandle childInput(toChild[0]);
    input_ = FileHandle(toChild[1]);
    if (pipe2(fromChild.data(), O_CLOEXEC) != 0)
        return;
    output_ = FileHandle(fromChild[0]);
    const FileHandle childOutput(fromChild[1]);
    fcntl(input_.get(), F_SETFL, O_NONBLOCK);
    fcntl(output_.get(), F_SETFL, O_NONBLOCK);
    process_ = fork();
    if (process_ == 0)
        becomeWatcher(childInput.get(), childOutput.get(), display);
}

AccessibilityProcess::~AccessibilityProcess() {
    end();
}

void AccessibilityProcess::end() {
    input_.close();
    output_.close();
    if (process_ <= 0)
        return;
    kill(process_, SIGKILL);
    waitpid(process_, nullptr, 0);
    process_ = -1;
}

bool AccessibilityProcess::readLines(const std::function<void(const std::string&)>& take) {
    std::array<char, 4096> bytes{};
    for (;;) {
        const ssize_t count = read(output_.get(), bytes.data(), bytes.size());
        if (count > 0)
            pending_.append(bytes.data(), static_cast<std::size_t>(count));
        else if (count == 0 || (errno != EAGAIN && errno != EINTR))
            return false;
        else
            break;
    }
    for (std::size_t end = 0; (end = pending_.find('\n')) != std::string::npos;) {
        const std::string line = pending_.substr(0, end);
        pending_.erase(0, end + 1);
        take(line);
    }
    return true;
}

void AccessibilityProcess::waitUntilReady(Instant until) {
    const AccessibilityEvents nothing{[](auto...) {}, [](auto...) {}, [](auto...) {}};
    while (isAlive() && !isReady_ && now() < until) {
        pollfd wait{output_.get(), POLLIN, 0};
        poll(&wait, 1, static_cast<int>(std::max<Instant>(1, (until - now()) / s_millisecond)));
        serve(nothing);
    }
}

void AccessibilityProcess::take(const std::string& line, const AccessibilityEvents& events) {
    std::istringstream words(line);
    std::string what;
    words >> what;
    std::uint32_t process = 0;
    std::string focus;
    Area area;
    if (what == "ready") {
        isReady_ = true;
    } else if (what == "absent") {
        isAbsent_ = true;
    } else if (what == "focus") {
        if (words >> process >> focus)
            events.focus(process, focusOf(focus));
    } else if (what == "answer" && asked_) {
        words >> focus;
        const Instant asked = *std::exchange(asked_, std::nullopt);
        if (askedWindow_ == windows_)
            events.answer(asked, focus == "late" ? std::nullopt : std::optional(focusOf(focus)));
    } else if (what == "rect" && askedHover_) {
        askedHover_.reset();
        const bool isKnown = static_cast<bool>(words >> area.x >> area.y >> area.width >> area.height);
        if (hoverWindow_ == windows_)
            events.hover(isKnown ? std::optional(area) : std::nullopt);
    }
}

/// What the pointer is over takes several questions, and no key waits for it.
bool AccessibilityProcess::hangs() const {
    constexpr Instant longestHover = 3 * s_longestAnswer;
    const auto isLate = [](const std::optional<Instant>& asked, Instant longest) {
        return asked && now() > *asked + longest;
    };
    return isLate(asked_, s_longestAnswer) || isLate(askedHover_, longestHover);
}

void AccessibilityProcess::serve(const AccessibilityEvents& events) {
    const bool goesOn = isAlive() && readLines([&](const std::string& line) { take(line, events); });
    if (!goesOn || isAbsent_ || hangs())
        end();
}

void AccessibilityProcess::send(const std::string& line) {
    // A pipe that is full belongs to a child that hangs, which is noticed by the answer that is missing.
    [[maybe_unused]] const auto written = write(input_.get(), line.data(), line.size());
}

void AccessibilityProcess::windowChanged(std::uint32_t process) {
    ++windows_;
    send(fmt::format("window {}\n", process));
}

void AccessibilityProcess::ask(Instant interval) {
    const Instant instant = now();
    if (asked_ || !isReady_ || !isAlive() || instant < lastAsked_ + interval)
        return;
    asked_ = lastAsked_ = instant;
    askedWindow_ = windows_;
    send("ask\n");
}

bool AccessibilityProcess::askHover(Position pointer) {
    if (askedHover_ || !isReady_ || !isAlive())
        return false;
    askedHover_ = now();
    hoverWindow_ = windows_;
    send(fmt::format("hover {} {}\n", pointer.x, pointer.y));
    return true;
}

} // namespace Recorder
