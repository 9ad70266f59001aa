#include "Tools/zulm/Media.h"

#include "Tools/zulm/ChildProcess.h"
#include "Tools/zulm/FFmpeg.h"
#include "Tools/zulm/Failure.h"

#include <fmt/core.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <charconv>
#include <string_view>

namespace Zulm {

using ZULMetaData::Rational;

namespace {

/// Runs ffprobe on a file.
void probe(const std::string& path, const std::string& name, std::vector<std::string> options,
           const std::function<void(std::string_view line)>& takeLine) {
    std::vector<std::string> words{"ffprobe", "-v", "error"};
    words.insert(words.end(), options.begin(), options.end());
    words.push_back(mediaAddress(path));
    const ChildResult result = runChild(words, inLines(takeLine));
    requireDone("ffprobe", result.exitCode, result.errors, "read " + name);
}

/// A number as ffprobe writes it: "1/12800", "-0.023000", or an integer.
Rational rationalIn(const std::string& text) {
    const bool isNegative = text.starts_with('-');
    const auto number = Rational::parse(isNegative ? text.substr(1) : text).value_or(Rational());
    return isNegative ? Rational() - number : number;
}

std::optional<std::int64_t> integerIn(std::string_view text) {
    std::int64_t number = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    return error == std::errc() && end == text.data() + text.size() ? std::optional(number) : std::nullopt;
}

/// The value of a field in a line such as "pts=512|dts=0|flags=K_".
std::string_view fieldIn(std::string_view line, std::string_view name) {
    while (!line.empty()) {
        const std::size_t end = std::min(line.find('|'), line.size());
        const std::string_view field = line.substr(0, end);
        if (field.starts_with(name) && field.substr(name.size()).starts_with('='))
            return field.substr(name.size() + 1);
        line.remove_prefix(std::min(end + 1, line.size()));
    }
    return {};
}

/// Packets without a time, and those that are only there to begin decoding with, are not shown.
void takePacket(std::string_view line, PictureStream& stream) {
    const std::string_view flags = fieldIn(line, "flags");
    const auto shown = integerIn(fieldIn(line, "pts"));
    const auto time = shown ? shown : integerIn(fieldIn(line, "dts")); // containers without B frames may have one time
    if (time && flags.find('D') == std::string_view::npos)
        stream.packets.push_back({*time, integerIn(fieldIn(line, "duration")).value_or(0), flags.starts_with('K')});
}

void readPackets(const std::string& path, const std::string& name, PictureStream& stream) {
    probe(path, name,
          {"-select_streams", std::to_string(stream.index), "-show_entries", "packet=pts,dts,duration,flags", "-of",
           "compact=print_section=0"},
          [&stream](std::string_view line) { takePacket(line, stream); });
    for (const MediaPacket& packet : stream.packets)
        stream.frames.push_back(packet.time);
    std::sort(stream.frames.begin(), stream.frames.end());
    stream.frames.erase(std::unique(stream.frames.begin(), stream.frames.end()), stream.frames.end());
}

void takeStream(const nlohmann::json& stream, Media& media) {
    const std::string type = stream.value("codec_type", "");
    const bool isStill = stream.contains("disposition") && stream["disposition"].value("attached_pic", 0) != 0;
    const int index = stream.at("index");
    if (type == "video" && !isStill && !media.picture)
        media.picture = PictureStream{index, rationalIn(stream.at("time_base")), {}, {}};
    else if (type == "audio" && stream.value("channels", 0) > 0)
        media.sounds.push_back({index, std::stoi(stream.value("sample_rate", "0")), stream.at("channels")});
    else
        ++media.otherStreams;
}

} // namespace

Rational PictureStream::end() const {
    const auto last = std::max_element(packets.begin(), packets.end(),
                                       [](const auto& left, const auto& right) { return left.time < right.time; });
    return last == packets.end() ? Rational() : secondsOf(last->time + last->duration);
}

std::size_t PictureStream::shownAt(const Rational& time) const {
    const auto later =
        std::upper_bound(frames.begin(), frames.end(), time,
                         [this](const Rational& at, std::int64_t frame) { return at < secondsOf(frame); });
    return later == frames.begin() ? 0 : static_cast<std::size_t>(later - frames.begin()) - 1;
}

std::size_t PictureStream::nearestTo(const Rational& time) const {
    const std::size_t before = shownAt(time);
    const std::size_t after = std::min(before + 1, frames.size() - 1);
    return secondsOf(frames[after]) - time < time - secondsOf(frames[before]) ? after : before;
}

std::size_t PictureStream::firstFrom(const Rational& time) const {
    const auto from =
        std::lower_bound(frames.begin(), frames.end(), time,
                         [this](std::int64_t frame, const Rational& at) { return secondsOf(frame) < at; });
    return static_cast<std::size_t>(from - frames.begin());
}

Media mediaIn(const std::string& path, const std::string& name) {
    std::string text;
    probe(path, name,
          {"-show_entries",
           "stream=index,codec_type,time_base,sample_rate,channels:stream_disposition=attached_pic:format=start_time",
           "-of", "json"},
          [&text](std::string_view line) { text.append(line) += '\n'; });
    Media media;
    try {
        const nlohmann::json document = nlohmann::json::parse(text);
        media.start = rationalIn(document.at("format").value("start_time", "0"));
        for (const nlohmann::json& stream : document.at("streams"))
            takeStream(stream, media);
    } catch (const std::exception& error) { // of a version that speaks otherwise
        throw Failure(fmt::format("{}: what ffprobe says about it is not understood: {}", name, error.what()));
    }
    if (media.picture)
        readPackets(path, name, *media.picture);
    return media;
}

} // namespace Zulm
