#include "Reports/Text.h"
#include "Tools/zulm/Captions.h"
#include "Tools/zulm/Choice.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaDataSession/Insights/KeyCaptions.h"

#include <fmt/core.h>

#include <limits>
#include <memory>
#include <optional>

namespace Zulm {

using namespace ZULMetaData;

namespace {

struct ConvertOptions {
    std::string file;
    CaptionFormat format = CaptionFormat::SRT;
    std::string output;
    std::vector<std::string> kinds;
    KeyCaptionOptions captions;
    std::optional<double> pause;
    bool force = false;
};

constexpr double s_shortestPause = 0.001; // all in seconds
constexpr double s_longestPause = 3600;
constexpr double s_untilTheNext = std::numeric_limits<double>::infinity();

/// Collects what is said in the streams of one recording.
class CaptionReader {
public:
    CaptionReader(const ConvertOptions& options, RecordingFile& recording, std::optional<double> duration)
        : options_(options), recording_(recording), end_(endOfCaptions(duration)) {}

    void read(const StreamInfo& stream) {
        RecordedKinds::visit(stream.type, [&]<class Kind>() { readKind<Kind>(stream); });
    }

    const std::vector<Caption>& captions() const { return captions_; }
    ExitCode code() const { return code_; }

private:
    template <class Kind>
    void readKind(const StreamInfo& stream) {
        if constexpr (std::same_as<typename Kind::Value, KeyStroke>) {
            readKeys(stream);
        } else if constexpr (std::same_as<typename Kind::Value, std::string>) {
            std::string last = "\n"; // no title is like it
            walk<std::string>(stream, [&](double time, const std::string& stored) {
                const std::string text = titleOf(stored);
                if (text != last)
                    captions_.push_back({time, s_untilTheNext, text});
                last = text;
            });
        }
    }

    void readKeys(const StreamInfo& stream) {
        std::vector<double> times;
        std::vector<KeyInput> keys;
        walk<KeyStroke>(stream, [&](double time, const KeyStroke& key) {
            times.push_back(time);
            keys.push_back(keyInputOf(key));
        });
        const Track<KeyboardActionKind> track(std::move(times), std::move(keys));
        for (const KeyCaption& caption : keyCaptions(track, options_.captions))
            captions_.push_back({caption.start, caption.end, caption.text});
    }

    static std::string titleOf(const std::string& stored) {
        const std::string text = validText(stored);
        const bool isBlank = text.find_first_not_of(" \t\r\n") == std::string::npos;
        return isBlank ? "(untitled)" : text;
    }

    /// Numbers of entries that have no place on the time line.
    struct LeftOut {
        std::uint64_t beforeStart = 0;
        std::uint64_t atEnd = 0;
    };

    template <class Value, class Visit>
    void walk(const StreamInfo& stream, Visit visit) {
        LeftOut leftOut;
        const std::uint64_t end = recording_.readEntries<Value>(stream, [&](double time, const Value& value) {
            if (time >= 0 && time < end_)
                visit(time, value);
            else
                ++(time >= end_ ? leftOut.atEnd : leftOut.beforeStart);
            return true;
        });
        complainAbout(stream, end, leftOut);
    }

    void complainAbout(const StreamInfo& stream, std::uint64_t end, const LeftOut& leftOut) {
        complainAbout(stream, leftOut.beforeStart, "before the beginning or at no time");
        complainAbout(stream, leftOut.atEnd, fmt::format("at the end, {} s, or after it", end_));
        code_ = worseOf(code_, complainAboutRest(recording_, stream, end));
    }

    void complainAbout(const StreamInfo& stream, std::uint64_t leftOut, const std::string& where) {
        if (leftOut == 0)
            return;
        complain(fmt::format("{}: {}: left out {} {} {}", recording_.name(), stream.name(), leftOut,
                             leftOut == 1 ? "entry" : "entries", where));
        code_ = ExitDamaged;
    }

    const ConvertOptions& options_;
    RecordingFile& recording_;
    double end_;
    std::vector<Caption> captions_;
    ExitCode code_ = ExitFine;
};

std::vector<std::string> kindsFor(const ConvertOptions& options) {
    if (!options.kinds.empty())
        return options.kinds;
    return holdsChapters(options.format) ? std::vector<std::string>{"slideTitles", "topmostWindowTitle"}
                                         : std::vector<std::string>{"keyboardAction"};
}

/// Returns nothing for a movie that tells no length, as one that was never finished.
std::optional<double> lengthOf(RecordingFile& recording) {
    const std::optional<double> duration = recording.duration();
    return duration && *duration > 0 ? duration : std::nullopt;
}

ExitCode runConvert(const ConvertOptions& options) {
    const InputFile input(options.file);
    RecordingFile recording = input.open();
    const std::vector<std::string> kinds = kindsFor(options);
    const std::vector<StreamInfo> streams = chosenStreams(recording, kinds);
    if (streams.empty())
        return complainAboutNothing(recording, kinds);
    const std::optional<double> duration = lengthOf(recording);
    CaptionReader reader(options, recording, duration);
    for (const StreamInfo& stream : streams)
        reader.read(stream);
    const std::string text = formatted(reader.captions(), options.format, duration);
    if (options.output.empty() || options.output == "-")
        writeOutput(text);
    else
        writeWholeFile(options.output, text, {input.name()}, options.force);
    return reader.code();
}

void requirePauseInRange(double pause) {
    if (pause < s_shortestPause || pause > s_longestPause)
        throw CLI::ValidationError(
            "--pause", fmt::format("{} is not from {} to {} seconds", pause, s_shortestPause, s_longestPause));
}

} // namespace

void addConvertCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<ConvertOptions>();
    CLI::App* command = app.add_subcommand(
        "convert", "Write keystrokes as captions or titles as chapters. Captions are srt, vtt or ass, chapters "
                   "ffmetadata or chapters; what was typed shows as bullets");
    command->add_option("FILE", options->file, "A movie, RIFF file or stream file; - is standard input")->required();
    addChoice(*command, "--to", options->format, "What to write",
              {{"srt", CaptionFormat::SRT},
               {"vtt", CaptionFormat::VTT},
               {"ass", CaptionFormat::ASS},
               {"ffmetadata", CaptionFormat::FFMetaData},
               {"chapters", CaptionFormat::Chapters}})
        ->required();
    command->add_option("-o,--output", options->output, "Write to this file; - is standard output, as without it")
        ->type_name("OUT");
    addStreamOption(*command, options->kinds,
                    "What to write: keyboardAction, or a kind of texts (repeatable). Without it, keyboardAction as "
                    "captions, slideTitles and topmostWindowTitle as chapters");
    addSeconds(*command, "--pause", options->pause,
               "Begin a new caption after a pause of this length; the default is 1 second");
    command->add_flag("--show-keys", options->captions.showsKeys, "Show what was typed, passwords included");
    command->add_flag("--force", options->force, "Replace OUT if it exists");
    command->footer("zulm convert --to srt Recording.mp4 -o Recording.srt\n"
                    "zulm convert --to ffmetadata Recording.mp4 | ffmpeg -i Recording.mp4 -i - -map_metadata 1 -c copy "
                    "Chapters.mp4");
    command->callback([options, &chosen] {
        requireKinds("--stream", options->kinds, "has neither keystrokes nor texts",
                     []<class Kind>() { return OneOf<typename Kind::Value, std::string, KeyStroke>; });
        options->captions.pause = options->pause.value_or(options->captions.pause);
        requirePauseInRange(options->captions.pause);
        chosen = [options] { return runConvert(*options); };
    });
}

} // namespace Zulm
