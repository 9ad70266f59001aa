#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <cmath>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::json;
using testing::HasSubstr;
using testing::Not;

const std::string s_ellipsis = "\xe2\x80\xa6";

class RedactCommand : public RecordedSession {
protected:
    std::string write(const std::string& name, const std::string& contents) const {
        writeFile(folder / name, contents);
        return folder / name;
    }

    /// The copy's bytes, after `verify` found nothing wrong with it.
    std::string redacted(const std::string& file, std::vector<std::string> arguments) const {
        const std::string output = folder / ("out" + std::filesystem::path(file).extension().string());
        arguments.insert(arguments.begin(), {"redact", file, "-o", output, "--force"});
        const ToolResult result = runTool(arguments);
        EXPECT_EQ(result.exitCode, 0) << result.errors;
        const ToolResult verified = runTool({"verify", output});
        EXPECT_EQ(verified.exitCode, 0) << verified.output << verified.errors;
        return contentsOf(output);
    }
};

std::string keyStream() {
    return streamHeader("2b7b6af5", 1, 16) + f64(1) + le32(0x5ec3e700) + le32(0x20000) + f64(2) + le32(0x5ec3e701) +
           le32(0);
}

std::string clearedKeyStream() {
    const std::string cleared = le32(0) + le32(0);
    return streamHeader("2b7b6af5", 1, 16) + f64(1) + cleared + f64(2) + cleared;
}

std::string hiddenNames() {
    return streamHeader(s_appNames, 1, 0) + textEntry(0.5, "Abc") + textEntry(2.0, s_ellipsis);
}

/// The stream of locations, from what was in force at the end of a range on.
std::string carriedTo(double end, std::int32_t x, std::int32_t y) {
    return streamHeader(s_cursorLocations, 1, 16) + pointEntry(std::nextafter(end, 1e9), x, y);
}

TEST_F(RedactCommand, ClearsKeysInAMovie) {
    const std::string file = write("movie.mp4", media() + zulmAtom({keyStream(), locationStream()}));
    const std::string copy = redacted(file, {"--keys"});
    EXPECT_EQ(copy, media() + zulmAtom({locationStream(), clearedKeyStream()})) << "in the order of the identifiers";
    EXPECT_THAT(copy, Not(HasSubstr(le32(0x5ec3e700).substr(0, 4))));
}

TEST_F(RedactCommand, HidesTitlesInEveryContainer) {
    EXPECT_EQ(redacted(write("a.mov", media() + zulmAtom({appNameStream()})), {"--titles", "Not"}),
              media() + zulmAtom({hiddenNames()}));
    EXPECT_EQ(redacted(write("a.wav", riffMedia() + zulmChunk({appNameStream()})), {"--titles", "Not"}),
              riffMedia() + zulmChunk({hiddenNames()}));
    EXPECT_EQ(redacted(write("a.dat", appNameStream()), {"--titles", "(?i)nOT"}), hiddenNames());
}

TEST_F(RedactCommand, FindsTheStreamsAfterARIFFFileOf64BitSizes) {
    const std::string body = chunk("data", "12345678");
    const std::string sizes = le32(28) + le64(4 + 8 + 28 + body.size()) + le64(8) + le64(0) + le32(0);
    const std::string wave = "RF64" + le32(0xffffffff) + "WAVE" + "ds64" + sizes + body;
    EXPECT_EQ(redacted(write("wide.wav", wave + zulmChunk({appNameStream()})), {"--titles", "Not"}),
              wave + zulmChunk({hiddenNames()}));
}

TEST_F(RedactCommand, LeavesNothingOfTheHiddenTextsInARecording) {
    const Json texts = Json::parse(runTool({"grep", ".", movie(), "--json"}).output)["files"][0]["matches"];
    ASSERT_FALSE(texts.empty());
    const std::string copy = redacted(movie(), {"--titles", ".", "--keys", "--stream", "systemData"});
    for (const Json& match : texts)
        EXPECT_THAT(copy, Not(HasSubstr(match["text"].get<std::string>())));
    EXPECT_THAT(copy, Not(HasSubstr("ProcessorCount")));
    EXPECT_THAT(copy, HasSubstr("ZULR"));
    EXPECT_THAT(copy, HasSubstr("pictures and sound"));
    EXPECT_EQ(runTool({"convert", folder / "out.mp4", "--to", "srt", "--show-keys"}).output.find("[returnKey]"),
              std::string::npos);
}

