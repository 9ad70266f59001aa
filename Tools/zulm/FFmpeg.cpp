#include "Tools/zulm/FFmpeg.h"

#include "Tools/zulm/ChildProcess.h"
#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

#include <cstdlib>

namespace Zulm {

using ZULMetaData::Rational;

namespace {

double numberAfter(const std::string& text, const std::string& words) {
    const std::size_t place = text.find(words);
    return place == std::string::npos ? 0 : std::strtod(text.c_str() + place + words.size(), nullptr);
}

} // namespace

std::string mediaAddress(const std::string& path) {
    return "file:" + path;
}

std::string secondsFor(const Rational& time) {
    return fmt::format("{:.6f}", time.nearest());
}

std::string numberFor(const Rational& value) {
    return fmt::format("{:.17g}", value.nearest());
}

void requireDone(const std::string& program, int exitCode, const std::string& errors, const std::string& what) {
    if (exitCode == 0)
        return;
    std::string_view text = std::string_view(errors).substr(0, errors.find('\n')); // the others follow from the first
    if (const std::size_t mark = text.find("] "); text.starts_with('[') && mark != std::string_view::npos)
        text.remove_prefix(mark + 2); // which part of ffmpeg says it
    throw Failure(fmt::format("{} cannot {}: {}; nothing was written", program, what,
                              text.empty() ? fmt::format("it ended with {}", exitCode) : std::string(text)));
}

FFmpeg::FFmpeg() {
    std::string version;
    run({"-version"}, "tell its version", inLines([&version](std::string_view line) {
            if (version.empty())
                version = line;
        }));
    version_ = numberAfter(version, "version ");
}

std::string FFmpeg::frameRateOption() const {
    constexpr double renamedIn = 5.1;
    return version_ != 0 && version_ < renamedIn ? "-vsync" : "-fps_mode";
}

void FFmpeg::requireEncoder(const std::string& encoder) const {
    bool isThere = false;
    run({"-hide_banner", "-encoders"}, "list its encoders", inLines([&](std::string_view line) {
            isThere = isThere || line.find(' ' + encoder + ' ') != std::string_view::npos;
        }));
    if (!isThere)
        throw Failure(fmt::format("ffmpeg has no encoder {}; install one that has, or cut with --fast", encoder));
}

void FFmpeg::run(const Words& options, const std::string& what,
                 const std::function<void(std::string_view bytes)>& take) const {
    Words words{"ffmpeg", "-nostdin", "-v", "error", "-y"};
    words.insert(words.end(), options.begin(), options.end());
    const ChildResult result = runChild(words, take);
    requireDone("ffmpeg", result.exitCode, result.errors, what);
}

Words CutSource::openedAt(const std::optional<Rational>& time) const {
    Words words{"-copyts"};
    if (time && *time > start)
        words.insert(words.end(), {"-ss", secondsFor(*time - start)});
    words.insert(words.end(), {"-i", mediaAddress(path)});
    return words;
}

} // namespace Zulm
