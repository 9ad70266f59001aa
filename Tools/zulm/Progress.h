#pragma once

#include <chrono>
#include <cstdint>
#include <string>

namespace Zulm {

/// "1.5 GB" and so on.
std::string bytesText(std::uint64_t bytes);

/// "12 s" for so many milliseconds.
std::string secondsText(std::uint64_t milliseconds);

/// A line on standard error with what is done and the time left, once work has taken half a second; only on a terminal.
class Progress {
public:
    /// `text` says how much of the work a number is.
    Progress(std::string what, std::uint64_t total, std::string (*text)(std::uint64_t) = bytesText);
    ~Progress();
    Progress(const Progress&) = delete;
    Progress& operator=(const Progress&) = delete;

    void advance(std::uint64_t bytes) { moveTo(done_ + bytes); }
    void moveTo(std::uint64_t done);

private:
    using Clock = std::chrono::steady_clock;

    void show(Clock::time_point now);

    std::string what_;
    std::uint64_t total_;
    std::string (*text_)(std::uint64_t);
    std::uint64_t done_ = 0;
    bool isEnabled_;
    bool isShown_ = false;
    Clock::time_point start_ = Clock::now();
    Clock::time_point next_;
};

} // namespace Zulm
