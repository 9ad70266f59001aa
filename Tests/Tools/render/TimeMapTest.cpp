#include "Tools/render/TimeMap.h"

#include <gtest/gtest.h>

namespace Render::Test {
namespace {

using ZULMetaData::EditList;

/// Ten seconds as they were, four seconds twice as fast, and a frame that is held for two: 14 s.
EditList threePieces() {
    EditList edits;
    edits.keep(10, 20);
    edits.keep(0, 4, 2);
    edits.hold({25, 2}, 2);
    return edits;
}

void expectTime(const FilmTime& time, std::size_t piece, double source) {
    EXPECT_EQ(time.piece, piece) << time.film;
    EXPECT_NEAR(time.source, source, 1e-9) << time.film;
}

TEST(TimeMap, FindsThePieceAndTheTimeOfTheRecording) {
    const TimeMap times(threePieces());
    EXPECT_DOUBLE_EQ(times.duration(), 14);
    expectTime(times.at(0), 0, 10);
    expectTime(times.at(5.25), 0, 15.25);
    expectTime(times.at(11), 1, 2);
    expectTime(times.at(12.5), 2, 12.5);
    expectTime(times.at(13.9), 2, 12.5);
}

TEST(TimeMap, BeginsAPieceAtItsJoinDespiteRounding) {
    const TimeMap times(threePieces());
    expectTime(times.at(10), 1, 0);
    expectTime(times.at(10 - 5e-8), 1, 0);
    expectTime(times.at(10 - 1e-3), 0, 20 - 1e-3);
    expectTime(times.at(12), 2, 12.5);
}

TEST(TimeMap, FindsTheFirstFrameOfEachPieceAtAnyRate) {
    EditList edits;
    for (int i = 0; i < 300; ++i)
        edits.keep(i, {3 * i + 1, 3}); // a third of a second of each second
    const TimeMap times(edits);
    for (int i = 0; i < 300; ++i) {
        const FilmTime now = times.at(i * 10 / 30.0);
        EXPECT_EQ(now.piece, static_cast<std::size_t>(i));
        EXPECT_NEAR(now.source, i, 1e-6);
    }
}

TEST(TimeMap, StaysWithinItsPieces) {
    EditList edits;
    edits.keep(10, 20);
    const TimeMap times(edits);
    EXPECT_DOUBLE_EQ(times.at(-1).source, 10);
    EXPECT_LT(times.at(10).source, 20);
    EXPECT_LT(times.at(99).source, 20);
    EXPECT_NEAR(times.at(99).source, 20, 1e-6);
}

TEST(TimeMap, StaysInAPieceThatIsShorterThanItsRounding) {
    EditList edits;
    edits.keep(3, {300000000001, 100000000000});
    const TimeMap times(edits);
    EXPECT_DOUBLE_EQ(times.at(0).source, 3);
    EXPECT_EQ(times.frames(30), 1);
}

TEST(TimeMap, CountsFramesUpToTheEnd) {
    const auto framesOf = [](const ZULMetaData::Rational& duration, double fps) {
        EditList edits;
        edits.keep(0, duration);
        return TimeMap(edits).frames(fps);
    };
    EXPECT_EQ(framesOf(1, 30), 30);
    EXPECT_EQ(framesOf({1, 3}, 30), 10);
    EXPECT_EQ(framesOf({31, 30}, 30), 31);
    EXPECT_EQ(framesOf({61, 60}, 30), 31); // half a frame is shown
    EXPECT_EQ(framesOf({1, 1000}, 30), 1);
    EXPECT_EQ(framesOf({1001, 30000}, 30000 / 1001.0), 1);
}

TEST(TimeMap, TellsHowLongAgoSomethingWasInTheTimeOfTheFilm) {
    const TimeMap times(threePieces());
    const FilmTime fast = times.at(11); // source 2, at speed 2
    EXPECT_DOUBLE_EQ(times.since(1, fast).value_or(-1), 0.5);
    EXPECT_DOUBLE_EQ(times.since(2, fast).value_or(-1), 0);
    EXPECT_FALSE(times.since(2.5, fast)) << "it is later";
    EXPECT_FALSE(times.since(15, times.at(1))) << "it is later";
    EXPECT_FALSE(times.since(9, times.at(1))) << "it was cut";
    EXPECT_DOUBLE_EQ(times.sinceCut(fast), 1);
}

TEST(TimeMap, ShowsAHeldFrameAsItWasInTheRecording) {
    const TimeMap times(threePieces());
    EXPECT_DOUBLE_EQ(times.since(12, times.at(12.1)).value_or(-1), 0.5);
    EXPECT_DOUBLE_EQ(times.since(12, times.at(13.9)).value_or(-1), 0.5);
    EXPECT_FALSE(times.since(12.6, times.at(13.9)));
}

} // namespace
} // namespace Render::Test
