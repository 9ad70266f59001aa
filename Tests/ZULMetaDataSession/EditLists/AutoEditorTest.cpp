#include "Tests/ZULMetaDataSession/EditListTexts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

std::vector<std::string> piecesOfChunks(const std::string& chunks, const EditListOptions& options = atFrameRate(30)) {
    return piecesOf(R"({"version": "1", "source": "a.mp4", "chunks": [)" + chunks + "]}", "a.json", options);
}

std::vector<std::string> piecesOfClips(const std::string& effects, const std::string& clips) {
    return piecesOf(R"({"version": "2", "source": "a.mp4", "tb": "30/1", "effects": [)" + effects + R"(], "clips": [)" +
                        clips + "]}",
                    "a.v2");
}

std::vector<std::string> piecesOfLayers(const std::string& layers, const std::string& more = "") {
    return piecesOf(R"({"version": "3", "timebase": "30000/1001", "v": [)" + layers + R"(], "a": [[{}]])" + more + "}",
                    "a.v3");
}

/// Returns a clip of version 3; `more` holds further members.
std::string clip(int start, int duration, int offset, const std::string& more = "") {
    return R"({"name": "video", "src": "a.mp4", "start": )" + std::to_string(start) + R"(, "dur": )" +
           std::to_string(duration) + R"(, "offset": )" + std::to_string(offset) + R"(, "stream": 0)" + more + '}';
}

TEST(AutoEditor, KeepsTheChunksThatAreNotCut) {
    EXPECT_THAT(piecesOfChunks("[0, 26, 1.0], [26, 34, 99999.0], [34, 396, 2], [396, 410, 0], [410, 500, 0.5],"),
                ElementsAre("0-13/15@1=13/15", "17/15-66/5@2=181/30", "41/3-50/3@1/2=6"));
    EXPECT_THAT(piecesOfChunks(""), IsEmpty());
}

TEST(AutoEditor, CountsChunksInTheTimebaseOfTheFile) {
    EXPECT_THAT(
        piecesOf(R"({"version": "1", "timebase": "30000/1001", "source": "", "chunks": [[30, 60, 1]]})", "a.v1"),
        ElementsAre("1001/1000-1001/500@1=1001/1000"));
    EXPECT_THAT(piecesOfChunks("[0, 26, 1]", {}), ElementsAre("a.json: it counts frames; name its frame rate"));
    for (const char* timebase : {"29.97", "0/1", "", "x", "30/0"})
        EXPECT_THAT(
            piecesOf(R"({"version": "1", "timebase": ")" + std::string(timebase) + R"(", "source": "", "chunks": []})",
                     "a.v1", atFrameRate(30)),
            ElementsAre("a.v1: \"timebase\" is no fraction such as \"30/1\" or \"30000/1001\""))
            << timebase;
}

TEST(AutoEditor, RefusesOtherChunks) {
    EXPECT_THAT(piecesOfChunks("[0, 1, 1], [0, 26]"),
                ElementsAre("a.json: chunk 2: it is no array of start, end and speed"));
    EXPECT_THAT(piecesOfChunks("[0, \"26\", 1]"),
                ElementsAre("a.json: chunk 1: the end is no number, or one of more than 400 places"));
    EXPECT_THAT(piecesOfChunks("[0, 26, -1]"), ElementsAre("a.json: chunk 1: speed is negative: -1"));
    EXPECT_THAT(piecesOfChunks("[26, 0, 1]"), ElementsAre(HasSubstr("a.json: chunk 1: end is 0")));
    EXPECT_THAT(piecesOf(R"({"version": "1", "chunks": []})", "a.json", atFrameRate(30)),
                ElementsAre("a.json: \"source\" is missing"));
    EXPECT_THAT(piecesOf(R"({"version": 1, "chunks": []})", "a.json"), ElementsAre("a.json: \"version\" is no text"));
    EXPECT_THAT(piecesOf(R"({"version": "4", "v": []})", "a.json"),
                ElementsAre("a.json: the timeline is of version \"4\"; versions 1, 2 and 3 can be read"));
}

TEST(AutoEditor, LooksUpTheEffectOfAClip) {
    EXPECT_THAT(piecesOfClips(R"([], ["speed:2.0", "volume:0.5"], ["cut"], ["varispeed:1.5", "speed:2"])",
                              "[0, 30, 0], [30, 60, 1], [60, 90, 2], [90, 180, 3]"),
                ElementsAre("0-1@1=1", "1-2@2=1/2", "3-6@3=1"));
    EXPECT_THAT(piecesOfClips("[]", "[0, 30, 1]"), ElementsAre("a.v2: clip 1: there is no effect \"1\""));
    EXPECT_THAT(piecesOfClips("[]", "[0, 30, -1]"), ElementsAre("a.v2: clip 1: there is no effect \"-1\""));
    EXPECT_THAT(piecesOfClips("[]", "[0, 30, 0.5]"), ElementsAre("a.v2: clip 1: there is no effect \"1/2\""));
    EXPECT_THAT(piecesOfClips(R"([], ["zoom:1.5"])", "[0, 30, 0]"),
                ElementsAre("a.v2: effect 1: an edit list cannot say the action \"zoom:1.5\""));
    EXPECT_THAT(piecesOfClips(R"(["speed"])", ""),
                ElementsAre("a.v2: effect 0: the action \"speed\" has no speed above 0"));
    EXPECT_THAT(piecesOfClips(R"(["speed:-1"])", ""),
                ElementsAre("a.v2: effect 0: the action \"speed:-1\" has no speed above 0"));
    EXPECT_THAT(piecesOfClips("[1]", ""), ElementsAre("a.v2: effect 0: an action is no text"));
    EXPECT_THAT(piecesOfClips("{}", ""), ElementsAre("a.v2: effect 0: the actions are no array"));
}

