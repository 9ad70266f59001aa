#include "ZULMetaDataSession/Track.h"

#include "Tests/ZULMetaDataSession/SessionSamples.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <memory>
#include <string>
#include <string_view>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr double s_infinity = std::numeric_limits<double>::infinity();
const double s_notANumber = std::nan("");

using Titles = Track<TopmostWindowTitleKind>;

// ---- Every kind -----------------------------------------------------------------------------------------------

template <class S>
struct TrackOfKind : testing::Test {
    using Kind = typename S::Kind;
    using Value = typename Track<Kind>::Value;

    static Track<Kind> trackAt(std::vector<double> times) {
        const std::size_t count = times.size();
        return {std::move(times), std::vector<Value>(count)};
    }
};
TYPED_TEST_SUITE(TrackOfKind, TestedKinds, KindName);

TYPED_TEST(TrackOfKind, IsEmptyAtFirst) {
    const Track<typename TypeParam::Kind> track;
    EXPECT_TRUE(track.empty());
    EXPECT_EQ(track.size(), 0U);
    EXPECT_EQ(track.leftOut(), 0U);
    EXPECT_EQ(track.at(0), nullptr);
    EXPECT_TRUE(track.between(-s_infinity, s_infinity).empty());
}

TYPED_TEST(TrackOfKind, HasColumnsOfOneLength) {
    const auto track = TestFixture::trackAt({1, 2, 4});
    EXPECT_THAT(track.times(), ElementsAre(1, 2, 4));
    EXPECT_EQ(track.values().size(), 3U);
    EXPECT_EQ(track.between(2, 4).values.data(), &track.values()[1]);
}

TYPED_TEST(TrackOfKind, OrdersTimesAndLeavesOutThoseThatAreNotFinite) {
    const auto track = TestFixture::trackAt({5, s_notANumber, 1, s_infinity, 3, -s_infinity});
    EXPECT_THAT(track.times(), ElementsAre(1, 3, 5));
    EXPECT_EQ(track.values().size(), 3U);
    EXPECT_EQ(track.leftOut(), 3U);
}

TYPED_TEST(TrackOfKind, SharesItsColumnsWithCopies) {
    const auto track = TestFixture::trackAt({1, 2});
    const auto copy = track; // NOLINT(performance-unnecessary-copy-initialization)
    EXPECT_EQ(copy.values().data(), track.values().data());
}

// ---- Order ----------------------------------------------------------------------------------------------------

TEST(Track, KeepsTheOrderOfEntriesAtOneTime) {
    const Titles track({2, 1, 2, 1}, {"c", "a", "d", "b"});
    EXPECT_THAT(shown(track), ElementsAre("1: a", "1: b", "2: c", "2: d"));
}

TEST(Track, LeavesOutEntriesAtNoTime) {
    const Titles track({s_notANumber, 1, s_infinity, 2, -s_infinity}, {"a", "b", "c", "d", "e"});
    EXPECT_THAT(shown(track), ElementsAre("1: b", "2: d"));
    EXPECT_EQ(track.leftOut(), 3U);
}

TEST(Track, LeavesOutTheOnlyEntryIfItIsAtNoTime) {
    for (const double time : {s_notANumber, s_infinity, -s_infinity}) {
        const Titles track({time}, {"a"});
        EXPECT_TRUE(track.empty());
        EXPECT_EQ(track.leftOut(), 1U);
    }
}

TEST(Track, LeavesOutEntriesAtNoTimeThatAreInOrder) {
    EXPECT_THAT(shown(Titles({-s_infinity, 1, 2}, {"a", "b", "c"})), ElementsAre("1: b", "2: c"));
    EXPECT_THAT(shown(Titles({1, 2, s_infinity}, {"a", "b", "c"})), ElementsAre("1: a", "2: b"));
}

TEST(Track, TakesNegativeTimesAndBothZeros) {
    const Titles track({-1, 0.0, -0.0, 1}, {"a", "b", "c", "d"});
    EXPECT_THAT(track.values(), ElementsAre("a", "b", "c", "d"));
}

