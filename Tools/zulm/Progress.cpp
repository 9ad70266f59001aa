#include "Tools/zulm/Progress.h"

#include "Reports/Text.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

#include <array>
#include <cstdio>
#include <utility>

namespace Zulm {

namespace {

using namespace std::chrono_literals;

constexpr auto s_firstAfter = 500ms;
constexpr auto s_interval = 100ms;

} // namespace

ProgressLine::ProgressLine()
    : isEnabled_(!settings().quiet && !settings().noProgress && isTerminal(stderr) && !PrintTarget::current()),
      next_(start_ + s_firstAfter) {}

void ProgressLine::show(const std::string& text, double share) {
    const auto now = Clock::now();
    const double elapsed = std::chrono::duration<double>(now - start_).count();
    const std::string left =
        share > 0 ? fmt::format(" ({:.0f} %), {:.0f} s left", share * 100, elapsed / share - elapsed) : std::string();
    const std::string line = fmt::format("\r\033[K{}{}", text, left);
    std::fputs(line.c_str(), stderr); // a terminal that is gone must not end the work
    std::fflush(stderr);
    isShown_ = true;
    next_ = now + s_interval;
}

void ProgressLine::hide() {
    if (isShown_)
        std::fputs("\r\033[K", stderr);
    isShown_ = false;
}

Progress::Progress(std::string what, std::uint64_t total, std::string (*text)(std::uint64_t))
    : what_(std::move(what)), total_(total), text_(text) {}

void Progress::moveTo(std::uint64_t done) {
    done_ = done;
    if (line_.isDue())
        line_.show(fmt::format("{}: {} of {}", shownMessage(what_), text_(done_), text_(total_)),
                   total_ == 0 ? 1 : static_cast<double>(done_) / static_cast<double>(total_));
}

void FileProgress::advance(std::uint64_t bytes, double share) {
    ++files_;
    bytes_ += bytes;
    if (line_.isDue())
        line_.show(fmt::format("{} file{}, {}", files_, files_ == 1 ? "" : "s", bytesText(bytes_)), share);
}

std::string secondsText(std::uint64_t milliseconds) {
    return fmt::format("{:.0f} s", static_cast<double>(milliseconds) / 1000);
}

std::string bytesText(std::uint64_t bytes) {
    constexpr std::array units{"bytes", "kB", "MB", "GB", "TB"};
    auto value = static_cast<double>(bytes);
    std::size_t unit = 0;
    for (; value >= 1000 && unit + 1 < units.size(); ++unit)
        value /= 1000;
    return unit == 0 ? fmt::format("{} bytes", bytes) : fmt::format("{:.1f} {}", value, units[unit]);
}

} // namespace Zulm
