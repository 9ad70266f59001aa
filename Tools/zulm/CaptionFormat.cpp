#include "Tools/zulm/CaptionFormat.h"

#include "Reports/Text.h"

#include <fmt/core.h>

#include <string_view>

namespace Zulm {

namespace {

/// Joins its neighbours without showing: keeps what follows from being markup where the format has no escapes.
constexpr auto s_wordJoiner = "\xe2\x81\xa0";

struct ClockTime {
    std::int64_t hours;
    std::int64_t minutes;
    std::int64_t seconds;
    std::int64_t fraction;
};

ClockTime clockTime(std::int64_t time, std::int64_t scale) {
    return {time / scale / 3600, time / scale / 60 % 60, time / scale % 60, time % scale};
}

std::string milliseconds(std::int64_t time, char separator) {
    const ClockTime clock = clockTime(time, 1000);
    return fmt::format("{:02}:{:02}:{:02}{}{:03}", clock.hours, clock.minutes, clock.seconds, separator,
                       clock.fraction);
}

std::string centiseconds(std::int64_t time) {
    const ClockTime clock = clockTime(time, 100);
    return fmt::format("{}:{:02}:{:02}.{:02}", clock.hours, clock.minutes, clock.seconds, clock.fraction);
}

/// Every character by `escape`, which gives what stands for it.
template <class Escape>
std::string escaped(const std::string& text, Escape escape) {
    std::string result;
    for (const char c : readableLine(text))
        result += escape(c);
    return result;
}

/// Players take <...> and {\...} for markup, and --> for times.
std::string srtText(const std::string& text) {
    return escaped(text, [](char c) {
        const std::string plain(1, c);
        if (c == '>')
            return s_wordJoiner + plain;
        return c == '<' || c == '{' ? plain + s_wordJoiner : plain;
    });
}

std::string vttText(const std::string& text) {
    return escaped(text, [](char c) -> std::string {
        switch (c) {
        case '&': return "&amp;";
        case '<': return "&lt;";
        case '>': return "&gt;";
        default: return std::string(1, c);
        }
    });
}

/// A backslash has no escape of its own.
std::string assText(const std::string& text) {
    return escaped(text, [](char c) -> std::string {
        if (c == '\\')
            return std::string("\\") + s_wordJoiner;
        return c == '{' || c == '}' ? std::string("\\") + c : std::string(1, c);
    });
}

std::string ffmpegText(const std::string& text) {
    return escaped(text, [](char c) {
        constexpr std::string_view special = "=;#\\";
        return special.find(c) == std::string_view::npos ? std::string(1, c) : std::string("\\") + c;
    });
}

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
    const std::string& text = caption.text;
    switch (format) {
    case CaptionFormat::SRT:
        return fmt::format("{}\n{} --> {}\n{}\n\n", number, milliseconds(caption.start, ','),
                           milliseconds(caption.end, ','), srtText(text));
    case CaptionFormat::VTT:
        return fmt::format("{} --> {}\n{}\n\n", milliseconds(caption.start, '.'), milliseconds(caption.end, '.'),
                           vttText(text));
    case CaptionFormat::ASS:
        return fmt::format("Dialogue: 0,{},{},Default,,0,0,0,,{}\n", centiseconds(caption.start),
                           centiseconds(caption.end), assText(text));
    case CaptionFormat::FFMetaData:
        return fmt::format("\n[CHAPTER]\nTIMEBASE=1/1000\nSTART={}\nEND={}\ntitle={}\n", caption.start, caption.end,
                           ffmpegText(text));
    case CaptionFormat::Chapters: break;
    }
    return fmt::format("CHAPTER{0:02}={1}\nCHAPTER{0:02}NAME={2}\n", number, milliseconds(caption.start, '.'),
                       readableLine(text));
}

} // namespace

bool holdsChapters(CaptionFormat format) {
    return format == CaptionFormat::FFMetaData || format == CaptionFormat::Chapters;
}

double unitsPerSecond(CaptionFormat format) {
    return format == CaptionFormat::ASS ? 100 : 1000;
}

std::string formatted(const std::vector<PlacedCaption>& captions, CaptionFormat format) {
    std::string file = headerOf(format);
    for (std::size_t i = 0; i < captions.size(); ++i)
        file += item(captions[i], i + 1, format);
    return file;
}

} // namespace Zulm
