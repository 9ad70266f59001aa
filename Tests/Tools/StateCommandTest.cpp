// `zulm state`: what holds at given times.

#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>
#include <nlohmann/json.hpp>

#include <cmath>
#include <limits>

namespace ZULMetaData::Test {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr double s_infinity = std::numeric_limits<double>::infinity();

// The first group of digits of each kind's identifier.
const std::string s_actions = "2b7b6af0";
const std::string s_cursors = "2b7b6af1";
const std::string s_positions = "2b7b6af2";
const std::string s_opacities = "2b7b6af3";
const std::string s_keys = "2b7b6af5";
const std::string s_regions = "2b7b6af6";
const std::string s_windows = "2b7b6af7";
const std::string s_slideTitles = "2b7b6af8";
const std::string s_slideTexts = "2b7b6af9";
const std::string s_slideComments = "2b7b6afa";
const std::string s_scales = "2b7b6afb";
const std::string s_scrolls = "2b7b6a05";
const std::string s_applications = "2b7b6a06";
const std::string s_titles = "2b7b6a07";
const std::string s_loads = "2b7b6a08";
const std::string s_hovers = "2b7b6a09";

std::string texts(const std::string& group, const std::string& entries) {
    return streamHeader(group, 1, 0) + entries;
}

std::string rectEntry(double time, std::int32_t x, std::int32_t y, std::int32_t width, std::int32_t height) {
    return f64(time) + raw(x) + raw(y) + raw(width) + raw(height);
}

std::string actionEntry(double time, std::int32_t stored) {
    return f64(time) + raw(stored);
}

std::string actions(const std::string& entries) {
    return streamHeader(s_actions, 1, 12) + entries;
}

std::string keyEntry(double time, std::uint32_t flags) {
    return f64(time) + le32('A') + le32(flags);
}

std::string keys(const std::string& entries) {
    return streamHeader(s_keys, 1, 16) + entries;
}

std::string positions(const std::string& entries) {
    return streamHeader(s_positions, 1, 16) + entries;
}

/// A cursor without a picture.
std::string cursorEntry(double time, std::uint64_t id) {
    return le32(28) + f64(time) + le64(id) + le32(8) + le32(0) + le32(3);
}

/// A cursor with a picture, of which nothing is decoded here.
std::string pictureEntry(double time, std::uint64_t id, std::int32_t x, std::int32_t y, const std::string& picture) {
    const auto size = static_cast<std::uint32_t>(picture.size());
    return le32(40 + size) + f64(time) + le64(id) + le32(20 + size) + le32(size) + raw(x) + raw(y) + picture + raw(-1) +
           le32(3);
}

std::string cursors(const std::string& entries) {
    return streamHeader(s_cursors, 2, 0) + entries;
}

class StateCommand : public RecordedSession {
protected:
    /// A movie of these streams.
    std::string recordingOf(const std::vector<std::string>& streams) const {
        std::string children;
        for (const std::string& stream : streams)
            children += extendedAtom("DATA", stream);
        writeFile(folder / "Recording.mp4", movieWith(children));
        return folder / "Recording.mp4";
    }

    static json documentOf(const std::string& file, const std::string& times,
                           const std::vector<std::string>& more = {}) {
        std::vector<std::string> arguments{"state", file, "--at", times, "--json"};
        arguments.insert(arguments.end(), more.begin(), more.end());
        const ToolResult result = runTool(arguments);
        EXPECT_EQ(result.exitCode, 0) << result.errors;
        return json::parse(result.output);
    }

    /// What holds at one time.
    static json stateOf(const std::string& file, const std::string& time) {
        const json states = documentOf(file, time).at("files").at(0).at("states");
        EXPECT_EQ(states.size(), 1U);
        return states.at(0);
    }

    /// The same for a movie of these streams.
    json stateIn(const std::vector<std::string>& streams, const std::string& time) const {
        return stateOf(recordingOf(streams), time);
    }

