// Putting streams into movies from the command line. Runs ffmpeg(1).

#include "Tests/Support/Bytes.h"
#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/ZULMetaData.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <filesystem>
#include <map>

namespace ZULMetaData::Test {

namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

class AttachCommand : public RecordedSession {
protected:
    void SetUp() override { writeFile(plain, tinyMovie()); }

    static std::map<uuid, std::string> streamsIn(const std::string& path) {
        std::map<uuid, std::string> streams;
        if (const auto parser = MetaDataParser::create(path))
            parser->loadAllData(streams);
        return streams;
    }

    static std::string dumpOf(const std::string& path) {
        const ToolResult result = runTool({"dump", "--format", "ndjson", path});
        EXPECT_EQ(result.exitCode, 0) << result.errors;
        return result.output;
    }

    std::string stream(const std::string& name, const std::string& bytes) const {
        writeFile(folder / name, bytes);
        return folder / name;
    }

    /// A movie that players play.
    std::string realMovie(const std::string& name) const {
        outputOf("ffmpeg -v error -f lavfi -i testsrc2=size=64x64:rate=10 -f lavfi -i sine -t 1 -c:v mpeg4 -c:a aac " +
                 (folder / name));
        return folder / name;
    }

    const std::string plain = folder / "Plain.mp4";
    const std::string out = folder / "Out.mp4";
};

TEST_F(AttachCommand, WritesACopyThatHoldsEveryStream) {
    std::vector<std::string> arguments{"attach", plain};
    arguments.insert(arguments.end(), streamFiles().begin(), streamFiles().end());
    arguments.insert(arguments.end(), {"-o", out});
    const ToolResult result = runTool(arguments);
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.output, HasSubstr(out + ": 17 streams attached\n"));
    EXPECT_THAT(result.output, HasSubstr("cursorLocation"));
    EXPECT_EQ(result.errors, "");
    EXPECT_EQ(streamsIn(out), streamsIn(movie()));
    EXPECT_EQ(contentsOf(plain), tinyMovie());
}

