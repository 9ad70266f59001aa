// Movies that are cut by ffmpeg together with their metadata. Every frame shows a marker at the place of the cursor: in
// the new movie it must still be there, judged from decoded pixels.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/ZULMMetaDataParser.h"
#include "ZULMetaDataBridge/Source/MetaDataReaders/MetaDataObserver.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <cmath>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

constexpr int s_width = 320;
constexpr int s_height = 176;
constexpr int s_markerSize = 12;
constexpr int s_framesPerSecond = 30;
constexpr int s_frames = 240;

/// Where the marker of a frame is. No two frames have it in the same place.
Point markerOf(int frame) {
    return {10 + frame * 4 % 280, 10 + frame * 4 / 280 * 40};
}

/// Frames that the movie of varying rate lacks.
bool isDropped(int frame) {
    return frame >= 60 && frame < 130 && frame % 9 != 0;
}

struct Frame {
    double time = 0;
    Point marker;
};

/// Frames as they are decoded and turned the right way up.
std::vector<Frame> framesOf(const std::string& movie, int width = s_width, int height = s_height) {
    const std::string pictures =
        outputOf("ffmpeg -v error -i '" + movie +
                 "' -map 0:v:0 -vsync passthrough -enc_time_base 1:90000 -f rawvideo -pix_fmt gray -");
    std::istringstream times(outputOf(
        "ffprobe -v error -select_streams v:0 -show_entries frame=pts_time -of default=nokey=1:noprint_wrappers=1 '" +
        movie + "'"));
    std::vector<Frame> frames;
    const auto size = static_cast<std::size_t>(width * height);
    for (std::size_t begin = 0; begin + size <= pictures.size(); begin += size) {
        Frame frame;
        std::string line;
        std::getline(times, line);
        frame.time = std::stod(line);
        double sum = 0;
        double x = 0;
        double y = 0;
        for (std::size_t i = 0; i < size; ++i)
            if (const int light = static_cast<unsigned char>(pictures[begin + i]); light > 128) {
                sum += 1;
                x += static_cast<double>(i % static_cast<std::size_t>(width));
                y += static_cast<double>(i / static_cast<std::size_t>(width));
            }
        EXPECT_GT(sum, 0) << movie << " at " << frame.time;
        frame.marker = {static_cast<std::int32_t>(std::lround(x / sum - (s_markerSize - 1) / 2.0)),
                        static_cast<std::int32_t>(std::lround(y / sum - (s_markerSize - 1) / 2.0))};
        frames.push_back(frame);
    }
    EXPECT_EQ(pictures.size(), frames.size() * size) << movie;
    return frames;
}

struct Cursor {
    std::vector<double> times;
    std::vector<Point> points;

    Point at(double time) const {
        const auto next = std::upper_bound(times.begin(), times.end(), time);
        return points.at(static_cast<std::size_t>(std::max<std::ptrdiff_t>(next - times.begin() - 1, 0)));
    }
};

Cursor cursorIn(const std::string& movie) {
    MetaDataObserver<Point> observer;
    MetaDataParser::create(movie)->loadDataType(s_cursorLocationUUID, observer, -1);
    return {observer.times, observer.values};
}

/// The times at which bursts begin in the sound, in seconds.
std::vector<double> burstsIn(const std::string& movie) {
    constexpr int rate = 48000;
    constexpr int loud = 3000;
    constexpr double rest = 0.1; // between two bursts at least
    const std::string bytes = outputOf("ffmpeg -v error -i '" + movie + "' -map 0:a:0 -f s16le -ac 1 -ar 48000 -");
    std::vector<double> bursts;
    double last = -1;
    for (std::size_t i = 0; i + 1 < bytes.size(); i += 2) {
        std::int16_t sample = 0;
        std::memcpy(&sample, bytes.data() + i, sizeof sample);
        const double time = static_cast<double>(i) / 2 / rate;
        if (std::abs(sample) < loud)
            continue;
        if (last < 0 || time - last > rest)
            bursts.push_back(time);
        last = time;
    }
    return bursts;
}

