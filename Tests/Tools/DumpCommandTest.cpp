// `zulm dump`: entries, in every format.

#include "Tests/Tools/Golden.h"
#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include "Platform/Image.h"

#include <gmock/gmock.h>
#include <nlohmann/json.hpp>

#include <cmath>
#include <filesystem>
#include <limits>
#include <sstream>

namespace ZULMetaData::Test {
namespace {

using nlohmann::json;
using testing::HasSubstr;

std::vector<std::string> linesOf(const std::string& text) {
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);)
        lines.push_back(line);
    return lines;
}

class DumpCommand : public RecordedSession {
protected:
    std::string written(const std::string& name, const std::string& bytes) const {
        writeFile(folder / name, bytes);
        return name;
    }

    ToolResult run(std::vector<std::string> arguments, ToolOptions options = {}) const {
        options.folder = folder.path().string();
        arguments.insert(arguments.begin(), "dump");
        return runTool(arguments, options);
    }

    /// The entries of a stream file with these bytes, as NDJSON gives them.
    std::vector<json> entriesOf(const std::string& bytes, int expectedCode = 0) const {
        const ToolResult result = run({"--format", "ndjson", written("stream.dat", bytes)});
        EXPECT_EQ(result.exitCode, expectedCode) << result.errors;
        std::vector<json> entries;
        for (const std::string& line : linesOf(result.output))
            entries.push_back(json::parse(line));
        return entries;
    }
};

TEST_F(DumpCommand, PrintsEveryEntryInEveryFormat) {
    copyOf(movie());
    for (const std::string format : {"text", "json", "ndjson", "csv"}) {
        const ToolResult result = run({"--format", format, "Recording.mp4"});
        EXPECT_EQ(result.exitCode, 0);
        EXPECT_EQ(result.errors, "");
        expectGolden(result.output, "dump." + format);
    }
}

TEST_F(DumpCommand, PrintsTextWithoutBeingAsked) {
    written("a.dat", locations());
    EXPECT_EQ(run({"a.dat"}).output, "    0.500000  x=10  y=-20\n    0.100000  x=0  y=7\n    2.000000  x=3  y=4\n");
}

TEST_F(DumpCommand, GivesTheSameEntriesAsOneDocumentAndLineByLine) {
    const json document = json::parse(run({"--format", "json", movie()}).output);
    std::size_t line = 0;
    const auto lines = linesOf(run({"--format", "ndjson", movie()}).output);
    for (const json& stream : document.at("files").at(0).at("streams"))
        for (json entry : stream.at("entries")) {
            entry["stream"] = stream.at("kind");
            ASSERT_EQ(json::parse(lines.at(line++)), entry);
        }
    EXPECT_EQ(line, lines.size());
}

TEST_F(DumpCommand, PrintsOnlyTheStreamsThatAreNamed) {
    const ToolResult result =
        run({"--stream", "slideText", "--stream", "cpuUsage", "--stream", "slideText", "--format", "csv", movie()});
    EXPECT_EQ(result.exitCode, 0);
    const auto lines = linesOf(result.output);
    EXPECT_EQ(lines.at(0), "stream,text,timestamp");
    EXPECT_EQ(lines.at(4), "");
    EXPECT_EQ(lines.at(5), "stream,cpuUsage,timestamp");
    EXPECT_EQ(lines.size(), 5U + 41U);
}

TEST_F(DumpCommand, TakesIdentifiersOfStreams) {
    const ToolResult byIdentifier = run({"--stream", "2b7b6a08-7a1f-11e2-83d0-0017f200be7f", movie()});
    EXPECT_EQ(byIdentifier.exitCode, 0);
    EXPECT_EQ(byIdentifier.output, run({"--stream", "cpuUsage", movie()}).output);
    EXPECT_EQ(run({"--stream", "2b7b6a08", movie()}).exitCode, 2);
}

TEST_F(DumpCommand, KnowsNearNamesOfStreams) {
    const ToolResult result = run({"--stream", "cursorLocatoin", movie()});
    EXPECT_EQ(result.exitCode, 2);
    EXPECT_THAT(result.errors, HasSubstr("did you mean cursorLocation?"));
    EXPECT_THAT(result.errors, HasSubstr("slideComment, recordingScaleFactor, systemData"));
}

