#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::json;
using testing::HasSubstr;

class DiffCommand : public RecordedSession {
protected:
    std::string write(const std::string& name, const std::string& contents) const {
        writeFile(folder / name, contents);
        return folder / name;
    }

    std::string locations(const std::string& name, const std::string& entries) const {
        return write(name, streamHeader(s_cursorLocations, 1, 16) + entries);
    }

    Json differencesOf(const ToolResult& result) const { return Json::parse(result.output)["files"][0]["streams"][0]; }
};

TEST_F(DiffCommand, FindsACopyTheSame) {
    const ToolResult result = runTool({"diff", movie(), copyOf(movie())});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(result.output, "");
}

TEST_F(DiffCommand, FindsStreamsTheSameWhateverContainerTheyAreIn) {
    const std::string file = write("sound.wav", riffMedia() + zulmChunk({appNameStream(), locationStream()}));
    EXPECT_EQ(
        runTool({"diff", write("movie.mp4", media() + zulmAtom({locationStream(), appNameStream()})), file}).exitCode,
        0);
}

TEST_F(DiffCommand, ShowsStreamsThatOnlyOneSideHas) {
    const std::string left = write("a.mp4", media() + zulmAtom({locationStream()}));
    const std::string right = write("b.mp4", media() + zulmAtom({appNameStream()}));
    const ToolResult result = runTool({"diff", left, right});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.output, "topmostAppName: only in " + right + "\ncursorLocation: only in " + left + "\n");
    const Json streams = Json::parse(runTool({"diff", "--json", left, right}).output)["files"][0]["streams"];
    EXPECT_EQ(streams[0]["status"], "added");
    EXPECT_EQ(streams[1]["status"], "removed");
}

TEST_F(DiffCommand, ShowsChangedAddedAndRemovedEntries) {
    const std::string left = locations("a.dat", pointEntry(1, 1, 1) + pointEntry(2, 2, 2) + pointEntry(3, 3, 3));
    const std::string right = locations("b.dat", pointEntry(1, 1, 1) + pointEntry(1.5, 9, 9) + pointEntry(3, 3, 4));
    const ToolResult result = runTool({"diff", left, right});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.output, "cursorLocation: differs\n"
                             "  +     1.500000  x=9  y=9\n"
                             "  -     2.000000  x=2  y=2\n"
                             "  <     3.000000  x=3  y=3\n"
                             "  >     3.000000  x=3  y=4\n"
                             "  cursorLocation: 1 changed, 1 added, 1 removed, 1 the same\n");
    const Json stream = differencesOf(runTool({"diff", left, right, "--json"}));
    EXPECT_EQ(stream["changed"], 1);
    EXPECT_EQ(stream["differences"][2]["change"], "changed");
    EXPECT_EQ(stream["differences"][2]["a"]["y"], 3);
    EXPECT_EQ(stream["differences"][2]["b"]["y"], 4);
    EXPECT_TRUE(stream["differences"][0]["a"].is_null());
}

TEST_F(DiffCommand, FindsItsWayBackBehindAnInsertedEntry) {
    std::string entries;
    for (int i = 0; i < 1000; ++i)
        entries += pointEntry(i, i, i);
    const std::string left = locations("a.dat", entries);
    const std::string right = locations("b.dat", pointEntry(-1, 0, 0) + entries);
    EXPECT_THAT(runTool({"diff", left, right}).output, HasSubstr("0 changed, 1 added, 0 removed, 1000 the same"));
}

TEST_F(DiffCommand, ListsNoMoreThanTheLimit) {
    std::string left;
    std::string right;
    for (int i = 0; i < 150; ++i) {
        left += pointEntry(i, i, i);
        right += pointEntry(i, i, i + 1);
    }
    const std::string a = locations("a.dat", left);
    const std::string b = locations("b.dat", right);
    EXPECT_THAT(runTool({"diff", a, b}).output, HasSubstr("... and 50 more; '--limit 0' lists all"));
    EXPECT_EQ(differencesOf(runTool({"diff", a, b, "--json"}))["complete"], false);
    EXPECT_EQ(differencesOf(runTool({"diff", a, b, "--json", "--limit", "0"}))["differences"].size(), 150U);
}

TEST_F(DiffCommand, ToleratesTimesThatDifferALittle) {
    const std::string left = locations("a.dat", pointEntry(1, 1, 1) + pointEntry(2, 2, 2) + pointEntry(9, 9, 9));
    const std::string right = locations("b.dat", pointEntry(1.01, 1, 1) + pointEntry(1.99, 2, 2) + pointEntry(9, 9, 9));
    EXPECT_EQ(runTool({"diff", left, right}).exitCode, 3);
    const ToolResult same = runTool({"diff", "--tolerance", "0.02", left, right});
    EXPECT_EQ(same.exitCode, 0);
    EXPECT_EQ(same.output, "");
    EXPECT_EQ(runTool({"diff", "--tolerance", "0:00.005", left, right}).exitCode, 3);
    const Json stream = differencesOf(runTool({"diff", "--json", "--tolerance", "0.02", left, right}));
    EXPECT_EQ(stream["status"], "same");
    EXPECT_EQ(stream["same"], 3);
    EXPECT_TRUE(stream["differences"].empty());
}