/// Makes the movies once: of 8 seconds, with a marker, a burst of sound at every second, and metadata.
class CutCommand : public testing::Test {
protected:
    static void SetUpTestSuite() {
        shared_ = std::make_unique<TemporaryFolder>();
        std::ofstream raw(*shared_ / "raw", std::ios::binary);
        for (int frame = 0; frame < s_frames; ++frame)
            raw << pictureOf(frame);
        raw.close();
        const std::string input =
            "ffmpeg -v error -y -f rawvideo -pix_fmt gray -s 320x176 -r 30 -i " + (*shared_ / "raw");
        const std::string sound =
            " -f lavfi -i \"aevalsrc='sin(2*PI*1000*t)*lt(mod(t,1),0.03)*gt(t,0.5):s=48000:d=8'\"";
        const std::string codecs = " -c:v libx264 -g 20 -sc_threshold 0 -bf 2 -crf 12 -pix_fmt yuv420p -c:a aac ";
        outputOf(input + sound + codecs + (*shared_ / "steady.mp4"));
        outputOf(input + sound + " -vf \"select='not(between(n,60,129)*mod(n,9))'\" -vsync vfr" + codecs +
                 (*shared_ / "varying.mp4"));
        outputOf(input + codecs + (*shared_ / "silent.mp4"));
        outputOf("ffmpeg -v error -y -i " + (*shared_ / "silent.mp4") + " -c copy -metadata:s:v rotate=90 " +
                 (*shared_ / "turned.mp4"));
        for (const char* name : {"steady", "varying", "silent", "turned"})
            writeFile(*shared_ / (std::string(name) + ".mp4"),
                      contentsOf(*shared_ / (std::string(name) + ".mp4")) + metaData(name == std::string("varying")));
    }
    static void TearDownTestSuite() { shared_.reset(); }

    static std::string movie(const std::string& name) { return *shared_ / (name + ".mp4"); }

    ToolResult cut(const std::string& source, std::vector<std::string> arguments) const {
        arguments.insert(arguments.begin(), {"cut", source, "-o", out});
        return runTool(arguments);
    }

    /// Every frame of the new movie shows the marker where the cursor is then.
    void expectMarkerUnderCursor() const {
        const Cursor cursor = cursorIn(out);
        const std::vector<Frame> frames = framesOf(out);
        ASSERT_FALSE(frames.empty());
        for (const Frame& frame : frames) {
            const Point expected = cursor.at(frame.time + 0.0001); // times are printed with six digits
            EXPECT_NEAR(frame.marker.x, expected.x, 1) << "at " << frame.time;
            EXPECT_NEAR(frame.marker.y, expected.y, 1) << "at " << frame.time;
        }
    }

    /// The movie begins with a frame, and frames begin at all of these times.
    void expectFramesAt(const std::vector<double>& times) const {
        const std::vector<Frame> frames = framesOf(out);
        for (const double time : times)
            EXPECT_TRUE(std::any_of(frames.begin(), frames.end(), [time](const Frame& frame) {
                return std::abs(frame.time - time) < 0.0001;
            })) << time;
    }

    struct Piece {
        double start;
        double end;
        double speed;
    };

    /// Every frame of the new movie is the one that the source shows at its time, and all pieces begin with one.
    void expectFramesOf(const std::string& source, const std::vector<Piece>& pieces, int width = s_width,
                        int height = s_height) const {
        constexpr double rounding = 0.0001;
        const std::vector<Frame> shown = framesOf(source, width, height);
        const std::vector<Frame> frames = framesOf(out, width, height);
        double base = 0;
        std::size_t next = 0;
        for (const auto& [start, end, speed] : pieces) {
            ASSERT_LT(next, frames.size());
            EXPECT_NEAR(frames[next].time, base, rounding);
            const double stop = base + (end - start) / speed;
            for (; next < frames.size() && (frames[next].time < stop - rounding || stop > frames.back().time); ++next) {
                const double time = start + (frames[next].time - base) * speed + rounding;
                auto expected = std::upper_bound(shown.begin(), shown.end(), time,
                                                 [](double at, const Frame& frame) { return at < frame.time; });
                expected = expected == shown.begin() ? expected : expected - 1;
                EXPECT_NEAR(frames[next].marker.x, expected->marker.x, 1) << frames[next].time;
                EXPECT_NEAR(frames[next].marker.y, expected->marker.y, 1) << frames[next].time;
            }
            base = stop;
        }
        EXPECT_EQ(next, frames.size());
    }