TEST_F(DumpCommand, TellsWhichStreamTheFileLacksAndPrintsTheOthers) {
    const ToolResult result =
        run({"--stream", "cpuUsage", "--stream", "cursorLocation", written("a.dat", locations())});
    EXPECT_EQ(result.exitCode, 4);
    EXPECT_THAT(result.output, HasSubstr("x=10"));
    EXPECT_THAT(result.errors, HasSubstr("a.dat: has no stream cpuUsage; 'zulm info a.dat' lists what it has"));
}

TEST_F(DumpCommand, KeepsToARangeOfTimes) {
    written("a.dat", locations());
    EXPECT_EQ(linesOf(run({"--from", "0.5", "a.dat"}).output).size(), 2U);
    EXPECT_EQ(run({"--from", "0.5", "--to", "1", "a.dat"}).output, "    0.500000  x=10  y=-20\n");
    EXPECT_EQ(run({"--to", "-1", "a.dat"}).output, "");
}

TEST_F(DumpCommand, GivesTheExactTimeAndIts32BitFormWhereTheyDiffer) {
    const auto entries = entriesOf(locations());
    EXPECT_FALSE(entries.at(0).contains("timestamp_f32"));
    EXPECT_EQ(entries.at(1).at("timestamp"), 0.1);
    EXPECT_EQ(entries.at(1).at("timestamp_f32"), static_cast<double>(0.1F));
}

TEST_F(DumpCommand, SpellsTimesThatAreNoNumbers) {
    const double infinity = std::numeric_limits<double>::infinity();
    const auto entries =
        entriesOf(streamHeader("2b7b6af2", 1, 16) + pointEntry(infinity, 1, 1) + pointEntry(-infinity, 1, 1) +
                      pointEntry(std::nan(""), 1, 1) + pointEntry(1e300, 1, 1),
                  3);
    EXPECT_EQ(entries.at(0).at("timestamp"), "Infinity");
    EXPECT_EQ(entries.at(1).at("timestamp"), "-Infinity");
    EXPECT_EQ(entries.at(2).at("timestamp"), "NaN");
    EXPECT_FALSE(entries.at(2).contains("timestamp_f32"));
    EXPECT_EQ(entries.at(3).at("timestamp"), 1e300);
    EXPECT_EQ(entries.at(3).at("timestamp_f32"), "Infinity");
    EXPECT_EQ(linesOf(run({"stream.dat"}).output).at(1), "   -Infinity  x=1  y=1");
}

TEST_F(DumpCommand, KeepsTheBytesOfTextsThatAreNotUTF8) {
    const auto entries = entriesOf(streamHeader("2b7b6a06", 1, 0) + textEntry(1, "Caf\xe9") +
                                       textEntry(2, "Caf\xc3\xa9") + textEntry(3, std::string("a\0b", 3)),
                                   3);
    EXPECT_EQ(entries.at(0).at("name"), "Caf\xef\xbf\xbd");
    EXPECT_EQ(entries.at(0).at("name_base64"), "Q2Fm6Q==");
    EXPECT_EQ(entries.at(1).at("name"), "Caf\xc3\xa9");
    EXPECT_FALSE(entries.at(1).contains("name_base64"));
    EXPECT_EQ(entries.at(2).at("name"), std::string("a\0b", 3));
    EXPECT_FALSE(entries.at(2).contains("name_base64"));
}

TEST_F(DumpCommand, TakesCodesForCharactersUnlessTheyAreVirtualKeys) {
    std::string stream = streamHeader("2b7b6af5", 1, 16);
    std::string text;
    for (const char c : std::string("hello world"))
        stream += f64(1) + le32(static_cast<unsigned char>(c)) + le32(0);
    for (const std::uint32_t code : {0x444U, 13U, 0xffffffffU})
        stream += f64(1) + le32(code) + le32(0);
    stream += f64(1) + le32(119) + le32(0xc0000000);
    const auto entries = entriesOf(stream);
    for (std::size_t i = 0; i < 11; ++i)
        text += entries.at(i).at("characterString").get<std::string>();
    EXPECT_EQ(text, "hello world");
    EXPECT_EQ(entries.at(11).at("characterString"), "\xd1\x84");
    EXPECT_EQ(entries.at(12).at("characterString"), "returnKey");
    EXPECT_EQ(entries.at(13).at("characterString"), "key 4294967295");
    EXPECT_EQ(entries.at(13).at("characterCode"), 4294967295U);
    EXPECT_EQ(entries.at(14).at("characterString"), "f8");
    EXPECT_EQ(entries.at(14).at("eventFlagsCode"), 0xc0000000U);
}