    /// One member of the states at several times.
    static json membersOf(const std::string& file, const std::string& times, const std::string& member,
                          const std::vector<std::string>& more = {}) {
        const json document = documentOf(file, times, more);
        json members = json::array();
        for (const json& state : document.at("files").at(0).at("states"))
            members.push_back(state.at(member));
        return members;
    }

    static int exitCodeFor(const std::vector<std::string>& arguments) { return runTool(arguments).exitCode; }
};

json rect(int x, int y, int width, int height) {
    return {{"x", x}, {"y", y}, {"width", width}, {"height", height}};
}

// ---- The document ---------------------------------------------------------------------------------------------

TEST_F(StateCommand, HasTheMembersOfEveryState) {
    const json document = documentOf(movie(), "1");
    EXPECT_EQ(document.at("schema"), "zulm.state");
    EXPECT_EQ(document.at("schema_version"), 1);
    EXPECT_THAT(document.at("errors"), IsEmpty());
    ASSERT_EQ(document.at("files").size(), 1U);
    EXPECT_EQ(document.at("files")[0].at("path"), movie());
    const json state = document.at("files")[0].at("states").at(0);
    std::vector<std::string> members;
    for (const auto& [name, value] : state.items())
        members.push_back(name);
    EXPECT_THAT(members, testing::UnorderedElementsAre("time", "cursor", "cursor_image", "opacity", "buttons",
                                                       "modifiers", "window", "title", "application", "slide", "hover",
                                                       "region", "scale", "cpu"));
}

TEST_F(StateCommand, HasNullForWhatIsNotKnown) {
    const std::string file = recordingOf({positions(pointEntry(5, 1, 2)), actions(actionEntry(5, 1)),
                                          keys(keyEntry(5, 0)), cursors(cursorEntry(5, 7)),
                                          texts(s_slideTitles, textEntry(5, "a")), texts(s_titles, textEntry(5, "b"))});
    const json state = stateOf(file, "4.9");
    for (const auto& [member, value] : state.items())
        if (member != "time") {
            EXPECT_TRUE(value.is_null()) << member;
        }
}

TEST_F(StateCommand, HasEverythingThatHolds) {
    const json state = stateIn(
        {positions(pointEntry(1, 340, -200)), cursors(pictureEntry(1, 18364758544493064720U, 3, -2, "png")),
         streamHeader(s_opacities, 1, 16) + f64(1) + f64(0.1), actions(actionEntry(1, 1 + 16 + 64)),
         keys(keyEntry(1, 0x00020000)), streamHeader(s_windows, 1, 24) + rectEntry(1, 10, -3, 100, 50),
         texts(s_titles, textEntry(1, "Inbox (3)")), texts(s_applications, textEntry(1, "Mail")),
         texts(s_slideTitles, textEntry(1, "Intro")), texts(s_slideTexts, textEntry(1, "a\nb")),
         texts(s_slideComments, textEntry(1, "slow down")), streamHeader(s_hovers, 1, 24) + rectEntry(1, 5, 6, 7, 8),
         streamHeader(s_regions, 1, 24) + rectEntry(0, 0, 0, 1280, 720),
         streamHeader(s_scales, 1, 12) + f64(0) + raw(2), streamHeader(s_loads, 1, 12) + f64(1) + f32(0.1F)},
        "2");
    EXPECT_EQ(state, json({{"time", 2.0},
                           {"cursor", {{"x", 340}, {"y", -200}}},
                           {"cursor_image",
                            {{"id", "18364758544493064720"}, {"hotspot_x", 3}, {"hotspot_y", -2}, {"bytes", 3}}},
                           {"opacity", 0.1},
                           {"buttons", {"left"}},
                           {"modifiers", {"shift"}},
                           {"window", rect(10, -3, 100, 50)},
                           {"title", "Inbox (3)"},
                           {"application", "Mail"},
                           {"slide", {{"title", "Intro"}, {"text", "a\nb"}, {"comment", "slow down"}}},
                           {"hover", rect(5, 6, 7, 8)},
                           {"region", rect(0, 0, 1280, 720)},
                           {"scale", 2},
                           {"cpu", 0.1}}));
}

TEST_F(StateCommand, AnswersInTheOrderGiven) {
    const std::string file = recordingOf({texts(s_titles, textEntry(1, "a") + textEntry(2, "b") + textEntry(3, "c"))});
    EXPECT_EQ(membersOf(file, "2.5,9,0,1,2.5", "title"), json({"b", "c", nullptr, "a", "b"}));
    EXPECT_EQ(membersOf(file, "2.5,9,0,1,2.5", "time"), json({2.5, 9.0, 0.0, 1.0, 2.5}));
}

// ---- Times ----------------------------------------------------------------------------------------------------

TEST_F(StateCommand, TakesTimesAsInEditListsAndTimeCodes) {
    EXPECT_EQ(membersOf(movie(), "12.5,61/3,0,90,1:30,0:01:02.5,00.50,7/2", "time"),
              json({12.5, 61.0 / 3, 0.0, 90.0, 90.0, 62.5, 0.5, 3.5}));
}

TEST_F(StateCommand, TakesTheNearestNumber) {
    EXPECT_EQ(membersOf(movie(), "0.1,9007199254740993,9007199254740995", "time"),
              json({0.1, 9007199254740992.0, 9007199254740996.0}));
}

TEST_F(StateCommand, RefusesOtherTimes) {
    for (const std::string times : {"",    ",",   "1,",  ",1",  "1,,2", "-1",    "+1",   "1e3",     " 1", "1 ",
                                    "0x1", "nan", "inf", "1/0", "1/-2", "1.5/2", "1:60", "1:2:3:4", ".",  "now"}) {
        const ToolResult result = runTool({"state", movie(), "--at=" + times, "--json"});
        EXPECT_EQ(result.exitCode, 2) << times;
        EXPECT_EQ(result.output, "") << times;
    }
    EXPECT_EQ(exitCodeFor({"state", movie(), "--at", std::string(400, '9')}), 2);
    EXPECT_THAT(runTool({"state", movie(), "--at", "1,soon"}).errors, HasSubstr("--at: 'soon' is not a time; give "));
}

TEST_F(StateCommand, NeedsARecordingAndTimes) {
    EXPECT_EQ(exitCodeFor({"state", movie()}), 2);
    EXPECT_EQ(exitCodeFor({"state", "--at", "1"}), 2);
    EXPECT_EQ(exitCodeFor({"state", movie(), movie(), "--at", "1"}), 2);
    EXPECT_EQ(exitCodeFor({"state", movie(), "--at", "1", "--at", "2"}), 2);
    EXPECT_EQ(exitCodeFor({"state", movie(), "--at", "1", "--interpolate", "cubic"}), 2);
}

// ---- The cursor -----------------------------------------------------------------------------------------------

TEST_F(StateCommand, MovesTheCursorInAStraightLine) {
    const std::string file = recordingOf({positions(pointEntry(1, 0, 100) + pointEntry(2, 100, 50))});
    EXPECT_EQ(membersOf(file, "0.9,1,1.25,2,9", "cursor"), json({nullptr,
                                                                 {{"x", 0}, {"y", 100}},
                                                                 {{"x", 25}, {"y", 87.5}},
                                                                 {{"x", 100}, {"y", 50}},
                                                                 {{"x", 100}, {"y", 50}}}));
    EXPECT_EQ(membersOf(file, "1.25", "cursor", {"--interpolate", "linear"}), membersOf(file, "1.25", "cursor"));
}

TEST_F(StateCommand, HoldsTheCursorIfItIsNotInterpolated) {
    const std::string file = recordingOf({positions(pointEntry(1, 0, 100) + pointEntry(2, 100, 50))});
    EXPECT_EQ(membersOf(file, "0.9,1,1.999,2", "cursor", {"--interpolate", "none"}),
              json({nullptr, {{"x", 0}, {"y", 100}}, {{"x", 0}, {"y", 100}}, {{"x", 100}, {"y", 50}}}));
}

TEST_F(StateCommand, RestsTheCursorWhileNothingWasRecorded) {
    std::string entries;
    for (int i = 0; i <= 10; ++i)
        entries += pointEntry(i, i * 10, 0);
    entries += pointEntry(20, 500, 0); // 10 s after the last one; usually there is 1 s between two
    const std::string file = recordingOf({positions(entries)});
    EXPECT_EQ(membersOf(file, "9.5,10,15,18.999,19,19.25,19.5,20", "cursor"), json({{{"x", 95}, {"y", 0}},
                                                                                    {{"x", 100}, {"y", 0}},
                                                                                    {{"x", 100}, {"y", 0}},
                                                                                    {{"x", 100}, {"y", 0}},
                                                                                    {{"x", 100}, {"y", 0}},
                                                                                    {{"x", 200}, {"y", 0}},
                                                                                    {{"x", 300}, {"y", 0}},
                                                                                    {{"x", 500}, {"y", 0}}}));
}

TEST_F(StateCommand, DoesNotRestForTwiceTheUsualDistance) {
    std::string entries;
    for (int i = 0; i <= 10; ++i)
        entries += pointEntry(i, 0, 0);
    const std::string file = recordingOf({positions(entries + pointEntry(12, 100, 0))});
    EXPECT_EQ(membersOf(file, "11", "cursor"), json({{{"x", 50}, {"y", 0}}}));
}

TEST_F(StateCommand, HasThePictureOfTheLastEarlierEntryOrTheFirstLaterOne) {
    const std::string file =
        recordingOf({cursors(cursorEntry(1, 7) + pictureEntry(2, 7, 1, 2, "old!") + cursorEntry(3, 7) +
                             pictureEntry(4, 7, 3, 4, "newer") + cursorEntry(5, 7) + cursorEntry(6, 8))});
    const auto image = [](int x, int y, int bytes) {
        return json{{"id", "7"}, {"hotspot_x", x}, {"hotspot_y", y}, {"bytes", bytes}};
    };
    EXPECT_EQ(membersOf(file, "0,1,2,3,4,5", "cursor_image"),
              json({nullptr, image(1, 2, 4), image(1, 2, 4), image(1, 2, 4), image(3, 4, 5), image(3, 4, 5)}));
    EXPECT_EQ(membersOf(file, "6", "cursor_image"),
              json({{{"id", "8"}, {"hotspot_x", nullptr}, {"hotspot_y", nullptr}, {"bytes", nullptr}}}));
}

// ---- Buttons and modifiers ------------------------------------------------------------------------------------

TEST_F(StateCommand, ListsButtonsInTheirOrder) {
    const std::string file = recordingOf({actions(actionEntry(1, 16) + actionEntry(2, 4) + actionEntry(3, 1) +
                                                  actionEntry(4, 8) + actionEntry(5, 32) + actionEntry(6, 2))});
    EXPECT_EQ(membersOf(file, "0.9,1,2,3,4,5,6", "buttons"), json({nullptr,
                                                                   {"middle"},
                                                                   {"right", "middle"},
                                                                   {"left", "right", "middle"},
                                                                   {"left", "middle"},
                                                                   {"left"},
                                                                   json::array()}));
}

TEST_F(StateCommand, KnowsButtonsFromTheFirstCursorActionOn) {
    const std::string file = recordingOf({actions(actionEntry(1, 256) + actionEntry(2, 256 + 1))});
    EXPECT_EQ(membersOf(file, "0.5,1,2", "buttons"), json({nullptr, json::array(), {"left"}}));
    EXPECT_EQ(stateIn({keys(keyEntry(1, 0))}, "2").at("buttons"), nullptr);
}

TEST_F(StateCommand, ListsModifiersInTheirOrder) {
    EXPECT_EQ(stateIn({keys(keyEntry(1, 0x801f0000))}, "1").at("modifiers"),
              json({"alpha", "shift", "ctrl", "alt", "cmd", "win"}));
    EXPECT_EQ(stateIn({actions(actionEntry(1, 2 + 16 + 32 + 64 + 128))}, "1").at("modifiers"),
              json({"shift", "ctrl", "alt", "cmd"}));
}

TEST_F(StateCommand, HasTheModifiersOfTheLastActionOrKey) {
    const std::string file =
        recordingOf({actions(actionEntry(1, 1 + 16) + actionEntry(3, 2 + 32) + actionEntry(5, 1 + 64)),
                     keys(keyEntry(2, 0x00100000) + keyEntry(4, 0) + keyEntry(5, 0x00080000 + 0x00020000))});
    EXPECT_EQ(membersOf(file, "0.5,1,2,3,4,5", "modifiers"),
              json({nullptr, {"shift"}, {"cmd"}, {"ctrl"}, json::array(), {"shift", "alt"}}));
}

TEST_F(StateCommand, LearnsNoModifiersFromTheMiddleButtonAndFromActionsWithoutAButton) {
    const std::string quiet =
        actionEntry(2, 16 + 64) + actionEntry(3, 32) + actionEntry(4, 256) + actionEntry(5, 128) + actionEntry(6, 0);
    EXPECT_EQ(stateIn({actions(quiet)}, "9").at("modifiers"), nullptr);
    EXPECT_EQ(stateIn({actions(actionEntry(1, 4 + 16) + quiet)}, "9").at("modifiers"), json({"shift"}));
}

// ---- Other values ---------------------------------------------------------------------------------------------

TEST_F(StateCommand, HasASlideIfOneOfItsTextsIsKnown) {
    const std::string file =
        recordingOf({texts(s_slideTitles, textEntry(3, "t")), texts(s_slideComments, textEntry(2, ""))});
    EXPECT_EQ(membersOf(file, "1,2,3", "slide"), json({nullptr,
                                                       {{"title", nullptr}, {"text", nullptr}, {"comment", ""}},
                                                       {{"title", "t"}, {"text", nullptr}, {"comment", ""}}}));
}

TEST_F(StateCommand, HasTheLastRegionAndScaleUntilThen) {
    const std::string file =
        recordingOf({streamHeader(s_regions, 1, 24) + rectEntry(1, 0, 0, 10, 10) + rectEntry(2, 5, 5, 0, 0),
                     streamHeader(s_scales, 1, 12) + f64(1) + raw(2) + f64(2) + raw(-1)});
    EXPECT_EQ(membersOf(file, "0,1,2", "region"), json({nullptr, rect(0, 0, 10, 10), rect(5, 5, 0, 0)}));
    EXPECT_EQ(membersOf(file, "0,1,2", "scale"), json({nullptr, 2, -1}));
}

TEST_F(StateCommand, NamesNumbersThatAreNotFinite) {
    const std::string opacities = streamHeader(s_opacities, 1, 16) + f64(1) + f64(s_infinity) + f64(2) +
                                  f64(-s_infinity) + f64(3) + f64(std::nan("")) + f64(4) + f64(5e-324);
    EXPECT_EQ(membersOf(recordingOf({opacities}), "1,2,3,4", "opacity"),
              json({"Infinity", "-Infinity", "NaN", 5e-324}));
    const auto infinite = static_cast<float>(s_infinity);
    const std::string loads = streamHeader(s_loads, 1, 12) + f64(1) + f32(infinite) + f64(2) + f32(-infinite) + f64(3) +
                              f32(std::nanf("")) + f64(4) + f32(48.367355F);
    EXPECT_EQ(membersOf(recordingOf({loads}), "1,2,3,4", "cpu"), json({"Infinity", "-Infinity", "NaN", 48.367355}));
}

TEST_F(StateCommand, WritesNumbersInTheFewestDigits) {
    const std::string file = recordingOf({streamHeader(s_opacities, 1, 16) + f64(0) + f64(16999.21443197597),
                                          streamHeader(s_loads, 1, 12) + f64(0) + f32(0.3F)});
    const std::string output = runTool({"state", file, "--at", "0", "--json"}).output;
    EXPECT_THAT(output, HasSubstr("\"opacity\": 16999.21443197597,"));
    EXPECT_THAT(output, HasSubstr("\"cpu\": 0.3\n"));
}

TEST_F(StateCommand, KeepsTheBytesOfTextsThatAreNotUTF8) {
    const json state = stateIn({texts(s_titles, textEntry(1, "Caf\xe9")), texts(s_slideTexts, textEntry(1, "\xff")),
                                texts(s_applications, textEntry(1, std::string("a\0b", 3)))},
                               "1");
    EXPECT_EQ(state.at("title"), "Caf\xef\xbf\xbd");
    EXPECT_EQ(state.at("title_base64"), "Q2Fm6Q==");
    EXPECT_EQ(state.at("slide").at("text_base64"), "/w==");
    EXPECT_EQ(state.at("application"), std::string("a\0b", 3));
    EXPECT_FALSE(state.contains("application_base64"));
}

TEST_F(StateCommand, LeavesOutEntriesAtNoTimeAndOrdersTheOthers) {
    const std::string file =
        recordingOf({texts(s_titles, textEntry(3, "late") + textEntry(std::nan(""), "never") + textEntry(1, "early") +
                                         textEntry(s_infinity, "never") + textEntry(3, "later"))});
    EXPECT_EQ(membersOf(file, "0,2,3,1000000", "title"), json({nullptr, "early", "later", "later"}));
}

TEST_F(StateCommand, KnowsWhatWasBeforeTheBeginning) {
    EXPECT_EQ(stateIn({texts(s_titles, textEntry(-5, "before"))}, "0").at("title"), "before");
}

// ---- Files ----------------------------------------------------------------------------------------------------

TEST_F(StateCommand, HasNullForAStreamThatCannotBeDecodedAndWarns) {
    const std::string file =
        recordingOf({texts(s_titles, textEntry(1, "a")), streamHeader(s_applications, 9, 0) + textEntry(1, "b"),
                     streamHeader(s_windows, 1, 16) + std::string(16, 'x')});
    const ToolResult result = runTool({"state", file, "--at", "2", "--json"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_THAT(result.errors, HasSubstr(file + ": the stream topmostAppName has version 9"));
    EXPECT_THAT(result.errors, HasSubstr(file + ": the stream topmostWindow states entries of 16 bytes instead of 24"));
    const json document = json::parse(result.output);
    EXPECT_THAT(document.at("errors"), IsEmpty());
    const json state = document.at("files")[0].at("states").at(0);
    EXPECT_EQ(state.at("application"), nullptr);
    EXPECT_EQ(state.at("window"), nullptr);
    EXPECT_EQ(state.at("title"), "a");
    EXPECT_EQ(runTool({"--quiet", "state", file, "--at", "2"}).errors, "");
}

TEST_F(StateCommand, SaysNothingAboutStreamsThatItDoesNotShow) {
    const std::string file = recordingOf({texts(s_titles, textEntry(1, "a")), streamHeader(s_scrolls, 9, 16)});
    EXPECT_EQ(runTool({"state", file, "--at", "2"}).errors, "");
}

TEST_F(StateCommand, HasWhatPrecedesATornEntry) {
    EXPECT_EQ(stateIn({texts(s_titles, textEntry(1, "a") + textEntry(2, "torn").substr(0, 9))}, "3").at("title"), "a");
}

TEST_F(StateCommand, EndsWithFourWithoutMetaData) {
    writeFile(folder / "plain.mp4", tinyMovie());
    const ToolResult result = runTool({"state", folder / "plain.mp4", "--at", "1", "--json"});
    EXPECT_EQ(result.exitCode, 4);
    const json document = json::parse(result.output);
    EXPECT_THAT(document.at("files"), IsEmpty());
    EXPECT_THAT(document.at("errors").at(0).at("message").get<std::string>(), HasSubstr("has no recording metadata"));
    EXPECT_THAT(runTool({"state", folder / "plain.mp4", "--at", "1"}).errors,
                HasSubstr("plain.mp4: has no recording metadata; 'zulm salvage "));
}

TEST_F(StateCommand, EndsWithOneForAFileThatCannotBeRead) {
    const ToolResult result = runTool({"state", folder / "missing.mp4", "--at", "1"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("missing.mp4: no such file"));
    writeFile(folder / "notes.txt", std::string(100, 'x'));
    EXPECT_EQ(exitCodeFor({"state", folder / "notes.txt", "--at", "1"}), 1);
    EXPECT_EQ(exitCodeFor({"state", folder.path().string(), "--at", "1"}), 1);
}

TEST_F(StateCommand, ReadsStandardInputAndStreamFiles) {
    ToolOptions options;
    options.input = contentsOf(movie());
    const ToolResult result = runTool({"state", "-", "--at", "1", "--json"}, options);
    EXPECT_EQ(result.exitCode, 0);
    json document = json::parse(result.output);
    EXPECT_EQ(document.at("files").at(0).at("path"), "-");
    EXPECT_EQ(document.at("files").at(0).at("states"), documentOf(movie(), "1").at("files").at(0).at("states"));
    EXPECT_NE(stateOf(streamFile("topmostAppName"), "1").at("application"), nullptr);
    EXPECT_EQ(stateOf(streamFile("topmostAppName"), "1").at("cursor"), nullptr);
}

TEST_F(StateCommand, WarnsOfAMisleadingName) {
    const std::string copy = copyOf(movie(), "Recording.avi");
    EXPECT_THAT(runTool({"state", copy, "--at", "1"}).errors, HasSubstr("is a movie by its contents"));
}

// ---- Text -----------------------------------------------------------------------------------------------------

TEST_F(StateCommand, PrintsWhatIsKnown) {
    const std::string file = recordingOf(
        {positions(pointEntry(1, 0, 0) + pointEntry(4, 10, -20)), cursors(cursorEntry(1, 8)),
         actions(actionEntry(1, 1 + 16 + 128)), streamHeader(s_windows, 1, 24) + rectEntry(1, 10, -3, 100, 50),
         texts(s_titles, textEntry(1, "a\n\x1b[2J")), streamHeader(s_loads, 1, 12) + f64(1) + f32(32)});
    ToolOptions options;
    options.folder = folder.path().string();
    EXPECT_EQ(runTool({"state", "Recording.mp4", "--at", "0,2"}, options).output,
              "Recording.mp4 at 0 s\n"
              "  nothing is known yet\n"
              "\n"
              "Recording.mp4 at 2 s\n"
              "  cursor       3.33333, -6.66667\n"
              "  shape        picture 8, which is not in the recording\n"
              "  buttons      left\n"
              "  modifiers    shift, cmd\n"
              "  window       100 x 50 at 10, -3\n"
              "  title        a\\x0a\\x1b[2J\n"
              "  cpu          32\n");
    EXPECT_EQ(runTool({"state", "Recording.mp4", "--at", "61/3"}, options).output.substr(0, 40),
              "Recording.mp4 at 20.333333333333332 s\n  ");
}

} // namespace
} // namespace ZULMetaData::Test