    double lengthOf(const std::string& stream) const {
        return std::stod(outputOf("ffprobe -v error -select_streams " + stream +
                                  " -show_entries stream=duration -of csv=p=0 '" + out + "'"));
    }

    TemporaryFolder folder;
    const std::string out = folder / "Out.mp4";

private:
    static std::string pictureOf(int frame) {
        std::string picture(static_cast<std::size_t>(s_width * s_height), '\x10');
        const Point marker = markerOf(frame);
        for (int y = 0; y < s_markerSize; ++y)
            for (int x = 0; x < s_markerSize; ++x)
                picture[static_cast<std::size_t>((marker.y + y) * s_width + marker.x + x)] = '\xf0';
        return picture;
    }

    static std::string metaData(bool isVarying) {
        std::string locations = streamHeader(s_cursorLocations, 1, 16);
        for (int frame = 0; frame < s_frames; ++frame)
            if (const Point marker = markerOf(frame); !isVarying || !isDropped(frame))
                locations += pointEntry(static_cast<double>(frame) / s_framesPerSecond, marker.x, marker.y);
        const std::string actions = streamHeader("2b7b6af0", 1, 12) + f64(1.5) + raw(1) + f64(4.5) + raw(2);
        return recordingInfo("Mac", "1.0", "14.2") + zulmAtom({locations, actions});
    }

    static std::unique_ptr<TemporaryFolder> shared_;
};

std::unique_ptr<TemporaryFolder> CutCommand::shared_;