TEST(Track, TakesTimesThatAreKnownToBeInOrder) {
    const Titles track = Titles::inOrder({1, 1, 2}, {"a", "b", "c"});
    EXPECT_THAT(shown(track), ElementsAre("1: a", "1: b", "2: c"));
    EXPECT_EQ(track.leftOut(), 0U);
}

// ---- Questions ------------------------------------------------------------------------------------------------

TEST(Track, KnowsWhatHoldsAtATime) {
    const Titles track({1, 2, 2, 4}, {"a", "b", "c", "d"});
    EXPECT_EQ(track.at(0.5), nullptr);
    EXPECT_EQ(*track.at(1), "a");
    EXPECT_EQ(*track.at(1.999), "a");
    EXPECT_EQ(*track.at(2), "c");
    EXPECT_EQ(*track.at(3), "c");
    EXPECT_EQ(*track.at(4), "d");
    EXPECT_EQ(*track.at(s_infinity), "d");
    EXPECT_EQ(track.at(-s_infinity), nullptr);
    EXPECT_EQ(track.at(s_notANumber), nullptr);
}

TEST(Track, CountsEntriesUpToATime) {
    const Titles track({1, 2, 2, 4}, {"a", "b", "c", "d"});
    EXPECT_EQ(track.countUntil(0), 0U);
    EXPECT_EQ(track.countUntil(1), 1U);
    EXPECT_EQ(track.countUntil(2), 3U);
    EXPECT_EQ(track.countUntil(9), 4U);
}

TEST(Track, HasTheEntriesBetweenTwoTimesWithoutTheSecond) {
    const Titles track({1, 2, 2, 4}, {"a", "b", "c", "d"});
    const auto valuesBetween = [&track](double from, double to) {
        const auto part = track.between(from, to);
        return std::vector<std::string>(part.values.begin(), part.values.end());
    };
    EXPECT_THAT(valuesBetween(1, 4), ElementsAre("a", "b", "c"));
    EXPECT_THAT(valuesBetween(1.5, 2.5), ElementsAre("b", "c"));
    EXPECT_THAT(valuesBetween(2, 2), IsEmpty());
    EXPECT_THAT(valuesBetween(4, 1), IsEmpty());
    EXPECT_THAT(valuesBetween(-s_infinity, s_infinity), ElementsAre("a", "b", "c", "d"));
    EXPECT_THAT(valuesBetween(s_notANumber, s_notANumber), IsEmpty());
    EXPECT_THAT(track.between(1.5, 5).times, ElementsAre(2, 2, 4));
}

// ---- Values ---------------------------------------------------------------------------------------------------

TEST(TrackValues, AreTypedByTheirKind) {
    EXPECT_TRUE((std::is_same_v<TrackValueOf<CursorLocationKind>, Point>));
    EXPECT_TRUE((std::is_same_v<TrackValueOf<TopmostWindowKind>, Rect>));
    EXPECT_TRUE((std::is_same_v<TrackValueOf<CPUUsageKind>, float>));
    EXPECT_TRUE((std::is_same_v<TrackValueOf<CursorOpacityKind>, double>));
    EXPECT_TRUE((std::is_same_v<TrackValueOf<ScaleFactorKind>, std::int32_t>));
    EXPECT_TRUE((std::is_same_v<TrackValueOf<TopmostAppNameKind>, std::string>));
    EXPECT_TRUE((std::is_same_v<TrackValueOf<CursorActionKind>, ButtonAction>));
    EXPECT_TRUE((std::is_same_v<TrackValueOf<KeyboardActionKind>, KeyInput>));
    EXPECT_TRUE((std::is_same_v<TrackValueOf<CursorImageKind>, CursorAppearance>));
    EXPECT_TRUE((std::is_same_v<TrackValueOf<SystemDataKind>, SystemData>));
}

struct NeverRecorded {
    using Value = Point;
};

TEST(TrackValues, OfAKindThatIsNotRecordedDoNotExist) {
    EXPECT_TRUE(RecordedKind<CursorLocationKind>);
    EXPECT_FALSE(RecordedKind<NeverRecorded>);
    EXPECT_FALSE(RecordedKind<Point>);
}

