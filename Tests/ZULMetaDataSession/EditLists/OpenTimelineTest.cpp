#include "Tests/ZULMetaDataSession/EditListTexts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

std::string time(const std::string& value, const std::string& rate = "25") {
    return R"({"OTIO_SCHEMA": "RationalTime.1", "value": )" + value + R"(, "rate": )" + rate + '}';
}

std::string range(const std::string& start, const std::string& duration, const std::string& rate = "25") {
    return R"({"OTIO_SCHEMA": "TimeRange.1", "start_time": )" + time(start, rate) + R"(, "duration": )" +
           time(duration, rate) + '}';
}

std::string reference(const std::string& url, const std::string& available = "null") {
    return R"({"OTIO_SCHEMA": "ExternalReference.1", "target_url": ")" + url + R"(", "available_range": )" + available +
           '}';
}

/// Returns a clip; `more` holds further members.
std::string clip(const std::string& played, const std::string& more = "") {
    return R"({"OTIO_SCHEMA": "Clip.1", "name": "a", "source_range": )" + played + more + '}';
}

std::string withEffects(const std::string& effects) {
    return R"(, "effects": [)" + effects + ']';
}

std::string warp(const std::string& scalar) {
    return R"({"OTIO_SCHEMA": "LinearTimeWarp.1", "effect_name": "LinearTimeWarp", "time_scalar": )" + scalar + '}';
}

std::string track(const std::string& kind, const std::string& children, const std::string& more = "") {
    return R"({"OTIO_SCHEMA": "Track.1", "kind": ")" + kind + R"(", "source_range": null, "children": [)" + children +
           ']' + more + '}';
}

std::vector<std::string> piecesOfTracks(const std::string& tracks, const std::string& more = "") {
    return piecesOf(
        R"({"OTIO_SCHEMA": "Timeline.1", "metadata": {}, "tracks": {"OTIO_SCHEMA": "Stack.1", "children": [)" + tracks +
            ']' + more + "}}",
        "a.otio");
}

std::vector<std::string> piecesOfClips(const std::string& clips) {
    return piecesOfTracks(track("Video", clips));
}

TEST(OpenTimeline, PlaysTheClipsOfItsTrackOfPictures) {
    EXPECT_THAT(piecesOfTracks(track("Audio", "{}") + ',' +
                               track("Video", clip(range("250", "50")) + ',' + clip(range("0", "25.0"))) + ',' +
                               track("Video", "")),
                ElementsAre("10-12@1=2", "0-1@1=1"));
    EXPECT_THAT(piecesOfClips(clip(range("100", "50", "23.976"))), ElementsAre("12500/2997-6250/999@1=6250/2997"));
    EXPECT_THAT(piecesOfTracks(""), IsEmpty());
}

TEST(OpenTimeline, HasOneTrackOfPictures) {
    const std::string one = track("Video", clip(range("0", "25")));
    EXPECT_THAT(piecesOfTracks(one + ',' + one),
                ElementsAre("a.otio: the timeline has several tracks of pictures, which an edit list cannot say"));
    EXPECT_THAT(piecesOfTracks(one + ',' + track("Video", clip(range("0", "25")), R"(, "enabled": false)")),
                ElementsAre("0-1@1=1"));
    EXPECT_THAT(piecesOfTracks(track("Subtitle", "")),
                ElementsAre("a.otio: a track is of the kind \"Subtitle\", neither Video nor Audio"));
}

TEST(OpenTimeline, PlaysAsLongAtASpeedAsItDoesWithoutOne) {
    EXPECT_THAT(piecesOfClips(clip(range("250", "50"), withEffects(warp("2.0")))), ElementsAre("10-14@2=2"));
    EXPECT_THAT(piecesOfClips(clip(range("250", "50"), withEffects(warp("2") + ',' + warp("0.25")))),
                ElementsAre("10-11@1/2=2"));
    EXPECT_THAT(piecesOfClips(clip(range("250", "50"), withEffects(warp("-1")))),
                ElementsAre("a.otio: item 1: it runs backwards, which an edit list cannot say"));
}

TEST(OpenTimeline, HoldsAFrozenFrame) {
    EXPECT_THAT(
        piecesOfClips(clip(range("250", "50"), withEffects(R"({"OTIO_SCHEMA": "FreezeFrame.1", "time_scalar": 0})"))),
        ElementsAre("10+2"));
    EXPECT_THAT(piecesOfClips(clip(range("250", "50"), withEffects(warp("0.0")))), ElementsAre("10+2"));
}

TEST(OpenTimeline, PassesOverEffectsOnThePicture) {
    EXPECT_THAT(
        piecesOfClips(clip(range("0", "25"), withEffects(R"({"OTIO_SCHEMA": "Effect.1", "effect_name": "Blur"})"))),
        ElementsAre("0-1@1=1"));
    EXPECT_THAT(
        piecesOfClips(clip(range("0", "25"), withEffects(R"({"OTIO_SCHEMA": "LinearTimeWarp.1", "enabled": false})"))),
        ElementsAre("0-1@1=1"));
    EXPECT_THAT(piecesOfClips(clip(range("0", "25"), withEffects(R"({"OTIO_SCHEMA": "TimeEffect.1"})"))),
                ElementsAre("a.otio: item 1: it has the effect \"TimeEffect\", which an edit list cannot say"));
}

