// What a user waits for while a film is made: a movie of 1920x1080 at 30 frames a second to H.264, with a moving
// cursor, rings, captions, zooms and a frame around it. Run it on two processors with nothing else to do: the first
// figure is compared with the clock.

#include "Benchmarks/Runner.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/MetaDataKinds.h"
#include "ZULMetaDataBridge/Source/ZULMAtomWriter.h"

#include <fmt/core.h>

#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cmath>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace ZULMetaData::Bench {

namespace {

constexpr int s_seconds = 20; // of the movie
const std::string s_movie = scratchFolder() + "/recording.mp4";
const std::string s_film = scratchFolder() + "/film.mp4";
const std::string s_said = scratchFolder() + "/said.txt";

/// What a program used.
struct Run {
    bool isFine = false;
    double seconds = 0; ///< on the clock
    double peak = 0;    ///< of memory, in MiB
};

/// Runs a program to its end. What it says goes to a file.
Run run(std::vector<std::string> words) {
    std::vector<char*> arguments;
    for (std::string& word : words)
        arguments.push_back(word.data());
    arguments.push_back(nullptr);
    const auto start = std::chrono::steady_clock::now();
    const pid_t child = fork();
    if (child == 0) {
        const bool isReady = std::freopen(s_said.c_str(), "w", stderr) && std::freopen("/dev/null", "w", stdout);
        if (isReady)
            execvp(arguments[0], arguments.data());
        _exit(127);
    }
    int status = -1;
    rusage used{};
    wait4(child, &status, 0, &used);
    const std::chrono::duration<double> taken = std::chrono::steady_clock::now() - start;
    return {WIFEXITED(status) && WEXITSTATUS(status) == 0, taken.count(), static_cast<double>(used.ru_maxrss) / 1024};
}

template <class Kind, class ValueOf>
FileLocation written(double distance, ValueOf valueOf) {
    const std::string file = scratchFolder() + "/" + metaDataKindName(Kind::type) + ".dat";
    MetaDataWriter<typename Kind::Value, int, int> writer;
    writer.init(file, Kind::type, Kind::version);
    for (int i = 0; i * distance < s_seconds; ++i)
        writer.write(i * distance, valueOf(i), false);
    return file;
}

/// Makes a movie in which everything moves, with sound, and the recording of a busy user.
bool makeRecording() {
    const std::string picture = fmt::format("testsrc2=s=1920x1080:r=30:d={}", s_seconds);
    const std::string sound = fmt::format("sine=frequency=440:duration={}", s_seconds);
    if (!run({"ffmpeg", "-v",   "error",   "-y",      "-f",       "lavfi",    "-i",      picture, "-f",  "lavfi", "-i",
              sound,    "-c:v", "libx264", "-preset", "veryfast", "-pix_fmt", "yuv420p", "-c:a",  "aac", s_movie})
             .isFine)
        return false;
    const auto position = [](int i) {
        return Point(960 + static_cast<int>(700 * std::sin(i * 0.004)),
                     540 + static_cast<int>(400 * std::cos(i * 0.003)));
    };
    const std::vector<FileLocation> files{
        written<CursorLocationKind>(0.001, position),
        written<CursorActionKind>(0.3, [](int i) { return i % 2 == 0 ? 1 : 2; }),
        written<KeyboardActionKind>(
            0.4, [](int i) { return KeyStroke(65 + static_cast<std::uint32_t>(i) % 26, 0x40040000); }),
        written<RecordingRegionKind>(s_seconds, [](int) { return Rect(0, 0, 1920, 1080); })};
    ZULMAtomWriter().writeMetaDataFiles(files, s_movie);
    return true;
}

/// Renders the movie so many times in a row, as one film.
Run renderedFilm(int times) {
    std::vector<std::string> words{ZULM_RENDER, "render", s_movie, "-o", s_film, "--force", "--verbose"};
    for (int i = 0; i < times; ++i)
        words.insert(words.end(), {"--keep", fmt::format("0-{}", s_seconds)});
    return run(words);
}

/// Returns what the renderer says of its own share, in percent, or NaN.
double drawingShare() {
    std::ifstream file(s_said);
    const std::string said{std::istreambuf_iterator<char>(file), {}};
    const std::size_t end = said.rfind(" %)");
    const std::size_t begin = end == std::string::npos ? end : said.rfind('(', end);
    return begin == std::string::npos ? std::nan("") : std::atof(said.c_str() + begin + 1);
}

void reportRendering() {
    const Measure time{"render 1920x1080 at 30 fps to H.264, everything on", "real time", 1};
    const Measure share{"the same: drawing", "the whole work", 40};
    const Measure memory{"the same: memory of a film that is four times as long", "the film", 1.1};
    if (!isSelected(time) && !isSelected(share) && !isSelected(memory))
        return;
    if (!makeRecording())
        return reportWrong(time);
    const Run film = renderedFilm(1);
    const double drawing = drawingShare();
    if (!film.isFine || !std::isfinite(drawing))
        return reportWrong(time);
    reportFigure(time, film.seconds / s_seconds, "x");
    reportFigure(share, drawing, "%");
    const Run longFilm = renderedFilm(4);
    if (!longFilm.isFine)
        return reportWrong(memory);
    fmt::print(stderr, "peaks: {:.0f} MiB for {} s, {:.0f} MiB for {} s\n", film.peak, s_seconds, longFilm.peak,
               4 * s_seconds);
    reportFigure(memory, longFilm.peak / film.peak, "x");
}

} // namespace

} // namespace ZULMetaData::Bench

int main(int argc, char** argv) {
    using namespace ZULMetaData::Bench;
    return runBenchmarks(argc, argv, [] { reportRendering(); });
}