TEST_F(DumpCommand, ShowsNumbersAsTheyAreStored) {
    const auto opacities = entriesOf(streamHeader("2b7b6af3", 1, 16) + f64(1) + f64(1e39) + f64(2) + f64(0.1) + f64(3) +
                                     f64(std::numeric_limits<double>::infinity()));
    EXPECT_EQ(opacities.at(0).at("opacity"), 1e39);
    EXPECT_EQ(opacities.at(1).at("opacity"), 0.1);
    EXPECT_EQ(opacities.at(2).at("opacity"), "Infinity");
    const std::string cursor = raw(0xfedcba9876543210U) + le32(8) + le32(0) + le32(3);
    const auto images = entriesOf(streamHeader("2b7b6af1", 1, 0) + le32(28) + f64(1) + cursor);
    EXPECT_EQ(images.at(0).at("id"), "18364758544493064720");
}

TEST_F(DumpCommand, ShowsControlCharactersInsteadOfSendingThem) {
    written("a.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1, "\x1b[2J\n\"q\"\xc2\x9b"));
    EXPECT_EQ(run({"a.dat"}).output, "    1.000000  name=\"\\x1b[2J\\x0a\\\"q\\\"\\u{9b}\"\n");
}

TEST_F(DumpCommand, ShowsTextsWholeAndNoTwoOfThemAlike) {
    written("a.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1, std::string("a\0b", 3)) + textEntry(2, "\x1b\xff") +
                         textEntry(3, "\\x1b\xef\xbf\xbd") + textEntry(4, "\xe2\x80\xae\n\t,"));
    EXPECT_EQ(run({"a.dat"}).output, "    1.000000  name=\"a\\x00b\"\n"
                                     "    2.000000  name=\"\\x1b\\xff\"\n"
                                     "    3.000000  name=\"\\\\x1b\xef\xbf\xbd\"\n"
                                     "    4.000000  name=\"\\u{202e}\\x0a\\x09,\"\n");
    EXPECT_EQ(run({"--format", "csv", "a.dat"}).output, "stream,name,timestamp\n"
                                                        "topmostAppName,a\\x00b,1.0\n"
                                                        "topmostAppName,\\x1b\\xff,2.0\n"
                                                        "topmostAppName,\\\\x1b\xef\xbf\xbd,3.0\n"
                                                        "topmostAppName,\"\\u{202e}\n\\x09,\",4.0\n");
    EXPECT_THAT(run({"--format", "json", "a.dat"}).output, HasSubstr("\"\\u202e\\n\\t,\""));
}

TEST_F(DumpCommand, WritesTablesThatOtherProgramsRead) {
    const std::string hostile("\0\r\n\"a\",\x1b\\x1b\xff\n\xe2\x80\xa8", 20);
    written("a.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1, hostile) + textEntry(2, "plain"));
    ToolOptions options;
    options.input = run({"--format", "csv", "a.dat"}).output;
    const ToolResult rows = runProgram(
        "python3",
        {"-c", "import csv, re, sys\n"
               "rows = list(csv.reader(open(0, newline='')))\n"
               "text = re.sub(rb'\\\\(?:x(..)|u\\{(\\w+)\\}|(\\\\))', lambda m: bytes.fromhex(m[1].decode()) "
               "if m[1] else chr(int(m[2], 16)).encode() if m[2] else m[3], rows[1][1].encode())\n"
               "print(len(rows), {len(row) for row in rows}, rows[2][1], text.hex())\n"},
        options);
    std::string digits;
    for (const char c : hostile) {
        digits += "0123456789abcdef"[static_cast<unsigned char>(c) >> 4];
        digits += "0123456789abcdef"[c & 0xf];
    }
    EXPECT_EQ(rows.output, "3 {3} plain " + digits + "\n") << rows.errors;
}

TEST_F(DumpCommand, QuotesFieldsOfTables) {
    written("a.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1, "a, \"b\"\nc"));
    EXPECT_EQ(run({"--format", "csv", "a.dat"}).output,
              "stream,name,timestamp\ntopmostAppName,\"a, \"\"b\"\"\nc\",1.0\n");
}

