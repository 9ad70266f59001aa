#pragma once

#include <chrono>
#include <cstdint>
#include <string>

namespace Zulm {

/// A line on standard error with bytes done and time left, once work has taken half a second; only on a terminal.
class Progress {
public:
    Progress(std::string what, std::uint64_t totalBytes);
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
    std::uint64_t done_ = 0;
    bool isEnabled_;
    bool isShown_ = false;
    Clock::time_point start_ = Clock::now();
    Clock::time_point next_;
};

/// "1.5 GB" and so on.
std::string bytesText(std::uint64_t bytes);

} // namespace Zulm
