// Runs ffmpeg and ffprobe on what is written.

#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <limits>
#include <sstream>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::json;
using testing::HasSubstr;
using testing::Not;

constexpr std::uint32_t s_shift = 0x20000;
constexpr std::uint32_t s_command = 0x100000;
constexpr std::uint32_t s_virtualKey = 0x40000000;
constexpr std::uint32_t s_return = 13;

const std::string s_bullet = "\xe2\x80\xa2";
const std::string s_joiner = "\xe2\x81\xa0";

std::string key(double time, std::uint32_t code, std::uint32_t flags = 0) {
    return f64(time) + le32(code) + le32(flags);
}

std::string typed(double time, const std::string& text) {
    std::string entries;
    for (const char c : text)
        entries += key(time, static_cast<unsigned char>(c));
    return entries;
}

class ConvertCommand : public RecordedSession {
protected:
    std::string write(const std::string& name, const std::string& contents) const {
        writeFile(folder / name, contents);
        return folder / name;
    }

    std::string keys(const std::string& entries) const {
        return write("keys.dat", streamHeader("2b7b6af5", 1, 16) + entries);
    }

    std::string titles(const std::string& entries) const {
        return write("titles.dat", streamHeader("2b7b6a07", 1, 0) + entries);
    }

    std::string converted(const std::string& file, std::vector<std::string> arguments) const {
        arguments.insert(arguments.begin(), {"convert", file, "--to"});
        const ToolResult result = runTool(arguments);
        EXPECT_EQ(result.exitCode, 0) << result.errors;
        return result.output;
    }
};

TEST_F(ConvertCommand, MasksWhatWasTyped) {
    const std::string file = keys(typed(1, "PASS 1") + key(1.5, s_return));
    EXPECT_EQ(converted(file, {"srt"}), "1\n00:00:01,000 --> 00:00:03,000\n" + s_bullet + s_bullet + s_bullet +
                                            s_bullet + s_bullet + s_bullet + " [returnKey]\n\n");
    EXPECT_EQ(converted(file, {"srt", "--show-keys"}), "1\n00:00:01,000 --> 00:00:03,000\nPASS 1 [returnKey]\n\n");
}

TEST_F(ConvertCommand, MakesACaptionOfKeysBetweenPauses) {
    const std::string file = keys(typed(1, "ab") + typed(1.9, "c") + typed(3, "d"));
    EXPECT_EQ(converted(file, {"srt", "--show-keys"}),
              "1\n00:00:01,000 --> 00:00:03,000\nabc\n\n2\n00:00:03,000 --> 00:00:04,500\nd\n\n");
    EXPECT_THAT(converted(file, {"srt", "--show-keys", "--pause", "0.5"}), HasSubstr("3\n00:00:03,000"));
}

TEST_F(ConvertCommand, BreaksLongLinesAndJoinsWhatBeginsTogether) {
    const std::string text = converted(keys(typed(1, std::string(60, 'X')) + typed(1.2, "Y")), {"srt", "--show-keys"});
    EXPECT_EQ(text, "1\n00:00:01,000 --> 00:00:02,700\n" + std::string(42, 'X') + " \xc2\xb7 " + std::string(18, 'X') +
                        "Y\n\n");
}

TEST_F(ConvertCommand, RoundsTimesAndCountsHours) {
    const std::string file = keys(typed(3725.0006, "a") + typed(3730.9996, "b"));
    EXPECT_THAT(converted(file, {"srt"}), HasSubstr("01:02:05,001 --> 01:02:06,501"));
    EXPECT_THAT(converted(file, {"vtt"}), HasSubstr("01:02:11.000 --> 01:02:12.500"));
    EXPECT_THAT(converted(file, {"ass"}), HasSubstr("Dialogue: 0,1:02:05.00,1:02:06.50,Default,"));
}

