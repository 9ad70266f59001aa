#include "Tools/record/StatusLine.h"

#include <fmt/core.h>
#include <unistd.h>

#include <cstdio>

namespace Recorder {

namespace {

constexpr Instant s_statusInterval = s_second / 2;

void write(const std::string& text) {
    std::fwrite(text.data(), 1, text.size(), stderr);
    std::fflush(stderr);
}

double inMebibytes(std::uint64_t bytes) {
    constexpr double mebibyte = 1 << 20;
    return static_cast<double>(bytes) / mebibyte;
}

} // namespace

void say(const std::string& line) {
    write(line + "\n");
}

bool StatusLine::isDue() const {
    return now() >= next_ && isatty(STDERR_FILENO) != 0;
}

void StatusLine::show(const Progress& progress) {
    next_ = now() + s_statusInterval;
    isShown_ = true;
    const auto seconds = static_cast<int>(progress.seconds);
    write(fmt::format(
        "\r{} {:02}:{:02}:{:02}  {} frames, {} dropped  {} entries  movie {:.1f} MiB, streams {:.1f} MiB  ",
        progress.isPaused ? "paused" : "recording", seconds / 3600, seconds / 60 % 60, seconds % 60, progress.frames,
        progress.dropped, progress.entries, inMebibytes(progress.movieBytes), inMebibytes(progress.streamBytes)));
}

void StatusLine::end() {
    if (isShown_)
        Recorder::say("");
    isShown_ = false;
}

void StatusLine::say(const std::string& line) {
    end();
    Recorder::say(line);
}

} // namespace Recorder