TEST_F(DumpCommand, ShowsListsWithTooFewAndTooManyTexts) {
    const auto list = [](std::initializer_list<std::string> texts) {
        std::string bytes;
        for (const std::string& text : texts)
            bytes += textEntry(0, text);
        return le32(static_cast<std::uint32_t>(4 + bytes.size())) + le32(static_cast<std::uint32_t>(texts.size())) +
               bytes;
    };
    const auto entries =
        entriesOf(streamHeader("2b7b6afc", 1, 0) + list({"a", "b"}) + list({"1", "2", "3", "4", "5", "\xe9"}), 3);
    EXPECT_EQ(entries.at(0).at("activeProcessorCount"), "b");
    EXPECT_EQ(entries.at(0).at("osVersion"), nullptr);
    EXPECT_THAT(entries.at(0).at("damage").get<std::string>(), HasSubstr("2 texts"));
    EXPECT_EQ(entries.at(1).at("ram"), "4");
    EXPECT_EQ(entries.at(1).at("further"), json::array({"5", "\xc3\xa9"}));
    EXPECT_EQ(entries.at(1).at("further_base64"), json::array({"NQ==", "6Q=="}));
    EXPECT_EQ(run({"--format", "csv", "stream.dat"}).output,
              "stream,processorCount,activeProcessorCount,osVersion,ram,further,timestamp\n"
              "systemData,a,b,,,,0.0\n"
              "systemData,1,2,3,4,\"[\"\"5\"\",\"\"\xc3\xa9\"\"]\",0.0\n");
    EXPECT_THAT(run({"stream.dat"}).output, HasSubstr("ram=\"4\"  further=[\"5\",\"\xc3\xa9\"]\n"));
}

TEST_F(DumpCommand, WritesImagesAsTheyAreStored) {
    const ToolResult result =
        run({"--stream", "cursorImage", "--format", "ndjson", "--images", "cursors/drawn", movie()});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    const json first = json::parse(linesOf(result.output).at(0));
    const std::string file = first.at("image").at("file");
    EXPECT_EQ(file, "cursors/drawn/cursor-11-entry-1.png");
    const std::string bytes = contentsOf(folder / file);
    EXPECT_EQ(bytes.size(), first.at("image").at("bytes").get<std::size_t>());
    const auto image = Image::fromEncodedBytes({reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size()});
    ASSERT_TRUE(image);
    EXPECT_EQ(image->width(), 32U);
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(folder / "cursors/drawn"), {}), 6);
}

TEST_F(DumpCommand, DoesNotReplaceImagesUnlessForced) {
    const std::vector<std::string> arguments{"--stream", "cursorImage", "--images", ".", movie()};
    EXPECT_EQ(run(arguments).exitCode, 0);
    const ToolResult again = run(arguments);
    EXPECT_EQ(again.exitCode, 1);
    EXPECT_THAT(again.errors, HasSubstr("cursor-11-entry-1.png: exists already; --force replaces it"));
    auto forced = arguments;
    forced.emplace_back("--force");
    EXPECT_EQ(run(forced).exitCode, 0);
}

