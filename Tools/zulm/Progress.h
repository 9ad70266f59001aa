#pragma once

#include <chrono>
#include <cstdint>
#include <string>

namespace Zulm {

/// "1.5 GB" and so on.
std::string bytesText(std::uint64_t bytes);

/// "12 s" for so many milliseconds.
std::string secondsText(std::uint64_t milliseconds);

/// A line on standard error that is written over and over, once work has taken half a second; only on a terminal.
class ProgressLine {
public:
    ProgressLine();
    ~ProgressLine() { hide(); }
    ProgressLine(const ProgressLine&) = delete;
    ProgressLine& operator=(const ProgressLine&) = delete;

    /// Returns whether the line is to be shown now.
    bool isDue() const { return isEnabled_ && Clock::now() >= next_; }

    /// Shows `text`, and the time left if a `share` of the work is known to be done.
    void show(const std::string& text, double share);

    /// Clears the line, so that something else can be printed.
    void hide();

private:
    using Clock = std::chrono::steady_clock;

    bool isEnabled_;
    bool isShown_ = false;
    Clock::time_point start_ = Clock::now();
    Clock::time_point next_;
};

/// What is done of one piece of work, and the time left.
class Progress {
public:
    /// `text` says how much of the work a number is.
    Progress(std::string what, std::uint64_t total, std::string (*text)(std::uint64_t) = bytesText);

    void advance(std::uint64_t bytes) { moveTo(done_ + bytes); }
    void moveTo(std::uint64_t done);

private:
    std::string what_;
    std::uint64_t total_;
    std::string (*text_)(std::uint64_t);
    std::uint64_t done_ = 0;
    ProgressLine line_;
};

/// How many files are done, and how many bytes they have.
class FileProgress {
public:
    /// `share` is how much of all files is done, from 0 to 1; 0 if nobody knows.
    void advance(std::uint64_t bytes, double share);
    void hide() { line_.hide(); }

private:
    std::uint64_t files_ = 0;
    std::uint64_t bytes_ = 0;
    ProgressLine line_;
};

} // namespace Zulm