TEST(TrackValues, OfAMachineAreEmptyIfTheirTextsAreMissing) {
    EXPECT_EQ(trackValue(std::list<std::string>{"a", "b"}), (SystemData{"a", "b", "", ""}));
    EXPECT_EQ(trackValue(std::list<std::string>{}), SystemData());
    EXPECT_EQ(trackValue(std::list<std::string>{"a", "b", "\xe9", "d", "e"}), (SystemData{"a", "b", "\xc3\xa9", "d"}));
}

// ---- Pictures of the cursor -----------------------------------------------------------------------------------

CursorAppearance appearance(std::uint64_t id, std::string_view picture = {}) {
    CursorAppearance cursor;
    cursor.id = id;
    cursor.hasOwnPicture = !picture.empty();
    if (cursor.hasOwnPicture)
        cursor.picture = std::make_shared<const CursorPicture>(CursorPicture{{picture.begin(), picture.end()}, {}, {}});
    return cursor;
}

/// The bytes of each picture, or "-".
std::vector<std::string> picturesIn(const Track<CursorImageKind>& track) {
    std::vector<std::string> pictures;
    for (const CursorAppearance& cursor : track.values())
        pictures.push_back(cursor.picture ? std::string(cursor.picture->bytes.begin(), cursor.picture->bytes.end())
                                          : "-");
    return pictures;
}

TEST(CursorPictures, AreThoseOfTheLastEarlierEntryOfTheIdentifier) {
    const Track<CursorImageKind> track({1, 2, 3, 4, 5, 6}, {appearance(7, "old"), appearance(7), appearance(8, "other"),
                                                            appearance(7), appearance(7, "new"), appearance(7)});
    EXPECT_THAT(picturesIn(track), ElementsAre("old", "old", "other", "old", "new", "new"));
}

TEST(CursorPictures, AreOtherwiseThoseOfTheFirstLaterEntry) {
    const Track<CursorImageKind> track({1, 2, 3, 4},
                                       {appearance(7), appearance(7), appearance(7, "first"), appearance(7, "second")});
    EXPECT_THAT(picturesIn(track), ElementsAre("first", "first", "first", "second"));
}

TEST(CursorPictures, AreMissingIfTheRecordingHasNone) {
    const Track<CursorImageKind> track({1, 2, 3}, {appearance(7), appearance(8, "other"), appearance(9)});
    EXPECT_THAT(picturesIn(track), ElementsAre("-", "other", "-"));
}

TEST(CursorPictures, FollowTheOrderOfTheTimes) {
    const Track<CursorImageKind> track({3, 1, 2}, {appearance(7, "late"), appearance(7, "early"), appearance(7)});
    EXPECT_THAT(picturesIn(track), ElementsAre("early", "early", "late"));
}

TEST(CursorPictures, OfEntriesAtNoTimeAreNotUsed) {
    const Track<CursorImageKind> track({s_notANumber, 1}, {appearance(7, "never"), appearance(7)});
    EXPECT_THAT(picturesIn(track), ElementsAre("-"));
}

TEST(CursorPictures, AreSharedAndNotCopied) {
    const Track<CursorImageKind> track(
        {1, 2, 3, 4}, {appearance(7, "same"), appearance(7), appearance(7, "same"), appearance(8, "same")});
    EXPECT_EQ(track.values()[0].picture, track.values()[1].picture);
    EXPECT_EQ(track.values()[0].picture, track.values()[2].picture);
    EXPECT_NE(track.values()[0].picture, track.values()[3].picture);
    EXPECT_TRUE(track.values()[2].hasOwnPicture);
}

// ---- Threads --------------------------------------------------------------------------------------------------

TEST(Track, MayBeReadAndCopiedByManyThreads) {
    const Titles track({1, 2}, {"a", "b"});
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back([&track] {
            for (int round = 0; round < 1000; ++round) {
                const Titles copy = track; // NOLINT(performance-unnecessary-copy-initialization)
                EXPECT_EQ(*copy.at(1.5), "a");
            }
        });
    for (std::thread& thread : threads)
        thread.join();
}

} // namespace
} // namespace ZULMetaData::Test