TEST_F(CutCommand, KeepsTheMarkerUnderTheCursor) {
    const ToolResult result = cut(movie("steady"), {"--keep", "1-2.51", "--keep", "5.02-7", "--keep", "0.5-1.3"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(result.errors, "");
    EXPECT_THAT(result.output, StartsWith(out + ": 4.290 s in 3 pieces of " + movie("steady") + ", with 2 streams\n"));
    expectMarkerUnderCursor();
    expectFramesAt({0, 1.51, 3.49});
    EXPECT_NEAR(lengthOf("v:0"), 4.29, 0.0005);
    EXPECT_NEAR(lengthOf("a:0"), 4.29, 0.03);
    EXPECT_THAT(namesIn(folder.path()), ElementsAre("Out.mp4"));
}

TEST_F(CutCommand, KeepsItAtOtherSpeedsAndInHeldFrames) {
    const std::string list = folder / "edits.json";
    writeFile(list, R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [
        {"start": "1", "end": "3", "speed": "3/2"}, {"at": "2.02", "duration": "3/4"},
        {"start": "61/30", "end": "4", "speed": "1/2"}, {"start": 0, "end": 8, "speed": "10"},
        {"at": 7.9, "duration": 1}, {"at": 100, "duration": "0.5"}]})");
    const ToolResult result = cut(movie("steady"), {"--edits", list});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(result.errors, "");
    expectMarkerUnderCursor();
    const double slow = 4.0 / 3 + 0.75;
    const double fast = slow + 2 * (4 - 61.0 / 30);
    expectFramesAt({0, 4.0 / 3, slow, fast, fast + 0.8, fast + 1.8});
    EXPECT_NEAR(lengthOf("v:0"), fast + 2.3, 0.0005);
    EXPECT_NEAR(lengthOf("a:0"), fast + 2.3, 0.03);
}

TEST_F(CutCommand, ShowsNoMoreFramesForASecondThanTheSource) {
    ASSERT_EQ(cut(movie("steady"), {"--keep", "0-8@16"}).exitCode, 0);
    const std::vector<Frame> frames = framesOf(out);
    EXPECT_LE(frames.size(), 32U); // half a second
    EXPECT_GE(frames.size(), 15U);
    expectMarkerUnderCursor();
}

TEST_F(CutCommand, CutsMoviesOfVaryingFrameRate) {
    const ToolResult result = cut(movie("varying"), {"--keep", "1.9-3.12", "--keep", "2.75-5@3/2"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    expectMarkerUnderCursor();
    expectFramesAt({0, 1.22});
    EXPECT_NEAR(lengthOf("v:0"), 2.72, 0.0005);
}

TEST_F(CutCommand, CutsMoviesWithoutSound) {
    ASSERT_EQ(cut(movie("silent"), {"--remove", "1-2", "--remove", "4-7.25"}).exitCode, 0);
    expectMarkerUnderCursor();
    EXPECT_NEAR(lengthOf("v:0"), 3.75, 0.0005);
    EXPECT_EQ(outputOf("ffprobe -v error -select_streams a -show_entries stream=index -of csv=p=0 " + out), "");
}

TEST_F(CutCommand, CutsMoviesOfOneFrame) {
    const std::string still = folder / "still.mp4";
    outputOf("ffmpeg -v error -f lavfi -i color=white:s=64x48:r=1/20 -frames:v 1 -c:v libx264 " + still);
    writeFile(still, contentsOf(still) + zulmAtom({locationStream()}));
    const std::vector<std::pair<std::vector<std::string>, double>> lengths{
        {{"--keep", "0-4"}, 4},
        {{"--keep", "5-9", "--keep", "1-2"}, 5},
        {{"--keep", "1-4@2", "--keep", "2-19", "--keep", "0-1@1/2"}, 20.5}};
    for (const auto& [edits, length] : lengths) {
        std::vector<std::string> arguments = edits;
        arguments.push_back("--force");
        const ToolResult result = cut(still, arguments);
        EXPECT_EQ(result.errors, "");
        EXPECT_NEAR(lengthOf("v:0"), length, 0.0005);
        EXPECT_NEAR(std::stod(outputOf("ffprobe -v error -show_entries format=duration -of csv=p=0 " + out)), length,
                    0.0005);
    }
}

TEST_F(CutCommand, KeepsTurnedMoviesTurned) {
    ASSERT_EQ(cut(movie("turned"), {"--keep", "2-3", "--keep", "6-7@2"}).exitCode, 0);
    expectFramesOf(movie("turned"), {{2, 3, 1}, {6, 7, 2}}, s_height, s_width);
}

TEST_F(CutCommand, CutsMoviesThatBeginLaterAndRIFFFiles) {
    const std::string late = folder / "late.mp4";
    outputOf("ffmpeg -v error -itsoffset 0.35 -i " + movie("silent") + " -i " + movie("steady") +
             " -map 0:v -map 1:a -c copy -t 3 " + late);
    writeFile(late, contentsOf(late) + zulmAtom({locationStream()}));
    const std::string riff = folder / "riff.avi"; // counts time in frames
    outputOf("ffmpeg -v error -i " + movie("steady") + " -t 3 -c:v mjpeg -q:v 2 -c:a pcm_s16le " + riff);
    writeFile(riff, contentsOf(riff) + zulmChunk({locationStream()}));
    for (const std::string& source : {late, riff})
        for (const std::vector<std::string>& mode : {std::vector<std::string>{}, {"--fast"}}) {
            SCOPED_TRACE(source + (mode.empty() ? "" : " --fast"));
            std::vector<std::string> arguments{"--keep", "1.01-2.1", "--keep", "0.1-0.9", "--force", "--json"};
            arguments.insert(arguments.end(), mode.begin(), mode.end());
            const ToolResult result = cut(source, arguments);
            ASSERT_EQ(result.exitCode, 0) << result.errors;
            std::vector<Piece> pieces;
            const auto document = nlohmann::json::parse(result.output);
            for (const auto& piece : document.at("files").at(0).at("pieces"))
                pieces.push_back({piece.at("start"), piece.at("end"), piece.at("speed")});
            expectFramesOf(source, pieces);
        }
}

TEST_F(CutCommand, KeepsTheSoundInTime) {
    ASSERT_EQ(cut(movie("steady"), {"--keep", "0.5-2.5", "--keep", "5.7-7.9", "--keep", "2.5-5.5@2"}).exitCode, 0);
    const std::vector<double> bursts = burstsIn(out);
    ASSERT_EQ(bursts.size(), 7U); // at 1, 2; 6, 7; 3, 4, 5
    const std::vector<double> expected{0.5, 1.5, 2.3, 3.3, 4.45, 4.95, 5.45};
    for (std::size_t i = 0; i < bursts.size(); ++i)
        EXPECT_NEAR(bursts[i], expected[i], i < 4 ? 0.005 : 0.04) << i;
}

TEST_F(CutCommand, IsSilentInHeldFramesAndBeyondTheEnd) {
    ASSERT_EQ(cut(movie("steady"), {"--keep", "6.5-10", "--keep", "0.9-1.5"}).exitCode, 0);
    const std::vector<double> bursts = burstsIn(out);
    ASSERT_EQ(bursts.size(), 2U);
    EXPECT_NEAR(bursts[0], 0.5, 0.005);
    EXPECT_NEAR(bursts[1], 3.6, 0.005);
    EXPECT_NEAR(lengthOf("v:0"), 4.1, 0.0005);
    expectMarkerUnderCursor();
}

TEST_F(CutCommand, ReleasesAndPressesButtonsAtTheCuts) {
    ASSERT_EQ(cut(movie("silent"), {"--keep", "1-2", "--keep", "4-5"}).exitCode, 0);
    MetaDataObserver<std::int32_t> actions;
    MetaDataParser::create(out)->loadDataType(s_cursorActionUUID, actions, -1);
    EXPECT_THAT(actions.times, ElementsAre(0.5, 1, 1, 1.5));
    EXPECT_THAT(actions.values, ElementsAre(1, 2, 1, 2));
}

TEST_F(CutCommand, CarriesNoRecordingInfoOver) {
    ASSERT_EQ(cut(movie("silent"), {"--keep", "1-2"}).exitCode, 0);
    EXPECT_THAT(contentsOf(out), Not(HasSubstr("ZULR")));
    EXPECT_EQ(runTool({"verify", out}).exitCode, 0);
}

// Fast cuts -------------------------------------------------------------------------------------------------------

TEST_F(CutCommand, CopiesThePicturesFromKeyFramesOn) {
    const ToolResult result = cut(movie("steady"), {"--fast", "--keep", "1-2.5", "--keep", "5.02-7", "--json"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    const auto file = nlohmann::json::parse(result.output).at("files").at(0);
    EXPECT_EQ(file.at("fast"), true);
    const auto pieces = file.at("pieces");
    ASSERT_EQ(pieces.size(), 2U);
    EXPECT_NEAR(pieces[0].at("start").get<double>(), 20.0 / 30, 1e-9); // key frames are 20 frames apart
    EXPECT_GE(pieces[0].at("end").get<double>(), 2.5);
    EXPECT_LE(pieces[0].at("end").get<double>(), 2.65);
    EXPECT_NEAR(pieces[1].at("start").get<double>(), 140.0 / 30, 1e-9);
    EXPECT_GE(pieces[1].at("end").get<double>(), 7);
    expectMarkerUnderCursor();
    const std::vector<Frame> frames = framesOf(out);
    EXPECT_NEAR(frames.front().marker.x, markerOf(20).x, 1);
    EXPECT_EQ(burstsIn(out).size(), 4U); // at 1, 2; 5, 6
}

TEST_F(CutCommand, CopiesPicturesOfVaryingRateAndTurnedOnes) {
    ASSERT_EQ(cut(movie("varying"), {"--fast", "--keep", "3-4", "--keep", "0.1-1", "--keep", "6-9"}).exitCode, 0);
    expectMarkerUnderCursor();
    ASSERT_EQ(cut(movie("turned"), {"--fast", "--keep", "2-3", "--force"}).exitCode, 0);
    const std::vector<Frame> source = framesOf(movie("turned"), s_height, s_width);
    const std::vector<Frame> frames = framesOf(out, s_height, s_width);
    for (std::size_t i = 0; i < frames.size(); ++i)
        EXPECT_EQ(frames[i].marker, source.at(60 + i).marker);
}

TEST_F(CutCommand, RefusesSpeedsAndHeldFramesInAFastCut) {
    const ToolResult result = cut(movie("steady"), {"--fast", "--keep", "1-2@2"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("--fast copies pictures"));
    EXPECT_THAT(namesIn(folder.path()), ElementsAre());
}

// What goes wrong -------------------------------------------------------------------------------------------------

TEST_F(CutCommand, SaysWhatIsMissing) {
    ToolOptions options;
    options.environment = {{"PATH", folder.path()}};
    const ToolResult result = runTool({"cut", movie("steady"), "--keep", "1-2", "-o", out}, options);
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("ffmpeg: no such program in PATH; install ffmpeg"));
    EXPECT_THAT(namesIn(folder.path()), ElementsAre());
}

TEST_F(CutCommand, WritesNothingIfFFmpegFails) {
    const std::string broken = folder / "Broken.mp4";
    writeFile(broken, tinyMovie() + zulmAtom({locationStream()}));
    const ToolResult result = cut(broken, {"--keep", "1-2"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(namesIn(folder.path()), ElementsAre("Broken.mp4"));
}

TEST_F(CutCommand, EndsAsRetimeDoes) {
    EXPECT_EQ(cut(movie("steady"), {}).exitCode, 2);
    EXPECT_EQ(cut(movie("steady"), {"--keep", "2-1"}).exitCode, 1);
    EXPECT_EQ(cut(movie("steady"), {"--remove", "0-100"}).exitCode, 1);
    const std::string plain = folder / "Plain.mp4";
    writeFile(plain, tinyMovie());
    EXPECT_EQ(cut(plain, {"--keep", "1-2"}).exitCode, 4);
    const std::string stream = folder / "a.dat";
    writeFile(stream, locationStream());
    EXPECT_EQ(cut(stream, {"--keep", "1-2"}).exitCode, 1);
    writeFile(out, "precious");
    EXPECT_EQ(cut(movie("steady"), {"--keep", "1-2"}).exitCode, 1);
    EXPECT_EQ(contentsOf(out), "precious");
}

TEST_F(CutCommand, LeavesNothingWhenItIsInterrupted) {
    for (const int signal : {SIGINT, SIGTERM, SIGHUP}) {
        ToolOptions options;
        options.killAfterMilliseconds = 1;
        options.killSignal = signal;
        options.killWhen = [this] { // while pieces are encoded
            for (const auto& entry : std::filesystem::recursive_directory_iterator(folder.path()))
                if (entry.path().extension() == ".nut")
                    return true;
            return false;
        };
        const ToolResult result =
            runTool({"cut", movie("steady"), "--keep", "0-8@1/40", "--keep", "0-7", "-o", out}, options);
        EXPECT_EQ(result.exitCode, 128 + signal);
        EXPECT_THAT(result.errors, HasSubstr("interrupted; nothing was written"));
        EXPECT_THAT(namesIn(folder.path()), ElementsAre());
        for (const auto& process : std::filesystem::directory_iterator("/proc")) {
            std::ifstream commandLine(process.path() / "cmdline");
            const std::string words{std::istreambuf_iterator<char>(commandLine), {}};
            EXPECT_THAT(words.substr(0, 6) == "ffmpeg" ? words : "", Not(HasSubstr(folder.path().string())));
        }
    }
}

} // namespace
} // namespace ZULMetaData::Test