TEST_F(AttachCommand, ChangesTheMovieWhereItIsToldTo) {
    const ToolResult result = runTool({"attach", plain, streamFile("cursorLocation"), "--in-place"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(contentsOf(plain), tinyMovie() + zulmAtom({contentsOf(streamFile("cursorLocation"))}));
}

TEST_F(AttachCommand, WantsToKnowWhichFileIsWritten) {
    const ToolResult neither = runTool({"attach", plain, streamFile("cursorLocation")});
    EXPECT_EQ(neither.exitCode, 2);
    EXPECT_THAT(neither.errors, HasSubstr("either -o OUT, which writes a changed copy, or --in-place"));
    EXPECT_EQ(runTool({"attach", plain, streamFile("cpuUsage"), "-o", out, "--in-place"}).exitCode, 2);
    EXPECT_EQ(runTool({"attach", plain, streamFile("cpuUsage"), "--force", "--in-place"}).exitCode, 2);
    const ToolResult nothing = runTool({"attach", plain, "--in-place"});
    EXPECT_EQ(nothing.exitCode, 2);
    EXPECT_THAT(nothing.errors, HasSubstr("at least one STREAM, or --from OLDMOVIE"));
    EXPECT_EQ(contentsOf(plain), tinyMovie());
    EXPECT_FALSE(std::filesystem::exists(out));
}

TEST_F(AttachCommand, ReportsAsJSON) {
    const std::string torn = stream("torn.dat", appNameStream() + "torn");
    const std::string open = stream("Open.mp4", be32(0) + "mdat" + "0123456789");
    const ToolResult result = runTool({"attach", open, torn, "-o", out, "--json"});
    EXPECT_EQ(result.exitCode, 3);
    const auto file = nlohmann::json::parse(result.output).at("files").at(0);
    EXPECT_EQ(file.at("path"), open);
    EXPECT_EQ(file.at("output"), out);
    EXPECT_EQ(file.at("repair").at("changes").at(0).at("offset"), 0);
    EXPECT_EQ(file.at("repair").at("changes").at(0).at("before"), "00000000");
    EXPECT_EQ(file.at("repair").at("changes").at(0).at("after"), "00000012");
    const auto attached = file.at("streams").at(0);
    EXPECT_EQ(attached.at("kind"), "topmostAppName");
    EXPECT_EQ(attached.at("uuid"), "2b7b6a06-7a1f-11e2-83d0-0017f200be7f");
    EXPECT_EQ(attached.at("offset"), 18 + 32);
    EXPECT_EQ(attached.at("bytes"), 56);
    EXPECT_EQ(attached.at("entries"), 2);
    EXPECT_EQ(attached.at("bytes_cut"), 4);
    EXPECT_EQ(attached.at("cut_because"), "an entry is cut short");
}

// Loss ------------------------------------------------------------------------------------------------------------

TEST_F(AttachCommand, CutsTornTailsOffAndSaysSo) {
    const std::string torn = stream("torn.dat", locationStream() + "torn!");
    const ToolResult result = runTool({"attach", plain, torn, streamFile("cpuUsage"), "-o", out});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr(torn + ": cursorLocation left out 5 bytes from offset 56 of the stream on: "
                                                "an entry is cut short"));
    EXPECT_EQ(streamsIn(out)[kind(s_cursorLocations)], locationStream());
    EXPECT_EQ(streamsIn(out).size(), 2U);
    EXPECT_EQ(contentsOf(torn), locationStream() + "torn!");
}

TEST_F(AttachCommand, TakesWhatIsWholeOfHostileStreams) {
    const std::map<std::string, std::string> hostile{
        {"an entry of size 0", streamHeader(s_appNames, 1, 0) + le32(0) + std::string(100, '\0')},
        {"a huge entry", streamHeader(s_appNames, 1, 0) + le32(0xffffffff) + "x"},
        {"huge entries", streamHeader(s_appNames, 1, 0xffffffff) + "x"},
    };
    for (const auto& [what, bytes] : hostile) {
        SCOPED_TRACE(what);
        const ToolResult result =
            runTool({"attach", plain, stream("a.dat", bytes), "-o", out, "--force", "--unchecked"});
        EXPECT_EQ(result.exitCode, 3) << result.errors;
        EXPECT_EQ(contentsOf(out), tinyMovie() + zulmAtom({bytes.substr(0, 24)}));
    }
}

TEST_F(AttachCommand, RefusesFilesThatAreNoStreams) {
    for (const std::size_t length : {1U, 23U}) {
        const ToolResult result = runTool({"attach", plain, stream("a.dat", std::string(length, 'x')), "-o", out});
        EXPECT_EQ(result.exitCode, 1);
        EXPECT_THAT(result.errors, HasSubstr("a.dat: too short for a stream"));
    }
    EXPECT_THAT(runTool({"attach", plain, movie(), "-o", out}).errors, HasSubstr("'--from " + movie() + "'"));
    EXPECT_THAT(runTool({"attach", plain, stream("a.txt", ""), "-o", out}).errors, Not(HasSubstr("--from")));
    EXPECT_EQ(runTool({"attach", plain, folder / "missing.dat", "-o", out}).exitCode, 1);
    EXPECT_EQ(runTool({"attach", plain, folder.path(), "-o", out}).exitCode, 1);
    EXPECT_FALSE(std::filesystem::exists(out));
}

TEST_F(AttachCommand, ExaminesTheStreamsBeforeItCopiesTheMovie) {
    const std::string large = folder / "Large.mp4"; // larger than what may be written
    writeFile(large,
              tinyMovie() + zulmAtom({locationStream()}) + be32((1 << 20) + 8) + "mdat" + std::string(1 << 20, 'm'));
    const std::map<std::string, std::string> refused{
        {stream("short.dat", "x"),
         "short.dat: too short for a stream: 1 bytes of a 24-byte header; nothing was written"},
        {stream("same.dat", locationStream()),
         large +
             ": has a stream of the kind cursorLocation already, at offset 198; --replace adds one that readers take "
             "instead; nothing was written"}};
    for (const auto& [file, message] : refused) {
        const ToolResult result =
            runProgram("sh", {"-c", "ulimit -f 100; exec \"$0\" \"$@\"", ZULM_PATH, "attach", large, file, "-o", out});
        EXPECT_EQ(result.exitCode, 1);
        EXPECT_THAT(result.errors, HasSubstr(message));
    }
    EXPECT_FALSE(std::filesystem::exists(out));
}

TEST_F(AttachCommand, RefusesWhatIsNoStreamOfAKnownKindUnlessItIsAskedFor) {
    const std::map<std::string, std::string> doubtful{
        {std::string(16, 'u') + le32(1) + le32(4) + "data",
         "is no stream of a known kind: its header begins with the identifier 75757575-7575-7575-7575-757575757575"},
        {streamHeader(s_cursorLocations, 9, 16) + pointEntry(0.5, 1, 2),
         "is a stream of the kind cursorLocation in version 9, which is not known: the last known one is 1"},
        {locationStream().substr(0, 30), "has 6 bytes after its header, but not one whole entry"},
    };
    for (const auto& [bytes, message] : doubtful) {
        SCOPED_TRACE(message);
        const std::string file = stream("a.dat", bytes);
        const ToolResult result = runTool({"attach", plain, file, "-o", out});
        EXPECT_EQ(result.exitCode, 1);
        EXPECT_THAT(result.errors, HasSubstr(file + ": " + message));
        EXPECT_THAT(result.errors, HasSubstr("; --unchecked attaches it as it is; nothing was written"));
        EXPECT_FALSE(std::filesystem::exists(out));
        EXPECT_THAT(runTool({"attach", plain, file, "-o", out, "--unchecked"}).exitCode, testing::AnyOf(0, 3));
        EXPECT_EQ(streamsIn(out).size(), 1U);
        std::filesystem::remove(out);
    }
    EXPECT_EQ(runTool({"attach", plain, stream("a.dat", locationStream().substr(0, 24)), "-o", out}).exitCode, 0);
}

TEST_F(AttachCommand, CarriesUnknownStreamsOfAnotherMovieOver) {
    const std::string unknown = std::string(16, 'u') + le32(1) + le32(4) + "data";
    const std::string old = stream("Old.mp4", media() + zulmAtom({unknown}));
    EXPECT_EQ(runTool({"attach", plain, "--from", old, "-o", out}).exitCode, 0);
    EXPECT_EQ(streamsIn(out).size(), 1U);
}

TEST_F(AttachCommand, LeavesEmptyStreamFilesOutAndSaysSo) {
    const std::string empty = stream("empty.dat", "");
    const ToolResult result = runTool({"attach", plain, empty, stream("a.dat", locationStream()), "-o", out, "--json"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr(empty + ": is empty, as nothing was recorded into it; it was left out"));
    EXPECT_EQ(nlohmann::json::parse(result.output).at("files").at(0).at("left_out").at(0), empty);
    EXPECT_EQ(contentsOf(out), tinyMovie() + zulmAtom({locationStream()}));
    const ToolResult alone = runTool({"attach", plain, empty, "-o", folder / "None.mp4"});
    EXPECT_EQ(alone.exitCode, 3);
    EXPECT_THAT(alone.errors, HasSubstr("there is no stream to attach; nothing was written"));
    EXPECT_FALSE(std::filesystem::exists(folder / "None.mp4"));
}

TEST_F(AttachCommand, RefusesASecondStreamOfAKindUnlessItMayReplace) {
    const std::string newer = stream("newer.dat", locationStream());
    const std::string both = copyOf(movie());
    const ToolResult result = runTool({"attach", both, newer, "--in-place"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("has a stream of the kind cursorLocation already"));
    EXPECT_THAT(result.errors, HasSubstr("--replace"));
    EXPECT_EQ(contentsOf(both), contentsOf(movie()));
    EXPECT_EQ(runTool({"attach", both, newer, "--in-place", "--replace"}).exitCode, 0);
    EXPECT_EQ(streamsIn(both)[kind(s_cursorLocations)], locationStream());
    EXPECT_EQ(streamsIn(both).size(), 17U);
    const ToolResult twice = runTool({"attach", plain, newer, streamFile("cursorLocation"), "--in-place", "--replace"});
    EXPECT_EQ(twice.exitCode, 1);
    EXPECT_THAT(twice.errors, HasSubstr("a second stream of the kind cursorLocation"));
}

// From another movie ----------------------------------------------------------------------------------------------

TEST_F(AttachCommand, BringsBackWhatARemuxDrops) {
    const std::string recording = realMovie("Recording.mp4");
    ASSERT_EQ(runTool({"attach", recording, "--from", movie(), "--in-place"}).exitCode, 0);
    ASSERT_EQ(streamsIn(recording).size(), 17U);
    const std::string remuxed = folder / "Remuxed.mp4";
    outputOf("ffmpeg -v error -i " + recording + " -map 0 -c copy " + remuxed);
    EXPECT_THAT(streamsIn(remuxed), IsEmpty()) << "a remux drops atoms that it does not know";
    const ToolResult result = runTool({"attach", remuxed, "--from", recording, "-o", out});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(dumpOf(out), dumpOf(recording));
    EXPECT_THAT(dumpOf(out), Not(IsEmpty()));
    const std::string packets = "ffmpeg -v error -map 0 -c copy -f streamhash - -i ";
    EXPECT_EQ(outputOf(packets + out), outputOf(packets + recording));
}

TEST_F(AttachCommand, CarriesStreamsOverFromRIFF) {
    const std::string riff = stream("old.avi", riffMedia() + zulmChunk({locationStream(), scaleStream(2) + "x"}));
    const ToolResult result = runTool({"attach", plain, "--from", riff, "-o", out});
    EXPECT_EQ(result.exitCode, 3) << "the odd byte is no entry";
    EXPECT_THAT(result.errors, Not(HasSubstr("salvage")));
    EXPECT_EQ(contentsOf(out), tinyMovie() + zulmAtom({locationStream(), scaleStream(2)}));
}

TEST_F(AttachCommand, TakesAStreamFileBesideAnotherMovieAndInPlaceOfItsStreamWhereItMayReplace) {
    const std::string old = stream("Old.mp4", media() + zulmAtom({appNameStream()}));
    ASSERT_EQ(runTool({"attach", plain, streamFile("cpuUsage"), "--from", old, "-o", out}).exitCode, 0);
    EXPECT_EQ(streamsIn(out).size(), 2U);
    const std::string newer = stream("newer.dat", streamHeader(s_appNames, 1, 0) + textEntry(0, "New"));
    EXPECT_EQ(runTool({"attach", plain, newer, "--from", old, "-o", out, "--force"}).exitCode, 1);
    EXPECT_EQ(runTool({"attach", plain, newer, "--from", old, "-o", out, "--force", "--replace"}).exitCode, 0);
    EXPECT_EQ(contentsOf(out), tinyMovie() + zulmAtom({contentsOf(newer)}));
}

TEST_F(AttachCommand, EndsWithFourWhereThereIsNothingToCarryOver) {
    const ToolResult result = runTool({"attach", plain, "--from", stream("Old.mp4", media()), "-o", out});
    EXPECT_EQ(result.exitCode, 4);
    EXPECT_THAT(result.errors, HasSubstr("no recording metadata in it; nothing was written"));
    EXPECT_FALSE(std::filesystem::exists(out));
}

TEST_F(AttachCommand, SaysWhereTheOldMovieHidesStreams) {
    const std::string old = stream("Old.mp4", media());
    MP4MetaData::appendMetaDataFiles(old, {stream("a.dat", locationStream() + "torn"), streamFile("cpuUsage")});
    const ToolResult result = runTool({"attach", plain, "--from", old, "-o", out});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("its metadata cannot be walked to the end; 'zulm salvage " + old));
    EXPECT_EQ(contentsOf(out), tinyMovie() + zulmAtom({locationStream()}));
}

TEST_F(AttachCommand, SaysWhereTheOldMovieIsCutShort) {
    const std::string whole = media() + zulmAtom({locationStream()});
    const ToolResult result =
        runTool({"attach", plain, "--from", stream("Old.mp4", whole.substr(0, whole.size() - 9)), "-o", out});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("cursorLocation at offset 62 declares 56 bytes, 47 of which are there"));
    EXPECT_EQ(contentsOf(out), tinyMovie() + zulmAtom({locationStream().substr(0, 40)}));
}

TEST_F(AttachCommand, SurvivesOldMoviesWithHostileSizes) {
    for (const std::uint64_t size : s_hostileSizes) {
        const std::string children = be32(1) + "DATA" + be64(size) + locationStream();
        const std::string old = stream("Old.mp4", media() + extendedAtom("ZULM", children));
        const ToolResult result = runTool({"attach", plain, "--from", old, "-o", out, "--force"});
        EXPECT_THAT(result.exitCode, testing::AnyOf(0, 3, 4)) << size << '\n' << result.errors;
        for (const auto& [type, bytes] : streamsIn(out))
            EXPECT_TRUE(locationStream().starts_with(bytes)) << size;
        std::filesystem::remove(out);
    }
}

// Movies by their contents -----------------------------------------------------------------------------------------

TEST_F(AttachCommand, TakesMoviesWhateverTheirNames) {
    for (const char* name : {"Movie.m4v", "Movie.ismv", "Movie", "Movie.3gp"}) {
        const std::string movie = stream(name, tinyMovie());
        const ToolResult result = runTool({"attach", movie, streamFile("cpuUsage"), "--in-place"});
        EXPECT_EQ(result.exitCode, 0) << result.errors;
        EXPECT_EQ(result.errors, "");
        EXPECT_EQ(contentsOf(movie), tinyMovie() + zulmAtom({contentsOf(streamFile("cpuUsage"))}));
    }
    const ToolResult named = runTool({"attach", plain, streamFile("cpuUsage"), "-o", folder / "Out.m4v"});
    EXPECT_EQ(named.exitCode, 0);
    EXPECT_THAT(named.errors, HasSubstr("programs that go by the name do not take it for a movie"));
}

TEST_F(AttachCommand, TellsStreamFilesByTheirContents) {
    const std::string old = stream("Old.dat", media() + zulmAtom({locationStream()}));
    const ToolResult result = runTool({"attach", plain, old, "-o", out});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("not a stream file (.dat) but a movie; '--from " + old));
    EXPECT_EQ(runTool({"attach", plain, stream("locations", locationStream()), "-o", out}).exitCode, 0);
}