TEST_F(DumpCommand, ReportsAnImageThatCannotBeDecoded) {
    std::string stream = contentsOf(streamFile("cursorImage"));
    const std::size_t header = stream.find("IHDR");
    ASSERT_NE(header, std::string::npos);
    stream[header + 4] = '\x7f'; // a width that the checksum denies
    const auto entries = entriesOf(stream, 3);
    EXPECT_THAT(entries.at(0).at("image").at("damage").get<std::string>(), HasSubstr("cannot be decoded"));
    EXPECT_EQ(entries.at(1).at("image").at("width"), 32);
    EXPECT_EQ(entries.at(6).at("image"), nullptr); // an image that came earlier
    const ToolResult result = run({"--images", "images", "stream.dat"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("cursorImage, entry 1: its image cannot be decoded; not written"));
    EXPECT_FALSE(std::filesystem::exists(folder / "images/cursor-11-entry-1.png"));
    EXPECT_TRUE(std::filesystem::exists(folder / "images/cursor-12-entry-2.png"));
}

TEST_F(DumpCommand, GivesWhatIsWholeOfAStreamThatIsCutShort) {
    EXPECT_EQ(entriesOf(locations().substr(0, 60), 3).size(), 2U);
    EXPECT_EQ(entriesOf(streamHeader("2b7b6a06", 1, 0) + textEntry(1, "whole") + textEntry(2, "torn").substr(0, 14), 3)
                  .size(),
              1U);
}

TEST_F(DumpCommand, DoesNotBelieveSizes) {
    for (const std::uint32_t size : {0U, 4U, 7U, 0x7fffffffU, 0xffffffffU}) {
        const auto entries =
            entriesOf(streamHeader("2b7b6a06", 1, 0) + textEntry(1, "whole") + le32(size) + f64(2) + "text", 3);
        EXPECT_EQ(entries.size(), 1U) << size;
    }
    EXPECT_TRUE(entriesOf(streamHeader("2b7b6afc", 1, 0) + le32(16) + le32(1) + le32(3) + f64(0), 3).empty());
    EXPECT_LT(run({"stream.dat"}).peakMemoryKB, 400 << 10); // most of it a sanitizer's, where there is one
}

TEST_F(DumpCommand, SaysWhichStreamsItCannotDecode) {
    const ToolResult result = run({"--format", "json", written("Odd.mp4", oddMovie())});
    EXPECT_THAT(result.errors,
                HasSubstr("entries of 2b7b6aff-7a1f-11e2-83d0-0017f200be7f, version 1, cannot be decoded"));
    EXPECT_THAT(result.errors, HasSubstr("entries of caretPosition, version 1, cannot be decoded"));
    const json streams = json::parse(result.output).at("files").at(0).at("streams");
    ASSERT_EQ(streams.size(), 3U);
    EXPECT_EQ(streams.at(0).at("kind"), "caretPosition");
    EXPECT_EQ(streams.at(0).at("entries"), nullptr);
    EXPECT_EQ(streams.at(1).at("entries").size(), 3U);
    EXPECT_EQ(streams.at(2).at("kind"), nullptr);
}

TEST_F(DumpCommand, EndsWith4WhereThereIsNoMetaData) {
    const ToolResult result = run({"--format", "json", written("plain.mp4", tinyMovie())});
    EXPECT_EQ(result.exitCode, 4);
    EXPECT_TRUE(json::parse(result.output).at("files").at(0).at("streams").empty());
    EXPECT_THAT(result.errors, HasSubstr("plain.mp4: has no recording metadata"));
}

TEST_F(DumpCommand, ReadsStandardInput) {
    ToolOptions options;
    options.input = locations();
    EXPECT_EQ(linesOf(run({"-"}, options).output).size(), 3U);
}

TEST_F(DumpCommand, PrintsSeveralFiles) {
    written("a.dat", locations());
    written("b.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1, "Mail"));
    EXPECT_EQ(run({"a.dat", "b.dat"}).output, "a.dat: cursorLocation\n"
                                              "    0.500000  x=10  y=-20\n    0.100000  x=0  y=7\n"
                                              "    2.000000  x=3  y=4\n"
                                              "b.dat: topmostAppName\n    1.000000  name=\"Mail\"\n");
    EXPECT_EQ(run({"--format", "csv", "a.dat", "b.dat"}).output,
              "file,stream,x,y,timestamp\n"
              "a.dat,cursorLocation,10,-20,0.5\na.dat,cursorLocation,0,7,0.1\na.dat,cursorLocation,3,4,2.0\n\n"
              "file,stream,name,timestamp\nb.dat,topmostAppName,Mail,1.0\n");
    EXPECT_EQ(linesOf(run({"--format", "ndjson", "b.dat", "a.dat"}).output).front(),
              R"({"file":"b.dat","stream":"topmostAppName","name":"Mail","timestamp":1.0})");
    const json document = json::parse(run({"--format", "json", "a.dat", "b.dat"}).output);
    EXPECT_EQ(document.at("files").size(), 2U);
    EXPECT_EQ(document.at("files").at(1).at("path"), "b.dat");
}

TEST_F(DumpCommand, GoesOnAfterAFileThatCannotBeRead) {
    written("a.dat", locations());
    const ToolResult result = run({"--format", "ndjson", "none.dat", "a.dat"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(linesOf(result.output).size(), 3U);
    EXPECT_THAT(result.errors, HasSubstr("none.dat: no such file"));
}

TEST_F(DumpCommand, PrintsOnlyTheChosenColumns) {
    written("a.dat", locations());
    EXPECT_EQ(run({"--columns", "y,x", "--format", "csv", "a.dat"}).output, "y,x\n-20,10\n7,0\n4,3\n");
    EXPECT_EQ(linesOf(run({"--columns", "stream,timestamp,file,y", "--format", "csv", "a.dat"}).output).at(1),
              "cursorLocation,0.5,a.dat,-20");
    EXPECT_EQ(linesOf(run({"--columns", "y", "a.dat"}).output).front(), "  y=-20");
    EXPECT_EQ(linesOf(run({"--columns", "y,timestamp", "a.dat"}).output).front(), "    0.500000  y=-20");
    EXPECT_EQ(linesOf(run({"--columns", "timestamp", "--format", "ndjson", "a.dat"}).output).at(1),
              R"({"timestamp":0.1,"timestamp_f32":0.10000000149011612})");
    const json document = json::parse(run({"--columns", "x", "--format", "json", "a.dat"}).output);
    EXPECT_EQ(document.at("files").at(0).at("streams").at(0).at("entries").at(0), json({{"x", 10}}));
}

TEST_F(DumpCommand, LeavesOutStreamsWithoutTheChosenColumns) {
    const std::vector<std::string> lines =
        linesOf(run({"--columns", "timestamp,title", "--format", "csv", movie()}).output);
    EXPECT_EQ(std::count(lines.begin(), lines.end(), "timestamp,title"), 2); // slide titles and window titles
    EXPECT_EQ(run({"--columns", "hotspotOffsetX", "--stream", "slideText", movie()}).output, "");
}

TEST_F(DumpCommand, RefusesColumnsThatNoEntryHas) {
    const ToolResult result = run({"--columns", "timestmp", "a.dat"});
    EXPECT_EQ(result.exitCode, 2);
    EXPECT_THAT(result.errors, HasSubstr("--columns: 'timestmp' is no column; did you mean timestamp? (the columns "
                                         "are file, stream, timestamp, "));
    EXPECT_EQ(run({"--columns", "", "a.dat"}).exitCode, 2);
    EXPECT_EQ(run({"--columns", "x,,y", "a.dat"}).exitCode, 2);
}

TEST_F(DumpCommand, WritesImagesOfOneFileAtATime) {
    const ToolResult result = run({"--images", "images", movie(), movie()});
    EXPECT_EQ(result.exitCode, 2);
    EXPECT_THAT(result.errors, HasSubstr("--images: the images of one FILE"));
}

TEST_F(DumpCommand, NeedsNoMoreMemoryForMoreEntries) {
    const auto memoryFor = [this](int count) {
        std::string stream = streamHeader("2b7b6af2", 1, 16);
        for (int i = 0; i < count; ++i)
            stream += pointEntry(i, i, i);
        ToolOptions options;
        options.environment = {{"ASAN_OPTIONS", "quarantine_size_mb=1"}};
        const ToolResult result = run({"--format", "json", written("many.dat", stream)}, options);
        EXPECT_EQ(result.exitCode, 0);
        EXPECT_EQ(linesOf(result.output).size(), static_cast<std::size_t>(count) + 3);
        return result.peakMemoryKB;
    };
    const long few = memoryFor(1000);
    EXPECT_LT(memoryFor(200000) - few, 4096);
}

TEST_F(DumpCommand, DecodesNoEntriesOfAnotherSizeThanTheirKindHas) {
    const std::string points = streamHeader("2b7b6af6", 1, 16) + std::string(1600, 'x'); // of regions: 24 bytes each
    const ToolResult result = run({"--format", "ndjson", written("stream.dat", points)});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.output, "");
    EXPECT_THAT(result.errors, HasSubstr("entries of recordingRegion, version 1, cannot be decoded: at offset 20: the "
                                         "header says that entries take 16 bytes, but those of this kind take 24"));
}

} // namespace
} // namespace ZULMetaData::Test