TEST_F(RedactCommand, ChangesNothingElse) {
    redacted(movie(), {"--stream", "systemData"});
    const ToolResult result = runTool({"diff", movie(), folder / "out.mp4"});
    EXPECT_EQ(result.output, "systemData: only in " + movie() + "\n");
}

TEST_F(RedactCommand, RemovesStreamsAndTimes) {
    const std::string file = write("movie.mp4", media() + zulmAtom({locationStream(), appNameStream()}));
    EXPECT_EQ(redacted(file, {"--stream", "topmostAppName"}), media() + zulmAtom({locationStream()}));
    const std::string late = streamHeader(s_cursorLocations, 1, 16) + pointEntry(1.0, -3, 7);
    const std::string lateNames = streamHeader(s_appNames, 1, 0) + textEntry(2.0, "Notes");
    EXPECT_EQ(redacted(file, {"--range", ":1"}), media() + zulmAtom({lateNames, carriedTo(1, -3, 7)}));
    const std::string carried = carriedTo(0.75, 10, 20) + pointEntry(1.0, -3, 7);
    EXPECT_EQ(redacted(file, {"--range", ":0.75"}), media() + zulmAtom({lateNames, carried}));
    EXPECT_EQ(redacted(file, {"--range", "0.5:0.75"}), media() + zulmAtom({lateNames, carried}));
    const std::string early = streamHeader(s_cursorLocations, 1, 16) + pointEntry(0.5, 10, 20);
    const std::string earlyNames = streamHeader(s_appNames, 1, 0) + textEntry(0.5, s_ellipsis);
    EXPECT_EQ(redacted(file, {"--range", "0.75:"}), media() + zulmAtom({earlyNames, early}));
}

TEST_F(RedactCommand, TakesRangesTitlesAndKindsMoreThanOnce) {
    const std::string names = streamHeader(s_appNames, 1, 0);
    const std::string scrolls = streamHeader("2b7b6a05", 1, 16);
    const std::string file = write(
        "movie.mp4", media() + zulmAtom({scrolls + pointEntry(1, 0, 1) + pointEntry(2, 0, 2) + pointEntry(62, 0, 3),
                                         locationStream(), appNameStream()}));
    EXPECT_EQ(redacted(file, {"--range", "0.75:1.5", "--range", "61..63", "--keep-only", "scrollAction"}),
              media() + zulmAtom({scrolls + pointEntry(2, 0, 2)}));
    EXPECT_EQ(
        redacted(file, {"--titles", "^A", "--titles", "^N", "--stream", "scrollAction", "--stream", "cursorLocation"}),
        media() + zulmAtom({names + textEntry(0.5, s_ellipsis) + textEntry(2, s_ellipsis)}));
    EXPECT_EQ(redacted(file, {"--keep-only", "scrollAction", "--keep-only", "topmostAppName"}),
              media() + zulmAtom({scrolls + pointEntry(1, 0, 1) + pointEntry(2, 0, 2) + pointEntry(62, 0, 3),
                                  appNameStream()}));
}

TEST_F(RedactCommand, TakesFileAfterAnyOption) {
    const std::string file = write("movie.mp4", media() + zulmAtom({locationStream(), appNameStream()}));
    for (const std::vector<std::string>& options : {std::vector<std::string>{"--stream", "topmostAppName"},
                                                    {"--keep-only", "cursorLocation"},
                                                    {"--titles", "Not"},
                                                    {"--range", "5:"}}) {
        std::vector<std::string> arguments{"redact", "-o", folder / "out.mp4", "--force"};
        arguments.insert(arguments.end(), options.begin(), options.end());
        arguments.push_back(file);
        EXPECT_EQ(runTool(arguments).exitCode, 0) << options.front();
    }
}