// Metadata that is torn at the end ---------------------------------------------------------------------------------

TEST_F(AttachCommand, MendsMetadataThatIsTornAtTheEnd) {
    const std::string whole = tinyMovie() + zulmAtom({locationStream()}) + extendedAtom("ZULR", std::string(64, 's'));
    const std::string cpu = streamFile("cpuUsage");
    const std::string torn = stream("Torn.mp4", whole.substr(0, whole.size() - 1));
    const ToolResult result = runTool({"attach", torn, cpu, "--in-place"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("the name and the versions in it are incomplete and are dropped"));
    EXPECT_EQ(streamsIn(torn).size(), 2U);
    const std::string stray = stream("Stray.mp4", whole + "\n");
    EXPECT_EQ(runTool({"attach", stray, cpu, "--in-place"}).exitCode, 0);
    EXPECT_EQ(contentsOf(stray), whole + zulmAtom({contentsOf(cpu)}));
}

// Times -------------------------------------------------------------------------------------------------------------

TEST_F(AttachCommand, WarnsOfEntriesBehindTheEndOfTheMovie) {
    writeFile(plain, tinyMovie(420, 600)); // 0.7 seconds
    const ToolResult result = runTool({"attach", plain, stream("a.dat", locationStream()), "-o", out, "--json"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_THAT(result.errors, HasSubstr("1 entry of 1 stream lies after the end of the movie at 0.700 s, the last at "
                                         "1.000 s; --shift moves the times, and --trim leaves such entries out"));
    EXPECT_EQ(nlohmann::json::parse(result.output).at("files").at(0).at("entries_after_end"), 1);
    EXPECT_EQ(runTool({"attach", plain, stream("a.dat", locationStream()), "-o", out, "--force", "--quiet"}).errors,
              "");
}

TEST_F(AttachCommand, ShiftsTimes) {
    const std::string old = stream("Old.mp4", media() + zulmAtom({locationStream()}));
    const ToolResult result = runTool({"attach", plain, "--from", old, "--shift", "-0.25", "-o", out});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(contentsOf(out), tinyMovie() + zulmAtom({streamHeader(s_cursorLocations, 1, 16) +
                                                       pointEntry(0.25, 10, 20) + pointEntry(0.75, -3, 7)}));
    const ToolResult before = runTool({"attach", plain, "--from", old, "--shift", "-0:00:05", "-o", out, "--force"});
    EXPECT_THAT(before.errors, HasSubstr("entries lie before the beginning of the movie, the first at -4.500 s"));
    for (const std::string word : {"nan", "x", ""})
        EXPECT_EQ(runTool({"attach", plain, "--from", old, "--shift", word, "-o", out, "--force"}).exitCode, 2) << word;
}

TEST_F(AttachCommand, TrimsWhatLiesOutsideOfTheMovie) {
    writeFile(plain, tinyMovie(420, 600));
    const std::string old = stream("Old.mp4", media() + zulmAtom({locationStream(), appNameStream()}));
    const ToolResult result = runTool({"attach", plain, "--from", old, "--trim", "-o", out, "--json"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(result.errors, "");
    const auto file = nlohmann::json::parse(result.output).at("files").at(0);
    EXPECT_EQ(file.at("entries_trimmed"), 2);
    EXPECT_EQ(file.at("entries_after_end"), 0);
    EXPECT_EQ(file.at("streams").at(0).at("source"), old);
    EXPECT_EQ(contentsOf(out),
              tinyMovie(420, 600) + zulmAtom({appNameStream().substr(0, 24 + 15), locationStream().substr(0, 40)}));
    EXPECT_EQ(namesIn(folder.path()), (std::vector<std::string>{"Old.mp4", "Out.mp4", "Plain.mp4"}));
}

TEST_F(AttachCommand, LeavesOutStreamsOfWhichNothingIsInTheMovie) {
    writeFile(plain, tinyMovie(420, 600));
    const std::string late = stream("late.dat", streamHeader(s_cursorLocations, 1, 16) + pointEntry(9, 1, 2));
    const ToolResult none = runTool({"attach", plain, late, "--trim", "-o", out});
    EXPECT_EQ(none.exitCode, 3);
    EXPECT_THAT(none.errors, HasSubstr("no entry of cursorLocation lies in the movie; the stream is left out"));
    EXPECT_FALSE(std::filesystem::exists(out));
}

TEST_F(AttachCommand, CannotTrimToAnEndThatNobodyTells) {
    writeFile(plain, media());
    const ToolResult result = runTool({"attach", plain, stream("a.dat", locationStream()), "--trim", "-o", out});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("--trim: the movie does not tell how long it lasts"));
}

// The index of fragments ---------------------------------------------------------------------------------------------

TEST_F(AttachCommand, SaysThatTheIndexOfFragmentsIsNoLongerAtTheEnd) {
    const std::string index = atom("mfra", "index of fragments");
    const std::string movie = stream("Fragments.ismv", tinyMovie() + index);
    const ToolResult left = runTool({"attach", movie, streamFile("cpuUsage"), "-o", out, "--json"});
    EXPECT_EQ(left.exitCode, 0);
    EXPECT_THAT(left.errors, HasSubstr("the index of its fragments (mfra) is no longer at the end of the file"));
    EXPECT_EQ(nlohmann::json::parse(left.output).at("files").at(0).at("fragment_index"), "not-at-end");
    const ToolResult moved = runTool({"attach", movie, streamFile("cpuUsage"), "--move-mfra", "-o", out, "--force"});
    EXPECT_EQ(moved.exitCode, 0);
    EXPECT_EQ(moved.errors, "");
    EXPECT_EQ(contentsOf(out), tinyMovie() + atom("free", "index of fragments") +
                                   zulmAtom({contentsOf(streamFile("cpuUsage"))}) + index);
}

// Outputs ---------------------------------------------------------------------------------------------------------

TEST_F(AttachCommand, ReplacesAnOutputOnlyByForceAndNeverAnInput) {
    writeFile(out, "mine");
    EXPECT_EQ(runTool({"attach", plain, streamFile("cpuUsage"), "-o", out}).exitCode, 1);
    EXPECT_EQ(contentsOf(out), "mine");
    EXPECT_EQ(runTool({"attach", plain, streamFile("cpuUsage"), "-o", out, "--force"}).exitCode, 0);
    std::filesystem::create_hard_link(plain, folder / "Hard.mp4");
    std::filesystem::create_symlink(plain, folder / "Soft.mp4");
    for (const std::string& same : {plain, folder / "Hard.mp4", folder / "Soft.mp4"}) {
        const ToolResult result = runTool({"attach", plain, streamFile("cpuUsage"), "-o", same, "--force"});
        EXPECT_EQ(result.exitCode, 1) << same;
        EXPECT_THAT(result.errors, HasSubstr("is the input " + plain + " itself"));
    }
    const std::string old = copyOf(movie(), "Old.mp4");
    EXPECT_EQ(runTool({"attach", plain, "--from", old, "-o", old, "--force"}).exitCode, 1);
    EXPECT_EQ(contentsOf(old), contentsOf(movie()));
    EXPECT_EQ(contentsOf(plain), tinyMovie());
}

TEST_F(AttachCommand, RefusesMoviesThatAreNone) {
    const std::string cpu = streamFile("cpuUsage");
    const std::string broken = stream("Broken.mp4", media() + be32(100) + "free");
    const ToolResult result = runTool({"attach", broken, cpu, "--in-place"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("the atom 'free' at offset 30 declares 100 bytes"));
    EXPECT_THAT(result.errors, HasSubstr("'zulm salvage " + broken + " -o DIR'"));
    EXPECT_EQ(contentsOf(broken), media() + be32(100) + "free");
    EXPECT_EQ(runTool({"attach", stream("Empty.mp4", ""), cpu, "--in-place"}).exitCode, 1);
    EXPECT_EQ(runTool({"attach", stream("a.avi", riffMedia()), cpu, "--in-place"}).exitCode, 1);
    EXPECT_EQ(runTool({"attach", folder / "missing.mp4", cpu, "--in-place"}).exitCode, 1);
    EXPECT_EQ(runTool({"attach", plain, cpu, "-o", folder / "Out.avi"}).exitCode, 1);
    EXPECT_EQ(runTool({"attach", stream("Zeros.mp4", std::string(5000, '\0')), cpu, "--in-place"}).exitCode, 1);
    EXPECT_EQ(runTool({"attach", plain, cpu, "-o", folder / "no folder/Out.mp4"}).exitCode, 1);
}

TEST_F(AttachCommand, LeavesNoTraceOfAnAppendThatFails) {
    const std::string large = stream("large.dat", streamHeader(s_cursorLocations, 1, 16) + std::string(1 << 20, 'x'));
    const std::string open = stream("Open.mp4", be32(0) + "mdat" + "0123456789");
    const auto names = namesIn(folder.path());
    const std::string limited = "ulimit -f 100; exec \"$0\" \"$@\"";
    for (const std::vector<std::string>& destination : {std::vector<std::string>{"--in-place"}, {"-o", out}}) {
        std::vector<std::string> arguments{"-c", limited, ZULM_PATH, "attach", open, large};
        arguments.insert(arguments.end(), destination.begin(), destination.end());
        const ToolResult result = runProgram("sh", arguments);
        EXPECT_EQ(result.exitCode, 1) << result.errors;
        EXPECT_THAT(result.errors, HasSubstr("cannot be written at offset"));
        EXPECT_EQ(contentsOf(open), be32(0) + "mdat" + "0123456789");
        EXPECT_EQ(namesIn(folder.path()), names);
    }
}

TEST_F(AttachCommand, UndoesWhatASignalInterrupts) {
    const std::string huge = folder / "huge.dat";
    writeSparseFile(huge, 24 + (std::uint64_t(16) << 32), streamHeader(s_cursorLocations, 1, 16)); // takes minutes
    for (const int signal : {2, 15}) {
        ToolOptions options;
        options.killAfterMilliseconds = 1;
        options.killWhen = [this] { return std::filesystem::file_size(plain) > tinyMovie().size() + (1 << 20); };
        options.killSignal = signal;
        const ToolResult result = runTool({"attach", plain, huge, "--in-place"}, options);
        EXPECT_EQ(result.exitCode, 128 + signal) << result.errors;
        EXPECT_THAT(result.errors, HasSubstr("interrupted; it is what it was before"));
        EXPECT_EQ(contentsOf(plain), tinyMovie());
    }
}

} // namespace

} // namespace ZULMetaData::Test
