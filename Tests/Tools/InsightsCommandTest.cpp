#include "Tests/Tools/Golden.h"
#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <filesystem>
#include <limits>
#include <string>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::json;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

const std::string s_bullet = "\xe2\x80\xa2";

std::string action(double time, std::int32_t stored) {
    return f64(time) + raw(stored);
}

std::string key(double time, char character) {
    return f64(time) + le32(static_cast<unsigned char>(character)) + le32(0);
}

class InsightsCommand : public RecordedSession {
protected:
    /// A movie of 20 seconds with these streams.
    std::string movieWith(const std::vector<std::string>& streams) const {
        writeFile(folder / "Small.mp4", tinyMovie() + zulmAtom(streams));
        return folder / "Small.mp4";
    }

    static std::string actions(const std::string& entries) { return streamHeader("2b7b6af0", 1, 12) + entries; }
    static std::string keys(const std::string& entries) { return streamHeader("2b7b6af5", 1, 16) + entries; }
    static std::string locations(const std::string& entries) {
        return streamHeader(s_cursorLocations, 1, 16) + entries;
    }
    static std::string region() {
        return streamHeader("2b7b6af6", 1, 24) + f64(0) + le32(0) + le32(0) + le32(1500) + le32(900);
    }

    /// Starts in the folder of the movie, so that the output has no path of this machine.
    static ToolOptions besideMovie() {
        ToolOptions options;
        options.folder = std::filesystem::path(movie()).parent_path();
        return options;
    }

    ToolResult insights(std::vector<std::string> arguments) const {
        arguments.insert(arguments.begin(), "insights");
        return runTool(arguments);
    }

    Json fileIn(std::vector<std::string> arguments) const {
        arguments.emplace_back("--json");
        return Json::parse(insights(arguments).output).at("files").at(0);
    }
};

TEST_F(InsightsCommand, ShowsWhatHappens) {
    const ToolResult result = runTool({"insights", "Recording.mp4"}, besideMovie());
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.errors, IsEmpty());
    expectGolden(result.output, "insights.txt");
}

TEST_F(InsightsCommand, ShowsTheSameAsJson) {
    const ToolResult result = runTool({"insights", "--json", "Recording.mp4"}, besideMovie());
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    expectGolden(result.output, "insights.json");
}

TEST_F(InsightsCommand, PrintsOnlyWhatThereIs) {
    const std::string file = movieWith({actions(action(1, 1 | 16) + action(1.5, 2)), locations(pointEntry(0, 10, 20))});
    EXPECT_EQ(insights({file, "--quiet"}).output, file + ": 20.000 s, 1 click, 18.500 s idle, 0 chapters, 0 zooms\n"
                                                         "     start s       end s  clicks\n"
                                                         "       1.000       1.500  shift left at 10,20\n"
                                                         "     start s       end s  idle time\n"
                                                         "       1.500      20.000  18.500 s\n");
}

TEST_F(InsightsCommand, MasksWhatWasTyped) {
    const std::string file = movieWith({keys(key(1, 'p') + key(1.2, 'w') + key(1.4, 13))});
    EXPECT_THAT(insights({file}).output, HasSubstr(s_bullet + s_bullet + " [returnKey]\n"));
    EXPECT_THAT(insights({file, "--show-keys"}).output, HasSubstr("pw [returnKey]\n"));
    EXPECT_EQ(fileIn({file}).at("captions").at(0).at("text"), s_bullet + s_bullet + " [returnKey]");
    EXPECT_EQ(fileIn({file, "--show-keys"}).at("captions").at(0).at("keys").at(1).at("label"), "w");
}

TEST_F(InsightsCommand, DescribesOddClicks) {
    const std::string file = movieWith({actions(action(1, 1) + action(1.1, 2) + action(1.2, 1) + action(1.3, 2) +
                                                action(3, 4) + action(4, 8) + action(5, 16)),
                                        locations(pointEntry(0, 10, 20) + pointEntry(3.5, 90, 80))});
    const std::string text = insights({file, "--quiet"}).output;
    EXPECT_THAT(text, HasSubstr("1.200       1.300  left at 10,20, click 2 in a row\n"));
    EXPECT_THAT(text, HasSubstr("3.000       4.000  right drag at 10,20 to 90,80\n"));
    EXPECT_THAT(text, HasSubstr("5.000       6.000  middle at 90,80, release not recorded\n"));
}