TEST_F(ConvertCommand, KeepsMarkupOutOfEveryFormat) {
    const std::string title = "a<b>--> {\\an8} \\N &amp;\r\n\r\nc";
    const std::string file = titles(textEntry(1, title));
    const std::vector<std::string> chosen{"--stream", "topmostWindowTitle"};
    const auto as = [&](const std::string& format) { return converted(file, {format, chosen[0], chosen[1]}); };
    EXPECT_THAT(as("srt"), HasSubstr("a<" + s_joiner + "b" + s_joiner + ">--" + s_joiner + "> {" + s_joiner +
                                     "\\an8} \\N &amp;    c\n"));
    EXPECT_THAT(as("vtt"), HasSubstr("a&lt;b&gt;--&gt; {\\an8} \\N &amp;amp;    c\n"));
    EXPECT_THAT(as("ass"), HasSubstr(",,a<b>--> \\{\\" + s_joiner + "an8\\} \\" + s_joiner + "N &amp;    c\n"));
}

TEST_F(ConvertCommand, EscapesChapterTitles) {
    const std::string file = titles(textEntry(1, "a=b;c#d\\e\nf"));
    EXPECT_EQ(converted(file, {"ffmetadata"}), ";FFMETADATA1\n\n[CHAPTER]\nTIMEBASE=1/1000\nSTART=1000\nEND=6000\n"
                                               "title=a\\=b\\;c\\#d\\\\e f\n");
    EXPECT_EQ(converted(file, {"chapters"}), "CHAPTER01=00:00:01.000\nCHAPTER01NAME=a=b;c#d\\e f\n");
}

TEST_F(ConvertCommand, MakesAChapterOfEveryChangeOfTitles) {
    const std::string slides = streamHeader("2b7b6af8", 1, 0) + textEntry(0, "Intro") + textEntry(4, "End");
    const std::string windows = streamHeader("2b7b6a07", 1, 0) + textEntry(0, "Mail") + textEntry(1, "Mail") +
                                textEntry(2, "") + textEntry(3, "\xff");
    const std::string file = write("movie.mp4", tinyMovie() + zulmAtom({slides, windows}));
    EXPECT_EQ(converted(file, {"chapters"}), "CHAPTER01=00:00:00.000\nCHAPTER01NAME=Mail \xc2\xb7 Intro\n"
                                             "CHAPTER02=00:00:02.000\nCHAPTER02NAME=(untitled)\n"
                                             "CHAPTER03=00:00:03.000\nCHAPTER03NAME=\xef\xbf\xbd\n"
                                             "CHAPTER04=00:00:04.000\nCHAPTER04NAME=End\n");
    EXPECT_THAT(converted(file, {"ffmetadata"}), HasSubstr("START=4000\nEND=20000\n")) << "the movie's end";
}

TEST_F(ConvertCommand, EndsWithTheMovie) {
    const std::string slides = streamHeader("2b7b6af8", 1, 0) + textEntry(17.25, "Last") + textEntry(20, "At the end") +
                               textEntry(25, "Later");
    const std::string keystrokes =
        streamHeader("2b7b6af5", 1, 16) + typed(19.5, "a") + typed(19.9996, "b") + typed(1e9, "c");
    const std::string file = write("movie.mp4", tinyMovie() + zulmAtom({slides, keystrokes}));
    const ToolResult chapters = runTool({"convert", file, "--to", "ffmetadata"});
    EXPECT_EQ(chapters.exitCode, 3);
    EXPECT_THAT(chapters.errors, HasSubstr("slideTitles: left out 2 entries at the end, 20 s, or after it"));
    EXPECT_THAT(chapters.output, testing::EndsWith("START=17250\nEND=20000\ntitle=Last\n"));
    const ToolResult captions = runTool({"convert", file, "--to", "srt", "--show-keys"});
    EXPECT_THAT(captions.errors, HasSubstr("keyboardAction: left out 1 entry at the end"));
    EXPECT_EQ(captions.output, "1\n00:00:19,500 --> 00:00:20,000\nab\n\n");
}

