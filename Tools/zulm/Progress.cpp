#include "Tools/zulm/Progress.h"

#include "Reports/Text.h"
#include "Tools/zulm/Settings.h"

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

Progress::Progress(std::string what, std::uint64_t total, std::string (*text)(std::uint64_t))
    : what_(std::move(what)), total_(total), text_(text),
      isEnabled_(!settings().quiet && !settings().noProgress && isTerminal(stderr)), next_(start_ + s_firstAfter) {}

Progress::~Progress() {
    if (isShown_)
        std::fputs("\r\033[K", stderr);
}

void Progress::moveTo(std::uint64_t done) {
    done_ = done;
    if (!isEnabled_)
        return;
    const auto now = Clock::now();
    if (now >= next_)
        show(now);
}

void Progress::show(Clock::time_point now) {
    const double elapsed = std::chrono::duration<double>(now - start_).count();
    const double share = total_ == 0 ? 1 : static_cast<double>(done_) / static_cast<double>(total_);
    const double left = share > 0 ? elapsed / share - elapsed : 0;
    const std::string line = fmt::format("\r\033[K{}: {} of {} ({:.0f} %), {:.0f} s left", shownMessage(what_),
                                         text_(done_), text_(total_), share * 100, left);
    std::fputs(line.c_str(), stderr); // a terminal that is gone must not end the work
    std::fflush(stderr);
    isShown_ = true;
    next_ = now + s_interval;
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
