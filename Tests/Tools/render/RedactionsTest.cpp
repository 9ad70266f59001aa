#include "Tools/render/Redactions.h"

#include "Tests/Tools/render/RenderSamples.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <bit>
#include <sstream>

namespace Render::Test {
namespace {

using namespace ZULMetaData;
using testing::DoubleNear;
using testing::ElementsAre;

Redactions placesOf(const std::string& places) {
    return Redactions::read("{\"schema\": \"zulm.redactions\", \"schema_version\": 1, \"places\": [\n" + places + "]}",
                            "my.json");
}

std::string refusal(const std::string& places) {
    return failureOf([&] { placesOf(places); });
}

/// The bytes of a stream: its header, and values at times.
template <class Kind>
std::string streamOf(const std::vector<std::pair<double, typename Kind::Value>>& entries) {
    const MetaDataHeader header{Kind::type, Kind::version, metaDataFixedEntrySize<typename Kind::Value>()};
    const auto headerBytes = std::bit_cast<std::array<char, sizeof header>>(header);
    std::ostringstream bytes;
    bytes.write(headerBytes.data(), headerBytes.size());
    for (const auto& [time, value] : entries)
        metaDataWrite(time, value, bytes, Kind::version);
    return bytes.str();
}

/// The times that are left of a stream.
template <class Kind>
std::vector<double> timesLeft(const Redactions& redactions, const std::string& stream) {
    const RedactedStreams redacted = redactions.redacted(Recording(ByteSource::memory(stream), "stream.dat"));
    EXPECT_TRUE(redacted.losses.empty());
    if (redacted.streams.size() != 1)
        return {-1};
    const Recording left(ByteSource::memory(redacted.streams[0]), "left.dat");
    const auto times = left.track<Kind>().times();
    return {times.begin(), times.end()};
}

TEST(Redactions, TellTheLineAndTheMember) {
    EXPECT_EQ(refusal("{\"from\": 1}"), "my.json: line 2: \"places[0]\" has no \"to\"");
    EXPECT_EQ(refusal("{\"to\": 1}"), "my.json: line 2: \"places[0]\" has no \"from\"");
    EXPECT_EQ(refusal("{\"from\": 0, \"to\": 1},\n{\"from\": 0, \"to\": 1, \"x\": 4}"),
              "my.json: line 3: \"places[1]\" has no \"y\"");
    EXPECT_EQ(refusal("{\"from\": 2,\n\"to\": 2}"),
              "my.json: line 2: \"places[0]\" must have an area, and end after it begins");
    EXPECT_EQ(refusal("{\"from\": 0, \"to\": 1, \"x\": 0, \"y\": 0, \"width\": 0, \"height\": 5}"),
              "my.json: line 2: \"places[0]\" must have an area, and end after it begins");
    EXPECT_EQ(refusal("{\"from\": 0, \"to\": 1,\n\"why\": 2}"), "my.json: line 3: \"places[0].why\" is not known");
    EXPECT_EQ(refusal("7"), "my.json: line 2: \"places[0]\" must be an object");
    EXPECT_EQ(failureOf([] { Redactions::read(R"({"schema": "zulm.redactions", "schema_version": 1})", "my.json"); }),
              "my.json: line 1: \"places\" is missing");
}

TEST(Redactions, CoverNothingIfThereAreNoPlaces) {
    const Redactions redactions = placesOf("");
    YuvPicture picture = grey(8, 8, 1);
    EXPECT_TRUE(redactions.empty());
    EXPECT_FALSE(redactions.cover(picture, 0, {0, 0, 8, 8}));
    EXPECT_FALSE(redactions.hidesCursor({4, 4}, 0));
}

TEST(Redactions, CoverWholePixelsOfTheRectangle) {
    const Redactions redactions = placesOf(R"({"from": 1, "to": 2, "x": 110.2, "y": 210, "width": 20, "height": 9.9})");
    YuvPicture picture = grey(200, 100, 1); // two pixels for each unit
    ASSERT_TRUE(redactions.cover(picture, 1.5, {100, 200, 100, 50}));
    for (int y = 0; y < 100; ++y)
        for (int x = 0; x < 200; ++x)
            ASSERT_EQ(luma(picture, x, y), x >= 20 && x < 61 && y >= 20 && y < 40 ? 16 : 235) << x << ", " << y;
}

TEST(Redactions, CoverAtBothEndsOfTheTimeAndNotOutside) {
    const Redactions redactions = placesOf(R"({"from": 1, "to": 2})");
    const YuvPicture white = grey(8, 8, 1);
    for (const double time : {0.9999, 1.0, 1.5, 2.0, 2.0009}) {
        YuvPicture picture = white;
        EXPECT_TRUE(redactions.cover(picture, time, {0, 0, 100, 100})) << time;
        EXPECT_EQ(luma(picture, 7, 7), 16);
        EXPECT_EQ(luma(white, 7, 7), 235) << "the picture of another frame";
    }
    for (const double time : {0.0, 0.99, 2.01}) {
        YuvPicture picture = white;
        EXPECT_FALSE(redactions.cover(picture, time, {0, 0, 100, 100})) << time;
        EXPECT_EQ(luma(picture, 7, 7), 235);
    }
}

TEST(Redactions, CoverPlacesThatAreFarOutside) {
    const Redactions redactions = placesOf(R"({"from": 0, "to": 1, "x": -1e7, "y": -1e7, "width": 1e7, "height": 1e7},
                    {"from": 0, "to": 1, "x": 1e7, "y": 5, "width": 1e7, "height": 1})");
    YuvPicture picture = grey(8, 8, 1);
    EXPECT_TRUE(redactions.cover(picture, 0, {1, 1, 8, 8}));
    for (int y = 0; y < 8; ++y)
        EXPECT_EQ(luma(picture, 7, y), 235);
}

TEST(Redactions, HideACursorThatTouchesThem) {
    const Redactions redactions = placesOf(R"({"from": 1, "to": 2, "x": 100, "y": 100, "width": 50, "height": 50})");
    EXPECT_TRUE(redactions.hidesCursor({125, 125}, 1));
    EXPECT_TRUE(redactions.hidesCursor({52, 125}, 2));
    EXPECT_FALSE(redactions.hidesCursor({51, 125}, 2));
    EXPECT_TRUE(redactions.hidesCursor({198, 198}, 1.5));
    EXPECT_FALSE(redactions.hidesCursor({198, 199}, 1.5));
    EXPECT_FALSE(redactions.hidesCursor({125, 125}, 2.5));
}

const std::string s_place = R"({"from": 0, "to": 10, "x": 40, "y": 40, "width": 20, "height": 20})";

TEST(Redactions, RemoveACursorInAPlaceAndOnItsWay) {
    const std::string stream = streamOf<CursorLocationKind>(
        {{0, {5, 5}}, {1, {6, 6}}, {2, {50, 50}}, {3, {200, 200}}, {4, {5, 5}}, {11, {5, 5}}});
    EXPECT_THAT(timesLeft<CursorLocationKind>(placesOf(s_place), stream),
                ElementsAre(0, DoubleNear(3, 1e-9), 4, 11)); // at 3 s it is elsewhere again
}

TEST(Redactions, KeepACursorThatIsElsewhere) {
    const std::string stream = streamOf<CursorLocationKind>({{0, {5, 5}}, {5, {39, 39}}, {6, {61, 61}}, {7, {40, 39}}});
    EXPECT_THAT(timesLeft<CursorLocationKind>(placesOf(s_place), stream), ElementsAre(0, 5, 6, 7));
}

TEST(Redactions, RemoveWhatIsNotKnownToBeElsewhere) {
    // Neither the place of the cursor nor that of the window is known.
    EXPECT_THAT(timesLeft<CursorActionKind>(placesOf(s_place), streamOf<CursorActionKind>({{1, 1}, {11, 2}})),
                ElementsAre(DoubleNear(10, 1e-9), 11)); // the button is down after the place is uncovered
    const std::string keys = streamOf<KeyboardActionKind>({{1, KeyStroke('a', 0)}, {10.5, KeyStroke('b', 0)}});
    EXPECT_THAT(timesLeft<KeyboardActionKind>(placesOf(s_place), keys), ElementsAre(10.5));
    // The first position is known from 5 s on.
    EXPECT_THAT(
        timesLeft<CursorLocationKind>(placesOf(s_place), streamOf<CursorLocationKind>({{5, {5, 5}}, {6, {5, 5}}})),
        ElementsAre(DoubleNear(5, 1e-9), 6));
}

TEST(Redactions, KeepRectanglesOfWindowsAndTheRegion) {
    EXPECT_THAT(timesLeft<TopmostWindowKind>(placesOf(s_place), streamOf<TopmostWindowKind>({{1, Rect(40, 40, 9, 9)}})),
                ElementsAre(1));
    EXPECT_THAT(
        timesLeft<RecordingRegionKind>(placesOf(s_place), streamOf<RecordingRegionKind>({{1, Rect(40, 40, 9, 9)}})),
        ElementsAre(1));
}

TEST(Redactions, LeaveOutAStreamThatCannotBeDecoded) {
    std::string stream = streamOf<CursorLocationKind>({{0, {5, 5}}});
    stream[16] = 99; // the version
    const RedactedStreams redacted = placesOf(s_place).redacted(Recording(ByteSource::memory(stream), "stream.dat"));
    EXPECT_TRUE(redacted.streams.empty());
    ASSERT_EQ(redacted.losses.size(), 1U);
    EXPECT_THAT(redacted.losses[0], testing::HasSubstr("cursorLocation"));
}

} // namespace
} // namespace Render::Test