TEST_F(ConvertCommand, KeepsTheLengthOfAMovieThatFFmpegPutsChaptersAndCaptionsInto) {
    const std::string picture = folder / "picture.mp4";
    ASSERT_EQ(runProgram("ffmpeg", {"-v", "error", "-f", "lavfi", "-i", "color=size=16x16:rate=5:duration=4", picture})
                  .exitCode,
              0);
    const std::string stream = write("keys.dat", streamHeader("2b7b6af5", 1, 16) + typed(3.75, "a"));
    const std::string names =
        write("names.dat", streamHeader("2b7b6af8", 1, 0) + textEntry(0, "One") + textEntry(3, "Two"));
    ASSERT_EQ(runTool({"attach", picture, stream, names, "--in-place"}).exitCode, 0);
    const std::string chapters = write("chapters.txt", converted(picture, {"ffmetadata"}));
    const std::string captions = write("captions.srt", converted(picture, {"srt"}));
    const std::string output = folder / "output.mp4";
    const ToolResult muxed =
        runProgram("ffmpeg", {"-v", "error", "-i", picture, "-i", chapters, "-i", captions, "-map", "0:v", "-map", "2",
                              "-map_metadata", "1", "-c:v", "copy", "-c:s", "mov_text", output});
    ASSERT_EQ(muxed.exitCode, 0) << muxed.errors;
    const ToolResult duration =
        runProgram("ffprobe", {"-v", "error", "-show_entries", "format=duration", "-of", "csv=p=0", output});
    EXPECT_EQ(duration.output, "4.000000\n");
}

TEST_F(ConvertCommand, ShowsWhatCannotBeSeenInTitles) {
    const std::string file = titles(textEntry(1, std::string("a\0b\xe2\x80\xae", 6)));
    for (const char* format : {"ffmetadata", "chapters"})
        EXPECT_THAT(converted(file, {format}), HasSubstr("=a[U+0000]b[U+202E]\n")) << format;
    EXPECT_THAT(converted(file, {"srt", "--stream", "topmostWindowTitle"}), HasSubstr("\na[U+0000]b[U+202E]\n"));
}

TEST_F(ConvertCommand, TakesCodesForCharactersUnlessTheyAreVirtualKeys) {
    EXPECT_THAT(converted(keys(typed(1, "hello world")), {"srt", "--show-keys"}), HasSubstr("\nhello world\n"));
    EXPECT_THAT(converted(keys(key(1, 0x444) + key(1, 119, s_virtualKey) + key(1, 8)), {"srt", "--show-keys"}),
                HasSubstr("\n\xd1\x84 [f8] [back]\n"));
    EXPECT_THAT(converted(keys(key(1, 97, s_virtualKey)), {"srt"}), HasSubstr("\n" + s_bullet + "\n"));
}

TEST_F(ConvertCommand, LeavesOutWhatHasNoPlaceOnTheTimeLine) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const std::string file = keys(typed(-1, "a") + typed(nan, "b") + typed(1e300, "c") + typed(2, "d"));
    const ToolResult result = runTool({"convert", file, "--to", "srt", "--show-keys"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("left out 2 entries before the beginning or at no time"));
    EXPECT_EQ(result.output, "1\n00:00:02,000 --> 00:00:03,500\nd\n\n");
}

TEST_F(ConvertCommand, PutsTimesThatRunBackwardsInOrder) {
    const std::string text = converted(keys(typed(9, "b") + typed(1, "a")), {"vtt", "--show-keys"});
    EXPECT_LT(text.find("\na\n"), text.find("\nb\n"));
}