TEST(AutoEditor, PlaysTheOneLayerOfPictures) {
    EXPECT_THAT(piecesOfLayers('[' + clip(0, 30, 0) + ',' + clip(30, 60, 300) + ']'),
                ElementsAre("0-1001/1000@1=1001/1000", "1001/100-3003/250@1=1001/500"));
    EXPECT_THAT(piecesOfLayers("[], [" + clip(0, 30, 0) + ']'), ElementsAre("0-1001/1000@1=1001/1000"));
    EXPECT_THAT(piecesOfLayers('[' + clip(0, 30, 0) + "], [" + clip(0, 30, 0) + ']'),
                ElementsAre("a.v3: the timeline has several layers of pictures, which an edit list cannot say"));
}

TEST(AutoEditor, CountsTheOffsetAtTheSpeedOfTheClip) {
    EXPECT_THAT(piecesOfLayers('[' + clip(0, 30, 150, R"(, "speed": 2.0)") + ']'),
                ElementsAre("1001/100-3003/250@2=1001/1000"));
    EXPECT_THAT(piecesOfLayers('[' + clip(0, 30, 150, R"(, "effects": ["speed:4", "varispeed:0.5"])") + ']'),
                ElementsAre("1001/100-3003/250@2=1001/1000"));
}

TEST(AutoEditor, PlaysClipsInTheOrderOfTheTimeline) {
    EXPECT_THAT(piecesOfLayers('[' + clip(30, 30, 600) + ',' + clip(0, 30, 300) + ']'),
                ElementsAre("1001/100-11011/1000@1=1001/1000", "1001/50-21021/1000@1=1001/1000"));
    EXPECT_THAT(
        piecesOfLayers('[' + clip(0, 30, 0) + ',' + clip(31, 30, 0) + ']'),
        ElementsAre("a.v3: clip 2: it begins at frame 31 of the timeline, and the clip before it ends at 30; an "
                    "edit list has neither gaps nor layers"));
    EXPECT_THAT(piecesOfLayers('[' + clip(1, 30, 0) + ']'), ElementsAre(HasSubstr("the clip before it ends at 0")));
    EXPECT_THAT(piecesOfLayers('[' + clip(0, 30, 0) + ',' + clip(20, 30, 0) + ']'),
                ElementsAre(HasSubstr("neither gaps nor layers")));
}

TEST(AutoEditor, RefusesLayersThatAnEditListCannotSay) {
    EXPECT_THAT(piecesOfLayers(R"([{"name": "image", "src": "a.png", "start": 0, "dur": 1}])"),
                ElementsAre("a.v3: clip 1: it is no video, which is all that an edit list can say"));
    EXPECT_THAT(
        piecesOfLayers('[' + clip(0, 30, 0) + R"(,{"src": "b.mp4", "start": 30, "dur": 1, "offset": 0}])"),
        ElementsAre(HasSubstr("a.v3: clip 2: the source is \"b.mp4\", but that of an earlier piece is \"a.mp4\"")));
    EXPECT_THAT(
        piecesOfLayers('[' + clip(0, 30, 0) + R"(,{"src": "a.mp4", "start": 30, "dur": 1, "offset": 0, "stream": 1}])"),
        ElementsAre(HasSubstr("it plays another stream")));
    EXPECT_THAT(piecesOfLayers(R"([{"src": null, "start": 0, "dur": 1, "offset": 0}])"),
                ElementsAre("a.v3: clip 1: \"src\" is no text"));
    EXPECT_THAT(piecesOfLayers('[' + clip(0, 30, 0, R"(, "effects": ["cut"])") + ']'),
                ElementsAre("a.v3: clip 1: it is cut, but lasts 30 frames"));
    EXPECT_THAT(piecesOfLayers('[' + clip(0, 30, 0, R"(, "speed": 0)") + ']'),
                ElementsAre("a.v3: clip 1: \"speed\" is 0; it must be above 0"));
    EXPECT_THAT(piecesOfLayers('[' + clip(0, 30, 0, R"(, "speed": -1)") + ']'),
                ElementsAre("a.v3: clip 1: it runs backwards, which an edit list cannot say"));
    EXPECT_THAT(piecesOfLayers('[' + clip(0, 30, 0) + ']', R"(, "transitions": {"v": [[{"kind": "dissolve"}]]})"),
                ElementsAre("a.v3: the timeline has transitions, which an edit list cannot say"));
    EXPECT_THAT(piecesOfLayers('[' + clip(0, 30, 0) + ']', R"(, "transitions": {"v": [[]], "a": [[{}]]})"),
                ElementsAre("0-1001/1000@1=1001/1000"));
    EXPECT_THAT(piecesOfLayers("{}"), ElementsAre("a.v3: a layer of \"v\" is no array"));
    EXPECT_THAT(piecesOfLayers("[]"), ElementsAre("a.v3: the timeline has sound without pictures"));
    EXPECT_THAT(piecesOf(R"({"version": "3", "timebase": "30/1", "v": [], "a": []})", "a.v3"), IsEmpty());
}

} // namespace
} // namespace ZULMetaData::Test
