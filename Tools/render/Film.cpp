#include "Tools/render/Film.h"

#include "Reports/Text.h"
#include "Tools/render/FilmWriter.h"
#include "Tools/render/Gif.h"
#include "Tools/render/Production.h"
#include "Tools/render/SoundTrack.h"
#include "Tools/render/Stills.h"
#include "Tools/zulm/FileAccess.h"
#include "Tools/zulm/Interruptions.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

#include <algorithm>
#include <ctime>
#include <filesystem>
#include <set>

namespace Render {

using namespace ZULMetaData;
using Zulm::ExitCode;
using Zulm::Failure;

namespace {

constexpr int s_gifWidth = 960; ///< at most, unless a size is asked for
constexpr double s_gifFps = 12;
constexpr int s_paletteFrames = 24;

EditList editsFor(const RenderOptions& options, const Production& production) {
    if (options.removesIdle)
        return production.withoutIdle(options.idleLeast, options.idleRest);
    const Zulm::EditOptions& edits = options.edits;
    const bool isCut = !edits.file.empty() || !edits.kept.empty() || !edits.removed.empty();
    return isCut ? Zulm::editsOf(edits, production.recording()) : production.whole();
}

/// Calls `draw(frame)` with all frames of the film, and shows progress.
template <class Draw>
void drawFrames(Production& production, double fps, const std::string& name, Draw draw) {
    const Zulm::NotedSignals noted;
    const TimeMap& times = production.session().times();
    const std::int64_t count = times.frames(fps);
    Zulm::Progress progress("rendering " + name, static_cast<std::uint64_t>(times.duration() * 1000),
                            Zulm::secondsText);
    for (std::int64_t frame = 0; frame < count; ++frame) {
        Zulm::NotedSignals::check();
        const double time = static_cast<double>(frame) / fps;
        draw(production.composer().frameAt(times.at(time)), static_cast<double>(frame + 1) / fps);
        progress.moveTo(static_cast<std::uint64_t>(time * 1000));
    }
}

/// How much of the work was drawing. The times are those of processors, so that other programs do not count.
void sayTimes(const Composer& composer, double length) {
    timespec time{};
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &time);
    const double whole = static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9;
    Zulm::say(fmt::format("{:.2f} s of processors for {:.2f} s of film, of which drawing took {:.2f} s ({:.0f} %)",
                          whole, length, composer.drawingTime(), 100 * composer.drawingTime() / whole));
}

ExitCode renderFilm(const RenderOptions& options, Production& production, const EditList& edits) {
    FilmWriter::requireCodec(options.codec);
    Zulm::OutputFile output(options.output, inputsOf(options), options.force);
    FilmSettings settings;
    settings.fps = options.fps.value_or(settings.fps);
    settings.codec = options.codec;
    settings.quality = options.quality.value_or(settings.quality);
    settings.isQualityAsked = options.quality.has_value();
    std::unique_ptr<SoundTrack> sound;
    if (!options.isSilent)
        sound = std::make_unique<SoundTrack>(production.path(), options.recording, edits);
    if (sound && sound->hasSound())
        settings.soundRate = sound->rate();
    if (settings.soundRate > 0 && !options.redactions.empty())
        Zulm::warn(fmt::format("{}: its sound is not covered; --no-sound leaves it out", options.recording));
    const double length = production.session().times().duration();
    FilmWriter writer(output.temporaryPath(), options.output, settings, production.size().width,
                      production.size().height,
                      production.pictures().at(production.session().times().at(0).source).matrix());
    drawFrames(production, settings.fps, options.output, [&](const YuvPicture& picture, double end) {
        writer.writePicture(picture);
        if (settings.soundRate > 0)
            writer.writeSound(sound->readUntil(std::min(end, length)));
    });
    writer.finish();
    sayTimes(production.composer(), length);
    const std::size_t streams = production.streams().attachTo(output.temporaryPath(), options.output).streams.size();
    output.commit();
    if (!Zulm::settings().quiet)
        Zulm::writeOutput(fmt::format("{}: {:.3f} s, {} x {}, {} stream{}\n", Zulm::shown(options.output), length,
                                      production.size().width, production.size().height, streams,
                                      streams == 1 ? "" : "s"));
    return production.complain();
}

ExitCode renderGif(const RenderOptions& options, Production& production) {
    const double fps = options.fps.value_or(s_gifFps);
    const FilmSize& size = production.size();
    const TimeMap& times = production.session().times();
    Zulm::OutputFile output(options.output, inputsOf(options), options.force);
    GifPalette palette(size.width, size.height);
    const int samples = static_cast<int>(std::min<std::int64_t>(s_paletteFrames, times.frames(fps)));
    for (int i = 0; i < samples; ++i)
        palette.add(production.composer().frameAt(times.at(times.duration() * i / samples)));
    GifWriter writer(output.temporaryPath(), options.output, size.width, size.height, fps, palette.take());
    drawFrames(production, fps, options.output,
               [&writer](const YuvPicture& picture, double) { writer.writePicture(picture); });
    writer.finish();
    output.commit();
    return production.complain();
}

ExitCode renderStills(const RenderOptions& options, Production& production) {
    namespace fs = std::filesystem;
    const TimeMap& times = production.session().times();
    std::vector<std::string> names;
    std::vector<std::string> paths;
    for (const double time : options.at) {
        if (time > times.duration())
            throw Failure(fmt::format("--at {}: the film ends at {:.3f} s", time, times.duration()));
        names.push_back(fmt::format("frame-{:09.3f}.png", time));
        paths.push_back((fs::path(options.frames) / names.back()).string());
    }
    if (std::set<std::string>(paths.begin(), paths.end()).size() < paths.size())
        throw Failure(
            "--at: two of the times are less than a millisecond apart, and would have one file; leave one out");
    Zulm::requireFree(paths, options.force);
    const Zulm::NotedSignals noted;
    NewFiles files(options.frames);
    Zulm::Progress progress("drawing frames of " + options.recording, names.size(), countText);
    for (std::size_t i = 0; i < names.size(); ++i) {
        Zulm::NotedSignals::check();
        writePng(production.composer().frameAt(times.at(options.at[i])), files.add(names[i]), inputsOf(options));
        progress.moveTo(i + 1);
    }
    files.keep();
    return production.complain();
}

} // namespace

ExitCode render(const RenderOptions& options) {
    Production production(options);
    if (production.recording().streams().empty())
        return Zulm::complainAboutNoStreams(production.recording());
    const EditList edits = editsFor(options, production);
    production.prepare(edits, options.zoom, options.isGif ? s_gifWidth : 1 << 20);
    if (!options.frames.empty())
        return renderStills(options, production);
    return options.isGif ? renderGif(options, production) : renderFilm(options, production, edits);
}

} // namespace Render
