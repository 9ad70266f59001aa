#include "ZULMetaDataSession/Insights/Idle.h"

#include "Tests/ZULMetaDataSession/Insights/Tracks.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <ostream>

namespace ZULMetaData {

static void PrintTo(const IdleSpan& span, std::ostream* stream) {
    *stream << span.start << " to " << span.end;
}

namespace Test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::int32_t s_leftDown = 1;
constexpr std::int32_t s_leftUp = 2;

std::vector<IdleSpan> idleWithPositions(const TrackEntries<CursorLocationKind>& entries, double duration,
                                        const IdleOptions& options = {}) {
    return idleSpansOf(positions(entries), {}, {}, {}, duration, options);
}

TEST(Idle, IsUnknownWithoutAnyEntry) {
    EXPECT_THAT(idleSpansOf({}, {}, {}, {}, 100), IsEmpty());
}

TEST(Idle, LastsFromOneMoveToTheNextOrTheEnd) {
    EXPECT_THAT(idleWithPositions({{0, {0, 0}}, {5, {1, 0}}, {9, {2, 0}}, {20, {3, 0}}}, 26),
                ElementsAre(IdleSpan{0, 5}, IdleSpan{9, 20}, IdleSpan{20, 26}));
}

TEST(Idle, BeginsWithTheRecordingIfNothingHappensAtFirst) {
    EXPECT_THAT(idleWithPositions({{7, {0, 0}}}, 8), ElementsAre(IdleSpan{0, 7}));
}

TEST(Idle, IsNotEndedByAPositionThatRepeats) {
    EXPECT_THAT(idleWithPositions({{0, {1, 1}}, {3, {1, 1}}, {6, {1, 1}}, {7, {2, 1}}}, 8),
                ElementsAre(IdleSpan{0, 7}));
}

TEST(Idle, IsEndedByButtonsKeysAndScrolling) {
    const std::vector<IdleSpan> spans =
        idleSpansOf({}, actions({{0, 256}, {6, s_leftDown}, {13, s_leftUp}}), keys({{21, {'a', 0}}}),
                    trackOf<ScrollActionKind>({{30, {0, 120}}, {31, {0, 120}}}), 40);
    EXPECT_THAT(spans,
                ElementsAre(IdleSpan{0, 6}, IdleSpan{6, 13}, IdleSpan{13, 21}, IdleSpan{21, 30}, IdleSpan{31, 40}));
}

TEST(Idle, IsNotEndedByAnActionWithoutAButton) {
    EXPECT_THAT(idleSpansOf({}, actions({{4, 256}}), {}, {}, 6), ElementsAre(IdleSpan{0, 6}));
}

TEST(Idle, LastsAtLeastAsLongAsAskedFor) {
    const TrackEntries<CursorLocationKind> entries{{0, {0, 0}}, {4, {1, 0}}, {9, {2, 0}}};
    EXPECT_THAT(idleWithPositions(entries, 10), ElementsAre(IdleSpan{4, 9}));
    EXPECT_THAT(idleWithPositions(entries, 10, {3}), ElementsAre(IdleSpan{0, 4}, IdleSpan{4, 9}));
    EXPECT_THAT(idleWithPositions(entries, 10, {6}), IsEmpty());
    EXPECT_THAT(idleWithPositions({{0, {0, 0}}, {4, {1, 0}}, {4, {2, 0}}}, 4, {0}), ElementsAre(IdleSpan{0, 4}));
}

TEST(Idle, LiesWithinTheRecording) {
    EXPECT_THAT(idleWithPositions({{-20, {0, 0}}, {-10, {1, 0}}, {1e300, {2, 0}}}, 8), ElementsAre(IdleSpan{0, 8}));
    EXPECT_THAT(idleWithPositions({{0, {0, 0}}}, 0), IsEmpty());
    EXPECT_THAT(idleWithPositions({{0, {0, 0}}}, -8), IsEmpty());
}

TEST(Idle, IsFoundInEntriesWithoutOrder) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    EXPECT_THAT(idleWithPositions({{9, {9, 9}}, {nan, {3, 3}}, {2, {2, 2}}, {0, {0, 0}}}, 10),
                ElementsAre(IdleSpan{2, 9}));
}

TEST(Idle, IsFoundAmongAMillionEntriesAtOneTime) {
    constexpr std::size_t count = 1'000'000;
    constexpr std::int32_t far = std::numeric_limits<std::int32_t>::max();
    std::vector<Point> places(count, Point(far, far));
    for (std::size_t i = 0; i < count; i += 2)
        places[i] = {-far, -far};
    EXPECT_THAT(idleSpansOf({std::vector<double>(count, 1), places}, {}, {}, {}, 1e9), ElementsAre(IdleSpan{1, 1e9}));
}

} // namespace
} // namespace Test
} // namespace ZULMetaData