TEST_F(InsightsCommand, TakesItsParameters) {
    const std::string titles = streamHeader("2b7b6a07", 1, 0) + textEntry(0, "Mail") + textEntry(8, "Code");
    const std::string file =
        movieWith({actions(action(10, 1) + action(10.1, 2)), locations(pointEntry(0, 700, 450)), titles, region()});
    const Json usual = fileIn({file});
    EXPECT_EQ(usual.at("idle").size(), 2U);
    EXPECT_EQ(usual.at("chapters").size(), 1U);
    EXPECT_EQ(usual.at("zooms").at(0).at("factor"), 1.5);
    const Json other = fileIn({file, "--idle", "9.95", "--chapter", "5", "--zoom", "3"});
    EXPECT_EQ(other.at("idle").size(), 1U);
    EXPECT_EQ(other.at("chapters").size(), 2U);
    EXPECT_EQ(other.at("zooms").at(0).at("places").at(0).at("area").at("width"), 500);
    EXPECT_THAT(insights({file}).output, HasSubstr("9.600      11.900  1.5 times: clicks around 700,450\n"));
}

TEST_F(InsightsCommand, RefusesImpossibleParameters) {
    for (const std::string factor : {"0.5", "101", "x", "nan", ""}) {
        const ToolResult result = insights({movie(), "--zoom", factor});
        EXPECT_EQ(result.exitCode, 2);
        EXPECT_THAT(result.errors, HasSubstr("--zoom"));
    }
    EXPECT_EQ(insights({movie(), "--idle", "-1"}).exitCode, 2);
    EXPECT_EQ(insights({}).exitCode, 2);
}

TEST_F(InsightsCommand, SaysIfTheRegionIsNotKnown) {
    const std::string file = movieWith({actions(action(1, 1) + action(1.5, 2)), locations(pointEntry(0, 10, 20))});
    const ToolResult result = insights({file});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_THAT(result.errors,
                HasSubstr(file + ": has no stream recordingRegion, so it is not known where to zoom in"));
    EXPECT_EQ(fileIn({file}).at("screen"), nullptr);
}

TEST_F(InsightsCommand, EndsWithFourWithoutMetaData) {
    writeFile(folder / "plain.mp4", tinyMovie());
    const ToolResult plain = insights({folder / "plain.mp4"});
    EXPECT_EQ(plain.exitCode, 4);
    EXPECT_THAT(plain.output, IsEmpty());
    EXPECT_THAT(plain.errors, HasSubstr("has no recording metadata"));
    const ToolResult other = insights({streamFile("cpuUsage")});
    EXPECT_EQ(other.exitCode, 4);
    EXPECT_THAT(other.errors, HasSubstr("has no stream cursorAction or "));
}

TEST_F(InsightsCommand, EndsWithOneIfAFileCannotBeRead) {
    const ToolResult result = insights({folder / "none.mp4", movie()});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("none.mp4: no such file"));
    EXPECT_THAT(result.output, HasSubstr("6 clicks"));
}

TEST_F(InsightsCommand, EndsWithThreeIfSomethingIsDamaged) {
    const std::string torn = movieWith({actions(action(1, 1) + action(1.5, 2) + "torn")});
    const ToolResult result = insights({torn});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("cursorAction cannot be read from offset"));
    EXPECT_THAT(result.output, HasSubstr("1 click,"));
    const std::string newer = movieWith({streamHeader("2b7b6af0", 9, 12), locations(pointEntry(0, 10, 20))});
    EXPECT_EQ(insights({newer}).exitCode, 3);
    EXPECT_THAT(insights({newer}).errors, HasSubstr("cursorAction has version 9"));
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const std::string timeless = movieWith({actions(action(nan, 1) + action(1, 1) + action(2, 2))});
    EXPECT_EQ(insights({timeless}).exitCode, 3);
    EXPECT_THAT(insights({timeless}).errors, HasSubstr("cursorAction: left out 1 entry at no time"));
}

TEST_F(InsightsCommand, ReadsStandardInput) {
    ToolOptions options;
    options.input = contentsOf(movie());
    const ToolResult result = runTool({"insights", "-"}, options);
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.output, testing::StartsWith("-: 20.000 s, 6 clicks"));
}

TEST_F(InsightsCommand, ShowsTextsWithEscapes) {
    const std::string titles = streamHeader("2b7b6a07", 1, 0) + textEntry(0, "a\x1b[31m\xff");
    const std::string file = movieWith({titles});
    EXPECT_THAT(insights({file}).output, HasSubstr("a\\x1b[31m\\xff\n"));
    EXPECT_EQ(fileIn({file}).at("chapters").at(0).at("title_base64"), "YRtbMzFt/w==");
}

} // namespace
} // namespace ZULMetaData::Test