TEST_F(RedactCommand, HidesATextOfTheRangeInEveryStream) {
    const std::string titles = streamHeader("2b7b6a07", 1, 0);
    const std::string file =
        write("movie.mp4", media() + zulmAtom({appNameStream(), titles + textEntry(0, "Notes") + textEntry(1, "Abc")}));
    EXPECT_EQ(redacted(file, {"--range", "3:4"}),
              media() + zulmAtom({hiddenNames().substr(0, 24) + textEntry(0.5, s_ellipsis) + textEntry(2, s_ellipsis),
                                  titles + textEntry(0, s_ellipsis) + textEntry(1, s_ellipsis)}));
}

TEST_F(RedactCommand, FindsTitlesInEveryNormalForm) {
    const std::string names = streamHeader(s_appNames, 1, 0);
    const std::string apart = write("movie.mp4", media() + zulmAtom({names + textEntry(1, "Cafe\xcc\x81")}));
    EXPECT_EQ(redacted(apart, {"--titles", "Caf\xc3\xa9"}), media() + zulmAtom({names + textEntry(1, s_ellipsis)}));
}

TEST_F(RedactCommand, LeavesNoMetadataWhereAllOfItGoes) {
    const std::string file = write("movie.mp4", media() + zulmAtom({appNameStream()}));
    const ToolResult result = runTool({"redact", file, "-o", folder / "out.mp4", "--stream", "topmostAppName"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(contentsOf(folder / "out.mp4"), media());
    const std::string stream = write("a.dat", appNameStream());
    EXPECT_EQ(runTool({"redact", stream, "-o", folder / "b.dat", "--stream", "topmostAppName"}).exitCode, 1);
    EXPECT_FALSE(std::filesystem::exists(folder / "b.dat"));
}

TEST_F(RedactCommand, KeepsTheMediaInItsPlace) {
    const std::string before = zulmAtom({appNameStream()});
    const std::string file = write("movie.mp4", before + media() + before);
    const std::string copy = redacted(file, {"--titles", "Not"});
    EXPECT_EQ(copy, atom("free", std::string(before.size() - 8, '\0')) + media() + zulmAtom({hiddenNames()}));
    const std::string old = zulmChunk({appNameStream()});
    const std::string sound = write("sound.avi", riffMedia() + old + ZULMetaData::Test::chunk("IDXX", "odd"));
    EXPECT_EQ(redacted(sound, {"--titles", "Not"}),
              riffMedia() + ZULMetaData::Test::chunk("JUNK", std::string(old.size() - 8, '\0')) +
                  ZULMetaData::Test::chunk("IDXX", "odd") + zulmChunk({hiddenNames()}));
}

TEST_F(RedactCommand, PadsOddChunks) {
    const std::string odd = streamHeader(s_appNames, 1, 0) + textEntry(1, "a");
    const std::string file = write("sound.wav", chunk("RIFF", "odd") + zulmChunk({odd, odd + textEntry(2, "bc")}));
    EXPECT_EQ(redacted(file, {"--keys"}), chunk("RIFF", "odd") + zulmChunk({odd + textEntry(2, "bc")}));
}

TEST_F(RedactCommand, KeepsRecordingInfo) {
    const std::string info = extendedAtom("ZULR", std::string(64, '\x01'));
    const std::string file = write("movie.mp4", media() + zulmAtom({appNameStream()}) + info);
    EXPECT_EQ(redacted(file, {"--titles", "Not"}), media() + info + zulmAtom({hiddenNames()}));
}

TEST_F(RedactCommand, DropsATornTailAndSaysSo) {
    const std::string file = write("torn.dat", appNameStream() + "secret tail");
    const ToolResult result = runTool({"redact", file, "-o", folder / "out.dat", "--keys"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("topmostAppName: left out 11 bytes after its last whole entry"));
    EXPECT_EQ(contentsOf(folder / "out.dat"), appNameStream());
    EXPECT_EQ(runTool({"verify", folder / "out.dat"}).exitCode, 0);
}

TEST_F(RedactCommand, DropsStreamsThatReadersDoNotFind) {
    const std::string torn = be32(1) + "DATA" + be64(16 + 56 + 5) + locationStream();
    const std::string file =
        write("torn.mp4", media() + extendedAtom("ZULM", torn + extendedAtom("DATA", appNameStream())));
    const ToolResult result = runTool({"redact", file, "-o", folder / "out.mp4", "--keys"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("left out 1 streams that readers do not find; 'zulm salvage"));
    EXPECT_EQ(contentsOf(folder / "out.mp4"), media() + zulmAtom({locationStream()}));
}

TEST_F(RedactCommand, RemovesUnknownStreamsThatItCannotLookInto) {
    const std::string unknown = streamHeader("deadbeef", 1, 12) + f64(1) + raw(2);
    const std::string file = write("movie.mp4", media() + zulmAtom({appNameStream(), unknown}));
    const ToolResult result = runTool({"redact", file, "-o", folder / "out.mp4", "--titles", "Not"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("removed: its entries cannot be looked into"));
    EXPECT_EQ(contentsOf(folder / "out.mp4"), media() + zulmAtom({hiddenNames()}));
}

TEST_F(RedactCommand, RefusesMetadataThatWouldStayOutsideOfItsPlace) {
    const std::string file = write("movie.mp4", atom("mdat", "xx" + appNameStream()) + zulmAtom({locationStream()}));
    const ToolResult result = runTool({"redact", file, "-o", folder / "out.mp4", "--titles", "Not"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("topmostAppName at offset 10 is outside of the metadata"));
    EXPECT_FALSE(std::filesystem::exists(folder / "out.mp4"));
}

TEST_F(RedactCommand, RefusesADamagedContainer) {
    const std::string open = media() + zulmAtom({appNameStream()}) + be32(0) + "mdat" + "rest";
    const ToolResult result = runTool({"redact", write("open.mp4", open), "-o", folder / "out.mp4", "--keys"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("'zulm repair"));
    const std::string cut = write("cut.wav", riffMedia() + zulmChunk({appNameStream()}) + "RIFF" + le32(99));
    EXPECT_EQ(runTool({"redact", cut, "-o", folder / "out.wav", "--keys"}).exitCode, 1);
    EXPECT_FALSE(std::filesystem::exists(folder / "out.mp4"));
    EXPECT_FALSE(std::filesystem::exists(folder / "out.wav"));
}

TEST_F(RedactCommand, KeepsTheHolesOfALargeMovie) {
    const std::uint64_t size = 5ULL << 30;
    const std::string file = folder / "large.mp4";
    writeSparseFile(file, size, atom("ftyp", "mp42") + be32(1) + "mdat" + be64(size - 12));
    writeFile(folder / "names.dat", appNameStream());
    ZULMAtomWriter().writeMetaDataFiles({folder / "names.dat"}, file);
    const ToolResult result = runTool({"redact", file, "-o", folder / "out.mp4", "--titles", "Not"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(std::filesystem::file_size(folder / "out.mp4"), size + zulmAtom({hiddenNames()}).size());
    EXPECT_EQ(runTool({"extract", folder / "out.mp4", "-o", folder / "out"}).exitCode, 0);
    EXPECT_EQ(contentsOf(folder / "out/topmostAppName.dat"), hiddenNames());
    EXPECT_LT(std::stoull(outputOf("du -k " + (folder / "out.mp4"))), 10000U) << "kilobytes on the disk";
}

TEST_F(RedactCommand, RefusesWhatItCannotMean) {
    const std::string output = folder / "out.mp4";
    EXPECT_EQ(runTool({"redact", movie(), "-o", output}).exitCode, 2);
    for (const char* range : {"5", ":", "a:b", "5:4", "nan:1", "1:2:3", "1x:2"})
        EXPECT_EQ(runTool({"redact", movie(), "-o", output, "--range", range}).exitCode, 2) << range;
    EXPECT_EQ(runTool({"redact", movie(), "-o", output, "--titles", "("}).exitCode, 2);
    EXPECT_EQ(runTool({"redact", movie(), "-o", output, "--stream", "nonsense"}).exitCode, 2);
    EXPECT_EQ(runTool({"redact", movie(), "-o", folder / "out.wav", "--keys"}).exitCode, 1);
    EXPECT_EQ(runTool({"redact", movie(), "-o", movie(), "--force", "--keys"}).exitCode, 1);
    EXPECT_EQ(runTool({"redact", write("none.mp4", media()), "-o", output, "--keys"}).exitCode, 4);
    EXPECT_FALSE(std::filesystem::exists(output));
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(folder.path()), {}), 1) << "nothing is left behind";
}

/// A movie of two seconds with two chapters, a title, a comment and a named track, and with metadata.
class RedactRealMovie : public RedactCommand {
protected:
    void SetUp() override {
        const std::string tags = write("tags.txt", ";FFMETADATA1\ntitle=Salary Movie\ncomment=by Bob\n"
                                                   "[CHAPTER]\nTIMEBASE=1/1000\nSTART=0\nEND=1000\ntitle=Salary List\n"
                                                   "[CHAPTER]\nTIMEBASE=1/1000\nSTART=1000\nEND=2000\ntitle=Mail\n");
        for (const std::string name : {"real.mp4", "real.mov", "real.avi"}) {
            outputOf("ffmpeg -v error -y -f lavfi -i testsrc=size=64x48:rate=10:duration=2 -f lavfi -i sine=duration=2 "
                     "-i " +
                     tags + " -map_metadata 2 -metadata:s:v handler_name='Salary Track' -c:v mpeg4 -c:a pcm_s16le " +
                     (name == "real.mp4" ? "-c:a aac " : "") + (folder / name));
        }
        const std::string titles = streamHeader("2b7b6a07", 1, 0) + textEntry(0, "Mail") + textEntry(1, "Salary List");
        for (const std::string name : {"real.mp4", "real.mov"})
            write(name, contentsOf(folder / name) + zulmAtom({titles}));
        write("real.avi", contentsOf(folder / "real.avi") + zulmChunk({titles}));
    }

    static std::string packetsOf(const std::string& file) {
        return outputOf("ffmpeg -v error -i " + file + " -map 0:v -map 0:a -c copy -f streamhash -");
    }

    static std::string picturesOf(const std::string& file) {
        return outputOf("ffmpeg -v error -i " + file + " -map 0:v -map 0:a -f framemd5 -");
    }
};

TEST_F(RedactRealMovie, RefusesWhatItsChaptersAndTagsTell) {
    for (const std::string name : {"real.mp4", "real.mov", "real.avi"}) {
        const std::string output = folder / ("out" + name);
        const ToolResult result = runTool({"redact", folder / name, "-o", output, "--titles", "Salary"});
        EXPECT_EQ(result.exitCode, 1) << name;
        EXPECT_THAT(result.errors, HasSubstr("texts that are to go are in the movie too: "));
        EXPECT_THAT(result.errors, HasSubstr("add --chapters"));
        EXPECT_FALSE(std::filesystem::exists(output));
        EXPECT_EQ(runTool({"redact", folder / name, "-o", output, "--stream", "topmostWindowTitle"}).exitCode,
                  name == "real.avi" ? 0 : 1)
            << "an AVI file has no chapters";
    }
}

TEST_F(RedactRealMovie, RemovesChaptersAndTagsAndStillPlays) {
    for (const std::string name : {"real.mp4", "real.mov", "real.avi"}) {
        const std::string copy = redacted(folder / name, {"--titles", "Salary", "--chapters"});
        for (const char* secret : {"Salary", "by Bob"})
            EXPECT_THAT(copy, Not(HasSubstr(secret))) << name;
        const std::string output = folder / ("out" + std::filesystem::path(name).extension().string());
        const std::string shown = outputOf("ffprobe -v error -show_chapters -show_format -show_streams " + output);
        EXPECT_THAT(shown, Not(HasSubstr("CHAPTER")));
        EXPECT_THAT(shown, Not(HasSubstr("title")));
        EXPECT_THAT(shown, Not(HasSubstr("codec_type=data")));
        EXPECT_THAT(outputOf("exiftool -s " + output), Not(HasSubstr("Salary")));
        EXPECT_EQ(packetsOf(output), packetsOf(folder / name));
        EXPECT_EQ(picturesOf(output), picturesOf(folder / name));
    }
}

TEST_F(RedactCommand, RemovesTheCreator) {
    const std::string file =
        write("movie.mp4", media() + recordingInfo("Mac", "4.2.17", "10.15.7") + zulmAtom({keyStream()}));
    EXPECT_EQ(redacted(file, {"--creator"}), media() + recordingInfo("Mac", "", "") + zulmAtom({keyStream()}));
}

TEST_F(RedactCommand, BlanksUnknownAtoms) {
    const std::string file = write("movie.mp4", media() + atom("abcd", "secret") + zulmAtom({keyStream()}));
    EXPECT_EQ(redacted(file, {"--keys"}), media() + atom("abcd", "secret") + zulmAtom({clearedKeyStream()}));
    EXPECT_EQ(redacted(file, {"--blank-unknown"}),
              media() + atom("free", std::string(6, '\0')) + zulmAtom({keyStream()}));
}

TEST_F(RedactCommand, WritesNothingIfTheCopyHoldsWhatWasToGo) {
    const std::string names = streamHeader(s_appNames, 1, 0) + textEntry(1, "Salary of March");
    const std::string file = write("movie.mp4", atom("mdat", "xx"
                                                             "Salary of March") +
                                                    zulmAtom({names}));
    const ToolResult result = runTool({"redact", file, "-o", folder / "out.mp4", "--titles", "Salary"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("the copy still holds a text that was to go, in mdat at offset 10"));
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(folder.path()), {}), 1) << "nothing is left behind";
}

TEST_F(RedactCommand, ListsWhatWouldGo) {
    const std::string file = write("movie.mp4", media() + recordingInfo("Mac", "4.2", "1.2") +
                                                    zulmAtom({keyStream(), appNameStream(), locationStream()}));
    const std::vector<std::string> options{"redact", file,       "--dry-run",      "--range",
                                           "1:1.5",  "--stream", "keyboardAction", "--creator"};
    const ToolResult result = runTool(options);
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.output, HasSubstr("topmostAppName           changed      0.500000  name=\"Abc\"\n"));
    EXPECT_THAT(result.output, HasSubstr("cursorLocation           removed      1.000000  x=-3  y=7\n"));
    EXPECT_THAT(result.output, HasSubstr("cursorLocation           added      1.500000\n"));
    EXPECT_THAT(result.output, HasSubstr("keyboardAction           removed      2.000000  characterCode="));
    EXPECT_THAT(result.output, HasSubstr("ZULR                     removed: 80 bytes at offset 30 (creator)\n"));
    std::vector<std::string> asJSON = options;
    asJSON.emplace_back("--json");
    const Json document = Json::parse(runTool(asJSON).output)["files"][0];
    EXPECT_EQ(document["dry_run"], true);
    EXPECT_EQ(document["entries"].size(), 5U);
    EXPECT_EQ(document["entries"][0]["stream"], "topmostAppName");
    EXPECT_EQ(document["entries"][0]["change"], "changed");
    EXPECT_EQ(document["places"][0]["reason"], "creator");
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(folder.path()), {}), 1) << "nothing is written";
    EXPECT_EQ(runTool({"redact", file, "--keys"}).exitCode, 2) << "neither --output nor --dry-run";
}

TEST_F(RedactCommand, ReportsAsJSON) {
    const std::string file = write("movie.mp4", media() + zulmAtom({keyStream(), appNameStream()}));
    const ToolResult result =
        runTool({"redact", file, "-o", folder / "out.mp4", "--keys", "--stream", "topmostAppName", "--json"});
    const Json streams = Json::parse(result.output)["files"][0]["streams"];
    EXPECT_EQ(streams[0]["kind"], "topmostAppName");
    EXPECT_EQ(streams[0]["removed"], true);
    EXPECT_EQ(streams[1]["entries_changed"], 2);
}

} // namespace
} // namespace ZULMetaData::Test
