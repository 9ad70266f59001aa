#include "Tools/zulm/Captions.h"

#include "Reports/Text.h"
#include "Tools/zulm/Substitutes.h"

#include <fmt/core.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <utility>

namespace Zulm {

namespace {

constexpr double s_lastDuration = 5; ///< seconds of the last title if the length of the movie is not known
constexpr double s_endOfTime = 1e9;  ///< seconds: 30 years, within what every format can hold

/// A caption in units of a time scale, as it stands in a file.
struct PlacedCaption {
    std::int64_t start = 0;
    std::int64_t end = 0;
    std::string text;
};

/// Captions in the order of their times, none overlapping the next and none empty. Those that begin together become
/// one. A title that nothing follows ends with the movie, or after a few seconds if the length of the movie is not
/// known.
std::vector<PlacedCaption> placed(std::vector<Caption> captions, double unitsPerSecond,
                                  std::optional<double> duration) {
    std::stable_sort(captions.begin(), captions.end(),
                     [](const Caption& left, const Caption& right) { return left.start < right.start; });
    const double lastEnd = std::floor(endOfCaptions(duration) * unitsPerSecond);
    const auto unitsAt = [&](double seconds) {
        return std::llround(std::min(std::round(seconds * unitsPerSecond), lastEnd));
    };
    std::vector<PlacedCaption> result;
    for (const Caption& caption : captions) {
        const double end = std::isfinite(caption.end) ? caption.end : duration.value_or(caption.start + s_lastDuration);
        const std::int64_t start = std::min(unitsAt(caption.start), std::max(std::llround(lastEnd) - 1, 0LL));
        const PlacedCaption next{start, unitsAt(end), caption.text};
        if (!result.empty() && result.back().start == next.start) {
            result.back().text += " \xc2\xb7 " + next.text; // middle dot
            result.back().end = std::max(result.back().end, next.end);
            continue;
        }
        if (!result.empty())
            result.back().end = std::min(result.back().end, next.start);
        result.push_back(next);
    }
    for (PlacedCaption& caption : result)
        caption.end = std::max(caption.end, caption.start + 1);
    return result;
}

std::string milliseconds(std::int64_t time, char separator) {
    return fmt::format("{:02}:{:02}:{:02}{}{:03}", time / 3600000, time / 60000 % 60, time / 1000 % 60, separator,
                       time % 1000);
}

std::string centiseconds(std::int64_t time) {
    return fmt::format("{}:{:02}:{:02}.{:02}", time / 360000, time / 6000 % 60, time / 100 % 60, time % 100);
}

// What would be markup in a text. Where a format has no escape, U+2060 (the word joiner, which joins its neighbours
// without showing) keeps what follows from being markup.

/// Players take <...> and {\...} for markup, and --> for times.
const Substitutes s_srtEscapes{{'>', "\u2060>"}, {'<', "<\u2060"}, {'{', "{\u2060"}};
const Substitutes s_vttEscapes{{'&', "&amp;"}, {'<', "&lt;"}, {'>', "&gt;"}};
/// A backslash has no escape of its own.
const Substitutes s_assEscapes{{'\\', "\\\u2060"}, {'{', "\\{"}, {'}', "\\}"}};
const Substitutes s_ffmpegEscapes{{'=', "\\="}, {';', "\\;"}, {'#', "\\#"}, {'\\', "\\\\"}};

constexpr auto s_assHeader =
    "[Script Info]\n"
    "ScriptType: v4.00+\n"
    "PlayResX: 1920\n"
    "PlayResY: 1080\n"
    "WrapStyle: 0\n"
    "ScaledBorderAndShadow: yes\n"
    "\n"
    "[V4+ Styles]\n"
    "Format: Name, Fontname, Fontsize, PrimaryColour, SecondaryColour, OutlineColour, BackColour, Bold, Italic, "
    "Underline, StrikeOut, ScaleX, ScaleY, Spacing, Angle, BorderStyle, Outline, Shadow, Alignment, MarginL, MarginR, "
    "MarginV, Encoding\n"
    "Style: Default,Sans,56,&H00FFFFFF,&H00FFFFFF,&H00000000,&H80000000,0,0,0,0,100,100,0,0,1,3,0,2,40,40,60,1\n"
    "\n"
    "[Events]\n"
    "Format: Layer, Start, End, Style, Name, MarginL, MarginR, MarginV, Effect, Text\n";

std::string headerOf(CaptionFormat format) {
    switch (format) {
    case CaptionFormat::VTT: return "WEBVTT\n\n";
    case CaptionFormat::ASS: return s_assHeader;
    case CaptionFormat::FFMetaData: return ";FFMETADATA1\n";
    default: return {};
    }
}

std::string item(const PlacedCaption& caption, std::size_t number, CaptionFormat format) {
    const std::string text = readableLine(caption.text);
    switch (format) {
    case CaptionFormat::SRT:
        return fmt::format("{}\n{} --> {}\n{}\n\n", number, milliseconds(caption.start, ','),
                           milliseconds(caption.end, ','), substituted(text, s_srtEscapes));
    case CaptionFormat::VTT:
        return fmt::format("{} --> {}\n{}\n\n", milliseconds(caption.start, '.'), milliseconds(caption.end, '.'),
                           substituted(text, s_vttEscapes));
    case CaptionFormat::ASS:
        return fmt::format("Dialogue: 0,{},{},Default,,0,0,0,,{}\n", centiseconds(caption.start),
                           centiseconds(caption.end), substituted(text, s_assEscapes));
    case CaptionFormat::FFMetaData:
        return fmt::format("\n[CHAPTER]\nTIMEBASE=1/1000\nSTART={}\nEND={}\ntitle={}\n", caption.start, caption.end,
                           substituted(text, s_ffmpegEscapes));
    case CaptionFormat::Chapters: break;
    }
    return fmt::format("CHAPTER{0:02}={1}\nCHAPTER{0:02}NAME={2}\n", number, milliseconds(caption.start, '.'), text);
}

} // namespace

bool holdsChapters(CaptionFormat format) {
    return format == CaptionFormat::FFMetaData || format == CaptionFormat::Chapters;
}

double endOfCaptions(std::optional<double> duration) {
    return std::min(duration.value_or(s_endOfTime), s_endOfTime);
}

std::string formatted(std::vector<Caption> captions, CaptionFormat format, std::optional<double> duration) {
    const double unitsPerSecond = format == CaptionFormat::ASS ? 100 : 1000;
    std::string file = headerOf(format);
    std::size_t number = 0;
    const auto inOrder = placed(std::move(captions), unitsPerSecond, duration);
    for (const PlacedCaption& caption : inOrder)
        file += item(caption, ++number, format);
    return file;
}

} // namespace Zulm
