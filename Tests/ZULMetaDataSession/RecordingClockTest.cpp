// Times of a monotonic clock as times of the recording: before the first frame, across pauses, and after a long time.

#include "ZULMetaDataSession/RecordingClock.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <limits>
#include <optional>
#include <random>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using namespace std::chrono_literals;
using Outside = RecordingClock::Outside;

class RecordingClockTest : public testing::Test {
protected:
    std::optional<double> event(MonotonicTime time) const { return clock.timeOf(time, Outside::Drop); }
    std::optional<double> state(MonotonicTime time) const { return clock.timeOf(time, Outside::MoveToEdge); }

    RecordingClock clock;
};

TEST_F(RecordingClockTest, CountsFromTheFirstFrame) {
    clock.start(100s);
    EXPECT_EQ(event(100s), 0.0);
    EXPECT_EQ(event(100'250ms), 0.25);
    EXPECT_EQ(event(101s), 1.0);
    EXPECT_EQ(clock.elapsedAt(100s + 1ns), 1ns);
}

TEST_F(RecordingClockTest, TakesTimesOfTheStandardClock) {
    const auto start = std::chrono::steady_clock::now();
    clock.start(start);
    EXPECT_EQ(event(start + 2s), 2.0);
}

TEST_F(RecordingClockTest, DropsEventsBeforeTheFirstFrameAndMovesStatesToIt) {
    EXPECT_FALSE(clock.hasStarted());
    EXPECT_EQ(event(99s), std::nullopt);
    EXPECT_EQ(state(99s), 0.0);
    clock.start(100s);
    EXPECT_TRUE(clock.hasStarted());
    EXPECT_EQ(event(99s), std::nullopt);
    EXPECT_EQ(event(100s - 1ns), std::nullopt);
    EXPECT_EQ(state(100s - 1ns), 0.0);
    EXPECT_EQ(state(-5s), 0.0);
}

TEST_F(RecordingClockTest, StartsOnce) {
    clock.start(100s);
    clock.start(200s);
    EXPECT_EQ(event(201s), 101.0);
}

TEST_F(RecordingClockTest, LeavesPausesOut) {
    clock.start(100s);
    clock.pause(110s);
    EXPECT_TRUE(clock.isPaused());
    clock.resume(115s);
    EXPECT_FALSE(clock.isPaused());
    EXPECT_EQ(event(109s), 9.0);
    EXPECT_EQ(event(115s), 10.0);
    EXPECT_EQ(event(116s), 11.0);
}

TEST_F(RecordingClockTest, LetsNoEntryLieInsideAPause) {
    clock.start(100s);
    clock.pause(110s);
    for (const bool isOver : {false, true}) {
        if (isOver)
            clock.resume(115s);
        for (const auto time : {110'000ms, 112'000ms, 114'999ms}) {
            EXPECT_EQ(event(time), std::nullopt);
            EXPECT_EQ(state(time), 10.0);
        }
    }
    EXPECT_EQ(event(110s - 1ns), 9.999999999);
    EXPECT_EQ(event(115s + 1ns), 10.000000001);
}

TEST_F(RecordingClockTest, RemembersEveryPauseForWhatArrivesLate) {
    clock.start(100s);
    clock.pause(110s);
    clock.resume(115s);
    clock.pause(120s);
    clock.resume(140s);
    clock.pause(150s);
    EXPECT_EQ(event(105s), 5.0);
    EXPECT_EQ(event(112s), std::nullopt);
    EXPECT_EQ(state(112s), 10.0);
    EXPECT_EQ(event(119s), 14.0);
    EXPECT_EQ(state(130s), 15.0);
    EXPECT_EQ(event(140s), 15.0);
    EXPECT_EQ(event(149s), 24.0);
    EXPECT_EQ(event(1000s), std::nullopt);
    EXPECT_EQ(state(1000s), 25.0);
}

TEST_F(RecordingClockTest, KnowsWhichKindsAreMoved) {
    clock.start(100s);
    clock.pause(110s);
    EXPECT_EQ(clock.timeOf<CursorLocationKind>(112s), 10.0);
    EXPECT_EQ(clock.timeOf<TopmostWindowTitleKind>(90s), 0.0);
    EXPECT_EQ(clock.timeOf<RecordingRegionKind>(90s), 0.0);
    EXPECT_EQ(clock.timeOf<CursorActionKind>(112s), std::nullopt);
    EXPECT_EQ(clock.timeOf<KeyboardActionKind>(90s), std::nullopt);
    EXPECT_EQ(clock.timeOf<ScrollActionKind>(101s), 1.0);
}

TEST_F(RecordingClockTest, IgnoresASecondPauseAndAResumeWithoutAPause) {
    clock.resume(90s);
    clock.start(100s);
    clock.resume(105s);
    clock.pause(110s);
    clock.pause(108s);
    clock.pause(112s);
    clock.resume(115s);
    clock.resume(120s);
    EXPECT_EQ(event(109s), 9.0);
    EXPECT_EQ(event(121s), 16.0);
}

TEST_F(RecordingClockTest, KeepsPausesInOrder) {
    clock.start(100s);
    clock.pause(110s);
    clock.resume(115s);
    clock.pause(105s);
    EXPECT_EQ(event(112s), std::nullopt);
    EXPECT_EQ(state(116s), 10.0) << "the second one begins where the first ended";
    clock.resume(120s);
    EXPECT_EQ(event(105s), 5.0);
    EXPECT_EQ(event(121s), 11.0);
}

TEST_F(RecordingClockTest, HasNoPauseThatEndsBeforeItBegins) {
    clock.start(100s);
    clock.pause(110s);
    clock.resume(105s);
    EXPECT_FALSE(clock.isPaused());
    EXPECT_EQ(event(112s), 12.0);
    clock.pause(113s);
    clock.resume(113s);
    EXPECT_EQ(event(113s), 13.0);
}

TEST_F(RecordingClockTest, CanPauseInTheFuture) {
    clock.start(100s);
    clock.pause(200s);
    EXPECT_TRUE(clock.isPaused());
    EXPECT_EQ(event(150s), 50.0);
    EXPECT_EQ(event(200s), std::nullopt);
    EXPECT_EQ(state(300s), 100.0);
}

TEST_F(RecordingClockTest, CountsOfPausesOnlyWhatIsAfterTheFirstFrame) {
    clock.pause(80s);
    clock.resume(90s);
    clock.pause(95s);
    clock.resume(105s);
    EXPECT_EQ(state(85s), 0.0);
    clock.start(100s);
    EXPECT_EQ(event(101s), std::nullopt);
    EXPECT_EQ(state(101s), 0.0);
    EXPECT_EQ(event(105s), 0.0);
    EXPECT_EQ(event(106s), 1.0);
    clock.pause(50s);
    EXPECT_EQ(state(110s), 0.0) << "it begins where the last one ended";
}

TEST_F(RecordingClockTest, MayBePausedAtTheFirstFrame) {
    clock.pause(80s);
    clock.start(100s);
    EXPECT_TRUE(clock.isPaused());
    EXPECT_EQ(event(100s), std::nullopt);
    EXPECT_EQ(state(100s), 0.0);
    clock.resume(130s);
    EXPECT_EQ(event(131s), 1.0);
}

TEST_F(RecordingClockTest, DoesNotDriftInADay) {
    const std::int64_t start = 1'234'567'890'123'456'789;
    clock.start(std::chrono::nanoseconds(start));
    EXPECT_EQ(event(std::chrono::nanoseconds(start) + 24h), 86400.0);
    EXPECT_EQ(event(std::chrono::nanoseconds(start) + 24h + 1ns), 86400.000000001);
    EXPECT_EQ(event(std::chrono::nanoseconds(start + 86'399'999'999'999)), 86399.999999999);
    std::int64_t now = start;
    for (int i = 0; i < 86'400; ++i) { // a pause of a third of a second in every second, nearly
        clock.pause(std::chrono::nanoseconds(now + 500'000'000));
        clock.resume(std::chrono::nanoseconds(now + 833'333'333));
        now += 1'000'000'000;
    }
    EXPECT_EQ(clock.elapsedAt(std::chrono::nanoseconds(now)), std::chrono::nanoseconds(86'400LL * 666'666'667));
}

TEST_F(RecordingClockTest, NeverGoesBackward) {
    std::mt19937 random(20260401);
    std::vector<std::int64_t> edges{0};
    clock.start(0s);
    for (int i = 0; i < 200; ++i) {
        const std::int64_t time = static_cast<std::int64_t>(random() % 100'000);
        if (random() % 2 == 0)
            clock.pause(std::chrono::nanoseconds(time));
        else
            clock.resume(std::chrono::nanoseconds(time));
    }
    std::chrono::nanoseconds last{0};
    for (std::int64_t time = 0; time < 100'000; ++time) {
        const auto moved = clock.elapsedAt(std::chrono::nanoseconds(time), Outside::MoveToEdge);
        ASSERT_TRUE(moved);
        ASSERT_GE(*moved, last) << time;
        ASSERT_LE(*moved - last, 1ns) << time;
        const auto dropped = clock.elapsedAt(std::chrono::nanoseconds(time));
        ASSERT_TRUE(!dropped || *dropped == *moved);
        last = *moved;
    }
}

TEST_F(RecordingClockTest, HasNoTimesThatOverflow) {
    constexpr std::chrono::nanoseconds earliest(std::numeric_limits<std::int64_t>::min());
    constexpr std::chrono::nanoseconds latest(std::numeric_limits<std::int64_t>::max());
    clock.start(earliest);
    EXPECT_EQ(event(earliest), 0.0);
    EXPECT_EQ(event(latest), 9223372036.854775807) << "no more than a signed number holds";
    clock.pause(-10s);
    clock.resume(latest);
    EXPECT_EQ(clock.elapsedAt(latest), latest - 10s + 1ns);
}

} // namespace

} // namespace ZULMetaData::Test
