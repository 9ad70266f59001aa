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

namespace Recorder {

namespace {

constexpr Instant s_longestAnswer = 2 * s_second;

Focus focusOf(const std::string& word) {
    return word == "ordinary" ? Focus::Ordinary : word == "password" ? Focus::Password : Focus::Unknown;
}

/// What runs in the child until it becomes the program again.
[[noreturn]] void becomeWatcher(int input, int output, const std::string& display) {
    dup2(input, STDIN_FILENO);
    dup2(output, STDOUT_FILENO);
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

bool AccessibilityProcess::waitUntilReady(Instant until) {
    bool isReady = false;
    bool isAbsent = !isAlive();
    while (!isReady && !isAbsent && now() < until) {
        pollfd wait{output_.get(), POLLIN, 0};
        poll(&wait, 1, static_cast<int>(std::max<Instant>(1, (until - now()) / s_millisecond)));
        const bool goesOn = readLines([&](const std::string& line) {
            isReady = isReady || line == "ready";
            isAbsent = isAbsent || line == "absent";
        });
        isAbsent = isAbsent || !goesOn;
    }
    if (!isReady)
        end();
    return isReady;
}

void AccessibilityProcess::serve(const AccessibilityEvents& events) {
    const bool goesOn = isAlive() && readLines([&](const std::string& line) {
                            std::istringstream words(line);
                            std::string what;
                            words >> what;
                            if (what == "focus") {
                                std::uint32_t process = 0;
                                std::string focus;
                                if (words >> process >> focus)
                                    events.focus(process, focusOf(focus));
                            } else if (what == "answer" && asked_) {
                                std::string focus;
                                words >> focus;
                                const Instant asked = *asked_;
                                asked_.reset();
                                if (askedWindow_ == windows_)
                                    events.answer(asked, focusOf(focus));
                            } else if (what == "rect") {
                                Area area;
                                isHovering_ = false;
                                const bool isKnown =
                                    static_cast<bool>(words >> area.x >> area.y >> area.width >> area.height);
                                events.hover(isKnown ? std::optional(area) : std::nullopt);
                            }
                        });
    const bool hangs = asked_ && now() > *asked_ + s_longestAnswer;
    if (goesOn && !hangs)
        return;
    end();
    events.gone();
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
    if (asked_ || !isAlive() || instant < lastAsked_ + interval)
        return;
    asked_ = lastAsked_ = instant;
    askedWindow_ = windows_;
    send("ask\n");
}

bool AccessibilityProcess::askHover(Position pointer) {
    if (isHovering_ || !isAlive())
        return false;
    isHovering_ = true;
    send(fmt::format("hover {} {}\n", pointer.x, pointer.y));
    return true;
}

} // namespace Recorder