TEST_F(ConvertCommand, GivesWhatIsWholeOfATornStream) {
    const ToolResult result = runTool({"convert", keys(typed(1, "ab") + "torn"), "--to", "srt"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("cannot be read from offset 56 on"));
    EXPECT_THAT(result.output, HasSubstr(s_bullet + s_bullet));
}

TEST_F(ConvertCommand, WritesAFileWholeOrNotAtAll) {
    const std::string file = keys(typed(1, "a"));
    const std::string output = folder / "out.srt";
    EXPECT_EQ(runTool({"convert", file, "--to", "srt", "-o", output}).exitCode, 0);
    EXPECT_EQ(contentsOf(output), converted(file, {"srt"}));
    EXPECT_EQ(runTool({"convert", file, "--to", "vtt", "-o", output}).exitCode, 1);
    EXPECT_EQ(runTool({"convert", file, "--to", "vtt", "-o", output, "--force"}).exitCode, 0);
    EXPECT_EQ(runTool({"convert", file, "--to", "vtt", "-o", file, "--force"}).exitCode, 1);
}

TEST_F(ConvertCommand, PutsNoFileInPlaceOfWhatIsNone) {
    const std::string file = keys(typed(1, "a"));
    const std::string pipe = folder / "pipe.srt";
    ASSERT_EQ(runProgram("mkfifo", {pipe}).exitCode, 0);
    for (const std::string& output : {pipe, folder.path().string()}) {
        const ToolResult result = runTool({"convert", file, "--to", "srt", "-o", output, "--force"});
        EXPECT_EQ(result.exitCode, 1);
        EXPECT_EQ(result.errors, "zulm: " + output + ": not a regular file; choose another output\n");
    }
    EXPECT_TRUE(std::filesystem::is_fifo(pipe));
}

TEST_F(ConvertCommand, TakesAHyphenForStandardOutput) {
    const std::string file = keys(typed(1, "a"));
    EXPECT_EQ(runTool({"convert", file, "--to", "srt", "-o", "-"}).output, converted(file, {"srt"}));
}

TEST_F(ConvertCommand, SaysWhatItCannotConvert) {
    const std::string file = write("names.mp4", media() + zulmAtom({appNameStream()}));
    const ToolResult none = runTool({"convert", file, "--to", "srt"});
    EXPECT_EQ(none.exitCode, 4);
    EXPECT_THAT(none.errors, HasSubstr("has no stream keyboardAction"));
    EXPECT_EQ(runTool({"convert", file, "--to", "mp3"}).exitCode, 2);
    EXPECT_EQ(runTool({"convert", file}).exitCode, 2);
    EXPECT_EQ(runTool({"convert", file, "--to", "srt", "--stream", "cpuUsage"}).exitCode, 2);
}

TEST_F(ConvertCommand, WritesSubtitlesThatFFmpegReads) {
    const std::string file = keys(typed(1, "a<b>{c}") + key(3, s_return) + typed(5, "x"));
    for (const char* format : {"srt", "vtt", "ass"}) {
        const std::string output = folder / (std::string("out.") + format);
        ASSERT_EQ(runTool({"convert", file, "--to", format, "--show-keys", "-o", output}).exitCode, 0);
        const ToolResult read = runProgram("ffmpeg", {"-v", "warning", "-i", output, "-map", "0", "-f", "srt", "-"});
        EXPECT_EQ(read.exitCode, 0);
        EXPECT_EQ(read.errors, "") << format;
        const std::string packets = runProgram("ffprobe", {"-v", "error", "-show_entries",
                                                           "packet=pts_time,duration_time", "-of", "csv=p=0", output})
                                        .output;
        EXPECT_EQ(packets, "1.000000,1.500000\n3.000000,1.500000\n5.000000,1.500000\n") << format;
    }
    const std::string text =
        runProgram("ffmpeg", {"-v", "error", "-i", folder / "out.ass", "-f", "webvtt", "-"}).output;
    EXPECT_THAT(text, HasSubstr("00:01.000 --> 00:02.500"));
}

TEST_F(ConvertCommand, WritesChaptersThatFFmpegPutsIntoAMovie) {
    const std::string chapters = folder / "chapters.txt";
    ASSERT_EQ(runTool({"convert", titles(textEntry(0, "One = #1; \\ \"q\"") + textEntry(1.25, "Zwei \xc3\xa4")), "--to",
                       "ffmetadata", "-o", chapters})
                  .exitCode,
              0);
    const std::string output = folder / "out.mp4";
    const ToolResult muxed =
        runProgram("ffmpeg", {"-v", "error", "-f", "lavfi", "-i", "color=size=16x16:rate=5:duration=7", "-i", chapters,
                              "-map", "0", "-map_metadata", "1", output});
    ASSERT_EQ(muxed.exitCode, 0) << muxed.errors;
    const Json found =
        Json::parse(runProgram("ffprobe", {"-v", "error", "-show_chapters", "-of", "json", output}).output);
    ASSERT_EQ(found["chapters"].size(), 2U);
    EXPECT_EQ(found["chapters"][0]["tags"]["title"], "One = #1; \\ \"q\"");
    EXPECT_EQ(found["chapters"][0]["end_time"], "1.250000");
    EXPECT_EQ(found["chapters"][1]["tags"]["title"], "Zwei \xc3\xa4");
    EXPECT_EQ(found["chapters"][1]["end_time"], "6.250000");
}

TEST_F(ConvertCommand, ConvertsARecordedSessionToEveryFormat) {
    for (const char* format : {"srt", "vtt", "ass", "ffmetadata", "chapters"})
        EXPECT_FALSE(converted(movie(), {format}).empty()) << format;
}

} // namespace
} // namespace ZULMetaData::Test