TEST_F(DiffCommand, ToleratesNoOtherValues) {
    const std::string left = locations("a.dat", pointEntry(1, 1, 1));
    const std::string right = locations("b.dat", pointEntry(1.01, 1, 2));
    const ToolResult result = runTool({"diff", "--tolerance", "0.02", left, right});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.output, "cursorLocation: differs\n"
                             "  <     1.000000  x=1  y=1\n"
                             "  >     1.010000  x=1  y=2\n"
                             "  cursorLocation: 1 changed, 0 added, 0 removed, 0 the same\n");
    const std::string torn = locations("c.dat", pointEntry(1.01, 1, 1) + "1234");
    EXPECT_EQ(runTool({"diff", "--tolerance", "0.02", left, torn}).exitCode, 3);
}

TEST_F(DiffCommand, ToleratesTimesOfTexts) {
    const std::string header = streamHeader(s_appNames, 1, 0);
    const std::string left = write("a.dat", header + textEntry(1, "Mail") + textEntry(2, "Notes"));
    const std::string right = write("b.dat", header + textEntry(1.25, "Mail") + textEntry(2, "Notes"));
    EXPECT_EQ(runTool({"diff", "--tolerance", "0.5", left, right}).exitCode, 0);
    EXPECT_EQ(runTool({"diff", "--tolerance", "0", left, right}).exitCode, 3);
}

TEST_F(DiffCommand, NamesOnlyTheStreamsWhenQuiet) {
    const std::string left = locations("a.dat", pointEntry(1, 1, 1));
    EXPECT_EQ(runTool({"diff", "-q", left, locations("b.dat", pointEntry(1, 1, 2))}).output,
              "cursorLocation: differs\n");
}

TEST_F(DiffCommand, ComparesOnlyTheChosenKinds) {
    const std::string left = write("a.mp4", media() + zulmAtom({locationStream(), appNameStream()}));
    const std::string right = write("b.mp4", media() + zulmAtom({locationStream()}));
    EXPECT_EQ(runTool({"diff", left, right, "--stream", "cursorLocation"}).exitCode, 0);
    EXPECT_EQ(runTool({"diff", left, right, "--stream", "topmostAppName"}).exitCode, 3);
}

TEST_F(DiffCommand, ShowsInWhatNumbersAndTextsDiffer) {
    const std::string opacity = streamHeader("2b7b6af3", 1, 16) + f64(1);
    const std::string numbers =
        runTool({"diff", write("a.dat", opacity + f64(1e39)), write("b.dat", opacity + f64(2e39))}).output;
    EXPECT_THAT(numbers, HasSubstr("opacity=1e+39\n"));
    EXPECT_THAT(numbers, HasSubstr("opacity=2e+39\n"));
    const std::string names = streamHeader(s_appNames, 1, 0);
    const std::string texts = runTool({"diff", write("a.dat", names + textEntry(1, std::string("a\0b", 3))),
                                       write("b.dat", names + textEntry(1, std::string("a\0c", 3)))})
                                  .output;
    EXPECT_THAT(texts, HasSubstr("name=\"a\\x00b\"\n"));
    EXPECT_THAT(texts, HasSubstr("name=\"a\\x00c\"\n"));
}

TEST_F(DiffCommand, ComparesStreamsOfUnknownKindsByTheirBytes) {
    const std::string header = streamHeader("deadbeef", 1, 4);
    const std::string left = write("a.dat", header + "abcdefgh");
    const std::string right = write("b.dat", header + "abcdefgX");
    const ToolResult result = runTool({"diff", left, right});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.output, HasSubstr("  < ZWZnaA==\n  > ZWZnWA==\n"));
    EXPECT_THAT(result.output, HasSubstr("1 changed, 0 added, 0 removed, 1 the same"));
}

TEST_F(DiffCommand, ShowsADifferenceInHeaders) {
    const std::string right = write("b.dat", streamHeader(s_cursorLocations, 1, 20) + pointEntry(0.5, 10, 20));
    const ToolResult result = runTool({"diff", locations("a.dat", pointEntry(0.5, 10, 20)), right});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.output, HasSubstr("its header's entry_size: 16 and 20"));
}

TEST_F(DiffCommand, ComparesWhatIsWholeOfATornStream) {
    const ToolResult result =
        runTool({"diff", write("a.dat", appNameStream()), write("b.dat", appNameStream().substr(0, 50))});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.output, HasSubstr("0 changed, 0 added, 1 removed, 1 the same"));
    EXPECT_THAT(result.output, HasSubstr("after the last entry: 0 and 11 bytes"));
    EXPECT_THAT(result.errors, HasSubstr("cannot be read from offset 39 on; 'zulm verify"));
}

TEST_F(DiffCommand, EndsWithEntriesAtNoTime) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const std::string left = locations("a.dat", pointEntry(nan, 1, 1) + pointEntry(2, 2, 2));
    const std::string right = locations("b.dat", pointEntry(1, 1, 1) + pointEntry(nan, 2, 2) + pointEntry(nan, 3, 3));
    EXPECT_EQ(runTool({"diff", left, right}).exitCode, 3);
}

TEST_F(DiffCommand, FailsWhereThereIsNothingToCompare) {
    const std::string none = write("none.mp4", media());
    EXPECT_EQ(runTool({"diff", none, none}).exitCode, 4);
    EXPECT_EQ(runTool({"diff", movie(), folder / "missing.mp4"}).exitCode, 1);
    EXPECT_EQ(runTool({"diff", movie()}).exitCode, 2);
    EXPECT_EQ(runTool({"diff", "-", "-"}).exitCode, 2);
}

} // namespace
} // namespace ZULMetaData::Test
