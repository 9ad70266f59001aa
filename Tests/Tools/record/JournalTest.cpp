#include "Tools/record/Journal.h"

#include "Tests/Support/Files.h"
#include "ZULMetaDataSession/Recording.h"

#include <gtest/gtest.h>

#include <span>
#include <string>
#include <utility>
#include <vector>

using namespace Recorder;
using namespace ZULMetaData;

namespace {

constexpr Instant s_begin = 1000 * s_second;

class JournalTest : public testing::Test {
protected:
    /// Notes that the pointer is at `x`.
    void move(Instant time, std::int32_t x) { journal_.note<CursorLocationKind>(s_begin + time, Point(x, 0)); }

    void click(Instant time) { journal_.note<CursorActionKind>(s_begin + time, 1); }

    /// Ends the streams, and returns the times and places of the pointer.
    std::vector<std::pair<double, double>> positions() {
        journal_.session().finish();
        const Recording stream(folder_ / "a/cursorLocation.dat");
        const Track<CursorLocationKind>& track = stream.track<CursorLocationKind>();
        std::vector<std::pair<double, double>> all;
        for (std::size_t i = 0; i < track.size(); ++i)
            all.emplace_back(track.times()[i], track.values()[i].x);
        return all;
    }

    ZULMetaData::Test::TemporaryFolder folder_;
    Journal journal_{folder_ / "a", [](const Error&) {}};
};

using Positions = std::vector<std::pair<double, double>>;

} // namespace

TEST_F(JournalTest, WritesWhatHoldsAtTheBeginningAt0) {
    move(-2 * s_second, 1);
    move(-s_second, 2);
    journal_.start(s_begin);
    EXPECT_EQ(positions(), (Positions{{0, 2}}));
}

TEST_F(JournalTest, KeepsAStateThatIsReadAfterTheBeginningThoughItIsOlder) {
    move(-s_second, 1);
    journal_.start(s_begin);
    move(-s_millisecond / 2, 2);
    EXPECT_EQ(positions(), (Positions{{0, 1}, {0, 2}}));
}

TEST_F(JournalTest, KeepsAStateOfAPauseThatIsReadAfterIt) {
    journal_.start(s_begin);
    move(0, 1);
    journal_.pause(s_begin + s_second);
    journal_.resume(s_begin + 5 * s_second);
    move(5 * s_second - s_millisecond, 2);
    EXPECT_EQ(positions(), (Positions{{0, 1}, {1, 2}}));
}

TEST_F(JournalTest, LeavesEventsBeforeTheBeginningOut) {
    click(-s_millisecond);
    journal_.start(s_begin);
    click(-s_millisecond);
    click(0);
    journal_.session().finish();
    const Recording stream(folder_ / "a/cursorAction.dat");
    const std::span<const double> times = stream.track<CursorActionKind>().times();
    EXPECT_EQ(std::vector<double>(times.begin(), times.end()), std::vector<double>{0});
}

TEST_F(JournalTest, LeavesEventsOfAPauseOut) {
    journal_.start(s_begin);
    click(s_second / 2);
    journal_.pause(s_begin + s_second);
    click(2 * s_second);
    journal_.resume(s_begin + 5 * s_second);
    click(5 * s_second - s_millisecond);
    journal_.session().finish();
    EXPECT_EQ(Recording(folder_ / "a/cursorAction.dat").track<CursorActionKind>().size(), 1U);
}

TEST_F(JournalTest, WritesAPositionThatRestedUntilAPauseOnceMore) {
    journal_.start(s_begin);
    move(0, 1);
    journal_.pause(s_begin + s_second);
    move(2 * s_second, 2);
    journal_.resume(s_begin + 5 * s_second);
    EXPECT_EQ(positions(), (Positions{{0, 1}, {0.999, 1}, {1, 2}}));
}

TEST_F(JournalTest, WritesNothingFromTheEndOn) {
    journal_.start(s_begin);
    move(0, 1);
    journal_.endAt(s_begin + s_second);
    move(s_second, 3);
    move(s_second / 2, 2); // read late
    journal_.noteStill<CursorLocationKind>(s_begin + 2 * s_second);
    EXPECT_EQ(positions(), (Positions{{0, 1}, {0.5, 2}}));
}