TEST(OpenTimeline, CountsFromTheBeginningOfTheMedia) {
    EXPECT_THAT(piecesOfClips(clip(range("90250", "50"),
                                   R"(, "media_reference": )" + reference("a.mp4", range("90000", "1000")))),
                ElementsAre("10-12@1=2"));
    EXPECT_THAT(piecesOfClips(clip("null", R"(, "media_reference": )" + reference("a.mp4", range("90000", "1000")))),
                ElementsAre("0-40@1=40"));
    EXPECT_THAT(
        piecesOfClips(clip(range("0", "50"), R"(, "media_reference": )" + reference("a.mp4", range("90000", "1000")))),
        ElementsAre("a.otio: item 1: start is negative: -3600"));
    EXPECT_THAT(piecesOfClips(clip("null")), ElementsAre("a.otio: item 1: it has no \"source_range\""));
}

TEST(OpenTimeline, HasOneSource) {
    EXPECT_THAT(piecesOfClips(clip(range("0", "25"), R"(, "media_reference": )" + reference("a.mp4")) + ',' +
                              clip(range("0", "25"), R"(, "media_reference": )" + reference("b.mp4"))),
                ElementsAre(HasSubstr("a.otio: item 2: the source is \"b.mp4\"")));
    const std::string references = R"(, "media_references": {"DEFAULT_MEDIA": )" + reference("a.mp4") +
                                   R"(, "proxy": {"OTIO_SCHEMA": "MissingReference.1"}})";
    EXPECT_THAT(piecesOfClips(clip(range("0", "25"), R"(, "media_reference": )" + reference("a.mp4")) + ',' +
                              clip(range("0", "25"), references)),
                ElementsAre("0-1@1=1", "0-1@1=1"));
    EXPECT_THAT(piecesOfClips(clip(range("0", "25"), references + R"(, "active_media_reference_key": "proxy")")),
                ElementsAre("0-1@1=1"));
    EXPECT_THAT(piecesOfClips(clip(range("0", "25"), references + R"(, "active_media_reference_key": "none")")),
                ElementsAre("a.otio: item 1: it plays a media reference that it does not have"));
    EXPECT_THAT(
        piecesOfClips(clip(range("0", "25"), R"(, "media_reference": {"OTIO_SCHEMA": "GeneratorReference.1"})")),
        ElementsAre("a.otio: item 1: its media is a \"GeneratorReference\", not a file"));
}

TEST(OpenTimeline, RefusesWhatAnEditListCannotSay) {
    EXPECT_THAT(piecesOfClips(clip(range("0", "25")) + R"(,{"OTIO_SCHEMA": "Transition.1"},)" + clip(range("0", "25"))),
                ElementsAre("a.otio: item 2: it is a \"Transition\", which an edit list cannot say"));
    EXPECT_THAT(piecesOfClips(R"({"OTIO_SCHEMA": "Gap.1", "source_range": )" + range("0", "10") + '}'),
                ElementsAre("a.otio: item 1: it is a gap, which an edit list cannot say"));
    EXPECT_THAT(piecesOfClips(R"({"OTIO_SCHEMA": "Gap.1", "source_range": )" + range("0", "0") + '}'), IsEmpty());
    EXPECT_THAT(piecesOfClips(R"({"OTIO_SCHEMA": "Stack.1", "children": []})"),
                ElementsAre("a.otio: item 1: it is a \"Stack\", which an edit list cannot say"));
    EXPECT_THAT(piecesOfClips(clip(range("0", "25"), R"(, "enabled": false)")),
                ElementsAre("a.otio: item 1: the clip is switched off, which leaves a gap"));
    EXPECT_THAT(piecesOfTracks(R"({"OTIO_SCHEMA": "Track.1", "kind": "Video", "children": [{}], "source_range": )" +
                               range("0", "25") + '}'),
                ElementsAre("a.otio: the track is trimmed; trim its clips instead"));
    EXPECT_THAT(piecesOfTracks(track("Video", "{}", withEffects(warp("2")))),
                ElementsAre("a.otio: the track has another speed; change that of its clips instead"));
    EXPECT_THAT(piecesOfTracks("", R"(, "source_range": )" + range("0", "25")),
                ElementsAre("a.otio: the stack of tracks is trimmed; trim its clips instead"));
}

TEST(OpenTimeline, RefusesOtherDocuments) {
    EXPECT_THAT(piecesOf(R"({"OTIO_SCHEMA": "Clip.1"})", "a.otio"), ElementsAre("a.otio: a timeline is no Timeline"));
    EXPECT_THAT(piecesOf("{}", "a.otio"), ElementsAre("a.otio: a timeline is no Timeline"));
    EXPECT_THAT(piecesOf(R"({"OTIO_SCHEMA": "Timeline.1"})", "a.otio"), ElementsAre("a.otio: \"tracks\" is missing"));
    EXPECT_THAT(piecesOfClips(clip("{}")), ElementsAre("a.otio: item 1: a range is no TimeRange"));
    EXPECT_THAT(piecesOfClips(clip(range("0", "25", "0"))),
                ElementsAre("a.otio: item 1: the rate of a time is not above 0"));
    EXPECT_THAT(piecesOfClips(clip(range("0", "25", "-1"))),
                ElementsAre("a.otio: item 1: the rate of a time is not above 0"));
    EXPECT_THAT(piecesOfClips(clip(range("0", "0"))),
                ElementsAre("a.otio: item 1: end is 0, which is not after start, 0"));
    EXPECT_THAT(piecesOfClips("1"), ElementsAre("a.otio: item 1: it is a JSON value, which an edit list cannot say"));
}

} // namespace
} // namespace ZULMetaData::Test
